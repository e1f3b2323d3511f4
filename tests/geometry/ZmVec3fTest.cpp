// ZmVec3f, the MathUtils predicates and the small geometry value types.
#include "../FileCapture.h"

#include <zmlib/MathUtils.h>
#include <zmlib/ZmBox2f.h>
#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmBox3i.h>
#include <zmlib/ZmVec2f.h>
#include <zmlib/ZmVec2i.h>
#include <zmlib/ZmVec3f.h>
#include <zmlib/ZmVec3l.h>
#include <zmlib/ZmVec4f.h>
#include <zmlib/ZmVec4i.h>

#include <Eigen/Dense>
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <random>
#include <type_traits>

namespace {

constexpr double kPi = 3.14159265358979323846;

Eigen::Vector3d toEigen(const ZmVec3f& v)
{
    return {v[0], v[1], v[2]};
}

ZmVec3f randomVec(std::mt19937& rng, float range = 10.0f)
{
    std::uniform_real_distribution<float> d(-range, range);
    return {d(rng), d(rng), d(rng)};
}

std::string printed(const ZmVec3f& v)
{
    return writtenToFile([&](FILE* f) { v.print(f); });
}

} // namespace

// The byte layouts are what messages and fingerprints carry, and every value must survive a byte copy.
static_assert(sizeof(ZmVec2f) == 8 && sizeof(ZmVec2i) == 8 && sizeof(ZmVec3f) == 12 && sizeof(ZmVec3i) == 12);
static_assert(sizeof(ZmVec3d) == 24 && sizeof(ZmVec3l) == 24 && sizeof(ZmVec4f) == 16 &&
              sizeof(ZmVec4i) == 16);
static_assert(sizeof(ZmBox2f) == 16 && sizeof(ZmBox3f) == 24 && sizeof(ZmBox3i) == 24);
static_assert(std::is_trivially_copyable_v<ZmVec3f> && std::is_trivially_copyable_v<ZmBox3f> &&
              std::is_trivially_default_constructible_v<ZmVec3f>);

TEST(ZmGeometryValues, BoxesKeepTheInterleavedOrderAndCorners)
{
    const ZmBox3f b(ZmVec3f(1, 2, 3), ZmVec3f(4, 5, 6));
    const float expected[6] = {1, 4, 2, 5, 3, 6};
    for (int i = 0; i < 6; ++i)
        EXPECT_EQ(b[i], expected[i]) << i;
    EXPECT_EQ(b.getMax(), ZmVec3f(4, 5, 6));
    EXPECT_FALSE(b.isEmpty());
    EXPECT_TRUE(ZmBox3i(0, 9, 5, 4, 0, 1).isEmpty());
    EXPECT_TRUE(ZmBox2f(0, 0, -1, 1).isEmpty());
    EXPECT_EQ(ZmBox3i(ZmVec3i(1, 2, 3), ZmVec3i(4, 5, 6)).zmin(), 3);
}

TEST(ZmVec3f, DumpAndPrintTexts)
{
    EXPECT_EQ(ZmVec3f(1, -0.5f, 0).dump(), R"({"x":"1.000000","y":"-0.500000","z":"0.000000"})");
    EXPECT_EQ(ZmVec3f(1e20f, -1.25e-7f, 2.5f).dump(),
              R"({"x":"100000002004087734272.000000","y":"-0.000000","z":"2.500000"})");
    EXPECT_EQ(printed(ZmVec3f(1, 2.5f, -1e-7f)), "         1        2.5     -1e-07\n");
}

TEST(ZmVec3f, MeasuresAndIndexTies)
{
    const ZmVec3f v(3, -7, 7);
    EXPECT_EQ(v.infnorm(), 7);
    EXPECT_EQ(v.indexOfMax(), 2);
    EXPECT_EQ(v.indexOfMin(), 1);
    EXPECT_EQ(ZmVec3f(2, 2, 2).indexOfMax(), 0);
    EXPECT_EQ(ZmVec3f(5, 1, 1).indexOfMin(), 1);
    EXPECT_EQ(v.sumOfComponents(), 3);
    EXPECT_EQ(v.productOfComponents(), -147);

    ZmVec3f z(0.0f);
    EXPECT_EQ(z.normalize(), 0.0f);
    EXPECT_EQ(z, ZmVec3f(0.0f));
    ZmVec3f u(0, 3, 4);
    EXPECT_EQ(u.normalize(), 5.0f);
    EXPECT_EQ(u, ZmVec3f(0, 0.6f, 0.8f));
}

