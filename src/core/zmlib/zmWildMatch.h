/// \file
/// The library's wildcard matcher, used for file-name filters and string matching.
#pragma once

#include <zmlib/ZmExport.h>

/// Wildcard match: '*' any run of bytes (also none), '?' exactly one byte, every other byte
/// itself (case-sensitive).
///
/// A single forward scan with one restart point and no full backtracking, with the leniencies
/// callers rely on: 'abc' matches 'a?' (a pattern used up on '*' or '?' accepts the rest of the
/// text), and 'aab' does not match '*ab' (the byte that failed is not tried again against the
/// restart point). An empty pattern matches only the empty text. Returns 1 for a match, else 0.
ZMLIB_API int zmWildMatch(const char* str, const char* pattern);
