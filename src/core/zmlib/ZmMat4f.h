/// \file
/// The library's 4x4 single-precision transform matrix.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmVec3f.h>
#include <zmlib/ZmVec4f.h>

#include <cmath>
#include <cstdio>
#include <string>

class ZmRotation;

/// A 4x4 matrix of floats stored row by row (`m[row][column]`, 64 bytes): the affine and
/// projective transforms of points and directions. Points are ROW vectors multiplied on the left,
/// `p' = p * M`, so the translation is row 3 and column 3 of an affine transform is (0, 0, 0, 1);
/// `A.multRight(B)` (and `A *= B`) gives `A * B`, which applies A first and B second.
///
/// A plain value: no heap storage, copyable with a byte copy. The default constructor leaves the
/// elements uninitialised on purpose; NaN marks a matrix as "unset" (`makeNaN`, `isNumber`).
/// Nothing throws and nothing reports an error except `affine_inverse` (0) and `factor`
/// (false); `inverse()` of a singular matrix yields large or non-finite entries, intended (test
/// `det4()` first where that matters). Concurrent reads of one matrix are safe.
class ZMLIB_API ZmMat4f {
public:
    ZmMat4f() noexcept {}
    /// Row by row.
    ZmMat4f(float a00, float a01, float a02, float a03, float a10, float a11, float a12, float a13, float a20,
            float a21, float a22, float a23, float a30, float a31, float a32, float a33) noexcept
        : m_m{{a00, a01, a02, a03}, {a10, a11, a12, a13}, {a20, a21, a22, a23}, {a30, a31, a32, a33}}
    {}
    explicit ZmMat4f(const float m[4][4]) noexcept { setValue(m); }
    /// Upper-left block from \p m, row 3 and column 3 from the identity.
    explicit ZmMat4f(const ZmMat3f& m) noexcept
        : ZmMat4f(m[0][0], m[0][1], m[0][2], 0, m[1][0], m[1][1], m[1][2], 0, m[2][0], m[2][1], m[2][2], 0, 0,
                  0, 0, 1)
    {}

    void setValue(float a00, float a01, float a02, float a03, float a10, float a11, float a12, float a13,
                  float a20, float a21, float a22, float a23, float a30, float a31, float a32,
                  float a33) noexcept
    {
        *this = ZmMat4f(a00, a01, a02, a03, a10, a11, a12, a13, a20, a21, a22, a23, a30, a31, a32, a33);
    }
    void setValue(const float m[4][4]) noexcept
    {
        for (int i = 0; i < 4; ++i)
            for (int j = 0; j < 4; ++j)
                m_m[i][j] = m[i][j];
    }
    /// ROWS 0..2 are \p a, \p b, \p c, row 3 is the translation \p d; column 3 is (0, 0, 0, 1).
    void setValue(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c, const ZmVec3f& d) noexcept
    {
        *this = ZmMat4f(a[0], a[1], a[2], 0, b[0], b[1], b[2], 0, c[0], c[1], c[2], 0, d[0], d[1], d[2], 1);
    }
    void getValue(float m[4][4]) const noexcept
    {
        for (int i = 0; i < 4; ++i)
            for (int j = 0; j < 4; ++j)
                m[i][j] = m_m[i][j];
    }

    /// Row \p i, so that `m[i][j]` is row i, column j. No index check.
    float* operator[](int i) noexcept { return m_m[i]; }
    const float* operator[](int i) const noexcept { return m_m[i]; }

    static ZmMat4f identity() noexcept { return ZmMat4f(1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1); }
    void makeIdentity() noexcept { *this = identity(); }
    void makeNaN() noexcept;
    /// False when any element is NaN.
    bool isNumber() const noexcept;
    /// Exact comparison of all sixteen elements with 0 and 1.
    bool isIdentity() const noexcept
    {
        for (int i = 0; i < 4; ++i)
            for (int j = 0; j < 4; ++j)
                if (m_m[i][j] != (i == j ? 1.0f : 0.0f))
                    return false;
        return true;
    }
    /// False as soon as some `|a[i][j] - b[i][j]| > eps`, so a difference of exactly \p eps passes.
    bool equals(const ZmMat4f& b, float eps) const noexcept;

