#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmString.h>

#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

namespace {

const ZmBitfield::INIT kSet = ZmBitfield::INIT(0);
const ZmBitfield::INIT kClear = ZmBitfield::INIT(1);
const ZmBitfield::INIT kUninitialised = ZmBitfield::INIT(2);

/// Every bit through operator[], and the raw words: bit i is bit i % 32 of word i / 32.
::testing::AssertionResult matchesModel(const ZmBitfield& b, const std::vector<bool>& model)
{
    if (b.nBits() != model.size()) {
        return ::testing::AssertionFailure() << "nBits " << b.nBits() << ", model " << model.size();
    }
    std::vector<uint32_t> words((model.size() + 31) / 32, 0);
    for (size_t i = 0; i < model.size(); ++i) {
        if (b[i] != int(model[i])) {
            return ::testing::AssertionFailure() << "bit " << i << " is " << b[i];
        }
        words[i / 32] |= uint32_t(model[i]) << (i % 32);
    }
    for (size_t w = 0; w < words.size(); ++w) {
        const size_t used = std::min<size_t>(32, model.size() - w * 32);
        const uint32_t mask = used == 32 ? ~0u : (1u << used) - 1u;
        if ((b.dataPtr()[w] & mask) != words[w]) {
            return ::testing::AssertionFailure() << "word " << w << " holds " << std::hex << b.dataPtr()[w];
        }
    }
    return ::testing::AssertionSuccess();
}

std::vector<bool> pattern(size_t n)
{
    std::vector<bool> v(n);
    for (size_t i = 0; i < n; ++i) {
        v[i] = (i * 7 + i / 5) % 3 == 0;
    }
    return v;
}

void apply(ZmBitfield& b, const std::vector<bool>& v)
{
    for (size_t i = 0; i < v.size(); ++i) {
        b.set(i, v[i]);
    }
}

} // namespace

TEST(ZmBitfield, WordCountIsOneMoreThanBitsOver32)
{
    const struct {
        uint64_t bits;
        uint64_t words;
    } cases[] = {{1, 1}, {31, 1}, {32, 2}, {33, 2}, {63, 2}, {64, 3}, {100, 4}};
    for (const auto& c : cases) {
        for (const ZmBitfield::INIT init : {kSet, kClear}) {
            const ZmBitfield b(c.bits, init);
            EXPECT_EQ(b.nBits(), c.bits);
            ASSERT_EQ(b.memSize(), c.words * 4) << c.bits << " bits";
            ASSERT_NE(b.dataPtr(), nullptr);
            for (uint64_t w = 0; w < c.words; ++w) {
                EXPECT_EQ(b.dataPtr()[w], init == kSet ? 0xFFFFFFFFu : 0u) << c.bits << " bits, word " << w;
            }
        }
    }
    for (const ZmBitfield& empty : {ZmBitfield(0, kSet), ZmBitfield(0, kClear), ZmBitfield()}) {
        EXPECT_EQ(empty.nBits(), 0u);
        EXPECT_EQ(empty.memSize(), 0u);
        EXPECT_EQ(empty.dataPtr(), nullptr);
    }
}

TEST(ZmBitfield, GrowingGivesNewBitsTheInitialValue)
{
    // Old sizes off a word boundary, so the unused bits of the old last word are part of the growth.
    const struct {
        uint64_t from;
        uint64_t to;
    } steps[] = {{10, 40}, {10, 20}, {40, 100}, {5, 200}, {33, 63}};
    for (const auto& s : steps) {
        for (const ZmBitfield::INIT start : {kSet, kClear}) {
            for (const ZmBitfield::INIT init : {kSet, kClear, kUninitialised}) {
                ZmBitfield b(s.from, start);
                const std::vector<bool> low = pattern(s.from);
                apply(b, low);
                b.resize(s.to, init);
                EXPECT_EQ(b.nBits(), s.to);
                EXPECT_EQ(b.memSize(), (s.to / 32 + 1) * 4);
                std::vector<bool> model = low;
                model.resize(s.to, init == kSet);
                if (init == kUninitialised) {
                    // New bits are whatever the heap holds; only the old ones are fixed.
                    for (uint64_t i = s.from; i < s.to; ++i) {
                        model[i] = b[i] != 0;
                    }
                }
                EXPECT_TRUE(matchesModel(b, model))
                    << s.from << " -> " << s.to << " bits, start " << start << ", init " << init;
            }
        }
    }
}

