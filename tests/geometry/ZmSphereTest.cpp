// ZmSphere: crossings with lines and segments, circumscribed spheres.
#include <zmlib/ZmLine.h>
#include <zmlib/ZmSphere.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>

namespace {

ZmVec3f randomVec(std::mt19937& rng, float range)
{
    std::uniform_real_distribution<float> d(-range, range);
    return {d(rng), d(rng), d(rng)};
}

} // namespace

TEST(ZmSphere, CrossingsMatchSamplingTheLine)
{
    std::mt19937 rng(11);
    const double h = 1e-3;
    int hits = 0;
    for (int i = 0; i < 400; ++i) {
        const ZmSphere sphere(randomVec(rng, 3), std::uniform_real_distribution<float>(0.5f, 3.0f)(rng));
        const ZmVec3f a = randomVec(rng, 5), b = sphere.getCenter() + randomVec(rng, 2.5f); // aimed near it
        const ZmLine line(a, b);
        const ZmVec3f& d = line.getDirection();
        const float len = (b - a).length();
        const ZmVec3f c = sphere.getCenter();
        if (std::fabs((line.getClosestPoint(c) - c).length() - sphere.getRadius()) < 0.01f)
            continue; // grazing
        // The parameter interval [t0, t1] of the line inside the sphere, by sampling.
        double t0 = 1e9, t1 = -1e9;
        for (double t = -20; t <= 20; t += h) {
            if ((a + d * float(t) - c).length() <= sphere.getRadius()) {
                t0 = std::min(t0, t);
                t1 = t;
            }
        }
        const bool crosses = t0 <= t1;
        auto at = [&](double t) { return a + d * float(t); };
        auto near = [&](const ZmVec3f& got, double t) { return (got - at(t)).length() <= 2 * h; };
        ZmVec3f p0, p1, first, enter, exit;
        ASSERT_EQ(sphere.intersect(line, p0, p1), crosses);
        const bool ahead = sphere.intersect(line, first);
        ASSERT_EQ(sphere.intersect(a, b, enter, exit), crosses);
        if (!crosses) {
            EXPECT_TRUE(p0.isNoNumber() && p1.isNoNumber() && enter.isNoNumber() && exit.isNoNumber());
            EXPECT_FALSE(ahead);
            continue;
        }
        ++hits;
        EXPECT_TRUE(near(p0, t0) && near(p1, t1));
        // The first crossing at or ahead of the position.
        if (t0 > h || (t0 < -h && t1 > h)) {
            EXPECT_TRUE(ahead && near(first, t0 > h ? t0 : t1));
        } else if (t1 < -h) {
            EXPECT_FALSE(ahead);
        }
        // The segment a-b clamps the interval: beside the sphere, enter == exit at one end.
        EXPECT_TRUE(near(enter, std::clamp(t0, 0.0, double(len))) &&
                    near(exit, std::clamp(t1, 0.0, double(len))));
        if (t0 > len || t1 < 0) {
            EXPECT_EQ(enter, exit);
        }
    }
    EXPECT_GT(hits, 150);
    EXPECT_LT(hits, 350);
    ZmVec3f enter, exit;
    EXPECT_TRUE(ZmSphere(ZmVec3f(0.0f), 1).intersect(ZmVec3f(0, 0, -5), ZmVec3f(0, 0, -3), enter, exit));
    EXPECT_TRUE(enter == ZmVec3f(0, 0, -3) && exit == ZmVec3f(0, 0, -3));
    EXPECT_TRUE(ZmSphere(ZmVec3f(0.0f), 1).intersect(ZmVec3f(0.5f), ZmVec3f(0.5f), enter, exit));
    EXPECT_FALSE(ZmSphere(ZmVec3f(0.0f), 1).intersect(ZmVec3f(2.0f), ZmVec3f(2.0f), enter, exit));
}

TEST(ZmSphere, CircumscribeAndEmptyStates)
{
    ZmSphere s(ZmVec3f(5.0f), 1);
    s.circumscribe(ZmBox3f(0, 2, 0, 2, 0, 2));
    EXPECT_EQ(s.getCenter(), ZmVec3f(1.0f));
    EXPECT_FLOAT_EQ(s.getRadius(), std::sqrt(3.0f));
    s.circumscribe(ZmBox3f(0, 2, 3, 1, 0, 2));
    EXPECT_TRUE(s.getCenter() == ZmVec3f(0.0f) && s.getRadius() == -1.0f && s.isEmpty() && !s.isConsistent());
    const ZmSphere& empty = ZmSphere::emptySphere();
    EXPECT_EQ(&empty, &ZmSphere::emptySphere());
    EXPECT_TRUE(empty.getCenter() == ZmVec3f(0.0f) && empty.getRadius() == -1.0f);
    s.setValue(ZmVec3f(1, 2, 3), 0);
    EXPECT_TRUE(s.isNotEmpty() && s.isConsistent());
    s.makeEmpty();
    EXPECT_TRUE(s.getCenter() == ZmVec3f(1, 2, 3) && s.getRadius() == -1.0f);
    s.setRadius(std::nanf("0"));
    EXPECT_TRUE(s.isNoNumber() && !s.isConsistent());
}
