/// \file
/// The library's unit-quaternion rotation.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmVec3f.h>

#include <cmath>
#include <string>

/// A rotation as a unit quaternion of four floats stored x, y, z, w (vector part first, 16 bytes);
/// the rotation of angle a about the unit axis n is (n * sin(a/2), cos(a/2)). Rotations act on
/// row vectors like the matrices: `v * M` with `M` from `getValue(ZmMat4f&)`.
///
/// The setters from four components normalise; the setters from an axis and angle, from vectors
/// and from a rotation matrix produce a unit quaternion from valid input and do not normalise
/// again; `operator[]` writes without any test. A plain value without heap storage; the default
/// constructor leaves it uninitialised on purpose, NaN marks it "unset". Nothing fails: a zero
/// quaternion normalises to NaN, NaN propagates. Concurrent reads of one rotation are safe.
class ZMLIB_API ZmRotation {
public:
    ZmRotation() noexcept {}
    /// Components x, y, z, w, then normalised.
    ZmRotation(float x, float y, float z, float w) noexcept { setValue(x, y, z, w); }
    /// Four components x, y, z, w, then normalised.
    explicit ZmRotation(const float* q) noexcept { setValue(q); }
    /// Rotation by \p angle radians about \p axis (normalised first unless it is zero).
    ZmRotation(const ZmVec3f& axis, float angle) noexcept { setValue(axis, angle); }
    /// The shortest rotation taking direction \p from to direction \p to. Opposite directions give
    /// a half turn about an axis perpendicular to \p from, also when rounding puts their dot
    /// product just above -1.
    ZmRotation(const ZmVec3f& from, const ZmVec3f& to) noexcept { setValue(from, to); }
    /// The rotation taking \p fromDir to \p toDir and then turning about \p toDir so that the
    /// rotated \p fromUp lies in the plane of \p toDir and \p toUp.
    ZmRotation(const ZmVec3f& fromDir, const ZmVec3f& fromUp, const ZmVec3f& toDir,
               const ZmVec3f& toUp) noexcept
    {
        setValue(fromDir, fromUp, toDir, toUp);
    }
    /// From a rotation matrix (row-vector form).
    explicit ZmRotation(const ZmMat3f& m) noexcept { setValue(m); }
    /// From the upper 3x3 rotation of \p m (row-vector form); m[3][3] takes the place of the 1
    /// under the square roots.
    explicit ZmRotation(const ZmMat4f& m) noexcept { setValue(m); }

    ZmRotation& setValue(float x, float y, float z, float w) noexcept
    {
        m_q[0] = x;
        m_q[1] = y;
        m_q[2] = z;
        m_q[3] = w;
        normalize();
        return *this;
    }
    ZmRotation& setValue(const float* q) noexcept { return setValue(q[0], q[1], q[2], q[3]); }
    ZmRotation& setValue(const ZmVec3f& axis, float angle) noexcept;
    ZmRotation& setValue(const ZmVec3f& from, const ZmVec3f& to) noexcept;
    ZmRotation& setValue(const ZmVec3f& fromDir, const ZmVec3f& fromUp, const ZmVec3f& toDir,
                         const ZmVec3f& toUp) noexcept;
    ZmRotation& setValue(const ZmMat3f& m) noexcept;
    ZmRotation& setValue(const ZmMat4f& m) noexcept;

    void getValue(float& x, float& y, float& z, float& w) const noexcept
    {
        x = m_q[0];
        y = m_q[1];
        z = m_q[2];
        w = m_q[3];
    }
    /// The four components x, y, z, w.
    const float* getValue() const noexcept { return m_q; }
    /// Unit axis and angle in radians; a rotation too close to the identity (|xyz| <= 1e-5)
    /// gives the axis (0, 0, 1) and angle 0.
    void getValue(ZmVec3f& axis, float& angle) const noexcept;
    /// The rotation matrix for row vectors (`v * M` rotates v); row 3 and column 3 are those of
    /// the identity. Each element is computed in double and rounded.
    void getValue(ZmMat4f& m) const noexcept
    {
        const double x = m_q[0], y = m_q[1], z = m_q[2], w = m_q[3];
        m[0][0] = float(1.0 - 2.0 * (y * y + z * z));
        m[0][1] = float(2.0 * (x * y + w * z));
        m[0][2] = float(2.0 * (x * z - w * y));
        m[0][3] = 0.0f;
        m[1][0] = float(2.0 * (x * y - w * z));
        m[1][1] = float(1.0 - 2.0 * (x * x + z * z));
        m[1][2] = float(2.0 * (y * z + w * x));
        m[1][3] = 0.0f;
        m[2][0] = float(2.0 * (x * z + w * y));
        m[2][1] = float(2.0 * (y * z - w * x));
        m[2][2] = float(1.0 - 2.0 * (x * x + y * y));
        m[2][3] = 0.0f;
        m[3][0] = 0.0f;
        m[3][1] = 0.0f;
        m[3][2] = 0.0f;
        m[3][3] = 1.0f;
    }
    /// The upper-left block of the 4x4 matrix.
    void getValue(ZmMat3f& m) const noexcept;
    ZmMat3f toMat3f() const noexcept
    {
        ZmMat3f m;
        getValue(m);
        return m;
    }

