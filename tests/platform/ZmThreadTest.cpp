#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmThread.h>
#include <zmlib/ZmThreadBarrier.h>
#include <zmlib/ZmThreadLocalStorageBase.h>
#include <zmlib/ZmWaitCondition.h>
#include <zmlib/ZmWaitCondition_p.h>

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <memory>
#include <string>
#include <sys/syscall.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

using Clock = std::chrono::steady_clock;

double msSince(Clock::time_point start)
{
    return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

class FnThread : public ZmThread {
public:
    using ZmThread::ZmThread;
    std::function<void()> body = [] {};

protected:
    void run() override { body(); }
};

void joinAll(std::vector<std::thread>& threads)
{
    for (std::thread& t : threads) {
        t.join();
    }
}

std::string g_logged;
[[maybe_unused]] void collectLog(ZmLogLevel level, const ZmString& line)
{
    g_logged += std::to_string(level) + line.getString();
}

} // namespace

TEST(ZmThread, RunsItsBodyAgainAfterFinishingAndCopiesShareTheThread)
{
    FnThread t("body");
    EXPECT_FALSE(t.running() || t.finished());
    EXPECT_TRUE(t.wait(0)); // never started: nothing to wait for
    std::atomic<bool> release{false};
    std::atomic<int> runs{0}, inside{0}, overlaps{0};
    std::atomic<unsigned long> tid{0};
    t.body = [&] {
        overlaps += inside++ != 0;
        tid = kvCurrentThreadId();
        while (!release) {
            ZmThread::msleep(1);
        }
        ++runs;
        --inside;
    };
    t.start();
    FnThread copy(t);
    EXPECT_TRUE(copy.running());
    EXPECT_FALSE(t.wait(20)); // the body is held: the wait times out
    release = true;
    t.start(); // waits for the first run to finish, then runs again
    while (!t.finished() || runs < 2) {
        ASSERT_TRUE(copy.wait(60000));
    }
    EXPECT_EQ(overlaps, 0);
    EXPECT_NE(tid, kvCurrentThreadId());
}

TEST(ZmThread, DefaultNamesCountEveryConstructedThread)
{
    FnThread first, named("named"), second, third(nullptr);
    const std::string name = first.threadName().getString();
    ASSERT_EQ(name.rfind("ZmThread ", 0), 0u) << name;
    const int n = std::stoi(name.substr(9));
    EXPECT_STREQ(named.threadName().getString(), "named");
    EXPECT_EQ(second.threadName().getString(), "ZmThread " + std::to_string(n + 2));
    EXPECT_EQ(third.threadName().getString(), "ZmThread " + std::to_string(n + 3));
    second.setThreadName("renamed");
    EXPECT_STREQ(second.threadName().getString(), "renamed");
}

TEST(ZmThread, SleepsLastAtLeastTheirWholeMilliseconds)
{
    const std::pair<std::function<void()>, double> cases[] = {{[] { ZmThread::usleep(0); }, 1},
                                                              {[] { ZmThread::usleep(1000); }, 2},
                                                              {[] { ZmThread::usleep(2500); }, 3},
                                                              {[] { ZmThread::msleep(4); }, 4}};
    for (const auto& [sleep, minMs] : cases) {
        const Clock::time_point start = Clock::now();
        sleep();
        EXPECT_GE(msSince(start), minMs);
    }
}

TEST(ZmThread, IdentitiesComeFromTheSystemAndTheFirstCallerIsMain)
{
    EXPECT_EQ(kvCurrentProcessId(), static_cast<unsigned long>(getpid()));
    EXPECT_EQ(kvCurrentThreadId(), static_cast<unsigned long>(syscall(SYS_gettid)));
    // In a fresh process, so that no earlier test has fixed the main thread already.
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const auto child = [] {
        bool wasMain = false;
        unsigned long first = 0;
        std::thread([&] {
            wasMain = kvIsMainThread();
            first = kvCurrentThreadId();
        }).join();
        std::_Exit(wasMain && first != kvCurrentThreadId() && !kvIsMainThread() && kvMainThreadId() == first
                       ? 0
                       : 1);
    };
    EXPECT_EXIT(child(), testing::ExitedWithCode(0), "");
}

