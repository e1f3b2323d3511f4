// Orientation letters: hand-worked cases, and random rotations against Eigen and a plain
// re-computation of the dominant patient axes.
#include <zmlib/ZmOrientationLetters.h>

#include <Eigen/Dense>
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>

namespace {

using Mat4 = Eigen::Matrix<float, 4, 4, Eigen::RowMajor>; // the storage order of ZmMat4f

/// Our matrix with upper block \p a (a direction d maps to a^T d) and translation \p t.
ZmMat4f affine(const Eigen::Matrix3f& a, const Eigen::Vector3f& t = Eigen::Vector3f::Zero())
{
    Mat4 e = Mat4::Identity();
    e.topLeftCorner<3, 3>() = a;
    e.block<1, 3>(3, 0) = t.transpose();
    float m[4][4];
    std::memcpy(m, e.data(), sizeof m);
    return ZmMat4f(m);
}

const std::string kLetters = "LRPAHF";
const std::string kOpposites = "RLAPFH";

/// The letter of the largest absolute component of \p d, leaving out axis \p skip.
std::string dominant(const Eigen::Vector3f& d, Eigen::Index skip, Eigen::Index& axis)
{
    Eigen::Vector3f a = d.cwiseAbs();
    if (skip >= 0) {
        a[skip] = -1.0f;
    }
    a.maxCoeff(&axis);
    return std::string(1, (d[axis] < 0 ? kOpposites : kLetters)[size_t(2 * axis)]);
}

Eigen::Vector3f axisOf(const std::string& letter)
{
    const size_t i = kLetters.find(letter);
    return Eigen::Vector3f::Unit(Eigen::Index(i / 2)) * (i % 2 == 0 ? 1.0f : -1.0f);
}

bool near(const ZmVec3f& v, const Eigen::Vector3f& e)
{
    return v.equals(ZmVec3f(e.x(), e.y(), e.z()), 1e-5f);
}

} // namespace

TEST(ZmOrientationLetters, HandWorkedLabelsAndClasses)
{
    const ZmOrientationLetters id(ZmMat4f::identity());
    EXPECT_EQ(id.join('/'), "L/A/R/P");
    EXPECT_TRUE(id.isValid() && id.isAxial() && !id.isCoronal() && !id.isSagittal());
    ZmMat4f cor(0, 0, -1, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 0, 1); // screen x to -z, screen y to +x
    EXPECT_EQ(ZmOrientationLetters(cor).join('/'), "F/R/H/L");
    EXPECT_TRUE(ZmOrientationLetters(cor).isCoronal() && !ZmOrientationLetters(cor).isAxial());
    const ZmOrientationLetters sag("A", "F");
    EXPECT_EQ(sag, ZmOrientationLetters(ZmMat4f(0, -2, 0, 0, 0, 0, -3, 0, 1, 0, 0, 0, 0, 0, 0, 1)));
    EXPECT_EQ(sag.join('/'), "A/H/P/F");
    EXPECT_TRUE(sag.isValid() && sag.isSagittal() && !sag.isAxial() && !sag.isCoronal());
    EXPECT_NE(sag, ZmOrientationLetters("A", "H"));
    // Ties go to the lower axis, screen y may not take screen x's axis, row 3 and column 3 are unused.
    EXPECT_EQ(ZmOrientationLetters(ZmMat4f(0.7f, 0.7f, 0, 5, -0.9f, 0.1f, -0.1f, 0, 0, 0, 1, 0, 1, 2, 3, 2)),
              id);
    // A NaN anywhere counts as the identity; a singular matrix gives labels that isValid() rejects.
    cor[0][1] = std::nanf("0");
    EXPECT_EQ(ZmOrientationLetters(cor), id);
    const ZmOrientationLetters zero(affine(Eigen::Matrix3f::Zero()));
    EXPECT_EQ(zero.join('/'), "L/R/R/L");
    EXPECT_FALSE(zero.isValid());

    const ZmOrientationLetters none;
    EXPECT_EQ(none.join('/'), "///");
    EXPECT_TRUE(!none.isValid() && none.isAxial() && none.isCoronal() &&
                none.isSagittal()); // no letter excludes
    const ZmOrientationLetters oblique("LP", "HA");
    EXPECT_EQ(oblique.join(' '), "LP FP RA HA");
    EXPECT_TRUE(oblique.isValid() && !oblique.isAxial() && !oblique.isCoronal() && !oblique.isSagittal());
    EXPECT_EQ(ZmOrientationLetters("X", "P").left(), "X");
    for (const char* pair : {"L L", "L R", "LP RA", " P", "L ", "X P", "l P"}) {
        const char* space = std::strchr(pair, ' ');
        EXPECT_FALSE(ZmOrientationLetters(std::string(pair, space), space + 1).isValid()) << pair;
    }
}

