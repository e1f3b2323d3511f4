/// \file
/// A mutex that may be recursive, and the process-wide singleton mutex.
#pragma once

#include <zmlib/ZmExport.h>

struct ZmMutexPrivate;
struct ZmMutexStaticPart;

// Clang's lock analysis (-Wthread-safety): the mutex is a capability, the locker a scoped one, and
// data that a mutex guards says so. Other compilers see nothing.
#if defined(__clang__)
#define ZM_TS_ATTRIBUTE(x) __attribute__((x))
#else
#define ZM_TS_ATTRIBUTE(x)
#endif
#define ZM_CAPABILITY(name) ZM_TS_ATTRIBUTE(capability(name))
#define ZM_SCOPED_CAPABILITY ZM_TS_ATTRIBUTE(scoped_lockable)
#define ZM_GUARDED_BY(m) ZM_TS_ATTRIBUTE(guarded_by(m))
#define ZM_REQUIRES(...) ZM_TS_ATTRIBUTE(requires_capability(__VA_ARGS__))
#define ZM_ACQUIRE(...) ZM_TS_ATTRIBUTE(acquire_capability(__VA_ARGS__))
#define ZM_RELEASE(...) ZM_TS_ATTRIBUTE(release_capability(__VA_ARGS__))
#define ZM_TRY_ACQUIRE(...) ZM_TS_ATTRIBUTE(try_acquire_capability(__VA_ARGS__))
#define ZM_EXCLUDES(...) ZM_TS_ATTRIBUTE(locks_excluded(__VA_ARGS__))
#define ZM_NO_THREAD_SAFETY_ANALYSIS ZM_TS_ATTRIBUTE(no_thread_safety_analysis)

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
class ZM_CAPABILITY("mutex") ZMLIB_API ZmMutex {
public:
    explicit ZmMutex(bool recursive = false);
    virtual ~ZmMutex();
    ZmMutex(const ZmMutex&) = delete;
    ZmMutex& operator=(const ZmMutex&) = delete;

    void lock() ZM_ACQUIRE() { zmMutexLockCall(m_d); }
    /// True when the lock was taken.
    bool tryLock() ZM_TRY_ACQUIRE(true);
    void unlock() ZM_RELEASE()
    {
        if (const int rc = zmMutexUnlockCall(m_d)) {
            unlockFailed(rc);
        }
    }
    bool isRecursive() const;

    /// The platform part, for the wait condition that sleeps on this mutex.
    ZmMutexPrivate* privatePart() const { return m_d; }

    /// Over a platform part in static storage, initialised as a constant: how the singleton below
    /// is made (the tag type is private to the library).
    constexpr ZmMutex(const ZmMutexStaticPart&, ZmMutexPrivate* d) noexcept : m_d(d) {}

private:
    static void unlockFailed(int rc);

    ZmMutexPrivate* m_d;
};

/// Locks a mutex for the lifetime of the guard.
class ZM_SCOPED_CAPABILITY ZmMutexLocker {
public:
    explicit ZmMutexLocker(ZmMutex& mutex) ZM_ACQUIRE(mutex) : m_mutex(mutex) { m_mutex.lock(); }
    ~ZmMutexLocker() ZM_RELEASE() { m_mutex.unlock(); }
    ZmMutexLocker(const ZmMutexLocker&) = delete;
    ZmMutexLocker& operator=(const ZmMutexLocker&) = delete;

private:
    ZmMutex& m_mutex;
};

/// The process-wide non-recursive mutex that guards the lazy creation of singletons.
///
/// Initialised as a constant (usable from any static initialiser, whatever the order) and never
/// destroyed (usable from static destructors and from threads still running at exit): the library
/// has no global constructor or destructor.
extern ZMLIB_API ZmMutex ZmSingleton_Mutex;
