#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmThread.h>
#include <zmlib/ZmWaitCondition.h>
#include <zmlib/ZmWorkerThread.h>

#include <atomic>
#include <chrono>

using State = ZmWorkerThread::State;

/// The worker thread itself: its `run()` is the loop that waits for jobs and calls the owner's
/// `compute()`. All state changes happen under `stateMutex`; `state` is atomic only so that the
/// job's polls in `canceled()` and `suspended()` can read it without the lock.
class ZmWorkerThreadPrivate : public ZmThread {
public:
    ZmWorkerThreadPrivate(ZmWorkerThread* ownerObject, const char* name)
        : ZmThread(name), workerName(name), owner(ownerObject)
    {}

    ZmString workerName;
    ZmMutex stateMutex;
    /// The worker tells the controlling side that the state has changed.
    ZmWaitCondition stateChanged;
    /// The controlling side wakes the worker (a new job, a resume, a terminate).
    ZmWaitCondition jobCondition;
    ZmMutex callerMutex;
    /// Wakes the callers blocked in a synchronous start().
    ZmWaitCondition callerCondition;
    ZmWorkerThread* owner;
    std::atomic<State> state{ZmWorkerThread::Stopped};
    std::atomic<uint64_t> jobsRequested{0};
    std::atomic<uint64_t> jobsCompleted{0};
    /// Numbers the jobs: the last one started (under `stateMutex`), the one running (written by
    /// the worker), and the last one whose callers were released (under `callerMutex`). A
    /// synchronous start() waits for the release of its own job, so that neither a wake-up of an
    /// earlier job nor a spurious one lets it go, and a release that came first is not missed.
    uint64_t startedJobs ZM_GUARDED_BY(stateMutex) = 0;
    std::atomic<uint64_t> runningJob{0};
    uint64_t releasedJob ZM_GUARDED_BY(callerMutex) = 0;

    State load() const { return state.load(std::memory_order_relaxed); }
    // Released, so that whoever sees a new state through state() also sees the job counters.
    void store(State s) { state.store(s, std::memory_order_release); }

    void setStateAndNotify(State s)
    {
        stateMutex.lock();
        store(s);
        stateMutex.unlock();
        stateChanged.wakeOne();
    }

    void wakeCallers(uint64_t job)
    {
        callerMutex.lock();
        releasedJob = job > releasedJob ? job : releasedJob;
        callerCondition.wakeAll();
        callerMutex.unlock();
    }

protected:
    void run() override
    {
        setThreadNameNative(workerName.getString());
        owner->computeCtor();
        setStateAndNotify(ZmWorkerThread::Idle);
        for (;;) {
            stateMutex.lock();
            State s;
            while ((s = load()) == ZmWorkerThread::Idle || s == ZmWorkerThread::Canceled) {
                jobCondition.wait(&stateMutex);
            }
            const uint64_t job = startedJobs;
            stateMutex.unlock();
            if (s == ZmWorkerThread::TerminateRequested) {
                break;
            }
            runningJob.store(job, std::memory_order_relaxed);
            owner->compute();
            jobsCompleted.fetch_add(1, std::memory_order_relaxed);
            // The worker is idle again before the synchronous callers learn that the job has
            // ended, so that a caller may start the next job as soon as its start() returns.
            stateMutex.lock();
            s = load();
            // A terminate request that arrived during the job is kept, so that the loop still
            // ends; it cannot happen when one thread controls the worker.
            store(s == ZmWorkerThread::CancelRequested      ? ZmWorkerThread::Canceled
                  : s == ZmWorkerThread::TerminateRequested ? s
                                                            : ZmWorkerThread::Idle);
            stateMutex.unlock();
            stateChanged.wakeOne();
            wakeCallers(job);
        }
        owner->computeDtor();
        setStateAndNotify(ZmWorkerThread::Stopped);
    }
};

ZmWorkerThread::ZmWorkerThread(const char* name)
    : m_d(new ZmWorkerThreadPrivate(this, name != nullptr ? name : "ZmWorkerThread"))
{}

ZmWorkerThread::~ZmWorkerThread()
{
    terminate();
    delete m_d;
}

void ZmWorkerThread::computeCtor()
{}

void ZmWorkerThread::computeDtor()
{}

// The caller mutex is taken only for a synchronous start (the worker protocol's one nested lock),
// a conditional locking the lock analysis cannot follow.
bool ZmWorkerThread::start(bool synchronous) ZM_NO_THREAD_SAFETY_ANALYSIS
{
    ZmWorkerThreadPrivate* d = m_d;
    d->jobsRequested.fetch_add(1, std::memory_order_relaxed);
    if (!d->running()) {
        d->start();
        d->stateMutex.lock();
        while (d->load() != Idle) {
            d->stateChanged.wait(&d->stateMutex);
        }
        d->stateMutex.unlock();
    }
    d->stateMutex.lock();
    const State s = d->load();
    if (s != Idle && s != Canceled) {
        d->stateMutex.unlock();
        return false;
    }
    d->store(Busy);
    const uint64_t job = ++d->startedJobs;
    d->stateMutex.unlock();
    if (synchronous) {
        d->callerMutex.lock();
    }
    d->jobCondition.wakeOne();
    if (synchronous) {
        while (d->releasedJob < job) {
            d->callerCondition.wait(&d->callerMutex);
        }
        d->callerMutex.unlock();
    }
    return true;
}

