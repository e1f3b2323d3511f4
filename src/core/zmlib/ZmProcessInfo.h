/// \file
/// A snapshot of the memory use of a process.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// The memory figures of one process, taken once at construction: resident set ("working set")
/// and committed memory ("page file usage"), each with its peak, in bytes.
///
/// A plain value; any thread. A process that does not exist or whose figures cannot be read gives
/// `found()` false and all sizes 0; nothing is logged.
class ZMLIB_API ZmProcessInfo {
public:
    /// Takes the snapshot of the process \p processId.
    explicit ZmProcessInfo(int64_t processId);

    bool found() const { return m_found; }
    /// Resident memory now.
    uint64_t workingSetSize() const { return m_workingSetSize; }
    /// Largest resident memory so far.
    uint64_t peakWorkingSetSize() const { return m_peakWorkingSetSize; }
    /// Committed (data) memory now.
    uint64_t pagefileUsage() const { return m_pagefileUsage; }
    /// Largest committed memory so far.
    uint64_t peakPagefileUsage() const { return m_peakPagefileUsage; }

    /// When found, one information line of the module "ProcessInfo":
    /// "Working set size: <kB>Kb (peak <kB>Kb)".
    void log() const;

private:
    bool m_found = false;
    uint64_t m_workingSetSize = 0;
    uint64_t m_peakWorkingSetSize = 0;
    uint64_t m_pagefileUsage = 0;
    uint64_t m_peakPagefileUsage = 0;
};
