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
        out.emplace_back();
        t.nextToken(out.back());
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

// Splitting plain white-space separated text is PropertyJoinedTokensComeBack's.
TEST(ZmStringTokenizer, EscapesAndQuotes)
{
    const struct {
        const char* text;
        Tokens expected;
    } cases[] = {
        {"a b\\ c", {"a", "b c"}}, // a backslash takes the next byte as it is
        {"a\\\\b", {"a\\b"}},
        {"a\\\"b c", {"a\"b", "c"}},
        {"\\x\\y", {"xy"}},
        {"ab\\", {"ab"}},                // a trailing backslash escapes nothing
        {"ab\"c d\"e", {"abc de"}},      // quotes start anywhere and keep delimiters
        {"x \"y \\ z", {"x", "y \\ z"}}, // unclosed: runs to the end, no escapes
        {"\"\" \"\"", {"", ""}},
        {"\"a\"\"b\"", {"ab"}},
        {"\"a\"b c", {"ab", "c"}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(tokens(c.text), c.expected) << "'" << c.text << "'";
    }
}

TEST(ZmStringTokenizer, ReadsAZmStringToItsLengthAndRetargetsKeepingTheToken)
{
    const ZmString s("a\0b c", 0, 5);
    ZmStringTokenizer z(s);
    EXPECT_EQ(drain(z), (Tokens{std::string("a\0b", 3), "c"}));

    ZmStringTokenizer t("first rest");
    ZmString& token = t.nextToken();
    t = "   x y";
    EXPECT_EQ(text(token), "first");
    EXPECT_EQ(drain(t), (Tokens{"x", "y"}));
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
    EXPECT_EQ(text(t.nextToken()), ""); // exhausted: an empty token
    EXPECT_FALSE(t.hasMoreTokens());
}

// --- ZmStringTokenizerGeneral ----------------------------------------------------------------

// Runs of delimiters and the skip before the first token are PropertyJoinedTokensComeBack's.
TEST(ZmStringTokenizerGeneral, SplitsOnTheGivenSetOnly)
{
    const struct {
        const char* text;
        const char* delims;
        Tokens expected;
    } cases[] = {
        {" a b, c d ", ",", {" a b", " c d "}},                       // blanks are ordinary bytes now
        {"\177a\377b\200\200c\177", "\377\200\177", {"a", "b", "c"}}, // bytes of either sign
        {"a b", "", {"a b"}},
        {"\"a,b\",c", ",", {"a,b", "c"}}, // quotes and escapes still apply
        {"a\\,b,c", ",", {"a,b", "c"}},
        {"x,\"y", ",", {"x", "y"}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(tokens(c.text, c.delims), c.expected) << "'" << c.text << "' split at '" << c.delims << "'";
    }

    const ZmString s(";x;y;");
    ZmStringTokenizerGeneral fromString(s, ";");
    EXPECT_EQ(drain(fromString), (Tokens{"x", "y"}));
    fromString = ";;z; w"; // re-targeting skips with the set too
    EXPECT_EQ(drain(fromString), (Tokens{"z", " w"}));
}

TEST(ZmStringTokenizerGeneral, CopiesCarryPositionAndSet)
{
    ZmStringTokenizerGeneral a("p;q r;s", ";");
    EXPECT_EQ(text(a.nextToken()), "p");
    ZmStringTokenizerGeneral b(a), c("1 2", " ");
    c = a;
    EXPECT_EQ(drain(b), (Tokens{"q r", "s"}));
    EXPECT_EQ(drain(c), (Tokens{"q r", "s"}));
    EXPECT_EQ(drain(a), (Tokens{"q r", "s"})); // the original is not advanced by its copies
}

// --- ZmStdStringTokenizer --------------------------------------------------------------------

// White-space splitting with the default set is PropertyJoinedTokensComeBack's.
TEST(ZmStdStringTokenizer, SkipsEmptyPiecesWithNoQuotesOrEscapes)
{
    const struct {
        const char* text;
        const char* delims;
        Tokens expected;
    } cases[] = {
        {",a,,b,", ",", {"a", "b"}},
        {" a ", "", {" a "}}, // empty set: one token, the whole text
        {"\"a b\"\\ c", " ", {"\"a", "b\"\\", "c"}},
        {"", "", {}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(stdTokens(c.text, c.delims), c.expected) << "'" << c.text << "'";
        EXPECT_EQ(ZmStdStringTokenizer(c.text, c.delims).countTokens(), c.expected.size())
            << "'" << c.text << "'";
    }

    ZmStdStringTokenizer t(",a,,b,", ",");
    std::string out;
    t.nextToken(out);
    EXPECT_EQ(t.countTokens(), 2u); // counted over the whole text, also after a token was taken
    t.nextToken(out);
    EXPECT_FALSE(t.hasMoreTokens());
    t.nextToken(out);
    EXPECT_EQ(out, "b"); // exhausted: left unchanged
    EXPECT_EQ(t.countTokens(), 2u);

    t = ZmStdStringTokenizer("p;q;r", ";"); // a count to differ from the cached one
    EXPECT_EQ(t.countTokens(), 3u);
    t.nextToken(out);
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
        std::string src(rng() % 12, ' ');
        for (char& c : src) { // any byte but 0, favouring the interesting ones
            c = rng() % 3 == 0 ? " \t\n\"\\a"[rng() % 6] : char(1 + rng() % 255);
        }
        const bool hasWhite = std::any_of(src.begin(), src.end(), isWhite);
        const bool hasEscapes = src.find_first_of("\"\\") != std::string::npos;
        for (const bool force : {false, true}) {
            if (hasEscapes && (hasWhite || force)) {
                continue; // outside both domains
            }
            withWhite += hasWhite;
            withEscapes += hasEscapes;
            const ZmString prot = ZmString(src.c_str()).protect(force);
            ZmStringTokenizer t(prot);
            ASSERT_EQ(drain(t), Tokens{src}) << "protected '" << text(prot) << "', force " << force;
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
    const auto run = [&](size_t least) {
        std::string r(least + rng() % 4, ' ');
        for (char& c : r) {
            c = white[rng() % white.size()];
        }
        return r;
    };
    for (int iter = 0; iter < 5000; ++iter) {
        Tokens list(rng() % 8);
        std::string joined = run(0);
        for (std::string& tok : list) {
            tok.resize(1 + rng() % 6);
            for (char& c : tok) {
                do {
                    c = char(1 + rng() % 255);
                } while (c == '"' || c == '\\' || isWhite(c));
            }
            joined += tok + run(1);
        }
        ASSERT_EQ(tokens(joined.c_str()), list) << "'" << joined << "'";
        ASSERT_EQ(tokens(joined.c_str(), white.c_str()), list) << "'" << joined << "'";
        ASSERT_EQ(stdTokens(joined, nullptr), list) << "'" << joined << "'";
        ASSERT_EQ(ZmStdStringTokenizer(joined, nullptr).countTokens(), list.size()) << "'" << joined << "'";
    }
}
