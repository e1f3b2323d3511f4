// ZmMat4f and ZmMat4fCache against Eigen. Our matrices are row-major and act on row vectors, so a
// row-major Eigen copy is used as `row * E`; our rotation (x, y, z, w) is Eigen's quaternion.
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmMat4fCache.h>
#include <zmlib/ZmRotation.h>

#include <Eigen/Dense>
#include <Eigen/Geometry>
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>

namespace {

using EMat4 = Eigen::Matrix<float, 4, 4, Eigen::RowMajor>;

EMat4 toEigen(const ZmMat4f& m)
{
    return Eigen::Map<const EMat4>(m[0]);
}

Eigen::Vector3f toEigen(const ZmVec3f& v)
{
    return Eigen::Vector3f(v[0], v[1], v[2]);
}

Eigen::Quaternionf toEigen(const ZmRotation& r)
{
    return Eigen::Quaternionf(r[3], r[0], r[1], r[2]);
}

bool near(const ZmMat4f& a, const EMat4& b, float tol)
{
    return (toEigen(a) - b).cwiseAbs().maxCoeff() <= tol;
}

bool sameBits(const ZmMat4f& a, const ZmMat4f& b)
{
    return std::memcmp(&a, &b, sizeof a) == 0;
}

ZmMat4f randomMat4(std::mt19937& rng)
{
    std::uniform_real_distribution<float> d(-2.0f, 2.0f);
    ZmMat4f m;
    for (int i = 0; i < 16; ++i)
        m[i / 4][i % 4] = d(rng);
    return m;
}

ZmVec3f randomVec(std::mt19937& rng, float lo, float hi)
{
    std::uniform_real_distribution<float> d(lo, hi);
    return ZmVec3f(d(rng), d(rng), d(rng));
}

ZmRotation randomRotation(std::mt19937& rng)
{
    std::uniform_real_distribution<float> d(-1.0f, 1.0f);
    return ZmRotation(d(rng), d(rng), d(rng), d(rng));
}

} // namespace

TEST(ZmMat4f, SettersAndPredicates)
{
    ZmMat4f m;
    m.setValue(ZmVec3f(1, 2, 3), ZmVec3f(4, 5, 6), ZmVec3f(7, 8, 9), ZmVec3f(10, 11, 12));
    EXPECT_TRUE(sameBits(m, ZmMat4f(1, 2, 3, 0, 4, 5, 6, 0, 7, 8, 9, 0, 10, 11, 12, 1)));
    EXPECT_TRUE(sameBits(ZmMat4f(ZmMat3f(1, 2, 3, 4, 5, 6, 7, 8, 9)),
                         ZmMat4f(1, 2, 3, 0, 4, 5, 6, 0, 7, 8, 9, 0, 0, 0, 0, 1)));
    m.setTranslate(ZmVec3f(-1, 2, 5));
    EXPECT_TRUE(sameBits(m, ZmMat4f(1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, -1, 2, 5, 1)));
    m.setScale(ZmVec3f(2, 3, 4));
    EXPECT_TRUE(sameBits(m, ZmMat4f(2, 0, 0, 0, 0, 3, 0, 0, 0, 0, 4, 0, 0, 0, 0, 1)));
    m.setShear(ZmVec3f(1, 2, 3), ZmVec3f(4, 5, 6), ZmVec3f(7, 8, 9));
    EXPECT_TRUE(sameBits(m.transpose(), ZmMat4f(1, 4, 7, 0, 2, 5, 8, 0, 3, 6, 9, 0, 0, 0, 0, 1)));

    m.setScale(1.0f);
    m[3][0] = -0.0f; // exact comparison: -0 equals 0
    EXPECT_TRUE(m.isIdentity());
    m[2][1] = 1e-30f;
    EXPECT_FALSE(m.isIdentity());
    ZmMat4f b = ZmMat4f::identity();
    b[1][2] = 0.25f;
    EXPECT_TRUE(ZmMat4f::identity().equals(b, 0.25f)); // a difference of exactly eps passes
    EXPECT_FALSE(ZmMat4f::identity().equals(b, 0.2499f));
    b.makeNaN();
    EXPECT_FALSE(b.isNumber());
}

