/// \file
/// A reusable barrier for a fixed number of threads.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmWaitCondition.h>

/// Holds threads until a fixed number of them has arrived, then lets them all go, generation after
/// generation.
///
/// Owns its mutex and condition. Shared by the threads that meet at it; not copyable. Nothing
/// throws; a platform failure is written to the log by the mutex or the condition.
class ZMLIB_API ZmThreadBarrier {
public:
    /// A barrier for \p count threads; a count below 1 behaves as 1.
    explicit ZmThreadBarrier(int count);
    ZmThreadBarrier(const ZmThreadBarrier&) = delete;
    ZmThreadBarrier& operator=(const ZmThreadBarrier&) = delete;

    /// Waits until all threads of this generation have entered. True for exactly one of them, the
    /// last to arrive.
    bool enter();

private:
    int m_count;
    int m_remaining ZM_GUARDED_BY(m_mutex);
    int m_generation ZM_GUARDED_BY(m_mutex);
    ZmMutex m_mutex;
    ZmWaitCondition m_condition;
};
