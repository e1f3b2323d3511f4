#include <zmlib/ZmBitfield.h>

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmString.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <utility>

namespace {

// The scans below read the 32-bit words in pairs: on a little-endian machine 64-bit word k holds
// bits 64k to 64k + 63, so counting and searching run on 64-bit values. memcpy keeps the loads
// free of alignment and aliasing assumptions; it compiles to a plain load.
__attribute__((always_inline)) inline uint64_t load64(const uint32_t* p, uint64_t k) noexcept
{
    uint64_t v;
    std::memcpy(&v, p + 2 * k, sizeof v);
    return v;
}

/// Bits 64 * (n / 64) to n - 1 as one value, the bits past n cleared (0 when n % 64 == 0).
/// Reads only words that hold bits below n.
inline uint64_t tail64(const uint32_t* p, uint64_t n) noexcept
{
    const uint64_t r = n % 64;
    if (r == 0) {
        return 0;
    }
    const uint64_t w = (n / 64) * 2;
    uint64_t v = p[w];
    if (r > 32) {
        v |= uint64_t(p[w + 1]) << 32;
    }
    return v & ((uint64_t(1) << r) - 1);
}

/// The low n % 32 bits of a word, or all of them when n % 32 == 0.
inline uint32_t lowMask32(uint64_t n) noexcept
{
    const uint32_t r = uint32_t(n % 32);
    return r == 0 ? ~0u : (1u << r) - 1u;
}

// Counting is the hot path of mask statistics. The processor's popcnt instruction is not in the
// x86-64 baseline the library is compiled for, so a copy of the loop built for it is chosen at
// run time; the portable copy is the fallback. The body is inlined into both, and each copy is
// compiled for its own target.
__attribute__((always_inline)) inline uint64_t countWords(const uint32_t* p, uint64_t words64) noexcept
{
    uint64_t c0 = 0, c1 = 0, c2 = 0, c3 = 0;
    uint64_t k = 0;
    for (; k + 4 <= words64; k += 4) {
        c0 += uint64_t(__builtin_popcountll(load64(p, k)));
        c1 += uint64_t(__builtin_popcountll(load64(p, k + 1)));
        c2 += uint64_t(__builtin_popcountll(load64(p, k + 2)));
        c3 += uint64_t(__builtin_popcountll(load64(p, k + 3)));
    }
    for (; k < words64; ++k) {
        c0 += uint64_t(__builtin_popcountll(load64(p, k)));
    }
    return c0 + c1 + c2 + c3;
}

uint64_t countPortable(const uint32_t* p, uint64_t words64) noexcept
{
    return countWords(p, words64);
}

#if defined(__x86_64__) || defined(__i386__)
__attribute__((target("popcnt"))) uint64_t countPopcnt(const uint32_t* p, uint64_t words64) noexcept
{
    return countWords(p, words64);
}
#endif

using CountFunction = uint64_t (*)(const uint32_t*, uint64_t) noexcept;

CountFunction countFunction() noexcept
{
    static const CountFunction fn = [] {
#if defined(__x86_64__) || defined(__i386__)
        __builtin_cpu_init();
        if (__builtin_cpu_supports("popcnt")) {
            return CountFunction(&countPopcnt);
        }
#endif
        return CountFunction(&countPortable);
    }();
    return fn;
}

/// The lowest bit below n that differs from \p flip (0: set bits, ~0: clear bits), or -1.
int64_t findFirst(const uint32_t* p, uint64_t n, uint64_t flip) noexcept
{
    const uint64_t words64 = n / 64;
    uint64_t k = 0;
    // Four words per test keeps the loop at one branch per 32 bytes.
    for (; k + 4 <= words64; k += 4) {
        const uint64_t a = load64(p, k) ^ flip, b = load64(p, k + 1) ^ flip;
        const uint64_t c = load64(p, k + 2) ^ flip, d = load64(p, k + 3) ^ flip;
        if ((a | b | c | d) != 0) {
            break;
        }
    }
    for (; k < words64; ++k) {
        const uint64_t v = load64(p, k) ^ flip;
        if (v != 0) {
            return int64_t(k * 64 + uint64_t(__builtin_ctzll(v)));
        }
    }
    const uint64_t v = (tail64(p, n) ^ flip) & (n % 64 == 0 ? 0 : (uint64_t(1) << (n % 64)) - 1);
    return v == 0 ? -1 : int64_t(words64 * 64 + uint64_t(__builtin_ctzll(v)));
}

/// Whether a bit in [from, end) is set.
bool anySetIn(const uint32_t* p, uint64_t from, uint64_t end) noexcept
{
    if (from >= end) {
        return false;
    }
    uint64_t w = from / 32;
    const uint64_t last = (end - 1) / 32;
    const uint32_t head = ~0u << (from % 32);
    if (w == last) {
        return (p[w] & head & lowMask32(end)) != 0;
    }
    if ((p[w] & head) != 0) {
        return true;
    }
    for (++w; w < last; ++w) {
        if (p[w] != 0) {
            return true;
        }
    }
    return (p[last] & lowMask32(end)) != 0;
}

/// Applies \p op to the first \p n bits of \p a and \p b; the bits of \p a from n on are kept.
template <typename Op>
void combine(uint32_t* a, const uint32_t* b, uint64_t n, Op op) noexcept
{
    const uint64_t full = n / 32;
    for (uint64_t w = 0; w < full; ++w) {
        a[w] = op(a[w], b[w]);
    }
    if (n % 32 != 0) {
        const uint32_t m = lowMask32(n);
        a[full] = (a[full] & ~m) | (op(a[full], b[full]) & m);
    }
}

template <typename Op>
void combineAll(uint32_t* a, const uint32_t* b, uint64_t words, Op op) noexcept
{
    for (uint64_t w = 0; w < words; ++w) {
        a[w] = op(a[w], b[w]);
    }
}

} // namespace

