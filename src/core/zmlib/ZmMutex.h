/// \file
/// A mutex that may be recursive, and the process-wide singleton mutex.
#pragma once

#include <zmlib/ZmExport.h>

struct ZmMutexPrivate;

/// The platform calls behind `ZmMutex::lock()` and `unlock()`. They are reached through these
/// pointers so that a lock or an unlock inlines to a single call into the platform: this keeps an
/// uncontended `ZmMutex` as fast as a bare POSIX mutex. Not for direct use.
extern ZMLIB_API int (*const zmMutexLockCall)(ZmMutexPrivate*);
extern ZMLIB_API int (*const zmMutexUnlockCall)(ZmMutexPrivate*);

/// A mutual-exclusion lock over the POSIX mutex, normal or recursive.
///
/// A normal mutex must not be locked twice by the same thread, and only its owner may unlock it.
/// A recursive one counts its owner's locks. `lock()` and `tryLock()` report nothing; a failed
/// `unlock()` (not the owner, not locked) is written to the log and otherwise ignored. Not copyable.
class ZMLIB_API ZmMutex {
public:
    explicit ZmMutex(bool recursive = false);
    virtual ~ZmMutex();
    ZmMutex(const ZmMutex&) = delete;
    ZmMutex& operator=(const ZmMutex&) = delete;

    void lock() { zmMutexLockCall(m_d); }
    /// True when the lock was taken.
    bool tryLock();
    void unlock()
    {
        if (const int rc = zmMutexUnlockCall(m_d)) {
            unlockFailed(rc);
        }
    }
    bool isRecursive() const;

    /// The platform part, for the wait condition that sleeps on this mutex.
    ZmMutexPrivate* privatePart() const { return m_d; }

private:
    static void unlockFailed(int rc);

    ZmMutexPrivate* m_d;
};

/// Locks a mutex for the lifetime of the guard.
class ZmMutexLocker {
public:
    explicit ZmMutexLocker(ZmMutex& mutex) : m_mutex(mutex) { m_mutex.lock(); }
    ~ZmMutexLocker() { m_mutex.unlock(); }
    ZmMutexLocker(const ZmMutexLocker&) = delete;
    ZmMutexLocker& operator=(const ZmMutexLocker&) = delete;

private:
    ZmMutex& m_mutex;
};

/// The process-wide non-recursive mutex that guards the lazy creation of singletons.
extern ZMLIB_API ZmMutex ZmSingleton_Mutex;
