#include <zmlib/ZmString.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <climits>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

namespace {

// The string's text including embedded zero bytes.
std::string text(const ZmString& s)
{
    return std::string(s.getString(), size_t(s.length()));
}

// Size >= 1, terminator in place, capacity not below size.
::testing::AssertionResult wellFormed(const ZmString& s)
{
    if (s.size() < 1 || !s.isConsistent() || s.getString()[s.size() - 1] != 0) {
        return ::testing::AssertionFailure()
               << "size " << s.size() << " max " << s.getMax() << " not a terminated string";
    }
    return ::testing::AssertionSuccess();
}

std::string randomText(std::mt19937& rng, const std::string& alphabet, size_t maxLen)
{
    std::string out(std::uniform_int_distribution<size_t>(0, maxLen)(rng), ' ');
    std::uniform_int_distribution<size_t> pick(0, alphabet.size() - 1);
    for (char& c : out) {
        c = alphabet[pick(rng)];
    }
    return out;
}

std::string lower(std::string s)
{
    for (char& c : s) {
        c = char(std::tolower(static_cast<unsigned char>(c)));
    }
    return s;
}

char* callVprintf(ZmString& s, const char* fmt, ...) ZMLIB_PRINTF(2, 3);
char* callVprintf(ZmString& s, const char* fmt, ...)
{
    va_list args;
    va_start(args, fmt);
    char* r = s.vprintf(fmt, args);
    va_end(args);
    return r;
}

// The size and capacity that formatting must leave, recomputed from the growth rule of the
// array: format with the current size as the limit (a text longer than the limit does not fit, a
// text of exactly the limit fits without its terminator), double while it does not fit, then
// size the string to the text; a text that filled the limit exactly gets its terminator appended.
struct SizeModel {
    int64_t size;
    int64_t max;
    int filledLimit = 0; // how often the text exactly filled the limit

    // The array's growth: max(trunc(size * 1.5), n) once n exceeds the capacity.
    void grow(int64_t n)
    {
        if (n > max) {
            max = std::max<int64_t>(int64_t(double(size) * 1.5), n);
        }
        size = n;
    }
    void format(int64_t len)
    {
        if (size < 2) {
            grow(64);
        }
        int64_t n = len <= size ? len : -1;
        while (n != size) {
            if (n >= 0) {
                grow(n + 1);
                return;
            }
            grow(2 * size);
            n = len <= size ? len : -1;
        }
        grow(size + 1);
        ++filledLimit;
    }
};

// Text, size and capacity in one comparable value: "'abc' 4/16".
std::string layout(const ZmString& s)
{
    return "'" + text(s) + "' " + std::to_string(s.size()) + "/" + std::to_string(s.getMax());
}

} // namespace

TEST(ZmString, ConstructorsGiveExactSizesAndCapacities)
{
    EXPECT_EQ(layout(ZmString()), "'' 1/16");
    EXPECT_EQ(layout(ZmString(static_cast<const char*>(nullptr))), "'' 1/16");
    EXPECT_EQ(layout(ZmString("abc")), "'abc' 4/16");
    // 21 bytes exceed 16: the block grows to what is needed (1.5 x size 0 is less).
    EXPECT_EQ(layout(ZmString("abcdefghijklmnopqrst")), "'abcdefghijklmnopqrst' 21/21");
    EXPECT_EQ(layout(ZmString("hello world", 6, 5)), "'world' 6/6");
    EXPECT_EQ(layout(ZmString("ab\0cd", 0, 5)), std::string("'ab\0cd' 6/6", 11)); // zero bytes kept
    EXPECT_EQ(layout(ZmString('x', 5)), "'xxxxx' 6/6");
    EXPECT_EQ(layout(ZmString('x', 0)), "'' 1/1");
    EXPECT_EQ(layout(ZmString(0, "%d-%s", 42, "ab")), "'42-ab' 6/64");
    EXPECT_TRUE(ZmString().isEmptyString());
    EXPECT_TRUE(ZmString("\0x", 0, 2).isEmptyString()); // first byte zero
    EXPECT_FALSE(ZmString("x").isEmptyString());
}