TEST(ZmBitfield, ShrinkingKeepsLowBitsAndZeroFreesTheWords)
{
    ZmBitfield b(100, kClear);
    const std::vector<bool> bits = pattern(100);
    apply(b, bits);
    b.resize(40, kSet);
    EXPECT_EQ(b.memSize(), 8u);
    EXPECT_TRUE(matchesModel(b, std::vector<bool>(bits.begin(), bits.begin() + 40)));
    b.resize(0, kSet);
    EXPECT_EQ(b.nBits(), 0u);
    EXPECT_EQ(b.memSize(), 0u);
    EXPECT_EQ(b.dataPtr(), nullptr);
    b.resize(5, kSet);
    EXPECT_TRUE(matchesModel(b, std::vector<bool>(5, true)));
}

TEST(ZmBitfield, BitOperationsMatchAVectorModel)
{
    for (const uint32_t seed : {7u, 8u, 9u}) {
        for (const uint64_t n : {1u, 32u, 77u, 200u}) {
            std::mt19937 rng(seed);
            const bool startSet = (seed & 1u) != 0;
            ZmBitfield b(n, startSet ? kSet : kClear);
            std::vector<bool> model(n, startSet);
            for (int step = 0; step < 3000; ++step) {
                const uint64_t i = rng() % n;
                switch (rng() % 5) {
                case 0:
                    b.set(i);
                    model[i] = true;
                    break;
                case 1:
                    b.unset(i);
                    model[i] = false;
                    break;
                case 2:
                    b.toggle(i);
                    model[i] = !model[i];
                    break;
                default: {
                    const bool v = (rng() & 1u) != 0;
                    b.set(i, v);
                    model[i] = v;
                    break;
                }
                }
                ASSERT_EQ(b[i], int(model[i])) << "seed " << seed << " n " << n << " step " << step;
                if (step % 50 == 0) {
                    ASSERT_TRUE(matchesModel(b, model)) << "seed " << seed << " n " << n << " step " << step;
                }
            }
            ASSERT_TRUE(matchesModel(b, model)) << "seed " << seed << " n " << n;
        }
    }
}

TEST(ZmBitfield, CopiesAreIndependent)
{
    ZmBitfield a(70, kClear);
    const std::vector<bool> bits = pattern(70);
    apply(a, bits);

    ZmBitfield b(a);
    ASSERT_EQ(b.memSize(), a.memSize());
    EXPECT_NE(b.dataPtr(), a.dataPtr());
    EXPECT_EQ(std::memcmp(b.dataPtr(), a.dataPtr(), a.memSize()), 0); // every word, spare bits too
    b.toggle(3);
    b.set(69);
    EXPECT_TRUE(matchesModel(a, bits));

    ZmBitfield c(5, kSet);
    c = a;
    EXPECT_TRUE(matchesModel(c, bits));
    c.unset(0);
    EXPECT_TRUE(matchesModel(a, bits));
    ZmBitfield& alias = c;
    c = alias;
    EXPECT_EQ(c.nBits(), 70u);

    c = ZmBitfield();
    EXPECT_EQ(c.dataPtr(), nullptr);
    EXPECT_EQ(c.memSize(), 0u);
    const ZmBitfield emptyCopy(c);
    EXPECT_EQ(emptyCopy.dataPtr(), nullptr);
}

TEST(ZmBitfield, SwapExchangesContents)
{
    ZmBitfield a(10, kSet);
    ZmBitfield b(100, kClear);
    b.set(99);
    const unsigned int* aWords = a.dataPtr();
    const unsigned int* bWords = b.dataPtr();
    a.swap(b);
    EXPECT_EQ(a.nBits(), 100u);
    EXPECT_EQ(a.memSize(), 16u);
    EXPECT_EQ(a.dataPtr(), bWords);
    EXPECT_EQ(a[99], 1);
    EXPECT_EQ(b.nBits(), 10u);
    EXPECT_EQ(b.dataPtr(), aWords);
    EXPECT_TRUE(matchesModel(b, std::vector<bool>(10, true)));
}

