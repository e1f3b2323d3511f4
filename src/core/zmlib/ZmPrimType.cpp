#include <zmlib/ZmPrimType.h>

#include <cstring>

const char* const ZmPrimType::primTypeName[10] = {"byte",    "short",  "int",    "float", "double",
                                                  "complex", "string", "ushort", "uint",  "sbyte"};
const int ZmPrimType::primTypeSize[10] = {1, 2, 4, 4, 8, 8, 8, 2, 4, 1};

bool ZmPrimType::nameToType(const char* name, Type& type) noexcept
{
    if (name == nullptr) {
        return false;
    }
    for (int code = 0; code < 10; ++code) {
        if (std::strcmp(name, primTypeName[code]) == 0) {
            type = Type(code);
            return true;
        }
    }
    return false;
}

ZmPrimType& ZmPrimType::makeSigned() noexcept
{
    switch (m_type) {
    case BYTE:
        m_type = SBYTE;
        break;
    case USHORT:
        m_type = SHORT;
        break;
    case UINT:
        m_type = INT;
        break;
    default:
        break;
    }
    return *this;
}

ZmPrimType& ZmPrimType::makeUnsigned() noexcept
{
    switch (m_type) {
    case SHORT:
        m_type = USHORT;
        break;
    case INT:
        m_type = UINT;
        break;
    case SBYTE:
        m_type = BYTE;
        break;
    default:
        break;
    }
    return *this;
}