TEST(ZmString, CopyMoveAndAssignmentCopyAndKeepTheSource)
{
    ZmString src("abc");
    const ZmString copy(src);
    EXPECT_EQ(layout(copy), "'abc' 4/4"); // the copy's capacity is the source's size
    EXPECT_NE(copy.getString(), src.getString());
    const ZmString moved(std::move(src));
    EXPECT_EQ(layout(moved), "'abc' 4/4");
    EXPECT_EQ(layout(src), "'abc' 4/16");

    ZmString target;
    ZmString longer("abcdefghijklmnopqrst");
    target = longer;
    EXPECT_EQ(layout(target), "'abcdefghijklmnopqrst' 21/21");
    ZmString target2("xy");
    target2 = std::move(longer);
    EXPECT_EQ(text(target2), "abcdefghijklmnopqrst");
    EXPECT_EQ(text(longer), "abcdefghijklmnopqrst");
    target = ZmString("q"); // shorter: the capacity stays
    EXPECT_EQ(layout(target), "'q' 2/21");
    ZmString& alias = target;
    target = alias;
    EXPECT_EQ(layout(target), "'q' 2/21");

    target = static_cast<const char*>(nullptr);
    EXPECT_EQ(layout(target), "'' 1/21");
    target = "hello world";
    target = target.getString() + 6; // a pointer into the string's own block
    EXPECT_EQ(layout(target), "'world' 6/21");
    target = target.getString();
    EXPECT_EQ(layout(target), "'world' 6/21");
}

TEST(ZmString, CharacterClassTestsAreAsciiOnlyAndTrueWhenEmpty)
{
    const struct {
        const char* in;
        bool alnum, alpha, digit;
    } cases[] = {{"", true, true, true},       {"aZ09", true, false, false},
                 {"aZ", true, true, false},    {"0123456789", true, false, true},
                 {"a b", false, false, false}, {"\xe9", false, false, false},
                 {"12-", false, false, false}};
    for (const auto& c : cases) {
        const ZmString s(c.in);
        EXPECT_EQ(s.isAlnum(), c.alnum) << "'" << c.in << "'";
        EXPECT_EQ(s.isAlpha(), c.alpha) << "'" << c.in << "'";
        EXPECT_EQ(s.isDigit(), c.digit) << "'" << c.in << "'";
    }
}

TEST(ZmString, ComparisonsAreByteWise)
{
    // std::string compares bytes as unsigned values, as strcmp does.
    const ZmString abc("abc");
    const std::string l = "abc";
    for (const char* rhs : {"abc", "abd", "ab", "abcd", "", "b", "ABC", "\xe9"}) {
        const std::string r = rhs;
        SCOPED_TRACE(rhs);
        EXPECT_EQ(abc == rhs, l == r);
        EXPECT_EQ(abc != rhs, l != r);
        EXPECT_EQ(abc < rhs, l < r);
        EXPECT_EQ(abc <= rhs, l <= r);
        EXPECT_EQ(abc > rhs, l > r);
        EXPECT_EQ(abc >= rhs, l >= r);
        EXPECT_EQ(abc == ZmString(rhs), l == r);
        EXPECT_EQ(abc != ZmString(rhs), l != r);
        EXPECT_EQ(abc.isEqualTo(ZmString(rhs), false), l == r);
        EXPECT_EQ(abc.isEqualTo(ZmString(rhs), true), l == lower(r)); // lengths first, then bytes
    }
    EXPECT_TRUE(ZmString().isEqualTo(ZmString(""), true));
    // A string is never reported different from a null pointer.
    EXPECT_FALSE(abc != static_cast<const char*>(nullptr));
    EXPECT_FALSE(ZmString() != static_cast<const char*>(nullptr));
    // With an embedded zero, string == string sees the sizes, == text strcmp, != text the length.
    const ZmString zero("abc\0d", 0, 5);
    EXPECT_FALSE(zero == abc);
    EXPECT_TRUE(zero == "abc");
    EXPECT_TRUE(zero != "abc");
    EXPECT_FALSE(zero.isEqualTo(abc, true)); // the lengths decide before any byte is compared

    EXPECT_EQ(ZmString::strcasecmp("HeLLo", "hello"), 0);
    EXPECT_LT(ZmString::strcasecmp("a", "B"), 0);
    EXPECT_EQ(ZmString::strncasecmp("abcX", "ABCy", 3), 0);
    EXPECT_NE(ZmString::strncasecmp("abcX", "ABCy", 4), 0);
    char buf[] = "a,,b;c";
    char* ctx = nullptr;
    std::string parts;
    for (char* t = ZmString::strtok(buf, ",;", &ctx); t != nullptr;
         t = ZmString::strtok(nullptr, ",;", &ctx)) {
        parts += std::string(t) + "|";
    }
    EXPECT_EQ(parts, "a|b|c|");
}

