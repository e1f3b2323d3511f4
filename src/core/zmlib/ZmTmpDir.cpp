#include <zmlib/ZmTmpDir.h>

#include <zmlib/ZmDirectory.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <sys/stat.h>
#include <unistd.h>

namespace {

/// \p path without one trailing '/' (the root "/" stays): lstat would otherwise follow a final
/// symbolic link.
ZmString withoutTrailingSlash(const ZmString& path)
{
    ZmString s(path);
    if (s.length() > 1 && s.getString()[s.length() - 1] == '/') {
        s.removeLast(1);
    }
    return s;
}

bool isRealDirectory(const char* path)
{
    struct stat st;
    return ::lstat(path, &st) == 0 && S_ISDIR(st.st_mode);
}

void logDeleteFailure(const char* path)
{
    getTheLogInstance().errorf("Can't delete %s:\n%s\n", path, std::strerror(errno));
}

/// Depth-first removal. Entries are classified with lstat, so a symbolic link to a directory is
/// unlinked like a file and nothing outside the tree is reached through it.
int removeTree(const ZmString& dir)
{
    if (!isRealDirectory(dir.getString())) {
        return -1;
    }
    ZmDArray<ZmString> names;
    ZmDirectory::scanSortedByName(dir.getString(), names, nullptr, false);
    for (const ZmString& name : names) {
        const ZmString path(0, "%s/%s", dir.getString(), name.getString());
        if (isRealDirectory(path.getString())) {
            removeTree(path);
        } else if (::unlink(path.getString()) != 0) {
            logDeleteFailure(path.getString());
        }
    }
    if (::rmdir(dir.getString()) != 0) {
        logDeleteFailure(dir.getString());
        return -1;
    }
    return 0;
}

} // namespace

ZmTmpDir::ZmTmpDir(const char* name, bool create, bool autoRemove) : m_autoRemove(autoRemove)
{
    makeUnique(name);
    if (create) {
        this->create();
    }
}

ZmTmpDir::~ZmTmpDir()
{
    if (m_autoRemove && doesExist()) {
        remove();
    }
}

void ZmTmpDir::makeUnique(const char* name)
{
    const ZmFilename path(withoutTrailingSlash(name != nullptr ? ZmString(name) : ZmString(*this)));
    const char* s = path.getString();
    const int slash = path.rindex('/');
    ZmString result;
    if (path.isRelative() && std::strncmp(s, "./", 2) != 0) {
        result = getSystemTmpPath();
    } else {
        result = ZmString(s, 0, slash + 1);
    }
    const char* component = s + slash + 1;
    result += component[0] != 0 ? component : "tmp";
    struct stat st;
    if (::lstat(result.getString(), &st) == 0) {
        // Intended: the second directory of a name is ".2" (the first is the bare name), unlike
        // ZmFilename::makeUnique(), which counts from 1; directory names already made keep their form.
        for (int n = 2;; ++n) {
            const ZmString candidate(0, "%s.%d", result.getString(), n);
            if (::lstat(candidate.getString(), &st) != 0) {
                result = candidate;
                break;
            }
        }
    }
    result += '/';
    ZmString::operator=(result);
}

int ZmTmpDir::create(int mode)
{
    return ::mkdir(withoutTrailingSlash(*this).getString(), mode_t(mode)) == 0 ? 1 : 0;
}

bool ZmTmpDir::doesExist() const
{
    return isRealDirectory(withoutTrailingSlash(*this).getString());
}

int ZmTmpDir::remove()
{
    return removeTree(withoutTrailingSlash(*this));
}

const char* ZmTmpDir::getSystemTmpPath()
{
    // Process-wide and unprotected, as documented: every call rewrites it.
    static char buffer[1024];
    const char* dir = std::getenv("TMPDIR");
    // Room for the text, a '/' and the terminator.
    if (dir == nullptr || dir[0] == 0 || std::strlen(dir) + 2 > sizeof(buffer)) {
        dir = "/tmp";
    }
    std::memcpy(buffer, dir, std::strlen(dir) + 1); // fits: checked above
    size_t n = 0;
    for (; buffer[n] != 0; ++n) {
        if (buffer[n] == '\\') {
            buffer[n] = '/';
        }
    }
    if (buffer[n - 1] != '/') {
        buffer[n] = '/';
        buffer[n + 1] = 0;
    }
    return buffer;
}
