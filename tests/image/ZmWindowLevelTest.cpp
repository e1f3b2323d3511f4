#include <zmlib/ZmWindowLevel.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <tuple>
#include <vector>

namespace {

using Texts = std::array<std::string, 3>;
using Preset = std::tuple<std::string, std::string, std::string>;

ZmWindowLevelTagGroup group(const std::string& c, const std::string& w, const std::string& e)
{
    return ZmWindowLevelTagGroup(Texts{c, w, e});
}

// The texts of each preset, for exact comparisons (operator== compares numbers).
std::vector<Preset> textsOf(const std::vector<ZmWindowLevel>& list)
{
    std::vector<Preset> out;
    out.reserve(list.size());
    for (const ZmWindowLevel& p : list) {
        out.emplace_back(p.centerString(), p.widthString(), p.explanation());
    }
    return out;
}

uint32_t bitsOf(float f)
{
    uint32_t u;
    std::memcpy(&u, &f, sizeof u);
    return u;
}

} // namespace

TEST(ZmWindowLevel, CreateFromTagsPairsValuesByIndex)
{
    EXPECT_EQ(textsOf(ZmWindowLevel::createFromTags(group("40\\400", "80\\2000", "SOFT\\BONE"))),
              (std::vector<Preset>{{"40", "80", "SOFT"}, {"400", "2000", "BONE"}}));
    EXPECT_EQ(textsOf(ZmWindowLevel::createFromTags(group("40\\400", "80\\2000", "SOFT"))),
              (std::vector<Preset>{{"40", "80", "SOFT"}, {"400", "2000", ""}}));
    // Texts stay exactly as written, surrounding blanks included.
    EXPECT_EQ(textsOf(ZmWindowLevel::createFromTags(group(" 40.0", "80 ", "Soft Tissue"))),
              (std::vector<Preset>{{" 40.0", "80 ", "Soft Tissue"}}));
    // A pair with an empty value is dropped and its explanation with it.
    EXPECT_EQ(textsOf(ZmWindowLevel::createFromTags(group("40\\\\400\\", "80\\90\\2000\\5", "A\\B\\C\\D"))),
              (std::vector<Preset>{{"40", "80", "A"}, {"400", "2000", "C"}}));
    // Explanations beyond the pairs are ignored.
    EXPECT_EQ(textsOf(ZmWindowLevel::createFromTags(group("1", "2", "A\\B"))),
              (std::vector<Preset>{{"1", "2", "A"}}));
}

TEST(ZmWindowLevel, CreateFromTagsGivesNothingForUnmatchedCounts)
{
    EXPECT_TRUE(ZmWindowLevel::createFromTags(group("40\\400", "80", "SOFT\\BONE")).empty());
    EXPECT_TRUE(ZmWindowLevel::createFromTags(group("40", "80\\", "")).empty());
    EXPECT_TRUE(ZmWindowLevel::createFromTags(group("", "", "")).empty());
    EXPECT_TRUE(ZmWindowLevel::createFromTags(group("", "80", "X")).empty());
    EXPECT_TRUE(ZmWindowLevel::createFromTags(ZmWindowLevelTagGroup()).empty());
    EXPECT_TRUE(ZmWindowLevel::createFromTags(group("\\", "\\", "A\\B")).empty());
}

TEST(ZmWindowLevel, ToTagsJoinsWithSeparators)
{
    const std::vector<ZmWindowLevel> two{ZmWindowLevel("40", "80", "SOFT"),
                                         ZmWindowLevel("400", "2000", "BONE")};
    EXPECT_EQ(ZmWindowLevel::toTags(two).toArray(), (Texts{"40\\400", "80\\2000", "SOFT\\BONE"}));
    const std::vector<ZmWindowLevel> three{ZmWindowLevel("1", "2", "A"), ZmWindowLevel("3", "4"),
                                           ZmWindowLevel("5", "6", "")};
    EXPECT_EQ(ZmWindowLevel::toTags(three).toArray(), (Texts{"1\\3\\5", "2\\4\\6", "A\\\\"}));
    EXPECT_EQ(ZmWindowLevel::toTags({}).toArray(), (Texts{"", "", ""}));
    EXPECT_EQ(ZmWindowLevelTagGroup().toArray(), (Texts{"", "", ""}));
}

