#include <zmlib/ZmLine.h>
#include <zmlib/ZmSphere.h>

#include <cmath>

// A plain value of four floats, copied as bytes.
static_assert(sizeof(ZmSphere) == 16, "ZmSphere layout");

void ZmSphere::circumscribe(const ZmBox3f& box) noexcept
{
    if (box.isEmpty()) {
        setValue(ZmVec3f(0.0f), -1.0f);
        return;
    }
    m_center.setValue((box.xmin() + box.xmax()) * 0.5f, (box.ymin() + box.ymax()) * 0.5f,
                      (box.zmin() + box.zmax()) * 0.5f);
    m_radius = (ZmVec3f(box.xmax(), box.ymax(), box.zmax()) - m_center).length();
}

bool ZmSphere::crossings(const ZmVec3f& pos, const ZmVec3f& dir, float& tNear, float& tFar) const noexcept
{
    const ZmVec3f w = pos - m_center;
    const float b = 2.0f * w.dot(dir);
    const float disc = b * b - 4.0f * (w.dot(w) - m_radius * m_radius);
    // Written so that a NaN discriminant counts as a miss as well.
    if (!(disc >= 0.0f))
        return false;
    const float root = std::sqrt(disc);
    tNear = (-b - root) / 2.0f;
    tFar = (root - b) / 2.0f;
    return true;
}

bool ZmSphere::intersect(const ZmLine& line, ZmVec3f& nearPoint, ZmVec3f& farPoint) const noexcept
{
    const ZmVec3f& pos = line.getPosition();
    const ZmVec3f& dir = line.getDirection();
    float tNear, tFar;
    if (!crossings(pos, dir, tNear, tFar)) {
        nearPoint.makeNaN();
        farPoint.makeNaN();
        return false;
    }
    nearPoint = pos + dir * tNear;
    farPoint = pos + dir * tFar;
    return true;
}

bool ZmSphere::intersect(const ZmLine& line, ZmVec3f& point) const noexcept
{
    const ZmVec3f& pos = line.getPosition();
    const ZmVec3f& dir = line.getDirection();
    float tNear, tFar;
    if (crossings(pos, dir, tNear, tFar)) {
        if (tNear >= 0.0f) {
            point = pos + dir * tNear;
            return true;
        }
        if (tFar >= 0.0f) {
            point = pos + dir * tFar;
            return true;
        }
    }
    point.makeNaN();
    return false;
}

bool ZmSphere::intersect(const ZmVec3f& a, const ZmVec3f& b, ZmVec3f& enter, ZmVec3f& exit) const noexcept
{
    ZmVec3f dir = b - a;
    // A zero-length segment keeps a zero direction: it is then "inside" exactly when a is.
    const float len = dir.normalize();
    float tNear, tFar;
    if (crossings(a, dir, tNear, tFar)) {
        // Clamping to the segment; a segment beside the sphere on its line thus ends up with
        // enter == exit at one end and true, which is intended (callers compare the points).
        tNear = tNear < 0.0f ? 0.0f : (tNear > len ? len : tNear);
        tFar = tFar < 0.0f ? 0.0f : (tFar > len ? len : tFar);
        if (tNear <= tFar) {
            enter = a + dir * tNear;
            exit = a + dir * tFar;
            return true;
        }
    }
    enter.makeNaN();
    exit.makeNaN();
    return false;
}

const ZmSphere& ZmSphere::emptySphere()
{
    // Created on first use and never freed, so that it outlives every static user.
    static const ZmSphere* const sphere = new ZmSphere(ZmVec3f(0.0f), -1.0f);
    return *sphere;
}
