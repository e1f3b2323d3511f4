/// \file
/// A temporary directory with a unique name that can remove itself.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

/// A directory for temporary files: the string is its path, always ending in '/'.
///
/// The name is made unique at construction (work, work.2, work.3, ... in the system temporary
/// directory or the given parent); the directory is made on request and, with auto-remove, removed
/// with everything in it when the object is destroyed. Removal never follows a symbolic link: a
/// link inside the tree is deleted, not the directory or file it points to.
///
/// Failures are reported by the return values of `create()` and `remove()`; files that cannot be
/// deleted are written to the log. Not copyable (two owners would remove the same tree). Not
/// thread-safe; `getSystemTmpPath()` returns one process-wide buffer.
class ZMLIB_API ZmTmpDir : public ZmString {
public:
    /// Runs `makeUnique(name)` and, with \p create, makes the directory (`create()`).
    explicit ZmTmpDir(const char* name = nullptr, bool create = true, bool autoRemove = true);
    /// With auto-remove, removes the directory and its contents when it exists.
    ~ZmTmpDir();
    ZmTmpDir(const ZmTmpDir&) = delete;
    ZmTmpDir& operator=(const ZmTmpDir&) = delete;

    /// Sets the path to a free name: \p name (or, when null, the current path) without one
    /// trailing '/', placed in the system temporary directory when it is relative and does not
    /// begin with "./" (only its last component is used), else in its own parent. An empty last
    /// component becomes "tmp". When that name is taken, ".2", ".3", ... is appended (counting
    /// from 2 is intended; `ZmFilename::makeUnique()` counts from 1). A '/' ends the path.
    void makeUnique(const char* name);
    /// mkdir of the path with the permission bits \p mode (before the umask); parents are not
    /// made. 1 when the directory was made, 0 otherwise (also when it exists already).
    int create(int mode = 0700);
    /// The path names a directory (a symbolic link does not count).
    bool doesExist() const;
    /// Removes the directory and everything below it, entries in name order; symbolic links are
    /// unlinked, never followed. A failure to delete an entry is logged as
    /// "Can't delete %s:\n%s\n" (path, system error text) and removal goes on. Returns -1 when the
    /// path is not a directory (nothing is deleted), else the result of removing the directory
    /// itself: 0 on success, -1 (logged the same way) on failure. Paths in messages have no
    /// trailing '/'.
    int remove();
    bool autoRemove() const { return m_autoRemove; }
    void setAutoRemove(bool on) { m_autoRemove = on; }
    /// The path, ending in '/'.
    const char* str() const { return getString(); }

    /// The system temporary directory: $TMPDIR (read on every call), else "/tmp" (also when
    /// $TMPDIR is empty or does not fit 1024 bytes), backslashes turned into '/', ending in '/'.
    /// Returns a process-wide buffer that the next call overwrites; not thread-safe.
    static const char* getSystemTmpPath();

private:
    bool m_autoRemove;
};
