/// \file
/// A vector of three doubles.
#pragma once

/// Three components x, y, z (double precision), a plain value of 24 bytes. A default-constructed vector is
/// uninitialised, like every small geometry value.
class ZmVec3d {
public:
    ZmVec3d() noexcept = default;
    constexpr ZmVec3d(double x, double y, double z) noexcept : m_v{x, y, z} {}

    /// No index check: \p i must be 0 to 2.
    constexpr double& operator[](int i) noexcept { return m_v[i]; }
    constexpr const double& operator[](int i) const noexcept { return m_v[i]; }
    constexpr double& x() noexcept { return m_v[0]; }
    constexpr double& y() noexcept { return m_v[1]; }
    constexpr double& z() noexcept { return m_v[2]; }
    constexpr double x() const noexcept { return m_v[0]; }
    constexpr double y() const noexcept { return m_v[1]; }
    constexpr double z() const noexcept { return m_v[2]; }
    double* getValue() noexcept { return m_v; }
    const double* getValue() const noexcept { return m_v; }

    /// Exact comparison (NaN is unequal to everything).
    friend constexpr bool operator==(const ZmVec3d& a, const ZmVec3d& b) noexcept
    {
        return a.m_v[0] == b.m_v[0] && a.m_v[1] == b.m_v[1] && a.m_v[2] == b.m_v[2];
    }
    friend constexpr bool operator!=(const ZmVec3d& a, const ZmVec3d& b) noexcept { return !(a == b); }

private:
    double m_v[3];
};