TEST(ZmWindowLevel, TagsRoundTripKeepsTexts)
{
    // Any list of presets with non-empty centre and width and no separator in any text comes back
    // unchanged through the tags.
    const char alphabet[] = "0123456789.-+eE abcXYZ";
    std::mt19937 rng(4711);
    std::uniform_int_distribution<int> len(0, 6);
    std::uniform_int_distribution<size_t> ch(0, sizeof alphabet - 2);
    auto text = [&](int minLength) {
        std::string s(std::max(minLength, len(rng)), ' ');
        for (char& c : s) {
            c = alphabet[ch(rng)];
        }
        return s;
    };
    for (int round = 0; round < 500; ++round) {
        std::vector<ZmWindowLevel> list;
        for (int n = len(rng); n > 0; --n) {
            list.emplace_back(text(1), text(1), text(0));
        }
        const ZmWindowLevelTagGroup tags = ZmWindowLevel::toTags(list);
        ASSERT_EQ(textsOf(ZmWindowLevel::createFromTags(tags)), textsOf(list));
        // The tags hold n values each (n - 1 separators), or nothing at all.
        for (const std::string& t : tags.toArray()) {
            ASSERT_EQ(list.empty() ? 0 : std::count(t.begin(), t.end(), '\\') + 1,
                      static_cast<long>(list.size()));
        }
    }
}

TEST(ZmWindowLevel, NumericAccessReadsLeadingNumber)
{
    ZmWindowLevel p("40", "-1024.5", "x");
    EXPECT_EQ(p.center(), 40.0f);
    EXPECT_EQ(p.width(), -1024.5f);
    p.setCenter(std::string("12.5mm"));
    p.setWidth(std::string(" 1e3"));
    EXPECT_EQ(p.center(), 12.5f);
    EXPECT_EQ(p.width(), 1000.0f);
    p.setCenter(std::string(""));
    p.setWidth(std::string("abc"));
    EXPECT_EQ(p.center(), 0.0f);
    EXPECT_EQ(p.width(), 0.0f);
    EXPECT_EQ(ZmWindowLevel().centerString(), "");
    EXPECT_EQ(ZmWindowLevel().explanation(), "");
    p.setExplanation("Lung");
    EXPECT_EQ(p.explanation(), "Lung");
}

TEST(ZmWindowLevel, FloatsBecomeShortTexts)
{
    const std::pair<float, const char*> cases[] = {
        {40.0f, "40"}, {100.0f, "100"},   {-1024.0f, "-1024"}, {1500.5f, "1500.5"},
        {0.1f, "0.1"}, {1e20f, "1e+20"},  {1e-5f, "1e-05"},    {0.0f, "0"},
        {-0.0f, "-0"}, {INFINITY, "inf"}, {-INFINITY, "-inf"},
    };
    for (const auto& [value, text] : cases) {
        EXPECT_EQ(ZmWindowLevel(value, value, "e").centerString(), text) << value;
        ZmWindowLevel p;
        p.setWidth(value);
        EXPECT_EQ(p.widthString(), text) << value;
    }
    const ZmWindowLevel n(NAN, 1.0f, "NaN");
    EXPECT_TRUE(std::isnan(n.center()));
    EXPECT_EQ(n.explanation(), "NaN");
}