TEST(ZmMat4f, ProductsPointMapsAndDeterminantsMatchEigen)
{
    std::mt19937 rng(4711);
    for (int n = 0; n < 200; ++n) {
        const ZmMat4f a = randomMat4(rng), b = randomMat4(rng);
        const EMat4 ea = toEigen(a), eb = toEigen(b);
        EXPECT_TRUE(near(ZmMat4f(a).multRight(b), ea * eb, 1e-5f));
        EXPECT_TRUE(near(ZmMat4f(a).multLeft(b), eb * ea, 1e-5f));
        EXPECT_TRUE(sameBits(ZmMat4f(a) *= b, ZmMat4f(a).multRight(b)));

        const ZmVec3f p = randomVec(rng, -3, 3);
        const Eigen::RowVector4f row = Eigen::RowVector4f(p[0], p[1], p[2], 1) * ea;
        const Eigen::Vector4f col = ea * Eigen::Vector4f(p[0], p[1], p[2], 1);
        const Eigen::RowVector3f dir = toEigen(p).transpose() * ea.topLeftCorner<3, 3>();
        ZmVec3f inPlace = p;
        a.multVecMatrix(inPlace, inPlace);
        ZmVec4f v4, w4;
        a.multVecMatrix(ZmVec4f(p[0], p[1], p[2], 1), v4);
        a.multMatrixVec(ZmVec4f(p[0], p[1], p[2], 1), w4);
        for (int j = 0; j < 3; ++j) {
            EXPECT_NEAR(a.multVecMatrix(p)[j], row(j) / row(3), 1e-4f * (1 + row.norm() / std::fabs(row(3))));
            EXPECT_NEAR(a.multMatrixVec(p)[j], col(j) / col(3), 1e-4f * (1 + col.norm() / std::fabs(col(3))));
            EXPECT_NEAR(a.multDirMatrix(p)[j], dir(j), 1e-5f);
            EXPECT_EQ(inPlace[j], a.multVecMatrix(p)[j]);
        }
        for (int j = 0; j < 4; ++j) {
            EXPECT_NEAR(v4[j], row(j), 1e-5f);
            EXPECT_NEAR(w4[j], col(j), 1e-5f);
        }
        EXPECT_NEAR(a.det4(), ea.determinant(), 1e-4f * (1 + std::fabs(ea.determinant())));
        EXPECT_NEAR(a.det3(), (ea.topLeftCorner<3, 3>().determinant()), 1e-4f);
        Eigen::Matrix3f pick; // rows 3, 0, 2 and columns 1, 3, 0
        pick << ea(3, 1), ea(3, 3), ea(3, 0), ea(0, 1), ea(0, 3), ea(0, 0), ea(2, 1), ea(2, 3), ea(2, 0);
        EXPECT_NEAR(a.det3(3, 0, 2, 1, 3, 0), pick.determinant(), 1e-4f);
    }
    // Sums start from +0: a row of four -0 products gives +0, not -0.
    ZmMat4f negated(-1, -1, -1, -1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0);
    negated *= ZmMat4f(0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0);
    EXPECT_FALSE(std::signbit(negated[0][0]));
    // A then B: translate first, then scale.
    ZmMat4f t, s;
    t.setTranslate(ZmVec3f(1, 2, 3));
    s.setScale(ZmVec3f(2, 3, 4));
    EXPECT_EQ(t.multRight(s).multVecMatrix(ZmVec3f(1, 1, 1)), ZmVec3f(4, 9, 16));
}

