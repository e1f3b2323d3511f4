// ZmUUID's random source on POSIX systems: the kernel's getrandom, /dev/urandom as the fallback.
#include <zmlib/ZmUUID_p.h>

#include <cerrno>
#include <fcntl.h>
#include <sys/random.h>
#include <unistd.h>

namespace {

// Reads exactly \p n bytes from \p fd; false on failure or end of file.
bool readFully(int fd, unsigned char* out, size_t n)
{
    size_t got = 0;
    while (got < n) {
        const ssize_t r = read(fd, out + got, n - got);
        if (r < 0 && errno == EINTR) {
            continue;
        }
        if (r <= 0) {
            return false;
        }
        got += size_t(r);
    }
    return true;
}

} // namespace

// getrandom, restarted when interrupted.
bool ZmUUIDPlatform::kernelRandom(unsigned char* out, size_t n)
{
    size_t got = 0;
    while (got < n) {
        const ssize_t r = getrandom(out + got, n - got, 0);
        if (r < 0) {
            if (errno == EINTR) {
                continue;
            }
            return false;
        }
        got += size_t(r);
    }
    return true;
}

// /dev/urandom, four bytes at a time, from the last four bytes to the first.
int ZmUUIDPlatform::fallbackRandom(unsigned char (&bytes)[16])
{
    int filled = 0;
    const int fd = open("/dev/urandom", O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        return 0;
    }
    for (int pos = 12; pos >= 0; pos -= 4) {
        if (!readFully(fd, bytes + pos, 4)) {
            break;
        }
        filled += 4;
    }
    close(fd);
    return filled;
}
