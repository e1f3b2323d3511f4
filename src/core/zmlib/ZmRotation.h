/// \file
/// The library's unit-quaternion rotation.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmVec3f.h>

#include <cmath>
#include <string>

#include <emmintrin.h> // SSE2: every x86-64 processor, the only target of this library

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
        // With this = (x, y, z, w) and q = (X, Y, Z, W), lane by lane:
        //   x' = X w + x W + z Y - Z y,   y' = W y + w Y + x Z - X z,
        //   z' = z W + Z w + X y - x Y,   w' = W w - X x - y Y - z Z,
        // summed left to right (products commute exactly, adding a negated term is exact
        // subtraction), then normalised.
        const __m128 a = _mm_loadu_ps(m_q), b = _mm_loadu_ps(q.m_q);
        const __m128 lane3 = _mm_set_ps(-0.0f, 0.0f, 0.0f, 0.0f); // sign bit of w only
        const __m128 t1 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(3, 2, 1, 3)),
                                     _mm_shuffle_ps(b, b, _MM_SHUFFLE(3, 3, 3, 0)));
        const __m128 t2 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(0, 3, 3, 0)),
                                     _mm_shuffle_ps(b, b, _MM_SHUFFLE(0, 2, 1, 3)));
        const __m128 t3 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(1, 1, 0, 2)),
                                     _mm_shuffle_ps(b, b, _MM_SHUFFLE(1, 0, 2, 1)));
        const __m128 t4 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 0, 2, 1)),
                                     _mm_shuffle_ps(b, b, _MM_SHUFFLE(2, 1, 0, 2)));
        const __m128 r =
            _mm_sub_ps(_mm_add_ps(_mm_add_ps(t1, _mm_xor_ps(t2, lane3)), _mm_xor_ps(t3, lane3)), t4);
        storeNormalized(r);
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
    /// Divides by the square root of `norm()`, the reciprocal taken in double.
    void normalize() noexcept { storeNormalized(_mm_loadu_ps(m_q)); }
    /// Stores \p v divided by its length: the squared norm summed in float in the order x, y, z,
    /// w (as `norm()`), its square root and reciprocal in double, each product rounded to float.
    void storeNormalized(__m128 v) noexcept
    {
        const __m128 sq = _mm_mul_ps(v, v);
        const __m128 n =
            _mm_add_ss(_mm_add_ss(_mm_add_ss(sq, _mm_shuffle_ps(sq, sq, _MM_SHUFFLE(1, 1, 1, 1))),
                                  _mm_movehl_ps(sq, sq)),
                       _mm_shuffle_ps(sq, sq, _MM_SHUFFLE(3, 3, 3, 3)));
        const __m128d len = _mm_sqrt_sd(_mm_setzero_pd(), _mm_cvtss_sd(_mm_setzero_pd(), n));
        __m128d inv = _mm_div_sd(_mm_set_sd(1.0), len);
        inv = _mm_unpacklo_pd(inv, inv);
        const __m128 lo = _mm_cvtpd_ps(_mm_mul_pd(_mm_cvtps_pd(v), inv));
        const __m128 hi = _mm_cvtpd_ps(_mm_mul_pd(_mm_cvtps_pd(_mm_movehl_ps(v, v)), inv));
        _mm_storeu_ps(m_q, _mm_movelh_ps(lo, hi));
    }

    float m_q[4];
};