TEST(ZmMat4f, InverseTakesTheAffineOrTheLUPath)
{
    std::mt19937 rng(17);
    for (int n = 0; n < 200; ++n) {
        ZmMat4f a;
        a.setTransform(randomVec(rng, -5, 5), randomRotation(rng), randomVec(rng, 0.2f, 3),
                       randomRotation(rng));
        ZmMat4f out;
        ASSERT_EQ(ZmMat4f::affine_inverse(a, out), 1);
        EXPECT_TRUE(sameBits(out, a.inverse()));
        EXPECT_TRUE(near(ZmMat4f(a).multRight(out), EMat4::Identity(), 1e-4f));
        // The precision rules, re-computed plainly: adjugate products in float, difference and
        // 1/det in double, translation row in float. The determinant's summation order is free,
        // so one unit in the last place is allowed.
        double pos = 0, neg = 0;
        for (double t : {double(a[0][0] * a[1][1] * a[2][2]), double(a[0][1] * a[1][2] * a[2][0]),
                         double(a[0][2] * a[1][0] * a[2][1]), -double(a[0][2] * a[1][1] * a[2][0]),
                         -double(a[0][1] * a[1][0] * a[2][2]), -double(a[0][0] * a[1][2] * a[2][1])})
            (t >= 0 ? pos : neg) += t;
        const double inv = 1.0 / (pos + neg);
        float plain[4][3];
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j) { // cofactor(j, i) / det, cyclic indices
                const int j1 = (j + 1) % 3, j2 = (j + 2) % 3, i1 = (i + 1) % 3, i2 = (i + 2) % 3;
                plain[i][j] = float((double(a[j1][i1] * a[j2][i2]) - double(a[j1][i2] * a[j2][i1])) * inv);
            }
        for (int j = 0; j < 3; ++j)
            plain[3][j] = -(a[3][0] * plain[0][j] + a[3][1] * plain[1][j] + a[3][2] * plain[2][j]);
        for (int i = 0; i < 12; ++i) {
            const float expected = plain[i / 3][i % 3];
            EXPECT_LE(std::fabs(out[i / 3][i % 3] - expected),
                      std::fabs(std::nextafter(expected, 1e30f) - expected));
        }

        const ZmMat4f general = randomMat4(rng);
        if (std::fabs(toEigen(general).determinant()) > 0.1f) {
            EXPECT_EQ(ZmMat4f::affine_inverse(general, out), 0);
            EXPECT_TRUE(near(ZmMat4f(general).multRight(general.inverse()), EMat4::Identity(), 1e-3f));
        }
    }
    EXPECT_TRUE(sameBits(ZmMat4f::identity().inverse(), ZmMat4f::identity()));
    ZmMat4f notAffine = ZmMat4f::identity(), out = ZmMat4f::identity();
    notAffine[3][3] = 2;
    notAffine[0][0] = 3;
    EXPECT_EQ(ZmMat4f::affine_inverse(notAffine, out), 0);
    EXPECT_TRUE(out.isIdentity()) << "out untouched";
    EXPECT_TRUE(near(notAffine.inverse(), toEigen(notAffine).inverse(), 1e-6f));
    // A singular affine matrix fails the affine path and goes through the 1e-6 substitution.
    ZmMat4f flat;
    flat.setScale(ZmVec3f(1, 1, 0));
    EXPECT_EQ(ZmMat4f::affine_inverse(flat, out), 0);
    EXPECT_NEAR(flat.inverse()[2][2], 1e6f, 1.0f);
}

