#include <zmlib/ZmCoder.h>

#include <atomic>
#include <climits>
#include <cstdlib>
#include <cstring>

#if defined(__x86_64__) || defined(__i386__)
#define ZMCODER_X86 1
#include <immintrin.h>
#else
#define ZMCODER_X86 0
#endif

// ============================================================================================
// MD5
// ============================================================================================

namespace {

inline uint32_t loadLE32(const unsigned char* p) noexcept
{
    uint32_t v;
    std::memcpy(&v, p, 4);
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
    v = __builtin_bswap32(v);
#endif
    return v;
}

inline void storeLE32(unsigned char* p, uint32_t v) noexcept
{
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
    v = __builtin_bswap32(v);
#endif
    std::memcpy(p, &v, 4);
}

inline uint32_t rotl(uint32_t x, int s) noexcept
{
    return (x << s) | (x >> (32 - s));
}

} // namespace

// The four rounds, written so that the compiler keeps the critical path short:
// - F(b,c,d) = d ^ (b & (c ^ d)) and G(b,c,d) = (b & d) + (c & ~d): the two terms of G share no
//   bit, so they can be added to a separately, off the path through b;
// - the message word and the constant are added to a before the round function is known;
// - I(b,c,d) = c ^ (b | ~d).
#define ZMMD5_F(a, b, c, d, k, s, t)                                                                         \
    (a) = ((a) + (x[k] + (t))) + ((d) ^ ((b) & ((c) ^ (d))));                                                \
    (a) = rotl((a), (s)) + (b)
#define ZMMD5_G(a, b, c, d, k, s, t)                                                                         \
    (a) = ((a) + (x[k] + (t))) + ((c) & ~(d));                                                               \
    (a) += (b) & (d);                                                                                        \
    (a) = rotl((a), (s)) + (b)
#define ZMMD5_H(a, b, c, d, k, s, t)                                                                         \
    (a) = ((a) + (x[k] + (t))) + (((c) ^ (d)) ^ (b));                                                        \
    (a) = rotl((a), (s)) + (b)
#define ZMMD5_I(a, b, c, d, k, s, t)                                                                         \
    (a) = ((a) + (x[k] + (t))) + ((c) ^ ((b) | ~(d)));                                                       \
    (a) = rotl((a), (s)) + (b)

