// Fuzzes the text form of ZmLib::MD5.
//
// fromString() takes exactly 32 characters, one byte per pair, without validating them; anything
// else gives the zero digest. toString() writes 32 upper-case digits, or "" for the zero digest.
// Checked on every input:
// - any length but 32 gives the zero digest;
// - 32 hexadecimal digits (either case) give the bytes an independent decoder reads, and
//   toString() gives them back upper-cased ("" when they are all zero);
// - whatever fromString() returned, its text is "" exactly for the zero digest, else 32 upper-case
//   digits that read back to the same digest;
// - the first 16 input bytes taken as a digest survive toString() -> fromString() and
//   getBytes().
#include "FuzzCheck.h"

#include <zmlib/ZmLibMD5.h>
#include <zmlib/ZmString.h>

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

namespace {

using ZmLib::MD5;

bool isUpperHex(const ZmString& s)
{
    for (int i = 0; i < s.length(); ++i) {
        const char c = s.getString()[i];
        if (!((c >= '0' && c <= '9') || (c >= 'A' && c <= 'F'))) {
            return false;
        }
    }
    return true;
}

void checkTextOf(const MD5& d)
{
    ZmString text;
    d.toString(text);
    if (!d.value().isValid()) {
        FUZZ_CHECK(text.length() == 0);
        return;
    }
    FUZZ_CHECK(text.length() == 32);
    FUZZ_CHECK(isUpperHex(text));
    FUZZ_CHECK(MD5::fromString(text) == d);
}

int digitValue(char c)
{
    const char* digits = "0123456789abcdef";
    const char* p = std::strchr(digits, std::tolower(static_cast<unsigned char>(c)));
    return c != 0 && p != nullptr ? int(p - digits) : -1;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size > 4096) {
        return 0;
    }
    const char* chars = reinterpret_cast<const char*>(data);
    const ZmString input(chars, 0, int(size));
    const MD5 parsed = MD5::fromString(input);
    checkTextOf(parsed);

    if (size != 32) {
        FUZZ_CHECK(parsed == MD5());
    } else {
        unsigned char expected[16];
        bool allHex = true;
        for (int i = 0; i < 16 && allHex; ++i) {
            const int hi = digitValue(chars[2 * i]);
            const int lo = digitValue(chars[2 * i + 1]);
            allHex = hi >= 0 && lo >= 0;
            expected[i] = static_cast<unsigned char>(hi * 16 + lo);
        }
        if (allHex) {
            unsigned char bytes[16];
            parsed.getBytes(bytes);
            FUZZ_CHECK(std::memcmp(bytes, expected, 16) == 0);
            std::string upper(chars, 32);
            bool zero = true;
            for (char& c : upper) {
                c = char(std::toupper(static_cast<unsigned char>(c)));
                zero = zero && c == '0';
            }
            ZmString text;
            parsed.toString(text);
            FUZZ_CHECK(text == (zero ? std::string() : upper).c_str());
        }
    }

    if (size >= 16) {
        const MD5 raw = MD5::fromBytes(data);
        unsigned char back[16];
        raw.getBytes(back);
        FUZZ_CHECK(std::memcmp(back, data, 16) == 0);
        checkTextOf(raw);
    }
    return 0;
}
