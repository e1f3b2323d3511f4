#include <zmlib/ZmLine2D.h>

#include <cmath>

// A plain value of four floats, copied as bytes.
static_assert(sizeof(ZmLine2D) == 16, "ZmLine2D layout");

ZmVec2f ZmLine2D::getClosestPoint(const ZmVec2f& p, bool clampToSegment) const noexcept
{
    const float len = m_direction.length();
    if (len == 0.0f)
        return m_position;
    const ZmVec2f unit = m_direction / len;
    float t = (p - m_position).dot(unit);
    if (clampToSegment)
        t = t < 0.0f ? 0.0f : (t > len ? len : t);
    return m_position + unit * t;
}

float ZmLine2D::getDistanceTo(const ZmVec2f& p) const noexcept
{
    const ZmVec2f v = p - m_position;
    const float len = m_direction.length();
    if (len == 0.0f)
        return v.length();
    return (v.y() * m_direction.x() - v.x() * m_direction.y()) / len;
}

float ZmLine2D::getDistance2To(const ZmVec2f& p) const noexcept
{
    const ZmVec2f v = p - m_position;
    const float d2 = m_direction.length2();
    if (d2 == 0.0f)
        return v.length2();
    const ZmVec2f off = v - m_direction * (v.dot(m_direction) / d2);
    return off.length2();
}

bool ZmLine2D::crossingParameters(const ZmLine2D& other, float& s, float& u) const noexcept
{
    if (isEmpty() || other.isEmpty())
        return false;
    const ZmVec2f& d = m_direction;
    const ZmVec2f& e = other.m_direction;
    const float den = e.y() * d.x() - d.y() * e.x();
    if (den == 0.0f)
        return false;
    const ZmVec2f w = other.m_position - m_position;
    u = (w.x() * d.y() - w.y() * d.x()) / den;
    s = (w.x() * e.y() - w.y() * e.x()) / den;
    return true;
}

bool ZmLine2D::intersects(const ZmLine2D& other, ZmVec2f* point) const noexcept
{
    float s, u;
    if (!crossingParameters(other, s, u))
        return false;
    if (point != nullptr)
        *point = other.m_position + other.m_direction * u;
    return true;
}

bool ZmLine2D::intersectsSegments(const ZmLine2D& other, ZmVec2f* point) const noexcept
{
    float s, u;
    if (!crossingParameters(other, s, u))
        return false;
    if (!(s >= 0.0f && s <= 1.0f && u >= 0.0f && u <= 1.0f))
        return false;
    if (point != nullptr)
        *point = other.m_position + other.m_direction * u;
    return true;
}

void ZmLine2D::translate(float t) noexcept
{
    const float len = m_direction.length();
    if (len == 0.0f)
        return;
    m_position += ZmVec2f(-m_direction.y(), m_direction.x()) / len * t;
}

std::vector<ZmVec2f> ZmLine2D::getCoordinates() const
{
    return {m_position, m_position + m_direction};
}
