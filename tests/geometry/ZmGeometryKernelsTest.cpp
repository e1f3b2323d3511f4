// The portable kernels (what other architectures run) against the SSE2 ones, bit for bit.
#include <zmlib/ZmGeometryKernels_p.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <random>

#if ZM_GEOMETRY_SSE2
namespace {

// Random floats of mixed magnitudes and signs, with zeros, plus the exact values of affine rows.
float draw(std::mt19937& rng)
{
    const uint32_t kind = rng() % 8;
    if (kind == 0) {
        return 0.0f;
    }
    std::uniform_real_distribution<float> unit(-1.0f, 1.0f);
    const float scale = kind < 5 ? 1.0f : (kind == 5 ? 1e-6f : (kind == 6 ? 1e4f : 1e-20f));
    return unit(rng) * scale;
}

bool sameBits(const float* a, const float* b, int n)
{
    return std::memcmp(a, b, sizeof(float) * size_t(n)) == 0;
}

} // namespace

TEST(ZmGeometryKernels, PortableFormsGiveTheSameBitsAsSse2)
{
    std::mt19937 rng(20261124);
    int singular = 0;
    for (int trial = 0; trial < 200000; ++trial) {
        float m[16];
        for (float& v : m) {
            v = draw(rng);
        }
        if (trial % 2 == 0) { // affine, the case callers pass
            m[3] = m[7] = m[11] = 0.0f;
            m[15] = 1.0f;
        }
        if (trial % 97 == 0) { // a singular upper block: two equal rows
            std::memcpy(m + 4, m, 3 * sizeof(float));
        }
        float scalar[16] = {}, simd[16] = {};
        const int rs = ZmGeometryKernels::affineInverseScalar(m, scalar);
        const int rv = ZmGeometryKernels::affineInverseSse2(m, simd);
        ASSERT_EQ(rs, rv) << trial;
        singular += rs == 0;
        ASSERT_TRUE(sameBits(scalar, simd, 16)) << trial;

        float a[4], b[4], cs[4], cv[4], ns[4], nv[4];
        for (int i = 0; i < 4; ++i) {
            a[i] = draw(rng);
            b[i] = draw(rng);
        }
        ZmGeometryKernels::composeScalar(a, b, cs);
        ZmGeometryKernels::composeSse2(a, b, cv);
        ASSERT_TRUE(sameBits(cs, cv, 4)) << trial;
        ZmGeometryKernels::normalizedScalar(a, ns);
        ZmGeometryKernels::normalizedSse2(a, nv);
        ASSERT_TRUE(sameBits(ns, nv, 4)) << trial;
    }
    EXPECT_GT(singular, 2000); // the singular path was taken, not just the regular one
}
#else
TEST(ZmGeometryKernels, PortableFormsGiveTheSameBitsAsSse2)
{
    GTEST_SKIP() << "no SSE2 on this target: the portable kernels are the only ones (the geometry "
                    "tests exercise them)";
}
#endif
