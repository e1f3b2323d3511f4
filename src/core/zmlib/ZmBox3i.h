/// \file
/// An axis-aligned box of 32-bit integers (voxel index ranges).
#pragma once

#include <zmlib/ZmVec3i.h>

#include <cstdint>

/// An axis-aligned box of six 32-bit integers in the order xmin, xmax, ymin, ymax, zmin, zmax (24 bytes;
/// the order is the one messages and fingerprints carry). A box whose minimum exceeds its maximum on
/// some axis is empty. A default-constructed box is uninitialised, like every small geometry value.
class ZmBox3i {
public:
    ZmBox3i() noexcept = default;
    constexpr ZmBox3i(int32_t xmin, int32_t xmax, int32_t ymin, int32_t ymax, int32_t zmin,
                      int32_t zmax) noexcept
        : m_v{xmin, xmax, ymin, ymax, zmin, zmax}
    {}
    /// From the minimum and the maximum corner.
    constexpr ZmBox3i(const ZmVec3i& min, const ZmVec3i& max) noexcept
        : m_v{min[0], max[0], min[1], max[1], min[2], max[2]}
    {}

    /// No index check: \p i must be 0 to 5 (xmin, xmax, ymin, ymax, zmin, zmax).
    constexpr int32_t& operator[](int i) noexcept { return m_v[i]; }
    constexpr const int32_t& operator[](int i) const noexcept { return m_v[i]; }
    constexpr int32_t& xmin() noexcept { return m_v[0]; }
    constexpr int32_t& xmax() noexcept { return m_v[1]; }
    constexpr int32_t& ymin() noexcept { return m_v[2]; }
    constexpr int32_t& ymax() noexcept { return m_v[3]; }
    constexpr int32_t& zmin() noexcept { return m_v[4]; }
    constexpr int32_t& zmax() noexcept { return m_v[5]; }
    constexpr int32_t xmin() const noexcept { return m_v[0]; }
    constexpr int32_t xmax() const noexcept { return m_v[1]; }
    constexpr int32_t ymin() const noexcept { return m_v[2]; }
    constexpr int32_t ymax() const noexcept { return m_v[3]; }
    constexpr int32_t zmin() const noexcept { return m_v[4]; }
    constexpr int32_t zmax() const noexcept { return m_v[5]; }
    constexpr ZmVec3i getMin() const noexcept { return {m_v[0], m_v[2], m_v[4]}; }
    constexpr ZmVec3i getMax() const noexcept { return {m_v[1], m_v[3], m_v[5]}; }
    int32_t* getValue() noexcept { return m_v; }
    const int32_t* getValue() const noexcept { return m_v; }
    /// True when the minimum exceeds the maximum on some axis.
    constexpr bool isEmpty() const noexcept { return m_v[0] > m_v[1] || m_v[2] > m_v[3] || m_v[4] > m_v[5]; }

    friend constexpr bool operator==(const ZmBox3i& a, const ZmBox3i& b) noexcept
    {
        for (int i = 0; i < 6; ++i) {
            if (a.m_v[i] != b.m_v[i])
                return false;
        }
        return true;
    }
    friend constexpr bool operator!=(const ZmBox3i& a, const ZmBox3i& b) noexcept { return !(a == b); }

private:
    int32_t m_v[6];
};