TEST(ZmOrientationLetters, ViewDirectionOfHandWorkedLabels)
{
    ZmVec3f view;
    ZmVec3f up;
    ZmOrientationLetters("L", "P").getViewDirection(view, up, ZmMat4f::identity(), false);
    EXPECT_TRUE(view == ZmVec3f(0, 0, 1) && up == ZmVec3f(0, -1, 0)); // axial, seen from the feet
    ZmOrientationLetters("L", "F").getViewDirection(view, up, ZmMat4f::identity(), true);
    EXPECT_TRUE(view == ZmVec3f(0, 1, 0) && up == ZmVec3f(0, 0, 1)); // coronal, seen from the front
    ZmOrientationLetters("LP", "H").getViewDirection(view, up, ZmMat4f::identity(), false);
    EXPECT_TRUE(near(view, Eigen::Vector3f(1, -1, 0).normalized()) && up == ZmVec3f(0, 0, -1));
    const ZmMat4f swap(0, 1, 0, 0, -1, 0, 0, 0, 0, 0, 1, 0, 7, 8, 9, 1); // patient x to world y, y to -x
    ZmOrientationLetters("H", "L").getViewDirection(view, up, swap, false);
    EXPECT_TRUE(view == ZmVec3f(-1, 0, 0) && up == ZmVec3f(0, -1, 0)) << view.dump() << up.dump();
    ZmOrientationLetters("H", "L").getViewDirection(view, up, swap, true);
    EXPECT_TRUE(view == ZmVec3f(1, 0, 0) && up == ZmVec3f(0, 1, 0)) << view.dump() << up.dump();
    for (const char* pair : {" P", "L R", "LP PL", "LR P"}) { // invalid, or not spanning a plane
        const char* space = std::strchr(pair, ' ');
        view.setValue(1, 2, 3);
        ZmOrientationLetters(std::string(pair, space), space + 1).getViewDirection(view, up, swap, false);
        EXPECT_FALSE(view.isNumber() || up.isNumber()) << pair;
    }
}

TEST(ZmOrientationLetters, RandomRotationsAgreeWithEigen)
{
    std::mt19937 rng(20240611);
    std::normal_distribution<float> normal;
    std::uniform_real_distribution<float> scale(0.5f, 2.0f);
    auto rotation = [&] {
        return Eigen::Quaternionf(normal(rng), normal(rng), normal(rng), normal(rng))
            .normalized()
            .toRotationMatrix();
    };
    auto vector = [&] { return Eigen::Vector3f(normal(rng), normal(rng), normal(rng)); };
    int classes[3] = {0, 0, 0};
    for (int n = 0; n < 2000; ++n) {
        const Eigen::Matrix3f r = rotation(); // screen x goes to column 0, screen y to column 1
        const ZmOrientationLetters l(affine(r.transpose(), vector()));
        Eigen::Index xAxis = -1;
        Eigen::Index yAxis = -1;
        ASSERT_EQ(l.right(), dominant(r.col(0), -1, xAxis));
        ASSERT_EQ(l.bottom(), dominant(r.col(1), xAxis, yAxis));
        ASSERT_EQ(l.left(), dominant(-r.col(0), -1, xAxis));
        ASSERT_EQ(l.top(), dominant(-r.col(1), xAxis, yAxis));
        ASSERT_TRUE(l.isValid() && xAxis != yAxis);
        ASSERT_EQ(int(l.isAxial()) + int(l.isCoronal()) + int(l.isSagittal()), 1);
        classes[0] += l.isAxial();
        classes[1] += l.isCoronal();
        classes[2] += l.isSagittal();
        ASSERT_EQ(ZmOrientationLetters(l.right(), l.bottom()), l);

        // Three parts, applied in argument order.
        const Eigen::Matrix3f a = rotation() * scale(rng);
        const Eigen::Matrix3f b = rotation();
        const Eigen::Matrix3f c = rotation();
        ASSERT_EQ(ZmOrientationLetters(affine(a), affine(b, vector()), affine(c)),
                  ZmOrientationLetters(affine(a * b * c)));

        // View and up mapped into a world frame by a scaled rotation, or by its inverse.
        const Eigen::Matrix3f t =
            rotation() * Eigen::Vector3f(scale(rng), scale(rng), scale(rng)).asDiagonal();
        const Eigen::Vector3f viewP = axisOf(l.right()).cross(axisOf(l.bottom()));
        const Eigen::Vector3f upP = axisOf(l.top());
        ZmVec3f view;
        ZmVec3f up;
        l.getViewDirection(view, up, affine(t, vector()), false);
        ASSERT_TRUE(near(view, (t.transpose() * viewP).normalized()) &&
                    near(up, (t.transpose() * upP).normalized()));
        const Eigen::Matrix3f inv = t.transpose().inverse();
        l.getViewDirection(view, up, affine(t, vector()), true);
        ASSERT_TRUE(near(view, (inv * viewP).normalized()) && near(up, (inv * upP).normalized()));
    }
    EXPECT_GT(classes[0], 400); // every class turns up in a fair share
    EXPECT_GT(classes[1], 400);
    EXPECT_GT(classes[2], 400);
}
