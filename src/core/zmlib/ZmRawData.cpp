#include <zmlib/ZmRawData.h>

#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmProgressInterface.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <type_traits>

#if defined(__x86_64__)
#include <immintrin.h>
#endif

namespace {

using Byte = unsigned char;

// --- instruction sets ----------------------------------------------------------------------------
//
// The element loops are written once, as always-inlined kernels, and compiled twice through thin
// wrappers: for the baseline of the build and, on x86-64, for AVX2, chosen at run time. The
// kernels hold no intrinsics: the compiler vectorises the same C++ for each target, so both give
// the same results (no fused multiply-add is enabled by either).
#define ZM_KERNEL inline __attribute__((always_inline))
#define COMMA ,
#if defined(__x86_64__)
#define ZM_HAVE_AVX2_KERNELS 1
#define ZM_AVX2 __attribute__((target("avx2")))
// ZMLIB_RAWDATA_BASELINE set in the environment keeps the baseline forms, so that the tests can
// run them on a machine that has AVX2.
bool cpuHasAvx2() noexcept
{
    static const bool yes =
        __builtin_cpu_supports("avx2") != 0 && std::getenv("ZMLIB_RAWDATA_BASELINE") == nullptr;
    return yes;
}
// Defines NAME (dispatching), NAME##Avx2 and NAME##Base around the kernel NAME##Kernel; the
// template parameters and the function parameters are given as they are declared (which is why
// they cannot stand in parentheses).
// NOLINTBEGIN(bugprone-macro-parentheses)
#define ZM_DISPATCHED(TEMPLATE, NAME, PARAMS, ARGS)                                                          \
    TEMPLATE void NAME##Base PARAMS                                                                          \
    {                                                                                                        \
        NAME##Kernel ARGS;                                                                                   \
    }                                                                                                        \
    TEMPLATE ZM_AVX2 void NAME##Avx2 PARAMS                                                                  \
    {                                                                                                        \
        NAME##Kernel ARGS;                                                                                   \
    }                                                                                                        \
    TEMPLATE void NAME PARAMS                                                                                \
    {                                                                                                        \
        if (cpuHasAvx2()) {                                                                                  \
            NAME##Avx2 ARGS;                                                                                 \
        } else {                                                                                             \
            NAME##Base ARGS;                                                                                 \
        }                                                                                                    \
    }
// NOLINTEND(bugprone-macro-parentheses)
#else
#define ZM_DISPATCHED(TEMPLATE, NAME, PARAMS, ARGS)                                                          \
    TEMPLATE void NAME PARAMS                                                                                \
    {                                                                                                        \
        NAME##Kernel ARGS;                                                                                   \
    }
#endif

// --- element types -------------------------------------------------------------------------------

template <class T>
struct Tag {
    using type = T;
};

/// Calls f(Tag<T>()) with the element type of \p code when it is numeric (not "complex" or
/// "string"); false otherwise. The one switch per call that keeps the loops free of dispatch.
template <class F>
bool withNumericType(int code, F&& f)
{
    switch (code) {
    case ZmPrimType::BYTE:
        f(Tag<uint8_t>());
        return true;
    case ZmPrimType::SHORT:
        f(Tag<int16_t>());
        return true;
    case ZmPrimType::INT:
        f(Tag<int32_t>());
        return true;
    case ZmPrimType::FLOAT:
        f(Tag<float>());
        return true;
    case ZmPrimType::DOUBLE:
        f(Tag<double>());
        return true;
    case ZmPrimType::USHORT:
        f(Tag<uint16_t>());
        return true;
    case ZmPrimType::UINT:
        f(Tag<uint32_t>());
        return true;
    case ZmPrimType::SBYTE:
        f(Tag<int8_t>());
        return true;
    default:
        return false;
    }
}

void logUnsupported(const char* where, ZmPrimType type)
{
    getTheLogInstance().errorf("Unsupported data type %s in %s\n", type.getName(), where);
}

/// \p v in the destination type D: integers saturate, floating values are clamped and truncated
/// toward zero (NaN gives 0), everything into a floating type converts as C++ converts it.
template <class D, class S>
ZM_KERNEL D convertValue(S v)
{
    if constexpr (std::is_floating_point_v<D>) {
        return D(v);
    } else if constexpr (std::is_floating_point_v<S>) {
        // The bounds as S: for int and uint from float they round up to 2^31 and 2^32, which the
        // >= test catches before any conversion could overflow.
        constexpr S lo = S(std::numeric_limits<D>::min());
        constexpr S hi = S(std::numeric_limits<D>::max());
        if constexpr (sizeof(D) < 4) {
            // Narrow destinations: both bounds are exact, so clamp, zero a NaN, and convert through
            // int32. Written as selects, which vectorise.
            S c = v < lo ? lo : v;
            c = c > hi ? hi : c;
            c = std::isnan(v) ? S(0) : c;
            return D(int32_t(c));
        } else {
            if (std::isnan(v)) {
                return D(0);
            }
            return v <= lo ? std::numeric_limits<D>::min() : v >= hi ? std::numeric_limits<D>::max() : D(v);
        }
    } else {
        // Every integer element type is at most 32 bits wide; the narrower pairs clamp in 32 bits,
        // which the vectoriser handles far better than 64.
        using Wide = std::conditional_t<(sizeof(S) < 4 && sizeof(D) < 4), int32_t, int64_t>;
        // NOLINTNEXTLINE(bugprone-signed-char-misuse): signed bytes are values here
        constexpr Wide lo = Wide(std::numeric_limits<D>::min());
        constexpr Wide hi = Wide(std::numeric_limits<D>::max());
        if constexpr (int64_t(std::numeric_limits<S>::min()) >= int64_t(std::numeric_limits<D>::min()) &&
                      uint64_t(std::numeric_limits<S>::max()) <= uint64_t(std::numeric_limits<D>::max())) {
            return D(v);
        } else {
            const Wide w = Wide(v); // NOLINT(bugprone-signed-char-misuse): signed bytes are values here
            return D(w < lo ? lo : w > hi ? hi : w);
        }
    }
}

template <class D, class S>
ZM_KERNEL void convertLoopKernel(D* __restrict d, const S* __restrict s, uint64_t n)
{
    for (uint64_t i = 0; i < n; ++i) {
        d[i] = convertValue<D>(s[i]);
    }
}
ZM_DISPATCHED(template <class D COMMA class S>, convertLoop,
              (D* __restrict d, const S* __restrict s, uint64_t n), (d, s, n))

template <class D, class S>
ZM_KERNEL void mapLinearLoopKernel(D* __restrict d, const S* __restrict s, uint64_t n, float offset,
                                   float scale)
{
    for (uint64_t i = 0; i < n; ++i) {
        const float v = (float(s[i]) + offset) * scale;
        d[i] = convertValue<D>(v);
    }
}
ZM_DISPATCHED(template <class D COMMA class S>, mapLinearLoop,
              (D* __restrict d, const S* __restrict s, uint64_t n, float offset, float scale),
              (d, s, n, offset, scale))

// --- range -------------------------------------------------------------------------------------

/// The range of p[0..n) under the sequential rule (a value lowers min when below it, else raises
/// max when above it), in 64 bytes of independent lanes: a generic vector, which the compiler maps
/// onto the registers of each target (a float min reduction written as a plain loop would not
/// vectorise, because of its NaN and signed-zero rules). The lanes all start at the values given;
/// NaN never wins a comparison, so NaN after the first value is passed over as the sequential rule
/// passes it over.
template <class T>
ZM_KERNEL void rangeOfKernel(const T* p, uint64_t n, T& lo, T& hi)
{
    typedef T Lanes __attribute__((vector_size(16)));
    constexpr uint64_t kLanes = 16 / sizeof(T);
    constexpr int kVectors = 4; // independent chains per bound
    Lanes mn[kVectors];
    Lanes mx[kVectors];
    for (int k = 0; k < kVectors; ++k) {
        mn[k] = Lanes{} + lo;
        mx[k] = Lanes{} + hi;
    }
    uint64_t i = 0;
    for (; i + kVectors * kLanes <= n; i += kVectors * kLanes) {
        for (int k = 0; k < kVectors; ++k) {
            Lanes v;
            std::memcpy(&v, p + i + uint64_t(k) * kLanes, sizeof v);
            mn[k] = v < mn[k] ? v : mn[k];
            mx[k] = v > mx[k] ? v : mx[k];
        }
    }
    for (int k = 0; k < kVectors; ++k) {
        for (uint64_t j = 0; j < kLanes; ++j) {
            lo = mn[k][j] < lo ? mn[k][j] : lo;
            hi = mx[k][j] > hi ? mx[k][j] : hi;
        }
    }
    for (; i < n; ++i) {
        const T v = p[i];
        lo = v < lo ? v : lo;
        hi = v > hi ? v : hi;
    }
}
ZM_DISPATCHED(template <class T>, rangeOf, (const T* p, uint64_t n, T& lo, T& hi), (p, n, lo, hi))

/// Calls f(Tag<T>(), count factor) for the types that getRange and isConstant cover; complex is
/// read as floats, two per element.
template <class F>
bool withRangeType(int code, F&& f)
{
    switch (code) {
    case ZmPrimType::BYTE:
        f(Tag<uint8_t>(), 1);
        return true;
    case ZmPrimType::SHORT:
        f(Tag<int16_t>(), 1);
        return true;
    case ZmPrimType::INT:
        f(Tag<int32_t>(), 1);
        return true;
    case ZmPrimType::FLOAT:
        f(Tag<float>(), 1);
        return true;
    case ZmPrimType::DOUBLE:
        f(Tag<double>(), 1);
        return true;
    case ZmPrimType::COMPLEX:
        f(Tag<float>(), 2);
        return true;
    case ZmPrimType::USHORT:
        f(Tag<uint16_t>(), 1);
        return true;
    default:
        return false;
    }
}

// --- exchanging memory ------------------------------------------------------------------------

/// Exchanges \p n bytes between \p a and \p b (which do not overlap) in 8-byte words, a loop the
/// compiler vectorises; each byte is read and written once, with no trip through a scratch buffer.
ZM_KERNEL void exchangeBytesKernel(Byte* __restrict a, Byte* __restrict b, uint64_t n)
{
    uint64_t i = 0;
    for (; i + 8 <= n; i += 8) {
        uint64_t x;
        uint64_t y;
        std::memcpy(&x, a + i, 8);
        std::memcpy(&y, b + i, 8);
        std::memcpy(a + i, &y, 8);
        std::memcpy(b + i, &x, 8);
    }
    for (; i < n; ++i) {
        const Byte x = a[i];
        a[i] = b[i];
        b[i] = x;
    }
}
ZM_DISPATCHED(, exchangeBytes, (Byte* __restrict a, Byte* __restrict b, uint64_t n), (a, b, n))

// --- byte order --------------------------------------------------------------------------------

template <class W>
ZM_KERNEL W byteSwapped(W w)
{
    if constexpr (sizeof(W) == 2) {
        return W(uint16_t(w >> 8 | w << 8));
    } else if constexpr (sizeof(W) == 4) {
        return __builtin_bswap32(w);
    } else {
        return __builtin_bswap64(w);
    }
}

template <class W>
ZM_KERNEL void swapWordsKernel(void* p, uint64_t n)
{
    Byte* b = static_cast<Byte*>(p);
    for (uint64_t i = 0; i < n; ++i) {
        W w;
        std::memcpy(&w, b + i * sizeof(W), sizeof(W));
        w = byteSwapped(w);
        std::memcpy(b + i * sizeof(W), &w, sizeof(W));
    }
}
// The baseline (SSE2) has no byte shuffle: the 32-bit reversal takes shifts there.
template <class W>
struct SwapWords {
    static ZM_KERNEL void swapWordsKernel(void* p, uint64_t n) { ::swapWordsKernel<W>(p, n); }
    ZM_DISPATCHED(static, swapWords, (void* p, uint64_t n), (p, n))
};
template <class W>
void swapWords(void* p, uint64_t n)
{
    SwapWords<W>::swapWords(p, n);
}

// --- voxel moves -------------------------------------------------------------------------------

/// Fills \p count elements at \p d with the element at \p value (zeros when null).
void fillElements(Byte* d, uint64_t count, int size, const void* value)
{
    if (count == 0) {
        return;
    }
    const Byte* v = static_cast<const Byte*>(value);
    bool zero = v == nullptr;
    if (!zero) {
        zero = true;
        for (int k = 0; k < size; ++k) {
            zero = zero && v[k] == 0;
        }
    }
    const uint64_t bytes = count * uint64_t(size);
    if (zero || size == 1) {
        std::memset(d, zero ? 0 : v[0], bytes);
        return;
    }
    std::memcpy(d, v, size_t(size));
    // Doubling copies: the pattern is repeated from what is already written.
    for (uint64_t done = uint64_t(size); done < bytes;) {
        const uint64_t chunk = std::min(done, bytes - done);
        std::memcpy(d + done, d, chunk);
        done += chunk;
    }
}

/// Moves one voxel: a fixed size becomes one load and store.
template <int Size>
struct VoxelMove {
    static void copy(Byte* d, const Byte* s, uint64_t) { std::memcpy(d, s, Size); }
};
template <>
struct VoxelMove<0> {
    static void copy(Byte* d, const Byte* s, uint64_t size) { std::memcpy(d, s, size); }
};

// In-place axis permutation. Any order of three axes is a product of at most three swaps of
// neighbouring axes, and each swap is a transposition that moves large pieces:
// - swapping x and y transposes every z plane: square planes by exchanging voxel pairs tile by
//   tile, others through the scratch (which holds any plane: it is as big as the two largest
//   extents make one);
// - swapping y and z transposes the matrix of x lines, following its cycles one line in hand,
//   with one bit per line marking the lines already in place.
// Either moves each voxel once (plus a copy of a plane into the scratch), where following the
// cycles of the whole permutation voxel by voxel jumps across the volume at every step.

const uint64_t kTransposeTile = 32;

/// Transposes \p planes planes of \p rows x \p cols voxels: plane[r][c] moves to plane[c][r].
template <int Size>
void transposePlanes(Byte* data, uint64_t vb, uint64_t rows, uint64_t cols, uint64_t planes, Byte* scratch)
{
    using Move = VoxelMove<Size>;
    const uint64_t planeBytes = rows * cols * vb;
    for (uint64_t p = 0; p < planes; ++p) {
        Byte* plane = data + p * planeBytes;
        if (Size > 0 && rows == cols) {
            Byte held[std::max(Size, 1)];
            for (uint64_t r0 = 0; r0 < rows; r0 += kTransposeTile) {
                const uint64_t r1 = std::min(r0 + kTransposeTile, rows);
                for (uint64_t c0 = r0; c0 < cols; c0 += kTransposeTile) {
                    const uint64_t c1 = std::min(c0 + kTransposeTile, cols);
                    for (uint64_t r = r0; r < r1; ++r) {
                        for (uint64_t c = std::max(c0, r + 1); c < c1; ++c) {
                            Byte* x = plane + (r * cols + c) * vb;
                            Byte* y = plane + (c * rows + r) * vb;
                            Move::copy(held, x, vb);
                            Move::copy(x, y, vb);
                            Move::copy(y, held, vb);
                        }
                    }
                }
            }
            continue;
        }
        std::memcpy(scratch, plane, planeBytes);
        for (uint64_t r0 = 0; r0 < rows; r0 += kTransposeTile) {
            const uint64_t r1 = std::min(r0 + kTransposeTile, rows);
            for (uint64_t c0 = 0; c0 < cols; c0 += kTransposeTile) {
                const uint64_t c1 = std::min(c0 + kTransposeTile, cols);
                for (uint64_t c = c0; c < c1; ++c) {
                    for (uint64_t r = r0; r < r1; ++r) {
                        Move::copy(plane + (c * rows + r) * vb, scratch + (r * cols + c) * vb, vb);
                    }
                }
            }
        }
    }
}

/// Transposes the \p rows x \p cols matrix of lines of \p lineBytes each in place, one line in
/// hand at \p held; \p done has a clear bit for each line.
void transposeLines(Byte* data, uint64_t lineBytes, uint64_t rows, uint64_t cols, ZmBitfield& done,
                    Byte* held)
{
    const uint64_t n = rows * cols;
    auto line = [&](uint64_t k) { return data + k * lineBytes; };
    // New position k = c * rows + r holds the line that was at r * cols + c; the first and the last
    // line stay.
    auto sourceOf = [&](uint64_t k) { return (k % rows) * cols + k / rows; };
    for (uint64_t start = 1; start + 1 < n; ++start) {
        if (done[start] != 0) {
            continue;
        }
        uint64_t src = sourceOf(start);
        if (src == start) {
            continue;
        }
        std::memcpy(held, line(start), lineBytes);
        uint64_t cur = start;
        while (src != start) {
            std::memcpy(line(cur), line(src), lineBytes);
            done.set(cur);
            cur = src;
            src = sourceOf(cur);
        }
        std::memcpy(line(cur), held, lineBytes);
        done.set(cur);
    }
}

/// Permutes the axes by swaps of neighbouring axes ('A' swaps x and y, 'B' swaps y and z) given by
/// \p swaps, of the volume with dims \p n; the bit field has a bit for every line of the volume.
template <int Size>
void permuteBySwaps(Byte* data, uint64_t vb, const uint64_t n[3], const char* swaps, ZmBitfield& done,
                    Byte* scratch)
{
    uint64_t d[3] = {n[0], n[1], n[2]};
    for (const char* s = swaps; *s != 0; ++s) {
        if (*s == 'A') {
            transposePlanes<Size>(data, vb, d[1], d[0], d[2], scratch);
            std::swap(d[0], d[1]);
        } else {
            done.unsetAll();
            transposeLines(data, d[0] * vb, d[2], d[1], done, scratch);
            std::swap(d[1], d[2]);
        }
    }
}

// --- down-sampling ------------------------------------------------------------------------------

/// Walks the output slices of a block reduction with the progress protocol: one task, a step per
/// output slice, a stop at a cancellation. \p slice(oz) reduces one output slice.
template <class F>
void forEachOutputSlice(uint64_t outZ, ZmProgressInterface* progress, F&& slice)
{
    ProgressScope scope(progress);
    if (progress != nullptr) {
        progress->startWorking(int(std::min<uint64_t>(outZ, uint64_t(std::numeric_limits<int>::max()))),
                               "Down-sampling");
    }
    for (uint64_t oz = 0; oz < outZ; ++oz) {
        if (progress != nullptr && progress->isCanceled()) {
            return;
        }
        slice(oz);
        if (progress != nullptr) {
            progress->nextStep();
        }
    }
}

struct Blocks {
    uint64_t nx, ny, nz;
    uint64_t bx, by, bz;
    uint64_t outX, outY, outZ;
    uint64_t nc;
    bool valid;
};

Blocks blocksOf(uint64_t nx, uint64_t ny, uint64_t nz, int bx, int by, int bz, int nc)
{
    Blocks b{nx, ny, nz, uint64_t(bx), uint64_t(by), uint64_t(bz), 0, 0, 0, uint64_t(nc), false};
    if (bx < 1 || by < 1 || bz < 1 || nc < 1) {
        return b;
    }
    b.outX = nx / b.bx;
    b.outY = ny / b.by;
    b.outZ = nz / b.bz;
    b.valid = true;
    return b;
}

/// The sum type of a block mean: float for float, double for double, an exact integer otherwise.
template <class T>
using SumOf = std::conditional_t<std::is_same_v<T, float>, float,
                                 std::conditional_t<std::is_same_v<T, double>, double, int64_t>>;

/// Block means of one output slice. The sums of a row of output voxels build up line by line, in
/// z, y, x order within each block, so the source streams through once.
template <class T>
void meanSlice(T* dst, const T* src, const Blocks& b, uint64_t oz)
{
    using Sum = SumOf<T>;
    constexpr uint64_t kChunk = 256; // output values per pass: the sums stay on the stack
    Sum sums[kChunk]{};
    const uint64_t rowValues = b.outX * b.nc;
    // sums[0..count) are set before each use; the analyser cannot follow the chunking.
    const Sum divisor = Sum(b.bx * b.by * b.bz);
    const uint64_t lineValues = b.nx * b.nc;
    for (uint64_t oy = 0; oy < b.outY; ++oy) {
        T* out = dst + ((oz * b.outY + oy) * b.outX) * b.nc;
        for (uint64_t first = 0; first < rowValues; first += kChunk) {
            const uint64_t count = std::min(kChunk, rowValues - first);
            for (uint64_t k = 0; k < count; ++k) {
                sums[k] = Sum(0);
            }
            for (uint64_t dz = 0; dz < b.bz; ++dz) {
                for (uint64_t dy = 0; dy < b.by; ++dy) {
                    const T* line = src + ((oz * b.bz + dz) * b.ny + (oy * b.by + dy)) * lineValues;
                    for (uint64_t k = 0; k < count; ++k) {
                        const uint64_t v = first + k;
                        const uint64_t ox = v / b.nc;
                        const uint64_t c = v % b.nc;
                        const T* block = line + ox * b.bx * b.nc + c;
                        Sum s = sums[k];
                        for (uint64_t dx = 0; dx < b.bx; ++dx) {
                            s += Sum(block[dx * b.nc]); // NOLINT(bugprone-signed-char-misuse)
                        }
                        sums[k] = s;
                    }
                }
            }
            for (uint64_t k = 0; k < count; ++k) {
                out[first + k] =
                    T(sums[k] / divisor); // NOLINT(clang-analyzer-core.UndefinedBinaryOperatorResult)
            }
        }
    }
}

#if defined(ZM_HAVE_AVX2_KERNELS)
/// 16-bit 2x2x2 means of \p pairs output values from four source lines, 16 at a time: each
/// multiply-add with ones sums the horizontal pairs of a line into 32 bits, four of them give the
/// block sums, which are divided by 8 with truncation toward zero and packed back. Unsigned values
/// are moved into the signed range first (x - 32768) and the bias added back to the sums. Returns
/// the number of values done; the caller finishes the rest.
ZM_AVX2 inline __m256i pairSumsAvx2(const void* at, __m256i flip)
{
    const __m256i v = _mm256_loadu_si256(static_cast<const __m256i*>(at));
    return _mm256_madd_epi16(_mm256_xor_si256(v, flip), _mm256_set1_epi16(1));
}

template <class T>
ZM_AVX2 inline __m256i blockMeansAvx2(const T* l00, const T* l01, const T* l10, const T* l11, uint64_t x)
{
    constexpr bool isUnsigned = std::is_unsigned_v<T>;
    const __m256i flip = _mm256_set1_epi16(int16_t(isUnsigned ? 0x8000 : 0));
    __m256i sum =
        _mm256_add_epi32(_mm256_add_epi32(pairSumsAvx2(l00 + x, flip), pairSumsAvx2(l01 + x, flip)),
                         _mm256_add_epi32(pairSumsAvx2(l10 + x, flip), pairSumsAvx2(l11 + x, flip)));
    sum = _mm256_add_epi32(sum, _mm256_set1_epi32(isUnsigned ? 8 * 32768 : 0));
    // Truncation toward zero: negative sums are rounded up by adding 7 before the shift.
    sum = _mm256_add_epi32(sum, _mm256_and_si256(_mm256_srai_epi32(sum, 31), _mm256_set1_epi32(7)));
    return _mm256_srai_epi32(sum, 3);
}

template <class T>
ZM_AVX2 uint64_t mean222Avx2(T* out, const T* l00, const T* l01, const T* l10, const T* l11, uint64_t pairs)
{
    static_assert(sizeof(T) == 2, "16-bit values only");
    uint64_t k = 0;
    for (; k + 16 <= pairs; k += 16) {
        const __m256i low = blockMeansAvx2(l00, l01, l10, l11, 2 * k);
        const __m256i high = blockMeansAvx2(l00, l01, l10, l11, 2 * k + 16);
        // Packing works within 128-bit halves; the permutation puts the four quarters in order.
        const __m256i packed =
            std::is_unsigned_v<T> ? _mm256_packus_epi32(low, high) : _mm256_packs_epi32(low, high);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + k), _mm256_permute4x64_epi64(packed, 0xD8));
    }
    return k;
}

