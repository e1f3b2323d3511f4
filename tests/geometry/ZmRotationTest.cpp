// ZmRotation against Eigen's quaternions. Ours act on row vectors (v * M), Eigen's on column
// vectors, so our matrix is the transpose of toRotationMatrix() and `r * v` equals Eigen's `q * v`.
#include <zmlib/ZmRotation.h>

#include <Eigen/Geometry>
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>

namespace {

Eigen::Quaternionf toEigen(const ZmRotation& r)
{
    return Eigen::Quaternionf(r[3], r[0], r[1], r[2]);
}

Eigen::Vector3f toEigen(const ZmVec3f& v)
{
    return Eigen::Vector3f(v[0], v[1], v[2]);
}

ZmRotation raw(float x, float y, float z, float w) // without normalisation
{
    ZmRotation r;
    r[0] = x, r[1] = y, r[2] = z, r[3] = w;
    return r;
}

ZmRotation fromEigen(const Eigen::Quaternionf& q)
{
    return raw(q.x(), q.y(), q.z(), q.w());
}

bool sameBits(const ZmRotation& a, const ZmRotation& b)
{
    return std::memcmp(a.getValue(), b.getValue(), 4 * sizeof(float)) == 0;
}

ZmRotation randomRotation(std::mt19937& rng)
{
    std::uniform_real_distribution<float> d(-1.0f, 1.0f);
    return ZmRotation(d(rng), d(rng), d(rng), d(rng));
}

ZmVec3f randomVec(std::mt19937& rng)
{
    std::uniform_real_distribution<float> d(-2.0f, 2.0f);
    return ZmVec3f(d(rng), d(rng), d(rng));
}

void expectNear(const ZmVec3f& a, const Eigen::Vector3f& b, float tol)
{
    EXPECT_LE((toEigen(a) - b).cwiseAbs().maxCoeff(), tol)
        << toEigen(a).transpose() << " vs " << b.transpose();
}

} // namespace

TEST(ZmRotation, NormalisesComponentsAndDumpShiftsTheLabels)
{
    const ZmRotation r(1, 2, 3, 4);
    for (int i = 0; i < 4; ++i)
        EXPECT_NEAR(r[i], (i + 1) / std::sqrt(30.0f), 1e-7f);
    EXPECT_EQ(r.dump(), "{\"w\":\"0.182574\",\"x\":\"0.365148\",\"y\":\"0.547723\",\"z\":\"0.730297\"}");
    const float q[4] = {1, 2, 3, 4};
    EXPECT_TRUE(sameBits(ZmRotation(q), r));
    ZmRotation w = raw(0, 0, 0, 2);
    w *= ZmRotation::identity(); // composition normalises
    EXPECT_TRUE(sameBits(w, ZmRotation::identity()));
    w.makeNaN();
    EXPECT_FALSE(w.isNumber());
}

TEST(ZmRotation, MatricesAreEigensTransposedAndConvertBack)
{
    std::mt19937 rng(1);
    // Each component dominant in turn, so that every branch of the extraction runs.
    const ZmRotation dominant[] = {ZmRotation(0.9f, 0.1f, -0.2f, 0.05f), ZmRotation(0.1f, -0.9f, 0.2f, 0.05f),
                                   ZmRotation(0.1f, 0.2f, 0.9f, -0.05f), ZmRotation(0.1f, 0.2f, 0.3f, 0.9f)};
    for (int n = 0; n < 204; ++n) {
        const ZmRotation r = n < 4 ? dominant[n] : randomRotation(rng);
        ZmMat4f m;
        m = r;
        const Eigen::Matrix3f expected = toEigen(r).toRotationMatrix().transpose();
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j) {
                EXPECT_NEAR(m[i][j], expected(i, j), 2e-6f);
                EXPECT_EQ(r.toMat3f()[i][j], m[i][j]);
            }
        EXPECT_TRUE(m[0][3] == 0 && m[1][3] == 0 && m[2][3] == 0 && m[3][0] == 0 && m[3][1] == 0 &&
                    m[3][2] == 0 && m[3][3] == 1);
        EXPECT_TRUE(ZmRotation(m).equals(r, 1e-5f)) << n;
        EXPECT_TRUE(ZmRotation(ZmMat3f(m)).equals(r, 1e-5f)) << n;

        const ZmVec3f v = randomVec(rng); // rotating is that matrix applied to a row vector
        EXPECT_EQ(r * v, m.multVecMatrix(v));
        expectNear(r.multVec(v), toEigen(r) * toEigen(v), 1e-5f);
    }
}

TEST(ZmRotation, CompositionAppliesThisRotationFirst)
{
    std::mt19937 rng(3);
    for (int n = 0; n < 200; ++n) {
        const ZmRotation a = randomRotation(rng), b = randomRotation(rng);
        ZmRotation ab(a);
        ab *= b;
        EXPECT_TRUE(ab.equals(fromEigen((toEigen(b) * toEigen(a)).normalized()), 1e-6f));
        const ZmVec3f v = randomVec(rng);
        expectNear(ab * v, toEigen(b) * (toEigen(a) * toEigen(v)), 1e-5f);
        // Bit for bit the written arithmetic: float products summed in the written order, the
        // reciprocal of the length in double.
        const float x = a[0], y = a[1], z = a[2], w = a[3], X = b[0], Y = b[1], Z = b[2], W = b[3];
        const float p[4] = {X * w + x * W + z * Y - Z * y, W * y + w * Y + x * Z - X * z,
                            z * W + Z * w + X * y - x * Y, W * w - X * x - y * Y - z * Z};
        const double inv = 1.0 / std::sqrt(double(p[0] * p[0] + p[1] * p[1] + p[2] * p[2] + p[3] * p[3]));
        EXPECT_TRUE(
            sameBits(ab, raw(float(p[0] * inv), float(p[1] * inv), float(p[2] * inv), float(p[3] * inv))));
        // The inverse undoes it; q and -q are the same rotation.
        ab *= b.inverse();
        EXPECT_TRUE(ab.equals(a, 1e-6f));
        EXPECT_TRUE(a.equals(raw(-a[0], -a[1], -a[2], -a[3]), 1e-7f));
    }
    ZmRotation twice = raw(1, 0, 0, 1); // squared norm 2
    twice.invert();
    EXPECT_TRUE(sameBits(twice, raw(-0.5f, -0.0f, -0.0f, 0.5f)));
    EXPECT_FALSE(ZmRotation::identity().equals(raw(0, 0.25f, 0, 1), 0.25f)); // strict
    EXPECT_TRUE(ZmRotation::identity().equals(raw(0, 0.25f, 0, 1), 0.2501f));
}

