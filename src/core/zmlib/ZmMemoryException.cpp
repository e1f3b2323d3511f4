#include <zmlib/ZmMemoryException.h>

#include <cinttypes>
#include <cstdio>

ZmMemoryException::ZmMemoryException() = default;

ZmMemoryException::ZmMemoryException(uint64_t numBytes) : m_numBytes(numBytes)
{}

ZmMemoryException::ZmMemoryException(const ZmMemoryException& other)
    : ZmException(other), m_numBytes(other.m_numBytes)
{}

ZmMemoryException& ZmMemoryException::operator=(const ZmMemoryException& other)
{
    ZmException::operator=(other);
    m_numBytes = other.m_numBytes;
    return *this;
}

ZmMemoryException::~ZmMemoryException() = default;

const char* ZmMemoryException::what() const noexcept
{
    static const char kUnknown[] = "could not allocate enough memory";
    if (m_numBytes == 0) {
        return kUnknown;
    }
    // The text is formatted on the stack first: storing it in the message may itself need memory,
    // and a handler asking an out-of-memory exception for its text must still get one.
    char text[64];
    std::snprintf(text, sizeof text, "could not allocate %zu bytes", static_cast<size_t>(m_numBytes));
    try {
        m_message = text;
    } catch (...) {
        return kUnknown;
    }
    return m_message.getString();
}
