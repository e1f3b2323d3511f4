// ZmPlane: construction rules, distances, intersections, transforms and text.
#include <zmlib/ZmLine.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmPlane.h>

#include <Eigen/Dense>
#include <Eigen/Geometry>
#include <gtest/gtest.h>

#include <cmath>
#include <random>

namespace {

using Vec = Eigen::Vector3d;

Vec toEigen(const ZmVec3f& v)
{
    return {v[0], v[1], v[2]};
}

ZmVec3f toZm(const Vec& v)
{
    return {float(v[0]), float(v[1]), float(v[2])};
}

Vec randomPoint(std::mt19937& rng, double range)
{
    std::uniform_real_distribution<double> c(-range, range);
    return {c(rng), c(rng), c(rng)};
}

Vec randomUnit(std::mt19937& rng)
{
    std::normal_distribution<double> g;
    return Vec(g(rng), g(rng), g(rng)).normalized();
}

ZmPlane randomPlane(std::mt19937& rng)
{
    return ZmPlane(toZm(randomUnit(rng)), std::uniform_real_distribution<float>(-5.0f, 5.0f)(rng));
}

// Our row-vector transform p * M for p' = a^T p + t.
ZmMat4f toZm(const Eigen::Matrix3d& a, const Vec& t)
{
    return ZmMat4f(float(a(0, 0)), float(a(0, 1)), float(a(0, 2)), 0, float(a(1, 0)), float(a(1, 1)),
                   float(a(1, 2)), 0, float(a(2, 0)), float(a(2, 1)), float(a(2, 2)), 0, float(t[0]),
                   float(t[1]), float(t[2]), 1);
}

} // namespace

TEST(ZmPlane, ConstructionRulesAndText)
{
    ZmPlane p(ZmVec3f(0, 0, 2), 3.0f);
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0, 0, 1) && p.getDistanceFromOrigin() == 3.0f);
    p.setNormal(ZmVec3f(0, 0, -4));
    p.setDistanceFromOrigin(-2);
    p.normalize(); // the distance is not rescaled, only made non-negative
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0, 0, 1) && p.getDistanceFromOrigin() == 2.0f);
    p.set(ZmVec3f(1, 0, 0), ZmVec3f(0, 1, 0), ZmVec3f(0, 0, 1));
    EXPECT_NEAR(p.getNormal().dot(ZmVec3f(1, 1, 1)), std::sqrt(3.0f), 1e-6f);
    EXPECT_NEAR(p.getDistanceFromOrigin(), 1 / std::sqrt(3.0f), 1e-6f);
    p.set(ZmVec3f(1, 1, 1), ZmVec3f(2, 2, 2), ZmVec3f(4, 4, 4)); // collinear
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0.0f) && p.getDistanceFromOrigin() == 0.0f && p.isEmpty());
    p = ZmPlane(ZmVec3f(0, 3, 0), ZmVec3f(5, 2, 7));
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0, 1, 0) && p.getDistanceFromOrigin() == 2.0f && p.isValid());
    p.set(ZmVec3f(0.0f), 5.0f);
    EXPECT_EQ(p.getDistanceFromOrigin(), 0.0f);
    EXPECT_EQ(ZmPlane(ZmVec3f(0.0f), 5.0f).getDistanceFromOrigin(), 5.0f); // the constructor keeps it
    EXPECT_EQ(&ZmPlane::emptyPlane(), &ZmPlane::emptyPlane());
    EXPECT_TRUE(ZmPlane::emptyPlane().getNormal() == ZmVec3f(0.0f) &&
                ZmPlane::emptyPlane().getDistanceFromOrigin() == 0);
    p.makeNaN();
    EXPECT_TRUE(p.isNoNumber() && p.isEmpty());

    p = ZmPlane(ZmVec3f(0, 0, 1), 2.5f);
    EXPECT_EQ(p.dump(), R"({"normal":{"x":"0.000000","y":"0.000000","z":"1.000000"},"distance":"2.500000"})");
    EXPECT_EQ(p.getProjectedPoint(ZmVec3f(1, 2, 7)), ZmVec3f(1, 2, 2.5f));
    EXPECT_TRUE(p.isInHalfSpace(ZmVec3f(0, 0, 2.5f)) && !p.isInHalfSpace(ZmVec3f(0, 0, 2.4f)));
    p.offset(1);
    p.revertOrientation();
    EXPECT_EQ(p.dump(),
              R"({"normal":{"x":"-0.000000","y":"-0.000000","z":"-1.000000"},"distance":"-3.500000"})");
}