// The searches' general behaviour is checked against std::string below; these are the edges.
TEST(ZmString, SearchDefaultsTerminatorAndEmptyPattern)
{
    const ZmString s("hello");
    EXPECT_EQ(s.index('l'), 2);
    EXPECT_EQ(s.index('\0'), 5); // the terminator is searched too
    EXPECT_EQ(s.rindex('l'), 3);
    EXPECT_EQ(s.rindex('\0', -9), 5); // any negative start begins at the terminator
    EXPECT_EQ(s.index(""), 0);
    EXPECT_EQ(s.index("", 5), 5); // the terminator position is a valid start
    EXPECT_EQ(s.index("", 6), -1);
    // The empty text's first byte is its terminator, equal only to the string's own terminator.
    EXPECT_EQ(s.iindex(""), 5);
    EXPECT_EQ(ZmString("Hello World").matches("H*W?rld"), 1);
    EXPECT_EQ(ZmString("Hello World").matches("h*"), 0);
}

TEST(ZmString, AppendInsertRemoveKeepTheBlock)
{
    ZmString s("abc");
    s.removeLast(1);
    EXPECT_EQ(layout(s), "'ab' 3/16");
    s += 'x';
    EXPECT_EQ(layout(s), "'abx' 4/16");
    s += static_cast<const char*>(nullptr);
    s.insertStr(1, "");
    EXPECT_EQ(layout(s), "'abx' 4/16");
    EXPECT_EQ(text(ZmString("ab") + ZmString("cd")), "abcd");
    EXPECT_EQ(text(ZmString("ab") + ZmString()), "ab");

    ZmString big("0123456789abcdefghij");
    big.clear();
    EXPECT_EQ(layout(big), "'' 1/21");
}

TEST(ZmString, ReplaceSubStrAndCase)
{
    const struct {
        const char *in, *from, *to, *out;
    } cases[] = {{"aaaa", "aa", "b", "bb"},       {"aaa", "aa", "b", "ba"}, // left to right, no overlap
                 {"ab", "a", "aa", "aab"}, // the replacement is not scanned again
                 {"abcabc", "bc", nullptr, "aa"}, {"aa", "", "x", "aa"},    {"", "a", "x", ""},
                 {"xyz", "xyz", "", ""}};
    for (const auto& c : cases) {
        ZmString r(c.in);
        r.replaceSubStr(c.from, c.to);
        EXPECT_EQ(text(r), c.out) << "'" << c.in << "' '" << c.from << "'";
        EXPECT_TRUE(wellFormed(r));
    }
    ZmString m("MiXeD 1\xc9\xe9");
    m.toLower();
    EXPECT_EQ(text(m), "mixed 1\xc9\xe9"); // bytes above 0x7f untouched in the C locale
    m.toUpper();
    EXPECT_EQ(text(m), "MIXED 1\xc9\xe9");
}

TEST(ZmString, SubstrTakesAnInclusiveRange)
{
    const ZmString hello("hello");
    EXPECT_EQ(layout(hello.substr(1, 2)), "'el' 3/3");
    EXPECT_EQ(text(hello.substr(0, 4)), "hello");
    EXPECT_EQ(text(hello.substr(4, 4)), "o");
    EXPECT_EQ(layout(hello.substr(2, 1)), "'' 1/1"); // to - from + 1 = 0
}

TEST(ZmString, ProtectQuotesAndEscapes)
{
    EXPECT_EQ(text(ZmString("a b").protect(false)), "\"a b\"");
    EXPECT_EQ(text(ZmString("ab").protect(false)), "ab");
    EXPECT_EQ(text(ZmString("ab").protect(true)), "\"ab\"");
    EXPECT_EQ(text(ZmString("").protect(false)), "\"\"");
    EXPECT_EQ(text(ZmString("a\"b").protect(false)), "a\\\"b");
    EXPECT_EQ(text(ZmString("a\\b").protect(false)), "a\\\\b");
    EXPECT_EQ(text(ZmString("a\tb").protect(false)), "\"a\tb\"");
    EXPECT_EQ(text(ZmString("a\nb").protect(false)), "\"a\nb\"");
    EXPECT_EQ(text(ZmString("\" \\").protect(false)), "\"\\\" \\\\\"");
    EXPECT_TRUE(wellFormed(ZmString("").protect(true)));
}

