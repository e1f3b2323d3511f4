// ZmLine: closest points, picking of points, boxes, segments and triangles, transforms.
#include <zmlib/ZmLine.h>
#include <zmlib/ZmMat4f.h>

#include <Eigen/Dense>
#include <gtest/gtest.h>

#include <cmath>
#include <random>

namespace {

using Vec = Eigen::Vector3d;

Vec toEigen(const ZmVec3f& v)
{
    return {v[0], v[1], v[2]};
}

ZmVec3f randomVec(std::mt19937& rng, float range)
{
    std::uniform_real_distribution<float> d(-range, range);
    return {d(rng), d(rng), d(rng)};
}

ZmBox3f randomBox(std::mt19937& rng)
{
    std::uniform_real_distribution<float> lo(-2.0f, 1.0f), size(0.3f, 2.0f);
    const float x = lo(rng), y = lo(rng), z = lo(rng);
    return {x, x + size(rng), y, y + size(rng), z, z + size(rng)};
}

bool inGrownBox(const ZmBox3f& box, const Vec& p, double margin)
{
    for (int i = 0; i < 3; ++i) {
        if (p[i] < box[2 * i] - margin || p[i] > box[2 * i + 1] + margin)
            return false;
    }
    return true;
}

// Distance of p from the infinite line, and the parameter of its foot, in double.
double lineDistance(const ZmLine& line, const Vec& p, double* t = nullptr)
{
    const Vec v = p - toEigen(line.getPosition()), d = toEigen(line.getDirection());
    if (t != nullptr)
        *t = v.dot(d);
    return (v - v.dot(d) * d).norm();
}

// The picking measure of p: angle ratio dist/t or distance; +inf behind the start.
double pickMeasure(const ZmLine& line, const Vec& p, bool angular)
{
    double t;
    const double dist = lineDistance(line, p, &t);
    return t <= 0 ? INFINITY : angular ? dist / t : dist;
}

} // namespace

TEST(ZmLine, ConstructionClosestPointsAndTransform)
{
    EXPECT_TRUE(ZmLine(ZmVec3f(1.0f), ZmVec3f(1.0f)).isNoNumber());
    std::mt19937 rng(3);
    for (int i = 0; i < 200; ++i) {
        const ZmLine a(randomVec(rng, 5), randomVec(rng, 5)), b(randomVec(rng, 5), randomVec(rng, 5));
        ZmVec3f pa, pb;
        ASSERT_TRUE(a.getClosestPoints(b, pa, pb));
        // The connecting segment is perpendicular to both lines, whose points they are.
        const Vec gap = toEigen(pb) - toEigen(pa);
        EXPECT_NEAR(gap.dot(toEigen(a.getDirection())), 0.0, 1e-3 * (1 + gap.norm()));
        EXPECT_NEAR(gap.dot(toEigen(b.getDirection())), 0.0, 1e-3 * (1 + gap.norm()));
        EXPECT_LE(lineDistance(a, toEigen(pa)) + lineDistance(b, toEigen(pb)), 2e-3);
    }
    ZmVec3f pa, pb;
    ZmLine line(ZmVec3f(0.0f), ZmVec3f(0, 0, 1));
    EXPECT_FALSE(line.getClosestPoints(ZmLine(ZmVec3f(1.0f), ZmVec3f(1, 1, 3)), pa, pb));
    EXPECT_TRUE(pa.isNoNumber() && pb.isNoNumber());
    ZmMat4f m;
    m.setScale(2.0f);
    line.transform(m); // the direction is not normalised again
    EXPECT_EQ(line.getDirection(), ZmVec3f(0, 0, 2));
    EXPECT_TRUE(line.isEmpty());
    m.setTranslate(ZmVec3f(1, 2, 3));
    line.transform(m);
    EXPECT_TRUE(line.getPosition() == ZmVec3f(1, 2, 3) && line.getDirection() == ZmVec3f(0, 0, 2));
}