TEST(ZmRotation, AxisAngleRoundTrips)
{
    std::mt19937 rng(4);
    std::uniform_real_distribution<float> angles(0.01f, 6.2f);
    for (int n = 0; n < 200; ++n) {
        const ZmVec3f axis = randomVec(rng);
        const float angle = angles(rng);
        const ZmRotation r(axis, angle);
        EXPECT_TRUE(r.equals(
            fromEigen(Eigen::Quaternionf(Eigen::AngleAxisf(angle, toEigen(axis).normalized()))), 2e-6f));
        ZmVec3f gotAxis;
        float gotAngle;
        r.getValue(gotAxis, gotAngle);
        EXPECT_NEAR(gotAngle, angle, 2e-3f);
        expectNear(gotAxis, toEigen(axis).normalized(), 1e-3f);
        ZmRotation half(r);
        EXPECT_TRUE(half.scaleAngle(0.5f).equals(ZmRotation(axis, angle * 0.5f), 2e-3f));
    }
    ZmVec3f axis;
    float angle = -1;
    ZmRotation(ZmVec3f(1, 0, 0), 1e-6f).getValue(axis, angle); // too small for an axis
    EXPECT_EQ(axis, ZmVec3f(0, 0, 1));
    EXPECT_EQ(angle, 0.0f);
    EXPECT_TRUE(sameBits(ZmRotation(ZmVec3f(0, 0, 0), 1.0f), raw(0, 0, 0, std::cos(0.5f))));
}

TEST(ZmRotation, VectorPairsMapTheirDirections)
{
    std::mt19937 rng(5);
    for (int n = 0; n < 200; ++n) {
        const ZmVec3f from = randomVec(rng), to = randomVec(rng);
        expectNear(ZmRotation(from, to) * from.normalized(), toEigen(to).normalized(), 2e-5f);
        // Direction and up: both land, when each up vector is perpendicular to its direction.
        const ZmVec3f fromUp = from.cross(randomVec(rng)).normalized(),
                      toUp = to.cross(randomVec(rng)).normalized();
        const ZmRotation r(from, fromUp, to, toUp);
        expectNear(r * from.normalized(), toEigen(to).normalized(), 1e-4f);
        expectNear(r * fromUp, toEigen(toUp), 1e-3f);
    }
    // Exactly opposite directions: a half turn about an axis perpendicular to from; for x the
    // first candidate axis (from x x) is zero, so y is used.
    for (const ZmVec3f& from : {ZmVec3f(0, -2, 0), ZmVec3f(0, 0, 3), ZmVec3f(0.5f, 0, 0)}) {
        const ZmRotation opposite(from, -from);
        EXPECT_EQ(opposite[3], 0.0f);
        EXPECT_EQ(ZmVec3f(opposite[0], opposite[1], opposite[2]).dot(from), 0.0f);
        expectNear(opposite * from, -toEigen(from), 1e-6f);
    }
    // Off the axes the dot product of opposite directions often rounds to just above -1; they must
    // still give a unit half turn.
    for (int n = 0; n < 200; ++n) {
        const ZmVec3f from = randomVec(rng);
        const ZmRotation opposite(from, -from);
        EXPECT_NEAR(toEigen(opposite).norm(), 1.0f, 1e-6f) << n;
        expectNear(opposite * from, -toEigen(from), 1e-4f * from.length());
    }
    EXPECT_TRUE(sameBits(ZmRotation(ZmVec3f(1, 0, 0), ZmVec3f(-1, 0, 0)), raw(0, 0, 1, 0)));
    EXPECT_TRUE(sameBits(ZmRotation(ZmVec3f(0, 2, 0), ZmVec3f(0, 3, 0)), ZmRotation::identity()));
}

TEST(ZmRotation, SlerpEndPointsAndMidpoint)
{
    std::mt19937 rng(8);
    for (int n = 0; n < 100; ++n) {
        const ZmRotation a = randomRotation(rng), b = randomRotation(rng);
        EXPECT_TRUE(ZmRotation::slerp(a, b, 0).equals(a, 1e-6f));
        EXPECT_TRUE(ZmRotation::slerp(a, b, 1).equals(b, 1e-6f));
        EXPECT_TRUE(
            ZmRotation::slerp(a, b, 0.3f).equals(fromEigen(toEigen(a).slerp(0.3f, toEigen(b))), 1e-5f));
    }
    const ZmRotation a(0.1f, 0.2f, 0.3f, 0.9f);
    EXPECT_TRUE(sameBits(ZmRotation::slerp(a, raw(-a[0], -a[1], -a[2], -a[3]), 0.5f), a));
}
