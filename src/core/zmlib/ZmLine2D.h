/// \file
/// Lines and segments in the plane.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec2f.h>

#include <vector>

/// A line in the plane given by a position and a direction that is kept as given (not normalised),
/// so that the parameter range [0, 1] is the segment from the position to `position + direction`.
/// Used for 2D measurements and overlays: distances, projections and crossings of lines and
/// segments.
///
/// A plain value of four floats that owns nothing; the default constructor leaves it uninitialised,
/// like every small geometry value. Not synchronised: share constant lines freely. Nothing fails: a
/// line with a zero direction (`isEmpty`) falls back to its position where noted, crossings report
/// false.
class ZMLIB_API ZmLine2D {
public:
    ZmLine2D() noexcept = default;
    /// Position \p p0, direction `p1 - p0`.
    ZmLine2D(const ZmVec2f& p0, const ZmVec2f& p1) noexcept : m_position(p0), m_direction(p1 - p0) {}

    void setValue(const ZmVec2f& p0, const ZmVec2f& p1) noexcept
    {
        m_position = p0;
        m_direction = p1 - p0;
    }
    /// Plain stores.
    void setPosDir(const ZmVec2f& pos, const ZmVec2f& dir) noexcept
    {
        m_position = pos;
        m_direction = dir;
    }
    const ZmVec2f& getPosition() const noexcept { return m_position; }
    const ZmVec2f& getDirection() const noexcept { return m_direction; }

    /// The projection of \p p onto the line; with \p clampToSegment the projection is kept between
    /// the position and `position + direction`. A zero direction gives the position.
    ZmVec2f getClosestPoint(const ZmVec2f& p, bool clampToSegment) const noexcept;
    /// Signed perpendicular distance, positive to the left of the direction; for a zero direction
    /// the distance to the position.
    float getDistanceTo(const ZmVec2f& p) const noexcept;
    /// Squared distance from \p p to the infinite line; for a zero direction the squared distance to
    /// the position.
    float getDistance2To(const ZmVec2f& p) const noexcept;

    /// Crossing of the two infinite lines; false for parallel or empty lines. \p point (if not
    /// null) receives the crossing and is untouched on false.
    bool intersects(const ZmLine2D& other, ZmVec2f* point) const noexcept;
    /// Crossing of the two segments (both parameters in [0, 1], ends included); \p point as for
    /// `intersects`.
    bool intersectsSegments(const ZmLine2D& other, ZmVec2f* point) const noexcept;

    /// Moves the line sideways by \p t along its left normal `(-dir.y, dir.x) / |dir|`; a line with
    /// a zero direction has no normal and stays where it is.
    void translate(float t) noexcept;
    /// The two end points `position` and `position + direction`.
    std::vector<ZmVec2f> getCoordinates() const;

    /// No member is NaN and the direction is not exactly (0, 0).
    bool isNotEmpty() const noexcept
    {
        return m_position.isNumber() && m_direction.isNumber() &&
               (m_direction.x() != 0.0f || m_direction.y() != 0.0f);
    }
    bool isEmpty() const noexcept { return !isNotEmpty(); }
    /// All four members 0.
    void makeEmpty() noexcept
    {
        m_position.setValue(0.0f, 0.0f);
        m_direction.setValue(0.0f, 0.0f);
    }

private:
    /// Both line parameters of the crossing (\p s along this line, \p u along \p other); false
    /// for parallel or empty lines.
    bool crossingParameters(const ZmLine2D& other, float& s, float& u) const noexcept;

    ZmVec2f m_position;
    ZmVec2f m_direction;
};