void ZmCoder::md5Blocks(const unsigned char* data, size_t blocks) noexcept
{
    uint32_t a = m_state[0];
    uint32_t b = m_state[1];
    uint32_t c = m_state[2];
    uint32_t d = m_state[3];
    uint32_t x[16];
    for (; blocks != 0; --blocks, data += 64) {
        for (int i = 0; i < 16; ++i) {
            x[i] = loadLE32(data + 4 * i);
        }
        const uint32_t a0 = a;
        const uint32_t b0 = b;
        const uint32_t c0 = c;
        const uint32_t d0 = d;

        ZMMD5_F(a, b, c, d, 0, 7, 0xd76aa478);
        ZMMD5_F(d, a, b, c, 1, 12, 0xe8c7b756);
        ZMMD5_F(c, d, a, b, 2, 17, 0x242070db);
        ZMMD5_F(b, c, d, a, 3, 22, 0xc1bdceee);
        ZMMD5_F(a, b, c, d, 4, 7, 0xf57c0faf);
        ZMMD5_F(d, a, b, c, 5, 12, 0x4787c62a);
        ZMMD5_F(c, d, a, b, 6, 17, 0xa8304613);
        ZMMD5_F(b, c, d, a, 7, 22, 0xfd469501);
        ZMMD5_F(a, b, c, d, 8, 7, 0x698098d8);
        ZMMD5_F(d, a, b, c, 9, 12, 0x8b44f7af);
        ZMMD5_F(c, d, a, b, 10, 17, 0xffff5bb1);
        ZMMD5_F(b, c, d, a, 11, 22, 0x895cd7be);
        ZMMD5_F(a, b, c, d, 12, 7, 0x6b901122);
        ZMMD5_F(d, a, b, c, 13, 12, 0xfd987193);
        ZMMD5_F(c, d, a, b, 14, 17, 0xa679438e);
        ZMMD5_F(b, c, d, a, 15, 22, 0x49b40821);

        ZMMD5_G(a, b, c, d, 1, 5, 0xf61e2562);
        ZMMD5_G(d, a, b, c, 6, 9, 0xc040b340);
        ZMMD5_G(c, d, a, b, 11, 14, 0x265e5a51);
        ZMMD5_G(b, c, d, a, 0, 20, 0xe9b6c7aa);
        ZMMD5_G(a, b, c, d, 5, 5, 0xd62f105d);
        ZMMD5_G(d, a, b, c, 10, 9, 0x02441453);
        ZMMD5_G(c, d, a, b, 15, 14, 0xd8a1e681);
        ZMMD5_G(b, c, d, a, 4, 20, 0xe7d3fbc8);
        ZMMD5_G(a, b, c, d, 9, 5, 0x21e1cde6);
        ZMMD5_G(d, a, b, c, 14, 9, 0xc33707d6);
        ZMMD5_G(c, d, a, b, 3, 14, 0xf4d50d87);
        ZMMD5_G(b, c, d, a, 8, 20, 0x455a14ed);
        ZMMD5_G(a, b, c, d, 13, 5, 0xa9e3e905);
        ZMMD5_G(d, a, b, c, 2, 9, 0xfcefa3f8);
        ZMMD5_G(c, d, a, b, 7, 14, 0x676f02d9);
        ZMMD5_G(b, c, d, a, 12, 20, 0x8d2a4c8a);

        ZMMD5_H(a, b, c, d, 5, 4, 0xfffa3942);
        ZMMD5_H(d, a, b, c, 8, 11, 0x8771f681);
        ZMMD5_H(c, d, a, b, 11, 16, 0x6d9d6122);
        ZMMD5_H(b, c, d, a, 14, 23, 0xfde5380c);
        ZMMD5_H(a, b, c, d, 1, 4, 0xa4beea44);
        ZMMD5_H(d, a, b, c, 4, 11, 0x4bdecfa9);
        ZMMD5_H(c, d, a, b, 7, 16, 0xf6bb4b60);
        ZMMD5_H(b, c, d, a, 10, 23, 0xbebfbc70);
        ZMMD5_H(a, b, c, d, 13, 4, 0x289b7ec6);
        ZMMD5_H(d, a, b, c, 0, 11, 0xeaa127fa);
        ZMMD5_H(c, d, a, b, 3, 16, 0xd4ef3085);
        ZMMD5_H(b, c, d, a, 6, 23, 0x04881d05);
        ZMMD5_H(a, b, c, d, 9, 4, 0xd9d4d039);
        ZMMD5_H(d, a, b, c, 12, 11, 0xe6db99e5);
        ZMMD5_H(c, d, a, b, 15, 16, 0x1fa27cf8);
        ZMMD5_H(b, c, d, a, 2, 23, 0xc4ac5665);

        ZMMD5_I(a, b, c, d, 0, 6, 0xf4292244);
        ZMMD5_I(d, a, b, c, 7, 10, 0x432aff97);
        ZMMD5_I(c, d, a, b, 14, 15, 0xab9423a7);
        ZMMD5_I(b, c, d, a, 5, 21, 0xfc93a039);
        ZMMD5_I(a, b, c, d, 12, 6, 0x655b59c3);
        ZMMD5_I(d, a, b, c, 3, 10, 0x8f0ccc92);
        ZMMD5_I(c, d, a, b, 10, 15, 0xffeff47d);
        ZMMD5_I(b, c, d, a, 1, 21, 0x85845dd1);
        ZMMD5_I(a, b, c, d, 8, 6, 0x6fa87e4f);
        ZMMD5_I(d, a, b, c, 15, 10, 0xfe2ce6e0);
        ZMMD5_I(c, d, a, b, 6, 15, 0xa3014314);
        ZMMD5_I(b, c, d, a, 13, 21, 0x4e0811a1);
        ZMMD5_I(a, b, c, d, 4, 6, 0xf7537e82);
        ZMMD5_I(d, a, b, c, 11, 10, 0xbd3af235);
        ZMMD5_I(c, d, a, b, 2, 15, 0x2ad7d2bb);
        ZMMD5_I(b, c, d, a, 9, 21, 0xeb86d391);

        a += a0;
        b += b0;
        c += c0;
        d += d0;
    }
    m_state[0] = a;
    m_state[1] = b;
    m_state[2] = c;
    m_state[3] = d;
}

