/// \file
/// Private: the number format of the geometry classes' JSON texts.
#pragma once

#include <string>

namespace zmgeom {

/// Appends \p v in fixed notation with six decimals ("1.000000", "-0.500000"), independent of the
/// process locale (always "." and no grouping). NaN and infinities come out as "nan", "-nan", "inf",
/// "-inf".
void appendFixed6(std::string& out, float v);

/// Appends `{"k0":"v0","k1":"v1",...}` for \p n keys and values, the form of every dump().
void appendJsonObject(std::string& out, const char* const* keys, const float* values, int n);

} // namespace zmgeom
