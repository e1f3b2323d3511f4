/// \file
/// A vector of four floats.
#pragma once

/// Four single-precision components x, y, z, w, a plain value (16 bytes): a homogeneous point, a
/// plane as (normal, -distance), a colour. A default-constructed vector is uninitialised, like every
/// small geometry value.
class ZmVec4f {
public:
    ZmVec4f() noexcept = default;
    constexpr ZmVec4f(float x, float y, float z, float w) noexcept : m_v{x, y, z, w} {}

    /// No index check: \p i must be 0 to 3.
    constexpr float& operator[](int i) noexcept { return m_v[i]; }
    constexpr const float& operator[](int i) const noexcept { return m_v[i]; }
    constexpr float& x() noexcept { return m_v[0]; }
    constexpr float& y() noexcept { return m_v[1]; }
    constexpr float& z() noexcept { return m_v[2]; }
    constexpr float& w() noexcept { return m_v[3]; }
    constexpr float x() const noexcept { return m_v[0]; }
    constexpr float y() const noexcept { return m_v[1]; }
    constexpr float z() const noexcept { return m_v[2]; }
    constexpr float w() const noexcept { return m_v[3]; }
    float* getValue() noexcept { return m_v; }
    const float* getValue() const noexcept { return m_v; }

    /// Exact comparison (NaN is unequal to everything).
    friend constexpr bool operator==(const ZmVec4f& a, const ZmVec4f& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1] && a.m_v[2] == b.m_v[2] && a.m_v[3] == b.m_v[3];
    }
    friend constexpr bool operator!=(const ZmVec4f& a, const ZmVec4f& b) noexcept { return !(a == b); }

private:
    float m_v[4];
};