TEST(ZmPlane, ParallelismAndNearEquality)
{
    const ZmPlane up(ZmVec3f(0, 0, 1), 1.0f), down(ZmVec3f(0, 0, -1), 1.0f); // z = 1 and z = -1
    EXPECT_TRUE(up.isParallel(down));
    ASSERT_TRUE(up.getDistance(down).has_value());
    EXPECT_EQ(*up.getDistance(down), -2.0f);
    EXPECT_FALSE(up.getDistance(ZmPlane(ZmVec3f(0, 1, 1), 1.0f)).has_value());
    EXPECT_TRUE(!up.isNearEqualNormal(down.getNormal(), true) &&
                up.isNearEqualNormal(down.getNormal(), false));
    EXPECT_TRUE(up.isNearEqualNormal(ZmVec3f(0, 0.001f, 3), true));
    EXPECT_FALSE(up.isNearEqualNormal(ZmVec3f(0, 0.1f, 1), false));
    EXPECT_FALSE(up.isNearEqualNormal(ZmVec3f(0, 0, 1e-7f), false));
    EXPECT_TRUE(up.isNearEqualInROI(ZmPlane(ZmVec3f(0, 0, -1), -1.05f), ZmVec3f(0.0f), 0, 0.06f, false));

    // In a region: the gap between the sign-matched signed distances, maximised over samples of
    // the ball's surface, decides.
    std::mt19937 rng(24);
    for (int i = 0; i < 200; ++i) {
        const ZmPlane a = randomPlane(rng);
        const Vec n = toEigen(a.getNormal());
        const double flip = (i % 2) ? -1.0 : 1.0;
        const Vec m = flip * (n + 0.008 * n.unitOrthogonal()).normalized(); // inside the normal test
        const ZmPlane b(toZm(m), float(flip * (a.getDistanceFromOrigin() + 0.05 * randomPoint(rng, 1)[0])));
        const Vec c = randomPoint(rng, 3);
        const float r = std::uniform_real_distribution<float>(0, 5)(rng);
        double gap = 0;
        for (int k = 0; k < 4000; ++k) {
            const Vec x = c + r * randomUnit(rng);
            gap = std::max(gap, std::fabs(flip * (n.dot(x) - a.getDistanceFromOrigin()) -
                                          (toEigen(b.getNormal()).dot(x) - b.getDistanceFromOrigin())));
        }
        EXPECT_TRUE(a.isNearEqualInROI(b, toZm(c), r, float(gap * 1.02 + 1e-5), false)) << i;
        EXPECT_FALSE(a.isNearEqualInROI(b, toZm(c), r, float(gap * 0.98 - 1e-5), false)) << i;
        EXPECT_EQ(a.isNearEqualInROI(b, toZm(c), r, float(gap * 1.02 + 1e-5), true), flip > 0) << i;
    }
}