TEST(ZmVec3f, SignRoundAndNaNRules)
{
    const float nan = std::nanf("0");
    EXPECT_EQ(ZmVec3f(-2, 0, nan).sign(), ZmVec3f(-1, 0, 0));
    // Ties to even, then through a 32-bit integer (out of range gives its minimum).
    EXPECT_EQ(ZmVec3f(0.5f, 1.5f, -2.5f).round(), ZmVec3f(0, 2, -2));
    EXPECT_EQ(ZmVec3f(3e9f, nan, 2.4f).round(), ZmVec3f(-2147483648.0f, -2147483648.0f, 2));

    EXPECT_TRUE(ZmVec3f(0.0f).isZero());
    EXPECT_FALSE(ZmVec3f(0, 0, nan).isZero());
    EXPECT_TRUE(ZmVec3f(1.04f, 0, 0).isNormal(0.1f)); // the squared length 1.0816 is tested
    EXPECT_FALSE(ZmVec3f(1.05f, 0, 0).isNormal(0.1f));
    EXPECT_FALSE(ZmVec3f(nan, 0, 0).isNormal(10));
    EXPECT_TRUE(ZmVec3f(0, -1, 0.005f).isAxis(0.01f));
    EXPECT_FALSE(ZmVec3f(0, -1, 0.02f).isAxis(0.01f));
    EXPECT_TRUE(ZmVec3f::NaN().isNoNumber());
    EXPECT_TRUE(ZmVec3f(1, 1, 0).equals(ZmVec3f(1, 1, 1), 1.0f));
    EXPECT_FALSE(ZmVec3f(1, 1, 0).equals(ZmVec3f(1, 1, 1), 0.999f));
}

TEST(ZmVec3f, AngleAgainstDoublePrecision)
{
    EXPECT_DOUBLE_EQ(ZmVec3f(1, 0, 0).angle(ZmVec3f(0.0f)), kPi / 2);
    EXPECT_DOUBLE_EQ(ZmVec3f(1, 0, 0).angle(ZmVec3f(-2, 0, 0)), kPi);
    EXPECT_DOUBLE_EQ(ZmVec3f(1, 1, 1).angle(ZmVec3f(3, 3, 3)), 0.0);
    std::mt19937 rng(7);
    for (int i = 0; i < 1000; ++i) {
        const ZmVec3f a = randomVec(rng), b = randomVec(rng);
        const Eigen::Vector3d ea = toEigen(a), eb = toEigen(b);
        const double ref = std::atan2(ea.cross(eb).norm(), ea.dot(eb));
        EXPECT_NEAR(a.angle(b), ref, 2e-3) << i; // float acos near 0 and pi loses digits
    }
}

TEST(ZmVec3f, ClosestAxisMatchesBruteForce)
{
    EXPECT_EQ(ZmVec3f(0.0f).getClosestAxis(), ZmVec3f(1, 0, 0));
    EXPECT_EQ(ZmVec3f(1, 1, 0).getClosestAxis(), ZmVec3f(1, 0, 0));
    EXPECT_EQ(ZmVec3f(-1, 0, -1).getClosestAxis(), ZmVec3f(-1, 0, 0));
    EXPECT_EQ(ZmVec3f(std::nanf("0"), 1, 0).getClosestAxis(), ZmVec3f(0.0f));
    const ZmVec3f axes[6] = {{1, 0, 0}, {-1, 0, 0}, {0, 1, 0}, {0, -1, 0}, {0, 0, 1}, {0, 0, -1}};
    std::mt19937 rng(11);
    for (int i = 0; i < 2000; ++i) {
        const ZmVec3f v = randomVec(rng);
        int best = 0;
        for (int k = 1; k < 6; ++k) {
            if (v.dot(axes[k]) > v.dot(axes[best]))
                best = k;
        }
        EXPECT_EQ(v.getClosestAxis(), axes[best]) << i;
    }
}

