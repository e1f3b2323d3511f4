#include <zmlib/zmWildMatch.h>

#include <gtest/gtest.h>

#include <fnmatch.h>

#include <random>
#include <string>
#include <vector>

namespace {

bool oracle(const std::string& s, const std::string& p)
{
    return fnmatch(p.c_str(), s.c_str(), 0) == 0;
}

bool wild(const std::string& s, const std::string& p)
{
    const int r = zmWildMatch(s.c_str(), p.c_str());
    EXPECT_TRUE(r == 0 || r == 1) << r;
    return r == 1;
}

// The matcher is a one-restart-point scan that differs from full glob matching in two ways only:
//
//  (A) When the pattern runs out while text is left, it does not go back to the last '*': it
//      accepts if the last pattern byte was '*' or '?' and rejects otherwise. The '?' case accepts
//      too much, the literal case (with a '*' earlier) rejects too much. Either way, what it
//      consumed up to then was a proper prefix of the text matching the whole pattern.
//  (B) When a literal after a '*' fails in the middle of a partly matched segment, it restarts
//      the segment at the next text byte instead of one past where the failed attempt began, so
//      the skipped starts are never tried. This can only happen at a literal that is not the
//      first byte of a segment following a '*'.
//
// Where neither can apply the scan takes exactly the steps of the complete algorithm, so it
// agrees with fnmatch; otherwise every disagreement must come with the trace the leniency needs.
// Patterns are drawn from a, b, '*' and '?' only, so fnmatch (flags 0) has no bracket
// expressions or escapes that the matcher lacks.
struct Shape {
    bool hasStar = false;
    bool endsWithStar = false;
    bool endsWithQuestion = false;
    bool inSegmentLiteral = false; // (B) possible: a literal at offset >= 1 of a segment after '*'
};

Shape shapeOf(const std::string& p)
{
    Shape sh;
    sh.hasStar = p.find('*') != std::string::npos;
    sh.endsWithStar = !p.empty() && p.back() == '*';
    sh.endsWithQuestion = !p.empty() && p.back() == '?';
    bool afterStar = false;
    size_t offset = 0;
    for (char c : p) {
        if (c == '*') {
            afterStar = true;
            offset = 0;
            continue;
        }
        if (afterStar && offset >= 1 && c != '?') {
            sh.inSegmentLiteral = true;
        }
        ++offset;
    }
    return sh;
}

// Some proper prefix of s matches the whole pattern.
bool prefixMatches(const std::string& s, const std::string& p)
{
    for (size_t k = 0; k < s.size(); ++k) {
        if (oracle(s.substr(0, k), p)) {
            return true;
        }
    }
    return false;
}

struct Tally {
    long exactDomain = 0;
    long questionLenient = 0;
    long prefixRejected = 0;
    long restartRejected = 0;
};

::testing::AssertionResult explained(const std::string& s, const std::string& p, Tally& tally)
{
    const bool got = wild(s, p);
    const bool want = oracle(s, p);
    const Shape sh = shapeOf(p);
    const auto fail = [&](const char* why) {
        return ::testing::AssertionFailure() << "text '" << s << "' pattern '" << p << "': zmWildMatch "
                                             << got << ", fnmatch " << want << ": " << why;
    };

    if (!sh.hasStar) {
        // Byte by byte; the only leniency is a pattern ending in '?' accepting what is left.
        const bool expected =
            want || (sh.endsWithQuestion && s.size() > p.size() && oracle(s.substr(0, p.size()), p));
        if (got != expected) {
            return fail("star-free pattern");
        }
        tally.questionLenient += got != want;
        tally.exactDomain += !sh.endsWithQuestion;
        return ::testing::AssertionSuccess();
    }
    if (sh.endsWithStar && !sh.inSegmentLiteral) {
        ++tally.exactDomain;
        return got == want ? ::testing::AssertionSuccess() : fail("neither leniency applies");
    }
    if (got == want) {
        return ::testing::AssertionSuccess();
    }
    if (got) {
        if (!sh.endsWithQuestion || !prefixMatches(s, p)) {
            return fail("accepted without a '?'-ended pattern matching a proper prefix");
        }
        ++tally.questionLenient;
    } else if (!sh.endsWithStar && prefixMatches(s, p)) {
        ++tally.prefixRejected; // (A): stopped when the pattern ran out
    } else if (sh.inSegmentLiteral) {
        ++tally.restartRejected; // (B)
    } else {
        return fail("rejected without either leniency being possible");
    }
    return ::testing::AssertionSuccess();
}

} // namespace