ZmBitfield::ZmBitfield(uint64_t n, INIT init)
{
    resize(n, init);
}

ZmBitfield::ZmBitfield(const ZmBitfield& other) : m_nBits(other.m_nBits), m_nWords(other.m_nWords)
{
    if (m_nWords != 0) {
        m_data = static_cast<unsigned int*>(zmmalloc(other.memSize()));
        std::memcpy(m_data, other.m_data, other.memSize());
    }
}

ZmBitfield& ZmBitfield::operator=(const ZmBitfield& other)
{
    if (this != &other) {
        ZmBitfield copy(other);
        swap(copy);
    }
    return *this;
}

ZmBitfield::~ZmBitfield()
{
    zmfree(m_data);
}

void ZmBitfield::swap(ZmBitfield& other) noexcept
{
    std::swap(m_nBits, other.m_nBits);
    std::swap(m_nWords, other.m_nWords);
    std::swap(m_data, other.m_data);
}

void ZmBitfield::resize(uint64_t n, INIT init)
{
    if (n == 0) {
        zmfree(m_data);
        m_data = nullptr;
        m_nBits = 0;
        m_nWords = 0;
        return;
    }
    const uint64_t words = n / NBITS + 1;
    if (words != m_nWords) {
        m_data = static_cast<unsigned int*>(zmrealloc(m_data, words * sizeof(uint32_t)));
        if (words > m_nWords && (init == SET || init == CLEAR)) {
            std::memset(m_data + m_nWords, init == SET ? 0xff : 0x00, (words - m_nWords) * sizeof(uint32_t));
        }
    }
    // Only an old last word with bits below nBits is completed; after a multiple of 32 bits the
    // old spare word keeps its contents (intended).
    if (n > m_nBits && m_nBits % NBITS != 0) {
        const uint32_t high = ~((1u << (m_nBits % NBITS)) - 1u);
        if (init == SET) {
            m_data[m_nBits / NBITS] |= high;
        } else if (init == CLEAR) {
            m_data[m_nBits / NBITS] &= ~high;
        }
    }
    m_nBits = n;
    m_nWords = words;
}

