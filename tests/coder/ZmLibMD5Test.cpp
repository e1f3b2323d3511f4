#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmBox3i.h>
#include <zmlib/ZmLibMD5.h>
#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmLibMD5List.h>
#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmPlane.h>
#include <zmlib/ZmVec2f.h>
#include <zmlib/ZmVec2i.h>
#include <zmlib/ZmVec3l.h>
#include <zmlib/ZmVec4f.h>

#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

using ZmLib::MD5;
using ZmLib::MD5Coder;
using ZmLib::MD5List;

namespace {

using Bytes = std::vector<unsigned char>;

// The system's md5sum over \p bytes, as 32 upper-case digits ("" when it could not be run).
std::string systemMd5(const Bytes& bytes)
{
    ScratchDir dir;
    const std::string path = dir / "data";
    FILE* f = std::fopen(path.c_str(), "wb");
    if (f == nullptr) {
        return "";
    }
    if (!bytes.empty()) {
        std::fwrite(bytes.data(), 1, bytes.size(), f);
    }
    std::fclose(f);
    FILE* p = popen(("md5sum < '" + path + "'").c_str(), "r");
    if (p == nullptr) {
        return "";
    }
    char line[128] = {};
    const bool got = std::fgets(line, sizeof line, p) != nullptr;
    pclose(p);
    std::string hex = got ? std::string(line, 32) : "";
    for (char& c : hex) {
        c = char(std::toupper(static_cast<unsigned char>(c)));
    }
    return hex;
}

std::string text(const MD5& d)
{
    ZmString s;
    d.toString(s);
    return s.getString();
}

MD5 digestOf(const Bytes& bytes)
{
    MD5Coder c;
    c.append(bytes.data(), bytes.size());
    return c.finalize();
}

MD5 randomDigest(std::mt19937_64& rng)
{
    return MD5(Zm128(rng(), rng()));
}

// The little-endian bytes of \p values, one after another.
template <class T>
Bytes leBytes(std::initializer_list<T> values)
{
    Bytes out;
    for (T v : values) {
        unsigned char b[sizeof(T)];
        std::memcpy(b, &v, sizeof v);
        out.insert(out.end(), b, b + sizeof b);
    }
    return out;
}

Bytes bytesOf(const MD5& d)
{
    Bytes b(16);
    d.getBytes(b.data());
    return b;
}

} // namespace

TEST(ZmLibMD5, TextFormRoundTripsAndRejectsOtherLengths)
{
    std::mt19937_64 rng(4711);
    for (int i = 0; i < 200; ++i) {
        const MD5 d = randomDigest(rng);
        const Bytes b = bytesOf(d);
        std::string expected;
        for (const unsigned char byte : b) {
            char pair[3];
            std::snprintf(pair, sizeof pair, "%02X", byte);
            expected += pair;
        }
        ASSERT_EQ(text(d), expected);
        ASSERT_EQ(MD5::fromString(ZmString(expected.c_str())), d);
        std::string lower = expected;
        std::transform(lower.begin(), lower.end(), lower.begin(),
                       [](char c) { return char(std::tolower(c)); });
        ASSERT_EQ(MD5::fromString(ZmString(lower.c_str())), d);
    }
    // Byte order: the first character pair is byte 0, the low byte of the first word.
    const MD5 ordered = MD5::fromString("0102030405060708090A0B0C0D0E0Fff");
    EXPECT_EQ(ordered.value().first, 0x0807060504030201ull);
    EXPECT_EQ(ordered.value().second, 0xFF0F0E0D0C0B0A09ull);
    EXPECT_EQ(ZmLib::zm_hash(ordered), 0x04030201u);

    EXPECT_EQ(text(MD5()), "");
    EXPECT_EQ(MD5::fromString(""), MD5());
    EXPECT_EQ(MD5::fromString("0102030405060708090A0B0C0D0E0F1"), MD5());   // 31
    EXPECT_EQ(MD5::fromString("0102030405060708090A0B0C0D0E0F101"), MD5()); // 33
    EXPECT_EQ(MD5::fromString("00000000000000000000000000000000"), MD5());
}

