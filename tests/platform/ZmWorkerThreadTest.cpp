#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmThread.h>
#include <zmlib/ZmWorkerThread.h>

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <random>
#include <string>
#include <unistd.h>

namespace {

using W = ZmWorkerThread;

/// Kills the process (SIGALRM) when a test hangs, so that it fails instead of blocking the run.
struct HangGuard {
    explicit HangGuard(unsigned seconds) { alarm(seconds); }
    ~HangGuard() { alarm(0); }
};

/// A job that releases synchronous callers at once, then runs until it is told to finish or is
/// cancelled, parking whenever it is suspended.
class LoopWorker : public ZmWorkerThread {
public:
    LoopWorker() : ZmWorkerThread("loop") {}
    ~LoopWorker() override
    {
        finish = true;
        terminate();
    }
    std::atomic<bool> finish{false};
    std::atomic<int> ctors{0}, dtors{0}, jobs{0}, parks{0};
    std::atomic<unsigned long> ctorTid{0}, computeTid{0}, dtorTid{0};

protected:
    void computeCtor() override { ctorTid = (++ctors, kvCurrentThreadId()); }
    void computeDtor() override { dtorTid = (++dtors, kvCurrentThreadId()); }
    void compute() override
    {
        computeTid = (++jobs, kvCurrentThreadId());
        wakeCaller();
        while (!finish && !canceled()) {
            parks += suspended();
            ZmThread::yield();
        }
    }
};

/// Polls until the worker reaches \p want; false after 20 s.
bool settle(const W& w, W::State want)
{
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (w.state() != want && std::chrono::steady_clock::now() < end) {
        ZmThread::yield();
    }
    return w.state() == want;
}

} // namespace

TEST(ZmWorkerThread, EdgeCasesOfStartCancelSuspendAndWait)
{
    const HangGuard guard(120);
    LoopWorker w;
    EXPECT_EQ(w.state(), W::Stopped);
    EXPECT_FALSE(w.wait());
    EXPECT_TRUE(w.start());
    EXPECT_EQ(w.state(), W::Busy);
    EXPECT_FALSE(w.start(true)); // busy: refused, but counted
    EXPECT_EQ(w.jobsRequested(), 2u);
    bool timedOut = false;
    EXPECT_TRUE(w.wait(timedOut, 10) && timedOut);
    w.finish = true;
    w.wait(); // true when it waited, false when the job had already ended: both are right here
    EXPECT_EQ(w.state(), W::Idle);
    EXPECT_EQ(w.jobsCompleted(), 1u);
    EXPECT_FALSE(w.cancel() || w.suspend() || w.resume() || w.wait(timedOut, 10) || timedOut);

    // Cancelling a parked job resumes it, and the job then ends on the cancel request.
    w.finish = false;
    ASSERT_TRUE(w.start(true)); // returns at the job's wakeCaller(), the job runs on
    EXPECT_EQ(w.jobsCompleted(), 1u);
    EXPECT_TRUE(w.suspend());
    ASSERT_TRUE(settle(w, W::Suspended));
    EXPECT_FALSE(w.wait()); // nothing to wait for while parked
    EXPECT_TRUE(w.cancel());
    w.wait(); // as above: the job may already have ended on the request
    EXPECT_EQ(w.state(), W::Canceled);
    EXPECT_EQ(w.parks, 1);

    // computeCtor/computeDtor run once per loop, on the worker thread; a terminated worker restarts.
    w.finish = true;
    ASSERT_TRUE(w.start(true));
    w.terminate();
    EXPECT_EQ(w.state(), W::Stopped);
    EXPECT_EQ(w.ctors + w.dtors, 2);
    EXPECT_NE(w.ctorTid, kvCurrentThreadId());
    EXPECT_EQ(w.ctorTid, w.computeTid);
    EXPECT_EQ(w.dtorTid, w.computeTid);
    ASSERT_TRUE(w.start(true));
    w.terminate();
    EXPECT_EQ(w.ctors + w.dtors, 4);
}

