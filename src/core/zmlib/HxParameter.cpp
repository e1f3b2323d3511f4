#include <zmlib/HxParameter.h>

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmString.h>

#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

const char* textOf(const char* s)
{
    return s != nullptr ? s : "";
}

uint64_t storageBytes(int n, int type, const void* data)
{
    if (type == ZmPrimType::STRING) {
        return std::strlen(textOf(static_cast<const char*>(data))) + 1;
    }
    return n > 0 ? uint64_t(n) * uint64_t(ZmPrimType(type).size()) : 0;
}

// The element at \p i as a double, and whether it is an integer type.
double elementValue(int type, const void* data, int i, bool& integer)
{
    integer = true;
    switch (type) {
    case ZmPrimType::BYTE:
        return static_cast<const uint8_t*>(data)[i];
    case ZmPrimType::SHORT:
        return static_cast<const int16_t*>(data)[i];
    case ZmPrimType::INT:
        return static_cast<const int32_t*>(data)[i];
    case ZmPrimType::USHORT:
        return static_cast<const uint16_t*>(data)[i];
    case ZmPrimType::UINT:
        return static_cast<const uint32_t*>(data)[i];
    case ZmPrimType::SBYTE:
        return static_cast<const int8_t*>(data)[i];
    case ZmPrimType::FLOAT:
        integer = false;
        return static_cast<const float*>(data)[i];
    case ZmPrimType::DOUBLE:
        integer = false;
        return static_cast<const double*>(data)[i];
    case ZmPrimType::COMPLEX:
        integer = false;
        return static_cast<const float*>(data)[2 * i];
    default:
        return 0;
    }
}

} // namespace

HxParameter::HxParameter(const char* name, const char* text) : HxParamBase(PARAMETER, name)
{
    replaceValue(1, ZmPrimType::STRING, text);
}

HxParameter::HxParameter(const char* name, int value) : HxParamBase(PARAMETER, name)
{
    replaceValue(1, ZmPrimType::INT, &value);
}

HxParameter::HxParameter(const char* name, double value) : HxParamBase(PARAMETER, name)
{
    replaceValue(1, ZmPrimType::DOUBLE, &value);
}

HxParameter::HxParameter(const char* name, int n, const int* values) : HxParamBase(PARAMETER, name)
{
    replaceValue(n, ZmPrimType::INT, values);
}

HxParameter::HxParameter(const char* name, int n, const float* values) : HxParamBase(PARAMETER, name)
{
    replaceValue(n, ZmPrimType::FLOAT, values);
}

HxParameter::HxParameter(const char* name, int n, const double* values) : HxParamBase(PARAMETER, name)
{
    replaceValue(n, ZmPrimType::DOUBLE, values);
}

HxParameter::HxParameter(const char* name, int n, ZmPrimType type, const void* data)
    : HxParamBase(PARAMETER, name)
{
    replaceValue(n, type, data);
}

HxParameter::HxParameter(const HxParameter& other) : HxParamBase(other)
{
    replaceValue(other.m_dim, other.m_type, other.m_data);
}

HxParameter& HxParameter::operator=(const HxParameter& other)
{
    if (this != &other) {
        HxParamBase::operator=(other);
        if (!sameValue(other.m_dim, other.m_type, other.m_data)) {
            replaceValue(other.m_dim, other.m_type, other.m_data);
            touch(0x02);
        }
    }
    return *this;
}

HxParameter::~HxParameter()
{
    zmfree(m_data);
}

HxParameter* HxParameter::create(const char* name, const char* text)
{
    return new HxParameter(name, text);
}

HxParamBase* HxParameter::duplicate() const
{
    return new HxParameter(*this);
}

bool HxParameter::sameValue(int n, int type, const void* data) const
{
    if (type == ZmPrimType::STRING) {
        return m_type == type && std::strcmp(textOf(static_cast<const char*>(m_data)),
                                             textOf(static_cast<const char*>(data))) == 0;
    }
    if (n < 0) {
        n = 0;
    }
    if (m_type != type || m_dim != n) {
        return false;
    }
    const uint64_t bytes = storageBytes(n, type, data);
    if (bytes == 0) {
        return true;
    }
    if (data == nullptr) { // a zero-filled value
        for (uint64_t i = 0; i < bytes; ++i) {
            if (static_cast<const char*>(m_data)[i] != 0) {
                return false;
            }
        }
        return true;
    }
    return std::memcmp(m_data, data, bytes) == 0;
}