TEST(ZmVec3f, ElementwiseOperations)
{
    const ZmVec3f a(1, 2, 3), b(4, -5, 6);
    EXPECT_EQ(a.cross(b), ZmVec3f(27, 6, -13));
    EXPECT_EQ(a.compprod(b), ZmVec3f(4, -10, 18));
    EXPECT_EQ(b.compquot(a), ZmVec3f(4, -2.5f, 2));
    EXPECT_EQ(a.lerp(b, 0.5f), ZmVec3f(2.5f, -1.5f, 4.5f));
    EXPECT_EQ(a.compSwapped(1, 9), ZmVec3f(1, 9, 3));
    EXPECT_EQ(a.swizzled(ZmVec3i(2, 0, 0)), ZmVec3f(3, 1, 1));
    ZmVec3f c(a);
    c += ZmVec3d(0.1, 0.2, 1e-9); // each double is rounded to float before the addition
    EXPECT_EQ(c, ZmVec3f(1 + 0.1f, 2 + 0.2f, 3 + 1e-9f));
    c = ZmVec3f(1, 1, 1);
    c /= 3.0f;
    EXPECT_EQ(c[0], 1.0f / 3.0f);
}

TEST(MathUtils, SignedAngleAboutANormal)
{
    const ZmVec3f x(1, 0, 0), y(0, 1, 0), z(0, 0, 1);
    EXPECT_FLOAT_EQ(MathUtils::angleBetweenVectors(x, y, z), kPi / 2);
    EXPECT_FLOAT_EQ(MathUtils::angleBetweenVectors(x, y, -z), 3 * kPi / 2);
    EXPECT_EQ(MathUtils::angleBetweenVectors(x, x, z), 0.0f);
    // Just below zero rounds to exactly 2*pi in float, which is folded back to 0.
    EXPECT_EQ(MathUtils::angleBetweenVectors(x, ZmVec3f(1, -1e-9f, 0), z), 0.0f);
    std::mt19937 rng(3);
    for (int i = 0; i < 500; ++i) {
        const ZmVec3f a = randomVec(rng), b = randomVec(rng), n = a.cross(b);
        const float phi = MathUtils::angleBetweenVectors(a, b, n);
        ASSERT_GE(phi, 0.0f);
        ASSERT_LT(phi, 6.2831855f);
        // About the normal a x b the turn from a to b is the unsigned angle; about -n the complement.
        EXPECT_NEAR(phi, a.angle(b), 1e-3) << i;
        EXPECT_NEAR(MathUtils::angleBetweenVectors(a, b, -n), 2 * kPi - a.angle(b), 1e-3) << i;
    }
}

TEST(MathUtils, Predicates)
{
    const ZmVec3f x(1, 0, 0), y(0, 1, 0);
    EXPECT_TRUE(MathUtils::areLinearlyIndependent(x, y, ZmVec3f(0, 0, 2)));
    EXPECT_FALSE(MathUtils::areLinearlyIndependent(x, y, ZmVec3f(3, -1, 0)));
    EXPECT_TRUE(MathUtils::areParallel(ZmVec3f(2, 0, 0), ZmVec3f(-5, 1e-4f, 0), 1e-3f));
    EXPECT_FALSE(MathUtils::areParallel(x, y, 1.0f)); // |x cross y| = 1, and the test is strict
    EXPECT_TRUE(MathUtils::arePerpendicular(x, ZmVec3f(1e-7f, 5, 0)));
    EXPECT_FALSE(MathUtils::arePerpendicular(x, ZmVec3f(1e-5f, 5, 0)));
    EXPECT_TRUE(MathUtils::haveSameSpaceOrientation(x, ZmVec3f(1e-3f, -9, 0)));
    EXPECT_FALSE(MathUtils::haveSameSpaceOrientation(x, y));
    std::mt19937 rng(5);
    for (int i = 0; i < 500; ++i) {
        const ZmVec3f v = randomVec(rng);
        const ZmVec3f p = MathUtils::getPerpendicularVector(v);
        EXPECT_NEAR(v.dot(p) / (v.length() * p.length()), 0.0, 1e-6) << i;
        // Crossing with the axis of the smallest component keeps the result well away from zero.
        EXPECT_GT(p.length(), 0.5f * v.length()) << i;
    }
}
