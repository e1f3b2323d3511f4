#include "../../fuzz/ModelVersion.h"

#include <zmlib/ZmVersion.h>

#include <gtest/gtest.h>

#include <array>
#include <climits>
#include <random>
#include <sstream>
#include <string>

namespace {

// Opens up the protected helper.
struct Version : ZmVersion {
    using ZmVersion::firstMismatchingValues;
    using ZmVersion::ZmVersion;
};

std::array<unsigned, 4> valuesOf(const ZmVersion& v)
{
    return {v.majorVersion(), v.minorVersion(), v.patchLevel(), v.buildNumber()};
}

} // namespace

TEST(ZmVersion, ParsesTextsExactly)
{
    using A = std::array<unsigned, 4>;
    const struct {
        std::string text;
        A expected;
    } cases[] = {
        {"7", {7, 0, 0, 0}},
        {"7.1", {7, 1, 0, 0}},
        {"7.1.12.2311", {7, 1, 12, 2311}},
        {"7.1.12.2311.", {7, 1, 12, 2311}},
        {"7.1.12.2311.beta 3", {7, 1, 12, 2311}},
        {"7.1.12.2311x", {}},
        {"7.1.", {}},
        {"7.1-beta", {}},
        {"7.1x", {}},
        {"", {}},
        {".7", {}},
        {"7..1", {}},
        {" 7. 1.\t2", {7, 1, 2, 0}},
        {"7 .1", {}},
        {"7.1 ", {}},
        {"007.010", {7, 10, 0, 0}},
        {"+7", {}},
        {"-1", {}},
        {"0x10", {}},
        {"4294967295.0.0.4294967295", {UINT_MAX, 0, 0, UINT_MAX}},
        {"1.4294967296", {}},
        {"1.99999999999999999999999", {}},
        {std::string("7.1\0", 4), {}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(valuesOf(ZmVersion(c.text)), c.expected) << '"' << c.text << '"';
    }
}

TEST(ZmVersion, PrintsAllFourValues)
{
    EXPECT_EQ(ZmVersion("7.1").toString(), "7.1.0.0");
    EXPECT_EQ(ZmVersion().toString(), "0.0.0.0");
    EXPECT_EQ(ZmVersion(4294967295u, 0, 12, 2311).toString(), "4294967295.0.12.2311");
    EXPECT_EQ(ZmVersion(4294967295u, 0, 12, 2311).asZmVec4i(), ZmVec4i(-1, 0, 12, 2311));
}

TEST(ZmVersion, ParseAgreesWithStreamExtraction)
{
    // Texts built mostly like versions, with every step disturbed now and then: numbers (leading
    // zeros, the 32-bit limit and beyond), white space before them, missing or foreign separators,
    // trailing dots and a zero byte.
    const std::string numbers[] = {"0", "7", "12", "2311", "007", "4294967295", "4294967296"};
    const std::string noise[] = {" ", "\t", "\n", "x", ".", "..", std::string(1, '\0'), ""};
    std::mt19937 rng(20240611);
    std::uniform_int_distribution<size_t> pickNumber(0, std::size(numbers) - 1);
    std::uniform_int_distribution<size_t> pickNoise(0, std::size(noise) - 1);
    std::uniform_int_distribution<int> count(0, 6);
    std::uniform_int_distribution<int> percent(0, 99);
    int nonNull = 0;
    for (int i = 0; i < 20000; ++i) {
        std::string text;
        for (int n = count(rng); n > 0; --n) {
            if (percent(rng) < 15) {
                text += noise[pickNoise(rng)];
            }
            text += numbers[pickNumber(rng)];
            text += percent(rng) < 85 ? std::string(".") : noise[pickNoise(rng)];
        }
        if (!text.empty() && percent(rng) < 60) {
            text.pop_back();
        }
        const ZmVersion v(text);
        ASSERT_EQ(valuesOf(v), model::streamParseVersion(text)) << '"' << text << '"';
        nonNull += v.isNull() ? 0 : 1;
        const std::string printed = v.toString();
        ASSERT_EQ(printed, std::to_string(v.majorVersion()) + "." + std::to_string(v.minorVersion()) + "." +
                               std::to_string(v.patchLevel()) + "." + std::to_string(v.buildNumber()));
        ASSERT_EQ(ZmVersion(printed), v) << printed;
    }
    // Both outcomes must be well represented, or the comparison says little.
    EXPECT_GT(nonNull, 4000);
    EXPECT_LT(nonNull, 16000);
}

TEST(ZmVersion, OrderOfKnownVersions)
{
    const ZmVersion a("7.1.12.0");
    const ZmVersion b("7.1.12.2311");
    const ZmVersion c("7.2.0.0");
    EXPECT_TRUE(a < b && b < c && a < c);
    EXPECT_TRUE(b.isBetween(ZmVersion("7.1.0.0"), b));
    EXPECT_TRUE(b.isBetween(b, b));
    EXPECT_FALSE(c.isBetween(a, b));
    EXPECT_FALSE(b.isBetween(c, a));
    EXPECT_TRUE(a.sameMajorMinor(b));
    EXPECT_FALSE(b.sameMajorMinor(c));
    // Values compare as unsigned: the top bit set is larger, not negative.
    EXPECT_LT(ZmVersion(1, 0, 0, 0), ZmVersion(0x80000000u, 0, 0, 0));
}

TEST(ZmVersion, ComparisonsMatchLexicographicOrder)
{
    const unsigned sample[] = {0, 1, 2, 0x7fffffffu, 0x80000000u, UINT_MAX};
    std::mt19937 rng(99);
    std::uniform_int_distribution<size_t> pick(0, std::size(sample) - 1);
    auto draw = [&] {
        return std::array<unsigned, 4>{sample[pick(rng)], sample[pick(rng)], sample[pick(rng)],
                                       sample[pick(rng)]};
    };
    for (int i = 0; i < 5000; ++i) {
        const std::array<unsigned, 4> x = draw();
        // Often share a prefix with x so that later positions decide.
        std::array<unsigned, 4> y = draw();
        const size_t shared = pick(rng) % 5;
        for (size_t k = 0; k < shared; ++k) {
            y[k] = x[k];
        }
        Version a(x[0], x[1], x[2], x[3]);
        ZmVersion b;
        b.setValues(y);
        ASSERT_EQ(a == b, x == y);
        ASSERT_EQ(a != b, x != y);
        ASSERT_EQ(a < b, x < y);
        ASSERT_EQ(a <= b, x <= y);
        ASSERT_EQ(a > b, x > y);
        ASSERT_EQ(a >= b, x >= y);
        ASSERT_EQ(a.sameMajorMinor(b), x[0] == y[0] && x[1] == y[1]);
        std::pair<unsigned, unsigned> expected(0, 0);
        for (size_t k = 0; k < 4; ++k) {
            if (x[k] != y[k]) {
                expected = {x[k], y[k]};
                break;
            }
        }
        ASSERT_EQ(a.firstMismatchingValues(b), expected);
    }
}

TEST(ZmVersion, SettersAndNull)
{
    ZmVersion v;
    EXPECT_TRUE(v.isNull());
    v.setBuildNumber(4);
    EXPECT_FALSE(v.isNull());
    v.setMajorVersion(1);
    v.setMinorVersion(2);
    v.setPatchLevel(3);
    EXPECT_EQ(valuesOf(v), (std::array<unsigned, 4>{1, 2, 3, 4}));
    v.setValues(5, 6, 7, 8);
    EXPECT_EQ(v.toString(), "5.6.7.8");
    v.makeNull();
    EXPECT_TRUE(v.isNull());
    EXPECT_EQ(v, ZmVersion("0.0.0.0"));
}
