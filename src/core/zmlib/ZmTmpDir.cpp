#include <zmlib/ZmTmpDir.h>

#include <zmlib/ZmDirectory.h>
#include <zmlib/ZmFileSystem_p.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

namespace {

/// \p path without one trailing '/' (the root "/" stays): the system would otherwise follow a
/// final symbolic link.
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
    return zmfs::isDirectory(path, false);
}

void logDeleteFailure(const char* path)
{
    getTheLogInstance().errorf("Can't delete %s:\n%s\n", path, std::strerror(errno));
}

/// Depth-first removal. Entries are classified without following links, so a symbolic link to a directory is
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
        } else if (!zmfs::removeFile(path.getString())) {
            logDeleteFailure(path.getString());
        }
    }
    if (!zmfs::removeDirectory(dir.getString())) {
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
    if (zmfs::nameExists(result.getString())) {
        // Intended: the second directory of a name is ".2" (the first is the bare name), unlike
        // ZmFilename::makeUnique(), which counts from 1; directory names already made keep their form.
        for (int n = 2;; ++n) {
            const ZmString candidate(0, "%s.%d", result.getString(), n);
            if (!zmfs::nameExists(candidate.getString())) {
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
    return zmfs::makeDirectory(withoutTrailingSlash(*this).getString(), mode) ? 1 : 0;
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