TEST(ZmPlane, IntersectionsLieOnBothOperands)
{
    std::mt19937 rng(22);
    int checked = 0;
    for (int i = 0; i < 500; ++i) {
        const ZmPlane a = randomPlane(rng), b = randomPlane(rng);
        const ZmLine probe(toZm(randomPoint(rng, 5)), toZm(randomPoint(rng, 5)));
        if (a.getNormal().cross(b.getNormal()).length() < 0.05f ||
            std::fabs(a.getNormal().dot(probe.getDirection())) < 0.05f)
            continue;
        ++checked;
        ZmLine line;
        ASSERT_TRUE(a.intersect(b, line));
        EXPECT_NEAR(line.getDirection().length(), 1.0f, 1e-6f);
        for (float t : {0.0f, 3.0f, -7.0f}) {
            const ZmVec3f p = line.getPosition() + line.getDirection() * t;
            EXPECT_TRUE(std::fabs(a.getDistance(p)) < 1e-3f && std::fabs(b.getDistance(p)) < 1e-3f) << i;
        }
        ZmVec3f hit;
        float t = NAN;
        ASSERT_TRUE(a.intersect(probe, hit, &t));
        EXPECT_NEAR(a.getDistance(hit), 0.0f, 1e-3f);
        EXPECT_LE((probe.getPosition() + probe.getDirection() * t - hit).length(), 1e-5f);
    }
    EXPECT_GT(checked, 400);
    // Equal largest components of the direction: x is taken, so the line's point has x == 0.
    ZmLine line;
    ASSERT_TRUE(ZmPlane(ZmVec3f(0, 0, 1), 2.0f).intersect(ZmPlane(ZmVec3f(1, 1, 0), 3.0f), line));
    EXPECT_TRUE(line.getPosition().x() == 0.0f && line.getPosition().z() == 2.0f);
    EXPECT_FALSE(ZmPlane(ZmVec3f(0, 0, 1), 2.0f).intersect(ZmPlane(ZmVec3f(0, 0, -1), 2.0f), line));
    EXPECT_TRUE(line.isNoNumber());
    ZmVec3f hit;
    EXPECT_FALSE(ZmPlane(ZmVec3f(0, 0, 1), 2.0f).intersect(ZmLine(ZmVec3f(0.0f), ZmVec3f(1, 1, 0)), hit));
    EXPECT_TRUE(hit.isNoNumber());

    float mn, mx; // extremes over the box corners
    ZmPlane(ZmVec3f(1, 0, 1), 0.0f).getDistance(ZmBox3f(-1, 2, -3, 0.5f, 1, 4), mn, mx);
    EXPECT_TRUE(std::fabs(mn) < 1e-6f && std::fabs(mx - 6 / std::sqrt(2.0f)) < 1e-5f);
}

TEST(ZmPlane, TransformsMapPointsOnThePlane)
{
    std::mt19937 rng(23);
    std::uniform_real_distribution<double> u(-3, 3);
    for (int i = 0; i < 200; ++i) {
        const ZmPlane plane = randomPlane(rng);
        const Vec n = toEigen(plane.getNormal()), e1 = n.unitOrthogonal(), e2 = n.cross(e1);
        // Rigid with uniform scale: a = (s R)^T; and a general affine map for transformInv.
        const Eigen::Matrix3d a =
            (u(rng) + 3.2) * Eigen::AngleAxisd(u(rng), randomUnit(rng)).toRotationMatrix();
        Eigen::Matrix3d general = 2 * Eigen::Matrix3d::Identity();
        general.col(0) += randomPoint(rng, 1);
        general.col(1) += randomPoint(rng, 1);
        const Vec t = randomPoint(rng, 3);
        for (int mode = 0; mode < 3; ++mode) {
            const Eigen::Matrix3d& m = mode == 2 ? general : a;
            if (m.determinant() < 0.2)
                continue;
            ZmPlane moved = plane;
            if (mode == 0)
                moved.transform(toZm(m, t));
            else // by the inverse of the inverse
                moved.transformInv(toZm(m.inverse(), -m.inverse().transpose() * t));
            ASSERT_TRUE(moved.isValid()) << moved.dump();
            for (int k = 0; k < 4; ++k) {
                const Vec p = plane.getDistanceFromOrigin() * n + u(rng) * e1 + u(rng) * e2;
                const Vec q = m.transpose() * p + t;
                EXPECT_NEAR(moved.getDistance(toZm(q)), 0.0, 2e-4 * (1 + q.norm())) << mode;
                // The side the normal points to stays that side.
                EXPECT_GT(moved.getDistance(toZm(Vec(m.transpose() * (p + n) + t))), 0.0f) << mode;
            }
        }
    }
    ZmMat4f flat;
    flat.setScale(0.0f);
    ZmPlane p(ZmVec3f(0, 0, 1), 2.0f);
    p.transform(flat);
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0.0f) && p.getDistanceFromOrigin() == 0.0f);
    p = ZmPlane(ZmVec3f(0, 0, 1), 2.0f);
    p.transformInv(flat);
    EXPECT_TRUE(p.getNormal() == ZmVec3f(0.0f) && p.getDistanceFromOrigin() == 0.0f);
}
