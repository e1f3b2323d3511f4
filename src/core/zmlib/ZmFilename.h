/// \file
/// A file name that knows path syntax and the file it names.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>

/// A `ZmString` holding a path, with path-text operations, unique and temporary names and queries
/// and operations on the named file.
///
/// The library writes paths with forward slashes; `fixSlashes()` turns backslashes into them.
/// `basename()`, `extension()` and `dirname()` accept either separator. Adds no fields: a
/// `ZmFilename` converts from and to `ZmString` and `const char*` freely.
///
/// File operations never throw: queries answer false, 0 or -1 when the file cannot be reached,
/// and the operations return the status described at each member. Not thread-safe: one thread at
/// a time per object. The process-wide counters of `getTempFilename()` and `generateFilePath()`
/// are atomic, but `getTempFilename()` also reads the shared buffer of
/// `ZmTmpDir::getSystemTmpPath()` and checks for free names without a lock: one thread at a time.
class ZMLIB_API ZmFilename : public ZmString {
public:
    ZmFilename() = default;
    /// Null gives the empty name.
    ZmFilename(const char* s) : ZmString(s) {}
    ZmFilename(const ZmString& s) : ZmString(s) {}
    ZmFilename(const ZmFilename& other) : ZmString(other) {}
    ~ZmFilename() = default;

    ZmFilename& operator=(const ZmFilename& other)
    {
        ZmString::operator=(other);
        return *this;
    }
    ZmFilename& operator=(const ZmString& other)
    {
        ZmString::operator=(other);
        return *this;
    }
    ZmFilename& operator=(const char* s)
    {
        ZmString::operator=(s);
        return *this;
    }

    // --- path text -----------------------------------------------------------------------------

    /// Every backslash becomes '/'.
    void fixSlashes();
    /// `pack()`, then `expandPath()`, then one trailing '/' is dropped (the root "/" stays).
    void canonizePath();
    /// Makes the path absolute: a leading "~" or "~/" is replaced by $HOME, any other relative
    /// path is joined to the current directory; what was joined is then packed. Absolute paths,
    /// and paths whose base ($HOME, current directory) is unknown, are left as they are.
    void expandPath();
    /// Lexical clean-up on '/' separators: "." segments go, runs of '/' become one, "dir/.."
    /// pairs cancel. A leading "/" (or drive "X:/") stays and ".." above it is dropped; leading
    /// ".." of a relative path stay. A trailing '/' is kept; an empty relative result is ".".
    /// Symbolic links are not consulted.
    void pack();
    /// The text after the last '/' or '\' (the whole name when there is neither).
    const char* basename() const { return basename(getString()); }
    /// Null gives "".
    static const char* basename(const char* path);
    /// The last '.' of the base name (the dot included), or "" (the terminator) when it has none.
    const char* extension() const { return extension(getString()); }
    /// Null gives "".
    static const char* extension(const char* path);
    /// Cuts the name at `extension()`.
    void removeExtension();
    /// The text before the last '/' or '\'; "/" when that is the first character, "." when there
    /// is no separator. So "a/b/" gives "a/b": `dirname() + "/" + basename()` is the path again.
    ZmString dirname() const;
    void dirname(ZmString& out) const;
    /// Null gives ".".
    static void dirname(const char* path, ZmString& out);
    /// Joins \p file with exactly one '/' between ("a/" + "/b" is "a/b"). An empty path becomes
    /// \p file; an empty \p file changes nothing.
    void appendFile(const ZmString& file);
    /// Absolute are names that begin with '/' and names "X:/..." or "X:\..." longer than two
    /// characters; everything else is relative, including "C:x" and a leading backslash
    /// (intended: callers rely on this rule as it stands).
    bool isRelative() const;
    /// Rewrites this path relative to the directory \p dir, with "../" as needed ("." when both
    /// name the same directory). Both are compared in their canonized form (`canonizePath()`), so
    /// relative inputs are taken against the current directory; no trailing '/' remains. \p dir is
    /// not changed. False, with the path unchanged, when no relative form exists (different
    /// drives).
    bool makeRelativeTo(ZmFilename& dir);

