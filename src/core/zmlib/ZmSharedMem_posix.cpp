// Named shared memory over POSIX shared-memory objects.
//
// A POSIX object outlives its users until it is unlinked, so the holders count themselves with
// file locks: every process that has a block mapped keeps the object's descriptor open with a
// shared flock(). A holder that lets go drops its lock and tries for an exclusive one without
// waiting; it gets it only when no other holder is left, and then unlinks the name. The kernel
// drops the lock of a process that dies, so a crash never leaves a count wrong. When the last
// holder dies without letting go (a crash, _exit, a kill) its object is an orphan: linked, held by
// nobody. Every attach first reclaims the orphans of the library's prefix, so such a block goes
// away at the next use of any block, as a mapping goes with its last handle elsewhere. An object
// is reclaimed only under an exclusive lock, which no holder's shared lock allows; an opener that
// has not taken its shared lock yet is covered by the check below.
//
// A process that opens a name can race with one that is removing it; so, once its shared lock is
// taken, every opener checks that the object is still linked and starts over when it is not. An
// object of size 0 is one whose creator has not sized it yet; openers wait for it, and remove it
// as stale when it stays empty and unlocked for a while (a creator that died before sizing it).

#include <zmlib/ZmSharedMem_p.h>
#include <zmlib/ZmThread.h>

#include <cerrno>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

