// Fuzzes the round trip ZmString::protect -> ZmStringTokenizer.
//
// protect() writes a text so that the tokenizer reads it back as one token: it quotes the text
// (when forced, when it is empty or when it holds white space) and puts a backslash before each
// double quote and backslash. Inside quotes, however, the tokenizer takes every byte as it is,
// escapes included, so the round trip holds only where the two rules agree:
// - protect(false): texts without white space (no quotes are written, escapes are read back),
//   or texts with neither a double quote nor a backslash (nothing is escaped);
// - protect(true): texts with neither a double quote nor a backslash (always quoted).
// Zero bytes are out too, since the tokenizer of a C string stops at the first one.
//
// Input layout: bit 0 of the first byte forces quotes; bit 1 picks how a text outside the domain
// is brought into it (white space becomes '_', or double quotes and backslashes become ' and /);
// the rest is the text, with zero bytes turned into 0x01. Every input therefore exercises a valid
// case. The protected form itself is checked byte for byte too, and the other quoting mode is
// tried as well whenever the text lies in its domain.
#include "FuzzCheck.h"

#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>

namespace {

bool isWhite(char c)
{
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

bool hasWhite(const std::string& s)
{
    for (const char c : s) {
        if (isWhite(c)) {
            return true;
        }
    }
    return false;
}

bool hasQuoteOrBackslash(const std::string& s)
{
    return s.find_first_of("\"\\") != std::string::npos;
}

bool inDomain(const std::string& s, bool forceQuotes)
{
    return forceQuotes ? !hasQuoteOrBackslash(s) : (!hasWhite(s) || !hasQuoteOrBackslash(s));
}

void removeQuotesAndBackslashes(std::string& s)
{
    for (char& c : s) {
        if (c == '"') {
            c = '\'';
        } else if (c == '\\') {
            c = '/';
        }
    }
}

std::string expectedProtected(const std::string& s, bool forceQuotes)
{
    const bool quote = forceQuotes || s.empty() || hasWhite(s);
    std::string out = quote ? "\"" : "";
    for (const char c : s) {
        if (c == '"' || c == '\\') {
            out += '\\';
        }
        out += c;
    }
    if (quote) {
        out += '"';
    }
    return out;
}

bool same(const ZmString& z, const std::string& s)
{
    return size_t(z.length()) == s.size() && std::memcmp(z.getString(), s.data(), s.size()) == 0;
}

void checkRoundTrip(const std::string& s, bool forceQuotes)
{
    const ZmString original(s.data(), 0, int(s.size()));
    const ZmString protectedText = original.protect(forceQuotes);
    FUZZ_CHECK(same(protectedText, expectedProtected(s, forceQuotes)));

    ZmStringTokenizer fromString(protectedText);
    FUZZ_CHECK(fromString.hasMoreTokens());
    FUZZ_CHECK(same(fromString.nextToken(), s));
    FUZZ_CHECK(!fromString.hasMoreTokens());

    ZmStringTokenizer fromChars(protectedText.getString());
    FUZZ_CHECK(fromChars.hasMoreTokens());
    FUZZ_CHECK(same(fromChars.nextToken(), s));
    FUZZ_CHECK(!fromChars.hasMoreTokens());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size == 0 || size > (1u << 20)) {
        return 0;
    }
    const bool forceQuotes = (data[0] & 1) != 0;
    const bool dropWhite = (data[0] & 2) != 0;
    std::string text(reinterpret_cast<const char*>(data) + 1, size - 1);
    for (char& c : text) {
        if (c == 0) {
            c = '\x01';
        }
    }
    if (!inDomain(text, forceQuotes)) {
        if (!forceQuotes && dropWhite) {
            for (char& c : text) {
                if (isWhite(c)) {
                    c = '_';
                }
            }
        } else {
            removeQuotesAndBackslashes(text);
        }
    }
    FUZZ_CHECK(inDomain(text, forceQuotes));
    checkRoundTrip(text, forceQuotes);
    if (inDomain(text, !forceQuotes)) {
        checkRoundTrip(text, !forceQuotes);
    }
    return 0;
}
