// ZmMat3f against Eigen (row-major copies of the same numbers) and hand-worked LU cases.
#include "../LogCapture.h"

#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmMat4f.h>

#include <Eigen/Dense>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>

namespace {

using EMat3 = Eigen::Matrix<float, 3, 3, Eigen::RowMajor>;

EMat3 toEigen(const ZmMat3f& m)
{
    return Eigen::Map<const EMat3>(m[0]);
}

ZmMat3f randomMat3(std::mt19937& rng)
{
    std::uniform_real_distribution<float> d(-2.0f, 2.0f);
    ZmMat3f m;
    for (int i = 0; i < 9; ++i)
        m[i / 3][i % 3] = d(rng);
    return m;
}

bool near(const ZmMat3f& a, const EMat3& b, float tol)
{
    return (toEigen(a) - b).cwiseAbs().maxCoeff() <= tol;
}

} // namespace

TEST(ZmMat3f, LayoutProductsAndInversesMatchEigen)
{
    const ZmVec3f a(1, 2, 3), b(4, 5, 6), c(7, 8, 9);
    const ZmMat3f cols(a, b, c), rows(std::array<ZmVec3f, 3>{a, b, c});
    EXPECT_EQ(cols[0][1], 4.0f); // vectors as columns ...
    EXPECT_EQ(rows[0][1], 2.0f); // ... or as rows
    EXPECT_TRUE(near(cols.transpose(), toEigen(rows), 0));
    EXPECT_EQ(ZmMat3f(ZmMat4f(1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16))[2][1], 10.0f);

    std::mt19937 rng(31);
    for (int n = 0; n < 200; ++n) {
        const ZmMat3f m = randomMat3(rng), o = randomMat3(rng);
        const EMat3 em = toEigen(m), eo = toEigen(o);
        EXPECT_TRUE(near(ZmMat3f(m).multRight(o), em * eo, 1e-5f));
        EXPECT_TRUE(near(ZmMat3f(m).multLeft(o), eo * em, 1e-5f));
        const ZmVec3f v(0.5f, -1.25f, 2.0f);
        const Eigen::Vector3f ev(0.5f, -1.25f, 2.0f);
        const Eigen::RowVector3f row = ev.transpose() * em;
        const Eigen::Vector3f col = em * ev;
        for (int j = 0; j < 3; ++j) {
            EXPECT_NEAR(m.multVecMatrix(v)[j], row(j), 1e-5f);
            EXPECT_NEAR(m.multMatrixVec(v)[j], col(j), 1e-5f);
        }
        EXPECT_NEAR(m.det(), em.determinant(), 1e-4f);
        EXPECT_NEAR(m.trace(), em.trace(), 1e-6f);
        // subdet(i, j) is the signed cofactor: M * transpose(cofactors) = det * I.
        EMat3 adjugate;
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                adjugate(j, i) = m.subdet(i, j);
        EXPECT_LT((em * adjugate - em.determinant() * EMat3::Identity()).cwiseAbs().maxCoeff(), 1e-4f);
        if (std::fabs(m.det()) > 0.1f) {
            EXPECT_TRUE(near(m.inverse().multRight(m), EMat3::Identity(), 2e-4f));
            const ZmMat3f s = ZmMat3f(m).multRight(m.transpose()); // symmetric
            EXPECT_TRUE(toEigen(s.symmInverse(s.det())).isApprox(toEigen(s).inverse(), 2e-3f));
        }
    }
}

TEST(ZmMat3f, SingularInverseIsTheAdjugate)
{
    const ZmMat3f singular(1, 2, 3, 2, 4, 6, 1, 0, 1);
    ASSERT_EQ(singular.det(), 0.0f);
    for (int i = 0; i < 9; ++i)
        EXPECT_EQ(singular.inverse()[i / 3][i % 3], singular.subdet(i % 3, i / 3));
    const ZmMat3f m(2, 0, 0, 0, 4, 0, 0, 0, 8);
    EXPECT_EQ(m.inverse(m.det())[1][1], 0.25f);
    EXPECT_EQ(m.inverse(1.0f)[1][1], 16.0f); // the argument is the determinant
}