/// Float 2x2x2 means, 8 at a time, in the z, y, x order of the scalar loop: the even and the odd
/// values of each line are separated by shuffles within 128-bit halves (which leaves the results
/// in the order 0 1 4 5 2 3 6 7, put right before the store). Returns the number of values done.
ZM_AVX2 uint64_t mean222Avx2(float* out, const float* l00, const float* l01, const float* l10,
                             const float* l11, uint64_t pairs)
{
    uint64_t k = 0;
    for (; k + 8 <= pairs; k += 8) {
        const uint64_t x = 2 * k;
        const float* lines[4] = {l00, l01, l10, l11};
        __m256 sum = _mm256_setzero_ps();
        for (int l = 0; l < 4; ++l) {
            const __m256 a = _mm256_loadu_ps(lines[l] + x);
            const __m256 b = _mm256_loadu_ps(lines[l] + x + 8);
            const __m256 even = _mm256_shuffle_ps(a, b, 0x88);
            const __m256 odd = _mm256_shuffle_ps(a, b, 0xDD);
            sum = l == 0 ? _mm256_add_ps(even, odd) : _mm256_add_ps(_mm256_add_ps(sum, even), odd);
        }
        // Dividing by 8 and multiplying by 1/8 round the same exact value.
        const __m256 mean = _mm256_mul_ps(sum, _mm256_set1_ps(0.125f));
        _mm256_storeu_ps(out + k, _mm256_castpd_ps(_mm256_permute4x64_pd(_mm256_castps_pd(mean), 0xD8)));
    }
    return k;
}
#endif

