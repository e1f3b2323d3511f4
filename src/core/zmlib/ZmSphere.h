/// \file
/// Spheres.
#pragma once

#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3f.h>

#include <cmath>

class ZmLine;

/// A sphere given by its centre and radius; a negative radius marks an empty sphere. Used as a
/// bounding volume and for picking and clipping against lines and segments.
///
/// A plain value of four floats that owns nothing; the default constructor leaves it
/// uninitialised, like every small geometry value. Not synchronised, except that `emptySphere()`
/// must be called once before several threads use it. Nothing fails: a missing crossing answers
/// false and sets the output points to NaN.
class ZMLIB_API ZmSphere {
public:
    ZmSphere() noexcept = default;
    ZmSphere(const ZmVec3f& center, float radius) noexcept : m_center(center), m_radius(radius) {}

    void setValue(const ZmVec3f& center, float radius) noexcept
    {
        m_center = center;
        m_radius = radius;
    }
    void setCenter(const ZmVec3f& center) noexcept { m_center = center; }
    void setRadius(float radius) noexcept { m_radius = radius; }
    const ZmVec3f& getCenter() const noexcept { return m_center; }
    float getRadius() const noexcept { return m_radius; }

    /// The smallest sphere around \p box: its centre and the distance to the corner (xmax, ymax,
    /// zmax). A box with some minimum above its maximum gives centre (0, 0, 0) and radius -1.
    void circumscribe(const ZmBox3f& box) noexcept;

    /// Both crossings of the infinite \p line (its direction taken as unit), \p nearPoint first along
    /// the direction; false and both NaN when the line misses.
    bool intersect(const ZmLine& line, ZmVec3f& nearPoint, ZmVec3f& farPoint) const noexcept;
    /// The first crossing at or ahead of the line's position; false and NaN when there is none.
    bool intersect(const ZmLine& line, ZmVec3f& point) const noexcept;
    /// The part of the segment \p a - \p b inside the sphere. The crossing parameters are clamped
    /// to the segment, so a segment wholly before or after the sphere on its line answers true
    /// with \p enter equal to \p exit at one of its ends; this is intended, callers compare the two
    /// points. False and both NaN when the segment's line misses the sphere.
    bool intersect(const ZmVec3f& a, const ZmVec3f& b, ZmVec3f& enter, ZmVec3f& exit) const noexcept;

    /// The radius is negative.
    bool isEmpty() const noexcept { return m_radius < 0.0f; }
    bool isNotEmpty() const noexcept { return !isEmpty(); }
    /// No NaN and a radius of at least 0.
    bool isConsistent() const noexcept { return isNumber() && m_radius >= 0.0f; }
    bool isNumber() const noexcept { return m_center.isNumber() && !std::isnan(m_radius); }
    bool isNoNumber() const noexcept { return !isNumber(); }
    /// All four members NaN.
    void makeNaN() noexcept
    {
        m_center.makeNaN();
        m_radius = std::nanf("0");
    }
    /// Sets the radius to -1; the centre stays.
    void makeEmpty() noexcept { m_radius = -1.0f; }
    /// A process-wide empty sphere (centre (0, 0, 0), radius -1), created on first use and never
    /// freed.
    static const ZmSphere& emptySphere();

private:
    /// Line parameters of the two crossings of the line (\p pos, unit \p dir); false when the
    /// line misses (or a value is NaN).
    bool crossings(const ZmVec3f& pos, const ZmVec3f& dir, float& tNear, float& tFar) const noexcept;

    ZmVec3f m_center;
    float m_radius;
};
