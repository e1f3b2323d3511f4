// Small fixed-size geometry next to Eigen's fixed-size float types, on the same numbers:
// transforming 10^7 points by a 4x4 matrix (homogeneous division included on both sides), 4x4
// products, inverses of affine matrices, quaternion composition (ours normalises, so the peer
// composes and normalises) and rotating an array of vectors by one rotation. Our matrices act on
// row vectors, Eigen's on column vectors, so the peer gets the transposed matrix: the same work.
// The "checksum" note (sum of all outputs) shows that both sides computed the same thing.

#include "zmbench.h"

#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmRotation.h>

#include <cmath>
#include <random>
#include <vector>

#if ZMBENCH_HAVE_EIGEN
#include <Eigen/Dense>
#include <Eigen/Geometry>
#endif

ZMBENCH_TARGET("ZmMat4f_multVecMatrix", 1.2, "10^7 points through a projective 4x4 matrix, divided by w");
ZMBENCH_TARGET("ZmMat4f_product", 1.2, "4096 matrix products A[i] * B");
// Composition and the affine inverse keep their double-precision steps; their peers take the same
// steps in double, and Eigen's all-float figures are reported beside them (peer-float).
ZMBENCH_TARGET("ZmMat4f_inverse", 1.2,
               "inverse of 4096 affine 4x4 matrices (peer: Eigen types taking our double-precision "
               "steps; peer-eigen3d: Eigen's 3x3 inverse in double; peer-float, peer-affine3f: Eigen all "
               "in float)");
ZMBENCH_TARGET("ZmRotation_compose", 1.2,
               "4096 quaternion products, each normalised (peer: Eigen's product normalised with our "
               "double-precision steps; peer-float: `normalized()`, all in float)");
ZMBENCH_TARGET("ZmRotation_rotate", 1.2, "4096 vectors rotated by one rotation");