/// The 2x2x2 single-component mean, the common case, with the block read as four pairs. Eight
/// values of at most 16 bits sum exactly in 32 bits, which vectorise twice as wide as 64. Integer
/// sums are exact in any order, so they add the four lines first (a plain vertical sum) and then
/// the pairs; float sums keep the z, y, x order of the general loop.
template <class T>
ZM_KERNEL void meanSlice222Kernel(T* dst, const T* src, const Blocks& b, uint64_t oz)
{
    using Sum = std::conditional_t<std::is_integral_v<T> && sizeof(T) <= 2, int32_t, SumOf<T>>;
    constexpr uint64_t kChunk = 512; // integer pairs per pass: the line sums stay on the stack
    // Zeroed only so that the analyser sees every read initialised; floats need none.
    Sum lines[std::is_integral_v<T> ? 2 * kChunk : 1]{};
    for (uint64_t oy = 0; oy < b.outY; ++oy) {
        const T* l00 = src + ((2 * oz) * b.ny + 2 * oy) * b.nx;
        const T* l01 = l00 + b.nx;
        const T* l10 = l00 + b.nx * b.ny;
        const T* l11 = l10 + b.nx;
        T* out = dst + (oz * b.outY + oy) * b.outX;
        uint64_t done = 0;
#if defined(ZM_HAVE_AVX2_KERNELS)
        if constexpr (sizeof(T) == 2 || std::is_same_v<T, float>) {
            if (cpuHasAvx2()) {
                done = mean222Avx2(out, l00, l01, l10, l11, b.outX);
            }
        }
#endif
        // NOLINTBEGIN(bugprone-signed-char-misuse): signed bytes are values here
        if constexpr (std::is_integral_v<T>) {
            for (uint64_t first = done; first < b.outX; first += kChunk) {
                const uint64_t pairs = std::min(kChunk, b.outX - first);
                const uint64_t x0 = 2 * first;
                for (uint64_t x = 0; x < 2 * pairs; ++x) {
                    lines[x] = Sum(l00[x0 + x]) + Sum(l01[x0 + x]) + Sum(l10[x0 + x]) + Sum(l11[x0 + x]);
                }
                for (uint64_t k = 0; k < pairs; ++k) {
                    out[first + k] = T((lines[2 * k] + lines[2 * k + 1]) / Sum(8));
                }
            }
        } else {
            for (uint64_t ox = done; ox < b.outX; ++ox) {
                const uint64_t x = 2 * ox;
                // z, y, x order, as the general loop sums.
                Sum s = Sum(l00[x]);
                s += Sum(l00[x + 1]);
                s += Sum(l01[x]);
                s += Sum(l01[x + 1]);
                s += Sum(l10[x]);
                s += Sum(l10[x + 1]);
                s += Sum(l11[x]);
                s += Sum(l11[x + 1]);
                out[ox] = T(s / Sum(8));
            }
        }
        // NOLINTEND(bugprone-signed-char-misuse)
    }
}
ZM_DISPATCHED(template <class T>, meanSlice222, (T * dst, const T* src, const Blocks& b, uint64_t oz),
              (dst, src, b, oz))