TEST(ZmMat3f, LUDecompositionFollowsItsPivotRules)
{
    std::mt19937 rng(7);
    for (int n = 0; n < 50; ++n) { // no zero pivots: L * U = M, no exchange
        const ZmMat3f m = randomMat3(rng);
        ZmMat3f lu(m);
        int index[3];
        float d = -1;
        ASSERT_EQ(lu.LUDecomposition(index, d), 1);
        EXPECT_EQ(d, 0.0f);
        EXPECT_EQ(index[0] + 10 * index[1] + 100 * index[2], 210);
        const EMat3 l =
            toEigen(lu).triangularView<Eigen::StrictlyLower>().toDenseMatrix() + EMat3::Identity();
        const EMat3 u = toEigen(lu).triangularView<Eigen::Upper>();
        EXPECT_TRUE((l * u).isApprox(toEigen(m), 1e-4f));
    }
    // Worked by hand from the rules: an exchange only for an exactly zero pivot, the column-1
    // pivot tested before elimination, the multipliers left in place, d the parity as 0/1.
    const struct {
        ZmMat3f m;
        std::array<int, 3> index;
        float d;
        ZmMat3f lu;
    } cases[] = {
        {ZmMat3f(0, 1, 1, 2, 1, 3, 4, 5, 6), {1, 0, 2}, 1, ZmMat3f(2, 1, 3, 0, 1, 1, 2, 3, -3)},
        {ZmMat3f(2, 1, 1, 4, 0, 3, 6, 5, 4), {0, 2, 1}, 1, ZmMat3f(2, 1, 1, 2, 3, 2, 3, -1, 2)},
        {ZmMat3f(0, 0, 1, 2, 1, 3, 4, 5, 6), {1, 2, 0}, 0, ZmMat3f(2, 1, 3, 0, 5, 6, 2, -0.4f, -2.6f)},
    };
    for (const auto& c : cases) {
        ZmMat3f lu(c.m);
        int index[3];
        float d;
        ASSERT_EQ(lu.LUDecomposition(index, d), 1);
        EXPECT_EQ((std::array<int, 3>{index[0], index[1], index[2]}), c.index);
        EXPECT_EQ(d, c.d);
        EXPECT_TRUE(near(lu, toEigen(c.lu), 1e-6f)) << toEigen(lu);
    }
    int index[3];
    float d;
    ZmMat3f zeroColumn(0, 1, 2, 0, 3, 4, 0, 5, 6), zeroSecond(1, 0, 2, 3, 0, 4, 5, 0, 7);
    EXPECT_EQ(zeroColumn.LUDecomposition(index, d), 0);
    EXPECT_EQ(zeroSecond.LUDecomposition(index, d), 0);
}

TEST(ZmMat3f, JacobiMatchesSelfAdjointEigenSolver)
{
    std::mt19937 rng(99);
    for (int n = 0; n < 200; ++n) {
        const ZmMat3f r = randomMat3(rng);
        const ZmMat3f s = ZmMat3f(r).multRight(r.transpose());
        const ZmMat3f before(s);
        float values[3];
        ZmVec3f vectors[3];
        int nrot = -1;
        s.jacobi(values, vectors, nrot);
        EXPECT_GT(nrot, 0);
        EXPECT_EQ(std::memcmp(&s, &before, sizeof s), 0) << "the matrix itself is unchanged";

        const Eigen::SelfAdjointEigenSolver<Eigen::Matrix3f> es(toEigen(s));
        const float scale = es.eigenvalues().cwiseAbs().maxCoeff();
        std::array<float, 3> sorted = {values[0], values[1], values[2]};
        std::sort(sorted.begin(), sorted.end()); // Eigen's are ascending, ours unsorted
        for (int k = 0; k < 3; ++k) {
            EXPECT_NEAR(sorted[size_t(k)], es.eigenvalues()(k), 1e-5f * scale + 1e-6f);
            const Eigen::Vector3f v(vectors[k][0], vectors[k][1], vectors[k][2]);
            EXPECT_NEAR(v.norm(), 1.0f, 1e-5f);
            EXPECT_LT((toEigen(s) * v - values[k] * v).norm(), 1e-4f * scale + 1e-5f); // whatever sign
        }
        EXPECT_NEAR(ZmMat3f(std::array<ZmVec3f, 3>{vectors[0], vectors[1], vectors[2]}).det(), 1.0f, 1e-5f);
    }

    float values[3];
    ZmVec3f vectors[3];
    int nrot = -1;
    ZmMat3f(3, 0, 0, 0, -1, 0, 0, 0, 2).jacobi(values, vectors, nrot);
    EXPECT_EQ(nrot, 0);
    EXPECT_EQ(values[1], -1.0f);
    EXPECT_EQ(vectors[2], ZmVec3f(0, 0, 1));

    ZmMat3f nan; // never converges: warned once, current values returned
    nan.makeNaN();
    EXPECT_FALSE(nan.isNumber());
    const LogCapture capture(ZmLogWarning);
    nan.jacobi(values, vectors, nrot);
    EXPECT_EQ(capture.matching("Too many iterations in routine jacobi").size(), 1u);
    EXPECT_EQ(vectors[0], ZmVec3f(1, 0, 0));
}

TEST(ZmMat3f, PrintAndDumpTexts)
{
    const ZmMat3f m(1, -0.5f, 2, 1234567, 0, 1e-7f, 3, 4, 5);
    char* buf = nullptr;
    size_t size = 0;
    FILE* f = open_memstream(&buf, &size);
    m.print(f);
    std::fclose(f);
    EXPECT_EQ(std::string(buf, size), "         1\t      -0.5\t         2\n"
                                      "1.2346e+06\t         0\t     1e-07\n"
                                      "         3\t         4\t         5\n");
    std::free(buf);
    EXPECT_EQ(m.dump(),
              "{\"m00\":\"1.000000\",\"m01\":\"-0.500000\",\"m02\":\"2.000000\",\"m10\":\"1234567.000000\","
              "\"m11\":\"0.000000\",\"m12\":\"0.000000\",\"m20\":\"3.000000\",\"m21\":\"4.000000\","
              "\"m22\":\"5.000000\"}");
}
