// zmtool md5 / zmtool cksum: file fingerprints with the library's MD5 and CRC, printed exactly as
// the GNU md5sum and the POSIX cksum commands print them, so that the outputs can be compared or
// checked with those programs.
#include "zmtool.h"

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmString.h>

#include <fcntl.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <time.h>
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

double now()
{
    timespec ts{};
    clock_gettime(CLOCK_MONOTONIC, &ts);
    return double(ts.tv_sec) + double(ts.tv_nsec) * 1e-9;
}

// A one-line progress bar on standard error for files that take more than a second, drawn only
// when standard error is a terminal and wiped before the result line is printed.
class ProgressBar {
public:
    ProgressBar(const char* name, uint64_t total) : m_name(name), m_total(total), m_start(now())
    {
        m_enabled = isatty(2) != 0;
    }
    ~ProgressBar() { clear(); }
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;

    void update(uint64_t done)
    {
        if (!m_enabled) {
            return;
        }
        const double t = now();
        if (t - m_start < 1.0 || (m_width > 0 && t - m_lastDraw < 0.1)) {
            return;
        }
        m_lastDraw = t;
        draw(done);
    }

    void clear()
    {
        if (m_width > 0) {
            std::fprintf(stderr, "\r%*s\r", m_width, "");
            std::fflush(stderr);
            m_width = 0;
        }
    }

private:
    void draw(uint64_t done)
    {
        int columns = 80;
        winsize ws{};
        if (ioctl(2, TIOCGWINSZ, &ws) == 0 && ws.ws_col > 0) {
            columns = ws.ws_col;
        }
        // Stay one column short of the edge so that the terminal never wraps the line.
        const int room = columns - 1;
        char tail[64];
        int barWidth = 0;
        if (m_total > 0) {
            const uint64_t shown = done < m_total ? done : m_total;
            const int percent = int(shown * 100 / m_total);
            std::snprintf(tail, sizeof tail, "%3d%%", percent);
            barWidth = room >= 40 ? 30 : room / 3;
        } else {
            std::snprintf(tail, sizeof tail, "%" PRIu64 " MiB", done >> 20);
        }
        std::string line = m_name;
        const int fixed = (barWidth > 0 ? barWidth + 3 : 1) + int(std::strlen(tail));
        const int nameRoom = room - fixed;
        if (nameRoom < 4) {
            line.clear();
        } else if (int(line.size()) > nameRoom) {
            line = "..." + line.substr(line.size() - size_t(nameRoom - 3));
        }
        if (barWidth > 0) {
            const uint64_t shown = done < m_total ? done : m_total;
            const int filled = int(shown * uint64_t(barWidth) / m_total);
            line += " [";
            line.append(size_t(filled), '#');
            line.append(size_t(barWidth - filled), '.');
            line += "]";
        } else {
            line += " ";
        }
        line += tail;
        if (int(line.size()) > room) {
            line.resize(size_t(room > 0 ? room : 0));
        }
        const int width = int(line.size());
        // Pad over whatever a longer previous line left behind.
        std::fprintf(stderr, "\r%s%*s", line.c_str(), m_width > width ? m_width - width : 0, "");
        std::fflush(stderr);
        if (width > m_width) {
            m_width = width;
        }
    }

    std::string m_name;
    uint64_t m_total;
    double m_start;
    double m_lastDraw = 0;
    bool m_enabled = false;
    int m_width = 0; // columns to wipe; 0 while nothing is shown
};

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
    ProgressBar progress(name, total);
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
