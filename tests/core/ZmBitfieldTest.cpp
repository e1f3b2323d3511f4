#include <zmlib/ZmBitfield.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <random>
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