template <class T>
void maxSlice(T* dst, const T* src, const Blocks& b, uint64_t oz)
{
    for (uint64_t oy = 0; oy < b.outY; ++oy) {
        for (uint64_t ox = 0; ox < b.outX; ++ox) {
            for (uint64_t c = 0; c < b.nc; ++c) {
                bool first = true;
                T m = T(0);
                for (uint64_t dz = 0; dz < b.bz; ++dz) {
                    for (uint64_t dy = 0; dy < b.by; ++dy) {
                        const T* line =
                            src + (((oz * b.bz + dz) * b.ny + (oy * b.by + dy)) * b.nx + ox * b.bx) * b.nc +
                            c;
                        for (uint64_t dx = 0; dx < b.bx; ++dx) {
                            const T v = line[dx * b.nc];
                            if (first) {
                                m = v;
                                first = false;
                            } else if (v > m) {
                                m = v;
                            }
                        }
                    }
                }
                dst[((oz * b.outY + oy) * b.outX + ox) * b.nc + c] = m;
            }
        }
    }
}

template <class T>
void labelSlice(T* dst, const T* src, const Blocks& b, uint64_t oz, T* scratch)
{
    const uint64_t blockSize = b.bx * b.by * b.bz;
    for (uint64_t oy = 0; oy < b.outY; ++oy) {
        for (uint64_t ox = 0; ox < b.outX; ++ox) {
            uint64_t k = 0;
            for (uint64_t dz = 0; dz < b.bz; ++dz) {
                for (uint64_t dy = 0; dy < b.by; ++dy) {
                    const T* line = src + ((oz * b.bz + dz) * b.ny + (oy * b.by + dy)) * b.nx + ox * b.bx;
                    for (uint64_t dx = 0; dx < b.bx; ++dx) {
                        scratch[k++] = line[dx];
                    }
                }
            }
            std::sort(scratch, scratch + blockSize);
            // The longest run of the sorted block; the first (lowest) label wins a tie.
            T best = scratch[0];
            uint64_t bestRun = 0;
            for (uint64_t i = 0; i < blockSize;) {
                uint64_t j = i + 1;
                while (j < blockSize && scratch[j] == scratch[i]) {
                    ++j;
                }
                if (j - i > bestRun) {
                    bestRun = j - i;
                    best = scratch[i];
                }
                i = j;
            }
            dst[(oz * b.outY + oy) * b.outX + ox] = best;
        }
    }
}

} // namespace

