/// \file
/// The library's 3x3 single-precision matrix.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec3f.h>

#include <array>
#include <cstdio>
#include <string>

class ZmMat4f;

/// A 3x3 matrix of floats stored row by row (`m[row][column]`, 36 bytes): linear maps, inertia
/// and covariance matrices, the rotation part of a 4x4 transform. Points are row vectors
/// (`multVecMatrix` computes `v * M`); `multMatrixVec` is the column-vector product.
///
/// A plain value: no heap storage, copyable with a byte copy. The default constructor leaves the
/// elements uninitialised on purpose; NaN marks a matrix as "unset" (`makeNaN`, `isNumber`).
/// Nothing throws; singular input follows fixed rules (`inverse()` divides by 1, `LUDecomposition`
/// returns 0) and NaN propagates. Concurrent reads of one matrix are safe.
class ZMLIB_API ZmMat3f {
public:
    ZmMat3f() noexcept {}
    /// Row by row.
    ZmMat3f(float a00, float a01, float a02, float a10, float a11, float a12, float a20, float a21,
            float a22) noexcept
        : m_m{{a00, a01, a02}, {a10, a11, a12}, {a20, a21, a22}}
    {}
    /// The three vectors become the COLUMNS (unlike the array constructor; the asymmetry is
    /// intended and callers rely on it).
    ZmMat3f(const ZmVec3f& a, const ZmVec3f& b, const ZmVec3f& c) noexcept
        : m_m{{a[0], b[0], c[0]}, {a[1], b[1], c[1]}, {a[2], b[2], c[2]}}
    {}
    /// The three vectors become the ROWS (a straight copy of the nine floats).
    explicit ZmMat3f(const std::array<ZmVec3f, 3>& rows) noexcept { setValue(rows); }
    explicit ZmMat3f(const float m[3][3]) noexcept { setValue(m); }
    /// The upper-left 3x3 block.
    explicit ZmMat3f(const ZmMat4f& m) noexcept { setValue(m); }

    void setValue(float a00, float a01, float a02, float a10, float a11, float a12, float a20, float a21,
                  float a22) noexcept
    {
        *this = ZmMat3f(a00, a01, a02, a10, a11, a12, a20, a21, a22);
    }
    /// The three vectors become the rows.
    void setValue(const std::array<ZmVec3f, 3>& rows) noexcept
    {
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                m_m[i][j] = rows[i][j];
    }
    void setValue(const float m[3][3]) noexcept
    {
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                m_m[i][j] = m[i][j];
    }
    /// The upper-left 3x3 block.
    void setValue(const ZmMat4f& m) noexcept;
    void getValue(float m[3][3]) const noexcept
    {
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                m[i][j] = m_m[i][j];
    }

    /// Row \p i, so that `m[i][j]` is row i, column j. No index check.
    float* operator[](int i) noexcept { return m_m[i]; }
    const float* operator[](int i) const noexcept { return m_m[i]; }

    static ZmMat3f identity() noexcept { return ZmMat3f(1, 0, 0, 0, 1, 0, 0, 0, 1); }
    void makeIdentity() noexcept { *this = identity(); }
    void makeNaN() noexcept;
    /// False when any element is NaN.
    bool isNumber() const noexcept;

    /// `this = this * m`.
    ZmMat3f& operator*=(const ZmMat3f& m) noexcept { return multRight(m); }
    /// `this = this * m`: with row vectors, this map first, then \p m.
    ZmMat3f& multRight(const ZmMat3f& m) noexcept
    {
        product(*this, m, *this);
        return *this;
    }
    /// `this = m * this`.
    ZmMat3f& multLeft(const ZmMat3f& m) noexcept
    {
        product(m, *this, *this);
        return *this;
    }