TEST(ZmMat4f, LUSolveMatchesPartialPivLU)
{
    std::mt19937 rng(123);
    for (int n = 0; n < 200; ++n) {
        const ZmMat4f a = randomMat4(rng);
        const EMat4 e = toEigen(a);
        if (std::fabs(e.determinant()) < 0.1f)
            continue;
        ZmMat4f lu(a);
        int index[4];
        float d = 0;
        ASSERT_EQ(lu.LUDecomposition(index, d), 1);
        EXPECT_NEAR(d * lu[0][0] * lu[1][1] * lu[2][2] * lu[3][3], e.determinant(),
                    1e-4f * (1 + std::fabs(e.determinant())));
        float x[4] = {1.5f, -2, 0.25f, 3};
        const Eigen::Vector4f expected = e.partialPivLu().solve(Eigen::Vector4f(x[0], x[1], x[2], x[3]));
        lu.LUBackSubstitution(index, x);
        for (int i = 0; i < 4; ++i)
            EXPECT_NEAR(x[i], expected(i), 1e-3f * (1 + expected.norm()));
    }
    int index[4];
    float d = 0;
    ZmMat4f tie(1, 0.5f, 0.2f, 0.1f, 1, 0.3f, 0.2f, 0.1f, 1, 0.1f, 0.4f, 0.2f, 1, 0.2f, 0.3f, 0.4f);
    ASSERT_EQ(tie.LUDecomposition(index, d), 1);
    EXPECT_EQ(index[0], 3) << "among equal scaled pivots the last row wins";
    ZmMat4f zeroRow = ZmMat4f::identity();
    zeroRow[1][1] = 0;
    ASSERT_EQ(zeroRow.LUDecomposition(index, d), 1) << "a zero row is patched, not reported";
    EXPECT_EQ(zeroRow[1][1], 1e-6f);
    EXPECT_EQ(d, 1.0f);

    // jacobi3 works on the upper 3x3 only.
    const ZmMat4f m(4, 1, -2, 9, 1, 2, 0.5f, 9, -2, 0.5f, 3, 9, 9, 9, 9, 9);
    float v4[3], v3[3];
    ZmVec3f e4[3], e3[3];
    int n4 = -1, n3 = -2;
    m.jacobi3(v4, e4, n4);
    ZmMat3f(m).jacobi(v3, e3, n3);
    EXPECT_EQ(std::memcmp(v4, v3, sizeof v4) + std::memcmp(e4, e3, sizeof e4) + (n4 - n3), 0);
}

TEST(ZmMat4f, SetTransformComposesInTheDocumentedOrder)
{
    std::mt19937 rng(2024);
    for (int n = 0; n < 100; ++n) {
        const ZmVec3f t = randomVec(rng, -5, 5), s = randomVec(rng, -3, 3), c = randomVec(rng, -2, 2);
        const ZmRotation r = randomRotation(rng), so = randomRotation(rng);
        ZmMat4f m;
        m.setTransform(t, r, s, so, c);
        const ZmVec3f p = randomVec(rng, -4, 4);
        // -c, so^-1, scale, so, r, +c, +t.
        Eigen::Vector3f e = toEigen(so).conjugate() * (toEigen(p) - toEigen(c));
        e = toEigen(r) * (toEigen(so) * e.cwiseProduct(toEigen(s))) + toEigen(c) + toEigen(t);
        for (int j = 0; j < 3; ++j)
            EXPECT_NEAR(m.multVecMatrix(p)[j], e(j), 1e-4f * (1 + e.norm()));
    }
    ZmMat4f a, b;
    const ZmRotation r(ZmVec3f(1, 2, 3), 0.7f);
    a.setTransform(ZmVec3f(1, 2, 3), r, ZmVec3f(2, 2, 1));
    b.setTransform(ZmVec3f(1, 2, 3), r, ZmVec3f(2, 2, 1), ZmRotation::identity(), ZmVec3f(0, 0, 0));
    EXPECT_TRUE(sameBits(a, b));
    a.setTransform(ZmVec3f(0, 0, 0), ZmRotation::identity(), ZmVec3f(1, 1, 1), r, ZmVec3f(5, 6, 7));
    EXPECT_TRUE(a.isIdentity()) << "neutral steps are skipped exactly";
}