    // --- naming --------------------------------------------------------------------------------

    /// When a file or directory of this name exists (a dangling symbolic link counts: the name is
    /// taken), inserts ".1", ".2", ... before the extension until the name is free:
    /// a.txt -> a.1.txt. A dot in a directory component is no extension: dir.d/file -> dir.d/file.1.
    void makeUnique();
    /// A free name "zm.%04d" (a process-wide counter, modulo 10000) in \p dir, or in the system
    /// temporary directory when \p dir is null. A non-empty \p dir always gets a "/" appended, so
    /// "/tmp/" gives "/tmp//zm.0001" (intended: existing names depend on it); an empty \p dir gives
    /// a relative name. The first name of a process uses 1. The file is not made.
    static ZmFilename getTempFilename(const char* dir);
    /// \p out = \p name with ".%d" of \p n inserted before its extension (the scheme of
    /// `makeUnique()`): ("a.txt", 2) gives "a.2.txt", ("dir.d/file", 3) "dir.d/file.3". Null
    /// \p name counts as empty.
    static void enumerate(ZmString& out, const char* name, int n);
    /// Builds a directory and a file name for a new file, such as a log file.
    ///
    /// \p dirPath is \p baseDir with backslashes turned into '/' and one trailing '/' dropped
    /// (the root "/" stays), or the system temporary path without its trailing '/' when
    /// \p baseDir is empty; with \p useDateFolder "/%04d%02d%02d" of the local date is appended.
    /// \p fileName is "%04d%02d%02d-%02d%02d%02d-%u" of the local time, where %u is 1000000 + n
    /// and n a process-wide atomic counter incremented by every call (1 on the first): names of
    /// one process never repeat, also within one second, and sort oldest first by byte order.
    /// Names of different processes may coincide within the same second.
    ///
    /// With \p createDir the directory is made with its missing parents (mode 0777 before the
    /// umask). Returns false, with both outputs set, when it cannot be made; the error is logged
    /// as "ZmFilename::generateFilePath() failed (error code: %d)\n" with errno. True otherwise.
    static bool generateFilePath(ZmString& dirPath, ZmString& fileName, const ZmString& baseDir,
                                 bool useDateFolder, bool createDir);

    // --- the named file ------------------------------------------------------------------------

    /// Something of this name exists (symbolic links are not followed: a dangling one exists).
    bool doesExist() const;
    /// The name reaches a directory (symbolic links are followed).
    bool isDirectory() const;
    /// access(R_OK) for the calling process.
    bool isReadable() const;
    /// access(W_OK) for the calling process.
    bool isWriteable() const;
    /// Size in bytes, or -1 when the status cannot be read.
    int64_t fileSize() const;
    /// Seconds since 1970-01-01 UTC of the last access; -1 when the status cannot be read.
    int64_t getAccessTime() const;
    /// Seconds since 1970-01-01 UTC of the creation: the birth time where the file system keeps
    /// one, else the last status change; -1 when the status cannot be read.
    int64_t getCreateTime() const;
    /// Seconds since 1970-01-01 UTC of the last modification; -1 when the status cannot be read.
    int64_t getModTime() const;
    /// The POSIX permission bits (st_mode & 07777), or -1 when the status cannot be read.
    int getMode() const;
    /// chmod to the permission bits \p mode: 0 on success, -1 on failure.
    int setMode(int mode) const;
    /// Creates an empty regular file with exactly the permission bits \p mode (the umask is not
    /// applied). 1 when this call made the file; 0 when it cannot be made, also when the name
    /// exists already (which is then left as it is).
    int create(int mode = 0666) const;
    /// Copies the contents of this regular file to \p dest (created with this file's permission
    /// bits before the umask, or truncated). 0 on success; -1 on failure, when \p dest is this
    /// same file, or when it is a directory; a partly written new \p dest is removed.
    int copy(const char* dest) const;
    /// Renames the file to \p newName (replacing a file of that name); this object keeps its
    /// text. 0 on success, -1 on failure.
    int rename(const char* newName) const;
    /// Removes the file (or symbolic link; not a directory). 0 on success, -1 on failure.
    int unlink() const;
};