// --- ranges and whole fields -------------------------------------------------------------------

namespace {

// Sets (\p value) or clears the bits from \p from to \p to inclusive: the partial words at the
// ends through masks, the words between at once.
void fillRange(uint32_t* data, uint64_t from, uint64_t to, bool value) noexcept
{
    if (from > to) {
        return;
    }
    constexpr uint64_t kBits = ZmBitfield::NBITS;
    const uint64_t w0 = from / kBits, w1 = to / kBits;
    const uint32_t m0 = ~0u << (from % kBits), m1 = ~0u >> (kBits - 1 - to % kBits);
    const auto apply = [value](uint32_t& word, uint32_t mask) { word = value ? word | mask : word & ~mask; };
    if (w0 == w1) {
        apply(data[w0], m0 & m1);
        return;
    }
    apply(data[w0], m0);
    std::memset(data + w0 + 1, value ? 0xff : 0, (w1 - w0 - 1) * sizeof(uint32_t));
    apply(data[w1], m1);
}

} // namespace

void ZmBitfield::setRange(uint64_t from, uint64_t to) noexcept
{
    fillRange(m_data, from, to, true);
}

void ZmBitfield::unsetRange(uint64_t from, uint64_t to) noexcept
{
    fillRange(m_data, from, to, false);
}

void ZmBitfield::setAll() noexcept
{
    if (m_nWords != 0) {
        std::memset(m_data, 0xff, memSize());
    }
}

void ZmBitfield::unsetAll() noexcept
{
    if (m_nWords != 0) {
        std::memset(m_data, 0, memSize());
    }
}

void ZmBitfield::toggleAll() noexcept
{
    for (uint64_t w = 0; w < m_nWords; ++w) {
        m_data[w] = ~m_data[w];
    }
}

// --- counting and search -----------------------------------------------------------------------

uint64_t ZmBitfield::nSetBits() const noexcept
{
    if (m_nBits == 0) {
        return 0;
    }
    return countFunction()(m_data, m_nBits / 64) + uint64_t(__builtin_popcountll(tail64(m_data, m_nBits)));
}

int64_t ZmBitfield::firstSetBit() const noexcept
{
    return findFirst(m_data, m_nBits, 0);
}

int64_t ZmBitfield::firstUnsetBit() const noexcept
{
    return findFirst(m_data, m_nBits, ~uint64_t(0));
}

int64_t ZmBitfield::lastSetBit() const noexcept
{
    const uint64_t words64 = m_nBits / 64;
    const uint64_t t = tail64(m_data, m_nBits);
    if (t != 0) {
        return int64_t(words64 * 64 + 63 - uint64_t(__builtin_clzll(t)));
    }
    uint64_t k = words64;
    for (; k >= 4; k -= 4) {
        const uint64_t a = load64(m_data, k - 1), b = load64(m_data, k - 2);
        const uint64_t c = load64(m_data, k - 3), d = load64(m_data, k - 4);
        if ((a | b | c | d) != 0) {
            break;
        }
    }
    for (; k > 0; --k) {
        const uint64_t v = load64(m_data, k - 1);
        if (v != 0) {
            return int64_t((k - 1) * 64 + 63 - uint64_t(__builtin_clzll(v)));
        }
    }
    return -1;
}

// --- set operations ----------------------------------------------------------------------------

