#include <zmlib/ZmStdStringTokenizer.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>
#include <zmlib/ZmStringTokenizerGeneral.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <random>
#include <string>
#include <vector>

namespace {

using Tokens = std::vector<std::string>;

std::string text(const ZmString& s)
{
    return std::string(s.getString(), size_t(s.length()));
}

Tokens drain(ZmStringTokenizer& t)
{
    Tokens out;
    while (t.hasMoreTokens()) {
        out.push_back(text(t.nextToken()));
    }
    return out;
}

Tokens tokens(const char* s)
{
    ZmStringTokenizer t(s);
    return drain(t);
}

Tokens tokens(const char* s, const char* delims)
{
    ZmStringTokenizerGeneral t(s, delims);
    return drain(t);
}

Tokens stdTokens(const std::string& s, const char* delims)
{
    ZmStdStringTokenizer t(s, delims);
    Tokens out;
    while (t.hasMoreTokens()) {
        std::string tok;
        t.nextToken(tok);
        out.push_back(tok);
    }
    return out;
}

// A byte the tokenizer and protect() both treat as white space.
bool isWhite(char c)
{
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

} // namespace

// --- ZmStringTokenizer -----------------------------------------------------------------------

TEST(ZmStringTokenizer, SplitsOnWhiteSpaceAndSkipsItAtBothEnds)
{
    EXPECT_EQ(tokens("a b"), (Tokens{"a", "b"}));
    EXPECT_EQ(tokens(" \t a \n\v\f\r bc  "), (Tokens{"a", "bc"}));
    EXPECT_EQ(tokens(""), Tokens{});
    EXPECT_EQ(tokens(" \t\n "), Tokens{});
    EXPECT_EQ(tokens("\xa0x\x85"), (Tokens{"\xa0x\x85"})); // not white space in the C locale

    ZmStringTokenizer t("one  ");
    EXPECT_TRUE(t.hasMoreTokens());
    EXPECT_EQ(text(t.nextToken()), "one");
    EXPECT_FALSE(t.hasMoreTokens());    // only delimiters were left
    EXPECT_EQ(text(t.nextToken()), ""); // exhausted: an empty token
    EXPECT_FALSE(t.hasMoreTokens());
}

TEST(ZmStringTokenizer, BackslashEscapesTheNextByte)
{
    EXPECT_EQ(tokens("a b\\ c"), (Tokens{"a", "b c"}));
    EXPECT_EQ(tokens("a\\\\b"), (Tokens{"a\\b"}));
    EXPECT_EQ(tokens("a\\\"b c"), (Tokens{"a\"b", "c"}));
    EXPECT_EQ(tokens("\\x\\y"), (Tokens{"xy"}));
    EXPECT_EQ(tokens("ab\\"), (Tokens{"ab"})); // a trailing backslash escapes nothing
    EXPECT_EQ(tokens("\\ "), (Tokens{" "}));
}

TEST(ZmStringTokenizer, QuotesStartAnywhereAndKeepDelimiters)
{
    EXPECT_EQ(tokens("ab\"c d\"e"), (Tokens{"abc de"}));
    EXPECT_EQ(tokens("\"a  b\"  c"), (Tokens{"a  b", "c"}));
    EXPECT_EQ(tokens("x \"y \\ z"), (Tokens{"x", "y \\ z"})); // unclosed: runs to the end, no escapes
    EXPECT_EQ(tokens("\"\""), (Tokens{""}));
    EXPECT_EQ(tokens("\"\" \"\""), (Tokens{"", ""}));
    EXPECT_EQ(tokens("a\"\"b"), (Tokens{"ab"}));
    EXPECT_EQ(tokens("\"a\"\"b\""), (Tokens{"ab"}));
    EXPECT_EQ(tokens("\"a\"b c"), (Tokens{"ab", "c"}));
}

TEST(ZmStringTokenizer, OverAZmStringReadsItsWholeLength)
{
    const ZmString s("a\0b c", 0, 5);
    ZmStringTokenizer t(s);
    EXPECT_EQ(drain(t), (Tokens{std::string("a\0b", 3), "c"}));
}

TEST(ZmStringTokenizer, RetargetingKeepsTheCurrentTokenUntilTheNextCall)
{
    ZmStringTokenizer t("first rest");
    ZmString& token = t.nextToken();
    EXPECT_EQ(text(token), "first");
    t = "   x y";
    EXPECT_EQ(text(token), "first");
    EXPECT_TRUE(t.hasMoreTokens());
    EXPECT_EQ(text(t.nextToken()), "x");
    EXPECT_EQ(text(t.nextToken()), "y");
    EXPECT_FALSE(t.hasMoreTokens());
    t = "  ";
    EXPECT_FALSE(t.hasMoreTokens());
    t = "z";
    EXPECT_EQ(drain(t), Tokens{"z"});
}

TEST(ZmStringTokenizer, NextIntAndNextFloatConvertTokens)
{
    ZmStringTokenizer t("12 -3 2.5 \"4 5\" abc 7x");
    EXPECT_EQ(t.nextInt(), 12);
    EXPECT_EQ(t.nextInt(), -3);
    EXPECT_FLOAT_EQ(t.nextFloat(), 2.5f);
    EXPECT_EQ(t.nextInt(), 4); // the quoted token "4 5"
    EXPECT_EQ(t.nextInt(), 0);
    EXPECT_EQ(t.nextInt(), 7);
    EXPECT_FALSE(t.hasMoreTokens());
    EXPECT_EQ(t.nextInt(), 0);
}

// --- ZmStringTokenizerGeneral ----------------------------------------------------------------

TEST(ZmStringTokenizerGeneral, SplitsOnTheGivenSetOnly)
{
    EXPECT_EQ(tokens("a,b;;c", ",;"), (Tokens{"a", "b", "c"}));
    EXPECT_EQ(tokens("a b,c d", ","), (Tokens{"a b", "c d"})); // blanks are ordinary bytes now
    EXPECT_EQ(tokens("a\xff"
                     "b\x80\x80"
                     "c",
                     "\xff\x80"),
              (Tokens{"a", "b", "c"}));
    EXPECT_EQ(tokens("\x7f"
                     "a\x7f",
                     "\x7f"),
              (Tokens{"a"}));
    EXPECT_EQ(tokens("a b", ""), (Tokens{"a b"}));
    EXPECT_EQ(tokens("  ", ","), (Tokens{"  "}));
}

TEST(ZmStringTokenizerGeneral, QuotesAndEscapesStillApply)
{
    EXPECT_EQ(tokens("\"a,b\",c", ","), (Tokens{"a,b", "c"}));
    EXPECT_EQ(tokens("a\\,b,c", ","), (Tokens{"a,b", "c"}));
    EXPECT_EQ(tokens("x,\"y", ","), (Tokens{"x", "y"}));
}

TEST(ZmStringTokenizerGeneral, InitialSkipUsesTheSet)
{
    ZmStringTokenizerGeneral t(",,;a", ",;");
    EXPECT_TRUE(t.hasMoreTokens());
    EXPECT_EQ(text(t.nextToken()), "a");
    EXPECT_FALSE(t.hasMoreTokens());

    ZmStringTokenizerGeneral onlyDelims(",,,", ",");
    EXPECT_FALSE(onlyDelims.hasMoreTokens());

    const ZmString s(";x;y;");
    ZmStringTokenizerGeneral fromString(s, ";");
    EXPECT_EQ(drain(fromString), (Tokens{"x", "y"}));

    // Re-targeting skips with the set too.
    fromString = ";;z; w";
    EXPECT_EQ(drain(fromString), (Tokens{"z", " w"}));
}

TEST(ZmStringTokenizerGeneral, CopiesCarryPositionAndSet)
{
    ZmStringTokenizerGeneral a("p;q r;s", ";");
    EXPECT_EQ(text(a.nextToken()), "p");
    ZmStringTokenizerGeneral b(a);
    EXPECT_EQ(drain(b), (Tokens{"q r", "s"}));
    EXPECT_EQ(drain(a), (Tokens{"q r", "s"})); // the original is not advanced by the copy

    ZmStringTokenizerGeneral c("1 2", " ");
    c = ZmStringTokenizerGeneral("u|v", "|");
    EXPECT_EQ(drain(c), (Tokens{"u", "v"}));
}

// --- ZmStdStringTokenizer --------------------------------------------------------------------

TEST(ZmStdStringTokenizer, SkipsEmptyPiecesAndCountsWholeText)
{
    ZmStdStringTokenizer t(",a,,b,", ",");
    std::string out;
    t.nextToken(out);
    EXPECT_EQ(out, "a");
    EXPECT_EQ(t.countTokens(), 2u); // counted over the whole text, also after a token was taken
    t.nextToken(out);
    EXPECT_EQ(out, "b");
    EXPECT_FALSE(t.hasMoreTokens());
    t.nextToken(out);
    EXPECT_EQ(out, "b"); // exhausted: left unchanged
    EXPECT_EQ(t.countTokens(), 2u);

    EXPECT_EQ(stdTokens("a\tb\nc\vd\fe\rf g", nullptr), (Tokens{"a", "b", "c", "d", "e", "f", "g"}));
    EXPECT_EQ(stdTokens(" a ", ""), (Tokens{" a "})); // empty set: one token, the whole text
    EXPECT_EQ(ZmStdStringTokenizer(" a ", "").countTokens(), 1u);
    EXPECT_EQ(stdTokens("\"a b\"\\ c", " "), (Tokens{"\"a", "b\"\\", "c"})); // no quotes, no escapes
    EXPECT_EQ(stdTokens("", ","), Tokens{});
    EXPECT_EQ(stdTokens(",,,", ","), Tokens{});
    EXPECT_EQ(ZmStdStringTokenizer(",,,", ",").countTokens(), 0u);
    EXPECT_EQ(ZmStdStringTokenizer("", "").countTokens(), 0u);
    EXPECT_FALSE(ZmStdStringTokenizer("", nullptr).hasMoreTokens());

    ZmStdStringTokenizer other("x y", nullptr);
    other = ZmStdStringTokenizer("p;q", ";");
    EXPECT_EQ(other.countTokens(), 2u);
    other.nextToken(out);
    EXPECT_EQ(out, "p");
}

// --- properties --------------------------------------------------------------------------------

// protect() writes what the tokenizer reads back as exactly the original, one token, when the
// text has no white space (escapes alone carry quotes and backslashes) or, quoted, when it has
// neither quotes nor backslashes (inside quotes every byte is taken as it is). Forced quotes
// therefore need the second domain: a quote inside would end the quoted run early.
TEST(ZmStringTokenizer, PropertyProtectRoundTrips)
{
    std::mt19937 rng(6006);
    int withWhite = 0;
    int withEscapes = 0;
    for (int iter = 0; iter < 20000; ++iter) {
        const bool allowWhite = rng() % 2 == 0;
        std::string src(rng() % 12, ' ');
        for (char& c : src) {
            do {
                c = char(1 + rng() % 255);
                if (rng() % 3 == 0) { // favour the interesting bytes
                    c = " \t\n\"\\a"[rng() % 6];
                }
            } while (allowWhite ? (c == '"' || c == '\\') : isWhite(c));
        }
        const bool hasWhite = std::any_of(src.begin(), src.end(), isWhite);
        const bool hasEscapes = src.find_first_of("\"\\") != std::string::npos;
        withWhite += hasWhite;
        withEscapes += hasEscapes;

        const ZmString s(src.c_str());
        for (bool force : {false, true}) {
            if (force && hasEscapes) {
                continue;
            }
            const ZmString prot = s.protect(force);
            ZmStringTokenizer t(prot);
            ASSERT_TRUE(t.hasMoreTokens()) << "'" << src << "' force " << force;
            ASSERT_EQ(text(t.nextToken()), src) << "protected '" << text(prot) << "'";
            ASSERT_FALSE(t.hasMoreTokens()) << "protected '" << text(prot) << "'";
        }
    }
    EXPECT_GT(withWhite, 1000);
    EXPECT_GT(withEscapes, 1000);

    // Outside that domain, forced quotes around an escaped quote split the quoted run.
    const ZmString prot = ZmString("a\"b").protect(true);
    EXPECT_EQ(text(prot), "\"a\\\"b\"");
    ZmStringTokenizer t(prot);
    EXPECT_EQ(text(t.nextToken()), "a\\b");
}

TEST(ZmStringTokenizer, PropertyJoinedTokensComeBack)
{
    std::mt19937 rng(7007);
    const std::string white = " \t\n\r\v\f";
    for (int iter = 0; iter < 5000; ++iter) {
        Tokens list(rng() % 8);
        for (std::string& tok : list) {
            tok.resize(1 + rng() % 6);
            for (char& c : tok) {
                do {
                    c = char(1 + rng() % 255);
                } while (c == '"' || c == '\\' || isWhite(c));
            }
        }
        const auto run = [&] {
            std::string r(rng() % 4, ' ');
            for (char& c : r) {
                c = white[rng() % white.size()];
            }
            return r;
        };
        std::string joined = run();
        for (const std::string& tok : list) {
            joined += tok + run() + white[rng() % white.size()];
        }
        ASSERT_EQ(tokens(joined.c_str()), list) << "'" << joined << "'";
        ASSERT_EQ(stdTokens(joined, nullptr), list) << "'" << joined << "'";
        ASSERT_EQ(ZmStdStringTokenizer(joined, nullptr).countTokens(), list.size());
        ASSERT_EQ(tokens(joined.c_str(), white.c_str()), list) << "'" << joined << "'";
    }
}
