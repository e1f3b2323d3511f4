/// \file
/// The library's three-component single-precision vector.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3d.h>
#include <zmlib/ZmVec3i.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>

/// A point or direction of three floats x, y, z (12 bytes, components in this order).
///
/// A plain value: no heap storage, copyable with a byte copy. The default constructor leaves the
/// components uninitialised on purpose (geometry is created in bulk and filled at once); NaN marks
/// a value as "unset" (`makeNaN`, `isNumber`). Points are row vectors, transformed as `p * M`.
/// Nothing fails: division by zero and NaN give the IEEE results.
class ZMLIB_API ZmVec3f {
public:
    ZmVec3f() noexcept = default;
    constexpr ZmVec3f(float x, float y, float z) noexcept : m_v{x, y, z} {}
    /// All three components set to \p v.
    explicit constexpr ZmVec3f(float v) noexcept : m_v{v, v, v} {}
    /// Each double rounded to float.
    explicit constexpr ZmVec3f(const ZmVec3d& v) noexcept
        : m_v{static_cast<float>(v[0]), static_cast<float>(v[1]), static_cast<float>(v[2])}
    {}
    /// Each integer converted to the nearest float.
    explicit constexpr ZmVec3f(const ZmVec3i& v) noexcept
        : m_v{static_cast<float>(v[0]), static_cast<float>(v[1]), static_cast<float>(v[2])}
    {}

    void setValue(float x, float y, float z) noexcept
    {
        m_v[0] = x;
        m_v[1] = y;
        m_v[2] = z;
    }
    void setValue(float v) noexcept { setValue(v, v, v); }

    /// No index check: \p i must be 0 to 2.
    constexpr float& operator[](int i) noexcept { return m_v[i]; }
    constexpr const float& operator[](int i) const noexcept { return m_v[i]; }
    constexpr float& x() noexcept { return m_v[0]; }
    constexpr float& y() noexcept { return m_v[1]; }
    constexpr float& z() noexcept { return m_v[2]; }
    constexpr float x() const noexcept { return m_v[0]; }
    constexpr float y() const noexcept { return m_v[1]; }
    constexpr float z() const noexcept { return m_v[2]; }
    /// The three components as an array.
    float* getValue() noexcept { return m_v; }
    const float* getValue() const noexcept { return m_v; }

    ZmVec3f& operator+=(const ZmVec3f& o) noexcept
    {
        m_v[0] += o.m_v[0];
        m_v[1] += o.m_v[1];
        m_v[2] += o.m_v[2];
        return *this;
    }
    /// The double vector is rounded to float before it is added.
    ZmVec3f& operator+=(const ZmVec3d& o) noexcept { return *this += ZmVec3f(o); }
    ZmVec3f& operator-=(const ZmVec3f& o) noexcept
    {
        m_v[0] -= o.m_v[0];
        m_v[1] -= o.m_v[1];
        m_v[2] -= o.m_v[2];
        return *this;
    }
    ZmVec3f& operator*=(float s) noexcept
    {
        m_v[0] *= s;
        m_v[1] *= s;
        m_v[2] *= s;
        return *this;
    }
    /// Three true divisions (no reciprocal), so results are correctly rounded.
    ZmVec3f& operator/=(float s) noexcept
    {
        m_v[0] /= s;
        m_v[1] /= s;
        m_v[2] /= s;
        return *this;
    }

    constexpr float dot(const ZmVec3f& o) const noexcept
    {
        return m_v[0] * o.m_v[0] + m_v[1] * o.m_v[1] + m_v[2] * o.m_v[2];
    }
    constexpr ZmVec3f cross(const ZmVec3f& o) const noexcept
    {
        return {m_v[1] * o.m_v[2] - m_v[2] * o.m_v[1], m_v[2] * o.m_v[0] - m_v[0] * o.m_v[2],
                m_v[0] * o.m_v[1] - m_v[1] * o.m_v[0]};
    }
    /// Component-wise product.
    constexpr ZmVec3f compprod(const ZmVec3f& o) const noexcept
    {
        return {m_v[0] * o.m_v[0], m_v[1] * o.m_v[1], m_v[2] * o.m_v[2]};
    }
    /// Component-wise quotient, without a test for zero components.
    constexpr ZmVec3f compquot(const ZmVec3f& o) const noexcept
    {
        return {m_v[0] / o.m_v[0], m_v[1] / o.m_v[1], m_v[2] / o.m_v[2]};
    }

