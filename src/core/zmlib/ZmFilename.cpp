#include <zmlib/ZmFilename.h>

#include <zmlib/ZmFileSystem_p.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmTmpDir.h>
#include <zmlib/ZmWallClock_p.h>

#include <atomic>
#include <cerrno>
#include <cstdlib>

namespace {

bool isSeparator(char c)
{
    return c == '/' || c == '\\';
}

/// The root of \p s ("/", "X:/" or nothing) and its '/'-separated segments, skipping empty ones.
int splitPath(const char* s, ZmDArray<ZmString>& segments)
{
    segments.clear();
    int rootLength = 0;
    if (s[0] == '/') {
        rootLength = 1;
    } else if (s[0] != 0 && s[1] == ':' && s[2] == '/') {
        rootLength = 3;
    }
    const char* p = s + rootLength;
    while (*p != 0) {
        const char* end = p;
        while (*end != 0 && *end != '/') {
            ++end;
        }
        if (end != p) {
            segments.append(ZmString(p, 0, int(end - p)));
        }
        p = *end == 0 ? end : end + 1;
    }
    return rootLength;
}

void joinSegments(ZmString& out, const ZmDArray<ZmString>& segments, int64_t from)
{
    for (int64_t i = from; i < segments.size(); ++i) {
        if (i > from) {
            out += '/';
        }
        out += segments[i];
    }
}

/// The position where makeUnique() and enumerate() insert their number: the last '.' when no
/// '/' follows it, else the end.
int insertionPoint(const ZmString& name)
{
    const int dot = name.rindex('.');
    if (dot >= 0 && name.index('/', dot) < 0) {
        return dot;
    }
    return name.length();
}

} // namespace

// --- path text ---------------------------------------------------------------------------------

void ZmFilename::fixSlashes()
{
    replace('\\', '/');
}

void ZmFilename::canonizePath()
{
    pack();
    expandPath();
    const int n = length();
    const bool driveRoot = n == 3 && getString()[1] == ':';
    if (n > 1 && !driveRoot && getString()[n - 1] == '/') {
        removeLast(1);
    }
}

void ZmFilename::expandPath()
{
    if (!isRelative()) {
        return;
    }
    const char* s = getString();
    ZmFilename joined;
    if (s[0] == '~' && (s[1] == 0 || s[1] == '/')) {
        const char* home = std::getenv("HOME");
        if (home == nullptr || home[0] == 0) {
            return;
        }
        joined = home;
        joined += s + 1;
    } else {
        if (!zmfs::currentDirectory(joined)) {
            return;
        }
        if (s[0] != 0) {
            joined += '/';
            joined += s;
        }
    }
    joined.pack();
    *this = joined;
}

void ZmFilename::pack()
{
    const int n = length();
    if (n == 0) {
        return;
    }
    const char* s = getString();
    const bool trailingSlash = s[n - 1] == '/';
    ZmDArray<ZmString> parts;
    const int rootLength = splitPath(s, parts);
    ZmDArray<ZmString> kept;
    for (const ZmString& part : parts) {
        if (part == ".") {
            continue;
        }
        if (part == "..") {
            if (kept.isNotEmptyArray() && !(kept.last() == "..")) {
                kept.removeLast(1);
            } else if (rootLength == 0) {
                kept.append(part);
            }
            // Above a root there is nothing to climb to: dropped.
            continue;
        }
        kept.append(part);
    }
    ZmString result(s, 0, rootLength);
    joinSegments(result, kept, 0);
    if (kept.isNotEmptyArray() && trailingSlash) {
        result += '/';
    }
    if (result.isEmptyString()) {
        result = ".";
    }
    ZmString::operator=(result);
}

const char* ZmFilename::basename(const char* path)
{
    if (path == nullptr) {
        return "";
    }
    const char* base = path;
    for (const char* p = path; *p != 0; ++p) {
        if (isSeparator(*p)) {
            base = p + 1;
        }
    }
    return base;
}

const char* ZmFilename::extension(const char* path)
{
    if (path == nullptr) {
        return "";
    }
    const char* base = basename(path);
    const char* dot = std::strrchr(base, '.');
    return dot != nullptr ? dot : base + std::strlen(base);
}

void ZmFilename::removeExtension()
{
    const int at = int(extension() - getString());
    removeLast(length() - at);
}

ZmString ZmFilename::dirname() const
{
    ZmString out;
    dirname(getString(), out);
    return out;
}

void ZmFilename::dirname(ZmString& out) const
{
    dirname(getString(), out);
}

void ZmFilename::dirname(const char* path, ZmString& out)
{
    const char* base = basename(path);
    if (path == nullptr || base == path) {
        out = ".";
        return;
    }
    const char* sep = base - 1;
    if (sep == path || (sep == path + 2 && path[1] == ':')) {
        // Keep the separator of a root: "/x" lies in "/", "C:/x" in "C:/".
        ++sep;
    }
    out = ZmString(path, 0, int(sep - path));
}