TEST(ZmWindowLevel, FloatTextsReadBackExactly)
{
    std::mt19937 rng(2024);
    for (int i = 0; i < 20000; ++i) {
        const uint32_t bits = static_cast<uint32_t>(rng());
        float f;
        std::memcpy(&f, &bits, sizeof f);
        if (std::isnan(f)) {
            continue;
        }
        ZmWindowLevel p;
        p.setCenter(f);
        const std::string text = p.centerString();
        ASSERT_LE(text.size(), 16u) << text;
        ASSERT_EQ(bitsOf(static_cast<float>(std::strtod(text.c_str(), nullptr))), bits) << text;
        ASSERT_EQ(bitsOf(p.center()), bits) << text;
    }
}

TEST(ZmWindowLevel, EqualityIsNumericForValuesExactForExplanation)
{
    EXPECT_EQ(ZmWindowLevel("40", "80", "SOFT"), ZmWindowLevel("40.0", "8e1", "SOFT"));
    EXPECT_NE(ZmWindowLevel("40", "80", "SOFT"), ZmWindowLevel("40", "80", "soft"));
    EXPECT_NE(ZmWindowLevel("40", "80", "SOFT"), ZmWindowLevel("40", "80", "SOFT "));
    EXPECT_NE(ZmWindowLevel("40", "80", ""), ZmWindowLevel("41", "80", ""));
    EXPECT_NE(ZmWindowLevel("40", "80", ""), ZmWindowLevel("40", "81", ""));
    // Compared as double, not as the float that center() gives.
    EXPECT_NE(ZmWindowLevel("0.1", "1", ""), ZmWindowLevel("0.10000000149011612", "1", ""));
    // Texts that are no numbers read as 0 and so compare equal to 0.
    EXPECT_EQ(ZmWindowLevel("abc", "", ""), ZmWindowLevel("0", "0.0", ""));
    const ZmWindowLevel nan("nan", "1", "");
    EXPECT_NE(nan, nan);
}

TEST(ZmWindowLevel, MergeCollapsesEqualNeighboursOnly)
{
    const ZmWindowLevel A("40", "80", "A");
    const ZmWindowLevel A2("40.0", "80", "A");
    const ZmWindowLevel B("400", "2000", "B");
    const ZmWindowLevel C("-600", "1500", "C");
    EXPECT_EQ(textsOf(ZmWindowLevel::merge({A, B}, {B, C})), textsOf({A, B, C}));
    EXPECT_EQ(textsOf(ZmWindowLevel::merge({A, B}, {C, A})), textsOf({A, B, C, A}));
    // A run keeps its first member's texts.
    EXPECT_EQ(textsOf(ZmWindowLevel::merge({A, A2}, {A2, A, B})), textsOf({A, B}));
    EXPECT_EQ(textsOf(ZmWindowLevel::merge({}, {B, B})), textsOf({B}));
    EXPECT_TRUE(ZmWindowLevel::merge({}, {}).empty());
}

TEST(ZmWindowLevel, MergeMatchesUniqueOfConcatenation)
{
    const std::vector<ZmWindowLevel> pool{ZmWindowLevel("40", "80", "A"), ZmWindowLevel("40.00", "80", "A"),
                                          ZmWindowLevel("40", "80", "B"), ZmWindowLevel("40", "81", "A"),
                                          ZmWindowLevel("nan", "80", "A")};
    std::mt19937 rng(31337);
    std::uniform_int_distribution<size_t> pick(0, pool.size() - 1);
    std::uniform_int_distribution<int> len(0, 6);
    for (int round = 0; round < 2000; ++round) {
        std::vector<ZmWindowLevel> a;
        std::vector<ZmWindowLevel> b;
        for (int n = len(rng); n > 0; --n) {
            a.push_back(pool[pick(rng)]);
        }
        for (int n = len(rng); n > 0; --n) {
            b.push_back(pool[pick(rng)]);
        }
        std::vector<ZmWindowLevel> expected = a;
        expected.insert(expected.end(), b.begin(), b.end());
        expected.erase(std::unique(expected.begin(), expected.end()), expected.end());
        ASSERT_EQ(textsOf(ZmWindowLevel::merge(a, b)), textsOf(expected));
    }
}