    float length() const noexcept { return std::sqrt(length2()); }
    /// The squared length.
    constexpr float length2() const noexcept { return dot(*this); }
    /// The largest absolute component.
    float infnorm() const noexcept
    {
        return std::fmax(std::fabs(m_v[0]), std::fmax(std::fabs(m_v[1]), std::fabs(m_v[2])));
    }
    constexpr float sumOfComponents() const noexcept { return m_v[0] + m_v[1] + m_v[2]; }
    constexpr float productOfComponents() const noexcept { return m_v[0] * m_v[1] * m_v[2]; }
    constexpr float min() const noexcept { return m_v[indexOfMin()]; }
    constexpr float max() const noexcept { return m_v[indexOfMax()]; }
    /// Index of the smallest component; on ties the lowest index.
    constexpr int indexOfMin() const noexcept
    {
        int i = m_v[1] < m_v[0] ? 1 : 0;
        return m_v[2] < m_v[i] ? 2 : i;
    }
    /// Index of the largest component; on ties the lowest index.
    constexpr int indexOfMax() const noexcept
    {
        int i = m_v[1] > m_v[0] ? 1 : 0;
        return m_v[2] > m_v[i] ? 2 : i;
    }

    /// Divides by the length and returns the length measured before; a zero vector is left as it
    /// is and 0 is returned.
    float normalize() noexcept
    {
        const float len = length();
        if (len != 0.0f)
            *this /= len;
        return len;
    }
    /// A normalised copy (same rule as `normalize`).
    ZmVec3f normalized() const noexcept
    {
        ZmVec3f r(*this);
        r.normalize();
        return r;
    }
    ZmVec3f abs() const noexcept { return {std::fabs(m_v[0]), std::fabs(m_v[1]), std::fabs(m_v[2])}; }
    void makeAbs() noexcept { *this = abs(); }
    /// Each component -1, 0 or +1; NaN gives 0.
    constexpr ZmVec3f sign() const noexcept { return {sign(m_v[0]), sign(m_v[1]), sign(m_v[2])}; }
    /// Each component rounded to the nearest integer in the current rounding mode (ties to even by
    /// default) and passed through a 32-bit integer; NaN and values outside its range come back as
    /// -2147483648, as the processor's conversion gives them.
    ZmVec3f round() const noexcept
    {
        return {roundThroughInt(m_v[0]), roundThroughInt(m_v[1]), roundThroughInt(m_v[2])};
    }
    /// `this + (b - this) * t`, per component.
    constexpr ZmVec3f lerp(const ZmVec3f& b, float t) const noexcept
    {
        return {m_v[0] + (b.m_v[0] - m_v[0]) * t, m_v[1] + (b.m_v[1] - m_v[1]) * t,
                m_v[2] + (b.m_v[2] - m_v[2]) * t};
    }
    /// A copy with component \p i replaced by \p v.
    ZmVec3f compSwapped(unsigned i, float v) const noexcept
    {
        ZmVec3f r(*this);
        r.m_v[i] = v;
        return r;
    }
    /// `(v[idx[0]], v[idx[1]], v[idx[2]])`, without a range check.
    ZmVec3f swizzled(const ZmVec3i& idx) const noexcept { return {m_v[idx[0]], m_v[idx[1]], m_v[idx[2]]}; }

