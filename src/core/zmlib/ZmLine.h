/// \file
/// Lines and rays in space.
#pragma once

#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3f.h>

#include <cmath>

class ZmMat4f;

/// A line in space given by a position and a unit direction. It is also a ray: the picking
/// operations only accept points with a positive parameter along the direction, so that nothing
/// behind the eye is picked. Used for picking, clipping and measuring.
///
/// A plain value of six floats that owns nothing; the default constructor leaves it
/// uninitialised, like every small geometry value. Not synchronised: share constant lines freely.
/// Nothing fails: degenerate input gives NaN members or outputs and false results.
///
/// Picking tolerances: a tolerance of 0 or more is angular, the ratio of the distance from the
/// ray to its parameter along the ray (the tangent of the opening angle of a cone around the ray),
/// so that picking feels the same near and far; a negative tolerance is an absolute distance in
/// model units. A point counts as picked when that measure is strictly below |tolerance|.
class ZMLIB_API ZmLine {
public:
    ZmLine() noexcept = default;
    /// Position \p p0, direction towards \p p1 normalised; equal points give an all-NaN line.
    ZmLine(const ZmVec3f& p0, const ZmVec3f& p1) noexcept { setValue(p0, p1); }

    void setValue(const ZmVec3f& p0, const ZmVec3f& p1) noexcept
    {
        if (p0 == p1) {
            makeNaN();
            return;
        }
        m_position = p0;
        m_direction = p1 - p0;
        m_direction.normalize();
    }
    /// Stores both and normalises \p dir (a zero direction stays zero).
    void setPosDir(const ZmVec3f& pos, const ZmVec3f& dir) noexcept
    {
        m_position = pos;
        m_direction = dir;
        m_direction.normalize();
    }
    const ZmVec3f& getPosition() const noexcept { return m_position; }
    const ZmVec3f& getDirection() const noexcept { return m_direction; }

    /// The foot of the perpendicular from \p p on the infinite line (the direction taken as unit).
    ZmVec3f getClosestPoint(const ZmVec3f& p) const noexcept
    {
        return m_position + m_direction * (p - m_position).dot(m_direction);
    }
    /// The closest points of the two infinite lines; false with both NaN for parallel lines.
    bool getClosestPoints(const ZmLine& other, ZmVec3f& onThis, ZmVec3f& onOther) const noexcept;

    /// Point picking: \p p lies ahead of the position (parameter > 0) and within the tolerance of
    /// the ray (see the class comment).
    bool intersect(float tolerance, const ZmVec3f& p) const noexcept;
    /// Slab test of the infinite line against \p box (xmin, xmax, ymin, ymax, zmin, zmax). On a
    /// hit \p enter and \p exit are the points where the line enters and leaves the slabs, and
    /// both must lie in the box enlarged by \p tolerance on every side; on a miss both are NaN.
    /// A slab thinner along the line than \p tolerance counts as a hit at once and leaves \p enter
    /// and \p exit unwritten; this shortcut is intended.
    ///
    /// With \p tolerance 0 a hit can come out as a miss: the entry and exit points are computed in
    /// float, and a line that touches the box only on a face, an edge or a corner may have them
    /// land a rounding step outside it. For picking, pass a tolerance scaled to the coordinates,
    /// about 1e-4f * (the largest absolute coordinate of the box and of the line's position, at
    /// least 1); lines that graze a face almost in parallel can still miss by more.
    bool intersect(const ZmBox3f& box, ZmVec3f& enter, ZmVec3f& exit, float tolerance) const noexcept;
    /// Box picking: true when some point of the ray with parameter t > 0 lies within the margin
    /// of \p box on every axis (per axis, min - margin <= coordinate <= max + margin). The margin is
    /// |tolerance| for a negative tolerance, and tolerance * t for an angular one (the box seen
    /// through a cone around the ray). A box with some minimum above its maximum is never picked.
    bool intersect(float tolerance, const ZmBox3f& box) const noexcept;
    /// Segment picking: the point of the segment \p a - \p b nearest to the infinite line (for a
    /// segment parallel to the line, or of zero length, the end further along the ray) is picked
    /// as a point with \p tolerance. On a hit \p point receives that point of the segment, on a
    /// miss NaN.
    bool intersect(float tolerance, const ZmVec3f& a, const ZmVec3f& b, ZmVec3f& point) const noexcept;
    /// Ray and triangle \p a, \p b, \p c: true when the ray (parameter t > 0) meets the triangle,
    /// edges and corners included. \p point is the crossing, \p barycentric its weights for a, b
    /// and c (point = w0 a + w1 b + w2 c), and \p front is true when the ray meets the side that
    /// `(b - a) x (c - a)` points to. A ray parallel to the triangle's plane or a degenerate
    /// triangle misses. On a miss \p point and \p barycentric are NaN and \p front is false.
    bool intersect(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c, ZmVec3f& point, ZmVec3f& barycentric,
                   bool& front) const noexcept;

    /// The position as a point (`multVecMatrix`), the direction as a direction (`multDirMatrix`);
    /// the direction is not normalised again, so a scaling transform leaves it scaled.
    void transform(const ZmMat4f& m) noexcept;

    /// Some member is NaN or the direction is not of unit length (squared length beyond 1 +- 0.001).
    bool isEmpty() const noexcept { return !isNumber() || !m_direction.isNormal(0.001f); }
    bool isValid() const noexcept { return !isEmpty(); }
    bool isNotEmpty() const noexcept { return !isEmpty(); }
    bool isNumber() const noexcept { return m_position.isNumber() && m_direction.isNumber(); }
    bool isNoNumber() const noexcept { return !isNumber(); }
    /// All six members NaN.
    void makeNaN() noexcept
    {
        m_position.makeNaN();
        m_direction.makeNaN();
    }
    /// All six members 0.
    void makeEmpty() noexcept
    {
        m_position.makeNull();
        m_direction.makeNull();
    }

private:
    ZmVec3f m_position;
    ZmVec3f m_direction;
};
