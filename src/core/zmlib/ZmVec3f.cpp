#include <zmlib/ZmVec3f.h>

#include "ZmGeometryText_p.h"

#include <charconv>
#include <cmath>

namespace zmgeom {

void appendFixed6(std::string& out, float v)
{
    if (std::isnan(v)) {
        out += std::signbit(v) ? "-nan" : "nan";
        return;
    }
    // to_chars never consults the locale; the widest float in fixed notation has 39 digits before
    // the point.
    char buf[64];
    const auto res = std::to_chars(buf, buf + sizeof buf, v, std::chars_format::fixed, 6);
    out.append(buf, res.ptr);
}

void appendJsonObject(std::string& out, const char* const* keys, const float* values, int n)
{
    out += "{";
    for (int i = 0; i < n; ++i) {
        if (i > 0)
            out += ",";
        out += '"';
        out += keys[i];
        out += "\":\"";
        appendFixed6(out, values[i]);
        out += '"';
    }
    out += "}";
}

} // namespace zmgeom

double ZmVec3f::angle(const ZmVec3f& b) const noexcept
{
    const float p = length() * b.length();
    if (p == 0.0f)
        return std::acos(0.0); // a zero vector is taken as perpendicular to everything, on purpose
    const float c = dot(b) / p;
    if (c < -1.0f)
        return 3.14159265358979323846;
    if (c > 1.0f)
        return 0.0;
    return std::acos(static_cast<double>(c));
}

ZmVec3f ZmVec3f::getClosestAxis() const noexcept
{
    ZmVec3f best(0.0f);
    float bestScore = -1.0f;
    for (int axis = 0; axis < 3; ++axis) {
        for (const float s : {1.0f, -1.0f}) { // +e then -e
            ZmVec3f e(0.0f);
            e.m_v[axis] = s;
            // The full dot product, so that a NaN in any component spoils every score.
            const float score = dot(e);
            if (score > bestScore) {
                bestScore = score;
                best = e;
            }
        }
    }
    return best;
}

bool ZmVec3f::isAxis(float eps) const noexcept
{
    const float eps2 = eps * eps;
    for (int axis = 0; axis < 3; ++axis) {
        for (const float s : {1.0f, -1.0f}) {
            ZmVec3f e(0.0f);
            e.m_v[axis] = s;
            if ((*this - e).length2() <= eps2)
                return true;
        }
    }
    return false;
}

void ZmVec3f::print(FILE* fp) const
{
    std::fprintf(fp, "%10.5g %10.5g %10.5g\n", m_v[0], m_v[1], m_v[2]);
}

std::string ZmVec3f::dump() const
{
    static const char* const keys[] = {"x", "y", "z"};
    std::string out;
    zmgeom::appendJsonObject(out, keys, m_v, 3);
    return out;
}
