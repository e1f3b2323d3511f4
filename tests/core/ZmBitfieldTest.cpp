#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmString.h>

#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace {

const ZmBitfield::INIT kSet = ZmBitfield::INIT(0);
const ZmBitfield::INIT kClear = ZmBitfield::INIT(1);
const ZmBitfield::INIT kUninitialised = ZmBitfield::INIT(2);

/// Every bit through operator[], print() and the raw words (bit i is bit i % 32 of word i / 32), and
/// the counts and searches, against \p m.
::testing::AssertionResult matchesModel(const ZmBitfield& b, const std::vector<bool>& m)
{
    if (b.nBits() != m.size()) {
        return ::testing::AssertionFailure() << "nBits " << b.nBits() << ", model " << m.size();
    }
    std::string text;
    for (size_t i = 0; i < m.size(); ++i) {
        if (b[i] != int(m[i]) || ((b.dataPtr()[i / 32] >> (i % 32)) & 1u) != uint32_t(m[i])) {
            return ::testing::AssertionFailure()
                   << "bit " << i << " is " << b[i] << ", word " << std::hex << b.dataPtr()[i / 32];
        }
        text += m[i] ? '1' : '0';
    }
    ZmString printed("previous contents");
    b.print(printed);
    if (printed.length() != int(text.size()) || text != printed.getString()) {
        return ::testing::AssertionFailure() << "print gives " << printed.getString();
    }
    const uint64_t count = uint64_t(std::count(m.begin(), m.end(), true));
    const auto firstSet = std::find(m.begin(), m.end(), true);
    const auto firstUnset = std::find(m.begin(), m.end(), false);
    const auto lastSet = std::find(m.rbegin(), m.rend(), true);
    const int64_t fs = firstSet == m.end() ? -1 : firstSet - m.begin();
    const int64_t fu = firstUnset == m.end() ? -1 : firstUnset - m.begin();
    const int64_t ls = lastSet == m.rend() ? -1 : int64_t(m.size()) - 1 - (lastSet - m.rbegin());
    if (b.nSetBits() != count || b.nUnsetBits() != m.size() - count || b.firstSetBit() != fs ||
        b.firstUnsetBit() != fu || b.lastSetBit() != ls || b.isAnyBitSet() != (fs >= 0) ||
        b.isAnyBitUnset() != (fu >= 0)) {
        return ::testing::AssertionFailure()
               << "set " << b.nSetBits() << "/" << count << ", unset " << b.nUnsetBits() << ", first set "
               << b.firstSetBit() << "/" << fs << ", first unset " << b.firstUnsetBit() << "/" << fu
               << ", last set " << b.lastSetBit() << "/" << ls << ", any set/unset " << b.isAnyBitSet()
               << b.isAnyBitUnset();
    }
    return ::testing::AssertionSuccess();
}

void writeBits(ZmBitfield& b, const std::vector<bool>& v)
{
    for (size_t i = 0; i < v.size(); ++i) {
        b.set(i, v[i]);
    }
}

/// Fills the bits past nBits (up to the end of the last word) with random values: they are
/// unspecified memory, and no count, search or comparison may see them.
void scribbleSpare(ZmBitfield& b, std::mt19937& rng)
{
    for (uint64_t i = b.nBits(); i < b.memSize() * 8; ++i) {
        b.set(i, (rng() & 1u) != 0);
    }
}

std::vector<bool> randomModel(uint64_t n, std::mt19937& rng, unsigned percentSet)
{
    std::vector<bool> v(n);
    for (uint64_t i = 0; i < n; ++i) {
        v[i] = rng() % 100 < percentSet;
    }
    return v;
}

ZmBitfield fieldOf(const std::vector<bool>& model, std::mt19937& rng)
{
    ZmBitfield b(model.size(), kUninitialised);
    writeBits(b, model);
    scribbleSpare(b, rng);
    return b;
}

} // namespace

