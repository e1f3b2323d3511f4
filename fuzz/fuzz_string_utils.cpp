// Fuzzes the checked number parsers StringUtils::toDouble, toLong and toULong.
//
// The input up to its first zero byte is the text. For each parser the runtime's own parser is
// run on the same text as the reference: the text counts as a number when it consumed at least
// one byte and everything up to the terminator. Then the library must report exactly that through
// ok, return the runtime's value (bit for bit, so NaN payloads and the sign of zero count) when
// it does, and return the default (two different defaults are tried) when it does not. The
// forms without an ok pointer must return the same values.
#include "FuzzCheck.h"

#include <zmlib/StringUtils.h>

#include <cerrno>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string>

namespace {

bool sameBits(double a, double b)
{
    uint64_t x;
    uint64_t y;
    std::memcpy(&x, &a, sizeof x);
    std::memcpy(&y, &b, sizeof y);
    return x == y;
}

bool parsedWhole(const char* s, const char* end)
{
    return end != s && *end == 0;
}

void checkDouble(const char* s)
{
    char* end = nullptr;
    errno = 0;
    const double reference = std::strtod(s, &end);
    const bool whole = parsedWhole(s, end);
    // A NaN with a payload and an odd value: neither can be mistaken for a parsed result.
    const double defaults[2] = {-1234.5625, std::nan("0x5a5")};
    for (const double dflt : defaults) {
        bool ok = !whole;
        const double value = StringUtils::toDouble(s, dflt, &ok);
        FUZZ_CHECK(ok == whole);
        FUZZ_CHECK(sameBits(value, whole ? reference : dflt));
        FUZZ_CHECK(sameBits(StringUtils::toDouble(s, dflt), value));
        FUZZ_CHECK(sameBits(StringUtils::toDouble(s, dflt, nullptr), value));
    }
}

void checkLong(const char* s)
{
    char* end = nullptr;
    const long reference = std::strtol(s, &end, 0);
    const bool whole = parsedWhole(s, end);
    const long defaults[2] = {-777, std::numeric_limits<long>::min() + 3};
    for (const long dflt : defaults) {
        bool ok = !whole;
        const long value = StringUtils::toLong(s, dflt, &ok);
        FUZZ_CHECK(ok == whole);
        FUZZ_CHECK(value == (whole ? reference : dflt));
        FUZZ_CHECK(StringUtils::toLong(s, dflt) == value);
    }
}

void checkULong(const char* s)
{
    char* end = nullptr;
    const unsigned long reference = std::strtoul(s, &end, 0);
    const bool whole = parsedWhole(s, end);
    const unsigned long defaults[2] = {777, std::numeric_limits<unsigned long>::max() - 3};
    for (const unsigned long dflt : defaults) {
        bool ok = !whole;
        const unsigned long value = StringUtils::toULong(s, dflt, &ok);
        FUZZ_CHECK(ok == whole);
        FUZZ_CHECK(value == (whole ? reference : dflt));
        FUZZ_CHECK(StringUtils::toULong(s, dflt) == value);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const char* bytes = reinterpret_cast<const char*>(data);
    const std::string text = size == 0 ? std::string() : std::string(bytes, strnlen(bytes, size));
    checkDouble(text.c_str());
    checkLong(text.c_str());
    checkULong(text.c_str());
    return 0;
}