void HxParameter::replaceValue(int n, int type, const void* data)
{
    const bool text = type == ZmPrimType::STRING;
    const int dim = text ? 1 : (n > 0 ? n : 0);
    const uint64_t bytes = storageBytes(dim, type, data);
    void* fresh = nullptr;
    if (bytes > 0) {
        fresh = zmmalloc(bytes);
        if (text) {
            std::memcpy(fresh, textOf(static_cast<const char*>(data)), bytes);
        } else if (data != nullptr) {
            std::memcpy(fresh, data, bytes);
        } else {
            std::memset(fresh, 0, bytes);
        }
    }
    zmfree(m_data);
    m_data = fresh;
    m_dim = dim;
    m_type = type;
}

void HxParameter::set(int n, ZmPrimType type, const void* data)
{
    if (!sameValue(n, type, data)) {
        replaceValue(n, type, data);
        touch(0x02);
    }
}

void HxParameter::set(int value)
{
    set(1, ZmPrimType::INT, &value);
}

void HxParameter::set(double value)
{
    set(1, ZmPrimType::DOUBLE, &value);
}

void HxParameter::set(int n, const int* values)
{
    set(n, ZmPrimType::INT, values);
}

void HxParameter::set(int n, const float* values)
{
    set(n, ZmPrimType::FLOAT, values);
}

void HxParameter::set(int n, const double* values)
{
    set(n, ZmPrimType::DOUBLE, values);
}

void HxParameter::set(const char* text)
{
    set(1, ZmPrimType::STRING, textOf(text));
}

int HxParameter::getNum(int i) const
{
    if (m_type == ZmPrimType::STRING) {
        return i == 0 ? std::atoi(static_cast<const char*>(m_data)) : 0;
    }
    if (i < 0 || i >= m_dim) {
        return 0;
    }
    bool integer = true;
    const double v = elementValue(m_type, m_data, i, integer);
    if (integer) {
        return int(int64_t(v)); // uint values above INT_MAX wrap, as a cast always did
    }
    // Rounded by adding 0.5 and truncating toward zero, as it always has been (-1.7 gives -1);
    // values outside the int range are clamped and NaN gives 0 (converting them is undefined).
    const double r = v + 0.5;
    return r != r ? 0 : r >= 2147483647.0 ? INT32_MAX : r <= -2147483648.0 ? INT32_MIN : int(r);
}

void HxParameter::getNum(int* out) const
{
    for (int i = 0; i < m_dim; ++i) {
        out[i] = getNum(i);
    }
}

double HxParameter::getReal(int i) const
{
    if (m_type == ZmPrimType::STRING) {
        return i == 0 ? std::strtod(static_cast<const char*>(m_data), nullptr) : 0.0;
    }
    if (i < 0 || i >= m_dim) {
        return 0.0;
    }
    bool integer = true;
    return elementValue(m_type, m_data, i, integer);
}

void HxParameter::getReal(double* out) const
{
    for (int i = 0; i < m_dim; ++i) {
        out[i] = getReal(i);
    }
}

const char* HxParameter::getString() const
{
    if (m_type == ZmPrimType::STRING) {
        return static_cast<const char*>(m_data);
    }
    // Four process-wide buffers in rotation, as documented: a text stays valid for four calls.
    static ZmString* const buffers = new ZmString[4];
    static int next = 0;
    ZmString& buffer = buffers[next];
    next = (next + 1) % 4;
    print(buffer, false);
    return buffer.getString();
}

int HxParameter::getBundleTagValue(const char*& out) const
{
    if (m_type != ZmPrimType::STRING) {
        return 0;
    }
    const char* colon = std::strchr(static_cast<const char*>(m_data), ':');
    if (colon == nullptr || colon[1] == 0) {
        return 0;
    }
    out = colon + 2;
    return 1;
}

void HxParameter::print(ZmString& out, bool append) const
{
    if (!append) {
        out.clear();
    }
    if (m_type == ZmPrimType::STRING) {
        for (const char* p = static_cast<const char*>(m_data); *p != 0; ++p) {
            if (*p != '"') {
                out += *p;
            }
        }
        return;
    }
    if (m_type == ZmPrimType::COMPLEX) {
        return;
    }
    char text[48];
    for (int i = 0; i < m_dim; ++i) {
        switch (m_type) {
        case ZmPrimType::FLOAT:
            std::snprintf(text, sizeof text, "%.8g", double(static_cast<const float*>(m_data)[i]));
            break;
        case ZmPrimType::DOUBLE:
            std::snprintf(text, sizeof text, "%.12g", static_cast<const double*>(m_data)[i]);
            break;
        default: {
            bool integer = true;
            std::snprintf(text, sizeof text, "%" PRId64, int64_t(elementValue(m_type, m_data, i, integer)));
            break;
        }
        }
        if (i > 0) {
            out += ' ';
        }
        out += text;
    }
}

bool HxParameter::operator==(const HxParameter& other) const
{
    return sameValue(other.m_dim, other.m_type, other.m_data);
}
