#include <zmlib/MathUtils.h>

#include <cmath>

namespace MathUtils {

float angleBetweenVectors(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& n)
{
    const ZmVec3f an = a.normalized();
    const ZmVec3f bn = b.normalized();
    const ZmVec3f nn = n.normalized();
    constexpr float twoPi = 6.2831855f;
    float phi = std::atan2(an.cross(bn).dot(nn), an.dot(bn));
    if (phi < 0.0f) {
        phi += twoPi;
        // A tiny negative angle rounds up to 2*pi, which lies outside [0, 2*pi).
        if (phi == twoPi)
            return 0.0f;
    }
    return phi;
}

bool areLinearlyIndependent(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c)
{
    return a.cross(b).dot(c) != 0.0f;
}

bool areParallel(const ZmVec3f& a, const ZmVec3f& b, float eps)
{
    return eps > a.normalized().cross(b.normalized()).length();
}

bool arePerpendicular(const ZmVec3f& a, const ZmVec3f& b)
{
    const double d = a.dot(b);
    return d > -1e-6 && d < 1e-6;
}

ZmVec3f getPerpendicularVector(const ZmVec3f& v)
{
    if (v.isZero())
        return ZmVec3f(0.0f); // any vector will do; zero keeps the result defined
    ZmVec3f e(0.0f);
    e[v.abs().indexOfMin()] = 1.0f;
    return v.cross(e);
}

bool haveSameSpaceOrientation(const ZmVec3f& a, const ZmVec3f& b)
{
    return a.dot(b) > 0.0f;
}

} // namespace MathUtils
