#include <zmlib/ZmRotation.h>

#include "ZmGeometryKernels_p.h"
#include "ZmGeometryText_p.h"

#include <cmath>

namespace {

constexpr float kTwoPi = 6.2831855f;

} // namespace

ZmRotation& ZmRotation::setValue(const ZmVec3f& axis, float angle) noexcept
{
    // A zero axis stays zero and gives (0, 0, 0, cos(a/2)).
    const ZmVec3f n = axis.normalized();
    const float half = angle * 0.5f;
    const float s = std::sin(half);
    m_q[0] = n[0] * s;
    m_q[1] = n[1] * s;
    m_q[2] = n[2] * s;
    m_q[3] = std::cos(half);
    return *this;
}

ZmRotation& ZmRotation::setValue(const ZmVec3f& from, const ZmVec3f& to) noexcept
{
    const ZmVec3f f = from.normalized();
    const ZmVec3f t = to.normalized();
    const float c = f.dot(t);
    if (c >= 1.0f)
        return makeIdentity();
    const ZmVec3f cross = f.cross(t);
    // Exactly opposite directions can give a dot product one rounding step above -1; their cross
    // product is then exactly zero and the general case below would give a quaternion of length
    // near 0, so they take the half turn too.
    if (c <= -1.0f || (c < 0.0f && cross.length2() == 0.0f)) {
        // Opposite directions: a half turn about any axis perpendicular to from.
        ZmVec3f axis = f.cross(ZmVec3f(1, 0, 0));
        if (axis.length2() == 0.0f)
            axis = f.cross(ZmVec3f(0, 1, 0));
        const double inv = 1.0 / double(axis.length());
        m_q[0] = float(axis[0] * inv);
        m_q[1] = float(axis[1] * inv);
        m_q[2] = float(axis[2] * inv);
        m_q[3] = 0.0f;
        return *this;
    }
    const ZmVec3f axis = cross.normalized();
    const double cd = c;
    const double s = std::sqrt((1.0 - cd) * 0.5);
    m_q[0] = float(axis[0] * s);
    m_q[1] = float(axis[1] * s);
    m_q[2] = float(axis[2] * s);
    m_q[3] = float(std::sqrt((1.0 + cd) * 0.5));
    return *this;
}

ZmRotation& ZmRotation::setValue(const ZmVec3f& fromDir, const ZmVec3f& fromUp, const ZmVec3f& toDir,
                                 const ZmVec3f& toUp) noexcept
{
    const ZmRotation r1(fromDir, toDir);
    const ZmVec3f u = r1 * fromUp;
    float c = u.dot(toUp);
    c = c < -1.0f ? -1.0f : (c > 1.0f ? 1.0f : c);
    float phi = std::acos(c);
    // toDir . (u x toUp), written out: which way round toDir the up vector has to turn.
    const float turn = toDir[0] * (u[1] * toUp[2] - u[2] * toUp[1]) +
                       toDir[1] * (u[2] * toUp[0] - u[0] * toUp[2]) +
                       toDir[2] * (u[0] * toUp[1] - u[1] * toUp[0]);
    if (turn < 0.0f)
        phi = kTwoPi - phi;
    *this = r1;
    return *this *= ZmRotation(toDir, phi);
}

namespace {

// The quaternion of a rotation matrix, from the largest of the trace and the diagonal elements.
// \p root(a) gives sqrt(a + 1) * 0.5, where the two matrix sizes differ in precision and in what
// stands for the 1.
template <class Matrix, class Root>
void quaternionFromMatrix(const Matrix& m, Root root, float q[4]) noexcept
{
    const int i = m[0][0] > m[1][1] ? (m[0][0] > m[2][2] ? 0 : 2) : (m[1][1] > m[2][2] ? 1 : 2);
    const float tr = m[0][0] + m[1][1] + m[2][2];
    if (tr > m[i][i]) {
        q[3] = root(tr);
        const float k = 4.0f * q[3];
        q[0] = (m[1][2] - m[2][1]) / k;
        q[1] = (m[2][0] - m[0][2]) / k;
        q[2] = (m[0][1] - m[1][0]) / k;
    } else {
        const int j = (i + 1) % 3, k = (i + 2) % 3;
        q[i] = root(m[i][i] - m[j][j] - m[k][k]);
        const float f = 4.0f * q[i];
        q[j] = (m[i][j] + m[j][i]) / f;
        q[k] = (m[i][k] + m[k][i]) / f;
        q[3] = (m[j][k] - m[k][j]) / f;
    }
}

} // namespace