TEST(ZmLine, PointPickingUsesAngularOrAbsoluteTolerance)
{
    const ZmLine ray(ZmVec3f(0.0f), ZmVec3f(0, 0, 1));
    EXPECT_TRUE(ray.intersect(0.1f, ZmVec3f(0.05f, 0, 1)));
    EXPECT_FALSE(ray.intersect(0.1f, ZmVec3f(0, 0, -1)));
    EXPECT_FALSE(ray.intersect(-0.01f, ZmVec3f(0.05f, 0, 1)));
    EXPECT_TRUE(ray.intersect(0.01f, ZmVec3f(0.05f, 0, 10)));
    std::mt19937 rng(4);
    for (int i = 0; i < 5000; ++i) {
        const ZmLine line(randomVec(rng, 3), randomVec(rng, 3));
        const ZmVec3f p = randomVec(rng, 5);
        const float tol = std::uniform_real_distribution<float>(-2.0f, 2.0f)(rng);
        const double m = pickMeasure(line, toEigen(p), tol >= 0);
        if (std::fabs(m - std::fabs(tol)) > 1e-3) {
            EXPECT_EQ(line.intersect(tol, p), std::fabs(tol) > m) << i;
        }
    }
}

TEST(ZmLine, BoxTestsMatchSamplingTheLine)
{
    std::mt19937 rng(5);
    const double h = 1e-3;
    int slabHits = 0, slabCompared = 0, pickHits = 0, compared = 0;
    for (int i = 0; i < 600; ++i) {
        const ZmBox3f box = randomBox(rng);
        const ZmLine line(randomVec(rng, 3), box.getMin() + randomVec(rng, 1.5f)); // aimed near the box
        const Vec p = toEigen(line.getPosition()), d = toEigen(line.getDirection());
        const float tol = std::uniform_real_distribution<float>(-0.5f, 0.3f)(rng);
        // Slab test of the infinite line (tolerance 1e-4) and picking of the ray (t > 0, margin
        // |tol| or tol * t), both against samples; margins 0.02 larger or smaller spot grazing cases.
        bool inner = false, outer = false, pickSmall = false, pickLarge = false;
        double t0 = 1e9, t1 = -1e9;
        for (double t = -40; t <= 40; t += h) {
            const Vec q = p + t * d;
            inner |= inGrownBox(box, q, -0.02);
            outer |= inGrownBox(box, q, 0.02);
            if (inGrownBox(box, q, 0)) {
                t0 = std::min(t0, t);
                t1 = t;
            }
            const double margin = tol < 0 ? -tol : tol * t;
            if (t > 0) {
                pickSmall |= inGrownBox(box, q, margin - 0.02);
                pickLarge |= inGrownBox(box, q, margin + 0.02);
            }
        }
        if (pickSmall == pickLarge) {
            ++compared;
            pickHits += pickSmall;
            EXPECT_EQ(line.intersect(tol, box), pickSmall) << i;
        }
        if (inner != outer)
            continue;
        ZmVec3f enter, exit;
        ASSERT_EQ(line.intersect(box, enter, exit, 1e-4f), inner) << i;
        slabHits += inner;
        ++slabCompared;
        EXPECT_TRUE(inner ? (toEigen(enter) - (p + t0 * d)).norm() <= 2 * h &&
                                (toEigen(exit) - (p + t1 * d)).norm() <= 2 * h
                          : enter.isNoNumber() && exit.isNoNumber());
    }
    EXPECT_TRUE(slabHits > 100 && slabHits < slabCompared - 100) << slabHits << " " << slabCompared;
    EXPECT_TRUE(compared > 400 && pickHits > 100 && pickHits < compared - 100) << compared << " " << pickHits;

    ZmVec3f enter(7.0f), exit(7.0f);
    const ZmLine line(ZmVec3f(0, 0, -5), ZmVec3f(0, 0, 5));
    // A slab thinner than the tolerance is a hit at once; the outputs stay as they were.
    EXPECT_TRUE(line.intersect(ZmBox3f(-1, 1, -1, 1, 0, 0.01f), enter, exit, 0.05f));
    EXPECT_TRUE(enter == ZmVec3f(7.0f) && exit == ZmVec3f(7.0f));
    // Parallel to the x slab: inside it only within the tolerance.
    EXPECT_FALSE(line.intersect(ZmBox3f(1, 2, -1, 1, -1, 1), enter, exit, 0.5f));
    EXPECT_TRUE(line.intersect(ZmBox3f(0.25f, 2, -1, 1, -1, 1), enter, exit, 0.5f));
    EXPECT_FALSE(line.intersect(ZmBox3f(1, -1, -1, 1, -1, 1), enter, exit, 0.0f));
    // Picking never reaches behind the start, not even at t == 0.
    EXPECT_FALSE(line.intersect(-0.5f, ZmBox3f(-1, 1, -1, 1, -8, -5.5f)));
    EXPECT_FALSE(line.intersect(0.5f, ZmBox3f(1, -1, -1, 1, 1, 2)));
}