#undef ZMMD5_F
#undef ZMMD5_G
#undef ZMMD5_H
#undef ZMMD5_I

void ZmCoder::crcMD5Init() noexcept
{
    m_state[0] = 0x67452301;
    m_state[1] = 0xefcdab89;
    m_state[2] = 0x98badcfe;
    m_state[3] = 0x10325476;
    m_count = 0;
}

void ZmCoder::crcMD5Update(const unsigned char* data, unsigned int n) noexcept
{
    size_t left = n;
    const size_t used = size_t(m_count & 63);
    m_count += n;
    if (used != 0) {
        const size_t take = left < 64 - used ? left : 64 - used;
        std::memcpy(m_buffer + used, data, take);
        if (used + take < 64) {
            return;
        }
        md5Blocks(m_buffer, 1);
        data += take;
        left -= take;
    }
    if (left >= 64) {
        md5Blocks(data, left / 64);
        data += left & ~size_t(63);
        left &= 63;
    }
    if (left != 0) {
        std::memcpy(m_buffer, data, left);
    }
}

void ZmCoder::crcMD5Final() noexcept
{
    const uint64_t bits = m_count << 3;
    size_t used = size_t(m_count & 63);
    m_buffer[used++] = 0x80;
    if (used > 56) {
        std::memset(m_buffer + used, 0, 64 - used);
        md5Blocks(m_buffer, 1);
        used = 0;
    }
    std::memset(m_buffer + used, 0, 56 - used);
    storeLE32(m_buffer + 56, uint32_t(bits));
    storeLE32(m_buffer + 60, uint32_t(bits >> 32));
    md5Blocks(m_buffer, 1);
    std::memset(m_buffer, 0, sizeof m_buffer);
    m_count = 0;
}

void ZmCoder::crcMD5Query(unsigned char digest[16]) const noexcept
{
    for (int i = 0; i < 4; ++i) {
        storeLE32(digest + 4 * i, m_state[i]);
    }
}

// ============================================================================================
// CRC of cksum: CRC-32, polynomial 0x04C11DB7, most significant bit first.
//
// The raw register r after bytes D (n of them) is (r0 * x^(8n) + D(x) * x^32) mod P.
// ============================================================================================

namespace {

constexpr uint32_t kCrcPoly = 0x04C11DB7;

// Tables for eight bytes per step: table[k][v] is the register after the byte v followed by k
// zero bytes, starting from 0.
struct CrcTables {
    uint32_t t[8][256];
    constexpr CrcTables() : t()
    {
        for (uint32_t v = 0; v < 256; ++v) {
            uint32_t r = v << 24;
            for (int bit = 0; bit < 8; ++bit) {
                r = (r & 0x80000000u) != 0 ? (r << 1) ^ kCrcPoly : r << 1;
            }
            t[0][v] = r;
        }
        for (int k = 1; k < 8; ++k) {
            for (uint32_t v = 0; v < 256; ++v) {
                const uint32_t prev = t[k - 1][v];
                t[k][v] = (prev << 8) ^ t[0][prev >> 24];
            }
        }
    }
};

constexpr CrcTables kCrcTables;

inline uint32_t crcByte(uint32_t r, unsigned char byte) noexcept
{
    return (r << 8) ^ kCrcTables.t[0][(r >> 24) ^ byte];
}

uint32_t crcPortable(uint32_t r, const unsigned char* p, size_t n) noexcept
{
    const auto& t = kCrcTables.t;
    for (; n >= 8; n -= 8, p += 8) {
        const uint32_t hi =
            r ^ ((uint32_t(p[0]) << 24) | (uint32_t(p[1]) << 16) | (uint32_t(p[2]) << 8) | p[3]);
        r = t[7][hi >> 24] ^ t[6][(hi >> 16) & 0xff] ^ t[5][(hi >> 8) & 0xff] ^ t[4][hi & 0xff] ^ t[3][p[4]] ^
            t[2][p[5]] ^ t[1][p[6]] ^ t[0][p[7]];
    }
    for (; n != 0; --n) {
        r = crcByte(r, *p++);
    }
    return r;
}

#if ZMCODER_X86

// x^e mod P, the folding constants.
constexpr uint64_t xPowModP(unsigned e)
{
    uint32_t r = 1; // x^0
    for (unsigned i = 0; i < e; ++i) {
        r = (r & 0x80000000u) != 0 ? (r << 1) ^ kCrcPoly : r << 1;
    }
    return r;
}

// Folding: a 128-bit accumulator X, whose bit i is the coefficient of x^i, stands for the data
// so far modulo P. Moving it forward by 128 + m bits over new data D is
//   X * x^(128+m) + D = Xhi * x^(192+m) + Xlo * x^(128+m) + D   (mod P),
// two carry-less products of a 64-bit half with a 32-bit constant (at most 95 bits), so no
// reduction is needed inside the loop. Four accumulators 64 bytes apart keep the multiplier busy.
// The 16 bytes of a block are reversed so that the first data bit becomes bit 127.
__attribute__((target("pclmul,sse4.1"))) inline __m128i foldStep(__m128i x, __m128i k) noexcept
{
    return _mm_xor_si128(_mm_clmulepi64_si128(x, k, 0x00), _mm_clmulepi64_si128(x, k, 0x11));
}

__attribute__((target("pclmul,sse4.1"))) inline __m128i loadReversed(const unsigned char* p,
                                                                     __m128i reverse) noexcept
{
    return _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p)), reverse);
}