TEST(ZmBitfield, WordCountIsOneMoreThanBitsOver32)
{
    const struct {
        uint64_t bits;
        uint64_t words;
    } cases[] = {{0, 0}, {1, 1}, {31, 1}, {32, 2}, {33, 2}, {63, 2}, {64, 3}, {100, 4}};
    for (const auto& c : cases) {
        for (const ZmBitfield::INIT init : {kSet, kClear}) {
            const ZmBitfield b(c.bits, init);
            EXPECT_EQ(b.nBits(), c.bits);
            ASSERT_EQ(b.memSize(), c.words * 4) << c.bits << " bits";
            EXPECT_EQ(b.dataPtr() == nullptr, c.words == 0) << c.bits << " bits";
            for (uint64_t w = 0; w < c.words; ++w) {
                EXPECT_EQ(b.dataPtr()[w], init == kSet ? 0xFFFFFFFFu : 0u) << c.bits << " bits, word " << w;
            }
        }
    }
    EXPECT_EQ(ZmBitfield().dataPtr(), nullptr);
}

TEST(ZmBitfield, ResizeKeepsLowBitsAndGivesNewBitsTheInitialValue)
{
    std::mt19937 rng(10);
    // Growing from sizes off a word boundary, so the unused bits of the old last word are part of
    // the growth; then shrinking, freeing (0 bits) and growing from nothing.
    const struct {
        uint64_t from;
        uint64_t to;
    } steps[] = {{10, 40}, {10, 20}, {40, 100}, {5, 200}, {33, 63}, {100, 40}, {100, 0}, {0, 5}};
    for (const auto& s : steps) {
        for (const ZmBitfield::INIT start : {kSet, kClear}) {
            for (const ZmBitfield::INIT init : {kSet, kClear, kUninitialised}) {
                ZmBitfield b(s.from, start);
                std::vector<bool> model = randomModel(s.from, rng, 50);
                writeBits(b, model);
                b.resize(s.to, init);
                EXPECT_EQ(b.memSize(), s.to == 0 ? 0 : (s.to / 32 + 1) * 4);
                EXPECT_EQ(b.dataPtr() == nullptr, s.to == 0);
                model.resize(s.to, init == kSet);
                for (uint64_t i = s.from; init == kUninitialised && i < s.to; ++i) {
                    model[i] = b[i] != 0; // whatever the heap holds; only the old bits are fixed
                }
                EXPECT_TRUE(matchesModel(b, model))
                    << s.from << " -> " << s.to << " bits, start " << start << ", init " << init;
            }
        }
    }
    // Intended: growing from 32 bits only fills added words, and the spare word already exists.
    ZmBitfield c(32, kSet);
    c.resize(40, kClear);
    EXPECT_EQ(c.nSetBits(), 40u);
}

TEST(ZmBitfield, CopiesAreIndependentAndSwapExchangesContents)
{
    std::mt19937 rng(70);
    std::vector<bool> bits = randomModel(70, rng, 50);
    const ZmBitfield a = fieldOf(bits, rng);
    ZmBitfield b(a);
    ASSERT_EQ(b.memSize(), a.memSize());
    EXPECT_NE(b.dataPtr(), a.dataPtr());
    EXPECT_EQ(std::memcmp(b.dataPtr(), a.dataPtr(), a.memSize()), 0); // every word, spare bits too

    ZmBitfield c(5, kSet);
    c = a;
    c.unset(0);
    EXPECT_TRUE(matchesModel(a, bits));
    const ZmBitfield& alias = c;
    c = alias;
    bits[0] = false;
    EXPECT_TRUE(matchesModel(c, bits));

    ZmBitfield d(10, kSet);
    const unsigned int* cWords = c.dataPtr();
    const unsigned int* dWords = d.dataPtr();
    c.swap(d);
    EXPECT_EQ(d.memSize(), 12u);
    EXPECT_EQ(d.dataPtr(), cWords);
    EXPECT_TRUE(matchesModel(d, bits));
    EXPECT_EQ(c.dataPtr(), dWords);
    EXPECT_TRUE(matchesModel(c, std::vector<bool>(10, true)));

    c = ZmBitfield();
    EXPECT_EQ(c.dataPtr(), nullptr);
    EXPECT_EQ(c.memSize(), 0u);
    EXPECT_EQ(ZmBitfield(c).dataPtr(), nullptr);
}