TEST(ZmWorkerThread, SynchronousStartWithoutWakeCallerReturnsAfterTheJob)
{
    const HangGuard guard(120);
    struct Counting : ZmWorkerThread {
        ~Counting() override { terminate(); }
        void compute() override { ZmThread::msleep((++count, 2)); }
        std::atomic<int> count{0};
    } w;
    EXPECT_STREQ(w.name().getString(), "ZmWorkerThread");
    for (int i = 1; i <= 50; ++i) {
        ASSERT_TRUE(w.start(true)); // the worker is idle again once start(true) has returned
        ASSERT_EQ(w.count, i);
    }
}

TEST(ZmWorkerThread, SelfTestLogsItsRate)
{
    static std::string line;
    getTheLogInstance().setWriteCallback([](ZmLogLevel, const ZmString& l) { line += l.getString(); },
                                         ZmLogDebug);
    ZmWorkerThread::test();
    getTheLogInstance().setWriteCallback(nullptr, ZmLogNone);
    const size_t pos = line.find(" iterations per second\n");
    ASSERT_NE(pos, std::string::npos) << line;
    EXPECT_GT(std::stoi(line.substr(line.find_last_of(" ]", pos - 1) + 1)), 0) << line;
}

// Random operations against a model of the state table. In the first phase every operation is
// followed by waiting for the state that the model predicts, so results and counters are exact;
// in the second, operations follow each other at once and only invariants are checked.
TEST(ZmWorkerThread, RandomOperationsFollowTheStateTable)
{
    const HangGuard guard(300);
    std::mt19937 rng(20240611);
    LoopWorker w;
    W::State m = W::Stopped;
    uint64_t requested = 0, completed = 0;
    int loops = 0;
    for (int step = 0; step < 40000; ++step) {
        const bool modelled = step < 15000;
        const int op = static_cast<int>(rng() % 15) % 8; // terminate (7) comes half as often
        const bool idle = m == W::Idle || m == W::Canceled, busy = m == W::Busy;
        bool r = false, expect = false, timedOut = false;
        W::State next = m;
        if (op <= 1) { // start, asynchronous or synchronous
            expect = idle || m == W::Stopped;
            requested += 1;
            loops += m == W::Stopped;
            next = expect ? W::Busy : m;
            if (modelled ? expect : w.state() != W::Busy) {
                w.finish = false;
            }
            r = w.start(op == 1);
        } else if (op == 2) {
            r = w.suspend(), expect = busy, next = busy ? W::Suspended : m;
        } else if (op == 3) {
            r = w.resume(), expect = m == W::Suspended, next = expect ? W::Busy : m;
        } else if (op == 4) {
            r = w.cancel(), expect = busy || m == W::Suspended, next = expect ? W::Canceled : m;
            completed += expect;
        } else if (op == 5) { // let the job end (while parked, only when racing)
            w.finish = w.finish || busy || !modelled;
            next = busy ? W::Idle : m;
            completed += busy;
        } else if (op == 6) {
            r = w.wait(timedOut, 1), expect = busy; // the job never ends by itself
            ASSERT_TRUE(!modelled || timedOut == busy);
        } else {
            w.finish = true;
            w.terminate();
            ASSERT_EQ(w.state(), W::Stopped); // at once, without settling
            completed += busy || m == W::Suspended;
            next = W::Stopped;
        }
        if (!modelled) {
            continue;
        }
        const std::string where = "step " + std::to_string(step) + " op " + std::to_string(op) + " from " +
                                  std::to_string(m) + " to " + std::to_string(next);
        ASSERT_EQ(r, expect) << where;
        m = next;
        ASSERT_TRUE(settle(w, m)) << where << ", state " << w.state();
        ASSERT_EQ(w.jobsRequested(), requested) << where;
        ASSERT_EQ(w.jobsCompleted(), completed) << where;
        ASSERT_EQ(w.ctors, loops) << where;
        ASSERT_EQ(w.dtors, loops - (m != W::Stopped)) << where;
    }
    w.finish = true;
    w.terminate();
    EXPECT_EQ(w.state(), W::Stopped);
    EXPECT_EQ(w.ctors, w.dtors);
    EXPECT_EQ(w.jobsCompleted(), static_cast<uint64_t>(w.jobs));
    EXPECT_EQ(w.jobsRequested(), requested);
}
