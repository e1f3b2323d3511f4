/// \file
/// The status of a file with its times as file times (private; shared by the file-name and
/// directory services).
#pragma once

#include <cerrno>
#include <cstdint>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

namespace zmfs {

/// Seconds between 1601-01-01 and 1970-01-01, the origins of file times and of time_t.
constexpr int64_t kEpochDelta = 11644473600LL;
constexpr uint64_t kTicksPerSecond = 10000000u;

/// 100-ns ticks since 1601-01-01 UTC.
inline uint64_t toFileTime(int64_t sec, int64_t nsec)
{
    return uint64_t(sec + kEpochDelta) * kTicksPerSecond + uint64_t(nsec / 100);
}

inline int64_t fileTimeToSeconds(uint64_t ticks)
{
    return int64_t(ticks / kTicksPerSecond) - kEpochDelta;
}

struct Status {
    uint64_t access;
    /// The birth time where the file system keeps one, else the status change time.
    uint64_t creation;
    uint64_t modification;
    unsigned mode;
    uint64_t device;
    uint64_t inode;
};

/// The status of \p path, relative to the directory \p dirFd (or AT_FDCWD); a final symbolic
/// link is followed only with \p follow. statx is used where the kernel has it.
inline bool readStatus(int dirFd, const char* path, bool follow, Status& s)
{
    const int flags = follow ? 0 : AT_SYMLINK_NOFOLLOW;
#ifdef STATX_BTIME
    struct statx sx;
    if (::statx(dirFd, path, flags, STATX_BASIC_STATS | STATX_BTIME, &sx) == 0) {
        s.access = toFileTime(sx.stx_atime.tv_sec, sx.stx_atime.tv_nsec);
        s.modification = toFileTime(sx.stx_mtime.tv_sec, sx.stx_mtime.tv_nsec);
        const bool birth = (sx.stx_mask & STATX_BTIME) != 0;
        const struct statx_timestamp& c = birth ? sx.stx_btime : sx.stx_ctime;
        s.creation = toFileTime(c.tv_sec, c.tv_nsec);
        s.mode = sx.stx_mode;
        s.device = makedev(sx.stx_dev_major, sx.stx_dev_minor);
        s.inode = sx.stx_ino;
        return true;
    }
    if (errno != ENOSYS) {
        return false;
    }
#endif
    struct stat st;
    if (::fstatat(dirFd, path, &st, flags) != 0) {
        return false;
    }
    s.access = toFileTime(st.st_atim.tv_sec, st.st_atim.tv_nsec);
    s.modification = toFileTime(st.st_mtim.tv_sec, st.st_mtim.tv_nsec);
    s.creation = toFileTime(st.st_ctim.tv_sec, st.st_ctim.tv_nsec);
    s.mode = st.st_mode;
    s.device = st.st_dev;
    s.inode = st.st_ino;
    return true;
}

} // namespace zmfs