// --- bits, ranges, counting and search -----------------------------------------------------------

TEST(ZmBitfield, EditsCountsAndSearchesMatchAVectorModel)
{
    std::mt19937 rng(20240611);
    for (const uint64_t n : {1, 5, 31, 32, 33, 63, 64, 65, 96, 127, 128, 129, 200, 257, 1000, 1024, 2049}) {
        ZmBitfield b(n, kClear);
        std::vector<bool> model(n, false);
        for (int step = 0; step < 400; ++step) {
            // 0-1 toggle a bit (set(i, v) is what every model is written with), 2-13 ranges, 14-17
            // whole field.
            const int op = int(rng() % 18);
            uint64_t from = rng() % n, to = rng() % n;
            if (rng() % 4 != 0 && from > to) {
                std::swap(from, to); // mostly proper ranges; sometimes from > to, which does nothing
            }
            if (op < 2) {
                b.toggle(from);
                model[from] = !model[from];
            } else if (op < 14) {
                const bool value = op < 8;
                if (value) {
                    b.setRange(from, to);
                } else {
                    b.unsetRange(from, to);
                }
                for (uint64_t k = from; k <= to; ++k) {
                    model[k] = value;
                }
            } else if (op == 14) {
                b.toggleAll();
                model.flip();
            } else if (op == 15) {
                b.setAll();
                model.assign(n, true);
            } else {
                if (op == 16) {
                    b.unsetAll();
                } else {
                    b.clearAll();
                }
                model.assign(n, false);
            }
            scribbleSpare(b, rng);
            ASSERT_TRUE(matchesModel(b, model)) << n << " bits, step " << step << ", op " << op;
        }
    }
}

TEST(ZmBitfield, RangeEdgesAndWholeFieldOperationsCoverEveryWord)
{
    ZmBitfield b(64, kClear);
    b.setRange(5, 5);
    EXPECT_EQ(b.dataPtr()[0], 1u << 5);
    b.setRange(30, 33);
    EXPECT_EQ(b.dataPtr()[0], (1u << 5) | (3u << 30));
    EXPECT_EQ(b.dataPtr()[1], 3u);
    b.unsetRange(31, 32);
    EXPECT_EQ(b.dataPtr()[0], (1u << 5) | (1u << 30));
    EXPECT_EQ(b.dataPtr()[1], 2u);
    b.setRange(0, 63);
    EXPECT_EQ(b.dataPtr()[2], 0u); // the spare word is past the range
    b.setAll();
    EXPECT_EQ(b.dataPtr()[2], ~0u);
    b.toggleAll();
    EXPECT_EQ(b.dataPtr()[0] | b.dataPtr()[1] | b.dataPtr()[2], 0u);

    const ZmBitfield empty;
    EXPECT_TRUE(matchesModel(empty, {}));
}

// --- set operations ------------------------------------------------------------------------------

