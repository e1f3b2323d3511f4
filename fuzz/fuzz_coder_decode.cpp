// Fuzzes the decoders of ZmCoder: abcDecode and hexStringToData.
//
// Input layout: the whole input is the text (zero bytes included), and also the bytes encoded.
//
// Checks, against a model written here (a letter 'A'..'P' or 'a'..'p' is 0..15, a hexadecimal
// digit of either case is its value, anything else 0, a trailing odd character is ignored):
// - abcDecode gives n / 2 bytes, each equal to the model, NUL-terminated;
// - hexStringToData writes exactly length / 2 bytes (into a buffer of exactly that size, so a
//   write past it is an address-sanitizer report), each equal to the model;
// - encoding the decoded bytes again gives the canonical text: each character replaced by the
//   encoder's character for its model value, so a valid text (upper-case) comes back unchanged;
// - decoding the encoding of the raw input gives the input back, for both encodings.
#include "FuzzCheck.h"

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmString.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

namespace {

unsigned letterModel(unsigned char c)
{
    if (c >= 'A' && c <= 'P') {
        return unsigned(c - 'A');
    }
    if (c >= 'a' && c <= 'p') {
        return unsigned(c - 'a');
    }
    return 0;
}

unsigned hexModel(unsigned char c)
{
    const char* digits = "0123456789abcdef0123456789ABCDEF";
    const char* at = c == 0 ? nullptr : std::strchr(digits, c);
    return at == nullptr ? 0 : unsigned(at - digits) % 16;
}

struct FreeDeleter {
    void operator()(char* p) const { std::free(p); }
};
using MallocText = std::unique_ptr<char, FreeDeleter>;

void checkAbc(const unsigned char* data, int n)
{
    int decodedLength = -1;
    const MallocText decoded(ZmCoder::abcDecode(reinterpret_cast<const char*>(data), n, decodedLength));
    FUZZ_CHECK(decoded != nullptr);
    FUZZ_CHECK(decodedLength == n / 2);
    FUZZ_CHECK(decoded.get()[decodedLength] == 0);
    const auto* bytes = reinterpret_cast<const unsigned char*>(decoded.get());
    for (int i = 0; i < decodedLength; ++i) {
        FUZZ_CHECK(bytes[i] == ((letterModel(data[2 * i]) << 4) | letterModel(data[2 * i + 1])));
    }

    int encodedLength = -1;
    const MallocText encoded(ZmCoder::abcEncode(bytes, decodedLength, encodedLength));
    FUZZ_CHECK(encoded != nullptr);
    FUZZ_CHECK(encodedLength == 2 * decodedLength);
    FUZZ_CHECK(std::strlen(encoded.get()) == size_t(encodedLength));
    for (int i = 0; i < encodedLength; ++i) {
        FUZZ_CHECK(encoded.get()[i] == char('A' + letterModel(data[i])));
    }

    // The raw input as data.
    const MallocText text(ZmCoder::abcEncode(data, n, encodedLength));
    FUZZ_CHECK(text != nullptr && encodedLength == 2 * n);
    const MallocText back(ZmCoder::abcDecode(text.get(), encodedLength, decodedLength));
    FUZZ_CHECK(back != nullptr && decodedLength == n);
    FUZZ_CHECK(n == 0 || std::memcmp(back.get(), data, size_t(n)) == 0);
}

void checkHex(const unsigned char* data, int n)
{
    const ZmString hex(reinterpret_cast<const char*>(data), 0, n);
    FUZZ_CHECK(hex.length() == n);
    const int bytes = n / 2;
    // Exactly bytes long (at least 1 so that new[] hands out a block of its own).
    const std::unique_ptr<unsigned char[]> out(new unsigned char[size_t(bytes == 0 ? 1 : bytes)]);
    ZmCoder::hexStringToData(out.get(), hex);
    for (int i = 0; i < bytes; ++i) {
        FUZZ_CHECK(out[size_t(i)] == ((hexModel(data[2 * i]) << 4) | hexModel(data[2 * i + 1])));
    }

    const char* upperDigits = "0123456789ABCDEF";
    ZmString again;
    ZmCoder::dataToHexString(out.get(), unsigned(bytes), again, true);
    FUZZ_CHECK(again.length() == 2 * bytes);
    for (int i = 0; i < 2 * bytes; ++i) {
        FUZZ_CHECK(again.getString()[i] == upperDigits[hexModel(data[i])]);
    }

    // The raw input as data, in both cases.
    for (bool upper : {false, true}) {
        ZmString text;
        ZmCoder::dataToHexString(data, unsigned(n), text, upper);
        FUZZ_CHECK(text.length() == 2 * n);
        const std::unique_ptr<unsigned char[]> back(new unsigned char[size_t(n == 0 ? 1 : n)]);
        ZmCoder::hexStringToData(back.get(), text);
        FUZZ_CHECK(n == 0 || std::memcmp(back.get(), data, size_t(n)) == 0);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size > (1u << 20)) {
        return 0;
    }
    const int n = int(size);
    checkAbc(data, n);
    checkHex(data, n);
    return 0;
}
