// Fuzzes the streaming property of ZmLib::MD5Coder: feeding a buffer in any sequence of non-empty
// pieces gives the digest of feeding it whole, whatever the pieces' alignment to the 64-byte
// blocks. A copy taken after the first piece and fed the rest ends at the same digest, and reading
// hash() between pieces changes nothing. An empty buffer checks the deliberate rule that an empty
// append feeds the four bytes of 4711.
//
// Input layout: the low 4 bits of byte 0 give the number k of piece-size bytes that follow; piece
// sizes are those bytes + 1 (1 to 256), used in turn until the data runs out; the rest of the
// input is the data. With k = 0 the data is cut into single bytes.
#include "FuzzCheck.h"

#include <zmlib/ZmLibMD5.h>
#include <zmlib/ZmLibMD5Coder.h>

#include <cstddef>
#include <cstdint>

using ZmLib::MD5;
using ZmLib::MD5Coder;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size == 0 || size > (1u << 16)) {
        return 0;
    }
    const size_t k = data[0] & 15u;
    if (size < 1 + k) {
        return 0;
    }
    const uint8_t* sizes = data + 1;
    const uint8_t* bytes = data + 1 + k;
    const size_t n = size - 1 - k;

    MD5Coder whole;
    whole.append(bytes, n);
    const MD5 expected = whole.finalize();
    FUZZ_CHECK(!whole.isRunning());

    if (n == 0) {
        // Intended: the empty append counted as the integer 4711, not as the empty message.
        static const unsigned char k4711[4] = {0x67, 0x12, 0x00, 0x00};
        MD5Coder fromInt;
        fromInt.append(k4711, 4);
        FUZZ_CHECK(expected == fromInt.finalize());
        FUZZ_CHECK(expected != MD5::hashOfEmptyMessage());
        return 0;
    }

    MD5Coder pieces;
    MD5Coder copy;
    size_t at = 0;
    for (size_t i = 0; at < n; ++i) {
        size_t piece = k == 0 ? 1 : size_t(sizes[i % k]) + 1;
        if (piece > n - at) {
            piece = n - at;
        }
        pieces.append(bytes + at, piece);
        if (i == 0) {
            copy = pieces;
        } else {
            copy.append(bytes + at, piece);
        }
        at += piece;
        if (i % 3 == 1) {
            (void)pieces.hash();
        }
        FUZZ_CHECK(pieces.isRunning());
    }
    FUZZ_CHECK(pieces.finalize() == expected);
    FUZZ_CHECK(copy.finalize() == expected);
    return 0;
}