    /// `this = this * m`.
    ZmMat4f& operator*=(const ZmMat4f& m) noexcept { return multRight(m); }
    /// `this = this * m`: with row vectors, this transform first, then \p m.
    ZmMat4f& multRight(const ZmMat4f& m) noexcept
    {
        product(*this, m, *this);
        return *this;
    }
    /// `this = m * this`: \p m first, then this transform.
    ZmMat4f& multLeft(const ZmMat4f& m) noexcept
    {
        product(m, *this, *this);
        return *this;
    }

    /// The rotation's matrix (see `ZmRotation::getValue(ZmMat4f&)`).
    ZmMat4f& operator=(const ZmRotation& r) noexcept;
    void setRotate(const ZmRotation& r) noexcept;
    /// Identity with row 3 = (t, 1).
    void setTranslate(const ZmVec3f& t) noexcept;
    /// Diagonal (s.x, s.y, s.z, 1), all else 0.
    void setScale(const ZmVec3f& s) noexcept;
    void setScale(float s) noexcept;
    /// Rows 0..2 are \p a, \p b, \p c with column 3 = 0; row 3 is (0, 0, 0, 1).
    void setShear(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c) noexcept;

    /// The composite transform that takes a point p through: p - c, rotation by `so` inverse,
    /// scaling by \p s, rotation by \p so, rotation by \p r, + c, + t. Steps whose parameter is
    /// exactly neutral (t or c zero, r or so the identity, s = (1, 1, 1)) are skipped.
    void setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s, const ZmRotation& so,
                      const ZmVec3f& c);
    /// `so` = identity, `c` = 0.
    void setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s);
    /// `c` = 0.
    void setTransform(const ZmVec3f& t, const ZmRotation& r, const ZmVec3f& s, const ZmRotation& so);
    /// Decomposes the matrix into the parameters of `setTransform` (with the given centre \p c),
    /// through `factor`: \p s are the factor's scales, \p so the rotation whose matrix is the
    /// transposed eigenvector matrix (rows = eigenvectors), \p r the remaining rotation and \p t
    /// the translation, so that `setTransform(t, r, s, so, c)` rebuilds a matrix without
    /// projection. A matrix with a negative determinant gets negative scales. Singular matrices
    /// leave the outputs unchanged.
    void getTransform(ZmVec3f& t, ZmRotation& r, ZmVec3f& s, ZmRotation& so, const ZmVec3f& c) const;
    /// `c` = 0.
    void getTransform(ZmVec3f& t, ZmRotation& r, ZmVec3f& s, ZmRotation& so) const;
    /// Polar factorisation of the upper 3x3 block A, in row-vector order
    /// `A = r * diag(s) * transpose(r) * u`: \p r is the eigenvector matrix of `A * transpose(A)`
    /// with eigenvector k (of `jacobi3`) as COLUMN k, \p s the square roots of its eigenvalues
    /// times the sign of det(A), \p u the remaining proper rotation; \p t is row 3 and \p proj the
    /// identity. Returns false, leaving the outputs unchanged, when |det(A)| < 1e-12.
    bool factor(ZmMat4f& r, ZmVec3f& s, ZmMat4f& u, ZmVec3f& t, ZmMat4f& proj) const;

    /// A point as row vector with homogeneous division:
    /// `out[j] = (sum_i v[i] * m[i][j] + m[3][j]) * (1 / w)`, `w = sum_i v[i] * m[i][3] + m[3][3]`.
    /// \p out may be \p v.
    void multVecMatrix(const ZmVec3f& v, ZmVec3f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2];
        const float w = x * m_m[0][3] + y * m_m[1][3] + z * m_m[2][3] + m_m[3][3];
        const float r0 = x * m_m[0][0] + y * m_m[1][0] + z * m_m[2][0] + m_m[3][0];
        const float r1 = x * m_m[0][1] + y * m_m[1][1] + z * m_m[2][1] + m_m[3][1];
        const float r2 = x * m_m[0][2] + y * m_m[1][2] + z * m_m[2][2] + m_m[3][2];
        const float inv = 1.0f / w;
        out[0] = r0 * inv;
        out[1] = r1 * inv;
        out[2] = r2 * inv;
    }
    ZmVec3f multVecMatrix(const ZmVec3f& v) const noexcept
    {
        ZmVec3f r;
        multVecMatrix(v, r);
        return r;
    }
    /// A point as column vector with homogeneous division:
    /// `out[i] = (sum_j m[i][j] * v[j] + m[i][3]) * (1 / w)`, `w = sum_j m[3][j] * v[j] + m[3][3]`.
    /// \p out may be \p v.
    void multMatrixVec(const ZmVec3f& v, ZmVec3f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2];
        const float w = m_m[3][0] * x + m_m[3][1] * y + m_m[3][2] * z + m_m[3][3];
        const float r0 = m_m[0][0] * x + m_m[0][1] * y + m_m[0][2] * z + m_m[0][3];
        const float r1 = m_m[1][0] * x + m_m[1][1] * y + m_m[1][2] * z + m_m[1][3];
        const float r2 = m_m[2][0] * x + m_m[2][1] * y + m_m[2][2] * z + m_m[2][3];
        const float inv = 1.0f / w;
        out[0] = r0 * inv;
        out[1] = r1 * inv;
        out[2] = r2 * inv;
    }
    ZmVec3f multMatrixVec(const ZmVec3f& v) const noexcept
    {
        ZmVec3f r;
        multMatrixVec(v, r);
        return r;
    }
    /// Full row-vector product `v * M`, no division. \p out may be \p v.
    void multVecMatrix(const ZmVec4f& v, ZmVec4f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2], w = v[3];
        for (int j = 0; j < 4; ++j)
            out[j] = x * m_m[0][j] + y * m_m[1][j] + z * m_m[2][j] + w * m_m[3][j];
    }
    /// Full column-vector product `M * v`, no division. \p out may be \p v.
    void multMatrixVec(const ZmVec4f& v, ZmVec4f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2], w = v[3];
        for (int i = 0; i < 4; ++i)
            out[i] = m_m[i][0] * x + m_m[i][1] * y + m_m[i][2] * z + m_m[i][3] * w;
    }
    /// A direction as row vector through the upper 3x3 only: `out[j] = sum_i d[i] * m[i][j]`.
    /// \p out may be \p d.
    void multDirMatrix(const ZmVec3f& d, ZmVec3f& out) const noexcept
    {
        const float x = d[0], y = d[1], z = d[2];
        out[0] = x * m_m[0][0] + y * m_m[1][0] + z * m_m[2][0];
        out[1] = x * m_m[0][1] + y * m_m[1][1] + z * m_m[2][1];
        out[2] = x * m_m[0][2] + y * m_m[1][2] + z * m_m[2][2];
    }
    ZmVec3f multDirMatrix(const ZmVec3f& d) const noexcept
    {
        ZmVec3f r;
        multDirMatrix(d, r);
        return r;
    }

    /// Determinant of the upper 3x3 block.
    float det3() const noexcept { return det3(0, 1, 2, 0, 1, 2); }
    /// Determinant of the 3x3 matrix made of rows r1, r2, r3 and columns c1, c2, c3.
    float det3(int r1, int r2, int r3, int c1, int c2, int c3) const noexcept
    {
        return m_m[r1][c1] * (m_m[r2][c2] * m_m[r3][c3] - m_m[r2][c3] * m_m[r3][c2]) -
               m_m[r1][c2] * (m_m[r2][c1] * m_m[r3][c3] - m_m[r2][c3] * m_m[r3][c1]) +
               m_m[r1][c3] * (m_m[r2][c1] * m_m[r3][c2] - m_m[r2][c2] * m_m[r3][c1]);
    }
    /// Determinant of the whole matrix (expanded along column 3).
    float det4() const noexcept;

    /// The inverse: the identity for the identity, else `affine_inverse` when it succeeds, else
    /// an LU solve for the four unit vectors (a singular matrix yields the result of the 1e-6
    /// and 1e-20 substitutions of `LUDecomposition`, intended: no error is reported).
    ZmMat4f inverse() const noexcept
    {
        if (isIdentity())
            return identity();
        ZmMat4f r;
        if (affine_inverse(*this, r))
            return r;
        return inverseByLU();
    }
    /// Inverse of an affine matrix (column 3 exactly (0, 0, 0, 1)); returns 1, or 0 without
    /// touching \p out when \p in is not affine or its upper 3x3 is singular to working
    /// precision: the six products of its determinant (each formed in float) are summed in double,
    /// positive and negative ones apart, and `|det / (pos - neg)| < 1e-15` counts as singular.
    /// The adjugate's products are formed in float, their differences and the scaling by 1/det
    /// in double; the translation row is `-(t * upper inverse)` in float.
    static int affine_inverse(const ZmMat4f& in, ZmMat4f& out) noexcept
    {
        if (in.m_m[0][3] != 0.0f || in.m_m[1][3] != 0.0f || in.m_m[2][3] != 0.0f || in.m_m[3][3] != 1.0f)
            return 0;
        return affineInverseKernel(in, out);
    }
    /// LU decomposition in place with partial pivoting and implicit row scaling. Never fails and
    /// always returns 1, intended: an all-zero row gets 1e-6 on its diagonal and a zero pivot
    /// becomes 1e-20. Among equally good pivot rows the later one wins. \p d is +-1 by the parity
    /// of the row exchanges, `index[k]` the pivot row of column k.
    int LUDecomposition(int index[4], float& d) noexcept;
    /// Solves `A x = b` in place (column vectors) after `LUDecomposition` of A.
    void LUBackSubstitution(int index[4], float b[4]) const noexcept;
    /// `ZmMat3f::jacobi` of the upper 3x3 block (same eigenvector layout).
    void jacobi3(float evalues[3], ZmVec3f evectors[3], int& nrot) const;

    ZmMat4f transpose() const noexcept
    {
        return ZmMat4f(m_m[0][0], m_m[1][0], m_m[2][0], m_m[3][0], m_m[0][1], m_m[1][1], m_m[2][1], m_m[3][1],
                       m_m[0][2], m_m[1][2], m_m[2][2], m_m[3][2], m_m[0][3], m_m[1][3], m_m[2][3],
                       m_m[3][3]);
    }

    /// Each element "%10.5g", followed by a tab when its column is below 2 and a newline
    /// otherwise, so every row ends in two newlines (after its third and its fourth element);
    /// intended, other tools read this layout. Nothing when \p fp is null.
    void print(FILE* fp) const;
    /// `{"m00":"…",…,"m33":"…"}`, row by row, each number in fixed notation with six decimals
    /// whatever the locale.
    std::string dump() const;

private:
    /// The general inverse, through LUDecomposition and LUBackSubstitution.
    ZmMat4f inverseByLU() const noexcept;

    /// The affine inverse proper (ZmMat4f.cpp): SIMD where the target has it, the same bits
    /// without.
    static int affineInverseKernel(const ZmMat4f& in, ZmMat4f& out) noexcept;
    /// out = a * b, each element summed k = 0..3 starting from 0.0f. \p out may be \p a or \p b.
    static void product(const ZmMat4f& a, const ZmMat4f& b, ZmMat4f& out) noexcept
    {
        ZmMat4f r;
        for (int i = 0; i < 4; ++i) {
            const float a0 = a.m_m[i][0], a1 = a.m_m[i][1], a2 = a.m_m[i][2], a3 = a.m_m[i][3];
            for (int j = 0; j < 4; ++j)
                r.m_m[i][j] =
                    0.0f + a0 * b.m_m[0][j] + a1 * b.m_m[1][j] + a2 * b.m_m[2][j] + a3 * b.m_m[3][j];
        }
        out = r;
    }

    float m_m[4][4];
};