// --- fill --------------------------------------------------------------------------------------

void ZmRawData::memset(ZmTypedPointer p, int value, int64_t n)
{
    void* d = p.data();
    const ZmPrimType type = p.primType();
    auto fill = [&](auto v) {
        using T = decltype(v);
        T* t = static_cast<T*>(d);
        for (int64_t i = 0; i < n; ++i) {
            t[i] = v;
        }
    };
    switch (int(type)) {
    case ZmPrimType::BYTE:
        fill(uint8_t(value));
        break;
    case ZmPrimType::SHORT:
        fill(int16_t(value));
        break;
    case ZmPrimType::USHORT:
        fill(uint16_t(value));
        break;
    case ZmPrimType::INT:
        fill(int32_t(value));
        break;
    case ZmPrimType::FLOAT:
        fill(float(value));
        break;
    case ZmPrimType::DOUBLE:
        fill(double(value));
        break;
    default:
        logUnsupported("ZmRawData::memset()", type);
        break;
    }
}

void ZmRawData::memset(ZmTypedPointer p, double value, int64_t n)
{
    const ZmPrimType type = p.primType();
    switch (int(type)) {
    case ZmPrimType::BYTE:
    case ZmPrimType::SHORT:
    case ZmPrimType::INT:
    case ZmPrimType::USHORT: {
        // Limited to the int range first: converting a larger double to int is undefined.
        const double r = std::floor(value + 0.5);
        memset(p,
               r != r               ? 0
               : r <= -2147483648.0 ? std::numeric_limits<int>::min()
               : r >= 2147483647.0  ? std::numeric_limits<int>::max()
                                    : int(r),
               n);
        break;
    }
    case ZmPrimType::FLOAT: {
        float* t = static_cast<float*>(p.data());
        const float v = float(value);
        for (int64_t i = 0; i < n; ++i) {
            t[i] = v;
        }
        break;
    }
    case ZmPrimType::DOUBLE: {
        double* t = static_cast<double*>(p.data());
        for (int64_t i = 0; i < n; ++i) {
            t[i] = value;
        }
        break;
    }
    default:
        logUnsupported("ZmRawData::memset()", type);
        break;
    }
}

// --- conversion --------------------------------------------------------------------------------

