/// \file
/// A vector of three 64-bit integers.
#pragma once

#include <cstdint>

/// Three components x, y, z (64-bit signed integers, for indices into volumes beyond 2^31 voxels), a plain
/// value of 24 bytes. A default-constructed vector is uninitialised, like every small geometry value.
class ZmVec3l {
public:
    ZmVec3l() noexcept = default;
    constexpr ZmVec3l(int64_t x, int64_t y, int64_t z) noexcept : m_v{x, y, z} {}

    /// No index check: \p i must be 0 to 2.
    constexpr int64_t& operator[](int i) noexcept { return m_v[i]; }
    constexpr const int64_t& operator[](int i) const noexcept { return m_v[i]; }
    constexpr int64_t& x() noexcept { return m_v[0]; }
    constexpr int64_t& y() noexcept { return m_v[1]; }
    constexpr int64_t& z() noexcept { return m_v[2]; }
    constexpr int64_t x() const noexcept { return m_v[0]; }
    constexpr int64_t y() const noexcept { return m_v[1]; }
    constexpr int64_t z() const noexcept { return m_v[2]; }
    int64_t* getValue() noexcept { return m_v; }
    const int64_t* getValue() const noexcept { return m_v; }

    /// Exact comparison.
    friend constexpr bool operator==(const ZmVec3l& a, const ZmVec3l& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1] && a.m_v[2] == b.m_v[2];
    }
    friend constexpr bool operator!=(const ZmVec3l& a, const ZmVec3l& b) noexcept { return !(a == b); }

private:
    int64_t m_v[3];
};