bool ZmWorkerThread::wait()
{
    bool timedOut;
    return wait(timedOut, 4294967295UL);
}

bool ZmWorkerThread::wait(bool& timedOut, unsigned long ms)
{
    ZmWorkerThreadPrivate* d = m_d;
    timedOut = false;
    d->stateMutex.lock();
    State s = d->load();
    if (s == Stopped || s == Idle || s == Suspended || s == Canceled) {
        d->stateMutex.unlock();
        return false;
    }
    for (;;) {
        s = d->load();
        if (s == Stopped || s == Suspended || s == Canceled || s == Idle) {
            break;
        }
        // Each wait gets the whole time again; a time-out ends the wait at once.
        if (!d->stateChanged.wait(&d->stateMutex, ms)) {
            d->stateMutex.unlock();
            timedOut = true;
            return true;
        }
    }
    d->stateMutex.unlock();
    return true;
}

bool ZmWorkerThread::suspend()
{
    m_d->stateMutex.lock();
    const bool busy = m_d->load() == Busy;
    if (busy) {
        m_d->store(SuspendRequested);
    }
    m_d->stateMutex.unlock();
    return busy;
}

bool ZmWorkerThread::suspended()
{
    ZmWorkerThreadPrivate* d = m_d;
    // Read without the lock on purpose: the job polls this often and it is nearly always false.
    if (d->load() != SuspendRequested) {
        return false;
    }
    d->stateMutex.lock();
    // Looked at again under the lock: a resume or cancel may have come in between.
    if (d->load() != SuspendRequested) {
        d->stateMutex.unlock();
        return false;
    }
    d->store(Suspended);
    d->stateChanged.wakeOne();
    while (d->load() == Suspended) {
        d->jobCondition.wait(&d->stateMutex);
    }
    d->stateMutex.unlock();
    return true;
}

bool ZmWorkerThread::resume()
{
    ZmWorkerThreadPrivate* d = m_d;
    bool resumed = false;
    d->stateMutex.lock();
    const State s = d->load();
    if (s == SuspendRequested) {
        d->store(Busy);
    } else if (s == Suspended) {
        d->store(Busy);
        d->jobCondition.wakeOne();
        resumed = true;
    }
    d->stateMutex.unlock();
    return resumed;
}

bool ZmWorkerThread::cancel()
{
    resume();
    m_d->stateMutex.lock();
    const bool busy = m_d->load() == Busy;
    if (busy) {
        m_d->store(CancelRequested);
    }
    m_d->stateMutex.unlock();
    return busy;
}

// Read without the lock on purpose, so that polling from the job is cheap.
bool ZmWorkerThread::canceled() const
{
    return m_d->load() == CancelRequested;
}

void ZmWorkerThread::terminate()
{
    ZmWorkerThreadPrivate* d = m_d;
    if (!d->running()) {
        return;
    }
    wait();
    if (state() == Suspended) {
        resume();
        wait();
    }
    d->stateMutex.lock();
    d->store(TerminateRequested);
    d->jobCondition.wakeOne();
    while (d->load() == TerminateRequested) {
        d->stateChanged.wait(&d->stateMutex);
    }
    d->stateMutex.unlock();
    // The loop has ended; its thread is only returning now. Wait for that without a sleep (it is
    // a matter of microseconds) but yielding the processor, so that the returning thread gets it
    // even on a single core and the wait burns nothing.
    while (d->running()) {
        ZmThread::yield();
    }
}

void ZmWorkerThread::wakeCaller()
{
    m_d->wakeCallers(m_d->runningJob.load(std::memory_order_relaxed));
}

ZmWorkerThread::State ZmWorkerThread::state() const
{
    return m_d->state.load(std::memory_order_acquire);
}

ZmString ZmWorkerThread::name() const
{
    return m_d->workerName;
}

void ZmWorkerThread::setName(const char* name)
{
    m_d->workerName = name != nullptr ? name : "";
    m_d->setThreadName(name);
}

uint64_t ZmWorkerThread::jobsRequested() const
{
    return m_d->jobsRequested.load(std::memory_order_relaxed);
}

uint64_t ZmWorkerThread::jobsCompleted() const
{
    return m_d->jobsCompleted.load(std::memory_order_relaxed);
}

namespace {

class CountingWorker : public ZmWorkerThread {
public:
    CountingWorker() : ZmWorkerThread("ZmWorkerThread::test") {}
    ~CountingWorker() override { terminate(); }
    uint64_t count = 0;

protected:
    void compute() override { ++count; }
};

} // namespace

void ZmWorkerThread::test()
{
    using Clock = std::chrono::steady_clock;
    CountingWorker worker;
    const Clock::time_point begin = Clock::now();
    Clock::time_point now;
    do {
        worker.start(true);
        now = Clock::now();
    } while (now - begin < std::chrono::milliseconds(200));
    worker.terminate();
    const double seconds = std::chrono::duration<double>(now - begin).count();
    getTheLogInstance().printf("%d iterations per second\n", static_cast<int>(worker.count / seconds));
}
