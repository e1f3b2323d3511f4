#include <zmlib/ZmUUID.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

/// The UUID whose storage bytes are \p bytes (the conversion is a plain copy of 16 bytes).
ZmUUID fromBytes(const unsigned char (&bytes)[16])
{
    ZmUUID u;
    std::memcpy(&u.first, bytes, 8);
    std::memcpy(&u.second, bytes + 8, 8);
    return u;
}

/// The text form built byte by byte with printf.
std::string hexOf(const unsigned char (&bytes)[16])
{
    std::string s;
    char pair[3];
    for (unsigned char b : bytes) {
        std::snprintf(pair, sizeof pair, "%02X", b);
        s += pair;
    }
    return s;
}

/// Version 4 in the high nibble of byte 6, variant bits 10 at the top of byte 8.
bool isVersion4(const ZmUUID& u)
{
    unsigned char bytes[16];
    std::memcpy(bytes, &u.first, 8);
    std::memcpy(bytes + 8, &u.second, 8);
    return (bytes[6] & 0xF0) == 0x40 && (bytes[8] & 0xC0) == 0x80;
}

} // namespace

TEST(ZmUUID, TextFormsShowStorageOrderAndRoundTrip)
{
    const unsigned char counting[16] = {0x00, 0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77,
                                        0x88, 0x99, 0xAA, 0xBB, 0xCC, 0xDD, 0xEE, 0xFF};
    const ZmUUID c = fromBytes(counting);
    EXPECT_STREQ(c.toString().getString(), "00112233445566778899AABBCCDDEEFF");
    EXPECT_STREQ(c.toFormattedString().getString(), "{00112233-4455-6677-8899-AABBCCDDEEFF}");
    EXPECT_EQ(zm_hash(c), 0xFFEEDDCCu) << "bytes 12-15, little-endian";
    EXPECT_EQ(ZmUUID::zm_hash(c), 0xFFEEDDCCu);
    EXPECT_STREQ(ZmUUID().toFormattedString().getString(), "{00000000-0000-0000-0000-000000000000}");

    std::mt19937_64 rng(4242);
    for (int i = 0; i < 2000; ++i) {
        unsigned char bytes[16];
        for (unsigned char& b : bytes) {
            b = static_cast<unsigned char>(rng());
        }
        const ZmUUID u = i % 2 == 0 ? fromBytes(bytes) : ZmUUID::generateUUID();
        if (i % 2 != 0) {
            std::memcpy(bytes, &u.first, 8);
            std::memcpy(bytes + 8, &u.second, 8);
        }
        const std::string plain = u.toString().getString();
        const std::string formatted = u.toFormattedString().getString();
        ASSERT_EQ(plain, hexOf(bytes));
        ASSERT_EQ(formatted, "{" + plain.substr(0, 8) + "-" + plain.substr(8, 4) + "-" + plain.substr(12, 4) +
                                 "-" + plain.substr(16, 4) + "-" + plain.substr(20) + "}");
        ASSERT_EQ(ZmUUID::fromString(plain.c_str()), u) << plain;
        ASSERT_EQ(ZmUUID::fromFormattedString(formatted.c_str()), u) << formatted;
        // Each form from the other, and lower case reads the same.
        ASSERT_EQ(ZmUUID::fromFormattedString(ZmUUID::fromString(plain.c_str()).toFormattedString()), u);
        ASSERT_EQ(ZmUUID::fromString(ZmUUID::fromFormattedString(formatted.c_str()).toString()), u);
        std::string lower = formatted;
        std::transform(lower.begin(), lower.end(), lower.begin(),
                       [](unsigned char ch) { return std::tolower(ch); });
        ASSERT_EQ(ZmUUID::fromFormattedString(lower.c_str()), u) << lower;
        ASSERT_EQ(zm_hash(u), uint32_t(bytes[12]) | uint32_t(bytes[13]) << 8 | uint32_t(bytes[14]) << 16 |
                                  uint32_t(bytes[15]) << 24);
    }
}

TEST(ZmUUID, MalformedTextsGiveNil)
{
    const std::string plain = "0123456789ABCDEF0123456789ABCDEF";
    const std::string formatted = "{01234567-89AB-CDEF-0123-456789ABCDEF}";
    ASSERT_TRUE(ZmUUID::fromString(plain.c_str()).isValid());
    ASSERT_TRUE(ZmUUID::fromFormattedString(formatted.c_str()).isValid());

    const std::string bad[] = {
        "",
        plain.substr(1),                          // 31 characters
        plain + "0",                              // 33
        formatted.substr(0, 37),                  // 37, closing brace missing
        formatted.substr(1),                      // 37, opening brace missing
        "(" + formatted.substr(1, 36) + ")",      // 38 without braces
        "0" + formatted.substr(1, 36) + "0",      // 38 without braces
        "{0123456789AB-CDEF-0123-456789ABCDEF-}", // dashes moved
        "{01234567-89AB-CDEF-0123-456789ABCDEF}}",
        formatted + " ",
        plain, // the plain form is no formatted form
    };
    for (const std::string& s : bad) {
        EXPECT_FALSE(ZmUUID::fromFormattedString(s.c_str()).isValid()) << '"' << s << '"';
        if (s.size() != 32) {
            EXPECT_FALSE(ZmUUID::fromString(s.c_str()).isValid()) << '"' << s << '"';
        }
    }
    EXPECT_FALSE(ZmUUID::fromString(formatted.c_str()).isValid());
    // 38 characters of a lowercase braced form minus one dash are 37: nil.
    EXPECT_FALSE(ZmUUID::fromFormattedString("{0123456789ab-cdef-0123-456789abcdef}").isValid());
}

