// The members of ZmFilename that ask the file system about the named file or change it.

#include <zmlib/ZmFilename.h>

#include <zmlib/ZmFileStatus_p.h>
#include <zmlib/ZmFileSystem_p.h>

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

// --- the named file ----------------------------------------------------------------------------

bool ZmFilename::doesExist() const
{
    return zmfs::nameExists(getString());
}

bool ZmFilename::isDirectory() const
{
    return zmfs::isDirectory(getString(), true);
}

bool ZmFilename::isReadable() const
{
    return ::access(getString(), R_OK) == 0;
}

bool ZmFilename::isWriteable() const
{
    return ::access(getString(), W_OK) == 0;
}

int64_t ZmFilename::fileSize() const
{
    struct stat st;
    if (::stat(getString(), &st) != 0) {
        return -1;
    }
    return int64_t(st.st_size);
}

int64_t ZmFilename::getAccessTime() const
{
    zmfs::Status s;
    return zmfs::readStatus(AT_FDCWD, getString(), true, s) ? zmfs::fileTimeToSeconds(s.access) : -1;
}

int64_t ZmFilename::getCreateTime() const
{
    zmfs::Status s;
    return zmfs::readStatus(AT_FDCWD, getString(), true, s) ? zmfs::fileTimeToSeconds(s.creation) : -1;
}

int64_t ZmFilename::getModTime() const
{
    zmfs::Status s;
    return zmfs::readStatus(AT_FDCWD, getString(), true, s) ? zmfs::fileTimeToSeconds(s.modification) : -1;
}

int ZmFilename::getMode() const
{
    struct stat st;
    if (::stat(getString(), &st) != 0) {
        return -1;
    }
    return int(st.st_mode & 07777);
}

int ZmFilename::setMode(int mode) const
{
    return ::chmod(getString(), mode_t(mode) & 07777) == 0 ? 0 : -1;
}

int ZmFilename::create(int mode) const
{
    const int fd = ::open(getString(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    if (fd < 0) {
        return 0;
    }
    // fchmod, not the open mode: the caller asked for these bits, not for them less the umask.
    const bool ok = ::fchmod(fd, mode_t(mode) & 07777) == 0;
    ::close(fd);
    if (!ok) {
        ::unlink(getString());
        return 0;
    }
    return 1;
}

int ZmFilename::copy(const char* dest) const
{
    if (dest == nullptr || dest[0] == 0) {
        return -1;
    }
    // Non-blocking open so that a pipe is refused below instead of waiting for a writer.
    const int in = ::open(getString(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (in < 0) {
        return -1;
    }
    struct stat src;
    struct stat dst;
    const bool destExists = ::stat(dest, &dst) == 0;
    if (::fstat(in, &src) != 0 || !S_ISREG(src.st_mode) ||
        (destExists && (S_ISDIR(dst.st_mode) || (dst.st_dev == src.st_dev && dst.st_ino == src.st_ino)))) {
        ::close(in);
        return -1;
    }
    const bool destNamed = zmfs::nameExists(dest);
    const int out = ::open(dest, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, src.st_mode & 07777);
    if (out < 0) {
        ::close(in);
        return -1;
    }
    ZmDArray<char> buffer(65536, 65536);
    bool ok = true;
    for (;;) {
        const ssize_t got = ::read(in, buffer.dataPtr(), size_t(buffer.size()));
        if (got == 0) {
            break;
        }
        if (got < 0) {
            if (errno == EINTR || errno == EAGAIN) {
                continue;
            }
            ok = false;
            break;
        }
        for (ssize_t done = 0; done < got && ok;) {
            const ssize_t put = ::write(out, buffer.dataPtr() + done, size_t(got - done));
            if (put < 0 && errno != EINTR) {
                ok = false;
            } else if (put > 0) {
                done += put;
            }
        }
        if (!ok) {
            break;
        }
    }
    ::close(in);
    if (::close(out) != 0) {
        ok = false;
    }
    if (!ok && !destNamed) {
        ::unlink(dest);
    }
    return ok ? 0 : -1;
}

int ZmFilename::rename(const char* newName) const
{
    if (newName == nullptr) {
        return -1;
    }
    return ::rename(getString(), newName) == 0 ? 0 : -1;
}

int ZmFilename::unlink() const
{
    return ::unlink(getString()) == 0 ? 0 : -1;
}