// --- counting, search, ranges --------------------------------------------------------------------

namespace {

const uint64_t kSizes[] = {1, 5, 31, 32, 33, 63, 64, 65, 96, 127, 128, 129, 200, 257, 1000, 1024, 2049};

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
    apply(b, model);
    scribbleSpare(b, rng);
    return b;
}

::testing::AssertionResult queriesMatch(const ZmBitfield& b, const std::vector<bool>& m)
{
    const int64_t n = int64_t(m.size());
    const uint64_t count = uint64_t(std::count(m.begin(), m.end(), true));
    int64_t firstSet = -1, firstUnset = -1, lastSet = -1;
    for (int64_t i = 0; i < n; ++i) {
        if (m[i] && firstSet < 0) {
            firstSet = i;
        }
        if (!m[i] && firstUnset < 0) {
            firstUnset = i;
        }
        if (m[i]) {
            lastSet = i;
        }
    }
    if (b.nSetBits() != count || b.nUnsetBits() != m.size() - count) {
        return ::testing::AssertionFailure() << "nSetBits " << b.nSetBits() << ", expected " << count;
    }
    if (b.firstSetBit() != firstSet || b.firstUnsetBit() != firstUnset || b.lastSetBit() != lastSet) {
        return ::testing::AssertionFailure()
               << "first set " << b.firstSetBit() << "/" << firstSet << ", first unset " << b.firstUnsetBit()
               << "/" << firstUnset << ", last set " << b.lastSetBit() << "/" << lastSet;
    }
    if (b.isAnyBitSet() != (firstSet >= 0) || b.isAnyBitUnset() != (firstUnset >= 0)) {
        return ::testing::AssertionFailure() << "isAnyBitSet/isAnyBitUnset";
    }
    return ::testing::AssertionSuccess();
}

} // namespace

TEST(ZmBitfield, RangesCountsAndSearchesMatchAVectorModel)
{
    std::mt19937 rng(20240611);
    for (const uint64_t n : kSizes) {
        ZmBitfield b(n, kClear);
        std::vector<bool> model(n, false);
        for (int step = 0; step < 300; ++step) {
            const int op = int(rng() % 16); // 0-11 ranges, 12-15 whole-field operations
            uint64_t from = rng() % n, to = rng() % n;
            if (rng() % 4 != 0 && from > to) {
                std::swap(from, to); // mostly proper ranges; sometimes from > to, which does nothing
            }
            if (op < 12) {
                const bool value = op < 6;
                if (value) {
                    b.setRange(from, to);
                } else {
                    b.unsetRange(from, to);
                }
                for (uint64_t i = from; i <= to; ++i) {
                    model[i] = value;
                }
            } else if (op == 12) {
                b.toggleAll();
                model.flip();
            } else if (op == 13) {
                b.setAll();
                model.assign(n, true);
            } else {
                if (op == 14) {
                    b.unsetAll();
                } else {
                    b.clearAll();
                }
                model.assign(n, false);
            }
            scribbleSpare(b, rng);
            ASSERT_TRUE(matchesModel(b, model)) << n << " bits, step " << step << ", op " << op;
            ASSERT_TRUE(queriesMatch(b, model)) << n << " bits, step " << step << ", op " << op;
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

    ZmBitfield c(64, kClear);
    c.setAll();
    EXPECT_EQ(c.dataPtr()[2], ~0u);
    c.toggleAll();
    EXPECT_EQ(c.dataPtr()[0] | c.dataPtr()[1] | c.dataPtr()[2], 0u);
    EXPECT_EQ(c.firstSetBit(), -1);
    EXPECT_EQ(c.lastSetBit(), -1);
    EXPECT_EQ(c.firstUnsetBit(), 0);

    const ZmBitfield empty;
    EXPECT_EQ(empty.nSetBits(), 0u);
    EXPECT_EQ(empty.firstSetBit(), -1);
    EXPECT_EQ(empty.firstUnsetBit(), -1);
    EXPECT_EQ(empty.lastSetBit(), -1);
    EXPECT_FALSE(empty.isAnyBitSet());
    EXPECT_FALSE(empty.isAnyBitUnset());
}

TEST(ZmBitfield, ResizeAfterAMultipleOf32KeepsTheOldSpareWord)
{
    // Intended: growing from 32 bits only fills added words, and the spare word already exists.
    ZmBitfield b(32, kSet);
    b.resize(40, kClear);
    ZmString text;
    b.print(text);
    EXPECT_STREQ(text.getString(), std::string(40, '1').c_str());
    EXPECT_EQ(b.nSetBits(), 40u);

    ZmBitfield c(10, kClear);
    c.set(3);
    c.resize(40, kSet);
    c.print(text);
    EXPECT_STREQ(text.getString(), ("0001000000" + std::string(30, '1')).c_str());
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
                EXPECT_EQ(a.hasIntersection(b), intersect) << where;
                EXPECT_EQ(b.hasIntersection(a), intersect) << where;
                EXPECT_EQ(a.isSuperset(b), superset) << where;
                EXPECT_EQ(a.isSubset(b), subset) << where;
                EXPECT_EQ(b.isSubset(a), superset) << where;

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
                ASSERT_TRUE(queriesMatch(rAnd, mAnd)) << where;

                // Spare bits: combined word by word for equal sizes, untouched otherwise.
                const uint64_t spareWord = na / 32;
                const uint32_t spare = ~0u << (na % 32);
                const uint32_t aw = a.dataPtr()[spareWord];
                const uint32_t bw = na == nb ? b.dataPtr()[spareWord] : 0;
                if (na == nb) {
                    EXPECT_EQ(rAnd.dataPtr()[spareWord] & spare, (aw & bw) & spare) << where;
                    EXPECT_EQ(rOr.dataPtr()[spareWord] & spare, (aw | bw) & spare) << where;
                    EXPECT_EQ(rXor.dataPtr()[spareWord] & spare, (aw ^ bw) & spare) << where;
                } else {
                    EXPECT_EQ(rAnd.dataPtr()[spareWord] & spare, aw & spare) << where;
                    EXPECT_EQ(rOr.dataPtr()[spareWord] & spare, aw & spare) << where;
                    EXPECT_EQ(rXor.dataPtr()[spareWord] & spare, aw & spare) << where;
                }
            }
        }
    }
}

