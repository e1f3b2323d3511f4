// The tokenizing rules of ZmStringTokenizer written plainly, one byte at a time, as the oracle of
// the tokenizer fuzz targets. IsDelimiter is a predicate on a byte.
#pragma once

#include <cstddef>
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