ZmRotation& ZmRotation::setValue(const ZmMat3f& m) noexcept
{
    // The square root in double.
    quaternionFromMatrix(
        m, [](float a) { return float(std::sqrt(double(a) + 1.0) * 0.5); }, m_q);
    return *this;
}

ZmRotation& ZmRotation::setValue(const ZmMat4f& m) noexcept
{
    // m[3][3] in place of the 1, the square root in float and the halving in double.
    const float m33 = m[3][3];
    quaternionFromMatrix(
        m, [m33](float a) { return float(double(std::sqrt(a + m33)) * 0.5); }, m_q);
    return *this;
}

void ZmRotation::getValue(ZmVec3f& axis, float& angle) const noexcept
{
    const float s = ZmVec3f(m_q[0], m_q[1], m_q[2]).length();
    if (double(s) > 1e-5) {
        const float inv = 1.0f / s;
        axis = ZmVec3f(m_q[0] * inv, m_q[1] * inv, m_q[2] * inv);
        angle = float(2.0 * double(std::acos(m_q[3])));
    } else {
        axis = ZmVec3f(0, 0, 1);
        angle = 0.0f;
    }
}

void ZmRotation::getValue(ZmMat3f& m) const noexcept
{
    ZmMat4f m4;
    getValue(m4);
    m.setValue(m4);
}

ZmRotation& ZmRotation::invert() noexcept
{
    const float inv = 1.0f / norm();
    m_q[0] = -m_q[0] * inv;
    m_q[1] = -m_q[1] * inv;
    m_q[2] = -m_q[2] * inv;
    m_q[3] = m_q[3] * inv;
    return *this;
}

ZmRotation& ZmRotation::scaleAngle(float f) noexcept
{
    ZmVec3f axis;
    float angle;
    getValue(axis, angle);
    return setValue(axis, angle * f);
}

bool ZmRotation::equals(const ZmRotation& b, float eps) const noexcept
{
    bool same = true, opposite = true;
    for (int i = 0; i < 4; ++i) {
        same = same && std::fabs(m_q[i] - b.m_q[i]) < eps;
        opposite = opposite && std::fabs(m_q[i] + b.m_q[i]) < eps;
    }
    return same || opposite;
}

ZmRotation ZmRotation::slerp(const ZmRotation& a, const ZmRotation& b, float t) noexcept
{
    double c = double(a.m_q[0]) * b.m_q[0] + double(a.m_q[1]) * b.m_q[1] + double(a.m_q[2]) * b.m_q[2] +
               double(a.m_q[3]) * b.m_q[3];
    double sb = 1.0;
    if (c < 0.0) {
        c = -c;
        sb = -1.0;
    }
    double wa, wb;
    if (1.0 - c > 1e-5) {
        const double theta = std::acos(c);
        const double s = std::sin(theta);
        wa = std::sin((1.0 - t) * theta) / s;
        wb = std::sin(t * theta) / s;
    } else {
        wa = 1.0 - t;
        wb = t;
    }
    wb *= sb;
    ZmRotation r;
    for (int i = 0; i < 4; ++i)
        r.m_q[i] = float(wa * a.m_q[i] + wb * b.m_q[i]);
    return r;
}

std::string ZmRotation::dump() const
{
    // The labels run one ahead of the storage order ("w" shows x), intended: readers of this text
    // rely on it.
    static const char* const keys[4] = {"w", "x", "y", "z"};
    std::string out;
    zmgeom::appendJsonObject(out, keys, m_q, 4);
    return out;
}

void ZmRotation::normalize() noexcept
{
    ZmGeometryKernels::normalized(m_q, m_q);
}

void ZmRotation::compose(const float* a, const float* b, float* out) noexcept
{
    ZmGeometryKernels::compose(a, b, out);
}
