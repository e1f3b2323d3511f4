#include <zmlib/ZmFileSystem_p.h>

#include <cerrno>
#include <cstdlib>
#include <sys/stat.h>
#include <unistd.h>

namespace zmfs {

bool nameExists(const char* path)
{
    struct stat st;
    return ::lstat(path, &st) == 0;
}

bool isDirectory(const char* path, bool followLinks)
{
    struct stat st;
    return (followLinks ? ::stat(path, &st) : ::lstat(path, &st)) == 0 && S_ISDIR(st.st_mode);
}

bool makeDirectory(const char* path, int mode)
{
    return ::mkdir(path, mode_t(mode)) == 0;
}

bool makeDirectories(const char* path)
{
    ZmString p(path);
    char* s = p.getString();
    for (char* q = s + 1; *q != 0; ++q) {
        if (*q == '/') {
            // Failures here are seen again by the final mkdir (or do not matter).
            *q = 0;
            ::mkdir(s, 0777);
            *q = '/';
        }
    }
    if (::mkdir(s, 0777) == 0) {
        return true;
    }
    if (errno != EEXIST) {
        return false;
    }
    if (isDirectory(s, true)) {
        return true;
    }
    errno = ENOTDIR;
    return false;
}

bool removeFile(const char* path)
{
    return ::unlink(path) == 0;
}

bool removeDirectory(const char* path)
{
    return ::rmdir(path) == 0;
}

bool currentDirectory(ZmString& out)
{
    char* cwd = ::getcwd(nullptr, 0);
    if (cwd == nullptr) {
        return false;
    }
    struct Freer {
        char* p;
        ~Freer() { std::free(p); }
    } freer{cwd};
    out = cwd;
    return true;
}

} // namespace zmfs