TEST(ZmMat4f, GetTransformRebuildsTheMatrix)
{
    std::mt19937 rng(77);
    const ZmVec3f signs[] = {ZmVec3f(1, 1, 1), ZmVec3f(-1, -1, -1), ZmVec3f(1, -1, 1)}; // incl. mirrors
    for (int n = 0; n < 150; ++n) {
        const ZmVec3f centre = (n % 2) ? randomVec(rng, -2, 2) : ZmVec3f(0, 0, 0);
        ZmMat4f m;
        m.setTransform(randomVec(rng, -5, 5), randomRotation(rng),
                       randomVec(rng, 0.3f, 3).compprod(signs[n % 3]), randomRotation(rng), centre);
        ZmVec3f t, s;
        ZmRotation r, so;
        m.getTransform(t, r, s, so, centre);
        ZmMat4f rebuilt;
        rebuilt.setTransform(t, r, s, so, centre);
        EXPECT_TRUE(rebuilt.equals(m, 1e-4f * (1 + toEigen(m).cwiseAbs().maxCoeff()))) << n;
        // |s| are the singular values and their product is the determinant.
        const Eigen::Matrix3f upper = toEigen(m).topLeftCorner<3, 3>();
        const Eigen::Vector3f sv = upper.jacobiSvd().singularValues();
        EXPECT_NEAR(s.abs().sumOfComponents(), sv.sum(), 1e-4f * sv.sum());
        EXPECT_NEAR(s.productOfComponents(), upper.determinant(), 1e-3f * sv.prod());

        ZmMat4f er, u, proj;
        ZmVec3f fs, ft;
        ASSERT_TRUE(m.factor(er, fs, u, ft, proj));
        EXPECT_TRUE(proj.isIdentity() && ft == ZmVec3f(m[3][0], m[3][1], m[3][2]));
        EXPECT_NEAR(u.det3(), 1.0f, 1e-4f); // a proper rotation remains
    }
    ZmMat4f flat, er, u, proj;
    ZmVec3f fs, ft;
    flat.setScale(ZmVec3f(1, 0, 2));
    EXPECT_FALSE(flat.factor(er, fs, u, ft, proj));
}

TEST(ZmMat4f, PrintAndDumpTexts)
{
    char* buf = nullptr;
    size_t size = 0;
    FILE* f = open_memstream(&buf, &size);
    ZmMat4f::identity().print(f);
    ZmMat4f::identity().print(nullptr);
    std::fclose(f);
    EXPECT_EQ(std::string(buf, size), "         1\t         0\t         0\n         0\n"
                                      "         0\t         1\t         0\n         0\n"
                                      "         0\t         0\t         1\n         0\n"
                                      "         0\t         0\t         0\n         1\n");
    std::free(buf);
    ZmMat4f m;
    m.setTranslate(ZmVec3f(1, -0.5f, 2.25f));
    EXPECT_EQ(m.dump(),
              "{\"m00\":\"1.000000\",\"m01\":\"0.000000\",\"m02\":\"0.000000\",\"m03\":\"0.000000\","
              "\"m10\":\"0.000000\",\"m11\":\"1.000000\",\"m12\":\"0.000000\",\"m13\":\"0.000000\","
              "\"m20\":\"0.000000\",\"m21\":\"0.000000\",\"m22\":\"1.000000\",\"m23\":\"0.000000\","
              "\"m30\":\"1.000000\",\"m31\":\"-0.500000\",\"m32\":\"2.250000\",\"m33\":\"1.000000\"}");
}

TEST(ZmMat4fCache, KeepsTheMatrixAndItsInverse)
{
    ZmMat4f m;
    m.setTransform(ZmVec3f(1, 2, 3), ZmRotation(ZmVec3f(0, 1, 1), 0.3f), ZmVec3f(2, 1, 0.5f));
    const ZmMat4fCache cache(m);
    ZmMat4fCache copy;
    copy = cache;
    EXPECT_TRUE(sameBits(copy.getMatrix(), m));
    EXPECT_TRUE(sameBits(copy.getInvMatrix(), m.inverse()));
    m.setScale(4.0f);
    copy.setMatrix(m);
    EXPECT_EQ(copy.getInvMatrix()[1][1], 0.25f);
}
