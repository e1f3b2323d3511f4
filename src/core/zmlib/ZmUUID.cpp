#include <zmlib/ZmUUID.h>
#include <zmlib/ZmUUID_p.h>

#include <cstddef>

namespace {

const char kHexDigits[] = "0123456789ABCDEF";

// Position of hexadecimal character \p k (0..31) inside the formatted form: after the brace, and
// after a dash following characters 8, 12, 16 and 20.
int formattedPosition(int k)
{
    return 1 + k + int(k >= 8) + int(k >= 12) + int(k >= 16) + int(k >= 20);
}

// Storage order: byte i of the UUID is byte i % 8 (from the low end) of its word.
ZmUUID fromBytes(const unsigned char (&bytes)[16])
{
    uint64_t words[2] = {0, 0};
    for (int i = 0; i < 16; ++i) {
        words[i / 8] |= uint64_t(bytes[i]) << (8 * (i % 8));
    }
    return ZmUUID(words[0], words[1]);
}

unsigned char byteAt(const ZmUUID& u, int i)
{
    return static_cast<unsigned char>((i < 8 ? u.first : u.second) >> (8 * (i % 8)));
}

// One hexadecimal character, without validation: below 'A' a digit, below 'a' an upper-case
// letter, else a lower-case letter. The byte is taken as signed so that every platform reads
// non-ASCII bytes alike.
int hexValue(char c)
{
    const int v = static_cast<signed char>(c); // NOLINT(bugprone-signed-char-misuse): signed on purpose
    if (v < 'A') {
        return v - '0';
    }
    if (v < 'a') {
        return v - 'A' + 10;
    }
    return v - 'a' + 10;
}

// The UUID of 32 hexadecimal characters, fetched through \p at(k) for k = 0..31.
template <class At>
ZmUUID parseHex(At at)
{
    unsigned char bytes[16];
    for (int i = 0; i < 16; ++i) {
        // Multiplication, not a shift: the unvalidated values may be negative.
        bytes[i] = static_cast<unsigned char>(hexValue(at(2 * i)) * 16 + hexValue(at(2 * i + 1)));
    }
    return fromBytes(bytes);
}

} // namespace

ZmUUID ZmUUID::generateUUID()
{
    unsigned char bytes[16] = {};
    if (!ZmUUIDPlatform::kernelRandom(bytes, sizeof bytes)) {
        for (unsigned char& b : bytes) {
            b = 0;
        }
        if (ZmUUIDPlatform::fallbackRandom(bytes) == 0) {
            // Nothing random could be had: the nil UUID tells the caller, where a fixed value with
            // only the version bits would silently repeat.
            return ZmUUID();
        }
    }
    bytes[6] = static_cast<unsigned char>((bytes[6] & 0x0F) | 0x40); // version 4
    bytes[8] = static_cast<unsigned char>((bytes[8] & 0x3F) | 0x80); // RFC 4122 variant
    return fromBytes(bytes);
}

ZmString ZmUUID::toString() const
{
    char text[33];
    for (int i = 0; i < 16; ++i) {
        const unsigned char b = byteAt(*this, i);
        text[2 * i] = kHexDigits[b >> 4];
        text[2 * i + 1] = kHexDigits[b & 0x0F];
    }
    text[32] = 0;
    return ZmString(text);
}

ZmString ZmUUID::toFormattedString() const
{
    const ZmString plain = toString();
    char text[39];
    text[0] = '{';
    text[9] = text[14] = text[19] = text[24] = '-';
    text[37] = '}';
    text[38] = 0;
    for (int k = 0; k < 32; ++k) {
        text[formattedPosition(k)] = plain.getString()[k];
    }
    return ZmString(text);
}

ZmUUID ZmUUID::fromString(const ZmString& s)
{
    if (s.length() != 32) {
        return ZmUUID();
    }
    const char* text = s.getString();
    return parseHex([text](int k) { return text[k]; });
}

ZmUUID ZmUUID::fromFormattedString(const ZmString& s)
{
    if (s.length() != 38) {
        return ZmUUID();
    }
    const char* text = s.getString();
    if (text[0] != '{' || text[9] != '-' || text[14] != '-' || text[19] != '-' || text[24] != '-' ||
        text[37] != '}') {
        return ZmUUID();
    }
    return parseHex([text](int k) { return text[formattedPosition(k)]; });
}
