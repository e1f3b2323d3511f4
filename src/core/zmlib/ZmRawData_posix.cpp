// The descriptor input and output of ZmRawData.

#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmRawData.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <unistd.h>

int64_t ZmRawData::read(int fd, void* buf, int64_t size, bool limitChunks)
{
    if (size < 1) {
        return 0;
    }
    // Bounded single calls: a huge read is not one system call.
    const int64_t limit = limitChunks ? 4194304 : 4294967295LL;
    char* b = static_cast<char*>(buf);
    int64_t done = 0;
    while (done < size) {
        const int64_t chunk = std::min(limit, size - done);
        const ssize_t got = ::read(fd, b + done, size_t(chunk));
        if (got < 0) {
            const int error = errno;
            if (error == EINTR) {
                continue;
            }
            char text[256];
            getTheLogInstance().errorf("ZmRawData::read() failed, ret=%lld, size=%lld, errno=%d (%s)",
                                       static_cast<long long>(got), static_cast<long long>(chunk), error,
                                       strerror_r(error, text, sizeof text));
            break;
        }
        if (got == 0) {
            break;
        }
        done += got;
    }
    return done;
}

uint64_t ZmRawData::write(int fd, const void* buf, uint64_t size)
{
    const char* b = static_cast<const char*>(buf);
    uint64_t done = 0;
    while (done < size) {
        const ssize_t put = ::write(fd, b + done, size_t(size - done));
        if (put < 0) {
            if (errno == EINTR) {
                continue;
            }
            return uint64_t(-1);
        }
        done += uint64_t(put);
    }
    return size;
}
