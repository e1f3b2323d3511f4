/// \file
/// An axis-aligned rectangle of floats.
#pragma once

#include <zmlib/ZmVec2f.h>

/// An axis-aligned rectangle stored as its minimum corner, then its maximum corner (two `ZmVec2f`,
/// 16 bytes). A rectangle whose minimum exceeds its maximum on some axis is empty. A
/// default-constructed rectangle is uninitialised, like every small geometry value.
class ZmBox2f {
public:
    ZmBox2f() noexcept = default;
    constexpr ZmBox2f(const ZmVec2f& min, const ZmVec2f& max) noexcept : m_min(min), m_max(max) {}
    constexpr ZmBox2f(float xmin, float ymin, float xmax, float ymax) noexcept
        : m_min(xmin, ymin), m_max(xmax, ymax)
    {}

    constexpr ZmVec2f& getMin() noexcept { return m_min; }
    constexpr ZmVec2f& getMax() noexcept { return m_max; }
    constexpr const ZmVec2f& getMin() const noexcept { return m_min; }
    constexpr const ZmVec2f& getMax() const noexcept { return m_max; }
    /// True when the minimum exceeds the maximum on either axis.
    constexpr bool isEmpty() const noexcept { return m_min.x() > m_max.x() || m_min.y() > m_max.y(); }

    friend constexpr bool operator==(const ZmBox2f& a, const ZmBox2f& b) noexcept
    {
        return a.m_min == b.m_min && a.m_max == b.m_max;
    }
    friend constexpr bool operator!=(const ZmBox2f& a, const ZmBox2f& b) noexcept { return !(a == b); }

private:
    ZmVec2f m_min;
    ZmVec2f m_max;
};
