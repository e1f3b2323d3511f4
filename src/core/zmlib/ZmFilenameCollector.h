/// \file
/// Gathers the names of files below a start directory.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmString.h>

/// Collects the paths of the files below a start directory whose names match a wildcard pattern
/// (`zmWildMatch` against the entry name).
///
/// The walk visits each directory's files in name order, then its sub-directories in name order,
/// depth first. Symbolic links are collected like files when their names match and are never
/// followed. Paths are the start directory (without a trailing '/') and the path below it joined
/// with '/'; an empty start directory means the current one and gives relative paths.
/// Directories that cannot be read are skipped. Holds its two settings; not thread-safe.
class ZMLIB_API ZmFilenameCollector {
public:
    ZmFilenameCollector() = default;

    void setStartDir(const ZmFilename& dir) { m_startDir = dir; }
    void setStartDir(const ZmString& dir) { m_startDir = dir; }
    void setStartDir(const char* dir) { m_startDir = dir; }
    /// The pattern; empty means "*".
    void setFileName(const ZmFilename& pattern) { m_fileName = pattern; }
    void setFileName(const ZmString& pattern) { m_fileName = pattern; }
    void setFileName(const char* pattern) { m_fileName = pattern; }

    /// Empties \p out and fills it with the matching paths below the start directory; returns how
    /// many, or -1 (with \p out empty) when the start directory cannot be read.
    int collect(ZmDArray<ZmString>& out) const;
    /// The same with the given start directory and pattern (null: "*").
    static int collect(ZmDArray<ZmString>& out, const char* startDir, const char* pattern);

private:
    ZmFilename m_startDir;
    ZmFilename m_fileName;
};
