/// \file
/// The arithmetic kernels behind ZmMat4f's affine inverse and ZmRotation's composition and
/// normalisation (private). Each has an SSE2 form for x86-64 and a portable form that produces the
/// same bits (the same products and sums, in the same order and precision), so that other
/// architectures need no intrinsic and the installed headers carry none. The tests compare the two
/// forms on x86-64. Compile without floating-point contraction (a fused multiply-add rounds once
/// where these kernels round twice): the library builds with -ffp-contract=off.
#pragma once

#include <cmath>

#if defined(__SSE2__)
#include <emmintrin.h>
#define ZM_GEOMETRY_SSE2 1
#else
#define ZM_GEOMETRY_SSE2 0
#endif

#if defined(__clang__)
#pragma clang fp contract(off)
#endif

namespace ZmGeometryKernels {

// --- affine inverse ------------------------------------------------------------------------------
//
// \p in and \p out are 4x4 row-major matrices (16 floats; they may be the same). The upper 3x3 is
// inverted through its adjugate: the determinant's six products are formed in float and summed in
// double, positive and negative ones apart; |det / (pos - neg)| < 1e-15 counts as singular (0 is
// returned and \p out is untouched). The adjugate's products are formed in float, their
// differences and the scaling by 1/det in double; the translation row is -(t * upper inverse) in
// float. Column 3 of the result is (0, 0, 0, 1).

/// max(0, x) and min(0, x) as the SSE2 instructions compute them (x when unordered).
inline double maxWithZero(double x) noexcept
{
    return 0.0 > x ? 0.0 : x;
}
inline double minWithZero(double x) noexcept
{
    return 0.0 < x ? 0.0 : x;
}

inline int affineInverseScalar(const float* in, float* out) noexcept
{
    const float a00 = in[0], a01 = in[1], a02 = in[2], a03 = in[3];
    const float a10 = in[4], a11 = in[5], a12 = in[6], a13 = in[7];
    const float a20 = in[8], a21 = in[9], a22 = in[10], a23 = in[11];
    const float t0 = in[12], t1 = in[13], t2 = in[14];
    // Positive terms p0..p2 and negative terms n0..n2 of the determinant; p3 and n3 come from
    // column 3 (zero for an affine matrix) and are carried as the vector form carries them.
    const float p[4] = {(a00 * a11) * a22, (a01 * a12) * a20, (a02 * a10) * a21, (a03 * a13) * a23};
    const float n[4] = {(a02 * a11) * a20, (a00 * a12) * a21, (a01 * a10) * a22, (a03 * a13) * a23};
    double posLane[2], negLane[2];
    for (int lane = 0; lane < 2; ++lane) {
        const double pl = p[lane], nl = n[lane], ph = p[lane + 2], nh = n[lane + 2];
        posLane[lane] = (maxWithZero(pl) - minWithZero(nl)) + (maxWithZero(ph) - minWithZero(nh));
        negLane[lane] = (minWithZero(pl) - maxWithZero(nl)) + (minWithZero(ph) - maxWithZero(nh));
    }
    const double pos = posLane[0] + posLane[1];
    const double neg = negLane[0] + negLane[1];
    const double det = pos + neg;
    const double inv = 1.0 / det;
    const double relative = det / (pos - neg);
    if (det == 0.0 || std::fabs(relative) < 1e-15) {
        return 0;
    }
    const auto adj = [inv](float plus, float minus) { return float((double(plus) - double(minus)) * inv); };
    // Rows of the upper inverse (the columns of the adjugate, transposed).
    const float u[3][3] = {
        {adj(a11 * a22, a12 * a21), adj(a21 * a02, a22 * a01), adj(a01 * a12, a02 * a11)},
        {adj(a12 * a20, a10 * a22), adj(a22 * a00, a20 * a02), adj(a02 * a10, a00 * a12)},
        {adj(a10 * a21, a11 * a20), adj(a20 * a01, a21 * a00), adj(a00 * a11, a01 * a10)},
    };
    for (int i = 0; i < 3; ++i) {
        for (int j = 0; j < 3; ++j) {
            out[4 * i + j] = u[i][j];
        }
        out[4 * i + 3] = 0.0f;
    }
    for (int j = 0; j < 3; ++j) {
        out[12 + j] = -((t0 * u[0][j] + t1 * u[1][j]) + t2 * u[2][j]);
    }
    out[15] = 1.0f;
    return 1;
}

#if ZM_GEOMETRY_SSE2
inline __m128 yzx(__m128 v) noexcept
{
    return _mm_shuffle_ps(v, v, _MM_SHUFFLE(3, 0, 2, 1));
}
inline __m128 zxy(__m128 v) noexcept
{
    return _mm_shuffle_ps(v, v, _MM_SHUFFLE(3, 1, 0, 2));
}
/// float((double(p) - double(q)) * inv) per lane.
inline __m128 adjugateColumn(__m128 p, __m128 q, __m128d inv) noexcept
{
    const __m128d lo = _mm_mul_pd(_mm_sub_pd(_mm_cvtps_pd(p), _mm_cvtps_pd(q)), inv);
    const __m128d hi =
        _mm_mul_pd(_mm_sub_pd(_mm_cvtps_pd(_mm_movehl_ps(p, p)), _mm_cvtps_pd(_mm_movehl_ps(q, q))), inv);
    return _mm_movelh_ps(_mm_cvtpd_ps(lo), _mm_cvtpd_ps(hi));
}

// The columns of the upper inverse are the cross products of the rows (r1 x r2, r2 x r0,
// r0 x r1); the determinant's products are (r0 * r1.yzx) * r2.zxy and (r0.zxy * r1.yzx) * r2,
// with pos and neg summed ((p0, n0) + (p2, n2)) + (p1, n1).
inline int affineInverseSse2(const float* in, float* out) noexcept
{
    const __m128 r0 = _mm_loadu_ps(in), r1 = _mm_loadu_ps(in + 4), r2 = _mm_loadu_ps(in + 8);
    const __m128 r0yzx = yzx(r0), r1yzx = yzx(r1), r2yzx = yzx(r2);
    const __m128 r0zxy = zxy(r0), r1zxy = zxy(r1), r2zxy = zxy(r2);
    const __m128d zero = _mm_setzero_pd();

    // Lanes (p0, p1, p2, p3) and (n0, n1, n2, n3) of the positive and the negative terms.
    const __m128 p = _mm_mul_ps(_mm_mul_ps(r0, r1yzx), r2zxy);
    const __m128 n = _mm_mul_ps(_mm_mul_ps(r0zxy, r1yzx), r2);
    // The term -n counts max(0, -n) = -min(0, n) towards pos and min(0, -n) = -max(0, n)
    // towards neg; subtracting a value of the right sign is exact addition.
    const __m128d p01 = _mm_cvtps_pd(p), p23 = _mm_cvtps_pd(_mm_movehl_ps(p, p));
    const __m128d n01 = _mm_cvtps_pd(n), n23 = _mm_cvtps_pd(_mm_movehl_ps(n, n));
    const __m128d pos2 = _mm_add_pd(_mm_sub_pd(_mm_max_pd(zero, p01), _mm_min_pd(zero, n01)),
                                    _mm_sub_pd(_mm_max_pd(zero, p23), _mm_min_pd(zero, n23)));
    const __m128d neg2 = _mm_add_pd(_mm_sub_pd(_mm_min_pd(zero, p01), _mm_max_pd(zero, n01)),
                                    _mm_sub_pd(_mm_min_pd(zero, p23), _mm_max_pd(zero, n23)));
    const double pos = _mm_cvtsd_f64(pos2) + _mm_cvtsd_f64(_mm_unpackhi_pd(pos2, pos2));
    const double neg = _mm_cvtsd_f64(neg2) + _mm_cvtsd_f64(_mm_unpackhi_pd(neg2, neg2));
    const double det = pos + neg;
    // (1 / det, det / (pos - neg)) in one division.
    const __m128d q = _mm_div_pd(_mm_set_pd(det, 1.0), _mm_set_pd(pos - neg, det));
    if (det == 0.0 || std::fabs(_mm_cvtsd_f64(_mm_unpackhi_pd(q, q))) < 1e-15) {
        return 0;
    }
    const __m128d inv = _mm_unpacklo_pd(q, q);

    __m128 c0 = adjugateColumn(_mm_mul_ps(r1yzx, r2zxy), _mm_mul_ps(r1zxy, r2yzx), inv);
    __m128 c1 = adjugateColumn(_mm_mul_ps(r2yzx, r0zxy), _mm_mul_ps(r2zxy, r0yzx), inv);
    __m128 c2 = adjugateColumn(_mm_mul_ps(r0yzx, r1zxy), _mm_mul_ps(r0zxy, r1yzx), inv);
    __m128 c3 = _mm_setzero_ps();
    _MM_TRANSPOSE4_PS(c0, c1, c2, c3); // now rows, with 0 in column 3

    const float* t = in + 12;
    __m128 row3 = _mm_add_ps(_mm_add_ps(_mm_mul_ps(_mm_set1_ps(t[0]), c0), _mm_mul_ps(_mm_set1_ps(t[1]), c1)),
                             _mm_mul_ps(_mm_set1_ps(t[2]), c2));
    row3 = _mm_xor_ps(row3, _mm_set1_ps(-0.0f));
    const __m128 xyzMask = _mm_castsi128_ps(_mm_set_epi32(0, -1, -1, -1));
    row3 = _mm_or_ps(_mm_and_ps(row3, xyzMask), _mm_set_ps(1.0f, 0.0f, 0.0f, 0.0f));
    _mm_storeu_ps(out, c0);
    _mm_storeu_ps(out + 4, c1);
    _mm_storeu_ps(out + 8, c2);
    _mm_storeu_ps(out + 12, row3);
    return 1;
}
#endif

inline int affineInverse(const float* in, float* out) noexcept
{
#if ZM_GEOMETRY_SSE2
    return affineInverseSse2(in, out);
#else
    return affineInverseScalar(in, out);
#endif
}

// --- quaternions (x, y, z, w) ----------------------------------------------------------------------
//
// Normalising divides by the length: the squared norm summed in float in the order x, y, z, w, its
// square root and reciprocal in double, each product rounded to float. The composition of a
// (first) and b (then) is the product b * a, lane by lane
//   x' = ((w X + x W) + z Y) - y Z,   y' = ((y W + w Y) + x Z) - z X,
//   z' = ((z W + w Z) + y X) - x Y,   w' = ((w W - x X) - y Y) - z Z,
// in float, then normalised. \p out may be \p a or \p b.

inline void normalizedScalar(const float* v, float* out) noexcept
{
    const float n = ((v[0] * v[0] + v[1] * v[1]) + v[2] * v[2]) + v[3] * v[3];
    const double inv = 1.0 / std::sqrt(double(n));
    for (int i = 0; i < 4; ++i) {
        out[i] = float(double(v[i]) * inv);
    }
}

inline void composeScalar(const float* a, const float* b, float* out) noexcept
{
    const float x = a[0], y = a[1], z = a[2], w = a[3];
    const float X = b[0], Y = b[1], Z = b[2], W = b[3];
    const float r[4] = {
        ((w * X + x * W) + z * Y) - y * Z,
        ((y * W + w * Y) + x * Z) - z * X,
        ((z * W + w * Z) + y * X) - x * Y,
        ((w * W - x * X) - y * Y) - z * Z,
    };
    normalizedScalar(r, out);
}

#if ZM_GEOMETRY_SSE2
inline void storeNormalizedSse2(__m128 v, float* out) noexcept
{
    const __m128 sq = _mm_mul_ps(v, v);
    const __m128 n = _mm_add_ss(
        _mm_add_ss(_mm_add_ss(sq, _mm_shuffle_ps(sq, sq, _MM_SHUFFLE(1, 1, 1, 1))), _mm_movehl_ps(sq, sq)),
        _mm_shuffle_ps(sq, sq, _MM_SHUFFLE(3, 3, 3, 3)));
    const __m128d len = _mm_sqrt_sd(_mm_setzero_pd(), _mm_cvtss_sd(_mm_setzero_pd(), n));
    __m128d inv = _mm_div_sd(_mm_set_sd(1.0), len);
    inv = _mm_unpacklo_pd(inv, inv);
    const __m128 lo = _mm_cvtpd_ps(_mm_mul_pd(_mm_cvtps_pd(v), inv));
    const __m128 hi = _mm_cvtpd_ps(_mm_mul_pd(_mm_cvtps_pd(_mm_movehl_ps(v, v)), inv));
    _mm_storeu_ps(out, _mm_movelh_ps(lo, hi));
}

inline void normalizedSse2(const float* v, float* out) noexcept
{
    storeNormalizedSse2(_mm_loadu_ps(v), out);
}

inline void composeSse2(const float* qa, const float* qb, float* out) noexcept
{
    const __m128 a = _mm_loadu_ps(qa), b = _mm_loadu_ps(qb);
    const __m128 lane3 = _mm_set_ps(-0.0f, 0.0f, 0.0f, 0.0f); // sign bit of w only
    const __m128 t1 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(3, 2, 1, 3)),
                                 _mm_shuffle_ps(b, b, _MM_SHUFFLE(3, 3, 3, 0)));
    const __m128 t2 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(0, 3, 3, 0)),
                                 _mm_shuffle_ps(b, b, _MM_SHUFFLE(0, 2, 1, 3)));
    const __m128 t3 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(1, 1, 0, 2)),
                                 _mm_shuffle_ps(b, b, _MM_SHUFFLE(1, 0, 2, 1)));
    const __m128 t4 = _mm_mul_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 0, 2, 1)),
                                 _mm_shuffle_ps(b, b, _MM_SHUFFLE(2, 1, 0, 2)));
    const __m128 r = _mm_sub_ps(_mm_add_ps(_mm_add_ps(t1, _mm_xor_ps(t2, lane3)), _mm_xor_ps(t3, lane3)), t4);
    storeNormalizedSse2(r, out);
}
#endif

inline void normalized(const float* v, float* out) noexcept
{
#if ZM_GEOMETRY_SSE2
    normalizedSse2(v, out);
#else
    normalizedScalar(v, out);
#endif
}

inline void compose(const float* a, const float* b, float* out) noexcept
{
#if ZM_GEOMETRY_SSE2
    composeSse2(a, b, out);
#else
    composeScalar(a, b, out);
#endif
}

} // namespace ZmGeometryKernels
