#include "ScratchDir.h"

#include <zmlib/ZmCoder.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <random>
#include <sstream>
#include <string>
#include <vector>

namespace {

using Bytes = std::vector<unsigned char>;

const unsigned char* bytesOf(const std::string& s)
{
    return reinterpret_cast<const unsigned char*>(s.data());
}

std::string toHex(const unsigned char* p, size_t n)
{
    static const char digits[] = "0123456789abcdef";
    std::string s;
    for (size_t i = 0; i < n; ++i) {
        s += digits[p[i] >> 4];
        s += digits[p[i] & 15];
    }
    return s;
}

// The digest of \p data fed in pieces of random sizes (seeded), so the partial-block buffer is
// used at every offset.
std::string md5Hex(const unsigned char* data, size_t n, unsigned seed = 0)
{
    ZmCoder coder;
    std::mt19937 rng(seed);
    size_t done = 0;
    while (done < n) {
        size_t piece = seed == 0 ? n - done : std::min<size_t>(n - done, rng() % 150);
        coder.crcMD5Update(data + done, static_cast<unsigned int>(piece));
        done += piece;
    }
    coder.crcMD5Final();
    unsigned char digest[16];
    coder.crcMD5Query(digest);
    return toHex(digest, 16);
}

struct CrcPathGuard {
    ~CrcPathGuard() { ZmCoder::setCrcImplementation(ZmCoder::CrcImplementation::Automatic); }
};

uint32_t crcWith(ZmCoder::CrcImplementation which, uint32_t start, const unsigned char* p, size_t n)
{
    ZmCoder::setCrcImplementation(which);
    return ZmCoder::crcUpdate(start, p, n);
}

// Runs `<program> <files...>` in \p dir and maps each file name to the first word of its line.
std::map<std::string, std::string> runOn(const std::string& program, const std::string& dir,
                                         const std::vector<std::string>& names)
{
    std::string cmd = "cd '" + dir + "' && " + program;
    for (const auto& name : names) {
        cmd += " " + name;
    }
    std::map<std::string, std::string> result;
    FILE* pipe = popen(cmd.c_str(), "r");
    if (pipe == nullptr) {
        return result;
    }
    char line[512];
    while (std::fgets(line, sizeof line, pipe) != nullptr) {
        // "<digest>  <name>" from md5sum, "<crc> <length> <name>" from cksum.
        std::istringstream in(line);
        std::string first;
        std::string name;
        in >> first;
        for (std::string word; in >> word;) {
            name = word;
        }
        result[name] = first;
    }
    pclose(pipe);
    return result;
}

} // namespace

TEST(ZmCoder, Md5MatchesTheRfc1321TestSuite)
{
    const std::pair<std::string, std::string> suite[] = {
        {"", "d41d8cd98f00b204e9800998ecf8427e"},
        {"a", "0cc175b9c0f1b6a831c399e269772661"},
        {"abc", "900150983cd24fb0d6963f7d28e17f72"},
        {"message digest", "f96b697d7cb7938d525a2f31aaf161d0"},
        {"abcdefghijklmnopqrstuvwxyz", "c3fcd3d76192e4007dfb496cca67e13b"},
        {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
         "d174ab98d277d9f5a5611c2c9f419d9f"},
        {"12345678901234567890123456789012345678901234567890123456789012345678901234567890",
         "57edf4a22be3c955ac49da2e2107b67a"},
    };
    for (const auto& [text, digest] : suite) {
        EXPECT_EQ(md5Hex(bytesOf(text), text.size()), digest) << '"' << text << '"';
        EXPECT_EQ(md5Hex(bytesOf(text), text.size(), 7), digest) << '"' << text << "\" in pieces";
    }
    // A fresh object is initialised; crcMD5Init restarts a used one.
    ZmCoder coder;
    coder.crcMD5Update(bytesOf("xyz"), 3);
    coder.crcMD5Init();
    coder.crcMD5Update(bytesOf("abc"), 3);
    coder.crcMD5Final();
    unsigned char digest[16];
    coder.crcMD5Query(digest);
    EXPECT_EQ(toHex(digest, 16), "900150983cd24fb0d6963f7d28e17f72");
}

TEST(ZmCoder, QueryBeforeFinalGivesTheInitialStateWords)
{
    ZmCoder coder;
    unsigned char words[16];
    coder.crcMD5Query(words);
    EXPECT_EQ(toHex(words, 16), "0123456789abcdeffedcba9876543210");
}