TEST(zmWildMatch, PlainAndLenientCases)
{
    EXPECT_EQ(zmWildMatch("abc", "a?"), 1);  // pattern used up on '?': the rest is accepted
    EXPECT_EQ(zmWildMatch("aab", "*ab"), 0); // the failing byte is not retried
    EXPECT_EQ(zmWildMatch("", "*"), 1);
    EXPECT_EQ(zmWildMatch("abc", ""), 0);
    EXPECT_EQ(zmWildMatch("", ""), 1);
    EXPECT_EQ(zmWildMatch("abc", "a*"), 1);
    EXPECT_EQ(zmWildMatch("abc", "a*c"), 1);
    EXPECT_EQ(zmWildMatch("abc", "*"), 1);
    EXPECT_EQ(zmWildMatch("abc", "abc"), 1);
    EXPECT_EQ(zmWildMatch("abab", "*ab"), 0); // the first 'ab' uses the pattern up, no going back
    EXPECT_EQ(zmWildMatch("xaxyz", "*a?"), 1);
}

TEST(zmWildMatch, QuestionMarkTakesExactlyOneByte)
{
    EXPECT_EQ(zmWildMatch("a", "?"), 1);
    EXPECT_EQ(zmWildMatch("", "?"), 0);
    EXPECT_EQ(zmWildMatch("ab", "a??"), 0);
    EXPECT_EQ(zmWildMatch("abc", "a?c"), 1);
    EXPECT_EQ(zmWildMatch("ac", "a?c"), 0);
    EXPECT_EQ(zmWildMatch("\xff", "?"), 1);
    EXPECT_EQ(zmWildMatch("abcd", "?b?d"), 1);
}

TEST(zmWildMatch, CaseSensitiveLiteralBytes)
{
    EXPECT_EQ(zmWildMatch("ABC", "abc"), 0);
    EXPECT_EQ(zmWildMatch("abc", "a?C"), 0);
    EXPECT_EQ(zmWildMatch("File.TXT", "*.txt"), 0);
    EXPECT_EQ(zmWildMatch("file.txt", "*.txt"), 1);
    EXPECT_EQ(zmWildMatch("\xe9t\xe9", "\xe9*"), 1);
    EXPECT_EQ(zmWildMatch("[a]", "[a]"), 1); // no bracket expressions
    EXPECT_EQ(zmWildMatch("a", "[a]"), 0);
    EXPECT_EQ(zmWildMatch("a\\b", "a\\b"), 1); // no escapes
}

TEST(zmWildMatch, RunsOfStarsActAsOne)
{
    EXPECT_EQ(zmWildMatch("", "**"), 1);
    EXPECT_EQ(zmWildMatch("abc", "a**c"), 1);
    EXPECT_EQ(zmWildMatch("abc", "***"), 1);
    EXPECT_EQ(zmWildMatch("abc", "**b**"), 1);
    EXPECT_EQ(zmWildMatch("abc", "**d**"), 0);
    EXPECT_EQ(zmWildMatch("ac", "a***?"), 1);
    EXPECT_EQ(zmWildMatch("a", "a***?"), 0);
}

TEST(zmWildMatch, PropertyExhaustiveSmallCasesAgainstFnmatch)
{
    // Every pattern over {a,b,*,?} up to 5 bytes against every text over {a,b} up to 7 bytes.
    std::vector<std::string> patterns{""};
    for (size_t k = 0; k < patterns.size(); ++k) {
        if (patterns[k].size() < 5) {
            for (char c : {'a', 'b', '*', '?'}) {
                patterns.push_back(patterns[k] + c);
            }
        }
    }
    std::vector<std::string> texts{""};
    for (size_t k = 0; k < texts.size(); ++k) {
        if (texts[k].size() < 7) {
            texts.push_back(texts[k] + 'a');
            texts.push_back(texts[k] + 'b');
        }
    }
    ASSERT_EQ(patterns.size(), 1365u);
    ASSERT_EQ(texts.size(), 255u);
    Tally tally;
    for (const std::string& p : patterns) {
        for (const std::string& s : texts) {
            ASSERT_TRUE(explained(s, p, tally));
        }
    }
    // Each kind of difference shows up, and the exactly-agreeing domain is well populated.
    EXPECT_GT(tally.exactDomain, 100000);
    EXPECT_GT(tally.questionLenient, 0);
    EXPECT_GT(tally.prefixRejected, 0);
    EXPECT_GT(tally.restartRejected, 0);
}

TEST(zmWildMatch, PropertyRandomLongerCasesAgainstFnmatch)
{
    std::mt19937 rng(8008);
    Tally tally;
    for (int iter = 0; iter < 100000; ++iter) {
        std::string p(rng() % 11, ' ');
        for (char& c : p) {
            c = "ab*?"[rng() % 4];
        }
        std::string s(rng() % 17, ' ');
        for (char& c : s) {
            c = "aabbc"[rng() % 5];
        }
        ASSERT_TRUE(explained(s, p, tally));
    }
    EXPECT_GT(tally.exactDomain, 1000);
    EXPECT_GT(tally.questionLenient, 0);
    EXPECT_GT(tally.prefixRejected, 0);
    EXPECT_GT(tally.restartRejected, 0);
}