TEST(ZmString, PrintfSizesAndCapacities)
{
    const std::string x100(100, 'x'), y64(64, 'y'), z200(200, 'z');
    ZmString s;
    const char* returned = s.printf("%s", x100.c_str());
    EXPECT_EQ(returned, s.getString());
    EXPECT_EQ(layout(s), "'" + x100 + "' 101/128"); // 64, then doubled once

    s.printf("%d", 7); // shorter: the size follows the text, the capacity stays
    EXPECT_EQ(layout(s), "'7' 2/128");
    // The limit is the size, not the capacity: 2 -> 4 -> ... -> 64 is filled exactly, so the
    // terminator is appended, within the capacity.
    s.printf("%s", y64.c_str());
    EXPECT_EQ(layout(s), "'" + y64 + "' 65/128");
    // Longer than the capacity: 65 -> 130 -> 260.
    const char* fromV = callVprintf(s, "%s", z200.c_str());
    EXPECT_EQ(fromV, s.getString());
    EXPECT_EQ(layout(s), "'" + z200 + "' 201/260");

    // A new string filled exactly: the appended terminator grows the block by 1.5.
    EXPECT_EQ(layout(ZmString(0, "%s", y64.c_str())), "'" + y64 + "' 65/96");
    ZmString empty;
    empty.printf("%s", "");
    EXPECT_EQ(layout(empty), "'' 1/64");

    char oracle[128];
    std::snprintf(oracle, sizeof oracle, "%d|%5.2f|%-4s|%x|%c", -12, 3.14159, "ab", 255u, 'q');
    ZmString mixed;
    mixed.printf("%d|%5.2f|%-4s|%x|%c", -12, 3.14159, "ab", 255u, 'q');
    EXPECT_EQ(text(mixed), oracle);
}

TEST(ZmString, SetInt64MatchesDecimalText)
{
    ZmString s("some longer previous text");
    for (int64_t v : {int64_t(0), int64_t(1), int64_t(-1), int64_t(10), int64_t(-10), int64_t(1234567890123),
                      INT64_MAX, INT64_MIN, INT64_MIN + 1}) {
        s.setInt64(v);
        EXPECT_EQ(text(s), std::to_string(v));
        EXPECT_TRUE(wellFormed(s));
        const ZmString f = ZmString::fromInt64(v);
        EXPECT_EQ(text(f), std::to_string(v));
        EXPECT_TRUE(wellFormed(f));
    }
}

TEST(ZmString, NumberParsersReportWhetherAValueWasRead)
{
    const struct {
        const char* in;
        int value;
        bool ok;
    } ints[] = {{"42", 42, true}, {"  -7xyz", -7, true}, {"3.9", 3, true}, {"abc", 0, false}, {"", 0, false}};
    for (const auto& c : ints) {
        bool ok = !c.ok;
        EXPECT_EQ(ZmString(c.in).toInt(ok), c.value) << "'" << c.in << "'";
        EXPECT_EQ(ok, c.ok) << "'" << c.in << "'";
    }
    bool ok = false;
    EXPECT_FLOAT_EQ(ZmString("2.5").toFloat(ok), 2.5f);
    EXPECT_TRUE(ok);
    EXPECT_FLOAT_EQ(ZmString("-1e2").toFloat(ok), -100.0f);
    EXPECT_TRUE(ok);
    EXPECT_EQ(ZmString("x1").toFloat(ok), 0.0f);
    EXPECT_FALSE(ok);
    ok = true;
    EXPECT_EQ(ZmString("").toFloat(ok), 0.0f); // the scan reports end of input, not one value
    EXPECT_FALSE(ok);

    EXPECT_EQ(ZmString("").toInt64(), 0);
    EXPECT_EQ(ZmString("-9223372036854775808").toInt64(), INT64_MIN);
    EXPECT_EQ(ZmString("9223372036854775807").toInt64(), INT64_MAX);
    EXPECT_EQ(ZmString(" 12abc").toInt64(), 12);
    EXPECT_EQ(ZmString("abc").toInt64(), 0);
    EXPECT_EQ(ZmString::toInt64("77"), 77);
    EXPECT_EQ(ZmString::toInt64("-5000000000"), -5000000000LL);
}

