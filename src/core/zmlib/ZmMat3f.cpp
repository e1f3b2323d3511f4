#include <zmlib/ZmMat3f.h>

#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMat4f.h>

#include "ZmGeometryText_p.h"

#include <cmath>

void ZmMat3f::setValue(const ZmMat4f& m) noexcept
{
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j)
            m_m[i][j] = m[i][j];
}

void ZmMat3f::makeNaN() noexcept
{
    const float nan = std::nanf("0");
    for (auto& row : m_m)
        for (float& v : row)
            v = nan;
}

bool ZmMat3f::isNumber() const noexcept
{
    for (const auto& row : m_m)
        for (float v : row)
            if (std::isnan(v))
                return false;
    return true;
}

ZmMat3f ZmMat3f::inverse(float det) const noexcept
{
    // The adjugate is the transposed cofactor matrix; subdet(j, i) is the signed cofactor of m[j][i].
    ZmMat3f r;
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j)
            r.m_m[i][j] = subdet(j, i) / det;
    return r;
}

ZmMat3f ZmMat3f::inverse() const noexcept
{
    const float d = det();
    // A singular matrix yields its adjugate, intended: callers that care test det() themselves.
    return inverse(d == 0.0f ? 1.0f : d);
}

ZmMat3f ZmMat3f::symmInverse(float det) const noexcept
{
    ZmMat3f r;
    for (int i = 0; i < 3; ++i)
        for (int j = i; j < 3; ++j)
            r.m_m[i][j] = r.m_m[j][i] = subdet(j, i) / det;
    return r;
}

int ZmMat3f::LUDecomposition(int index[3], float& d) noexcept
{
    index[0] = 0;
    index[1] = 1;
    index[2] = 2;
    d = 0.0f;

    // Column 0: a row exchange only for an exactly zero pivot.
    if (m_m[0][0] == 0.0f) {
        if (m_m[1][0] != 0.0f) {
            index[0] = 1;
            index[1] = 0;
        } else if (m_m[2][0] != 0.0f) {
            index[0] = 2;
            index[2] = 0;
        } else {
            return 0;
        }
        d = 1.0f;
    }
    float r0[3], r1[3], r2[3];
    for (int j = 0; j < 3; ++j) {
        r0[j] = m_m[index[0]][j];
        r1[j] = m_m[index[1]][j];
        r2[j] = m_m[index[2]][j];
    }
    const float p0 = r0[0];
    const float l1 = r1[0] / p0;
    const float l2 = r2[0] / p0;

    // Column 1: the pivot is tested before its elimination step, and the multipliers above stay
    // where they are when the two lower rows are exchanged; both rules are intended.
    if (r1[1] == 0.0f) {
        if (r2[1] == 0.0f)
            return 0;
        for (int j = 0; j < 3; ++j) {
            const float t = r1[j];
            r1[j] = r2[j];
            r2[j] = t;
        }
        const int t = index[1];
        index[1] = index[2];
        index[2] = t;
        d = (d == 0.0f) ? 1.0f : 0.0f; // parity as 0/1, not +-1, intended
    }

    const float u11 = r1[1] - r0[1] * l1;
    const float l21 = (r2[1] - r0[1] * l2) / u11;
    const float u12 = r1[2] - r0[2] * l1;
    const float u22 = r2[2] - r0[2] * l2 - u12 * l21;

    m_m[0][0] = p0;
    m_m[0][1] = r0[1];
    m_m[0][2] = r0[2];
    m_m[1][0] = l1;
    m_m[1][1] = u11;
    m_m[1][2] = u12;
    m_m[2][0] = l2;
    m_m[2][1] = l21;
    m_m[2][2] = u22;
    return 1;
}

namespace {

inline void jacobiRotate(float a[3][3], float s, float tau, int i, int j, int k, int l)
{
    const float g = a[i][j];
    const float h = a[k][l];
    a[i][j] = g - s * (h + g * tau);
    a[k][l] = h + s * (g - h * tau);
}

} // namespace

void ZmMat3f::jacobi(float evalues[3], ZmVec3f evectors[3], int& nrot) const
{
    // Cyclic Jacobi on a working copy; only its upper triangle is used. v collects the plane
    // rotations, its column k is eigenvector k.
    float a[3][3];
    getValue(a);
    float v[3][3] = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}};
    float b[3], z[3] = {0, 0, 0};
    for (int p = 0; p < 3; ++p)
        b[p] = evalues[p] = a[p][p];
    nrot = 0;

    auto output = [&]() {
        for (int k = 0; k < 3; ++k)
            evectors[k] = ZmVec3f(v[0][k], v[1][k], v[2][k]);
    };

    for (int sweep = 1; sweep <= 50; ++sweep) {
        const float sm = std::fabs(a[0][1]) + std::fabs(a[0][2]) + std::fabs(a[1][2]);
        if (sm == 0.0f) {
            output();
            return;
        }
        const float tresh = sweep < 4 ? 0.2f * sm / 9.0f : 0.0f;
        for (int p = 0; p < 2; ++p) {
            for (int q = p + 1; q < 3; ++q) {
                const float g = 100.0f * std::fabs(a[p][q]);
                if (sweep > 4 && std::fabs(evalues[p]) + g == std::fabs(evalues[p]) &&
                    std::fabs(evalues[q]) + g == std::fabs(evalues[q])) {
                    a[p][q] = 0.0f;
                } else if (std::fabs(a[p][q]) > tresh) {
                    float h = evalues[q] - evalues[p];
                    float t;
                    if (std::fabs(h) + g == std::fabs(h)) {
                        t = a[p][q] / h;
                    } else {
                        const float theta = 0.5f * h / a[p][q];
                        t = 1.0f / (std::fabs(theta) + std::sqrt(1.0f + theta * theta));
                        if (theta < 0.0f)
                            t = -t;
                    }
                    const float c = 1.0f / std::sqrt(1.0f + t * t);
                    const float s = t * c;
                    const float tau = s / (1.0f + c);
                    h = t * a[p][q];
                    z[p] -= h;
                    z[q] += h;
                    evalues[p] -= h;
                    evalues[q] += h;
                    a[p][q] = 0.0f;
                    for (int j = 0; j < p; ++j)
                        jacobiRotate(a, s, tau, j, p, j, q);
                    for (int j = p + 1; j < q; ++j)
                        jacobiRotate(a, s, tau, p, j, j, q);
                    for (int j = q + 1; j < 3; ++j)
                        jacobiRotate(a, s, tau, p, j, q, j);
                    for (int j = 0; j < 3; ++j)
                        jacobiRotate(v, s, tau, j, p, j, q);
                    ++nrot;
                }
            }
        }
        for (int p = 0; p < 3; ++p) {
            b[p] += z[p];
            evalues[p] = b[p];
            z[p] = 0.0f;
        }
    }
    getTheLogInstance().warnf("Too many iterations in routine jacobi\n");
    output();
}

void ZmMat3f::print(FILE* fp) const
{
    if (!fp)
        return;
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j)
            std::fprintf(fp, "%10.5g%c", double(m_m[i][j]), j < 2 ? '\t' : '\n');
}

std::string ZmMat3f::dump() const
{
    static const char* const keys[9] = {"m00", "m01", "m02", "m10", "m11", "m12", "m20", "m21", "m22"};
    std::string out;
    zmgeom::appendJsonObject(out, keys, &m_m[0][0], 9);
    return out;
}