TEST(ZmLibMD5, CompareIsUnsignedFirstWordThenSecond)
{
    const MD5 high(Zm128(0x8000000000000000ull, 0));
    const MD5 one(Zm128(1, 0xFFFFFFFFFFFFFFFFull));
    const MD5 oneTwo(Zm128(1, 0xFFFFFFFFFFFFFFFEull));
    EXPECT_EQ(MD5::compare(high, one), 1);
    EXPECT_EQ(MD5::compare(one, high), -1);
    EXPECT_EQ(MD5::compare(oneTwo, one), -1);
    EXPECT_EQ(MD5::compare(one, one), 0);
    EXPECT_TRUE(one < high);
}

TEST(ZmLibMD5, EmptyMessageConstantIsTheDigestOfZeroBytes)
{
    const std::string oracle = systemMd5({});
    ASSERT_EQ(oracle.size(), 32u) << "md5sum could not be run";
    EXPECT_EQ(oracle, "D41D8CD98F00B204E9800998ECF8427E");
    EXPECT_EQ(text(MD5::hashOfEmptyMessage()), oracle);
    EXPECT_EQ(MD5Coder().finalize(), MD5::hashOfEmptyMessage());
    EXPECT_TRUE(MD5::fromString(oracle.c_str()).isHashOfEmptyMessage());
    EXPECT_FALSE(MD5().isHashOfEmptyMessage());
}

TEST(ZmLibMD5Coder, AppendAgreesWithMd5sumAndEmptyAppendFeeds4711)
{
    // An empty piece counts as the four bytes of 4711, little-endian.
    MD5Coder empty;
    empty.append(nullptr, 0);
    EXPECT_EQ(text(empty.finalize()), systemMd5({0x67, 0x12, 0x00, 0x00}));

    std::mt19937 rng(12);
    Bytes data(3000);
    for (unsigned char& b : data) {
        b = static_cast<unsigned char>(rng());
    }
    // Random cuts, many across the 64-byte block boundaries.
    MD5Coder pieces;
    for (size_t at = 0; at < data.size();) {
        const size_t n = std::min<size_t>(data.size() - at, 1 + rng() % 150);
        pieces.append(data.data() + at, n);
        at += n;
    }
    EXPECT_EQ(text(pieces.finalize()), systemMd5(data));
}

TEST(ZmLibMD5Coder, FinalizeStopsTheCoderAndHashReadsTheState)
{
    const Bytes abc = {'a', 'b', 'c'};
    MD5Coder c;
    EXPECT_TRUE(c.isRunning());
    c.append(abc.data(), 3);
    const MD5 midway = c.hash();
    MD5Coder copy;
    copy = c; // the running digest travels with a copy
    const MD5 final = c.finalize();
    EXPECT_FALSE(c.isRunning());
    EXPECT_EQ(text(final), "900150983CD24FB0D6963F7D28E17F72");
    EXPECT_NE(midway, final);
    EXPECT_EQ(c.hash(), final);
    EXPECT_EQ(c.finalize(), final);
    c.append(abc.data(), 3);
    EXPECT_EQ(c.hash(), final);
    EXPECT_TRUE(copy.isRunning());
    EXPECT_EQ(copy.finalize(), final);
}