// --- properties against std::string models -----------------------------------------------------

TEST(ZmString, PropertyReplaceSubStrMatchesLeftToRightModel)
{
    std::mt19937 rng(1001);
    for (int iter = 0; iter < 3000; ++iter) {
        const std::string from = randomText(rng, "ab", 2) + "ab"[rng() % 2];
        const bool nullTo = rng() % 5 == 0;
        const std::string to = randomText(rng, "abx", 3);
        std::string src;
        for (int k = int(rng() % 6); k > 0; --k) {
            switch (rng() % 3) {
            case 0:
                src += from;
                break;
            case 1:
                src += from.substr(0, rng() % from.size());
                break; // near misses
            default:
                src += randomText(rng, "abc", 3);
                break;
            }
        }
        std::string model;
        for (size_t p = 0;;) {
            const size_t hit = src.find(from, p);
            model.append(src, p, hit == std::string::npos ? std::string::npos : hit - p);
            if (hit == std::string::npos) {
                break;
            }
            model += nullTo ? "" : to;
            p = hit + from.size();
        }
        ZmString s(src.c_str());
        s.replaceSubStr(from.c_str(), nullTo ? nullptr : to.c_str());
        ASSERT_EQ(text(s), model) << "'" << src << "' '" << from << "' -> '" << to << "'";
        ASSERT_TRUE(wellFormed(s));
    }
}

TEST(ZmString, PropertyExplodeAndUnpadMatchModels)
{
    // The first inputs are fixed: the empty text gives one empty piece, a separator at either end an
    // empty piece there; tabs and line ends are not blanks, and only blanks make an empty text.
    const char* splits[] = {"", "a,", ",a,,bc"};
    const char* pads[] = {"  a b  ", "\ta ", "a\t \n", "    ", " x", "x "};
    std::mt19937 rng(2002);
    ZmDArray<ZmString> out;
    out.append(ZmString("stale")); // emptied first
    for (int iter = 0; iter < 3000; ++iter) {
        const char sep = iter < 3 || rng() % 2 ? ',' : '\xff';
        const std::string src = iter < 3 ? splits[iter] : randomText(rng, std::string("ab,") + sep, 12);
        std::vector<std::string> model;
        for (size_t p = 0;;) {
            const size_t hit = src.find(sep, p);
            model.push_back(src.substr(p, hit == std::string::npos ? std::string::npos : hit - p));
            if (hit == std::string::npos) {
                break;
            }
            p = hit + 1;
        }
        ZmString(src.c_str()).explode(sep, out);
        ASSERT_EQ(size_t(out.size()), model.size()) << "'" << src << "'";
        for (size_t k = 0; k < model.size(); ++k) {
            ASSERT_EQ(text(out[k]), model[k]) << "'" << src << "' piece " << k;
        }

        const std::string padded = iter < 6 ? pads[iter] : randomText(rng, "  a\t", 10);
        const size_t first = padded.find_first_not_of(' ');
        const std::string trimmed =
            first == std::string::npos ? "" : padded.substr(first, padded.find_last_not_of(' ') - first + 1);
        ZmString u(padded.c_str());
        u.unpad();
        ASSERT_EQ(text(u), trimmed) << "'" << padded << "'";
        ASSERT_TRUE(wellFormed(u));
    }
}