void ZmRawData::memcpy(ZmTypedPointer dst, ZmTypedPointer src, int64_t n)
{
    const ZmPrimType dt = dst.primType();
    const ZmPrimType st = src.primType();
    if (dt == st) {
        if (n > 0) {
            std::memmove(dst.data(), src.data(), size_t(n) * size_t(dt.size()));
        }
        return;
    }
    if (dt == ZmPrimType::COMPLEX || st == ZmPrimType::COMPLEX) {
        getTheLogInstance().errorf("ERROR: ZmRawData::memcpy(), complex data are not supported\n");
        return;
    }
    if (int(dt) > ZmPrimType::USHORT) {
        getTheLogInstance().errorf("Unsupported data type %s in ZmRawData()\n", dt.getName());
        return;
    }
    if (n <= 0) {
        return;
    }
    withNumericType(dt, [&](auto d) {
        using D = typename decltype(d)::type;
        withNumericType(st, [&](auto s) {
            using S = typename decltype(s)::type;
            convertLoop(static_cast<D*>(dst.data()), static_cast<const S*>(src.data()), uint64_t(n));
        });
    });
}

void ZmRawData::mapLinear(ZmTypedPointer dst, ZmTypedPointer src, uint64_t n, double offset, double scale)
{
    const ZmPrimType dt = dst.primType();
    const ZmPrimType st = src.primType();
    const float o = float(offset);
    const float s = float(scale);
    if (st == ZmPrimType::COMPLEX && dt != ZmPrimType::COMPLEX) {
        getTheLogInstance().errorf(
            "ERROR: ZmRawData::mapLinear(), mapping from complex to real is not supported\n");
        return;
    }
    if (dt == ZmPrimType::STRING || st == ZmPrimType::STRING) {
        logUnsupported("ZmRawData::mapLinear()", ZmPrimType(ZmPrimType::STRING));
        return;
    }
    if (dt == ZmPrimType::COMPLEX) {
        float* d = static_cast<float*>(dst.data());
        if (st == ZmPrimType::COMPLEX) {
            mapLinearLoop(d, static_cast<const float*>(src.data()), 2 * n, o, s);
            return;
        }
        withNumericType(st, [&](auto t) {
            using S = typename decltype(t)::type;
            const S* v = static_cast<const S*>(src.data());
            for (uint64_t i = 0; i < n; ++i) {
                d[2 * i] = (float(v[i]) + o) * s;
                d[2 * i + 1] = 0.0f;
            }
        });
        return;
    }
    withNumericType(dt, [&](auto d) {
        using D = typename decltype(d)::type;
        withNumericType(st, [&](auto t) {
            using S = typename decltype(t)::type;
            mapLinearLoop(static_cast<D*>(dst.data()), static_cast<const S*>(src.data()), n, o, s);
        });
    });
}

// --- range -------------------------------------------------------------------------------------

void ZmRawData::getRange(ZmTypedPointer p, uint64_t n, float& min, float& max)
{
    if (p.isNull()) {
        return;
    }
    withRangeType(p.primType(), [&](auto tag, uint64_t factor) {
        using T = typename decltype(tag)::type;
        const T* v = static_cast<const T*>(p.data());
        T lo = v[0];
        T hi = v[0];
        if (n * factor > 1) {
            rangeOf(v + 1, n * factor - 1, lo, hi);
        }
        min = float(lo);
        max = float(hi);
    });
}

bool ZmRawData::isConstant(ZmTypedPointer p, uint64_t n)
{
    bool constant = false;
    const bool known = withRangeType(p.primType(), [&](auto tag, uint64_t factor) {
        using T = typename decltype(tag)::type;
        const uint64_t count = n * factor;
        if (count == 0) {
            constant = true;
            return;
        }
        const T* v = static_cast<const T*>(p.data());
        T lo = v[0];
        T hi = v[0];
        // Blocks big enough to stream, small enough to stop early on varying data.
        constexpr uint64_t kBlock = 16384;
        for (uint64_t i = 1; i < count; i += kBlock) {
            rangeOf(v + i, std::min(kBlock, count - i), lo, hi);
            if (lo < hi) {
                return;
            }
        }
        constant = true;
    });
    return known && constant;
}

// --- byte order --------------------------------------------------------------------------------

void ZmRawData::swapBytesWord2(void* p, uint64_t n)
{
    swapWords<uint16_t>(p, n);
}

void ZmRawData::swapBytesWord4(void* p, uint64_t n)
{
    swapWords<uint32_t>(p, n);
}

void ZmRawData::swapBytesWord8(void* p, uint64_t n)
{
    swapWords<uint64_t>(p, n);
}

void ZmRawData::swapBytes(ZmTypedPointer p, uint64_t n)
{
    const ZmPrimType type = p.primType();
    switch (type.size()) {
    case 1:
        break;
    case 2:
        swapBytesWord2(p.data(), n);
        break;
    case 4:
        swapBytesWord4(p.data(), n);
        break;
    case 8:
        // Intended: only a double is one 64-bit word; "complex" and "string" swap as two
        // 32-bit words each.
        if (type == ZmPrimType::DOUBLE) {
            swapBytesWord8(p.data(), n);
        } else {
            swapBytesWord4(p.data(), 2 * n);
        }
        break;
    default:
        getTheLogInstance().warnf("Swapping of %d-byte words not supported.", type.size());
        break;
    }
}

uint64_t ZmRawData::readBigEndian(ZmTypedPointer p, uint64_t n, FILE* f)
{
    const uint64_t got = ZmRawData::fread(p.data(), uint64_t(p.primType().size()), n, f);
    swapBytes(p, got);
    return got;
}

uint64_t ZmRawData::readLittleEndian(ZmTypedPointer p, uint64_t n, FILE* f)
{
    return ZmRawData::fread(p.data(), uint64_t(p.primType().size()), n, f);
}

uint64_t ZmRawData::writeBigEndian(ZmTypedPointer p, uint64_t n, FILE* f)
{
    swapBytes(p, n);
    const uint64_t put = ZmRawData::fwrite(p.data(), uint64_t(p.primType().size()), n, f);
    swapBytes(p, n);
    return put;
}

uint64_t ZmRawData::writeLittleEndian(ZmTypedPointer p, uint64_t n, FILE* f)
{
    return ZmRawData::fwrite(p.data(), uint64_t(p.primType().size()), n, f);
}

namespace {
constexpr uint64_t kStreamChunk = 1048576;
}

uint64_t ZmRawData::fread(void* buf, uint64_t elemSize, uint64_t n, FILE* f)
{
    if (elemSize == 0 || f == nullptr) {
        return 0;
    }
    const uint64_t total = elemSize * n;
    Byte* b = static_cast<Byte*>(buf);
    uint64_t done = 0;
    while (done < total) {
        const uint64_t chunk = std::min(kStreamChunk, total - done);
        const uint64_t got = std::fread(b + done, 1, size_t(chunk), f);
        done += got;
        if (got < chunk) {
            break;
        }
    }
    return done / elemSize;
}