// md5sum and cksum as outside oracles, on files of every size 0..130 and around 1 MiB.
TEST(ZmCoder, Md5AndCrcAgreeWithMd5sumAndCksum)
{
    if (std::system("command -v md5sum >/dev/null 2>&1 && command -v cksum >/dev/null 2>&1") != 0) {
        GTEST_SKIP() << "md5sum or cksum not installed";
    }
    ScratchDir dir;
    ASSERT_FALSE(dir.path().empty());
    std::mt19937 rng(20240611);
    std::vector<Bytes> contents;
    std::vector<std::string> names;
    std::vector<size_t> sizes;
    for (size_t n = 0; n <= 130; ++n) {
        sizes.push_back(n);
    }
    for (size_t n : {size_t(1 << 20) - 1, size_t(1 << 20), size_t(1 << 20) + 13}) {
        sizes.push_back(n);
    }
    for (size_t n : sizes) {
        Bytes data(n);
        for (auto& b : data) {
            b = static_cast<unsigned char>(rng());
        }
        names.push_back("f" + std::to_string(n));
        std::ofstream(dir / names.back(), std::ios::binary)
            .write(reinterpret_cast<const char*>(data.data()), std::streamsize(n));
        contents.push_back(std::move(data));
    }
    const auto md5sums = runOn("md5sum", dir.path(), names);
    const auto cksums = runOn("cksum", dir.path(), names);
    ASSERT_EQ(md5sums.size(), names.size());
    ASSERT_EQ(cksums.size(), names.size());

    CrcPathGuard guard;
    for (size_t i = 0; i < names.size(); ++i) {
        const Bytes& data = contents[i];
        const unsigned n = static_cast<unsigned>(data.size());
        EXPECT_EQ(md5Hex(data.data(), n, unsigned(i) + 1), md5sums.at(names[i])) << names[i];
        for (auto which : {ZmCoder::CrcImplementation::Automatic, ZmCoder::CrcImplementation::Portable}) {
            ZmCoder::setCrcImplementation(which);
            EXPECT_EQ(std::to_string(ZmCoder::crc(data.data(), n)), cksums.at(names[i]))
                << names[i] << " implementation " << int(ZmCoder::crcImplementation());
        }
    }
}

TEST(ZmCoder, CrcCheckValueAndEmptyInput)
{
    EXPECT_EQ(ZmCoder::crc(bytesOf("123456789"), 9), 930766865u);
    EXPECT_EQ(ZmCoder::crc(nullptr, 0), 0xFFFFFFFFu);
    EXPECT_EQ(ZmCoder::crcFinish(ZmCoder::crcUpdate(0, bytesOf("123456789"), 9), 9), 930766865u);
}

TEST(ZmCoder, CrcImplementationsAndSplitsAgreeOnRandomBuffers)
{
    CrcPathGuard guard;
    std::mt19937 rng(4711);
    Bytes pool(70000);
    for (auto& b : pool) {
        b = static_cast<unsigned char>(rng());
    }
    int folded = 0;
    for (int round = 0; round < 600; ++round) {
        // Mostly short lengths around the block sizes, some long ones.
        const size_t n = round % 10 == 0 ? rng() % 65000 : rng() % 300;
        const size_t offset = rng() % 64;
        const uint32_t start = round % 3 == 0 ? 0 : uint32_t(rng());
        const unsigned char* p = pool.data() + offset;
        const uint32_t portable = crcWith(ZmCoder::CrcImplementation::Portable, start, p, n);
        const uint32_t automatic = crcWith(ZmCoder::CrcImplementation::Automatic, start, p, n);
        folded += ZmCoder::crcImplementation() == ZmCoder::CrcImplementation::CarrylessMultiply;
        ASSERT_EQ(portable, automatic) << "n " << n << " offset " << offset << " start " << start;
        // Streaming in two pieces gives the same register.
        const size_t cut = n == 0 ? 0 : rng() % (n + 1);
        ASSERT_EQ(ZmCoder::crcUpdate(ZmCoder::crcUpdate(start, p, cut), p + cut, n - cut), portable);
    }
    if (folded == 0) {
        GTEST_SKIP() << "no carry-less multiply on this processor: only the table path was tested";
    }
}

