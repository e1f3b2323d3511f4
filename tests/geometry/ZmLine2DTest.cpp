// ZmLine2D: crossings, distances and projections of 2D lines and segments.
#include <zmlib/ZmLine2D.h>

#include <gtest/gtest.h>

#include <cmath>
#include <random>

namespace {

// Orientation of c against the directed line a -> b, in double (positive: c to the left).
double orient(const ZmVec2f& a, const ZmVec2f& b, const ZmVec2f& c)
{
    return (double(b.x()) - a.x()) * (double(c.y()) - a.y()) -
           (double(b.y()) - a.y()) * (double(c.x()) - a.x());
}

} // namespace

TEST(ZmLine2D, SegmentCrossingsAgreeWithOrientationTests)
{
    const ZmLine2D horizontal(ZmVec2f(0, 0), ZmVec2f(2, 0));
    ZmVec2f p(9, 9);
    EXPECT_TRUE(horizontal.intersectsSegments(ZmLine2D(ZmVec2f(1, -1), ZmVec2f(1, 1)), &p));
    EXPECT_EQ(p, ZmVec2f(1, 0));
    const ZmLine2D shortened(ZmVec2f(1, -1), ZmVec2f(1, -0.5f));
    EXPECT_FALSE(horizontal.intersectsSegments(shortened, &p));
    EXPECT_TRUE(horizontal.intersects(shortened, &p));
    EXPECT_FALSE(horizontal.intersects(ZmLine2D(ZmVec2f(0, 1), ZmVec2f(5, 1)), &p)); // parallel
    EXPECT_FALSE(horizontal.intersects(ZmLine2D(ZmVec2f(3, 3), ZmVec2f(3, 3)), &p)); // empty

    std::mt19937 rng(2024);
    std::uniform_real_distribution<float> u(-5.0f, 5.0f);
    int hits = 0, compared = 0;
    for (int i = 0; i < 20000; ++i) {
        const ZmVec2f p0(u(rng), u(rng)), p1(u(rng), u(rng)), q0(u(rng), u(rng)), q1(u(rng), u(rng));
        const double o[4] = {orient(p0, p1, q0), orient(p0, p1, q1), orient(q0, q1, p0), orient(q0, q1, p1)};
        if (std::fabs(o[0]) < 1e-3 || std::fabs(o[1]) < 1e-3 || std::fabs(o[2]) < 1e-3 ||
            std::fabs(o[3]) < 1e-3)
            continue; // touching or nearly collinear: rounding decides
        const bool expected = (o[0] < 0) != (o[1] < 0) && (o[2] < 0) != (o[3] < 0);
        const bool got = ZmLine2D(p0, p1).intersectsSegments(ZmLine2D(q0, q1), &p);
        ASSERT_EQ(got, expected) << i;
        ++compared;
        if (got) {
            ++hits; // the crossing lies on both lines
            EXPECT_NEAR(orient(p0, p1, p) / std::hypot(p1.x() - p0.x(), p1.y() - p0.y()), 0.0, 1e-4);
            EXPECT_NEAR(orient(q0, q1, p) / std::hypot(q1.x() - q0.x(), q1.y() - q0.y()), 0.0, 1e-4);
        }
    }
    EXPECT_GT(compared, 15000);
    EXPECT_GT(hits, 2000);
}

TEST(ZmLine2D, DistancesAndProjections)
{
    std::mt19937 rng(7);
    std::uniform_real_distribution<float> u(-5.0f, 5.0f);
    auto dist = [](const ZmVec2f& a, const ZmVec2f& b) {
        return std::hypot(double(a.x()) - b.x(), double(a.y()) - b.y());
    };
    for (int i = 0; i < 1000; ++i) {
        const ZmVec2f a(u(rng), u(rng)), b(u(rng), u(rng)), p(u(rng), u(rng));
        const ZmLine2D line(a, b);
        // The foot of the perpendicular: on the line, and no end of the segment is nearer.
        const ZmVec2f foot = line.getClosestPoint(p, false), c = line.getClosestPoint(p, true);
        EXPECT_NEAR(orient(a, b, foot) / dist(a, b), 0.0, 1e-5);
        EXPECT_LE(dist(foot, p), std::min(dist(a, p), dist(b, p)) + 1e-5);
        // Clamped: the foot when it lies on the segment, else the nearer end.
        const bool inside = std::fabs(dist(a, foot) + dist(foot, b) - dist(a, b)) < 1e-4;
        EXPECT_LE(dist(c, inside ? foot : (dist(a, p) < dist(b, p) ? a : b)), 1e-4);
        const float d = line.getDistanceTo(p); // signed: positive on the left
        EXPECT_EQ(d > 0, orient(a, b, p) > 0);
        EXPECT_NEAR(std::fabs(d), dist(foot, p), 1e-4);
        EXPECT_NEAR(line.getDistance2To(p), double(d) * d, 1e-3);
        ZmLine2D moved = line; // moved to the left, the old position lies to its right
        moved.translate(0.75f);
        EXPECT_NEAR(moved.getDistanceTo(a), -0.75, 1e-5);
    }
    // A zero direction falls back to the position.
    ZmLine2D point(ZmVec2f(1, 2), ZmVec2f(1, 2));
    EXPECT_TRUE(point.isEmpty());
    EXPECT_FLOAT_EQ(point.getDistanceTo(ZmVec2f(4, 6)), 5.0f);
    EXPECT_FLOAT_EQ(point.getDistance2To(ZmVec2f(4, 6)), 25.0f);
    EXPECT_EQ(point.getClosestPoint(ZmVec2f(4, 6), false), ZmVec2f(1, 2));
    const auto ends = ZmLine2D(ZmVec2f(1, 2), ZmVec2f(4, 6)).getCoordinates();
    ASSERT_EQ(ends.size(), 2u);
    EXPECT_TRUE(ends[0] == ZmVec2f(1, 2) && ends[1] == ZmVec2f(4, 6));
}