TEST(ZmLine, SegmentPickingTestsTheNearestPointOfTheSegment)
{
    std::mt19937 rng(8);
    int hits = 0;
    for (int i = 0; i < 500; ++i) {
        const ZmLine ray(randomVec(rng, 3), randomVec(rng, 3));
        const ZmVec3f a = randomVec(rng, 4), b = randomVec(rng, 4);
        const float tol = std::uniform_real_distribution<float>(-1.0f, 0.5f)(rng);
        const Vec e = toEigen(b) - toEigen(a), d = toEigen(ray.getDirection());
        if ((e - e.dot(d) * d).norm() < 0.2 * e.norm())
            continue;           // nearly parallel: the nearest point is ill-conditioned
        double best = INFINITY; // the sample of the segment nearest to the infinite line
        ZmVec3f nearest(0.0f);
        for (int k = 0; k <= 20000; ++k) {
            const ZmVec3f q = a + (b - a) * (k / 20000.0f);
            if (lineDistance(ray, toEigen(q)) < best) {
                best = lineDistance(ray, toEigen(q));
                nearest = q;
            }
        }
        const double m = pickMeasure(ray, toEigen(nearest), tol >= 0);
        if (std::fabs(m - std::fabs(tol)) < 0.01)
            continue;
        ZmVec3f point;
        ASSERT_EQ(ray.intersect(tol, a, b, point), std::fabs(tol) > m) << i;
        hits += std::fabs(tol) > m;
        EXPECT_TRUE(std::fabs(tol) > m ? (point - nearest).length() <= 2e-3f : point.isNoNumber());
    }
    EXPECT_GT(hits, 50);
    // A segment parallel to the ray is tested at its end further along the ray.
    ZmVec3f point;
    EXPECT_TRUE(ZmLine(ZmVec3f(0.0f), ZmVec3f(0, 0, 1))
                    .intersect(0.1f, ZmVec3f(0.5f, 0, 10), ZmVec3f(0.5f, 0, 1), point));
    EXPECT_EQ(point, ZmVec3f(0.5f, 0, 10));
}

TEST(ZmLine, TriangleHitsMatchALinearSolve)
{
    std::mt19937 rng(9);
    int hits = 0, fronts = 0;
    for (int i = 0; i < 3000; ++i) {
        const ZmLine ray(randomVec(rng, 3), randomVec(rng, 3));
        const ZmVec3f a = randomVec(rng, 3), b = randomVec(rng, 3), c = randomVec(rng, 3);
        Eigen::Matrix3d m; // p + t d = a + u (b - a) + v (c - a), solved in double
        m << -toEigen(ray.getDirection()), toEigen(b) - toEigen(a), toEigen(c) - toEigen(a);
        if (std::fabs(m.determinant()) < 1e-2)
            continue;
        const Vec tuv = m.partialPivLu().solve(toEigen(ray.getPosition()) - toEigen(a));
        const double w[3] = {1 - tuv[1] - tuv[2], tuv[1], tuv[2]};
        if (std::fabs(tuv[0]) < 1e-3 || std::fabs(w[0]) < 1e-3 || std::fabs(w[1]) < 1e-3 ||
            std::fabs(w[2]) < 1e-3)
            continue; // on an edge or at the ray's start
        const bool expected = tuv[0] > 0 && w[0] > 0 && w[1] > 0 && w[2] > 0;
        ZmVec3f point, bary;
        bool front = true;
        ASSERT_EQ(ray.intersect(a, b, c, point, bary, front), expected) << i;
        if (!expected) {
            EXPECT_TRUE(point.isNoNumber() && bary.isNoNumber() && !front);
            continue;
        }
        ++hits;
        fronts += front;
        EXPECT_EQ(front, toEigen(ray.getDirection()).dot(m.col(1).cross(m.col(2))) < 0);
        for (int k = 0; k < 3; ++k)
            EXPECT_NEAR(bary[k], w[k], 1e-4);
        EXPECT_LE((toEigen(point) - (toEigen(a) + tuv[1] * m.col(1) + tuv[2] * m.col(2))).norm(), 1e-4);
    }
    EXPECT_TRUE(hits > 100 && fronts > 30 && fronts < hits - 30) << hits << " " << fronts;
}