    /// The angle to \p b in radians, in [0, pi]. A zero vector on either side gives pi/2.
    double angle(const ZmVec3f& b) const noexcept;
    /// The signed unit axis (+x, -x, +y, -y, +z, -z) closest in direction; ties go to the earlier
    /// axis of that list, a zero vector gives +x and a vector with a NaN component (0, 0, 0).
    ZmVec3f getClosestAxis() const noexcept;

    /// True when the squared distance to \p b is at most `eps * eps`.
    bool equals(const ZmVec3f& b, float eps) const noexcept { return (*this - b).length2() <= eps * eps; }
    /// False with a NaN component, else true only when all three components are exactly 0.
    bool isZero() const noexcept { return isNumber() && m_v[0] == 0.0f && m_v[1] == 0.0f && m_v[2] == 0.0f; }
    /// False with a NaN component, else true when the squared length (not the length) lies in
    /// [1 - eps, 1 + eps].
    bool isNormal(float eps) const noexcept
    {
        if (!isNumber())
            return false;
        const float l2 = length2();
        return 1.0f - eps <= l2 && l2 <= 1.0f + eps;
    }
    /// True when the vector lies within distance \p eps of one of the six signed unit axes.
    bool isAxis(float eps) const noexcept;
    bool isNumber() const noexcept
    {
        return !std::isnan(m_v[0]) && !std::isnan(m_v[1]) && !std::isnan(m_v[2]);
    }
    bool isNoNumber() const noexcept { return !isNumber(); }
    void makeNull() noexcept { setValue(0.0f); }
    void makeNaN() noexcept { setValue(std::nanf("0")); }
    static ZmVec3f NaN() noexcept { return ZmVec3f(std::nanf("0")); }

    /// Writes "%10.5g %10.5g %10.5g\n".
    void print(FILE* fp) const;
    /// `{"x":"…","y":"…","z":"…"}`, each number in fixed notation with six decimals whatever the
    /// locale.
    std::string dump() const;

    friend constexpr ZmVec3f operator+(const ZmVec3f& a, const ZmVec3f& b) noexcept
    {
        return {a.m_v[0] + b.m_v[0], a.m_v[1] + b.m_v[1], a.m_v[2] + b.m_v[2]};
    }
    friend constexpr ZmVec3f operator-(const ZmVec3f& a, const ZmVec3f& b) noexcept
    {
        return {a.m_v[0] - b.m_v[0], a.m_v[1] - b.m_v[1], a.m_v[2] - b.m_v[2]};
    }
    friend constexpr ZmVec3f operator-(const ZmVec3f& a) noexcept
    {
        return {-a.m_v[0], -a.m_v[1], -a.m_v[2]};
    }
    friend constexpr ZmVec3f operator*(const ZmVec3f& a, float s) noexcept
    {
        return {a.m_v[0] * s, a.m_v[1] * s, a.m_v[2] * s};
    }
    friend constexpr ZmVec3f operator*(float s, const ZmVec3f& a) noexcept { return a * s; }
    friend constexpr ZmVec3f operator/(const ZmVec3f& a, float s) noexcept
    {
        return {a.m_v[0] / s, a.m_v[1] / s, a.m_v[2] / s};
    }
    /// Exact comparison (NaN is unequal to everything).
    friend constexpr bool operator==(const ZmVec3f& a, const ZmVec3f& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1] && a.m_v[2] == b.m_v[2];
    }
    friend constexpr bool operator!=(const ZmVec3f& a, const ZmVec3f& b) noexcept { return !(a == b); }

private:
    static float roundThroughInt(float v) noexcept
    {
        const float r = std::nearbyint(v);
        // The range test keeps the conversion defined; -2^31 is what an out-of-range one yields.
        return (r >= -2147483648.0f && r < 2147483648.0f) ? static_cast<float>(static_cast<int32_t>(r))
                                                          : -2147483648.0f;
    }
    static constexpr float sign(float v) noexcept { return v > 0.0f ? 1.0f : (v < 0.0f ? -1.0f : 0.0f); }

    float m_v[3];
};
