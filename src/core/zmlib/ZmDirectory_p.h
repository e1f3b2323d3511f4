/// \file
/// The platform part of the directory listing (private). ZmDirectory_posix.cpp implements it.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmDirectory.h>

/// A listed entry: the public record and whether the entry is a directory (a symbolic link never
/// is one).
struct ZmDirectoryEntry {
    ZmDirectory::FileInfo info;
    bool isDirectory;
};

/// Replaces \p out by the entries of the directory \p folder (never "." and "..") whose names match
/// the wildcard \p namePattern, in the order the system lists them; with \p directoriesOnly only
/// the directories. An entry that vanishes while it is listed is left out. Returns their number,
/// or -1 when the directory cannot be read.
int zmReadDirectory(const char* folder, const char* namePattern, bool directoriesOnly,
                    ZmDArray<ZmDirectoryEntry>& out);