    /// Row vector: `out[j] = sum_i v[i] * m[i][j]`. \p out may be \p v.
    void multVecMatrix(const ZmVec3f& v, ZmVec3f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2];
        out[0] = x * m_m[0][0] + y * m_m[1][0] + z * m_m[2][0];
        out[1] = x * m_m[0][1] + y * m_m[1][1] + z * m_m[2][1];
        out[2] = x * m_m[0][2] + y * m_m[1][2] + z * m_m[2][2];
    }
    ZmVec3f multVecMatrix(const ZmVec3f& v) const noexcept
    {
        ZmVec3f r;
        multVecMatrix(v, r);
        return r;
    }
    /// Column vector: `out[i] = sum_j m[i][j] * v[j]`. \p out may be \p v.
    void multMatrixVec(const ZmVec3f& v, ZmVec3f& out) const noexcept
    {
        const float x = v[0], y = v[1], z = v[2];
        out[0] = m_m[0][0] * x + m_m[0][1] * y + m_m[0][2] * z;
        out[1] = m_m[1][0] * x + m_m[1][1] * y + m_m[1][2] * z;
        out[2] = m_m[2][0] * x + m_m[2][1] * y + m_m[2][2] * z;
    }
    ZmVec3f multMatrixVec(const ZmVec3f& v) const noexcept
    {
        ZmVec3f r;
        multMatrixVec(v, r);
        return r;
    }

    /// Cofactor expansion along row 0.
    float det() const noexcept
    {
        return m_m[0][0] * (m_m[1][1] * m_m[2][2] - m_m[1][2] * m_m[2][1]) -
               m_m[0][1] * (m_m[1][0] * m_m[2][2] - m_m[1][2] * m_m[2][0]) +
               m_m[0][2] * (m_m[1][0] * m_m[2][1] - m_m[1][1] * m_m[2][0]);
    }
    /// The signed cofactor of `m[i][j]`, written with cyclic indices: with i1 = (i+1) mod 3,
    /// i2 = (i+2) mod 3 (j1, j2 likewise) it is `m[i1][j1] * m[i2][j2] - m[i1][j2] * m[i2][j1]`.
    float subdet(int i, int j) const noexcept
    {
        const int i1 = (i + 1) % 3, i2 = (i + 2) % 3, j1 = (j + 1) % 3, j2 = (j + 2) % 3;
        return m_m[i1][j1] * m_m[i2][j2] - m_m[i1][j2] * m_m[i2][j1];
    }
    float trace() const noexcept { return m_m[0][0] + m_m[1][1] + m_m[2][2]; }
    ZmMat3f transpose() const noexcept
    {
        return ZmMat3f(m_m[0][0], m_m[1][0], m_m[2][0], m_m[0][1], m_m[1][1], m_m[2][1], m_m[0][2], m_m[1][2],
                       m_m[2][2]);
    }
    /// The adjugate divided by \p det, which must be this matrix's determinant (it is not a
    /// tolerance); no test.
    ZmMat3f inverse(float det) const noexcept;
    /// The adjugate divided by `det()`; a singular matrix (determinant exactly 0) is divided by 1
    /// instead and so yields its adjugate, intended: callers test `det()` where it matters.
    ZmMat3f inverse() const noexcept;
    /// For a symmetric matrix: the six upper entries of the adjugate divided by \p det, mirrored.
    ZmMat3f symmInverse(float det) const noexcept;

    /// LU decomposition in place by a fixed three-row elimination. \p index receives the row
    /// permutation, \p d is 1 after an odd number of row exchanges and 0 after an even number
    /// (not +-1). Returns 1, or 0 for a zero pivot column (matrix singular). The pivoting rules
    /// are deliberately minimal: a row exchange happens only for an exactly zero pivot, the
    /// column-1 pivot is tested before its elimination step, and the column-0 multipliers stay
    /// where they were when the lower rows are exchanged. Rows hold (p0, r01, r02),
    /// (l1, u11, u12), (l2, l21, u22).
    int LUDecomposition(int index[3], float& d) noexcept;

    /// Eigen-decomposition of this matrix, which must be symmetric, by the cyclic Jacobi method
    /// (at most 50 sweeps; the matrix itself is not changed). `evalues[k]` is the k-th
    /// eigenvalue and `evectors[k]` its unit eigenvector, so the matrix whose ROWS are
    /// `evectors[0..2]` is orthogonal with determinant +1 (a product of plane rotations) and
    /// diagonalises this matrix. The eigenvalues are not sorted. \p nrot counts the plane
    /// rotations applied. Without convergence after 50 sweeps the log gets the warning
    /// "Too many iterations in routine jacobi" and the current values are returned.
    void jacobi(float evalues[3], ZmVec3f evectors[3], int& nrot) const;

    /// Each element "%10.5g", followed by a tab after columns 0 and 1 and a newline after column
    /// 2. Nothing when \p fp is null.
    void print(FILE* fp) const;
    /// `{"m00":"…","m01":"…",…,"m22":"…"}`, row by row, each number in fixed notation with six
    /// decimals whatever the locale.
    std::string dump() const;

private:
    /// out = a * b, summed k = 0, 1, 2 from 0.0f. \p out may be \p a or \p b.
    static void product(const ZmMat3f& a, const ZmMat3f& b, ZmMat3f& out) noexcept
    {
        ZmMat3f r;
        for (int i = 0; i < 3; ++i) {
            const float a0 = a.m_m[i][0], a1 = a.m_m[i][1], a2 = a.m_m[i][2];
            r.m_m[i][0] = 0.0f + a0 * b.m_m[0][0] + a1 * b.m_m[1][0] + a2 * b.m_m[2][0];
            r.m_m[i][1] = 0.0f + a0 * b.m_m[0][1] + a1 * b.m_m[1][1] + a2 * b.m_m[2][1];
            r.m_m[i][2] = 0.0f + a0 * b.m_m[0][2] + a1 * b.m_m[1][2] + a2 * b.m_m[2][2];
        }
        out = r;
    }

    float m_m[3][3];
};
