// Fuzzes ZmStringTokenizer over arbitrary bytes.
//
// The tokens are compared with a byte-at-a-time model of the tokenizing rules (white space
// separates, a backslash takes the next byte as it is, a double quote runs to the next one), so
// the library's run-copying shortcuts are checked against the plain reading. Besides that the
// invariants that hold for any input are checked: every token uses up at least one input byte (so
// there are at most as many tokens as bytes and draining ends), no token is longer than the
// input, the tokens together use no more bytes than the input has, and a drained tokenizer stays
// drained. Embedded zero bytes reach the tokenizer through the ZmString constructor, which takes
// the string's length(); the const char* forms stop at the first zero byte.
#include "FuzzCheck.h"
#include "ModelTokenizer.h"

#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace {

bool isDelimiter(char c)
{
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

void drainAndCheck(ZmStringTokenizer& tokenizer, size_t len, const std::vector<std::string>& expected)
{
    size_t count = 0;
    size_t bytes = 0;
    while (tokenizer.hasMoreTokens()) {
        checkNextToken(tokenizer, len, expected, count, bytes);
    }
    FUZZ_CHECK(count == expected.size());
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
    // Asking again after the end gives an empty token and changes nothing.
    FUZZ_CHECK(tokenizer.nextToken().length() == 0);
    FUZZ_CHECK(!tokenizer.hasMoreTokens());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size > (1u << 20)) {
        return 0;
    }
    static const char empty[1] = {0};
    const char* bytes = size == 0 ? empty : reinterpret_cast<const char*>(data);

    // The whole input, zero bytes included.
    const ZmString text(bytes, 0, int(size));
    FUZZ_CHECK(size_t(text.length()) == size);
    ZmStringTokenizer whole(text);
    drainAndCheck(whole, size, modelTokens(text.getString(), size, isDelimiter));

    // The same bytes as a C string: up to the first zero byte.
    const char* cText = text.getString();
    const size_t cLen = std::strlen(cText);
    const std::vector<std::string> cExpected = modelTokens(cText, cLen, isDelimiter);
    ZmStringTokenizer fromChars(cText);
    drainAndCheck(fromChars, cLen, cExpected);

    // Re-targeting a drained tokenizer starts over on the new text.
    whole = cText;
    drainAndCheck(whole, cLen, cExpected);
    return 0;
}
