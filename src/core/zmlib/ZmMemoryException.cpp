#include <zmlib/ZmMemoryException.h>

#include <cstdio>
#include <cstring>

ZmMemoryException::ZmMemoryException() : ZmException(NoAllocation{})
{}

ZmMemoryException::ZmMemoryException(uint64_t numBytes) : ZmException(NoAllocation{}), m_numBytes(numBytes)
{}

// The copy goes through the non-allocating base constructor too: the base message of a memory
// exception is never used, its text is formatted by what().
ZmMemoryException::ZmMemoryException(const ZmMemoryException& other)
    : ZmException(NoAllocation{}), m_numBytes(other.m_numBytes)
{}

ZmMemoryException& ZmMemoryException::operator=(const ZmMemoryException& other)
{
    if (this != &other) {
        m_numBytes = other.m_numBytes;
    }
    return *this;
}

ZmMemoryException::~ZmMemoryException() = default;

const char* ZmMemoryException::what() const noexcept
{
    if (m_numBytes == 0) {
        return "could not allocate enough memory";
    }
    std::snprintf(m_text, sizeof m_text, "could not allocate %zu bytes", static_cast<size_t>(m_numBytes));
    return m_text;
}