TEST(ZmCoder, AbcEncodingIsTwoLettersPerByteAndRoundTrips)
{
    int length = -1;
    const unsigned char one = 0x1F;
    char* text = ZmCoder::abcEncode(&one, 1, length);
    ASSERT_NE(text, nullptr);
    EXPECT_STREQ(text, "BP");
    EXPECT_EQ(length, 2);
    std::free(text);

    Bytes all(256);
    for (int i = 0; i < 256; ++i) {
        all[size_t(i)] = static_cast<unsigned char>(i);
    }
    text = ZmCoder::abcEncode(all.data(), 256, length);
    ASSERT_EQ(length, 512);
    EXPECT_EQ(std::strlen(text), 512u);
    EXPECT_EQ(std::string(text, 4), "AAAB");
    EXPECT_EQ(std::string(text + 508), "POPP");
    std::string lower(text);
    for (auto& c : lower) {
        c = char(c | 0x20);
    }
    for (const std::string& encoded : {std::string(text), lower, std::string(text) + "K"}) {
        char* decoded = ZmCoder::abcDecode(encoded.c_str(), int(encoded.size()), length);
        ASSERT_EQ(length, 256);
        EXPECT_EQ(decoded[256], 0);
        EXPECT_EQ(std::memcmp(decoded, all.data(), 256), 0);
        std::free(decoded);
    }
    std::free(text);
}

TEST(ZmCoder, AbcDecodeReadsOtherCharactersAsZeroAndEmptyInputsGiveEmptyBuffers)
{
    int length = -1;
    char* decoded = ZmCoder::abcDecode("BPZ!AQaq`@", 10, length);
    ASSERT_EQ(length, 5);
    EXPECT_EQ(std::string(decoded, 6), std::string("\x1f\0\0\0\0\0", 6));
    std::free(decoded);

    // Each call gets the length it writes, checked after the call.
    const auto expectEmpty = [](const char* what, auto call) {
        int outLength = -1;
        char* buffer = call(outLength);
        ASSERT_NE(buffer, nullptr) << what;
        EXPECT_EQ(buffer[0], 0) << what;
        EXPECT_EQ(outLength, 0) << what;
        std::free(buffer);
    };
    const auto* x = reinterpret_cast<const unsigned char*>("x");
    expectEmpty("odd single", [](int& l) { return ZmCoder::abcDecode("B", 1, l); });
    expectEmpty("negative decode", [](int& l) { return ZmCoder::abcDecode("BP", -2, l); });
    expectEmpty("null decode", [](int& l) { return ZmCoder::abcDecode(nullptr, 4, l); });
    expectEmpty("null encode", [](int& l) { return ZmCoder::abcEncode(nullptr, 4, l); });
    expectEmpty("negative encode", [x](int& l) { return ZmCoder::abcEncode(x, -1, l); });
}

TEST(ZmCoder, HexStringRoundTripsAndToleratesOddOrInvalidText)
{
    const unsigned char data[] = {0x00, 0x01, 0x9a, 0xbc, 0xde, 0xff};
    ZmString upper("old text");
    ZmString lower;
    ZmCoder::dataToHexString(data, 6, upper, true);
    ZmCoder::dataToHexString(data, 6, lower, false);
    EXPECT_STREQ(upper.getString(), "00019ABCDEFF");
    EXPECT_EQ(upper.length(), 12);
    EXPECT_STREQ(lower.getString(), "00019abcdeff");
    ZmCoder::dataToHexString(data, 0, upper, true);
    EXPECT_STREQ(upper.getString(), "");

    for (const ZmString& text : {lower, ZmString("00019ABCDEFF")}) {
        unsigned char back[7] = {0, 0, 0, 0, 0, 0, 0x77};
        ZmCoder::hexStringToData(back, text);
        EXPECT_EQ(std::memcmp(back, data, 6), 0);
        EXPECT_EQ(back[6], 0x77); // nothing written past length / 2
    }

    // Odd length: the last character is ignored; non-digits count as 0.
    unsigned char out[3] = {0x55, 0x55, 0x55};
    ZmCoder::hexStringToData(out, ZmString("1g 7A"));
    EXPECT_EQ(out[0], 0x10);
    EXPECT_EQ(out[1], 0x07);
    EXPECT_EQ(out[2], 0x55);
}