TEST(ZmLibMD5Coder, TypedValuesFeedTheirLittleEndianBytes)
{
    MD5List list(false);
    list.insert(MD5(Zm128(11, 12)));
    list.insert(MD5(Zm128(13, 14)));
    const MD5 digest = MD5::fromString("000102030405060708090A0B0C0D0E0F");
    const std::string withZero("hi\0x", 4);

    struct Case {
        const char* what;
        std::function<void(MD5Coder&)> feed;
        Bytes bytes;
    };
    const Bytes zeroCount = {0, 0, 0, 0, 0, 0, 0, 0};
    const Case cases[] = {
        {"char", [](MD5Coder& c) { c << 'A'; }, {0x41}},
        {"unsigned char", [](MD5Coder& c) { c << static_cast<unsigned char>(0xFE); }, {0xFE}},
        {"short", [](MD5Coder& c) { c << static_cast<short>(-2); }, {0xFE, 0xFF}},
        {"unsigned short", [](MD5Coder& c) { c << static_cast<unsigned short>(0x1234); }, {0x34, 0x12}},
        {"int", [](MD5Coder& c) { c << -5; }, {0xFB, 0xFF, 0xFF, 0xFF}},
        {"unsigned int", [](MD5Coder& c) { c << 0xA1B2C3D4u; }, {0xD4, 0xC3, 0xB2, 0xA1}},
        {"float", [](MD5Coder& c) { c << 1.0f; }, {0x00, 0x00, 0x80, 0x3F}},
        {"int64", [](MD5Coder& c) { c << int64_t(-2); }, {0xFE, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF}},
        {"uint64", [](MD5Coder& c) { c << uint64_t(0x0102030405060708ull); }, {8, 7, 6, 5, 4, 3, 2, 1}},
        {"ZmUniqueID", [](MD5Coder& c) { c << ZmUniqueID(0x0102030405060708ll); }, {8, 7, 6, 5, 4, 3, 2, 1}},
        {"MD5", [&](MD5Coder& c) { c << digest; }, {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15}},
        {"const char*", [](MD5Coder& c) { c << "ab"; }, {3, 0, 0, 0, 0, 0, 0, 0, 'a', 'b', 0}},
        {"null const char*",
         [](MD5Coder& c) { c << static_cast<const char*>(nullptr); },
         {1, 0, 0, 0, 0, 0, 0, 0, 0}},
        {"ZmString", [](MD5Coder& c) { c << ZmString("xyz"); }, {4, 0, 0, 0, 0, 0, 0, 0, 'x', 'y', 'z', 0}},
        {"empty ZmString", [](MD5Coder& c) { c << ZmString(); }, {1, 0, 0, 0, 0, 0, 0, 0, 0}},
        {"std::string", [&](MD5Coder& c) { c << withZero; }, {4, 0, 0, 0, 0, 0, 0, 0, 'h', 'i', 0, 'x'}},
        {"empty std::string", [](MD5Coder& c) { c << std::string(); }, zeroCount},
        {"MD5List", [&](MD5Coder& c) { c << list; }, bytesOf(list.hash())},
        {"ZmVec2f", [](MD5Coder& c) { c << ZmVec2f(1.5f, -2); }, leBytes({1.5f, -2.0f})},
        {"ZmVec2i", [](MD5Coder& c) { c << ZmVec2i(-1, 7); }, leBytes({int32_t(-1), int32_t(7)})},
        {"ZmVec3f", [](MD5Coder& c) { c << ZmVec3f(1, 2, 3); }, leBytes({1.0f, 2.0f, 3.0f})},
        {"ZmVec3i", [](MD5Coder& c) { c << ZmVec3i(4, -5, 6); },
         leBytes({int32_t(4), int32_t(-5), int32_t(6)})},
        {"ZmVec3l", [](MD5Coder& c) { c << ZmVec3l(1ll << 40, -1, 2); },
         leBytes({int64_t(1) << 40, int64_t(-1), int64_t(2)})},
        {"ZmVec4f", [](MD5Coder& c) { c << ZmVec4f(1, 2, 3, 4); }, leBytes({1.0f, 2.0f, 3.0f, 4.0f})},
        {"ZmPlane", [](MD5Coder& c) { c << ZmPlane(ZmVec3f(0, 0, 2), 3.0f); },
         leBytes({0.0f, 0.0f, 1.0f, 3.0f})},
        {"ZmBox3f", [](MD5Coder& c) { c << ZmBox3f(ZmVec3f(1, 2, 3), ZmVec3f(4, 5, 6)); },
         leBytes({1.0f, 4.0f, 2.0f, 5.0f, 3.0f, 6.0f})},
        {"ZmBox3i", [](MD5Coder& c) { c << ZmBox3i(0, 9, 1, 8, 2, 7); }, leBytes({0, 9, 1, 8, 2, 7})},
        {"ZmMat3f", [](MD5Coder& c) { c << ZmMat3f(1, 2, 3, 4, 5, 6, 7, 8, 9); },
         leBytes({1.f, 2.f, 3.f, 4.f, 5.f, 6.f, 7.f, 8.f, 9.f})},
        {"ZmMat4f", [](MD5Coder& c) { c << ZmMat4f(1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16); },
         leBytes({1.f, 2.f, 3.f, 4.f, 5.f, 6.f, 7.f, 8.f, 9.f, 10.f, 11.f, 12.f, 13.f, 14.f, 15.f, 16.f})},
    };
    Bytes all;
    MD5Coder chained;
    for (const Case& k : cases) {
        MD5Coder c;
        k.feed(c);
        EXPECT_EQ(c.finalize(), digestOf(k.bytes)) << k.what;
        k.feed(chained);
        all.insert(all.end(), k.bytes.begin(), k.bytes.end());
    }
    EXPECT_EQ(chained.finalize(), digestOf(all));
}

