/// \file
/// Directory listings, directory copies and disk queries.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>
#include <vector>

/// Static directory services: listings filtered by a wildcard pattern (`zmWildMatch`, matched
/// against entry names), sorted listings, a recursive copy and the free space of a volume.
///
/// Listings skip "." and ".."; a symbolic link is listed as what it is, never as a directory,
/// even when it points to one (so walks built on them stay inside the tree). File times are
/// 100-ns ticks since 1601-01-01 UTC. Failures answer -1 or false; `freeSpace()` logs its
/// failure. No state: any thread may call, provided nobody changes the directory meanwhile.
class ZMLIB_API ZmDirectory {
public:
    /// One directory entry.
    struct FileInfo {
        /// The entry's name without its directory.
        ZmString name;
        /// The birth time where the file system keeps one, else the last status change.
        uint64_t creationTime;
        uint64_t lastWriteTime;
    };

    /// Lists the entries of \p dir whose names match \p pattern (null: "*"), in the order the
    /// system reports them; with \p directoriesOnly only directories. \p list is emptied first.
    /// Directory and pattern are joined as "%s%s" when \p dir ends in a separator, else with '/';
    /// the pattern may hold a sub-directory ("sub/*.log"). Returns the number of entries listed,
    /// or -1 when \p dir is empty or cannot be read.
    static int scan(const char* dir, std::vector<FileInfo>& list, const char* pattern, bool directoriesOnly);
    /// `scan`, names only, ascending by byte order (strcmp). \p names is emptied first.
    static int scanSortedByName(const char* dir, ZmDArray<ZmString>& names, const char* pattern,
                                bool directoriesOnly);
    /// `scan`, split into directories and everything else, each ascending by byte order. Both
    /// arrays are emptied first. False when the directory cannot be read.
    static bool scanSortedByName(const char* dir, ZmDArray<ZmString>& files, ZmDArray<ZmString>& dirs,
                                 const char* pattern);
    /// `scan`, oldest first by creation time, equal times by name. \p times (when not null) is
    /// emptied and receives the creation times in the same order.
    static int scanSortedByCreationTime(const char* dir, ZmDArray<ZmString>& names, ZmDArray<uint64_t>* times,
                                        const char* pattern, bool directoriesOnly);
    /// \p path reaches a directory (symbolic links followed).
    static bool isDirectory(const char* path);
    /// Copies the tree \p src into \p dest (made when missing, its parent must exist; merged into
    /// an existing one, where files of the same name are overwritten). Regular files keep their
    /// permission bits before the umask, directories are made with 0777 before the umask, symbolic
    /// links are copied as links (never followed), other special files are not copied. A destination inside
    /// the source is not copied into itself. 0 when everything was copied; -1 when \p src is not a directory,
    /// \p dest cannot be made or is \p src, or any entry could not be copied (the rest is still copied).
    static int copy(const char* src, const char* dest);
    /// Bytes free to the caller on the volume of \p path's directory part ("/data/x" asks for
    /// "/data"); backslashes count as '/'. On failure logs
    /// "Could not determine free disk space in >%s<\n" (the directory) and returns -1.
    static int64_t freeSpace(const char* path);
    /// The native path delimiter, '/'.
    static char pathDelimiter() { return '/'; }
};