TEST(ZmMutex, RecursiveCountsTheOwnersLocksNormalDoesNot)
{
    ZmMutex recursive(true), normal;
    EXPECT_TRUE(recursive.isRecursive() && !normal.isRecursive());
    const auto othersGet = [](ZmMutex& m) {
        bool got = false;
        std::thread([&] { (got = m.tryLock()) ? m.unlock() : void(); }).join();
        return got;
    };
    recursive.lock();
    EXPECT_TRUE(recursive.tryLock());
    normal.lock();
    EXPECT_FALSE(normal.tryLock() || othersGet(normal));
    normal.unlock();
    EXPECT_TRUE(othersGet(normal));
    recursive.unlock();
    EXPECT_FALSE(othersGet(recursive)); // still held once
    recursive.unlock();
    EXPECT_TRUE(othersGet(recursive));

#ifndef __SANITIZE_THREAD__ // the thread sanitizer stops at the misuse itself
    getTheLogInstance().setWriteCallback(collectLog, ZmLogWarning);
    recursive.unlock(); // not the owner: EPERM, logged as an error
    getTheLogInstance().setWriteCallback(nullptr, ZmLogNone);
    EXPECT_EQ(g_logged.substr(0, 1), "3");
    EXPECT_NE(g_logged.find("ZmMutex::unlock() failed (error code: 1)\n"), std::string::npos) << g_logged;
#endif
}

TEST(ZmWaitCondition, DeadlineAddsWholeSecondsAndCarriesMilliseconds)
{
    const auto deadline = [](time_t s, long ns, unsigned long ms) {
        const timespec d = zmWaitConditionDeadline(timespec{s, ns}, ms);
        return std::make_pair(static_cast<long>(d.tv_sec), d.tv_nsec);
    };
    EXPECT_EQ(deadline(100, 800000000, 1500), std::make_pair(102L, 300000000L));
    EXPECT_EQ(deadline(100, 800999999, 199), std::make_pair(100L, 999000000L)); // clock truncated to ms
    EXPECT_EQ(deadline(100, 1000000, 999), std::make_pair(101L, 0L));
    EXPECT_EQ(deadline(7, 5, 4294967294UL), std::make_pair(7L + 4294967L, 294000000L));
}

TEST(ZmWaitCondition, TimesOutAndCopiesWakeTheSameWaiters)
{
    ZmMutex mutex;
    ZmWaitCondition condition;
    mutex.lock();
    const Clock::time_point start = Clock::now();
    EXPECT_FALSE(condition.wait(&mutex, 30));
    EXPECT_GE(msSince(start), 29); // the deadline may come up to 1 ms early
    mutex.unlock();

    // Wakes through a copy reach waiters on the source; wakeAll reaches every one of them.
    ZmWaitCondition copy(condition);
    int waiting = 0, woken = 0;
    bool go = false, timedOut = false;
    std::vector<std::thread> waiters(3);
    for (std::thread& t : waiters) {
        t = std::thread([&] {
            ZmMutexLocker lock(mutex);
            ++waiting;
            while (!go) {
                timedOut = !condition.wait(&mutex, 60000) || timedOut;
            }
            ++woken;
        });
    }
    for (bool ready = false; !ready; ZmThread::msleep(1)) {
        ZmMutexLocker lock(mutex);
        ready = go = waiting == 3; // all are waiting, so the one wake must reach all three
    }
    copy.wakeAll();
    joinAll(waiters);
    EXPECT_EQ(woken, 3);
    EXPECT_FALSE(timedOut);
}

// The wall clock as the library sees it can be stepped: this program's clock_gettime wins over the
// C library's for every caller in the process, the shared library included, and moves
// CLOCK_REALTIME while g_wallClockStep is set. The real clock comes from the system call itself.
namespace {
std::atomic<long> g_wallClockStep{0}; // seconds added to CLOCK_REALTIME
} // namespace