namespace {

// Combines the words of \p b into \p a with \p op: every word (spare word included) when the
// sizes are equal, else only the bits both fields have.
template <class Op>
void combineFields(uint32_t* a, uint64_t nBitsA, uint64_t nWordsA, const uint32_t* b, uint64_t nBitsB, Op op)
{
    if (nBitsA == nBitsB) {
        combineAll(a, b, nWordsA, op);
    } else {
        combine(a, b, std::min(nBitsA, nBitsB), op);
    }
}

// True when \p op of the words of \p a and \p b is not zero within their first \p n bits; four
// 64-bit words a step, so that a miss costs one branch per 32 bytes.
template <class Op>
bool anyCommonBits(const uint32_t* a, const uint32_t* b, uint64_t n, Op op) noexcept
{
    const uint64_t words64 = n / 64;
    uint64_t k = 0;
    for (; k + 4 <= words64; k += 4) {
        const uint64_t v = op(load64(a, k), load64(b, k)) | op(load64(a, k + 1), load64(b, k + 1)) |
                           op(load64(a, k + 2), load64(b, k + 2)) | op(load64(a, k + 3), load64(b, k + 3));
        if (v != 0) {
            return true;
        }
    }
    for (; k < words64; ++k) {
        if (op(load64(a, k), load64(b, k)) != 0) {
            return true;
        }
    }
    return op(tail64(a, n), tail64(b, n)) != 0;
}

} // namespace

ZmBitfield& ZmBitfield::operator&=(const ZmBitfield& other) noexcept
{
    combineFields(m_data, m_nBits, m_nWords, other.m_data, other.m_nBits,
                  [](uint32_t a, uint32_t b) { return a & b; });
    if (other.m_nBits < m_nBits) {
        // Bits beyond the other field's end are not in the other set.
        unsetRange(other.m_nBits, m_nBits - 1);
    }
    return *this;
}

ZmBitfield& ZmBitfield::operator|=(const ZmBitfield& other) noexcept
{
    combineFields(m_data, m_nBits, m_nWords, other.m_data, other.m_nBits,
                  [](uint32_t a, uint32_t b) { return a | b; });
    return *this;
}

ZmBitfield& ZmBitfield::operator^=(const ZmBitfield& other) noexcept
{
    combineFields(m_data, m_nBits, m_nWords, other.m_data, other.m_nBits,
                  [](uint32_t a, uint32_t b) { return a ^ b; });
    return *this;
}

bool ZmBitfield::hasIntersection(const ZmBitfield& other) const noexcept
{
    return anyCommonBits(m_data, other.m_data, std::min(m_nBits, other.m_nBits),
                         [](uint64_t a, uint64_t b) { return a & b; });
}

bool ZmBitfield::isSuperset(const ZmBitfield& other) const noexcept
{
    const uint64_t n = std::min(m_nBits, other.m_nBits);
    if (anyCommonBits(m_data, other.m_data, n, [](uint64_t a, uint64_t b) { return b & ~a; })) {
        return false;
    }
    // A set bit of the other field beyond this field's end is not in this set.
    return !anySetIn(other.m_data, n, other.m_nBits);
}

bool ZmBitfield::operator==(const ZmBitfield& other) const noexcept
{
    if (m_nBits != other.m_nBits) {
        return false;
    }
    if (m_nBits == 0) {
        return true;
    }
    const uint64_t full = m_nBits / NBITS;
    if (std::memcmp(m_data, other.m_data, full * sizeof(uint32_t)) != 0) {
        return false;
    }
    // The word after the full ones, masked to the bits below nBits; the spare word is compared
    // whole when nBits is a multiple of 32 (intended, see the header).
    const uint32_t m = lowMask32(m_nBits);
    return ((m_data[full] ^ other.m_data[full]) & m) == 0;
}

// --- byte label images -------------------------------------------------------------------------

void ZmBitfield::fromLabels(uint64_t n, const unsigned char* labels, unsigned char label)
{
    resize(n, CLEAR);
    if (n == 0) {
        return;
    }
    const uint64_t full = n / NBITS;
    for (uint64_t w = 0; w < full; ++w) {
        const unsigned char* l = labels + w * NBITS;
        uint32_t v = 0;
        for (unsigned int b = 0; b < NBITS; ++b) {
            v |= uint32_t(l[b] == label) << b;
        }
        m_data[w] = v;
    }
    // The last word (the spare word when n % 32 == 0) gets its remaining bits and zeros above.
    uint32_t v = 0;
    for (uint64_t i = full * NBITS; i < n; ++i) {
        v |= uint32_t(labels[i] == label) << (i % NBITS);
    }
    m_data[full] = v;
}

