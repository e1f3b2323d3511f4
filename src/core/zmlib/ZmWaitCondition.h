/// \file
/// A condition variable with timed waits.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMutex.h>

struct ZmWaitConditionPrivate;

/// A condition variable over the POSIX one, waited on with a `ZmMutex` that the caller holds.
///
/// Copies share one condition: a copy and its source are the same condition, and the last of them
/// destroys it. Waits and wakes may come from any thread. Wake-ups may be spurious, so wait in a
/// loop that tests the caller's predicate. Failed platform calls are written to the log; a failed
/// or timed-out wait returns false. Nothing throws.
class ZMLIB_API ZmWaitCondition {
public:
    ZmWaitCondition();
    ZmWaitCondition(const ZmWaitCondition& other);
    ZmWaitCondition& operator=(const ZmWaitCondition& other);
    virtual ~ZmWaitCondition();

    /// Releases \p mutex, waits for a wake or for \p ms milliseconds of monotonic time (4294967295
    /// and more: no limit) and locks \p mutex again. True when woken, false on time-out or failure.
    bool wait(ZmMutex* mutex, unsigned long ms = 4294967295UL) ZM_REQUIRES(*mutex);
    void wakeOne();
    void wakeAll();

private:
    ZmWaitConditionPrivate* m_d;
};