extern "C" int clock_gettime(clockid_t clock, struct timespec* ts) noexcept
{
    const long rc = syscall(SYS_clock_gettime, clock, ts);
    if (rc == 0 && clock == CLOCK_REALTIME) {
        ts->tv_sec += g_wallClockStep.load();
    }
    return int(rc);
}

// A step of the wall clock must not stretch a time-out: waits follow the monotonic clock. (On the
// wall clock, the 200 ms wait below would last an hour.)
TEST(ZmWaitCondition, TimeOutsIgnoreWallClockSteps)
{
    timespec probe{};
    g_wallClockStep = 3600;
    const time_t stepped = (clock_gettime(CLOCK_REALTIME, &probe), probe.tv_sec);
    g_wallClockStep = 0;
    if (stepped < std::time(nullptr) + 3000) {
        GTEST_SKIP() << "clock_gettime cannot be interposed in this build";
    }
    ZmMutex mutex;
    ZmWaitCondition condition;
    std::atomic<bool> done{false};
    double waitedMs = -1;
    g_wallClockStep = 3600;
    std::thread waiter([&] {
        ZmMutexLocker lock(mutex);
        const Clock::time_point start = Clock::now();
        EXPECT_FALSE(condition.wait(&mutex, 200));
        waitedMs = msSince(start);
        done = true;
    });
    for (int i = 0; i < 500 && !done; ++i) {
        ZmThread::msleep(10);
    }
    g_wallClockStep = 0;
    const bool endedInTime = done;
    while (!done) { // release a waiter stuck on the stepped clock, so the test ends either way
        condition.wakeAll();
        ZmThread::msleep(1);
    }
    waiter.join();
    EXPECT_TRUE(endedInTime) << "a 200 ms wait was still waiting after 5 s";
    EXPECT_GE(waitedMs, 199);
}

namespace {
std::atomic<int> g_destroyed{0};
void destroyInt(void* p)
{
    g_destroyed += *static_cast<int*>(p);
    delete static_cast<int*>(p);
}
} // namespace

TEST(ZmThreadLocalStorageBase, ValuesArePerThreadAndDestroyedAtThreadExit)
{
    g_destroyed = 0;
    ZmThreadLocalStorageBase slot(destroyInt);
    int mine = 1;
    slot.set(&mine);
    std::vector<std::thread> threads;
    for (int i = 0; i <= 3; ++i) { // thread 0 sets nothing and gets no destructor call
        threads.emplace_back([&slot, i] {
            EXPECT_EQ(slot.get(), nullptr);
            slot.set(i > 0 ? new int(i * 10) : nullptr);
        });
    }
    joinAll(threads);
    EXPECT_EQ(g_destroyed, 60);
    EXPECT_EQ(slot.get(), &mine);
    slot.set(nullptr);
}

TEST(ZmThreadBarrier, ExactlyOneTruePerGeneration)
{
    constexpr int kThreads = 4, kGenerations = 500;
    ZmThreadBarrier barrier(kThreads);
    std::vector<std::atomic<int>> arrived(kGenerations), trues(kGenerations);
    std::atomic<int> early{0};
    std::vector<std::unique_ptr<FnThread>> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.push_back(std::make_unique<FnThread>());
        threads.back()->body = [&] {
            for (int g = 0; g < kGenerations; ++g) {
                ++arrived[g];
                trues[g] += barrier.enter();
                early += arrived[g] != kThreads; // left before everyone had arrived
            }
        };
        threads.back()->start();
    }
    for (auto& t : threads) {
        while (!t->finished()) {
            ASSERT_TRUE(t->wait(60000));
        }
    }
    EXPECT_EQ(early, 0);
    for (int g = 0; g < kGenerations; ++g) {
        ASSERT_EQ(trues[g], 1) << "generation " << g;
    }
    ZmThreadBarrier alone(1), none(0);
    EXPECT_TRUE(alone.enter() && alone.enter() && none.enter());
}