TEST(ZmBitfield, SetOperationsWithItself)
{
    std::mt19937 rng(5);
    const std::vector<bool> m = randomModel(150, rng, 40);
    ZmBitfield a = fieldOf(m, rng);
    const ZmBitfield& self = a;
    a &= self;
    EXPECT_TRUE(matchesModel(a, m));
    a |= self;
    EXPECT_TRUE(matchesModel(a, m));
    EXPECT_TRUE(a.isSuperset(a));
    EXPECT_TRUE(a.hasIntersection(a));
    a ^= self;
    EXPECT_TRUE(matchesModel(a, std::vector<bool>(150, false)));
    EXPECT_FALSE(a.hasIntersection(a));
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

// --- labels --------------------------------------------------------------------------------------

TEST(ZmBitfield, LabelsRoundTripUnderEachInsertPolicy)
{
    std::mt19937 rng(3);
    const unsigned char label = 2;
    for (const uint64_t n : {0u, 1u, 32u, 45u, 64u, 1000u}) {
        std::vector<unsigned char> image(n);
        for (auto& v : image) {
            v = static_cast<unsigned char>(rng() % 4); // labels 0 (background) to 3
        }
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
            std::vector<unsigned char> before(n);
            for (auto& v : before) {
                v = static_cast<unsigned char>(rng() % 4);
            }
            std::vector<unsigned char> expected = before;
            for (uint64_t i = 0; i < n; ++i) {
                const unsigned char v = before[i];
                switch (policy) {
                case 1: // overwrite where set
                    expected[i] = mask[i] ? label : v;
                    break;
                case 2: // the image becomes the mask
                    expected[i] = mask[i] ? label : 0;
                    break;
                case 3: // set bits fill background only
                    expected[i] = mask[i] && v == 0 ? label : v;
                    break;
                case 4: // own label and background follow the mask, other labels stay
                    expected[i] = v == 0 || v == label ? (mask[i] ? label : 0) : v;
                    break;
                default: // no such policy: nothing is written
                    break;
                }
            }
            std::vector<unsigned char> out = before;
            m.toLabels(n, out.data(), label, ZmBitfield::InsertPolicy(policy));
            EXPECT_EQ(out, expected) << n << " bits, policy " << policy;
        }
    }
    EXPECT_EQ(ZmBitfield::INSERT_OVERWRITE, 1);
    EXPECT_EQ(ZmBitfield::INSERT_REPLACE, 2);
    EXPECT_EQ(ZmBitfield::INSERT_INTO_EMPTY, 3);
    EXPECT_EQ(ZmBitfield::INSERT_OWN_LABEL, 4);
}

