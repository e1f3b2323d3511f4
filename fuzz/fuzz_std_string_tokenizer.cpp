// Fuzzes ZmStdStringTokenizer, the plain splitter over a standard string.
//
// Input layout: the first byte picks the delimiters. Its low two bits: 0 = the default white
// space (a null delimiter list), 1 = the empty set, 2 and 3 = the next n bytes, where n is bits
// 2-4 of the first byte plus one (zero bytes dropped, as a C-string list cannot hold them). The
// rest is the text, zero bytes included.
//
// Checked: the tokens are exactly the maximal runs of non-delimiter bytes, in order (so none is
// empty or holds a delimiter, and together they give back the text without its delimiters);
// countTokens() equals the number of tokens nextToken yields, before, during and after draining;
// an exhausted tokenizer leaves the output alone; an assigned copy continues like the original.
#include "FuzzCheck.h"

#include <zmlib/ZmStdStringTokenizer.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

namespace {

// The maximal runs of bytes outside the delimiter set.
std::vector<std::string> modelTokens(const std::string& text, const std::string& delims)
{
    std::vector<std::string> tokens;
    std::string run;
    for (const char c : text) {
        if (delims.find(c) != std::string::npos) {
            if (!run.empty()) {
                tokens.push_back(run);
                run.clear();
            }
        } else {
            run += c;
        }
    }
    if (!run.empty()) {
        tokens.push_back(run);
    }
    return tokens;
}

// Takes up to maxTokens tokens (all when negative) and checks them against expected from index
// first on; returns the index of the next expected token.
size_t takeAndCheck(ZmStdStringTokenizer& tokenizer, const std::string& text, const std::string& delims,
                    const std::vector<std::string>& expected, size_t first, long maxTokens)
{
    size_t count = first;
    for (long taken = 0; tokenizer.hasMoreTokens() && (maxTokens < 0 || taken < maxTokens); ++taken) {
        // A token is at least one byte long, so more than text.size() tokens means a runaway.
        FUZZ_CHECK(count < text.size());
        std::string token;
        tokenizer.nextToken(token);
        FUZZ_CHECK(!token.empty());
        FUZZ_CHECK(token.find_first_of(delims) == std::string::npos);
        FUZZ_CHECK(count < expected.size());
        FUZZ_CHECK(token == expected[count]);
        ++count;
    }
    return count;
}

void drainAndCheck(ZmStdStringTokenizer& tokenizer, const std::string& text, const std::string& delims,
                   const std::vector<std::string>& expected, size_t first)
{
    FUZZ_CHECK(takeAndCheck(tokenizer, text, delims, expected, first, -1) == expected.size());
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
    std::string out = "unchanged";
    tokenizer.nextToken(out);
    FUZZ_CHECK(out == "unchanged");
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size == 0) {
        return 0;
    }
    const char* bytes = reinterpret_cast<const char*>(data);
    const char* delimArg = nullptr;
    std::string delims;
    size_t textStart = 1;
    switch (data[0] & 3) {
    case 0:
        delims = " \f\n\r\t\v";
        break;
    case 1:
        delimArg = "";
        break;
    default: {
        const size_t wanted = ((data[0] >> 2) & 7) + 1;
        const size_t n = wanted < size - 1 ? wanted : size - 1;
        for (size_t i = 1; i <= n; ++i) {
            if (bytes[i] != 0) {
                delims += bytes[i];
            }
        }
        delimArg = delims.c_str();
        textStart = 1 + n;
        break;
    }
    }
    const std::string text(bytes + textStart, size - textStart);
    const std::vector<std::string> expected = modelTokens(text, delims);

    ZmStdStringTokenizer tokenizer(text, delimArg);
    FUZZ_CHECK(tokenizer.countTokens() == expected.size());
    FUZZ_CHECK(tokenizer.hasMoreTokens() == !expected.empty());
    const size_t next = takeAndCheck(tokenizer, text, delims, expected, 0, long(expected.size() / 2));
    // The count covers the whole text, not only the tokens left.
    FUZZ_CHECK(tokenizer.countTokens() == expected.size());

    ZmStdStringTokenizer copy(std::string("x y"), ",");
    copy = tokenizer;
    drainAndCheck(copy, text, delims, expected, next);
    drainAndCheck(tokenizer, text, delims, expected, next);
    FUZZ_CHECK(tokenizer.countTokens() == expected.size());

    // Counted for the first time only after draining: still the whole text.
    ZmStdStringTokenizer late(text, delimArg);
    drainAndCheck(late, text, delims, expected, 0);
    FUZZ_CHECK(late.countTokens() == expected.size());
    return 0;
}
