// Fuzzes zmWildMatch.
//
// Input layout: the text, a zero byte, the pattern (up to the next zero byte). Without a zero
// byte the first half of the input is the text and the second half the pattern.
//
// The matcher is a single forward scan with one restart point, lenient by design (a pattern used
// up on '?' accepts the rest of the text, and a byte that broke a partial match after '*' is not
// tried again), so it is checked against properties rather than against a full matcher:
// - it ends and answers 0 or 1, the same through ZmString::matches;
// - "*" matches every text;
// - a pattern equal to the text matches, unless the text holds '*' directly followed by '?' (the
//   '?' then takes the text's '*' and the scan falls out of step: "*?a" does not match itself);
// - for a pattern without '*' the answer is exact: position by position '?' or the same byte,
//   and either both end together or the pattern ends on '?';
// - it never claims more than a full backtracking matcher allows: a match is a true match, or a
//   true match of the pattern with '*' appended when the pattern ends on '?'.
#include "FuzzCheck.h"

#include <zmlib/ZmString.h>
#include <zmlib/zmWildMatch.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>

namespace {

// A complete wildcard matcher: on a mismatch it goes back to the last '*' and lets it take one
// more byte, so every way of splitting the text among the stars is tried.
bool fullMatch(const std::string& s, const std::string& p)
{
    size_t i = 0;
    size_t j = 0;
    size_t starAt = std::string::npos;
    size_t starText = 0;
    while (j < s.size()) {
        if (i < p.size() && p[i] == '*') {
            starAt = i++;
            starText = j;
        } else if (i < p.size() && (p[i] == '?' || p[i] == s[j])) {
            ++i;
            ++j;
        } else if (starAt != std::string::npos) {
            i = starAt + 1;
            j = ++starText;
        } else {
            return false;
        }
    }
    while (i < p.size() && p[i] == '*') {
        ++i;
    }
    return i == p.size();
}

// The exact answer for a pattern without '*'.
bool starFreeMatch(const std::string& s, const std::string& p)
{
    if (p.empty()) {
        return s.empty();
    }
    if (p.size() > s.size()) {
        return false;
    }
    for (size_t k = 0; k < p.size(); ++k) {
        if (p[k] != '?' && p[k] != s[k]) {
            return false;
        }
    }
    return p.size() == s.size() || p.back() == '?';
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const char* bytes = reinterpret_cast<const char*>(data);
    const void* zero = size == 0 ? nullptr : std::memchr(bytes, 0, size);
    std::string text;
    std::string pattern;
    if (zero != nullptr) {
        const size_t split = size_t(static_cast<const char*>(zero) - bytes);
        text.assign(bytes, split);
        const char* rest = bytes + split + 1;
        pattern.assign(rest, strnlen(rest, size - split - 1));
    } else if (size > 0) {
        text.assign(bytes, size / 2);
        pattern.assign(bytes + size / 2, size - size / 2);
    }

    const int result = zmWildMatch(text.c_str(), pattern.c_str());
    FUZZ_CHECK(result == 0 || result == 1);
    const ZmString zText(text.c_str());
    FUZZ_CHECK(zText.matches(pattern.c_str()) == result);

    FUZZ_CHECK(zmWildMatch(text.c_str(), "*") == 1);
    if (text.find("*?") == std::string::npos) {
        FUZZ_CHECK(zmWildMatch(text.c_str(), text.c_str()) == 1);
    }
    if (pattern.find('*') == std::string::npos) {
        FUZZ_CHECK(result == (starFreeMatch(text, pattern) ? 1 : 0));
    }
    if (result == 1) {
        FUZZ_CHECK(fullMatch(text, pattern) ||
                   (!pattern.empty() && pattern.back() == '?' && fullMatch(text, pattern + "*")));
    }
    return 0;
}