TEST(ZmLibMD5List, HashRunsFromLastValueToFirstAndIsRecomputedAfterInsert)
{
    std::mt19937_64 rng(99);
    const MD5 a = randomDigest(rng);
    const MD5 b = randomDigest(rng);
    const MD5 c = randomDigest(rng);
    MD5List list(false);
    EXPECT_EQ(list.hash(), MD5::hashOfEmptyMessage());
    list.insert(a);
    list.insert(b);
    Bytes ba = bytesOf(b);
    const Bytes aBytes = bytesOf(a);
    ba.insert(ba.end(), aBytes.begin(), aBytes.end());
    EXPECT_EQ(list.hash(), digestOf(ba));
    EXPECT_EQ(text(list.hash()), systemMd5(ba));

    list.insert(c); // the cached digest must not survive
    Bytes cba = bytesOf(c);
    cba.insert(cba.end(), ba.begin(), ba.end());
    EXPECT_EQ(list.hash(), digestOf(cba));

    const MD5List copy(list);
    EXPECT_EQ(copy.hash(), list.hash());
    EXPECT_EQ(copy.values().size(), 3);
    EXPECT_FALSE(copy.isSorted());
}

TEST(ZmLibMD5List, SortedListKeepsAscendingOrderWhateverTheInsertOrder)
{
    std::mt19937_64 rng(7);
    std::vector<MD5> inserted;
    for (int i = 0; i < 300; ++i) {
        // Few distinct words, so that duplicates and ties on the first word occur; the high bit
        // checks that the order is unsigned.
        const uint64_t first = (rng() % 5) << 62 | (rng() % 3);
        inserted.push_back(i % 17 == 0 && i > 0 ? inserted[size_t(i) / 2] : MD5(Zm128(first, rng() % 4)));
    }
    MD5List sorted(true);
    MD5List unsorted(false);
    for (const MD5& d : inserted) {
        sorted.insert(d);
        unsorted.insert(d);
    }
    EXPECT_TRUE(sorted.isSorted());
    std::vector<MD5> model = inserted;
    std::sort(model.begin(), model.end(), [](const MD5& x, const MD5& y) { return MD5::compare(x, y) < 0; });
    ASSERT_EQ(sorted.values().size(), int64_t(model.size()));
    for (size_t i = 0; i < model.size(); ++i) {
        ASSERT_EQ(sorted.values()[i], model[i]) << "index " << i;
        ASSERT_EQ(unsorted.values()[i], inserted[i]) << "index " << i;
    }
    MD5List reversed(true);
    for (auto it = inserted.rbegin(); it != inserted.rend(); ++it) {
        reversed.insert(*it);
    }
    EXPECT_EQ(reversed.hash(), sorted.hash());
    EXPECT_NE(unsorted.hash(), sorted.hash());
}
