// Fuzzes the two UUID text readers.
//
// Input layout: the whole input is the text (zero bytes included, held in a ZmString through its
// length).
//
// Checks:
// - ZmUUID::fromString and fromFormattedString read any bytes without crashing or reading past
//   the text;
// - a text of the wrong length (32 resp. 38) or, for the formatted form, without its braces and
//   dashes gives the nil UUID; a formatted text reads exactly as its 32 hexadecimal characters do
//   through fromString;
// - whatever comes out, both text forms of it read back to it;
// - for texts of valid shape (only hexadecimal digits in the hexadecimal places) the value equals
//   an independent byte-by-byte reading of the digits, and toString() gives the digits back in
//   upper case.
#include "FuzzCheck.h"

#include <zmlib/ZmString.h>
#include <zmlib/ZmUUID.h>

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

namespace {

bool isHex(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'A' && c <= 'F') || (c >= 'a' && c <= 'f');
}

int hexDigit(char c)
{
    if (c <= '9') {
        return c - '0';
    }
    return (c | 0x20) - 'a' + 10;
}

void checkRoundTrip(const ZmUUID& u)
{
    FUZZ_CHECK(ZmUUID::fromString(u.toString()) == u);
    FUZZ_CHECK(ZmUUID::fromFormattedString(u.toFormattedString()) == u);
    FUZZ_CHECK(u.toString().length() == 32);
    FUZZ_CHECK(u.toFormattedString().length() == 38);
}

// Checks a 32-character reading \p u of \p hex that consists of hexadecimal digits only.
void checkValidHex(const ZmUUID& u, const std::string& hex)
{
    unsigned char bytes[16];
    for (int i = 0; i < 16; ++i) {
        bytes[i] = static_cast<unsigned char>(hexDigit(hex[2 * i]) * 16 + hexDigit(hex[2 * i + 1]));
    }
    uint64_t first = 0;
    uint64_t second = 0;
    std::memcpy(&first, bytes, 8);
    std::memcpy(&second, bytes + 8, 8);
    FUZZ_CHECK(u.first == first && u.second == second);
    std::string upper = hex;
    for (char& c : upper) {
        c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    }
    FUZZ_CHECK(upper == u.toString().getString());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size > 4096) {
        return 0;
    }
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    const ZmString text(bytes.data(), 0, int(size));
    FUZZ_CHECK(size_t(text.length()) == size);

    const ZmUUID plain = ZmUUID::fromString(text);
    checkRoundTrip(plain);
    if (size != 32) {
        FUZZ_CHECK(!plain.isValid());
    } else {
        bool allHex = true;
        for (char c : bytes) {
            allHex = allHex && isHex(c);
        }
        if (allHex) {
            checkValidHex(plain, bytes);
        }
    }

    const ZmUUID formatted = ZmUUID::fromFormattedString(text);
    checkRoundTrip(formatted);
    const bool shaped = size == 38 && bytes[0] == '{' && bytes[9] == '-' && bytes[14] == '-' &&
                        bytes[19] == '-' && bytes[24] == '-' && bytes[37] == '}';
    if (!shaped) {
        FUZZ_CHECK(!formatted.isValid());
    } else {
        const std::string hex = bytes.substr(1, 8) + bytes.substr(10, 4) + bytes.substr(15, 4) +
                                bytes.substr(20, 4) + bytes.substr(25, 12);
        FUZZ_CHECK(ZmUUID::fromString(ZmString(hex.data(), 0, 32)) == formatted);
        bool allHex = true;
        for (char c : hex) {
            allHex = allHex && isHex(c);
        }
        if (allHex) {
            checkValidHex(formatted, hex);
            const std::string expected = "{" +
                                         std::string(formatted.toString().getString())
                                             .insert(20, "-")
                                             .insert(16, "-")
                                             .insert(12, "-")
                                             .insert(8, "-") +
                                         "}";
            FUZZ_CHECK(expected == formatted.toFormattedString().getString());
        }
    }
    return 0;
}