TEST(ZmBitfield, SetOperationsMatchASetModelForAnySizes)
{
    std::mt19937 rng(99);
    const uint64_t sizes[] = {1, 31, 32, 33, 64, 65, 100, 128, 300, 1024, 1030};
    for (const uint64_t na : sizes) {
        for (const uint64_t nb : sizes) {
            for (int round = 0; round < 6; ++round) {
                const unsigned density = round < 2 ? 3 : round < 4 ? 50 : 97;
                const std::vector<bool> ma = randomModel(na, rng, density);
                std::vector<bool> mb = randomModel(nb, rng, density);
                if (round % 2 == 1) {
                    // b a subset of a over the common bits, so that the superset test can be true.
                    for (uint64_t i = 0; i < nb; ++i) {
                        mb[i] = i < na && ma[i] && rng() % 2 == 0;
                    }
                }
                const ZmBitfield a = fieldOf(ma, rng);
                const ZmBitfield b = fieldOf(mb, rng);
                const std::string where =
                    std::to_string(na) + " & " + std::to_string(nb) + " bits, round " + std::to_string(round);

                bool intersect = false, superset = true, subset = true;
                for (uint64_t i = 0; i < std::max(na, nb); ++i) {
                    const bool x = i < na && ma[i], y = i < nb && mb[i];
                    intersect = intersect || (x && y);
                    superset = superset && (!y || x);
                    subset = subset && (!x || y);
                }
                // The pairs run both ways round, so each call also sees the longer field first.
                EXPECT_EQ(a.hasIntersection(b), intersect) << where;
                EXPECT_EQ(a.isSuperset(b), superset) << where;
                EXPECT_EQ(a.isSubset(b), subset) << where;

                std::vector<bool> mAnd = ma, mOr = ma, mXor = ma;
                for (uint64_t i = 0; i < na; ++i) {
                    const bool y = i < nb && mb[i];
                    mAnd[i] = ma[i] && y;
                    mOr[i] = ma[i] || y;
                    mXor[i] = ma[i] != y;
                }
                ZmBitfield rAnd(a), rOr(a), rXor(a);
                rAnd &= b;
                rOr |= b;
                rXor ^= b;
                EXPECT_TRUE(matchesModel(rAnd, mAnd)) << where;
                EXPECT_TRUE(matchesModel(rOr, mOr)) << where;
                EXPECT_TRUE(matchesModel(rXor, mXor)) << where;

                // Spare bits: combined word by word for equal sizes, untouched otherwise.
                const uint64_t w = na / 32;
                const uint32_t spare = ~0u << (na % 32);
                const bool same = na == nb;
                const uint32_t aw = a.dataPtr()[w] & spare, bw = same ? b.dataPtr()[w] & spare : 0;
                EXPECT_EQ(rAnd.dataPtr()[w] & spare, same ? aw & bw : aw) << where;
                EXPECT_EQ(rOr.dataPtr()[w] & spare, same ? aw | bw : aw) << where;
                EXPECT_EQ(rXor.dataPtr()[w] & spare, same ? aw ^ bw : aw) << where;

                if (same && round == 2) {
                    // With itself as the other field.
                    ZmBitfield s(a);
                    const ZmBitfield& self = s;
                    s &= self;
                    s |= self;
                    EXPECT_TRUE(matchesModel(s, ma)) << where;
                    EXPECT_TRUE(s.isSuperset(self)) << where;
                    s ^= self;
                    EXPECT_TRUE(matchesModel(s, std::vector<bool>(na, false))) << where;
                }
            }
        }
    }
}

TEST(ZmBitfield, EqualityIgnoresSpareBitsExceptAWholeSpareWord)
{
    std::mt19937 rng(17);
    for (const uint64_t n : {1u, 31u, 32u, 33u, 64u, 95u, 96u, 200u}) {
        const std::vector<bool> m = randomModel(n, rng, 50);
        ZmBitfield a = fieldOf(m, rng);
        ZmBitfield b = fieldOf(m, rng);
        // Make the spare bits of the two fields differ.
        for (uint64_t i = n; i < a.memSize() * 8; ++i) {
            a.set(i, (i & 1) != 0);
            b.set(i, (i & 1) == 0);
        }
        // Intended: after a multiple of 32 bits the spare word is compared whole, as md5 hashes it.
        EXPECT_EQ(a == b, n % 32 != 0) << n << " bits";
        EXPECT_EQ(a != b, n % 32 == 0) << n << " bits";
        std::memcpy(b.dataPtr(), a.dataPtr(), a.memSize());
        EXPECT_TRUE(a == b) << n << " bits";
        b.toggle(rng() % n);
        EXPECT_TRUE(a != b) << n << " bits";
        EXPECT_FALSE(a == ZmBitfield(n + 1, kClear)) << n << " bits";
    }
    EXPECT_TRUE(ZmBitfield() == ZmBitfield(0, kSet));
}

