/// \file
/// Free predicates and constructions on vectors.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3f.h>

/// Vector predicates that take several vectors. Pure functions on values; nothing fails.
namespace MathUtils {

/// The signed angle from \p a to \p b about the normal \p n, in [0, 2*pi). The three vectors are
/// normalised first (zero vectors are left as they are).
ZMLIB_API float angleBetweenVectors(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& n);
/// The triple product (a x b) . c is not exactly 0.
ZMLIB_API bool areLinearlyIndependent(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c);
/// True when the cross product of the normalised vectors is shorter than \p eps (strictly).
ZMLIB_API bool areParallel(const ZmVec3f& a, const ZmVec3f& b, float eps);
/// The dot product, taken to double, lies strictly between -1e-6 and 1e-6.
ZMLIB_API bool arePerpendicular(const ZmVec3f& a, const ZmVec3f& b);
/// A vector perpendicular to \p v: v crossed with the unit axis of its smallest absolute component
/// (not normalised). For a zero vector the result is unspecified.
ZMLIB_API ZmVec3f getPerpendicularVector(const ZmVec3f& v);
/// a . b > 0.
ZMLIB_API bool haveSameSpaceOrientation(const ZmVec3f& a, const ZmVec3f& b);

} // namespace MathUtils
