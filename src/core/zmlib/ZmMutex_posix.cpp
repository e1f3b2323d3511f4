// ZmMutex over the POSIX mutex.
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmMutex_p.h>

ZmMutex::ZmMutex(bool recursive) : m_d(new ZmMutexPrivate)
{
    m_d->recursive = recursive;
    m_d->isStatic = false;
    pthread_mutexattr_t attr;
    pthread_mutexattr_init(&attr);
    pthread_mutexattr_settype(&attr, recursive ? PTHREAD_MUTEX_RECURSIVE : PTHREAD_MUTEX_NORMAL);
    pthread_mutex_init(&m_d->mutex, &attr);
    pthread_mutexattr_destroy(&attr);
}

ZmMutex::~ZmMutex()
{
    if (m_d->isStatic) {
        return; // the singleton's part lives in static storage and outlives every user
    }
    pthread_mutex_destroy(&m_d->mutex);
    delete m_d;
}

bool ZmMutex::tryLock()
{
    return pthread_mutex_trylock(&m_d->mutex) == 0;
}

bool ZmMutex::isRecursive() const
{
    return m_d->recursive;
}

#if defined(__GNUC__) && !defined(__clang__) && defined(__x86_64__)
// Jump to the platform through its address-table entry rather than through a linker stub: one jump
// less on the hottest path of every lock.
extern "C" int pthread_mutex_lock(pthread_mutex_t*) noexcept __attribute__((noplt));
extern "C" int pthread_mutex_unlock(pthread_mutex_t*) noexcept __attribute__((noplt));
#endif

namespace {
// The mutex is the first member, so each of these compiles to a single jump into the platform.
int lockCall(ZmMutexPrivate* d)
{
    return pthread_mutex_lock(&d->mutex);
}
int unlockCall(ZmMutexPrivate* d)
{
    return pthread_mutex_unlock(&d->mutex);
}

// The singleton's platform part: a normal mutex initialised as a constant.
ZmMutexPrivate g_singletonPart = {PTHREAD_MUTEX_INITIALIZER, false, true};
} // namespace

int (*const zmMutexLockCall)(ZmMutexPrivate*) = &lockCall;
int (*const zmMutexUnlockCall)(ZmMutexPrivate*) = &unlockCall;

// Constant-initialised; never destroyed under Clang, and its destructor does nothing elsewhere.
#if defined(__clang__)
[[clang::no_destroy]] [[clang::require_constant_initialization]]
#endif
ZmMutex ZmSingleton_Mutex{ZmMutexStaticPart{}, &g_singletonPart};
