// The directory services that read and change the file system.

#include <zmlib/ZmDirectory.h>
#include <zmlib/ZmDirectory_p.h>

#include <zmlib/ZmFileStatus_p.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/zmWildMatch.h>

#include <cstring>
#include <dirent.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

namespace {

/// A listed entry with its status, as the walks below need it.
struct Entry {
    ZmString name;
    unsigned mode;
    uint64_t device;
    uint64_t inode;
};

/// Calls \p take(name, status) for each entry of \p folder that matches \p namePattern, without
/// following a final symbolic link; -1 when the directory cannot be read, else 0.
template <class Take>
int forEachEntry(const char* folder, const char* namePattern, bool directoriesOnly, Take take)
{
    DIR* d = ::opendir(folder);
    if (d == nullptr) {
        return -1;
    }
    // Closed on every way out: a listing that runs out of memory throws from the loop below.
    struct Closer {
        DIR* dir;
        ~Closer() { ::closedir(dir); }
    } closer{d};
    const int fd = ::dirfd(d);
    while (const struct dirent* de = ::readdir(d)) {
        const char* name = de->d_name;
        if (std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0 || !zmWildMatch(name, namePattern)) {
            continue;
        }
        zmfs::Status s;
        // An entry that vanished between readdir and its status is not listed.
        if (!zmfs::readStatus(fd, name, false, s) || (directoriesOnly && !S_ISDIR(s.mode))) {
            continue;
        }
        take(name, s);
    }
    return 0;
}

int listEntries(const char* folder, const char* namePattern, bool directoriesOnly, ZmDArray<Entry>& out)
{
    out.clear();
    return forEachEntry(folder, namePattern, directoriesOnly, [&](const char* name, const zmfs::Status& s) {
        Entry e;
        e.name = name;
        e.mode = s.mode;
        e.device = s.device;
        e.inode = s.inode;
        out.append(e);
    });
}

bool isSameFile(const Entry& e, const struct stat& st)
{
    return e.device == uint64_t(st.st_dev) && e.inode == uint64_t(st.st_ino);
}

bool copyLink(const char* from, const char* to)
{
    ZmDArray<char> target(4096, 4096);
    const ssize_t n = ::readlink(from, target.dataPtr(), size_t(target.size()));
    if (n < 0 || n >= target.size()) {
        return false;
    }
    target[n] = 0;
    struct stat st;
    if (::lstat(to, &st) == 0 && (S_ISDIR(st.st_mode) || ::unlink(to) != 0)) {
        return false;
    }
    return ::symlink(target.dataPtr(), to) == 0;
}

/// Copies the entries of \p src into the existing directory \p dest; \p destRoot is skipped when
/// met, so a destination inside the source is not copied into itself.
bool copyTree(const ZmString& src, const ZmString& dest, const struct stat& destRoot)
{
    ZmDArray<Entry> entries;
    if (listEntries(src.getString(), "*", false, entries) < 0) {
        return false;
    }
    bool ok = true;
    for (const Entry& e : entries) {
        const ZmString from(0, "%s/%s", src.getString(), e.name.getString());
        const ZmString to(0, "%s/%s", dest.getString(), e.name.getString());
        struct stat st;
        const bool toExists = ::lstat(to.getString(), &st) == 0;
        if (S_ISDIR(e.mode)) {
            if (isSameFile(e, destRoot)) {
                continue;
            }
            if (toExists ? !S_ISDIR(st.st_mode) : ::mkdir(to.getString(), 0777) != 0) {
                ok = false;
                continue;
            }
            ok = copyTree(from, to, destRoot) && ok;
        } else if (S_ISLNK(e.mode)) {
            ok = copyLink(from.getString(), to.getString()) && ok;
        } else if (S_ISREG(e.mode)) {
            // A link in the destination is replaced, not written through.
            if (toExists && S_ISLNK(st.st_mode) && ::unlink(to.getString()) != 0) {
                ok = false;
                continue;
            }
            ok = ZmFilename(from).copy(to.getString()) == 0 && ok;
        } else {
            ok = false;
        }
    }
    return ok;
}

} // namespace

int zmReadDirectory(const char* folder, const char* namePattern, bool directoriesOnly,
                    ZmDArray<ZmDirectoryEntry>& out)
{
    out.clear();
    const int rc =
        forEachEntry(folder, namePattern, directoriesOnly, [&](const char* name, const zmfs::Status& s) {
            ZmDirectoryEntry e;
            e.info.name = name;
            e.info.creationTime = s.creation;
            e.info.lastWriteTime = s.modification;
            e.isDirectory = S_ISDIR(s.mode);
            out.append(e);
        });
    return rc < 0 ? -1 : int(out.size());
}

bool ZmDirectory::isDirectory(const char* path)
{
    struct stat st;
    return path != nullptr && ::stat(path, &st) == 0 && S_ISDIR(st.st_mode);
}

int ZmDirectory::copy(const char* src, const char* dest)
{
    struct stat from;
    if (src == nullptr || dest == nullptr || dest[0] == 0 || ::stat(src, &from) != 0 ||
        !S_ISDIR(from.st_mode)) {
        return -1;
    }
    ::mkdir(dest, 0777);
    struct stat to;
    if (::stat(dest, &to) != 0 || !S_ISDIR(to.st_mode) ||
        (to.st_dev == from.st_dev && to.st_ino == from.st_ino)) {
        return -1;
    }
    return copyTree(ZmString(src), ZmString(dest), to) ? 0 : -1;
}

int64_t ZmDirectory::freeSpace(const char* path)
{
    ZmFilename p(path);
    p.fixSlashes();
    const ZmString dir = p.dirname();
    struct statvfs vfs;
    if (::statvfs(dir.getString(), &vfs) != 0) {
        getTheLogInstance().errorf("Could not determine free disk space in >%s<\n", dir.getString());
        return -1;
    }
    return int64_t(vfs.f_bavail) * int64_t(vfs.f_frsize);
}