uint64_t ZmRawData::fwrite(void* buf, uint64_t elemSize, uint64_t n, FILE* f)
{
    if (elemSize == 0 || f == nullptr) {
        return 0;
    }
    const uint64_t total = elemSize * n;
    const Byte* b = static_cast<const Byte*>(buf);
    uint64_t done = 0;
    for (uint64_t k = 0; k < total / kStreamChunk; ++k) {
        const uint64_t put = std::fwrite(b + done, 1, size_t(kStreamChunk), f);
        done += put;
        if (put < kStreamChunk) {
            return done / elemSize;
        }
    }
    if (done < total) {
        done += std::fwrite(b + done, 1, size_t(total - done), f);
    }
    return done / elemSize;
}

// --- axes --------------------------------------------------------------------------------------

bool ZmRawData::swapDims(ZmTypedPointer p, int dims[3], const int perm[3], int nComponents)
{
    if (perm[0] == 0 && perm[1] == 1 && perm[2] == 2) {
        return true;
    }
    const bool isPermutation = perm[0] >= 0 && perm[0] <= 2 && perm[1] >= 0 && perm[1] <= 2 && perm[2] >= 0 &&
                               perm[2] <= 2 && perm[0] != perm[1] && perm[1] != perm[2] && perm[0] != perm[2];
    if (p.isNull() || !isPermutation || dims[0] < 1 || dims[1] < 1 || dims[2] < 1 || nComponents < 1) {
        return false;
    }
    const int newDims[3] = {dims[perm[0]], dims[perm[1]], dims[perm[2]]};
    const uint64_t voxels = uint64_t(dims[0]) * uint64_t(dims[1]) * uint64_t(dims[2]);
    if (isConstant(p, voxels * uint64_t(nComponents))) {
        std::memcpy(dims, newDims, sizeof newDims);
        return true;
    }
    const ZmPrimType type = p.primType();
    const int voxelBytes = type.size() * nComponents;
    const bool moved = voxelBytes == 4 || type == ZmPrimType::BYTE || type == ZmPrimType::SHORT ||
                       type == ZmPrimType::USHORT || type == ZmPrimType::INT || type == ZmPrimType::FLOAT ||
                       type == ZmPrimType::DOUBLE;
    if (!moved) {
        logUnsupported("ZmRawData::swapDims()", type);
        return false;
    }
    const uint64_t n[3] = {uint64_t(dims[0]), uint64_t(dims[1]), uint64_t(dims[2])};
    const uint64_t lo = std::min({n[0], n[1], n[2]});
    const uint64_t hi = std::max({n[0], n[1], n[2]});
    const uint64_t middle = n[0] + n[1] + n[2] - lo - hi;
    // The swaps that make new axis i old axis perm[i]; of the two ways to reverse the axes, the
    // one whose line swap moves the longer lines.
    const char* swaps = "A";
    if (perm[0] == 0) {
        swaps = "B";
    } else if (perm[0] == 2 && perm[1] == 0) {
        swaps = "BA";
    } else if (perm[0] == 1 && perm[1] == 2) {
        swaps = "AB";
    } else if (perm[0] == 2) {
        swaps = n[1] >= std::min(n[0], n[2]) ? "ABA" : "BAB";
    }
    void* scratch = nullptr;
    try {
        // Both allocated before anything moves: a failure leaves the data as it was.
        ZmBitfield done(n[0] * n[1] * n[2] / lo, ZmBitfield::CLEAR);
        scratch = zmmalloc(std::max<uint64_t>(2, middle) * hi * uint64_t(voxelBytes));
        Byte* data = static_cast<Byte*>(p.data());
        Byte* held = static_cast<Byte*>(scratch);
        const uint64_t vb = uint64_t(voxelBytes);
        switch (voxelBytes) {
        case 1:
            permuteBySwaps<1>(data, vb, n, swaps, done, held);
            break;
        case 2:
            permuteBySwaps<2>(data, vb, n, swaps, done, held);
            break;
        case 4:
            permuteBySwaps<4>(data, vb, n, swaps, done, held);
            break;
        case 8:
            permuteBySwaps<8>(data, vb, n, swaps, done, held);
            break;
        default:
            permuteBySwaps<0>(data, vb, n, swaps, done, held);
            break;
        }
    } catch (const ZmMemoryException&) {
        zmfree(scratch);
        return false;
    }
    zmfree(scratch);
    std::memcpy(dims, newDims, sizeof newDims);
    return true;
}

int ZmRawData::crop(void*& data, int elemSize, int dims[3], const int boxMin[3], const int boxMax[3],
                    const void* fillValue)
{
    if (elemSize < 1 || dims[0] < 1 || dims[1] < 1 || dims[2] < 1 || data == nullptr) {
        return 0;
    }
    if (boxMin[0] == 0 && boxMin[1] == 0 && boxMin[2] == 0 && boxMax[0] == dims[0] - 1 &&
        boxMax[1] == dims[1] - 1 && boxMax[2] == dims[2] - 1) {
        return 1;
    }
    int64_t out[3];
    for (int a = 0; a < 3; ++a) {
        out[a] = int64_t(boxMax[a]) - int64_t(boxMin[a]) + 1;
        if (out[a] < 1 || out[a] > std::numeric_limits<int>::max()) {
            return 0;
        }
    }
    const uint64_t es = uint64_t(elemSize);
    const uint64_t lineBytes = uint64_t(out[0]) * es;
    Byte* fresh = nullptr;
    try {
        fresh = static_cast<Byte*>(zmmalloc(lineBytes * uint64_t(out[1]) * uint64_t(out[2])));
    } catch (const ZmMemoryException&) {
        return 0;
    }
    const Byte* src = static_cast<const Byte*>(data);
    // The part of each box line that lies inside the source: x in [x0, x1).
    const int64_t x0 = std::max<int64_t>(0, -int64_t(boxMin[0]));
    const int64_t x1 = std::min<int64_t>(out[0], int64_t(dims[0]) - int64_t(boxMin[0]));
    for (int64_t z = 0; z < out[2]; ++z) {
        const int64_t sz = int64_t(boxMin[2]) + z;
        for (int64_t y = 0; y < out[1]; ++y) {
            const int64_t sy = int64_t(boxMin[1]) + y;
            Byte* line = fresh + (uint64_t(z) * uint64_t(out[1]) + uint64_t(y)) * lineBytes;
            const bool inside = sz >= 0 && sz < dims[2] && sy >= 0 && sy < dims[1] && x0 < x1;
            if (!inside) {
                fillElements(line, uint64_t(out[0]), elemSize, fillValue);
                continue;
            }
            fillElements(line, uint64_t(x0), elemSize, fillValue);
            const Byte* from = src + ((uint64_t(sz) * uint64_t(dims[1]) + uint64_t(sy)) * uint64_t(dims[0]) +
                                      uint64_t(int64_t(boxMin[0]) + x0)) *
                                         es;
            std::memcpy(line + uint64_t(x0) * es, from, uint64_t(x1 - x0) * es);
            fillElements(line + uint64_t(x1) * es, uint64_t(out[0] - x1), elemSize, fillValue);
        }
    }
    zmfree(data);
    data = fresh;
    for (int a = 0; a < 3; ++a) {
        dims[a] = int(out[a]);
    }
    return 1;
}

