// The threading layer against the standard library: an uncontended mutex, and the round trip of
// an empty job through a persistent worker thread.

#include "zmbench.h"

#include <zmlib/ZmMutex.h>
#include <zmlib/ZmWorkerThread.h>

#include <condition_variable>
#include <mutex>
#include <thread>

namespace {

// --- ZmMutex lock/unlock --------------------------------------------------------------------------

ZMBENCH_TARGET("ZmMutex_lockUnlock", 1.1,
               "One `lock()` + `unlock()` of a non-recursive `ZmMutex` vs `std::mutex`, uncontended, one "
               "thread. Both are the same POSIX mutex underneath; the library adds its out-of-line call "
               "and the check of the unlock result.");

template <class Mutex>
void LockUnlock(benchmark::State& state, const char* label)
{
    Mutex mutex;
    long counter = 0;
    for (auto _ : state) {
        mutex.lock();
        ++counter;
        mutex.unlock();
        benchmark::DoNotOptimize(counter);
    }
    state.SetLabel(label);
}
void MutexZm(benchmark::State& state)
{
    LockUnlock<ZmMutex>(state, "ZmMutex::lock + unlock");
}
void MutexPeer(benchmark::State& state)
{
    LockUnlock<std::mutex>(state, "std::mutex::lock + unlock");
}
BENCHMARK(MutexZm)->Name("ZmMutex_lockUnlock/zm");
BENCHMARK(MutexPeer)->Name("ZmMutex_lockUnlock/peer");

// --- worker thread round trip ---------------------------------------------------------------------

ZMBENCH_TARGET("ZmWorkerThread_roundTrip", 1.2,
               "A synchronous `ZmWorkerThread::start(true)` of an empty job on a worker that is already "
               "running vs the minimal hand-off a user would write: a persistent `std::thread` that waits on "
               "a `std::condition_variable` for a job flag, runs the job and signals back. Wall-clock time "
               "per round trip (the console's CPU column counts the whole process, both threads).");

class EmptyJobWorker : public ZmWorkerThread {
public:
    ~EmptyJobWorker() override { terminate(); }
    long jobs = 0;

protected:
    void compute() override { benchmark::DoNotOptimize(++jobs); }
};

void RoundTripZm(benchmark::State& state)
{
    EmptyJobWorker worker;
    worker.start(true);
    for (auto _ : state) {
        // The worker is idle again by the time start(true) returns, so this never fails.
        if (!worker.start(true)) {
            state.SkipWithError("start(true) found the worker busy");
            break;
        }
    }
    worker.terminate();
    state.SetLabel("ZmWorkerThread::start(true)");
}
BENCHMARK(RoundTripZm)->Name("ZmWorkerThread_roundTrip/zm")->MeasureProcessCPUTime()->UseRealTime();

class PeerWorker {
public:
    PeerWorker() : m_thread([this] { loop(); }) {}
    ~PeerWorker()
    {
        {
            const std::lock_guard<std::mutex> lock(m_mutex);
            m_quit = true;
        }
        m_jobCondition.notify_one();
        m_thread.join();
    }
    void runJob()
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_job = true;
        m_done = false;
        m_jobCondition.notify_one();
        m_doneCondition.wait(lock, [this] { return m_done; });
    }
    long jobs = 0;

private:
    void loop()
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        for (;;) {
            m_jobCondition.wait(lock, [this] { return m_job || m_quit; });
            if (m_quit) {
                return;
            }
            m_job = false;
            lock.unlock();
            benchmark::DoNotOptimize(++jobs);
            lock.lock();
            m_done = true;
            m_doneCondition.notify_one();
        }
    }

    std::mutex m_mutex;
    std::condition_variable m_jobCondition, m_doneCondition;
    bool m_job = false, m_done = false, m_quit = false;
    std::thread m_thread;
};

void RoundTripPeer(benchmark::State& state)
{
    PeerWorker worker;
    worker.runJob();
    for (auto _ : state) {
        worker.runJob();
    }
    state.SetLabel("std::thread + std::condition_variable");
}
BENCHMARK(RoundTripPeer)->Name("ZmWorkerThread_roundTrip/peer")->MeasureProcessCPUTime()->UseRealTime();

} // namespace