__attribute__((target("pclmul,sse4.1"))) uint32_t crcFolding(uint32_t r, const unsigned char* p,
                                                             size_t n) noexcept
{
    const __m128i reverse = _mm_set_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
    // Constants as {low: x^(128+m) mod P, high: x^(192+m) mod P}.
    const __m128i k512 = _mm_set_epi64x(int64_t(xPowModP(576)), int64_t(xPowModP(512)));
    const __m128i k128 = _mm_set_epi64x(int64_t(xPowModP(192)), int64_t(xPowModP(128)));

    // The incoming register joins the first 32 data bits: r * x^(8n) is the same as r placed on
    // top of the first block.
    __m128i x0 = _mm_xor_si128(loadReversed(p, reverse), _mm_set_epi32(int(r), 0, 0, 0));
    p += 16;
    n -= 16;
    if (n >= 112) {
        __m128i x1 = loadReversed(p, reverse);
        __m128i x2 = loadReversed(p + 16, reverse);
        __m128i x3 = loadReversed(p + 32, reverse);
        p += 48;
        n -= 48;
        while (n >= 64) {
            x0 = _mm_xor_si128(foldStep(x0, k512), loadReversed(p, reverse));
            x1 = _mm_xor_si128(foldStep(x1, k512), loadReversed(p + 16, reverse));
            x2 = _mm_xor_si128(foldStep(x2, k512), loadReversed(p + 32, reverse));
            x3 = _mm_xor_si128(foldStep(x3, k512), loadReversed(p + 48, reverse));
            p += 64;
            n -= 64;
        }
        x1 = _mm_xor_si128(foldStep(x0, k128), x1);
        x2 = _mm_xor_si128(foldStep(x1, k128), x2);
        x0 = _mm_xor_si128(foldStep(x2, k128), x3);
    }
    while (n >= 16) {
        x0 = _mm_xor_si128(foldStep(x0, k128), loadReversed(p, reverse));
        p += 16;
        n -= 16;
    }
    // X stands for the data; its CRC from 0 over its 16 bytes (first data bit first) is X * x^32
    // mod P, the register. The tail continues from there.
    unsigned char bytes[16];
    _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes), _mm_shuffle_epi8(x0, reverse));
    return crcPortable(crcPortable(0, bytes, 16), p, n);
}

bool haveCarrylessMultiply() noexcept
{
    static const bool have = [] {
        __builtin_cpu_init();
        return __builtin_cpu_supports("pclmul") && __builtin_cpu_supports("sse4.1");
    }();
    return have;
}

#else

bool haveCarrylessMultiply() noexcept
{
    return false;
}

#endif

// Process-wide choice of the CRC code (constant-initialised, no start-up code).
std::atomic<bool> g_crcForcePortable{false};

bool useFolding() noexcept
{
    return !g_crcForcePortable.load(std::memory_order_relaxed) && haveCarrylessMultiply();
}

} // namespace