void ZmBitfield::toLabels(uint64_t n, unsigned char* labels, unsigned char label,
                          InsertPolicy policy) const noexcept
{
    switch (policy) {
    case INSERT_OVERWRITE:
        for (uint64_t i = 0; i < n; ++i) {
            if ((*this)[i] != 0) {
                labels[i] = label;
            }
        }
        break;
    case INSERT_REPLACE:
        for (uint64_t i = 0; i < n; ++i) {
            labels[i] = (*this)[i] != 0 ? label : 0;
        }
        break;
    case INSERT_INTO_EMPTY:
        for (uint64_t i = 0; i < n; ++i) {
            if (labels[i] == 0 && (*this)[i] != 0) {
                labels[i] = label;
            }
        }
        break;
    case INSERT_OWN_LABEL:
        for (uint64_t i = 0; i < n; ++i) {
            if (labels[i] == 0 || labels[i] == label) {
                labels[i] = (*this)[i] != 0 ? label : 0;
            }
        }
        break;
    }
}

// --- files and fingerprints --------------------------------------------------------------------

bool ZmBitfield::load(const ZmString& fileName, uint64_t n)
{
    resize(n, CLEAR);
    std::FILE* f = std::fopen(fileName.getString(), "rb");
    if (f == nullptr) {
        return false;
    }
    const size_t want = size_t((n + 7) / 8);
    const size_t got = want == 0 ? 0 : std::fread(m_data, 1, want, f);
    std::fclose(f);
    return got == want;
}

bool ZmBitfield::save(const ZmString& fileName) const
{
    std::FILE* f = std::fopen(fileName.getString(), "wb");
    if (f == nullptr) {
        return false;
    }
    const size_t want = size_t((m_nBits + 7) / 8);
    bool ok = (want == 0 ? 0 : std::fwrite(m_data, 1, want, f)) == want;
    // Buffered bytes that cannot be flushed were not written either.
    if (std::fclose(f) != 0) {
        ok = false;
    }
    return ok;
}

void ZmBitfield::md5(unsigned char* digest16) const
{
    ZmCoder coder;
    const unsigned char* bytes = reinterpret_cast<const unsigned char*>(m_data);
    uint64_t left = (m_nBits / NBITS) * sizeof(uint32_t);
    // The coder takes 32-bit lengths; whole blocks of 1 GiB keep every piece a multiple of 64.
    constexpr uint64_t kPiece = uint64_t(1) << 30;
    while (left > 0) {
        const uint64_t piece = std::min(left, kPiece);
        coder.crcMD5Update(bytes, static_cast<unsigned int>(piece));
        bytes += piece;
        left -= piece;
    }
    if (m_nBits != 0) {
        // After a multiple of 32 bits the mask keeps every bit: the spare word goes in as it stands
        // (intended, existing fingerprints depend on it).
        const uint32_t last = m_data[m_nBits / NBITS] & lowMask32(m_nBits);
        unsigned char raw[sizeof last];
        std::memcpy(raw, &last, sizeof last);
        coder.crcMD5Update(raw, sizeof raw);
    }
    coder.crcMD5Final();
    coder.crcMD5Query(digest16);
}

void ZmBitfield::md5(ZmString& hex) const
{
    unsigned char digest[16];
    md5(digest);
    ZmCoder::dataToHexString(digest, sizeof digest, hex, true);
}

void ZmBitfield::print(ZmString& out) const
{
    out.resize(int64_t(m_nBits) + 1);
    char* s = out.getString();
    for (uint64_t i = 0; i < m_nBits; ++i) {
        s[i] = (*this)[i] != 0 ? '1' : '0';
    }
    s[m_nBits] = 0;
}