// --- labels, text, files and fingerprints --------------------------------------------------------

TEST(ZmBitfield, LabelsRoundTripUnderEachInsertPolicy)
{
    static_assert(ZmBitfield::INSERT_OVERWRITE == 1 && ZmBitfield::INSERT_REPLACE == 2 &&
                      ZmBitfield::INSERT_INTO_EMPTY == 3 && ZmBitfield::INSERT_OWN_LABEL == 4,
                  "stored policy numbers");
    std::mt19937 rng(3);
    const unsigned char label = 2;
    const auto randomImage = [&rng](uint64_t n) {
        std::vector<unsigned char> image(n);
        for (auto& v : image) {
            v = static_cast<unsigned char>(rng() % 4); // labels 0 (background) to 3
        }
        return image;
    };
    for (const uint64_t n : {0u, 1u, 32u, 45u, 64u, 1000u}) {
        const std::vector<unsigned char> image = randomImage(n);
        ZmBitfield b(7, kSet); // fromLabels resizes and overwrites
        b.fromLabels(n, image.data(), label);
        std::vector<bool> model(n);
        for (uint64_t i = 0; i < n; ++i) {
            model[i] = image[i] == label;
        }
        ASSERT_TRUE(matchesModel(b, model)) << n;
        if (n != 0) {
            EXPECT_EQ(b.dataPtr()[n / 32] & (~0u << (n % 32)), 0u) << "spare bits are cleared, " << n;
        }

        // Write a different mask back into a fresh random image, per policy.
        const std::vector<bool> mask = randomModel(n, rng, 50);
        const ZmBitfield m = fieldOf(mask, rng);
        for (int policy = 1; policy <= 5; ++policy) {
            const std::vector<unsigned char> before = randomImage(n);
            std::vector<unsigned char> expected = before;
            for (uint64_t i = 0; i < n; ++i) {
                const unsigned char v = before[i], own = mask[i] ? label : 0;
                const unsigned char byPolicy[] = {
                    v,
                    mask[i] ? label : v,            // 1: overwrite where set
                    own,                            // 2: the image becomes the mask
                    mask[i] && v == 0 ? label : v,  // 3: set bits fill background only
                    v == 0 || v == label ? own : v, // 4: own label and background follow the mask
                    v};                             // no such policy: nothing is written
                expected[i] = byPolicy[policy];
            }
            std::vector<unsigned char> out = before;
            m.toLabels(n, out.data(), label, ZmBitfield::InsertPolicy(policy));
            EXPECT_EQ(out, expected) << n << " bits, policy " << policy;
        }
    }
}

TEST(ZmBitfield, PrintGivesOneCharacterPerBit)
{
    ZmBitfield b(4, kClear);
    b.set(0);
    b.set(2);
    ZmString text("previous contents");
    b.print(text);
    EXPECT_STREQ(text.getString(), "1010");
    EXPECT_EQ(text.length(), 4);
    ZmBitfield().print(text);
    EXPECT_STREQ(text.getString(), "");
}

namespace {

/// The file image: bit i is bit i % 8 of byte i / 8.
std::string bytesOf(const std::vector<bool>& m)
{
    std::string s((m.size() + 7) / 8, '\0');
    for (size_t i = 0; i < m.size(); ++i) {
        s[i / 8] = char(s[i / 8] | (int(m[i]) << (i % 8)));
    }
    return s;
}

/// md5sum's digest of a file, upper case; empty on failure.
std::string md5sumOf(const std::string& path)
{
    std::string hex(32, '\0');
    std::FILE* p = popen(("md5sum < '" + path + "'").c_str(), "r");
    hex.resize(p == nullptr ? 0 : std::fread(&hex[0], 1, 32, p));
    if (p != nullptr) {
        pclose(p);
    }
    std::transform(hex.begin(), hex.end(), hex.begin(),
                   [](char c) { return char(std::toupper(static_cast<unsigned char>(c))); });
    return hex;
}

} // namespace

