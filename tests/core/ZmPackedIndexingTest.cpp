#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmPackedIndexing.h>
#include <zmlib/ZmSuperPackedIndexing.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <vector>

namespace {

std::vector<unsigned char> randomMask(size_t n, std::mt19937& rng, unsigned percentSet)
{
    std::vector<unsigned char> m(n);
    for (auto& v : m) {
        v = rng() % 100 < percentSet ? static_cast<unsigned char>(1 + rng() % 255) : 0;
    }
    return m;
}

/// Every selected element maps to the number of selected elements before it.
template <typename Indexing>
::testing::AssertionResult matchesPrefixCount(const Indexing& p, const std::vector<unsigned char>& mask)
{
    int64_t before = 0;
    for (size_t i = 0; i < mask.size(); ++i) {
        if (mask[i] != 0) {
            if (int64_t(p.index(int(i))) != before) {
                return ::testing::AssertionFailure()
                       << "element " << i << " maps to " << p.index(int(i)) << ", expected " << before;
            }
            ++before;
        }
    }
    if (int64_t(p.getPackedSize()) != before || int64_t(p.getNumPackedElems()) != before) {
        return ::testing::AssertionFailure()
               << "packed size " << p.getPackedSize() << ", expected " << before;
    }
    return ::testing::AssertionSuccess();
}

} // namespace

TEST(ZmPackedIndexing, BothConstructorsMatchAPrefixCount)
{
    std::mt19937 rng(256);
    for (const size_t n : {0u, 1u, 255u, 256u, 257u, 1000u, 70000u}) {
        for (const unsigned density : {0u, 5u, 50u, 100u}) {
            const std::vector<unsigned char> mask = randomMask(n, rng, density);
            const ZmPackedIndexing fromBytes(mask.data(), int(n));
            EXPECT_TRUE(matchesPrefixCount(fromBytes, mask)) << n << " elements, " << density << "%";

            ZmBitfield bits(n, ZmBitfield::SET); // spare bits set: they must not count
            for (size_t i = 0; i < n; ++i) {
                bits.set(i, mask[i] != 0);
            }
            const ZmPackedIndexing fromBits(bits);
            EXPECT_TRUE(matchesPrefixCount(fromBits, mask)) << n << " elements, " << density << "%";

            ZmPackedIndexing copy(fromBits);
            EXPECT_TRUE(matchesPrefixCount(copy, mask));
            const std::vector<unsigned char> none(3, 0);
            ZmPackedIndexing assigned(none.data(), 3);
            assigned = fromBytes;
            EXPECT_TRUE(matchesPrefixCount(assigned, mask));
        }
    }
    EXPECT_EQ(ZmPackedIndexing(nullptr, -5).getPackedSize(), 0);
}

TEST(ZmSuperPackedIndexing, PiecesContinueThePositionsOfEarlierPieces)
{
    std::mt19937 rng(64);
    for (int round = 0; round < 8; ++round) {
        ZmSuperPackedIndexing p;
        EXPECT_EQ(p.getNumElems(), 0);
        EXPECT_EQ(p.getPackedSize(), 0);
        std::vector<unsigned char> all;
        for (int piece = 0; piece < 12; ++piece) {
            // Sizes that start and end inside blocks of 256, whole blocks, and empty pieces.
            const size_t sizes[] = {0, 1, 7, 255, 256, 300, 1000};
            const size_t n = sizes[rng() % 7];
            const std::vector<unsigned char> mask = randomMask(n, rng, unsigned(rng() % 101));
            p.appendIndexSpace(mask.data(), int64_t(n));
            all.insert(all.end(), mask.begin(), mask.end());
            ASSERT_EQ(p.getNumElems(), int64_t(all.size()));
            ASSERT_TRUE(matchesPrefixCount(p, all)) << "round " << round << ", piece " << piece;
            for (size_t i = 0; i < all.size(); ++i) {
                ASSERT_EQ(p.valid(int(i)), all[i] != 0) << "element " << i;
            }
        }
        const ZmSuperPackedIndexing copy(p);
        EXPECT_TRUE(matchesPrefixCount(copy, all));
        EXPECT_EQ(copy.getNumElems(), p.getNumElems());
    }
    ZmSuperPackedIndexing p;
    p.appendIndexSpace(nullptr, -3);
    EXPECT_EQ(p.getNumElems(), 0);
}
