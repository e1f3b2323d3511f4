#include <zmlib/ZmFrameID.h>

ZmFrameID ZmFrameID::fromLatin1(const char* text)
{
    return ZmFrameID(ZmString::toInt64(text));
}

ZmString ZmFrameID::toZmString() const
{
    return ZmString::fromInt64(value());
}
