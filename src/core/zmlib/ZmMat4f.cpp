#include <zmlib/ZmMat4f.h>

#include <zmlib/ZmRotation.h>

#include "ZmGeometryKernels_p.h"
#include "ZmGeometryText_p.h"

#include <cmath>

void ZmMat4f::makeNaN() noexcept
{
    const float nan = std::nanf("0");
    for (auto& row : m_m)
        for (float& v : row)
            v = nan;
}

bool ZmMat4f::isNumber() const noexcept
{
    for (const auto& row : m_m)
        for (float v : row)
            if (std::isnan(v))
                return false;
    return true;
}

bool ZmMat4f::equals(const ZmMat4f& b, float eps) const noexcept
{
    for (int i = 0; i < 4; ++i)
        for (int j = 0; j < 4; ++j)
            if (std::fabs(m_m[i][j] - b.m_m[i][j]) > eps)
                return false;
    return true;
}

ZmMat4f& ZmMat4f::operator=(const ZmRotation& r) noexcept
{
    r.getValue(*this);
    return *this;
}

void ZmMat4f::setRotate(const ZmRotation& r) noexcept
{
    r.getValue(*this);
}

void ZmMat4f::setTranslate(const ZmVec3f& t) noexcept
{
    *this = ZmMat4f(1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, t[0], t[1], t[2], 1);
}

void ZmMat4f::setScale(const ZmVec3f& s) noexcept
{
    *this = ZmMat4f(s[0], 0, 0, 0, 0, s[1], 0, 0, 0, 0, s[2], 0, 0, 0, 0, 1);
}

void ZmMat4f::setScale(float s) noexcept
{
    setScale(ZmVec3f(s));
}

void ZmMat4f::setShear(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c) noexcept
{
    *this = ZmMat4f(a[0], a[1], a[2], 0, b[0], b[1], b[2], 0, c[0], c[1], c[2], 0, 0, 0, 0, 1);
}

namespace {

bool isIdentityRotation(const ZmRotation& r)
{
    return r[0] == 0.0f && r[1] == 0.0f && r[2] == 0.0f && r[3] == 1.0f;
}

} // namespace

void ZmMat4f::setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s, const ZmRotation& so,
                           const ZmVec3f& c)
{
    // Each factor is put in front (M = X * M), so the last one applied here acts first on a point.
    const ZmVec3f zero(0.0f);
    ZmMat4f x;
    makeIdentity();
    if (t != zero) {
        x.setTranslate(t);
        multLeft(x);
    }
    if (c != zero) {
        x.setTranslate(c);
        multLeft(x);
    }
    if (!isIdentityRotation(r)) {
        x.setRotate(r);
        multLeft(x);
    }
    if (s != ZmVec3f(1.0f)) {
        const bool scaleOrientation = !isIdentityRotation(so);
        if (scaleOrientation) {
            x.setRotate(so);
            multLeft(x);
        }
        x.setScale(s);
        multLeft(x);
        if (scaleOrientation) {
            x.setRotate(so.inverse());
            multLeft(x);
        }
    }
    if (c != zero) {
        x.setTranslate(-c);
        multLeft(x);
    }
}

void ZmMat4f::setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s)
{
    setTransform(t, r, s, ZmRotation::identity(), ZmVec3f(0.0f));
}

void ZmMat4f::setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s, const ZmRotation& so)
{
    setTransform(t, r, s, so, ZmVec3f(0.0f));
}

void ZmMat4f::getTransform(ZmVec3f& t, ZmRotation& r, ZmVec3f& s, ZmRotation& so, const ZmVec3f& c) const
{
    ZmMat4f m(*this);
    if (c != ZmVec3f(0.0f)) {
        // setTransform put the centre around everything else: M = T(-c) * X * T(c); take X.
        ZmMat4f x;
        x.setTranslate(c);
        m.multLeft(x);
        x.setTranslate(-c);
        m.multRight(x);
    }
    ZmMat4f eigen, rest, proj;
    ZmVec3f scale, translation;
    if (!m.factor(eigen, scale, rest, translation, proj))
        return;
    s = scale;
    // factor() gives eigenvectors as columns; setTransform applies so^-1 first, whose matrix is
    // that eigenvector matrix, so so itself is its transpose.
    so.setValue(eigen.transpose());
    r.setValue(rest);
    t = translation;
}

void ZmMat4f::getTransform(ZmVec3f& t, ZmRotation& r, ZmVec3f& s, ZmRotation& so) const
{
    getTransform(t, r, s, so, ZmVec3f(0.0f));
}

bool ZmMat4f::factor(ZmMat4f& r, ZmVec3f& s, ZmMat4f& u, ZmVec3f& t, ZmMat4f& proj) const
{
    const double det = det3();
    const double sign = det < 0.0 ? -1.0 : 1.0;
    if (std::fabs(det) < 1e-12)
        return false;

    // A * A^T = E * diag(lambda) * E^T with the eigenvectors as the columns of E; then
    // A = (E * diag(s) * E^T) * U with s = sign * sqrt(lambda), and the sign makes U proper.
    const ZmMat3f a(*this);
    ZmMat3f aat(a);
    aat *= a.transpose();
    float evalues[3];
    ZmVec3f evectors[3];
    int nrot = 0;
    aat.jacobi(evalues, evectors, nrot);

    const ZmMat3f e(evectors[0], evectors[1], evectors[2]); // columns
    for (int k = 0; k < 3; ++k)
        s[k] = float(std::sqrt(evalues[k]) * sign);

    ZmMat3f rest(e);
    rest *= ZmMat3f(1.0f / s[0], 0, 0, 0, 1.0f / s[1], 0, 0, 0, 1.0f / s[2]);
    rest *= e.transpose();
    rest *= a;

    r = ZmMat4f(e);
    u = ZmMat4f(rest);
    t = ZmVec3f(m_m[3][0], m_m[3][1], m_m[3][2]);
    proj.makeIdentity();
    return true;
}

