#include <zmlib/ZmUniqueID.h>

ZmUniqueID ZmUniqueID::fromLatin1(const char* text)
{
    return ZmUniqueID(ZmString::toInt64(text));
}

ZmString ZmUniqueID::toZmString() const
{
    return ZmString::fromInt64(value());
}
