#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmThread.h>
#include <zmlib/ZmThread_p.h>

#include <atomic>

namespace {

enum RunState : int { NeverStarted = 0, Running = 1, Finished = 2 };

// Numbers the default names. Counted atomically so that threads constructed at the same time
// cannot corrupt it; the numbering of a single constructing thread is 0, 1, 2, ...
std::atomic<int> s_threadCounter{0};

std::atomic<unsigned long> s_mainThreadId{0};

} // namespace

void ZmThreadPrivate::destroy(ZmThreadPrivate* d)
{
    const int rc = zmThreadAttributesDestroy(d->attributes);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmThread::~ZmThread() failed (error code: %d)\n", rc);
    }
    delete d;
}

ZmThread::ZmThread() : m_d(new ZmThreadPrivate)
{
    m_d->name = ZmString(0, "ZmThread %d", s_threadCounter.fetch_add(1, std::memory_order_relaxed));
    const int rc = zmThreadAttributesInit(m_d->attributes);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmThread::ZmThread() failed (error code: %d)\n", rc);
    }
}

ZmThread::ZmThread(const char* name) : m_d(new ZmThreadPrivate)
{
    const int n = s_threadCounter.fetch_add(1, std::memory_order_relaxed);
    m_d->name = name != nullptr ? ZmString(name) : ZmString(0, "ZmThread %d", n);
    const int rc = zmThreadAttributesInit(m_d->attributes);
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
    // Taken under the lock that start() holds while it launches this run (it may still hold it).
    d->stateMutex.lock();
    ZmThread* runner = d->runner;
    d->stateMutex.unlock();
    runner->run();
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
    const int rc = zmThreadLaunch(m_d->attributes, &ZmThread::trampoline, m_d);
    if (rc != 0) {
        // The destructor's text is reused for this warning on purpose; log readers match on it.
        getTheLogInstance().warnf("ZmThread::~ZmThread() failed (error code: %d)\n", rc);
        m_d->refs.unref(); // the run's reference; never the last, this object holds one too
        m_d->stateMutex.unlock();
        return;
    }
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
    zmThreadSleep(seconds * 1000);
}

void ZmThread::msleep(unsigned long ms)
{
    zmThreadSleep(ms);
}

// One millisecond more than the whole milliseconds, so that no sleep is zero; intended.
void ZmThread::usleep(unsigned long us)
{
    zmThreadSleep(us / 1000 + 1);
}

void ZmThread::yield()
{
    zmThreadSleep(0);
}

void ZmThread::setThreadNameNative(const char*)
{}

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
