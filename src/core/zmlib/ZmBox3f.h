/// \file
/// An axis-aligned box of floats.
#pragma once

#include <zmlib/ZmVec3f.h>

/// An axis-aligned box of six floats in the order xmin, xmax, ymin, ymax, zmin, zmax (24 bytes;
/// the order is the one messages and fingerprints carry). A box whose minimum exceeds its maximum on
/// some axis is empty. A default-constructed box is uninitialised, like every small geometry value.
class ZmBox3f {
public:
    ZmBox3f() noexcept = default;
    constexpr ZmBox3f(float xmin, float xmax, float ymin, float ymax, float zmin, float zmax) noexcept
        : m_v{xmin, xmax, ymin, ymax, zmin, zmax}
    {}
    /// From the minimum and the maximum corner.
    constexpr ZmBox3f(const ZmVec3f& min, const ZmVec3f& max) noexcept
        : m_v{min[0], max[0], min[1], max[1], min[2], max[2]}
    {}

    /// No index check: \p i must be 0 to 5 (xmin, xmax, ymin, ymax, zmin, zmax).
    constexpr float& operator[](int i) noexcept { return m_v[i]; }
    constexpr const float& operator[](int i) const noexcept { return m_v[i]; }
    constexpr float& xmin() noexcept { return m_v[0]; }
    constexpr float& xmax() noexcept { return m_v[1]; }
    constexpr float& ymin() noexcept { return m_v[2]; }
    constexpr float& ymax() noexcept { return m_v[3]; }
    constexpr float& zmin() noexcept { return m_v[4]; }
    constexpr float& zmax() noexcept { return m_v[5]; }
    constexpr float xmin() const noexcept { return m_v[0]; }
    constexpr float xmax() const noexcept { return m_v[1]; }
    constexpr float ymin() const noexcept { return m_v[2]; }
    constexpr float ymax() const noexcept { return m_v[3]; }
    constexpr float zmin() const noexcept { return m_v[4]; }
    constexpr float zmax() const noexcept { return m_v[5]; }
    constexpr ZmVec3f getMin() const noexcept { return {m_v[0], m_v[2], m_v[4]}; }
    constexpr ZmVec3f getMax() const noexcept { return {m_v[1], m_v[3], m_v[5]}; }
    float* getValue() noexcept { return m_v; }
    const float* getValue() const noexcept { return m_v; }
    /// True when the minimum exceeds the maximum on some axis.
    constexpr bool isEmpty() const noexcept { return m_v[0] > m_v[1] || m_v[2] > m_v[3] || m_v[4] > m_v[5]; }

    friend constexpr bool operator==(const ZmBox3f& a, const ZmBox3f& b) noexcept
    {
        for (int i = 0; i < 6; ++i) {
            if (a.m_v[i] != b.m_v[i])
                return false;
        }
        return true;
    }
    friend constexpr bool operator!=(const ZmBox3f& a, const ZmBox3f& b) noexcept { return !(a == b); }

private:
    float m_v[6];
};
