#include <zmlib/ZmLibMD5.h>

#include <cstring>

namespace ZmLib {

namespace {

// A character below 'A' counts as a digit, below 'a' as an upper-case letter, else as a lower-case
// letter: the text is meant to come from toString(), so nothing is validated.
unsigned int hexValue(char c) noexcept
{
    const unsigned int u = static_cast<unsigned char>(c);
    if (u < 'A') {
        return u - '0';
    }
    if (u < 'a') {
        return u - 'A' + 10;
    }
    return u - 'a' + 10;
}

} // namespace

MD5 MD5::fromBytes(const unsigned char bytes[16]) noexcept
{
    Zm128 v;
    std::memcpy(&v.first, bytes, 8);
    std::memcpy(&v.second, bytes + 8, 8);
    return MD5(v);
}

void MD5::getBytes(unsigned char bytes[16]) const noexcept
{
    std::memcpy(bytes, &m_value.first, 8);
    std::memcpy(bytes + 8, &m_value.second, 8);
}

void MD5::toString(ZmString& out) const
{
    out.clear();
    if (!m_value.isValid()) {
        return;
    }
    static const char kDigits[] = "0123456789ABCDEF";
    unsigned char bytes[16];
    getBytes(bytes);
    char text[33];
    for (int i = 0; i < 16; ++i) {
        text[2 * i] = kDigits[bytes[i] >> 4];
        text[2 * i + 1] = kDigits[bytes[i] & 15];
    }
    text[32] = 0;
    out = text;
}

MD5 MD5::fromString(const ZmString& s) noexcept
{
    if (s.length() != 32) {
        return MD5();
    }
    const char* text = s.getString();
    unsigned char bytes[16];
    for (int i = 0; i < 16; ++i) {
        bytes[i] = static_cast<unsigned char>((hexValue(text[2 * i]) << 4) + hexValue(text[2 * i + 1]));
    }
    return fromBytes(bytes);
}

MD5 MD5::hashOfEmptyMessage() noexcept
{
    // d4 1d 8c d9 8f 00 b2 04 | e9 80 09 98 ec f8 42 7e, each half as a little-endian word.
    return MD5(Zm128(0x04B2008FD98C1DD4ull, 0x7E42F8EC980980E9ull));
}

uint32_t zm_hash(const MD5& d) noexcept
{
    return static_cast<uint32_t>(d.value().first);
}

} // namespace ZmLib
