#include <zmlib/ZmLine.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmPlane.h>
#include <zmlib/ZmVec4f.h>

#include "ZmGeometryText_p.h"

#include <algorithm>
#include <cmath>

// Messages carry the members as raw bytes.
static_assert(sizeof(ZmPlane) == 16, "ZmPlane layout");

void ZmPlane::set(const ZmVec3f& p0, const ZmVec3f& p1, const ZmVec3f& p2) noexcept
{
    m_normal = (p1 - p0).cross(p2 - p0);
    if (m_normal.normalize() == 0.0f) {
        makeEmpty();
        return;
    }
    m_distance = m_normal.dot(p0);
}

void ZmPlane::set(const ZmVec3f& normal, const ZmVec3f& point) noexcept
{
    m_normal = normal;
    if (m_normal.normalize() == 0.0f) {
        makeEmpty();
        return;
    }
    m_distance = m_normal.dot(point);
}

void ZmPlane::set(const ZmVec3f& normal, float distance) noexcept
{
    m_normal = normal;
    if (m_normal.normalize() == 0.0f) {
        makeEmpty();
        return;
    }
    m_distance = distance;
}

boost::optional<float> ZmPlane::getDistance(const ZmPlane& other) const noexcept
{
    if (!isParallel(other))
        return boost::none;
    return m_normal.dot(other.m_normal * other.m_distance) - m_distance;
}

void ZmPlane::getDistance(const ZmBox3f& box, float& min, float& max) const noexcept
{
    for (int corner = 0; corner < 8; ++corner) {
        const ZmVec3f p((corner & 1) ? box.xmax() : box.xmin(), (corner & 2) ? box.ymax() : box.ymin(),
                        (corner & 4) ? box.zmax() : box.zmin());
        const float d = getDistance(p);
        if (corner == 0) {
            min = max = d;
        } else {
            min = std::min(min, d);
            max = std::max(max, d);
        }
    }
}

bool ZmPlane::isParallel(const ZmPlane& other) const noexcept
{
    const ZmVec3f& n = m_normal;
    const ZmVec3f& m = other.m_normal;
    const double dot = double(n.x()) * m.x() + double(n.y()) * m.y() + double(n.z()) * m.z();
    return std::fabs(std::fabs(dot) - 1.0) <= 0.0001;
}

bool ZmPlane::isNearEqualNormal(const ZmVec3f& normal, bool orientationMatters) const noexcept
{
    const float la = m_normal.length();
    const float lb = normal.length();
    if (la < 1e-6f || lb < 1e-6f)
        return false;
    float dot = (m_normal / la).dot(normal / lb);
    if (!orientationMatters)
        dot = std::fabs(dot);
    return std::fabs(dot - 1.0f) <= 0.0001f;
}

bool ZmPlane::isNearEqualInROI(const ZmPlane& other, const ZmVec3f& roiCenter, float roiRadius,
                               float tolerance, bool orientationMatters) const noexcept
{
    if (!isNearEqualNormal(other.m_normal, orientationMatters))
        return false;
    const float s = m_normal.dot(other.m_normal) < 0.0f ? -1.0f : 1.0f;
    // The gap between the two signed distances at c + y is gap(c) + (s n - m) . y, so its largest
    // magnitude over the ball is |gap(c)| + r |s n - m|.
    const float gapAtCenter = s * getDistance(roiCenter) - other.getDistance(roiCenter);
    const float tilt = std::max(roiRadius, 0.0f) * (m_normal * s - other.m_normal).length();
    return std::fabs(gapAtCenter) + tilt <= tolerance;
}

bool ZmPlane::intersect(const ZmPlane& other, ZmLine& line) const noexcept
{
    const ZmVec3f& n = m_normal;
    const ZmVec3f& m = other.m_normal;
    const float d = m_distance;
    const float e = other.m_distance;
    ZmVec3f dir = n.cross(m);
    const float len = dir.length();
    if (len < 1e-5f) {
        line.makeNaN();
        return false;
    }
    // The point of the line where the coordinate of dir's largest component is 0; on equal
    // magnitudes the earlier axis is taken.
    const ZmVec3f a = dir.abs();
    ZmVec3f pos;
    if (a.x() >= a.y() && a.x() >= a.z()) {
        pos.setValue(0.0f, (m.z() * d - n.z() * e) / dir.x(), (n.y() * e - m.y() * d) / dir.x());
    } else if (a.y() >= a.z()) {
        pos.setValue((n.z() * e - m.z() * d) / dir.y(), 0.0f, (m.x() * d - n.x() * e) / dir.y());
    } else {
        pos.setValue((m.y() * d - n.y() * e) / dir.z(), (n.x() * e - m.x() * d) / dir.z(), 0.0f);
    }
    dir /= len;
    line.setPosDir(pos, dir);
    return true;
}

bool ZmPlane::intersect(const ZmLine& line, ZmVec3f& point, float* t) const noexcept
{
    const ZmVec3f& pos = line.getPosition();
    const ZmVec3f& dir = line.getDirection();
    const float denom = m_normal.dot(dir);
    if (denom == 0.0f) {
        point.makeNaN();
        return false;
    }
    const float tt = -(m_normal.dot(pos) - m_distance) / denom;
    point = pos + dir * tt;
    if (t != nullptr)
        *t = tt;
    return true;
}

void ZmPlane::normalize() noexcept
{
    // The distance is deliberately not rescaled with the normal.
    m_normal.normalize();
    if (m_distance < 0.0f)
        revertOrientation();
}

void ZmPlane::transform(const ZmMat4f& m) noexcept
{
    const ZmVec3f q = m_normal * m_distance;
    ZmVec3f n;
    // Through the upper 3x3 itself, not its inverse transpose: intended for rigid and uniformly
    // scaled transforms, where both give the same direction.
    m.multDirMatrix(m_normal, n);
    if (n.normalize() == 0.0f) {
        makeEmpty();
        return;
    }
    ZmVec3f qt;
    m.multVecMatrix(q, qt);
    m_normal = n;
    m_distance = n.dot(qt);
}

void ZmPlane::transformInv(const ZmMat4f& m) noexcept
{
    // (normal, -distance) is the plane as a column vector: p on the plane <=> (p, 1) . v == 0.
    // A point p = p' m maps to p', so the plane of the p' is m v.
    const ZmVec4f v(m_normal.x(), m_normal.y(), m_normal.z(), -m_distance);
    ZmVec4f r;
    m.multMatrixVec(v, r);
    ZmVec3f n(r[0], r[1], r[2]);
    const float len = n.normalize();
    if (len == 0.0f) {
        makeEmpty();
        return;
    }
    m_normal = n;
    m_distance = -r[3] / len;
}

const ZmPlane& ZmPlane::emptyPlane()
{
    static const ZmPlane plane = [] {
        ZmPlane p;
        p.makeEmpty();
        return p;
    }();
    return plane;
}

std::string ZmPlane::dump() const
{
    std::string out = "{\"normal\":";
    out += m_normal.dump();
    out += ",\"distance\":\"";
    zmgeom::appendFixed6(out, m_distance);
    out += "\"}";
    return out;
}