// --- text, files and fingerprints ----------------------------------------------------------------

namespace {

std::string readFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void writeFile(const std::string& path, const std::string& bytes)
{
    std::ofstream out(path, std::ios::binary);
    out.write(bytes.data(), std::streamsize(bytes.size()));
}

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
    std::FILE* p = popen(("md5sum < '" + path + "'").c_str(), "r");
    if (p == nullptr) {
        return "";
    }
    char buf[64] = {};
    const size_t got = std::fread(buf, 1, 32, p);
    pclose(p);
    std::string hex(buf, got);
    for (char& c : hex) {
        c = char(std::toupper(static_cast<unsigned char>(c)));
    }
    return hex;
}

} // namespace

TEST(ZmBitfield, PrintGivesOneCharacterPerBit)
{
    ZmBitfield b(4, kClear);
    b.set(0);
    b.set(2);
    ZmString text("previous contents");
    b.print(text);
    EXPECT_STREQ(text.getString(), "1010");
    EXPECT_EQ(text.length(), 4);

    std::mt19937 rng(8);
    const std::vector<bool> m = randomModel(77, rng, 50);
    fieldOf(m, rng).print(text);
    std::string expected;
    for (const bool bit : m) {
        expected += bit ? '1' : '0';
    }
    EXPECT_STREQ(text.getString(), expected.c_str());
    ZmBitfield().print(text);
    EXPECT_STREQ(text.getString(), "");
}

TEST(ZmBitfield, SaveWritesTheBitBytesAndLoadReadsThemBack)
{
    const ScratchDir dir;
    ASSERT_FALSE(dir.path().empty());
    std::mt19937 rng(41);
    for (const uint64_t n : {0u, 1u, 8u, 10u, 32u, 33u, 64u, 1001u}) {
        const std::vector<bool> m = randomModel(n, rng, 50);
        const ZmBitfield b = fieldOf(m, rng);
        const std::string path = dir / ("f" + std::to_string(n));
        writeFile(path, "old contents that are longer than the new ones ......................");
        ASSERT_TRUE(b.save(ZmString(path.c_str()))) << n;
        // Exactly (n + 7) / 8 bytes, no header, as they lie in memory: the bits below n are the
        // model's, the spare bits of the last byte whatever the words hold.
        std::string file = readFile(path);
        EXPECT_EQ(file, std::string(reinterpret_cast<const char*>(b.dataPtr()), (n + 7) / 8)) << n;
        if (n % 8 != 0 && !file.empty()) {
            file.back() = char(file.back() & ((1 << (n % 8)) - 1));
        }
        EXPECT_EQ(file, bytesOf(m)) << n;

        ZmBitfield c(3, kSet);
        ASSERT_TRUE(c.load(ZmString(path.c_str()), n)) << n;
        EXPECT_TRUE(matchesModel(c, m)) << n;
    }

    // Loading reads exactly (n + 7) / 8 bytes of a longer file; a short file fails.
    std::vector<bool> m = randomModel(24, rng, 50);
    const std::string longer = dir / "longer";
    writeFile(longer, bytesOf(m) + "tail");
    ZmBitfield c;
    ASSERT_TRUE(c.load(ZmString(longer.c_str()), 20));
    m.resize(20);
    EXPECT_TRUE(matchesModel(c, m));

    const std::string oneByte = dir / "one";
    writeFile(oneByte, "\x05");
    EXPECT_FALSE(c.load(ZmString(oneByte.c_str()), 10));
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
        const std::string path = dir / ("m" + std::to_string(n));
        writeFile(path, bytes);
        const std::string expected = md5sumOf(path);
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
