#include <zmlib/ZmTransferID.h>

ZmTransferID ZmTransferID::fromLatin1(const char* text)
{
    return ZmTransferID(ZmString::toInt64(text));
}

ZmString ZmTransferID::toZmString() const
{
    return ZmString::fromInt64(value());
}
