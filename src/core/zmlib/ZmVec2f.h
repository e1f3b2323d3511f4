/// \file
/// A vector of two floats.
#pragma once

#include <cmath>

/// Two single-precision components x, y, a plain value (8 bytes). A default-constructed vector is
/// uninitialised, like every small geometry value; set it before use.
class ZmVec2f {
public:
    ZmVec2f() noexcept = default;
    constexpr ZmVec2f(float x, float y) noexcept : m_v{x, y} {}

    /// No index check: \p i must be 0 or 1.
    constexpr float& operator[](int i) noexcept { return m_v[i]; }
    constexpr const float& operator[](int i) const noexcept { return m_v[i]; }
    constexpr float& x() noexcept { return m_v[0]; }
    constexpr float& y() noexcept { return m_v[1]; }
    constexpr float x() const noexcept { return m_v[0]; }
    constexpr float y() const noexcept { return m_v[1]; }
    float* getValue() noexcept { return m_v; }
    const float* getValue() const noexcept { return m_v; }
    void setValue(float x, float y) noexcept
    {
        m_v[0] = x;
        m_v[1] = y;
    }

    constexpr float dot(const ZmVec2f& o) const noexcept { return m_v[0] * o.m_v[0] + m_v[1] * o.m_v[1]; }
    /// The length through `hypot`, so that no intermediate square overflows.
    float length() const noexcept { return std::hypot(m_v[0], m_v[1]); }
    constexpr float length2() const noexcept { return dot(*this); }
    bool isNumber() const noexcept { return !std::isnan(m_v[0]) && !std::isnan(m_v[1]); }

    ZmVec2f& operator+=(const ZmVec2f& o) noexcept
    {
        m_v[0] += o.m_v[0];
        m_v[1] += o.m_v[1];
        return *this;
    }
    ZmVec2f& operator-=(const ZmVec2f& o) noexcept
    {
        m_v[0] -= o.m_v[0];
        m_v[1] -= o.m_v[1];
        return *this;
    }
    ZmVec2f& operator*=(float s) noexcept
    {
        m_v[0] *= s;
        m_v[1] *= s;
        return *this;
    }

    friend constexpr ZmVec2f operator+(const ZmVec2f& a, const ZmVec2f& b) noexcept
    {
        return {a.m_v[0] + b.m_v[0], a.m_v[1] + b.m_v[1]};
    }
    friend constexpr ZmVec2f operator-(const ZmVec2f& a, const ZmVec2f& b) noexcept
    {
        return {a.m_v[0] - b.m_v[0], a.m_v[1] - b.m_v[1]};
    }
    friend constexpr ZmVec2f operator-(const ZmVec2f& a) noexcept { return {-a.m_v[0], -a.m_v[1]}; }
    friend constexpr ZmVec2f operator*(const ZmVec2f& a, float s) noexcept
    {
        return {a.m_v[0] * s, a.m_v[1] * s};
    }
    friend constexpr ZmVec2f operator*(float s, const ZmVec2f& a) noexcept
    {
        return {a.m_v[0] * s, a.m_v[1] * s};
    }
    friend constexpr ZmVec2f operator/(const ZmVec2f& a, float s) noexcept
    {
        return {a.m_v[0] / s, a.m_v[1] / s};
    }
    /// Exact comparison (NaN is unequal to everything).
    friend constexpr bool operator==(const ZmVec2f& a, const ZmVec2f& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1];
    }
    friend constexpr bool operator!=(const ZmVec2f& a, const ZmVec2f& b) noexcept { return !(a == b); }

private:
    float m_v[2];
};