TEST(ZmString, PropertySearchesMatchStdFind)
{
    std::mt19937 rng(3003);
    for (int iter = 0; iter < 2000; ++iter) {
        const std::string sub = randomText(rng, "abAB", 2) + "abAB"[rng() % 4];
        std::string src;
        for (int k = int(rng() % 5); k > 0; --k) {
            src += rng() % 2 ? sub : randomText(rng, "abAB", 3);
            if (rng() % 3 == 0) { // a differently cased copy for the case-insensitive search
                std::string flipped = sub;
                for (char& c : flipped) {
                    c = rng() % 2 ? char(std::toupper(c)) : char(std::tolower(c));
                }
                src += flipped;
            }
        }
        const ZmString s(src.c_str());
        const std::string withZero = src + '\0';
        const auto pos = [](size_t p) { return p == std::string::npos ? -1 : int(p); };

        ASSERT_EQ(s.index(sub.c_str()), pos(src.find(sub))) << src << " / " << sub;
        ASSERT_EQ(s.iindex(sub.c_str()), pos(lower(src).find(lower(sub)))) << src << " / " << sub;
        for (int start = -2; start <= int(s.size()) + 1; ++start) {
            const int expected = start < 0 || start >= int(s.size()) ? -1 : pos(src.find(sub, size_t(start)));
            ASSERT_EQ(s.index(sub.c_str(), start), expected) << src << " / " << sub << " @" << start;
        }
        for (char c : {'a', 'B', '\0'}) {
            for (int start = 0; start <= s.length(); ++start) {
                ASSERT_EQ(s.index(c, start), pos(withZero.find(c, size_t(start)))) << src << " @" << start;
                ASSERT_EQ(s.rindex(c, start), pos(withZero.rfind(c, size_t(start)))) << src << " @" << start;
            }
            ASSERT_EQ(s.rindex(c, -1), pos(withZero.rfind(c))) << src;
        }
    }
}

TEST(ZmString, PropertyEditSequencesMatchStdString)
{
    std::mt19937 rng(4004);
    for (int run = 0; run < 200; ++run) {
        ZmString s;
        std::string model;
        for (int step = 0; step < 60; ++step) {
            const std::string piece = randomText(rng, "abc \x80\xff", 12);
            const int op = int(rng() % 7);
            switch (op) {
            case 0: {
                const char c = char(1 + rng() % 255);
                s += c;
                model += c;
                break;
            }
            case 1:
                s += piece.c_str();
                model += piece;
                break;
            case 2: {
                const int at = int(rng() % (model.size() + 1));
                s.insertStr(at, piece.c_str());
                model.insert(size_t(at), piece);
                break;
            }
            case 3: {
                const int64_t n = int64_t(rng() % (model.size() + 1));
                s.removeLast(n);
                model.resize(model.size() - size_t(n));
                break;
            }
            case 4:
                if (rng() % 4 == 0) {
                    s.clear();
                    model.clear();
                }
                break;
            case 5:
                s += ZmString(piece.c_str());
                model += piece;
                break;
            default:
                s.replace('a', 'z');
                std::replace(model.begin(), model.end(), 'a', 'z');
                break;
            }
            ASSERT_EQ(text(s), model) << "run " << run << " step " << step << " op " << op;
            ASSERT_EQ(s.length(), int(model.size()));
            ASSERT_TRUE(wellFormed(s));
        }
    }
}

TEST(ZmString, PropertyPrintfMatchesSnprintfAndDoublingSizes)
{
    std::mt19937 rng(5005);
    ZmString s;
    int filled = 0;
    for (int iter = 0; iter < 3000; ++iter) {
        switch (rng() % 8) {
        case 0: {
            ZmString fresh; // start again from a new string's size and capacity
            s.swapWith(fresh);
            break;
        }
        case 1:
            s.clear();
            break;
        case 2:
            s = randomText(rng, "xyz", 40).c_str();
            break;
        default:
            break;
        }
        // Often aim exactly at the current size or a doubling of it: the terminator-append path.
        int64_t len = int64_t(rng() % 400);
        if (rng() % 3 == 0) {
            len = (s.size() < 2 ? 64 : s.size()) << (rng() % 3);
        }
        const int number = int(rng() % 100000) - 50000;
        const std::string numText = std::to_string(number);
        const int64_t padLen = std::max<int64_t>(0, len - int64_t(numText.size()) - 1);
        const std::string pad(size_t(padLen), 'p');
        std::vector<char> oracle(size_t(len) + 64);
        const int n = std::snprintf(oracle.data(), oracle.size(), "%d:%s", number, pad.c_str());
        ASSERT_GE(n, 0);

        SizeModel model{s.size(), s.getMax()};
        model.format(n);
        const char* returned = s.printf("%d:%s", number, pad.c_str());
        ASSERT_EQ(returned, s.getString());
        ASSERT_STREQ(s.getString(), oracle.data()) << "iteration " << iter;
        ASSERT_EQ(s.size(), model.size) << "iteration " << iter << " length " << n;
        ASSERT_EQ(s.getMax(), model.max) << "iteration " << iter << " length " << n;
        filled += model.filledLimit;
    }
    EXPECT_GT(filled, 300); // the terminator-append path was taken often
}