namespace {

constexpr int kPoints = 10000000;
constexpr int kCount = 4096;

std::vector<ZmVec3f> randomPoints(int n, unsigned seed)
{
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> d(-100.0f, 100.0f);
    std::vector<ZmVec3f> v(size_t(n), ZmVec3f(0.0f));
    for (auto& p : v)
        p = ZmVec3f(d(rng), d(rng), d(rng));
    return v;
}

std::vector<ZmRotation> randomRotations(int n, unsigned seed)
{
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> d(-1.0f, 1.0f);
    std::vector<ZmRotation> v(size_t(n), ZmRotation::identity());
    for (auto& r : v)
        r = ZmRotation(d(rng), d(rng), d(rng), d(rng));
    return v;
}

/// A perspective-like transform: rotation, scale, translation and a non-trivial column 3.
ZmMat4f projective()
{
    ZmMat4f m;
    m.setTransform(ZmVec3f(3, -2, 5), ZmRotation(ZmVec3f(1, 2, 3), 0.7f), ZmVec3f(1.5f, 0.5f, 2));
    m[0][3] = 0.001f;
    m[1][3] = -0.002f;
    m[2][3] = 0.003f;
    return m;
}

std::vector<ZmMat4f> randomAffine(int n, unsigned seed)
{
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> d(-1.0f, 1.0f), s(0.5f, 2.0f);
    std::vector<ZmMat4f> v(size_t(n), ZmMat4f::identity());
    for (auto& m : v)
        m.setTransform(ZmVec3f(10 * d(rng), 10 * d(rng), 10 * d(rng)),
                       ZmRotation(d(rng), d(rng), d(rng), d(rng)), ZmVec3f(s(rng), s(rng), s(rng)),
                       ZmRotation(d(rng), d(rng), d(rng), d(rng)));
    return v;
}

double sum(const std::vector<ZmVec3f>& v)
{
    double s = 0;
    for (const auto& p : v)
        s += double(p[0]) + p[1] + p[2];
    return s;
}

double sum(const std::vector<ZmMat4f>& v)
{
    double s = 0;
    for (const auto& m : v)
        for (int i = 0; i < 4; ++i)
            for (int j = 0; j < 4; ++j)
                s += m[i][j];
    return s;
}

double sum(const std::vector<ZmRotation>& v)
{
    double s = 0;
    for (const auto& r : v)
        s += double(r[0]) + r[1] + r[2] + r[3];
    return s;
}

#if ZMBENCH_HAVE_EIGEN
Eigen::Matrix4f toEigenColumnForm(const ZmMat4f& m)
{
    Eigen::Matrix4f e;
    for (int i = 0; i < 4; ++i)
        for (int j = 0; j < 4; ++j)
            e(j, i) = m[i][j];
    return e;
}

std::vector<Eigen::Vector3f> toEigen(const std::vector<ZmVec3f>& v)
{
    std::vector<Eigen::Vector3f> e(v.size());
    for (size_t i = 0; i < v.size(); ++i)
        e[i] = Eigen::Vector3f(v[i][0], v[i][1], v[i][2]);
    return e;
}

std::vector<Eigen::Quaternionf> toEigen(const std::vector<ZmRotation>& v)
{
    std::vector<Eigen::Quaternionf> e(v.size());
    for (size_t i = 0; i < v.size(); ++i)
        e[i] = Eigen::Quaternionf(v[i][3], v[i][0], v[i][1], v[i][2]);
    return e;
}

double sum(const std::vector<Eigen::Vector3f>& v)
{
    double s = 0;
    for (const auto& p : v)
        s += double(p(0)) + p(1) + p(2);
    return s;
}

double sum(const std::vector<Eigen::Matrix4f>& v)
{
    double s = 0;
    for (const auto& m : v)
        s += double(m.sum());
    return s;
}

double sum(const std::vector<Eigen::Quaternionf>& v)
{
    double s = 0;
    for (const auto& q : v)
        s += double(q.x()) + q.y() + q.z() + q.w();
    return s;
}

double sum(const std::vector<Eigen::Affine3f>& v)
{
    double s = 0;
    for (const auto& m : v)
        s += double(m.matrix().sum());
    return s;
}
#endif

/// After the timed loop: one item per output, the outputs' sum as "checksum" (equal on both sides
/// of a comparison when both computed the same thing) and the label.
template <class Out>
void report(benchmark::State& state, const std::vector<Out>& out, const char* label)
{
    state.SetItemsProcessed(int64_t(state.iterations()) * int64_t(out.size()));
    state.counters["checksum"] = sum(out);
    state.SetLabel(label);
}

// --- points through a 4x4 matrix ------------------------------------------------------------------

void MultVecMatrixZm(benchmark::State& state)
{
    const ZmMat4f m = projective();
    const std::vector<ZmVec3f> in = randomPoints(kPoints, 1);
    std::vector<ZmVec3f> out(in.size(), ZmVec3f(0.0f));
    for (auto _ : state) {
        const ZmVec3f* src = in.data();
        ZmVec3f* dst = out.data();
        for (int i = 0; i < kPoints; ++i)
            m.multVecMatrix(src[i], dst[i]);
        benchmark::DoNotOptimize(dst);
        benchmark::ClobberMemory();
    }
    report(state, out, "ZmMat4f::multVecMatrix");
}
BENCHMARK(MultVecMatrixZm)->Name("ZmMat4f_multVecMatrix/zm")->Unit(benchmark::kMillisecond);

#if ZMBENCH_HAVE_EIGEN
void MultVecMatrixPeer(benchmark::State& state)
{
    const Eigen::Matrix4f m = toEigenColumnForm(projective());
    const std::vector<Eigen::Vector3f> in = toEigen(randomPoints(kPoints, 1));
    std::vector<Eigen::Vector3f> out(in.size(), Eigen::Vector3f::Zero());
    for (auto _ : state) {
        const Eigen::Vector3f* src = in.data();
        Eigen::Vector3f* dst = out.data();
        for (int i = 0; i < kPoints; ++i)
            dst[i] = (m * src[i].homogeneous()).hnormalized();
        benchmark::DoNotOptimize(dst);
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen (Matrix4f * v.homogeneous()).hnormalized()");
}
BENCHMARK(MultVecMatrixPeer)->Name("ZmMat4f_multVecMatrix/peer")->Unit(benchmark::kMillisecond);
#else
ZMBENCH_MISSING_PEER("ZmMat4f_multVecMatrix/peer", "Eigen3 not found at configure time");
#endif

// --- 4x4 products ---------------------------------------------------------------------------------

void ProductZm(benchmark::State& state)
{
    const std::vector<ZmMat4f> a = randomAffine(kCount, 2);
    const ZmMat4f b = projective();
    std::vector<ZmMat4f> out(a.size(), ZmMat4f::identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i) {
            ZmMat4f m = a[size_t(i)];
            m *= b;
            out[size_t(i)] = m;
        }
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "ZmMat4f::operator*=");
}
BENCHMARK(ProductZm)->Name("ZmMat4f_product/zm");

#if ZMBENCH_HAVE_EIGEN
void ProductPeer(benchmark::State& state)
{
    // Row-vector A * B is column-vector B^T * A^T.
    std::vector<Eigen::Matrix4f> a;
    for (const ZmMat4f& m : randomAffine(kCount, 2))
        a.push_back(toEigenColumnForm(m));
    const Eigen::Matrix4f b = toEigenColumnForm(projective());
    std::vector<Eigen::Matrix4f> out(a.size(), Eigen::Matrix4f::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)].noalias() = b * a[size_t(i)];
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen Matrix4f * Matrix4f");
}
BENCHMARK(ProductPeer)->Name("ZmMat4f_product/peer");
#else
ZMBENCH_MISSING_PEER("ZmMat4f_product/peer", "Eigen3 not found at configure time");
#endif