uint32_t ZmCoder::crcUpdate(uint32_t crc, const unsigned char* data, size_t n) noexcept
{
#if ZMCODER_X86
    // Below a few blocks the table is as quick as setting up the folding.
    if (n >= 64 && useFolding()) {
        return crcFolding(crc, data, n);
    }
#endif
    return crcPortable(crc, data, n);
}

uint32_t ZmCoder::crcFinish(uint32_t crc, uint64_t totalLength) noexcept
{
    for (; totalLength != 0; totalLength >>= 8) {
        crc = crcByte(crc, static_cast<unsigned char>(totalLength));
    }
    return ~crc;
}

unsigned int ZmCoder::crc(const unsigned char* data, unsigned int n) noexcept
{
    return crcFinish(crcUpdate(0, data, n), n);
}

ZmCoder::CrcImplementation ZmCoder::setCrcImplementation(CrcImplementation which) noexcept
{
    g_crcForcePortable.store(which == CrcImplementation::Portable, std::memory_order_relaxed);
    return crcImplementation();
}

ZmCoder::CrcImplementation ZmCoder::crcImplementation() noexcept
{
    return useFolding() ? CrcImplementation::CarrylessMultiply : CrcImplementation::Portable;
}

// ============================================================================================
// Text encodings
// ============================================================================================

namespace {

// 0..15 for a hexadecimal digit of either case, else 0.
inline unsigned hexValue(unsigned char c) noexcept
{
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    c |= 0x20;
    return c >= 'a' && c <= 'f' ? c - 'a' + 10u : 0u;
}

// 0..15 for 'A'..'P' or 'a'..'p', else 0.
inline unsigned letterValue(unsigned char c) noexcept
{
    c |= 0x20;
    return c >= 'a' && c <= 'p' ? c - 'a' : 0u;
}

char* emptyBuffer(int& outLength)
{
    outLength = 0;
    char* out = static_cast<char*>(std::malloc(1));
    if (out != nullptr) {
        out[0] = 0;
    }
    return out;
}

} // namespace

void ZmCoder::dataToHexString(const unsigned char* data, unsigned int n, ZmString& out, bool upperCase)
{
    const char* digits = upperCase ? "0123456789ABCDEF" : "0123456789abcdef";
    out.resize(int64_t(n) * 2 + 1);
    char* q = out.getString();
    for (unsigned int i = 0; i < n; ++i) {
        *q++ = digits[data[i] >> 4];
        *q++ = digits[data[i] & 15];
    }
    *q = 0;
}

void ZmCoder::hexStringToData(unsigned char* out, const ZmString& hex) noexcept
{
    const unsigned char* s = reinterpret_cast<const unsigned char*>(hex.getString());
    const int bytes = hex.length() / 2;
    for (int i = 0; i < bytes; ++i) {
        out[i] = static_cast<unsigned char>((hexValue(s[2 * i]) << 4) | hexValue(s[2 * i + 1]));
    }
}

char* ZmCoder::abcEncode(const unsigned char* data, int n, int& outLength)
{
    if (data == nullptr || n <= 0) {
        return emptyBuffer(outLength);
    }
    // Above INT_MAX / 2 bytes the length 2n does not fit outLength.
    char* out = n > INT_MAX / 2 ? nullptr : static_cast<char*>(std::malloc(size_t(n) * 2 + 1));
    if (out == nullptr) {
        outLength = 0;
        return nullptr;
    }
    for (int i = 0; i < n; ++i) {
        out[2 * i] = char('A' + (data[i] >> 4));
        out[2 * i + 1] = char('A' + (data[i] & 15));
    }
    out[size_t(n) * 2] = 0;
    outLength = 2 * n;
    return out;
}

char* ZmCoder::abcDecode(const char* text, int n, int& outLength)
{
    if (text == nullptr || n <= 1) {
        return emptyBuffer(outLength);
    }
    const int bytes = n / 2;
    char* out = static_cast<char*>(std::malloc(size_t(bytes) + 1));
    if (out == nullptr) {
        outLength = 0;
        return nullptr;
    }
    const unsigned char* s = reinterpret_cast<const unsigned char*>(text);
    for (int i = 0; i < bytes; ++i) {
        out[i] = char((letterValue(s[2 * i]) << 4) | letterValue(s[2 * i + 1]));
    }
    out[bytes] = 0;
    outLength = bytes;
    return out;
}