float ZmMat4f::det4() const noexcept
{
    return -m_m[0][3] * det3(1, 2, 3, 0, 1, 2) + m_m[1][3] * det3(0, 2, 3, 0, 1, 2) -
           m_m[2][3] * det3(0, 1, 3, 0, 1, 2) + m_m[3][3] * det3(0, 1, 2, 0, 1, 2);
}

ZmMat4f ZmMat4f::inverseByLU() const noexcept
{
    ZmMat4f lu(*this);
    int index[4];
    float d;
    if (!lu.LUDecomposition(index, d))
        return lu; // never taken: the 4x4 decomposition always succeeds
    ZmMat4f r;
    for (int k = 0; k < 4; ++k) {
        float b[4] = {0.0f, 0.0f, 0.0f, 0.0f};
        b[k] = 1.0f;
        lu.LUBackSubstitution(index, b);
        for (int i = 0; i < 4; ++i)
            r.m_m[i][k] = b[i];
    }
    return r;
}

int ZmMat4f::LUDecomposition(int index[4], float& d) noexcept
{
    auto& a = m_m;
    float scale[4];
    d = 1.0f;
    for (int i = 0; i < 4; ++i) {
        float big = 0.0f;
        for (int j = 0; j < 4; ++j)
            big = std::fmax(big, std::fabs(a[i][j]));
        if (big == 0.0f) {
            // An all-zero row is patched instead of reported, intended: the decomposition never
            // fails and inverse() of a singular matrix gives huge or non-finite entries.
            a[i][i] = 1e-6f;
            big = 1e-6f;
        }
        scale[i] = 1.0f / big;
    }
    for (int j = 0; j < 4; ++j) {
        for (int i = 0; i < j; ++i) {
            float sum = a[i][j];
            for (int k = 0; k < i; ++k)
                sum -= a[i][k] * a[k][j];
            a[i][j] = sum;
        }
        float big = 0.0f;
        int imax = j;
        for (int i = j; i < 4; ++i) {
            float sum = a[i][j];
            for (int k = 0; k < j; ++k)
                sum -= a[i][k] * a[k][j];
            a[i][j] = sum;
            const float dum = scale[i] * std::fabs(sum);
            if (dum >= big) { // ">=": among equal candidates the later row wins, intended
                big = dum;
                imax = i;
            }
        }
        if (j != imax) {
            for (int k = 0; k < 4; ++k) {
                const float t = a[imax][k];
                a[imax][k] = a[j][k];
                a[j][k] = t;
            }
            d = -d;
            scale[imax] = scale[j];
        }
        index[j] = imax;
        if (a[j][j] == 0.0f)
            a[j][j] = 1e-20f; // a zero pivot is replaced, intended (see above)
        if (j != 3) {
            const float dum = 1.0f / a[j][j];
            for (int i = j + 1; i < 4; ++i)
                a[i][j] *= dum;
        }
    }
    return 1;
}

void ZmMat4f::LUBackSubstitution(int index[4], float b[4]) const noexcept
{
    const auto& a = m_m;
    int first = -1; // first non-zero element of b, to skip the leading zeros
    for (int i = 0; i < 4; ++i) {
        const int ip = index[i];
        float sum = b[ip];
        b[ip] = b[i];
        if (first >= 0) {
            for (int j = first; j < i; ++j)
                sum -= a[i][j] * b[j];
        } else if (sum != 0.0f) {
            first = i;
        }
        b[i] = sum;
    }
    for (int i = 3; i >= 0; --i) {
        float sum = b[i];
        for (int j = i + 1; j < 4; ++j)
            sum -= a[i][j] * b[j];
        b[i] = sum / a[i][i];
    }
}

void ZmMat4f::jacobi3(float evalues[3], ZmVec3f evectors[3], int& nrot) const
{
    ZmMat3f(*this).jacobi(evalues, evectors, nrot);
}

void ZmMat4f::print(FILE* fp) const
{
    if (!fp)
        return;
    for (int i = 0; i < 4; ++i)
        for (int j = 0; j < 4; ++j)
            std::fprintf(fp, "%10.5g%c", double(m_m[i][j]), j < 2 ? '\t' : '\n');
}

std::string ZmMat4f::dump() const
{
    static const char* const keys[16] = {"m00", "m01", "m02", "m03", "m10", "m11", "m12", "m13",
                                         "m20", "m21", "m22", "m23", "m30", "m31", "m32", "m33"};
    std::string out;
    zmgeom::appendJsonObject(out, keys, &m_m[0][0], 16);
    return out;
}

int ZmMat4f::affineInverseKernel(const ZmMat4f& in, ZmMat4f& out) noexcept
{
    return ZmGeometryKernels::affineInverse(&in.m_m[0][0], &out.m_m[0][0]);
}
