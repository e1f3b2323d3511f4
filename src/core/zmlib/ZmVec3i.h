/// \file
/// A vector of three 32-bit integers.
#pragma once

#include <cstdint>

/// Three components x, y, z (32-bit signed integers, used for voxel indices and dimensions), a plain value of
/// 12 bytes. A default-constructed vector is uninitialised, like every small geometry value.
class ZmVec3i {
public:
    ZmVec3i() noexcept = default;
    constexpr ZmVec3i(int32_t x, int32_t y, int32_t z) noexcept : m_v{x, y, z} {}

    /// No index check: \p i must be 0 to 2.
    constexpr int32_t& operator[](int i) noexcept { return m_v[i]; }
    constexpr const int32_t& operator[](int i) const noexcept { return m_v[i]; }
    constexpr int32_t& x() noexcept { return m_v[0]; }
    constexpr int32_t& y() noexcept { return m_v[1]; }
    constexpr int32_t& z() noexcept { return m_v[2]; }
    constexpr int32_t x() const noexcept { return m_v[0]; }
    constexpr int32_t y() const noexcept { return m_v[1]; }
    constexpr int32_t z() const noexcept { return m_v[2]; }
    int32_t* getValue() noexcept { return m_v; }
    const int32_t* getValue() const noexcept { return m_v; }

    /// Exact comparison.
    friend constexpr bool operator==(const ZmVec3i& a, const ZmVec3i& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1] && a.m_v[2] == b.m_v[2];
    }
    friend constexpr bool operator!=(const ZmVec3i& a, const ZmVec3i& b) noexcept { return !(a == b); }

private:
    int32_t m_v[3];
};