TEST(ZmBitfield, SaveWritesTheBitBytesAndLoadReadsThemBack)
{
    const ScratchDir dir;
    ASSERT_FALSE(dir.path().empty());
    std::mt19937 rng(41);
    for (const uint64_t n : {0u, 1u, 8u, 10u, 32u, 33u, 64u, 1001u}) {
        const std::vector<bool> m = randomModel(n, rng, 50);
        const ZmBitfield b = fieldOf(m, rng);
        const std::string name = "f" + std::to_string(n);
        dir.write(name, "old contents that are longer than the new ones ......................");
        ASSERT_TRUE(b.save(ZmString((dir / name).c_str()))) << n;
        // Exactly (n + 7) / 8 bytes, no header, as they lie in memory: the bits below n are the
        // model's, the spare bits of the last byte whatever the words hold.
        std::string file = dir.read(name);
        EXPECT_EQ(file, std::string(reinterpret_cast<const char*>(b.dataPtr()), (n + 7) / 8)) << n;
        if (n % 8 != 0 && !file.empty()) {
            file.back() = char(file.back() & ((1 << (n % 8)) - 1));
        }
        EXPECT_EQ(file, bytesOf(m)) << n;

        ZmBitfield c(3, kSet);
        ASSERT_TRUE(c.load(ZmString((dir / name).c_str()), n)) << n;
        EXPECT_TRUE(matchesModel(c, m)) << n;
    }

    // Loading reads exactly (n + 7) / 8 bytes of a longer file; a short file fails.
    std::vector<bool> m = randomModel(24, rng, 50);
    dir.write("longer", bytesOf(m) + "tail");
    ZmBitfield c;
    ASSERT_TRUE(c.load(ZmString((dir / "longer").c_str()), 20));
    m.resize(20);
    EXPECT_TRUE(matchesModel(c, m));

    dir.write("one", "\x05");
    EXPECT_FALSE(c.load(ZmString((dir / "one").c_str()), 10));
    EXPECT_EQ(c.nBits(), 10u);
    EXPECT_FALSE(c.load(ZmString((dir / "missing").c_str()), 10));
    EXPECT_FALSE(ZmBitfield(10, kSet).save(ZmString((dir / "no/such/dir").c_str())));
}

TEST(ZmBitfield, Md5HashesTheWordsAsMd5sumDoes)
{
    const ScratchDir dir;
    ASSERT_FALSE(dir.path().empty());
    std::mt19937 rng(1321);
    for (const uint64_t n : {0u, 1u, 31u, 32u, 33u, 64u, 100u, 4096u, 5000u}) {
        const std::vector<bool> m = randomModel(n, rng, 50);
        const ZmBitfield b = fieldOf(m, rng); // random spare bits
        // Expected bytes: the n / 32 full words, then (n > 0) the next word masked to the bits below
        // n, or whole (the spare word, as it stands) when n is a multiple of 32.
        std::string bytes(reinterpret_cast<const char*>(b.dataPtr()), (n / 32) * 4);
        if (n != 0) {
            uint32_t last = b.dataPtr()[n / 32];
            if (n % 32 != 0) {
                last &= (1u << (n % 32)) - 1u;
            }
            bytes.append(reinterpret_cast<const char*>(&last), 4);
        }
        const std::string name = "m" + std::to_string(n);
        dir.write(name, bytes);
        const std::string expected = md5sumOf(dir / name);
        ASSERT_EQ(expected.size(), 32u) << "md5sum did not run";

        ZmString hex("x");
        b.md5(hex);
        EXPECT_STREQ(hex.getString(), expected.c_str()) << n << " bits";
        unsigned char digest[16];
        b.md5(digest);
        char fromDigest[33];
        for (int i = 0; i < 16; ++i) {
            std::snprintf(fromDigest + 2 * i, 3, "%02X", digest[i]);
        }
        EXPECT_STREQ(fromDigest, expected.c_str()) << n << " bits";
    }
}