// --- affine inverses ------------------------------------------------------------------------------

void InverseZm(benchmark::State& state)
{
    const std::vector<ZmMat4f> in = randomAffine(kCount, 3);
    std::vector<ZmMat4f> out(in.size(), ZmMat4f::identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = in[size_t(i)].inverse();
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "ZmMat4f::inverse (affine path)");
}
BENCHMARK(InverseZm)->Name("ZmMat4f_inverse/zm");

#if ZMBENCH_HAVE_EIGEN
void InversePeer(benchmark::State& state)
{
    std::vector<Eigen::Matrix4f> in;
    for (const ZmMat4f& m : randomAffine(kCount, 3))
        in.push_back(toEigenColumnForm(m));
    std::vector<Eigen::Matrix4f> out(in.size(), Eigen::Matrix4f::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = in[size_t(i)].inverse();
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen Matrix4f::inverse");
}
BENCHMARK(InversePeer)->Name("ZmMat4f_inverse/peer-float");

// The affine inverse with Eigen's types taking our double-precision steps: each determinant term
// and each cofactor product formed in float, the determinant summed in double with positive and
// negative terms apart (and the same singularity test), the cofactor differences and the scaling
// by 1/det in double, the translation in float. Eigen sums in its own order, so the outputs agree
// with ours to a float rounding (checked after the timed loop), not bit for bit.
Eigen::Vector3d crossInDouble(const Eigen::Vector3f& u, const Eigen::Vector3f& v)
{
    const Eigen::Array3f p(u.y() * v.z(), u.z() * v.x(), u.x() * v.y());
    const Eigen::Array3f q(u.z() * v.y(), u.x() * v.z(), u.y() * v.x());
    return (p.cast<double>() - q.cast<double>()).matrix();
}

void affineInverseInDouble(const Eigen::Matrix4f& m, Eigen::Matrix4f& out)
{
    if (m(3, 0) != 0.0f || m(3, 1) != 0.0f || m(3, 2) != 0.0f || m(3, 3) != 1.0f) {
        out = m.inverse();
        return;
    }
    // In column form the columns of the 3x3 block are our rows, and the rows of its inverse the
    // cross products of those columns.
    const Eigen::Vector3f a = m.block<3, 1>(0, 0), b = m.block<3, 1>(0, 1), c = m.block<3, 1>(0, 2);
    const Eigen::Array3d p =
        (a.array() * Eigen::Array3f(b.y(), b.z(), b.x()) * Eigen::Array3f(c.z(), c.x(), c.y()))
            .cast<double>();
    const Eigen::Array3d n =
        (Eigen::Array3f(a.z(), a.x(), a.y()) * Eigen::Array3f(b.y(), b.z(), b.x()) * c.array())
            .cast<double>();
    const double pos = p.max(0.0).sum() - n.min(0.0).sum();
    const double neg = p.min(0.0).sum() - n.max(0.0).sum();
    const double det = pos + neg;
    if (det == 0.0 || std::fabs(det / (pos - neg)) < 1e-15) {
        out = m.inverse();
        return;
    }
    const double inv = 1.0 / det;
    out.row(0).head<3>() = (crossInDouble(b, c) * inv).cast<float>().transpose();
    out.row(1).head<3>() = (crossInDouble(c, a) * inv).cast<float>().transpose();
    out.row(2).head<3>() = (crossInDouble(a, b) * inv).cast<float>().transpose();
    out.block<3, 1>(0, 3) = -(out.topLeftCorner<3, 3>() * m.block<3, 1>(0, 3));
    out.row(3) = Eigen::RowVector4f(0.0f, 0.0f, 0.0f, 1.0f);
}

void InversePeerDouble(benchmark::State& state)
{
    const std::vector<ZmMat4f> ours = randomAffine(kCount, 3);
    std::vector<Eigen::Matrix4f> in;
    for (const ZmMat4f& m : ours)
        in.push_back(toEigenColumnForm(m));
    std::vector<Eigen::Matrix4f> out(in.size(), Eigen::Matrix4f::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            affineInverseInDouble(in[size_t(i)], out[size_t(i)]);
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    // The same results as ours, to a float rounding of each element's size.
    for (size_t i = 0; i < in.size(); ++i) {
        const Eigen::Matrix4f expected = toEigenColumnForm(ours[i].inverse());
        const float tolerance = 4e-7f * (1.0f + expected.cwiseAbs().maxCoeff());
        if ((out[i] - expected).cwiseAbs().maxCoeff() > tolerance) {
            state.SkipWithError("the peer's inverse differs from ours beyond float rounding");
            return;
        }
    }
    report(state, out, "Eigen Matrix4f, our double-precision steps");
}
BENCHMARK(InversePeerDouble)->Name("ZmMat4f_inverse/peer");

// Reported beside it: Eigen's own inverse of the 3x3 block in double (products in double too, no
// singularity test), rounded to float, with the translation row in float.
void InversePeerEigenDouble(benchmark::State& state)
{
    std::vector<Eigen::Affine3f> in;
    for (const ZmMat4f& m : randomAffine(kCount, 3))
        in.emplace_back(toEigenColumnForm(m));
    std::vector<Eigen::Affine3f> out(in.size(), Eigen::Affine3f::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i) {
            const Eigen::Affine3f& m = in[size_t(i)];
            Eigen::Affine3f& r = out[size_t(i)];
            r.linear() = m.linear().cast<double>().inverse().cast<float>();
            r.translation() = -(r.linear() * m.translation());
        }
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen 3x3 block inverted in double, translation in float");
}
BENCHMARK(InversePeerEigenDouble)->Name("ZmMat4f_inverse/peer-eigen3d");

void InversePeerAffine(benchmark::State& state)
{
    std::vector<Eigen::Affine3f> in;
    for (const ZmMat4f& m : randomAffine(kCount, 3))
        in.emplace_back(toEigenColumnForm(m));
    std::vector<Eigen::Affine3f> out(in.size(), Eigen::Affine3f::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = in[size_t(i)].inverse();
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen Affine3f::inverse");
}
BENCHMARK(InversePeerAffine)->Name("ZmMat4f_inverse/peer-affine3f");
#else
ZMBENCH_MISSING_PEER("ZmMat4f_inverse/peer", "Eigen3 not found at configure time");
#endif

// --- quaternion composition -----------------------------------------------------------------------

void ComposeZm(benchmark::State& state)
{
    const std::vector<ZmRotation> a = randomRotations(kCount, 4), b = randomRotations(kCount, 5);
    std::vector<ZmRotation> out(a.size(), ZmRotation::identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i) {
            ZmRotation r = a[size_t(i)];
            r *= b[size_t(i)];
            out[size_t(i)] = r;
        }
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "ZmRotation::operator*= (normalises)");
}
BENCHMARK(ComposeZm)->Name("ZmRotation_compose/zm");

#if ZMBENCH_HAVE_EIGEN
void ComposePeer(benchmark::State& state)
{
    const std::vector<Eigen::Quaternionf> a = toEigen(randomRotations(kCount, 4)),
                                          b = toEigen(randomRotations(kCount, 5));
    std::vector<Eigen::Quaternionf> out(a.size(), Eigen::Quaternionf::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = (b[size_t(i)] * a[size_t(i)]).normalized();
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen (Quaternionf * Quaternionf).normalized()");
}
BENCHMARK(ComposePeer)->Name("ZmRotation_compose/peer-float");

// The same composition with Eigen's float quaternion, normalised with our precision: the squared
// norm in float, its square root and reciprocal in double, each component multiplied in double and
// rounded. Eigen sums the product's terms in its own order, so the outputs agree with ours to a
// float rounding (not bit for bit); the case shows what the double-precision steps cost.
void ComposePeerDouble(benchmark::State& state)
{
    const std::vector<Eigen::Quaternionf> a = toEigen(randomRotations(kCount, 4)),
                                          b = toEigen(randomRotations(kCount, 5));
    std::vector<Eigen::Quaternionf> out(a.size(), Eigen::Quaternionf::Identity());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i) {
            const Eigen::Quaternionf r = b[size_t(i)] * a[size_t(i)];
            const double inv = 1.0 / std::sqrt(double(r.squaredNorm()));
            out[size_t(i)].coeffs() = (r.coeffs().cast<double>() * inv).cast<float>();
        }
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen Quaternionf * Quaternionf, normalised in double");
}
BENCHMARK(ComposePeerDouble)->Name("ZmRotation_compose/peer");
#else
ZMBENCH_MISSING_PEER("ZmRotation_compose/peer", "Eigen3 not found at configure time");
#endif

// --- rotating vectors -----------------------------------------------------------------------------

void RotateZm(benchmark::State& state)
{
    const ZmRotation r(0.3f, -0.5f, 0.2f, 0.8f);
    const std::vector<ZmVec3f> in = randomPoints(kCount, 6);
    std::vector<ZmVec3f> out(in.size(), ZmVec3f(0.0f));
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = r * in[size_t(i)];
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "ZmRotation * ZmVec3f");
}
BENCHMARK(RotateZm)->Name("ZmRotation_rotate/zm");

#if ZMBENCH_HAVE_EIGEN
void RotatePeer(benchmark::State& state)
{
    const Eigen::Quaternionf q = toEigen(std::vector<ZmRotation>{ZmRotation(0.3f, -0.5f, 0.2f, 0.8f)})[0];
    const std::vector<Eigen::Vector3f> in = toEigen(randomPoints(kCount, 6));
    std::vector<Eigen::Vector3f> out(in.size(), Eigen::Vector3f::Zero());
    for (auto _ : state) {
        for (int i = 0; i < kCount; ++i)
            out[size_t(i)] = q * in[size_t(i)];
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    report(state, out, "Eigen Quaternionf * Vector3f");
}
BENCHMARK(RotatePeer)->Name("ZmRotation_rotate/peer");
#else
ZMBENCH_MISSING_PEER("ZmRotation_rotate/peer", "Eigen3 not found at configure time");
#endif

} // namespace