TEST(ZmUUID, UnvalidatedCharactersFollowTheDigitLetterRule)
{
    // 'G' counts as an upper-case letter (16), 'g' as lower-case (16), ' ' as a digit (-16), '~'
    // as lower-case (39); each pair is value * 16 + value, truncated to a byte.
    const ZmUUID u = ZmUUID::fromString("0GgG  ~~000000000000000000000000");
    unsigned char bytes[16];
    std::memcpy(bytes, &u.first, 8);
    std::memcpy(bytes + 8, &u.second, 8);
    EXPECT_EQ(bytes[0], 0x10);
    EXPECT_EQ(bytes[1], (16 * 16 + 16) & 0xFF);
    EXPECT_EQ(bytes[2], (-16 * 16 - 16) & 0xFF);
    EXPECT_EQ(bytes[3], (39 * 16 + 39) & 0xFF);
    EXPECT_EQ(bytes[4], 0);
}

TEST(ZmUUID, MillionGeneratedAreDistinctVersion4)
{
    const int n = 1000000;
    std::vector<Zm128> all;
    all.reserve(n);
    for (int i = 0; i < n; ++i) {
        const ZmUUID u = ZmUUID::generateUUID();
        ASSERT_TRUE(isVersion4(u)) << u.toString().getString();
        const ZmString text = u.toString();
        ASSERT_EQ(text.getString()[12], '4');
        ASSERT_NE(std::strchr("89AB", text.getString()[16]), nullptr);
        all.push_back(u);
    }
    std::sort(all.begin(), all.end());
    EXPECT_EQ(std::adjacent_find(all.begin(), all.end()), all.end());

    // The 122 random bits look random: every one of them is set in roughly half the values.
    for (int bit = 0; bit < 128; ++bit) {
        const bool fixed = (bit >= 52 && bit < 56) || (bit >= 70 && bit < 72); // version, variant
        int64_t ones = 0;
        for (int i = 0; i < 10000; ++i) {
            const uint64_t word = bit < 64 ? all[i * 97].first : all[i * 97].second;
            ones += (word >> (bit % 64)) & 1;
        }
        if (!fixed) {
            EXPECT_GT(ones, 4500) << "bit " << bit;
            EXPECT_LT(ones, 5500) << "bit " << bit;
        }
    }
}

namespace {

enum class Blocked { KernelRandom, KernelRandomAndOpen };

/// Generates two UUIDs in a child process in which the kernel random call fails with ENOSYS (and
/// opening files with EACCES); returns false if the filter could not be set up there.
bool generateInSandbox(Blocked what, ZmUUID (&out)[2], std::string& why)
{
#if defined(__x86_64__)
    const unsigned int arch = AUDIT_ARCH_X86_64;
#elif defined(__aarch64__)
    const unsigned int arch = AUDIT_ARCH_AARCH64;
#else
    why = "no seccomp filter for this architecture";
    return false;
#endif
    int fds[2];
    if (pipe(fds) != 0) {
        why = "pipe failed";
        return false;
    }
    const pid_t pid = fork();
    if (pid == 0) {
        close(fds[0]);
        const bool blockOpen = what == Blocked::KernelRandomAndOpen;
        sock_filter filter[] = {
            BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, arch)),
            BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, arch, 1, 0),
            BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
            BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
            BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_getrandom, 0, 1),
            BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS),
            BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_openat, 0, 1),
            BPF_STMT(BPF_RET | BPF_K, blockOpen ? (SECCOMP_RET_ERRNO | EACCES) : SECCOMP_RET_ALLOW),
            BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
        };
        sock_fprog prog = {static_cast<unsigned short>(sizeof filter / sizeof filter[0]), filter};
        if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
            prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &prog) != 0) {
            _exit(3);
        }
        unsigned char check[4];
        if (syscall(SYS_getrandom, check, sizeof check, 0) != -1 || errno != ENOSYS) {
            _exit(4);
        }
        ZmUUID u[2] = {ZmUUID::generateUUID(), ZmUUID::generateUUID()};
        const bool ok = write(fds[1], u, sizeof u) == ssize_t(sizeof u);
        _exit(ok ? 0 : 5);
    }
    close(fds[1]);
    if (pid < 0) {
        close(fds[0]);
        why = "fork failed";
        return false;
    }
    size_t got = 0;
    char* dst = reinterpret_cast<char*>(out);
    while (got < sizeof out) {
        const ssize_t r = read(fds[0], dst + got, sizeof out - got);
        if (r <= 0) {
            break;
        }
        got += size_t(r);
    }
    close(fds[0]);
    int status = 0;
    waitpid(pid, &status, 0);
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0 || got != sizeof out) {
        why = "sandboxed child ended with status " + std::to_string(status);
        return false;
    }
    return true;
}

} // namespace

TEST(ZmUUID, FallsBackToUrandomWithoutTheKernelCall)
{
    ZmUUID u[2];
    std::string why;
    if (!generateInSandbox(Blocked::KernelRandom, u, why)) {
        GTEST_SKIP() << "cannot make the kernel random call fail here: " << why;
    }
    EXPECT_TRUE(isVersion4(u[0])) << u[0].toString().getString();
    EXPECT_TRUE(isVersion4(u[1])) << u[1].toString().getString();
    EXPECT_NE(u[0], u[1]);
}

TEST(ZmUUID, NilWhenNoRandomSourceWorks)
{
    ZmUUID u[2];
    std::string why;
    if (!generateInSandbox(Blocked::KernelRandomAndOpen, u, why)) {
        GTEST_SKIP() << "cannot make the random sources fail here: " << why;
    }
    EXPECT_FALSE(u[0].isValid()) << u[0].toString().getString();
    EXPECT_FALSE(u[1].isValid());
}