void ZmFilename::appendFile(const ZmString& file)
{
    const char* f = file.getString();
    if (f[0] == 0) {
        return;
    }
    if (isEmptyString()) {
        ZmString::operator=(file);
        return;
    }
    int n = length();
    while (n > 0 && getString()[n - 1] == '/') {
        --n;
    }
    removeLast(length() - n);
    while (*f == '/') {
        ++f;
    }
    *this += '/';
    *this += f;
}

bool ZmFilename::isRelative() const
{
    const char* s = getString();
    if (length() > 2 && s[1] == ':' && (s[2] == '/' || s[2] == '\\')) {
        return false;
    }
    return s[0] != '/';
}

bool ZmFilename::makeRelativeTo(ZmFilename& dir)
{
    ZmFilename self(*this);
    ZmFilename base(dir);
    self.canonizePath();
    base.canonizePath();
    ZmDArray<ZmString> selfParts;
    ZmDArray<ZmString> baseParts;
    const int selfRoot = splitPath(self.getString(), selfParts);
    const int baseRoot = splitPath(base.getString(), baseParts);
    if (ZmString(self.getString(), 0, selfRoot) != ZmString(base.getString(), 0, baseRoot)) {
        return false;
    }
    int64_t common = 0;
    while (common < selfParts.size() && common < baseParts.size() && selfParts[common] == baseParts[common]) {
        ++common;
    }
    ZmString result;
    for (int64_t i = common; i < baseParts.size(); ++i) {
        result += i > common ? "/.." : "..";
    }
    if (common < selfParts.size()) {
        if (!result.isEmptyString()) {
            result += '/';
        }
        joinSegments(result, selfParts, common);
    }
    if (result.isEmptyString()) {
        result = ".";
    }
    ZmString::operator=(result);
    return true;
}

// --- naming ------------------------------------------------------------------------------------

void ZmFilename::makeUnique()
{
    if (!zmfs::nameExists(getString())) {
        return;
    }
    const ZmString original(*this);
    for (int n = 1;; ++n) {
        enumerate(*this, original.getString(), n);
        if (!zmfs::nameExists(getString())) {
            return;
        }
    }
}

ZmFilename ZmFilename::getTempFilename(const char* dir)
{
    // Process-wide; the first name of a process uses 1.
    static std::atomic<int> counter{0};
    ZmFilename name;
    if (dir == nullptr) {
        name = ZmTmpDir::getSystemTmpPath();
    } else {
        name = dir;
        // Intended: a trailing separator still gets a second one ("/tmp/" -> "/tmp//zm.0001");
        // names made so far have this form.
        if (dir[0] != 0) {
            name += "/";
        }
    }
    const int n = counter.fetch_add(1, std::memory_order_relaxed) + 1;
    name += ZmString(0, "zm.%04d", n % 10000);
    name.makeUnique();
    return name;
}

void ZmFilename::enumerate(ZmString& out, const char* name, int n)
{
    const ZmString source(name);
    const int at = insertionPoint(source);
    out = ZmString(source.getString(), 0, at);
    out += ZmString(0, ".%d", n);
    out += source.getString() + at;
}

bool ZmFilename::generateFilePath(ZmString& dirPath, ZmString& fileName, const ZmString& baseDir,
                                  bool useDateFolder, bool createDir)
{
    // Names of one process never repeat, and sort by age as long as they keep seven digits.
    static std::atomic<unsigned> counter{0};
    const unsigned n = counter.fetch_add(1, std::memory_order_relaxed) + 1;

    const std::tm local = zmLocalTime(zmWallClock().seconds);

    ZmFilename dir(baseDir.isEmptyString() ? ZmString(ZmTmpDir::getSystemTmpPath()) : baseDir);
    dir.fixSlashes();
    if (dir.length() > 1 && dir.getString()[dir.length() - 1] == '/') {
        dir.removeLast(1);
    }
    if (useDateFolder) {
        const bool root = dir == "/";
        dir += ZmString(0, root ? "%04d%02d%02d" : "/%04d%02d%02d", local.tm_year + 1900, local.tm_mon + 1,
                        local.tm_mday);
    }
    dirPath = dir;
    fileName.printf("%04d%02d%02d-%02d%02d%02d-%u", local.tm_year + 1900, local.tm_mon + 1, local.tm_mday,
                    local.tm_hour, local.tm_min, local.tm_sec, 1000000u + n);

    if (createDir && !zmfs::makeDirectories(dirPath.getString())) {
        getTheLogInstance().errorf("ZmFilename::generateFilePath() failed (error code: %d)\n", errno);
        return false;
    }
    return true;
}
