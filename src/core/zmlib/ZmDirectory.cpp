#include <zmlib/ZmDirectory.h>

#include <zmlib/ZmFileStatus_p.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/zmWildMatch.h>

#include <cerrno>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/sysmacros.h>
#include <unistd.h>

namespace {

/// A listed entry with what the walks need besides the public record.
struct Entry {
    ZmDirectory::FileInfo info;
    unsigned mode;
    uint64_t device;
    uint64_t inode;
};

/// The status of \p name in the directory \p dirFd, without following a final symbolic link.
bool readEntryStatus(int dirFd, const char* name, Entry& e)
{
    zmfs::Status s;
    if (!zmfs::readStatus(dirFd, name, false, s)) {
        return false;
    }
    e.info.creationTime = s.creation;
    e.info.lastWriteTime = s.modification;
    e.mode = s.mode;
    e.device = s.device;
    e.inode = s.inode;
    return true;
}

/// The listing behind every scan: the entries of \p dir matching \p pattern, in system order.
int readEntries(const char* dir, const char* pattern, bool directoriesOnly, ZmDArray<Entry>& out)
{
    out.clear();
    if (dir == nullptr || dir[0] == 0) {
        return -1;
    }
    const char last = dir[std::strlen(dir) - 1];
    const ZmString search(0, last == '/' || last == '\\' ? "%s%s" : "%s/%s", dir,
                          pattern != nullptr ? pattern : "*");
    // The pattern is the last component of the search path; the rest names the directory.
    const char* namePattern = ZmFilename::basename(search.getString());
    ZmString folder;
    ZmFilename::dirname(search.getString(), folder);

    DIR* d = ::opendir(folder.getString());
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
        Entry e;
        // An entry that vanished between readdir and its status is not listed.
        if (!readEntryStatus(fd, name, e) || (directoriesOnly && !S_ISDIR(e.mode))) {
            continue;
        }
        e.info.name = name;
        out.append(e);
    }
    return int(out.size());
}

int byName(const Entry& a, const Entry& b)
{
    return std::strcmp(a.info.name.getString(), b.info.name.getString());
}

int byCreationTime(const Entry& a, const Entry& b)
{
    if (a.info.creationTime != b.info.creationTime) {
        return a.info.creationTime < b.info.creationTime ? -1 : 1;
    }
    return byName(a, b);
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
    if (readEntries(src.getString(), nullptr, false, entries) < 0) {
        return false;
    }
    bool ok = true;
    for (const Entry& e : entries) {
        const ZmString from(0, "%s/%s", src.getString(), e.info.name.getString());
        const ZmString to(0, "%s/%s", dest.getString(), e.info.name.getString());
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

int ZmDirectory::scan(const char* dir, std::vector<FileInfo>& list, const char* pattern, bool directoriesOnly)
{
    list.clear();
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    for (const Entry& e : entries) {
        list.push_back(e.info);
    }
    return n;
}

int ZmDirectory::scanSortedByName(const char* dir, ZmDArray<ZmString>& names, const char* pattern,
                                  bool directoriesOnly)
{
    names.clear();
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    entries.sort(byName);
    for (const Entry& e : entries) {
        names.append(e.info.name);
    }
    return n;
}

bool ZmDirectory::scanSortedByName(const char* dir, ZmDArray<ZmString>& files, ZmDArray<ZmString>& dirs,
                                   const char* pattern)
{
    files.clear();
    dirs.clear();
    ZmDArray<Entry> entries;
    if (readEntries(dir, pattern, false, entries) < 0) {
        return false;
    }
    entries.sort(byName);
    for (const Entry& e : entries) {
        (S_ISDIR(e.mode) ? dirs : files).append(e.info.name);
    }
    return true;
}

int ZmDirectory::scanSortedByCreationTime(const char* dir, ZmDArray<ZmString>& names,
                                          ZmDArray<uint64_t>* times, const char* pattern,
                                          bool directoriesOnly)
{
    names.clear();
    if (times != nullptr) {
        times->clear();
    }
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    entries.sort(byCreationTime);
    for (const Entry& e : entries) {
        names.append(e.info.name);
        if (times != nullptr) {
            times->append(e.info.creationTime);
        }
    }
    return n;
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
