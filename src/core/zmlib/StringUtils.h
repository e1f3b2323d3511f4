/// \file
/// Checked conversions of whole texts to numbers.
#pragma once

#include <zmlib/ZmExport.h>

/// Number parsers that accept a text only when the runtime's parser consumes all of it.
///
/// Each returns the value and sets *ok to true when \p s is not null, at least one character was
/// consumed and nothing (white space included) is left over; otherwise it returns \p dflt and sets
/// *ok to false. \p ok may be null. A value out of range is the runtime's clamped value
/// (HUGE_VAL, LONG_MAX, ...), still reported as parsed.
namespace StringUtils {

/// strtod.
ZMLIB_API double toDouble(const char* s, double dflt, bool* ok = nullptr);
/// strtol with base 0: "0x" means hexadecimal, a leading 0 octal.
ZMLIB_API long toLong(const char* s, long dflt, bool* ok = nullptr);
/// strtoul with base 0.
ZMLIB_API unsigned long toULong(const char* s, unsigned long dflt, bool* ok = nullptr);

} // namespace StringUtils
