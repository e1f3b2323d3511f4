#include <zmlib/StringUtils.h>

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>

TEST(StringUtils, ToLongBasesAndSigns)
{
    const struct {
        const char* in;
        long value;
    } good[] = {{"0x10", 16},
                {"0X1f", 31},
                {"010", 8},
                {"0", 0},
                {"-0x10", -16},
                {"+5", 5},
                {"-5", -5},
                {" 12", 12},
                {"\t\n12", 12},
                {"-017", -15},
                {"2147483648", 2147483648L}};
    for (const auto& c : good) {
        bool ok = false;
        EXPECT_EQ(StringUtils::toLong(c.in, 7, &ok), c.value) << "'" << c.in << "'";
        EXPECT_TRUE(ok) << "'" << c.in << "'";
        EXPECT_EQ(StringUtils::toLong(c.in, 7), c.value) << "'" << c.in << "'";
    }
    // Leading white space is consumed by the runtime parser; anything left over is not.
    for (const char* in : {"12 ", "12\n", "", "  ", "09", "0x", "12abc", "+", "-", "1.5", "0x1g", " - 1"}) {
        bool ok = true;
        EXPECT_EQ(StringUtils::toLong(in, 7, &ok), 7) << "'" << in << "'";
        EXPECT_FALSE(ok) << "'" << in << "'";
    }
    bool ok = true;
    EXPECT_EQ(StringUtils::toLong(nullptr, 7, &ok), 7);
    EXPECT_FALSE(ok);
    EXPECT_EQ(StringUtils::toLong(nullptr, -3), -3);

    // Out of range: the runtime's clamped value, still a parse of the whole text.
    ok = false;
    EXPECT_EQ(StringUtils::toLong("99999999999999999999", 7, &ok), LONG_MAX);
    EXPECT_TRUE(ok);
    EXPECT_EQ(StringUtils::toLong("-99999999999999999999", 7, &ok), LONG_MIN);
    EXPECT_TRUE(ok);
}

TEST(StringUtils, ToULongBasesAndRange)
{
    bool ok = false;
    EXPECT_EQ(StringUtils::toULong("0xffffffffffffffff", 1, &ok), ULONG_MAX);
    EXPECT_TRUE(ok);
    EXPECT_EQ(StringUtils::toULong("0777", 1, &ok), 511ul);
    EXPECT_TRUE(ok);
    EXPECT_EQ(StringUtils::toULong("42", 1, &ok), 42ul);
    EXPECT_TRUE(ok);
    EXPECT_EQ(StringUtils::toULong("-1", 1, &ok), ULONG_MAX); // the runtime negates in unsigned
    EXPECT_TRUE(ok);
    EXPECT_EQ(StringUtils::toULong("1 ", 9, &ok), 9ul);
    EXPECT_FALSE(ok);
    EXPECT_EQ(StringUtils::toULong("", 9, &ok), 9ul);
    EXPECT_FALSE(ok);
    EXPECT_EQ(StringUtils::toULong(nullptr, 9, &ok), 9ul);
    EXPECT_FALSE(ok);
    EXPECT_EQ(StringUtils::toULong(nullptr, 9), 9ul);
}

TEST(StringUtils, ToDoubleWholeTextOnly)
{
    const struct {
        const char* in;
        double value;
    } good[] = {{"1.5", 1.5}, {"-2.5e3", -2500.0}, {"0x1p4", 16.0}, {".5", 0.5},
                {"5.", 5.0},  {" 3", 3.0},         {"+0", 0.0},     {"1E-2", 0.01}};
    for (const auto& c : good) {
        bool ok = false;
        EXPECT_DOUBLE_EQ(StringUtils::toDouble(c.in, 1.5, &ok), c.value) << "'" << c.in << "'";
        EXPECT_TRUE(ok) << "'" << c.in << "'";
    }
    for (const char* in : {".", "1e", "3 ", "", " ", "1,5", "e5", "0x", "--1"}) {
        bool ok = true;
        EXPECT_EQ(StringUtils::toDouble(in, 1.5, &ok), 1.5) << "'" << in << "'";
        EXPECT_FALSE(ok) << "'" << in << "'";
    }
    bool ok = false;
    EXPECT_TRUE(std::isinf(StringUtils::toDouble("inf", 1.5, &ok)));
    EXPECT_TRUE(ok);
    EXPECT_TRUE(std::isnan(StringUtils::toDouble("nan", 1.5, &ok)));
    EXPECT_TRUE(ok);
    EXPECT_TRUE(std::signbit(StringUtils::toDouble("-0", 1.5, &ok)));
    EXPECT_TRUE(ok);

    ok = true;
    EXPECT_EQ(StringUtils::toDouble(nullptr, 1.5, &ok), 1.5);
    EXPECT_FALSE(ok);
    EXPECT_EQ(StringUtils::toDouble(nullptr, 1.5), 1.5);
}

// The oracle is the runtime parser itself plus the rule that it must consume something and
// everything.
TEST(StringUtils, PropertyAgreesWithRuntimeParsersOnRandomTexts)
{
    std::mt19937 rng(9009);
    const std::string alphabet = "0123456789abcdefxX+-. \teEpni";
    int accepted = 0;
    for (int iter = 0; iter < 50000; ++iter) {
        std::string s(rng() % 7, ' ');
        for (char& c : s) {
            c = alphabet[rng() % alphabet.size()];
        }
        const char* in = s.c_str();
        char* end = nullptr;

        const long l = std::strtol(in, &end, 0);
        const bool lOk = end != in && *end == 0;
        bool ok = !lOk;
        ASSERT_EQ(StringUtils::toLong(in, -77, &ok), lOk ? l : -77) << "'" << s << "'";
        ASSERT_EQ(ok, lOk) << "'" << s << "'";
        ASSERT_EQ(StringUtils::toLong(in, -77), lOk ? l : -77) << "'" << s << "'";
        accepted += lOk;

        const unsigned long u = std::strtoul(in, &end, 0);
        const bool uOk = end != in && *end == 0;
        ok = !uOk;
        ASSERT_EQ(StringUtils::toULong(in, 77, &ok), uOk ? u : 77ul) << "'" << s << "'";
        ASSERT_EQ(ok, uOk) << "'" << s << "'";

        const double d = std::strtod(in, &end);
        const bool dOk = end != in && *end == 0;
        ok = !dOk;
        const double want = dOk ? d : -0.25;
        const double got = StringUtils::toDouble(in, -0.25, &ok);
        ASSERT_EQ(std::memcmp(&got, &want, sizeof got), 0) << "'" << s << "': " << got << " vs " << want;
        ASSERT_EQ(ok, dOk) << "'" << s << "'";
        accepted += dOk;
    }
    EXPECT_GT(accepted, 1000); // the texts reach the accepting side often enough to matter
}
