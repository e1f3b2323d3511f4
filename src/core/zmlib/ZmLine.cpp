#include <zmlib/ZmLine.h>
#include <zmlib/ZmMat4f.h>

#include <algorithm>
#include <cmath>
#include <limits>

// Messages carry the members as raw bytes.
static_assert(sizeof(ZmLine) == 24, "ZmLine layout");

bool ZmLine::getClosestPoints(const ZmLine& other, ZmVec3f& onThis, ZmVec3f& onOther) const noexcept
{
    const ZmVec3f& p = m_position;
    const ZmVec3f& d = m_direction;
    const ZmVec3f& q = other.m_position;
    const ZmVec3f& e = other.m_direction;
    const float a = d.dot(d);
    const float b = d.dot(e);
    const float c = e.dot(e);
    const float r1 = p.dot(d) - q.dot(d);
    const float r2 = p.dot(e) - q.dot(e);
    const float den = b * b - c * a;
    if (den == 0.0f) {
        onThis.makeNaN();
        onOther.makeNaN();
        return false;
    }
    const float s = (c * r1 - r2 * b) / den;
    const float u = (b * r1 - r2 * a) / den;
    onThis = p + d * s;
    onOther = q + e * u;
    return true;
}

bool ZmLine::intersect(float tolerance, const ZmVec3f& p) const noexcept
{
    const ZmVec3f v = p - m_position;
    const float t = v.dot(m_direction);
    if (t <= 0.0f)
        return false; // behind the ray's start
    // Rounding can push the difference of a point on the ray slightly below 0; that is distance 0.
    float dist = std::sqrt(std::max(v.length2() - t * t, 0.0f));
    if (tolerance >= 0.0f)
        dist /= t;
    return std::fabs(tolerance) > dist;
}

bool ZmLine::intersect(const ZmBox3f& box, ZmVec3f& enter, ZmVec3f& exit, float tolerance) const noexcept
{
    if (box.isEmpty()) {
        enter.makeNaN();
        exit.makeNaN();
        return false;
    }
    float tNear = -1e38f;
    float tFar = 1e38f;
    for (int axis = 0; axis < 3; ++axis) {
        const float lo = box[2 * axis];
        const float hi = box[2 * axis + 1];
        const float p = m_position[axis];
        const float d = m_direction[axis];
        if (std::fabs(d) <= 1e-6f) {
            // Parallel to this slab: either always inside it or never.
            if (lo > p + tolerance || p - tolerance > hi) {
                enter.makeNaN();
                exit.makeNaN();
                return false;
            }
            continue;
        }
        const float inv = 1.0f / d;
        float t1 = (lo - p) * inv;
        float t2 = (hi - p) * inv;
        if (t1 > t2)
            std::swap(t1, t2);
        // Intended shortcut: a slab thinner than the tolerance is a hit, enter and exit unwritten.
        if (tolerance > t2 - t1)
            return true;
        tFar = std::min(tFar, t2);
        tNear = std::max(tNear, t1);
    }
    const ZmVec3f in = m_position + m_direction * tNear;
    const ZmVec3f out = m_position + m_direction * tFar;
    for (int axis = 0; axis < 3; ++axis) {
        const float lo = box[2 * axis] - tolerance;
        const float hi = box[2 * axis + 1] + tolerance;
        if (!(lo <= in[axis] && in[axis] <= hi && lo <= out[axis] && out[axis] <= hi)) {
            enter.makeNaN();
            exit.makeNaN();
            return false;
        }
    }
    enter = in;
    exit = out;
    return true;
}

bool ZmLine::intersect(float tolerance, const ZmBox3f& box) const noexcept
{
    if (box.isEmpty() || !isNumber())
        return false;
    // The margin is alpha + beta * t; each bound of each axis then reads c0 + c1 * t >= 0, a
    // half-line of parameters. The ray is picked when the half-lines meet in some t > 0.
    const float alpha = tolerance < 0.0f ? -tolerance : 0.0f;
    const float beta = tolerance < 0.0f ? 0.0f : tolerance;
    float tLo = 0.0f;
    float tHi = std::numeric_limits<float>::infinity();
    for (int axis = 0; axis < 3; ++axis) {
        const float p = m_position[axis];
        const float d = m_direction[axis];
        const float c0[2] = {p - box[2 * axis] + alpha, box[2 * axis + 1] - p + alpha};
        const float c1[2] = {d + beta, beta - d};
        for (int k = 0; k < 2; ++k) {
            if (c1[k] > 0.0f) {
                tLo = std::max(tLo, -c0[k] / c1[k]);
            } else if (c1[k] < 0.0f) {
                tHi = std::min(tHi, c0[k] / -c1[k]);
            } else if (!(c0[k] >= 0.0f)) {
                return false;
            }
        }
    }
    return tLo < tHi || (tLo == tHi && tLo > 0.0f);
}

bool ZmLine::intersect(float tolerance, const ZmVec3f& a, const ZmVec3f& b, ZmVec3f& point) const noexcept
{
    const ZmVec3f& d = m_direction;
    const ZmVec3f e = b - a;
    const ZmVec3f w = a - m_position;
    // Distance of a + s e from the line: |wPerp + s ePerp|, parts orthogonal to the unit direction.
    const ZmVec3f ePerp = e - d * e.dot(d);
    const ZmVec3f wPerp = w - d * w.dot(d);
    const float ee = ePerp.dot(ePerp);
    float s;
    if (ee == 0.0f) {
        // Parallel or a single point: all at one distance, take the end furthest along the ray.
        s = e.dot(d) > 0.0f ? 1.0f : 0.0f;
    } else {
        s = -wPerp.dot(ePerp) / ee;
        s = s < 0.0f ? 0.0f : (s > 1.0f ? 1.0f : s);
    }
    const ZmVec3f q = a + e * s;
    if (!intersect(tolerance, q)) {
        point.makeNaN();
        return false;
    }
    point = q;
    return true;
}

bool ZmLine::intersect(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c, ZmVec3f& point,
                       ZmVec3f& barycentric, bool& front) const noexcept
{
    const ZmVec3f e1 = b - a;
    const ZmVec3f e2 = c - a;
    const ZmVec3f pvec = m_direction.cross(e2);
    const float det = e1.dot(pvec);
    if (det != 0.0f) {
        const float inv = 1.0f / det;
        const ZmVec3f tvec = m_position - a;
        const float u = tvec.dot(pvec) * inv;
        const ZmVec3f qvec = tvec.cross(e1);
        const float v = m_direction.dot(qvec) * inv;
        const float t = e2.dot(qvec) * inv;
        if (u >= 0.0f && v >= 0.0f && u + v <= 1.0f && t > 0.0f) {
            point = m_position + m_direction * t;
            barycentric.setValue(1.0f - u - v, u, v);
            // det = -dir . ((b - a) x (c - a)): positive when the ray runs against the normal.
            front = det > 0.0f;
            return true;
        }
    }
    point.makeNaN();
    barycentric.makeNaN();
    front = false;
    return false;
}

void ZmLine::transform(const ZmMat4f& m) noexcept
{
    ZmVec3f pos, dir;
    m.multVecMatrix(m_position, pos);
    m.multDirMatrix(m_direction, dir);
    // The direction is deliberately not normalised again.
    m_position = pos;
    m_direction = dir;
}
