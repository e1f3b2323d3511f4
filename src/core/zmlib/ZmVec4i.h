/// \file
/// A vector of four 32-bit integers.
#pragma once

#include <cstdint>

/// Four 32-bit integers, a plain value: a default-constructed vector is uninitialised, like the
/// other small geometry values. 16 bytes, components in order.
class ZmVec4i {
public:
    ZmVec4i() noexcept = default;
    constexpr ZmVec4i(int32_t x, int32_t y, int32_t z, int32_t w) noexcept : m_v{x, y, z, w} {}

    /// No index check: \p i must be 0 to 3.
    constexpr int32_t& operator[](int i) noexcept { return m_v[i]; }
    constexpr const int32_t& operator[](int i) const noexcept { return m_v[i]; }
    constexpr int32_t& x() noexcept { return m_v[0]; }
    constexpr int32_t& y() noexcept { return m_v[1]; }
    constexpr int32_t& z() noexcept { return m_v[2]; }
    constexpr int32_t& w() noexcept { return m_v[3]; }
    constexpr int32_t x() const noexcept { return m_v[0]; }
    constexpr int32_t y() const noexcept { return m_v[1]; }
    constexpr int32_t z() const noexcept { return m_v[2]; }
    constexpr int32_t w() const noexcept { return m_v[3]; }
    constexpr bool operator==(const ZmVec4i& o) const noexcept
    {
        return m_v[0] == o.m_v[0] && m_v[1] == o.m_v[1] && m_v[2] == o.m_v[2] && m_v[3] == o.m_v[3];
    }
    constexpr bool operator!=(const ZmVec4i& o) const noexcept { return !(*this == o); }

private:
    int32_t m_v[4];
};
