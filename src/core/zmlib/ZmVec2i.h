/// \file
/// A vector of two 32-bit integers.
#pragma once

#include <cstdint>

/// Two 32-bit signed components x, y, a plain value (8 bytes). A default-constructed vector is
/// uninitialised, like every small geometry value.
class ZmVec2i {
public:
    ZmVec2i() noexcept = default;
    constexpr ZmVec2i(int32_t x, int32_t y) noexcept : m_v{x, y} {}

    /// No index check: \p i must be 0 or 1.
    constexpr int32_t& operator[](int i) noexcept { return m_v[i]; }
    constexpr const int32_t& operator[](int i) const noexcept { return m_v[i]; }
    constexpr int32_t& x() noexcept { return m_v[0]; }
    constexpr int32_t& y() noexcept { return m_v[1]; }
    constexpr int32_t x() const noexcept { return m_v[0]; }
    constexpr int32_t y() const noexcept { return m_v[1]; }

    friend constexpr bool operator==(const ZmVec2i& a, const ZmVec2i& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1];
    }
    friend constexpr bool operator!=(const ZmVec2i& a, const ZmVec2i& b) noexcept { return !(a == b); }

private:
    int32_t m_v[2];
};
