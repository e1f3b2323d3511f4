#include <zmlib/ZmException.h>

#include <cstdarg>

ZmException::ZmException() = default;

ZmException::ZmException(NoAllocation) noexcept : m_message(ZmString::NoBlock{})
{}

ZmException::ZmException(const char* fmt, ...)
{
    va_list args;
    va_start(args, fmt);
    m_message.vprintf(fmt, args);
    va_end(args);
}

ZmException::ZmException(ZmString& message) : m_message(message)
{}

ZmException::ZmException(const ZmException& other) : std::exception(other), m_message(other.m_message)
{}

ZmException& ZmException::operator=(const ZmException& other)
{
    if (this != &other) {
        // An assignment from a message-less exception must not copy its missing terminator.
        m_message = other.m_message.dataPtr() != nullptr ? other.m_message.getString() : "";
    }
    return *this;
}

ZmException::~ZmException() = default;

const char* ZmException::what() const noexcept
{
    return m_message.dataPtr() != nullptr ? m_message.getString() : "";
}

ZmException* ZmException::clone() const
{
    return doClone();
}

void ZmException::raise() const
{
    try {
        doRaise();
    } catch (const ZmException& e) {
        throw ZmException(e);
    }
    // doRaise() is declared [[noreturn]]; an override that returns anyway still ends here in a
    // throw, never in a silent fall-through.
    throw ZmException(*this);
}

ZmException* ZmException::doClone() const
{
    return new ZmException(*this);
}

void ZmException::doRaise() const
{
    throw ZmException(*this);
}
