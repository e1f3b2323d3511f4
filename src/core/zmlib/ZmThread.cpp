#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmSharedCount_p.h>
#include <zmlib/ZmThread.h>
#include <zmlib/ZmWaitCondition.h>

#include <atomic>
#include <cerrno>
#include <pthread.h>
#include <sched.h>
#include <time.h>
#include <unistd.h>

namespace {

enum RunState : int { NeverStarted = 0, Running = 1, Finished = 2 };

// Numbers the default names. Counted atomically so that threads constructed at the same time
// cannot corrupt it; the numbering of a single constructing thread is 0, 1, 2, ...
std::atomic<int> s_threadCounter{0};

std::atomic<unsigned long> s_mainThreadId{0};

void sleepMs(unsigned long ms)
{
    if (ms == 0) {
        sched_yield();
        return;
    }
    timespec t;
    t.tv_sec = static_cast<time_t>(ms / 1000);
    t.tv_nsec = static_cast<long>(ms % 1000) * 1000000;
    while (nanosleep(&t, &t) != 0 && errno == EINTR) {
    }
}

} // namespace

struct ZmThreadPrivate {
    pthread_attr_t attr;
    pthread_t handle{};
    // Written under the state mutex; read without it by running()/finished().
    std::atomic<int> state{NeverStarted};
    ZmMutex stateMutex;
    ZmWaitCondition finished;
    ZmString name;
    // The copy whose start() launched the current run.
    ZmThread* runner = nullptr;
    // Every ZmThread sharing this part holds one reference, and so does a run that is going.
    ZmSharedCount refs;

    static void destroy(ZmThreadPrivate* d)
    {
        const int rc = pthread_attr_destroy(&d->attr);
        if (rc != 0) {
            getTheLogInstance().errorf("ZmThread::~ZmThread() failed (error code: %d)\n", rc);
        }
        delete d;
    }
};

ZmThread::ZmThread() : m_d(new ZmThreadPrivate)
{
    m_d->name = ZmString(0, "ZmThread %d", s_threadCounter.fetch_add(1, std::memory_order_relaxed));
    const int rc = pthread_attr_init(&m_d->attr);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmThread::ZmThread() failed (error code: %d)\n", rc);
    }
}

ZmThread::ZmThread(const char* name) : m_d(new ZmThreadPrivate)
{
    const int n = s_threadCounter.fetch_add(1, std::memory_order_relaxed);
    m_d->name = name != nullptr ? ZmString(name) : ZmString(0, "ZmThread %d", n);
    const int rc = pthread_attr_init(&m_d->attr);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmThread::ZmThread(const char*) failed (error code: %d)\n", rc);
    }
}

// Copies share the thread on purpose: the copy and the source are the same thread.
ZmThread::ZmThread(const ZmThread& other) : m_d(ZmSharedPart<ZmThreadPrivate>::share(other.m_d))
{}

ZmThread& ZmThread::operator=(const ZmThread& other)
{
    if (this != &other) {
        ZmSharedPart<ZmThreadPrivate>::assign(m_d, other.m_d);
    }
    return *this;
}

ZmThread::~ZmThread()
{
    ZmSharedPart<ZmThreadPrivate>::release(m_d);
}

void* ZmThread::trampoline(void* arg)
{
    auto* d = static_cast<ZmThreadPrivate*>(arg);
    d->runner->run();
    d->stateMutex.lock();
    d->state.store(Finished, std::memory_order_release);
    d->finished.wakeAll();
    d->stateMutex.unlock();
    // The run's own reference: the object may have been destroyed once its body returned.
    ZmSharedPart<ZmThreadPrivate>::release(d);
    return nullptr;
}

void ZmThread::start()
{
    m_d->stateMutex.lock();
    while (m_d->state.load(std::memory_order_relaxed) == Running) {
        m_d->finished.wait(&m_d->stateMutex);
    }
    m_d->runner = this;
    m_d->refs.ref();
    const int rc = pthread_create(&m_d->handle, &m_d->attr, &ZmThread::trampoline, m_d);
    if (rc != 0) {
        // The destructor's text is reused for this warning on purpose; log readers match on it.
        getTheLogInstance().warnf("ZmThread::~ZmThread() failed (error code: %d)\n", rc);
        m_d->refs.unref(); // the run's reference; never the last, this object holds one too
        m_d->stateMutex.unlock();
        return;
    }
    pthread_detach(m_d->handle);
    m_d->state.store(Running, std::memory_order_release);
    m_d->stateMutex.unlock();
}

bool ZmThread::wait(unsigned long ms)
{
    m_d->stateMutex.lock();
    if (m_d->state.load(std::memory_order_relaxed) != Running) {
        m_d->stateMutex.unlock();
        return true;
    }
    // One wait, no loop: a spurious wake-up answers true, as it always has.
    const bool woken = m_d->finished.wait(&m_d->stateMutex, ms);
    m_d->stateMutex.unlock();
    return woken;
}

bool ZmThread::running() const
{
    return m_d->state.load(std::memory_order_acquire) == Running;
}

bool ZmThread::finished() const
{
    return m_d->state.load(std::memory_order_acquire) == Finished;
}

ZmString ZmThread::threadName() const
{
    return m_d->name;
}

void ZmThread::setThreadName(const char* name)
{
    m_d->name = name != nullptr ? name : "";
}

void ZmThread::sleep(unsigned long seconds)
{
    sleepMs(seconds * 1000);
}

void ZmThread::msleep(unsigned long ms)
{
    sleepMs(ms);
}

// One millisecond more than the whole milliseconds, so that no sleep is zero; intended.
void ZmThread::usleep(unsigned long us)
{
    sleepMs(us / 1000 + 1);
}

void ZmThread::yield()
{
    sleepMs(0);
}

void ZmThread::setThreadNameNative(const char*)
{}

unsigned long kvCurrentProcessId()
{
    return static_cast<unsigned long>(getpid());
}

unsigned long kvCurrentThreadId()
{
    return static_cast<unsigned long>(gettid());
}

unsigned long kvMainThreadId()
{
    unsigned long id = s_mainThreadId.load(std::memory_order_acquire);
    if (id == 0) {
        const unsigned long self = kvCurrentThreadId();
        // The first caller wins; a thread that loses the race reads the winner's id.
        id = s_mainThreadId.compare_exchange_strong(id, self, std::memory_order_acq_rel) ? self : id;
    }
    return id;
}

bool kvIsMainThread()
{
    return kvMainThreadId() == kvCurrentThreadId();
}
