/// \file
/// Infinite planes.
#pragma once

#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3f.h>

#include <boost/optional.hpp>

#include <cmath>
#include <string>

class ZmLine;
class ZmMat4f;

/// An infinite plane: the points p with `normal . p == distance`. The signed distance of a point
/// is `normal . p - distance`, positive on the side the normal points to. Used for slicing,
/// clipping and picking; a valid plane has a unit normal.
///
/// A plain value of four floats (normal, then distance) that owns nothing; the default
/// constructor leaves it uninitialised, like every small geometry value. Not synchronised, except
/// that `emptyPlane()` must be called once before several threads use it. Nothing fails: a zero
/// normal gives the all-zero plane, parallel planes and lines answer false with NaN outputs.
class ZMLIB_API ZmPlane {
public:
    ZmPlane() noexcept = default;
    /// Through three points, normal `(p1 - p0) x (p2 - p0)`; collinear points give all four 0.
    ZmPlane(const ZmVec3f& p0, const ZmVec3f& p1, const ZmVec3f& p2) noexcept { set(p0, p1, p2); }
    /// With \p normal (normalised) through \p point; a zero normal gives all four 0.
    ZmPlane(const ZmVec3f& normal, const ZmVec3f& point) noexcept { set(normal, point); }
    /// \p normal normalised, \p distance stored as given, not divided by the normal's length. Unlike
    /// `set`, a zero normal stays zero with the distance kept (an empty plane either way).
    ZmPlane(const ZmVec3f& normal, float distance) noexcept
        : m_normal(normal.normalized()), m_distance(distance)
    {}

    void set(const ZmVec3f& p0, const ZmVec3f& p1, const ZmVec3f& p2) noexcept;
    void set(const ZmVec3f& normal, const ZmVec3f& point) noexcept;
    /// \p normal normalised, \p distance stored as given; a zero normal gives all four 0.
    void set(const ZmVec3f& normal, float distance) noexcept;
    /// Plain store, not normalised.
    void setNormal(const ZmVec3f& normal) noexcept { m_normal = normal; }
    void setDistanceFromOrigin(float distance) noexcept { m_distance = distance; }
    const ZmVec3f& getNormal() const noexcept { return m_normal; }
    float getDistanceFromOrigin() const noexcept { return m_distance; }

    /// Signed distance of \p p, `normal . p - distance`.
    float getDistance(const ZmVec3f& p) const noexcept { return m_normal.dot(p) - m_distance; }
    /// For a parallel plane (as `isParallel` decides), the signed distance of its point
    /// `other.normal * other.distance` from this plane; empty otherwise.
    boost::optional<float> getDistance(const ZmPlane& other) const noexcept;
    /// Smallest and largest signed distance over the eight corners of \p box.
    void getDistance(const ZmBox3f& box, float& min, float& max) const noexcept;
    /// `p - normal * getDistance(p)`.
    ZmVec3f getProjectedPoint(const ZmVec3f& p) const noexcept { return p - m_normal * getDistance(p); }
    /// `normal . p >= distance`.
    bool isInHalfSpace(const ZmVec3f& p) const noexcept { return m_normal.dot(p) >= m_distance; }

    /// The normals are parallel or opposite: `| |n . m| - 1 | <= 0.0001`, in double.
    bool isParallel(const ZmPlane& other) const noexcept;
    /// Both normals normalised (false when either is shorter than 1e-6); their dot product, or its
    /// absolute value when \p orientationMatters is false, lies within 0.0001 of 1.
    bool isNearEqualNormal(const ZmVec3f& normal, bool orientationMatters) const noexcept;
    /// The planes agree within a region of interest, the ball of \p roiRadius around \p roiCenter
    /// (a negative radius counts as 0): the normals pass `isNearEqualNormal`, and over the whole
    /// ball the signed distances from the two planes (this plane's taken with the sign of the
    /// normals' dot product) differ by at most \p tolerance. That is `|s d(c) - d'(c)| + r |s n - m|
    /// <= tolerance` with s that sign, d and d' the signed distances, n and m the normals; for
    /// centre 0 and radius 0 it compares the two distances from the origin.
    bool isNearEqualInROI(const ZmPlane& other, const ZmVec3f& roiCenter, float roiRadius, float tolerance,
                          bool orientationMatters) const noexcept;

    /// The line where the two planes meet, its position the point where the coordinate of the
    /// direction's largest component is 0 (on equal magnitudes the earlier of x, y, z). False with
    /// a NaN line when the normals' cross product is shorter than 1e-5.
    bool intersect(const ZmPlane& other, ZmLine& line) const noexcept;
    /// Where \p line crosses the plane (its parameter, possibly negative, into \p t if given);
    /// false with a NaN point when the line runs exactly parallel.
    bool intersect(const ZmLine& line, ZmVec3f& point, float* t = nullptr) const noexcept;

    /// Normalises the normal without rescaling the distance (intended), then negates all four
    /// members when the distance is negative.
    void normalize() noexcept;
    /// `distance += d`.
    void offset(float d) noexcept { m_distance += d; }
    /// Negates all four members.
    void revertOrientation() noexcept
    {
        m_normal = -m_normal;
        m_distance = -m_distance;
    }
    /// Maps the plane by the point transform \p m. The normal goes through the upper 3x3 itself,
    /// not its inverse transpose (intended: meant for rigid and uniformly scaled transforms).
    void transform(const ZmMat4f& m) noexcept;
    /// Maps the plane by the inverse of the point transform \p m, using \p m itself.
    void transformInv(const ZmMat4f& m) noexcept;

    /// Some member is NaN or the normal's squared length lies outside [0.999, 1.001].
    bool isEmpty() const noexcept
    {
        const float l2 = m_normal.length2();
        return !isNumber() || l2 < 0.999f || l2 > 1.001f;
    }
    bool isValid() const noexcept { return !isEmpty(); }
    bool isNumber() const noexcept { return m_normal.isNumber() && !std::isnan(m_distance); }
    bool isNoNumber() const noexcept { return !isNumber(); }
    /// All four members NaN.
    void makeNaN() noexcept
    {
        m_normal.makeNaN();
        m_distance = std::nanf("0");
    }
    /// All four members 0.
    void makeEmpty() noexcept
    {
        m_normal.makeNull();
        m_distance = 0.0f;
    }
    /// A process-wide plane with all members 0, initialised on first use.
    static const ZmPlane& emptyPlane();

    /// `{"normal":{"x":"…","y":"…","z":"…"},"distance":"…"}`, numbers with six decimals.
    std::string dump() const;

private:
    ZmVec3f m_normal;
    float m_distance;
};