    /// Composition: first this rotation, then \p q (the quaternion product q * this), normalised.
    ZmRotation& operator*=(const ZmRotation& q) noexcept
    {
        // The product q * this in float, normalised (ZmRotation.cpp).
        compose(m_q, q.m_q, m_q);
        return *this;
    }
    /// \p v rotated (through the 4x4 matrix and `ZmMat4f::multVecMatrix`).
    ZmVec3f operator*(const ZmVec3f& v) const noexcept
    {
        ZmVec3f r;
        multVec(v, r);
        return r;
    }
    ZmVec3f multVec(const ZmVec3f& v) const noexcept { return *this * v; }
    /// \p out may be \p v.
    void multVec(const ZmVec3f& v, ZmVec3f& out) const noexcept
    {
        ZmMat4f m;
        getValue(m);
        m.multVecMatrix(v, out);
    }

    /// The inverse rotation, `(-x, -y, -z, w) / (x^2 + y^2 + z^2 + w^2)`.
    ZmRotation& invert() noexcept;
    ZmRotation inverse() const noexcept
    {
        ZmRotation r(*this);
        r.invert();
        return r;
    }
    /// Multiplies the angle by \p f, keeping the axis.
    ZmRotation& scaleAngle(float f) noexcept;
    /// All four `|a_i - b_i| < eps`, or all four `|a_i + b_i| < eps` (q and -q are the same
    /// rotation).
    bool equals(const ZmRotation& b, float eps) const noexcept;
    /// Spherical interpolation from \p a (t = 0) to \p b (t = 1) along the shorter arc, computed
    /// in double; not normalised afterwards.
    static ZmRotation slerp(const ZmRotation& a, const ZmRotation& b, float t) noexcept;

    static ZmRotation identity() noexcept
    {
        ZmRotation r;
        r.makeIdentity();
        return r;
    }
    ZmRotation& makeIdentity() noexcept
    {
        m_q[0] = m_q[1] = m_q[2] = 0.0f;
        m_q[3] = 1.0f;
        return *this;
    }
    void makeNaN() noexcept { m_q[0] = m_q[1] = m_q[2] = m_q[3] = std::nanf("0"); }
    bool isNumber() const noexcept
    {
        return !std::isnan(m_q[0]) && !std::isnan(m_q[1]) && !std::isnan(m_q[2]) && !std::isnan(m_q[3]);
    }

    /// Component \p i (0..3 for x, y, z, w), no check; writing does not normalise.
    float& operator[](int i) noexcept { return m_q[i]; }
    const float& operator[](int i) const noexcept { return m_q[i]; }

    /// `{"w":"…","x":"…","y":"…","z":"…"}` where, intended and relied upon by readers of this
    /// text, "w" carries the stored x, "x" the stored y, "y" the stored z and "z" the stored w.
    std::string dump() const;

private:
    /// The SQUARED norm, intended under this name.
    float norm() const noexcept
    {
        return m_q[0] * m_q[0] + m_q[1] * m_q[1] + m_q[2] * m_q[2] + m_q[3] * m_q[3];
    }
    /// Divides by the square root of `norm()`, the reciprocal taken in double, each product
    /// rounded to float (ZmRotation.cpp).
    void normalize() noexcept;
    /// \p out = (\p b * \p a) / |\p b * \p a|: products and sums in float, the reciprocal length
    /// in double. \p out may be either operand.
    static void compose(const float* a, const float* b, float* out) noexcept;

    float m_q[4];
};
