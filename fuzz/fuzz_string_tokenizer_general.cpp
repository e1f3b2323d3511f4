// Fuzzes ZmStringTokenizerGeneral: the tokenizer with a caller-given delimiter set.
//
// Input layout: the low four bits of the first byte give a count n (0-15); the next n bytes are
// the delimiters (zero bytes cannot be part of a C-string delimiter list and are dropped); the
// rest is the text. The tokens are compared with a byte-at-a-time model of the rules (a delimiter
// test first, then backslash escapes and double-quoted runs), and the invariants that hold for
// any input are checked as for the white-space tokenizer. A copy made in the middle of the text
// must continue exactly like the original, and re-targeting keeps the delimiter set.
#include "FuzzCheck.h"
#include "ModelTokenizer.h"

#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizerGeneral.h>

#include <bitset>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace {

using DelimiterSet = std::bitset<256>;

bool isDelimiter(const DelimiterSet& set, char c)
{
    return set[static_cast<unsigned char>(c)];
}

// Takes up to maxTokens tokens (all when negative), checking them against expected from index
// first on; returns the index of the next expected token.
size_t takeAndCheck(ZmStringTokenizerGeneral& tokenizer, size_t len, const std::vector<std::string>& expected,
                    size_t first, long maxTokens)
{
    size_t count = first;
    size_t bytes = 0;
    for (long taken = 0; tokenizer.hasMoreTokens() && (maxTokens < 0 || taken < maxTokens); ++taken) {
        checkNextToken(tokenizer, len, expected, count, bytes);
    }
    return count;
}

void drainAndCheck(ZmStringTokenizerGeneral& tokenizer, size_t len, const std::vector<std::string>& expected,
                   size_t first)
{
    FUZZ_CHECK(takeAndCheck(tokenizer, len, expected, first, -1) == expected.size());
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
    FUZZ_CHECK(tokenizer.nextToken().length() == 0);
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size == 0 || size > (1u << 20)) {
        return 0;
    }
    const char* bytes = reinterpret_cast<const char*>(data);
    const size_t wanted = data[0] & 0x0f;
    const size_t delimCount = wanted < size - 1 ? wanted : size - 1;
    std::string delims;
    DelimiterSet set;
    for (size_t i = 1; i <= delimCount; ++i) {
        if (bytes[i] != 0) {
            delims += bytes[i];
            set.set(static_cast<unsigned char>(bytes[i]));
        }
    }
    const size_t len = size - 1 - delimCount;
    const ZmString text(bytes, int(1 + delimCount), int(len));
    FUZZ_CHECK(size_t(text.length()) == len);
    const std::vector<std::string> expected =
        modelTokens(text.getString(), len, [&set](char c) { return isDelimiter(set, c); });

    // The whole text, zero bytes included; half-way through a copy is taken and both go on.
    ZmStringTokenizerGeneral whole(text, delims.c_str());
    const size_t next = takeAndCheck(whole, len, expected, 0, long(expected.size() / 2));
    ZmStringTokenizerGeneral copy(whole);
    drainAndCheck(copy, len, expected, next);
    drainAndCheck(whole, len, expected, next);

    // The same bytes as a C string: up to the first zero byte.
    const char* cText = text.getString();
    const size_t cLen = std::strlen(cText);
    const std::vector<std::string> cExpected =
        modelTokens(cText, cLen, [&set](char c) { return isDelimiter(set, c); });
    ZmStringTokenizerGeneral fromChars(cText, delims.c_str());
    drainAndCheck(fromChars, cLen, cExpected, 0);

    // Re-targeting keeps the delimiter set; assignment copies it.
    whole = cText;
    drainAndCheck(whole, cLen, cExpected, 0);
    ZmStringTokenizerGeneral assigned("", "");
    assigned = copy;
    assigned = cText;
    drainAndCheck(assigned, cLen, cExpected, 0);
    return 0;
}
