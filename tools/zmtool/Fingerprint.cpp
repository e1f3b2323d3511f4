// zmtool md5 / zmtool cksum: file fingerprints with the library's MD5 and CRC, printed exactly as
// the GNU md5sum and the POSIX cksum commands print them, so that the outputs can be compared or
// checked with those programs.
#include "TerminalProgress.h"
#include "zmtool.h"

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmString.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>

namespace {

enum class Kind { Md5, Cksum };

const size_t kChunkSize = size_t(1) << 20;

struct Sum {
    ZmLib::MD5Coder md5;
    uint32_t crc = 0;
    uint64_t length = 0;
};

void reportError(const char* command, const char* name, int error)
{
    std::fflush(stdout);
    std::fprintf(stderr, "zmtool %s: %s: %s\n", command, name, std::strerror(error));
}

// Reads \p fd to its end into \p sum; false with errno set on a read error.
bool readAll(int fd, Kind kind, const char* name, unsigned char* buffer, Sum& sum)
{
    uint64_t total = 0;
    struct stat st {};
    if (fstat(fd, &st) == 0 && S_ISREG(st.st_mode)) {
        total = uint64_t(st.st_size);
    }
    zmtool::TerminalProgress progress;
    progress.begin(name, total, 1.0);
    for (;;) {
        const ssize_t n = read(fd, buffer, kChunkSize);
        if (n < 0) {
            if (errno == EINTR) {
                continue;
            }
            const int error = errno;
            progress.clear();
            errno = error;
            return false;
        }
        if (n == 0) {
            return true;
        }
        // Chunks are never empty here, so the coder's special case for empty pieces never applies.
        if (kind == Kind::Md5) {
            sum.md5.append(buffer, uint64_t(n));
        } else {
            sum.crc = ZmCoder::crcUpdate(sum.crc, buffer, size_t(n));
        }
        sum.length += uint64_t(n);
        progress.update(sum.length);
    }
}

// md5sum marks a name holding a backslash, a line feed or a carriage return with a leading
// backslash and escapes those three characters, so that every result stays on one line and reads
// back unchanged.
void printMd5Line(const ZmLib::MD5& digest, const char* name)
{
    unsigned char bytes[16];
    digest.getBytes(bytes);
    ZmString hex;
    ZmCoder::dataToHexString(bytes, 16, hex, false);
    const bool escape = std::strpbrk(name, "\\\n\r") != nullptr;
    std::string text;
    for (const char* p = name; *p != 0; ++p) {
        if (escape && *p == '\\') {
            text += "\\\\";
        } else if (escape && *p == '\n') {
            text += "\\n";
        } else if (escape && *p == '\r') {
            text += "\\r";
        } else {
            text += *p;
        }
    }
    std::printf("%s%s  %s\n", escape ? "\\" : "", hex.getString(), text.c_str());
}

// Sums one file (or standard input for "-") and prints its line; false after reporting an error.
// cksum names nothing when it reads standard input by default (\p printName false), but prints
// "-" when asked for it.
bool sumOne(Kind kind, const char* command, const char* name, bool printName, unsigned char* buffer)
{
    const bool isStdin = std::strcmp(name, "-") == 0;
    int fd = 0;
    if (!isStdin) {
        do {
            fd = open(name, O_RDONLY | O_CLOEXEC);
        } while (fd < 0 && errno == EINTR);
        if (fd < 0) {
            reportError(command, name, errno);
            return false;
        }
    }
    Sum sum;
    const bool read = readAll(fd, kind, name, buffer, sum);
    const int error = errno;
    if (!isStdin) {
        close(fd);
    }
    if (!read) {
        reportError(command, name, error);
        return false;
    }
    if (kind == Kind::Md5) {
        printMd5Line(sum.md5.finalize(), name);
    } else {
        const uint32_t crc = ZmCoder::crcFinish(sum.crc, sum.length);
        std::printf("%" PRIu32 " %" PRIu64 "%s%s\n", crc, sum.length, printName ? " " : "",
                    printName ? name : "");
    }
    return true;
}

int usage(const char* command)
{
    std::fprintf(stderr, "usage: zmtool %s [FILE...]   (no FILE or '-': standard input)\n", command);
    return 2;
}

int run(Kind kind, int argc, char** argv)
{
    const char* command = kind == Kind::Md5 ? "md5" : "cksum";
    int first = 0;
    for (; first < argc; ++first) {
        const char* a = argv[first];
        if (std::strcmp(a, "--") == 0) {
            ++first;
            break;
        }
        if (std::strcmp(a, "--help") == 0 || std::strcmp(a, "-h") == 0) {
            std::printf("usage: zmtool %s [FILE...]\n"
                        "Prints the %s of each FILE (standard input for '-' or no FILE) as %s does.\n",
                        command, kind == Kind::Md5 ? "MD5 digest" : "CRC and size",
                        kind == Kind::Md5 ? "md5sum" : "cksum");
            return 0;
        }
        if (a[0] != '-' || a[1] == 0) {
            break;
        }
        std::fprintf(stderr, "zmtool %s: unknown option '%s'\n", command, a);
        return usage(command);
    }
    // Options come first; every later argument is a file name ("-" for standard input).
    const std::unique_ptr<unsigned char[]> buffer(new unsigned char[kChunkSize]);
    bool ok = true;
    if (first >= argc) {
        ok = sumOne(kind, command, "-", false, buffer.get());
    }
    for (int i = first; i < argc; ++i) {
        ok = sumOne(kind, command, argv[i], true, buffer.get()) && ok;
    }
    if (std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
        std::fprintf(stderr, "zmtool %s: write error: %s\n", command, std::strerror(errno));
        return 1;
    }
    return ok ? 0 : 1;
}

} // namespace

int zmtool::runMd5(int argc, char** argv)
{
    return run(Kind::Md5, argc, argv);
}

int zmtool::runCksum(int argc, char** argv)
{
    return run(Kind::Cksum, argc, argv);
}
