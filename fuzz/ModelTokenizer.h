// The tokenizing rules of ZmStringTokenizer written plainly, one byte at a time, as the oracle of
// the tokenizer fuzz targets. IsDelimiter is a predicate on a byte.
#pragma once

#include "FuzzCheck.h"

#include <zmlib/ZmStringTokenizer.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

template <class IsDelimiter>
std::vector<std::string> modelTokens(const char* text, size_t len, IsDelimiter isDelimiter)
{
    std::vector<std::string> tokens;
    size_t pos = 0;
    while (pos < len && isDelimiter(text[pos])) {
        ++pos;
    }
    while (pos < len) {
        std::string token;
        while (pos < len && !isDelimiter(text[pos])) {
            if (text[pos] == '\\') {
                ++pos;
                if (pos < len) {
                    token += text[pos];
                }
            } else if (text[pos] == '"') {
                ++pos;
                while (pos < len && text[pos] != '"') {
                    token += text[pos++];
                }
            } else {
                token += text[pos];
            }
            ++pos;
        }
        while (pos < len && isDelimiter(text[pos])) {
            ++pos;
        }
        tokens.push_back(token);
    }
    return tokens;
}

// Takes the next token of \p tokenizer (over a text of \p len bytes) and checks it against
// expected[count]; advances \p count and adds the token's length to \p bytes.
inline void checkNextToken(ZmStringTokenizer& tokenizer, size_t len, const std::vector<std::string>& expected,
                           size_t& count, size_t& bytes)
{
    // Each token uses up at least one byte, so more than len tokens means a runaway.
    FUZZ_CHECK(count < len);
    const ZmString& token = tokenizer.nextToken();
    const size_t tokenLen = size_t(token.length());
    FUZZ_CHECK(token.length() >= 0 && tokenLen <= len);
    FUZZ_CHECK(token.getString()[tokenLen] == 0);
    bytes += tokenLen;
    FUZZ_CHECK(bytes <= len);
    FUZZ_CHECK(count < expected.size());
    FUZZ_CHECK(tokenLen == expected[count].size());
    FUZZ_CHECK(std::memcmp(token.getString(), expected[count].data(), tokenLen) == 0);
    ++count;
}