namespace {

/// Where the system shows its shared-memory objects, and the prefix of the library's own.
constexpr char kObjectDir[] = "/dev/shm";
constexpr char kPrefix[] = "zmshm.";

/// Longest mapped name; the component after '/' may have at most 255 bytes.
constexpr int kMaxObjectName = 200;
/// Tries before giving up on a name that keeps changing under us.
constexpr int kMaxAttempts = 5000;
/// Sightings of an empty object (1 ms apart) before it counts as abandoned by its creator.
constexpr int kStaleAfter = 200;

ZmString objectName(const char* name)
{
    static const char hex[] = "0123456789ABCDEF";
    ZmString out("/");
    out += kPrefix;
    for (const unsigned char* p = reinterpret_cast<const unsigned char*>(name); *p != 0; ++p) {
        const unsigned char c = *p;
        if ((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '.' ||
            c == '_' || c == '-') {
            out += char(c);
        } else {
            out += '%';
            out += hex[c >> 4];
            out += hex[c & 15];
        }
    }
    if (out.length() > kMaxObjectName) {
        // FNV-1a of the whole name keeps long names apart; '~' never comes out of the escaping
        // above, so a cut name cannot meet a short one.
        uint64_t hash = 14695981039346656037ULL;
        for (const unsigned char* p = reinterpret_cast<const unsigned char*>(name); *p != 0; ++p) {
            hash = (hash ^ *p) * 1099511628211ULL;
        }
        out.removeLast(out.length() - (kMaxObjectName - 17));
        out += '~';
        for (int shift = 60; shift >= 0; shift -= 4) {
            out += hex[(hash >> shift) & 15];
        }
    }
    return out;
}

int lockFile(int fd, int operation)
{
    int rc;
    do {
        rc = flock(fd, operation);
    } while (rc != 0 && errno == EINTR);
    return rc;
}

void sleepOneMs()
{
    timespec ts{0, 1000000};
    nanosleep(&ts, nullptr);
}

/// Unlinks every object of the library's prefix that no process holds. Each is taken under an
/// exclusive lock without waiting, which fails while any holder keeps its shared lock, and is
/// unlinked only while still linked (another process may have removed it, and a new object of the
/// same name is another file). A creator or opener that opened an object but has not locked it
/// yet finds it unlinked once it holds its lock, and starts over.
void reclaimOrphans()
{
    DIR* dir = opendir(kObjectDir);
    if (dir == nullptr) {
        return;
    }
    const size_t prefixLength = sizeof kPrefix - 1;
    while (const dirent* e = readdir(dir)) {
        if (std::strncmp(e->d_name, kPrefix, prefixLength) != 0) {
            continue;
        }
        // On the stack: nothing here may throw while the directory is open.
        char object[sizeof e->d_name + 1];
        object[0] = '/';
        std::memcpy(object + 1, e->d_name, std::strlen(e->d_name) + 1);
        const int fd = shm_open(object, O_RDWR | O_NOFOLLOW, 0);
        if (fd < 0) {
            continue; // gone already, or another user's
        }
        struct stat st;
        if (lockFile(fd, LOCK_EX | LOCK_NB) == 0 && fstat(fd, &st) == 0 && st.st_nlink > 0) {
            shm_unlink(object);
        }
        close(fd);
    }
    closedir(dir);
}

bool attachAnonymous(ZmSharedMemPrivate& d, uint64_t bytes)
{
    void* view = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (view == MAP_FAILED) {
        return false;
    }
    d.view = static_cast<char*>(view);
    d.viewSize = bytes;
    d.valid = true;
    return true;
}

} // namespace

void zmSharedMemRelease(ZmSharedMemPrivate& d)
{
    if (d.view != nullptr) {
        munmap(d.view, d.viewSize);
    }
    d.view = nullptr;
    d.valid = false;
    if (d.handle < 0) {
        return;
    }
    const int fd = int(d.handle);
    if (d.holderPid == kvCurrentProcessId()) {
        lockFile(fd, LOCK_UN);
        struct stat st;
        // While we hold the exclusive lock nobody else can unlink the object, so when it is still
        // linked the name is still ours.
        if (lockFile(fd, LOCK_EX | LOCK_NB) == 0 && fstat(fd, &st) == 0 && st.st_nlink > 0) {
            shm_unlink(d.objectName.getString());
        }
    }
    close(fd);
    d.handle = -1;
}

uint64_t zmSharedMemGranularity()
{
    return uint64_t(sysconf(_SC_PAGESIZE));
}

bool zmSharedMemAttach(ZmSharedMemPrivate& d, const char* name, uint64_t bytes)
{
    if (name == nullptr || name[0] == 0) {
        return attachAnonymous(d, bytes);
    }
    reclaimOrphans();
    const ZmString object = objectName(name);
    const char* objectPath = object.getString();
    int emptySeen = 0;
    for (int attempt = 0; attempt < kMaxAttempts; ++attempt) {
        bool created = false;
        int fd = shm_open(objectPath, O_RDWR, 0600);
        if (fd < 0) {
            if (errno != ENOENT) {
                return false;
            }
            fd = shm_open(objectPath, O_RDWR | O_CREAT | O_EXCL, 0600);
            if (fd < 0) {
                if (errno == EEXIST) {
                    continue; // someone else created it meanwhile: open theirs
                }
                return false;
            }
            created = true;
        }
        struct stat st;
        if (lockFile(fd, LOCK_SH) != 0 || fstat(fd, &st) != 0) {
            close(fd);
            return false;
        }
        if (st.st_nlink == 0) {
            close(fd); // its last holder removed it before we got our lock: start over
            continue;
        }
        if (created) {
            if (ftruncate(fd, off_t(bytes)) != 0) {
                d.handle = fd;
                d.objectName = object;
                d.holderPid = kvCurrentProcessId();
                zmSharedMemRelease(d);
                return false;
            }
            st.st_size = off_t(bytes);
        } else if (st.st_size == 0) {
            // Not sized yet. When it stays so with nobody holding it, its creator is gone.
            if (++emptySeen >= kStaleAfter && lockFile(fd, LOCK_EX | LOCK_NB) == 0 && fstat(fd, &st) == 0 &&
                st.st_size == 0 && st.st_nlink > 0) {
                shm_unlink(objectPath);
                emptySeen = 0;
            }
            close(fd);
            sleepOneMs();
            continue;
        }
        d.handle = fd;
        d.objectName = object;
        d.holderPid = kvCurrentProcessId();
        d.viewSize = uint64_t(st.st_size);
        void* view = mmap(nullptr, d.viewSize, PROT_READ | PROT_WRITE, MAP_SHARED, fd, 0);
        if (view == MAP_FAILED) {
            return false; // the object stays held until the next attempt or the destructor
        }
        d.view = static_cast<char*>(view);
        d.valid = true;
        return true;
    }
    return false;
}