int ZmRawData::flip(void* data, int elemSize, const int dims[3], int axis)
{
    if (axis < 0 || axis > 2 || dims[0] < 1 || dims[1] < 1 || dims[2] < 1 || data == nullptr ||
        elemSize < 1) {
        return 0;
    }
    if (dims[axis] == 1) {
        return 1;
    }
    const uint64_t es = uint64_t(elemSize);
    const uint64_t nx = uint64_t(dims[0]), ny = uint64_t(dims[1]), nz = uint64_t(dims[2]);
    const uint64_t lineBytes = nx * es;
    Byte* tmp = nullptr;
    try {
        tmp = static_cast<Byte*>(zmmalloc(lineBytes));
    } catch (const ZmMemoryException&) {
        return 0;
    }
    Byte* d = static_cast<Byte*>(data);
    if (axis == 0) {
        // Each line reversed through the scratch line: one read and one write of every byte.
        for (uint64_t l = 0; l < ny * nz; ++l) {
            Byte* line = d + l * lineBytes;
            std::memcpy(tmp, line, lineBytes);
            auto reverse = [&](auto tag) {
                using T = typename decltype(tag)::type;
                const T* s = reinterpret_cast<const T*>(tmp);
                T* t = reinterpret_cast<T*>(line);
                for (uint64_t x = 0; x < nx; ++x) {
                    std::memcpy(t + x, s + (nx - 1 - x), sizeof(T));
                }
            };
            switch (elemSize) {
            case 1:
                reverse(Tag<uint8_t>());
                break;
            case 2:
                reverse(Tag<uint16_t>());
                break;
            case 4:
                reverse(Tag<uint32_t>());
                break;
            case 8:
                reverse(Tag<uint64_t>());
                break;
            default:
                for (uint64_t x = 0; x < nx; ++x) {
                    std::memcpy(line + x * es, tmp + (nx - 1 - x) * es, es);
                }
                break;
            }
        }
    } else if (axis == 1) {
        for (uint64_t z = 0; z < nz; ++z) {
            Byte* slice = d + z * ny * lineBytes;
            for (uint64_t y = 0; y < ny / 2; ++y) {
                exchangeBytes(slice + y * lineBytes, slice + (ny - 1 - y) * lineBytes, lineBytes);
            }
        }
    } else {
        const uint64_t sliceBytes = ny * lineBytes;
        for (uint64_t z = 0; z < nz / 2; ++z) {
            Byte* a = d + z * sliceBytes;
            Byte* b = d + (nz - 1 - z) * sliceBytes;
            exchangeBytes(a, b, sliceBytes);
        }
    }
    zmfree(tmp);
    return 1;
}

// --- down-sampling -------------------------------------------------------------------------------

namespace {

bool meanType(int code)
{
    return code == ZmPrimType::BYTE || code == ZmPrimType::SHORT || code == ZmPrimType::INT ||
           code == ZmPrimType::FLOAT || code == ZmPrimType::DOUBLE || code == ZmPrimType::USHORT;
}

void downSampleMeans(void* dst, ZmTypedPointer src, const Blocks& b, ZmProgressInterface* progress)
{
    withNumericType(src.primType(), [&](auto tag) {
        using T = typename decltype(tag)::type;
        T* d = static_cast<T*>(dst);
        const T* s = static_cast<const T*>(src.data());
        const bool pairs = b.bx == 2 && b.by == 2 && b.bz == 2 && b.nc == 1;
        forEachOutputSlice(b.outZ, progress, [&](uint64_t oz) {
            if (pairs) {
                meanSlice222(d, s, b, oz);
            } else {
                meanSlice(d, s, b, oz);
            }
        });
    });
}

} // namespace

void ZmRawData::downSample3D(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz, int bx,
                             int by, int bz, ZmProgressInterface* progress)
{
    downSample3DN(dst, src, nx, ny, nz, bx, by, bz, 1, progress);
}

void ZmRawData::downSample3DN(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz, int bx,
                              int by, int bz, int nComponents, ZmProgressInterface* progress)
{
    if (!meanType(src.primType())) {
        logUnsupported("ZmRawData::downSample3D", src.primType());
        return;
    }
    const Blocks b = blocksOf(nx, ny, nz, bx, by, bz, nComponents);
    if (b.valid) {
        downSampleMeans(dst, src, b, progress);
    }
}

void ZmRawData::downSampleLabels3D(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz,
                                   int bx, int by, int bz, ZmProgressInterface* progress)
{
    const ZmPrimType type = src.primType();
    if (!type.isInteger()) {
        logUnsupported("ZmRawData::downSampleLabels3D", type);
        return;
    }
    const Blocks b = blocksOf(nx, ny, nz, bx, by, bz, 1);
    if (!b.valid) {
        return;
    }
    const uint64_t blockSize = b.bx * b.by * b.bz;
    withNumericType(type, [&](auto tag) {
        using T = typename decltype(tag)::type;
        T* scratch = nullptr;
        try {
            scratch = static_cast<T*>(zmmalloc(blockSize * sizeof(T)));
        } catch (const ZmMemoryException&) {
            getTheLogInstance().errorf(
                "ZmRawData::downSampleLabels3D(): no memory for a block of %llu labels\n",
                static_cast<unsigned long long>(blockSize));
            return;
        }
        forEachOutputSlice(b.outZ, progress, [&](uint64_t oz) {
            labelSlice(static_cast<T*>(dst), static_cast<const T*>(src.data()), b, oz, scratch);
        });
        zmfree(scratch);
    });
}

void ZmRawData::downSampleMaxFilterComponents3DN(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny,
                                                 uint64_t nz, int bx, int by, int bz, int nComponents,
                                                 ZmProgressInterface* progress)
{
    const Blocks b = blocksOf(nx, ny, nz, bx, by, bz, nComponents);
    const bool known = withNumericType(src.primType(), [&](auto tag) {
        using T = typename decltype(tag)::type;
        if (!b.valid) {
            return;
        }
        forEachOutputSlice(b.outZ, progress, [&](uint64_t oz) {
            maxSlice(static_cast<T*>(dst), static_cast<const T*>(src.data()), b, oz);
        });
    });
    if (!known) {
        logUnsupported("ZmRawData::downSampleMaxFilterComponents3DN", src.primType());
    }
}
