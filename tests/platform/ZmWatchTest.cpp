#include "LogCapture.h"

#include <zmlib/ZmScopedWatch.h>
#include <zmlib/ZmWatch.h>

#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <thread>

static void sleepMs(int ms)
{
    std::this_thread::sleep_for(std::chrono::milliseconds(ms));
}

TEST(ZmWatch, AccumulatesRunningPeriodsUntilStartedAgain)
{
    ZmWatch idle(false);
    sleepMs(2);
    EXPECT_EQ(idle.getTime(), 0.0f);

    ZmWatch w(true);
    sleepMs(20);
    const double first = w.stop2();
    EXPECT_GE(first, 0.020);
    sleepMs(10);
    EXPECT_EQ(w.getTime2(), first); // stopped: the pause is not counted
    w.cont();
    sleepMs(20);
    EXPECT_GE(w.stop2(), first + 0.020);
    // A stopped watch's time is fixed, so the rounded forms must agree with it.
    EXPECT_EQ(w.getTimeMSec(), int(std::lround(w.getTime2() * 1000.0)));
    EXPECT_FLOAT_EQ(w.getTime(), float(w.getTime2()));

    ZmWatch ref(true);
    w.start(); // the total is gone: w counts from a moment after ref began
    // Read w before ref: the two arguments of one comparison are evaluated in no fixed order.
    const double sinceRestart = w.getTime2();
    EXPECT_LE(sinceRestart, ref.getTime2());
    w.reset();
    EXPECT_FALSE(w.isRunning());
    EXPECT_EQ(w.getTime2(), 0.0);
}

TEST(ZmWatch, DumpWritesNameIndexAndTimeSinceThePreviousDump)
{
    LogCapture capture;
    ZmWatch(true).dump(1); // no name, no line
    ZmWatch("", true).dump(1);
    ZmWatch w("phase", true);
    w.dump();
    sleepMs(15);
    ZmWatch copy(w); // copies the fields and owns its own name
    w = ZmWatch(nullptr, false);
    copy.dump(7);
    copy.start(); // forgets the previous dump
    copy.dump(12);
    ASSERT_EQ(LogCapture::lines().size(), 3u);
    // Take the numbers out of the lines, then require the exact text around them.
    int ms1 = -1, ms2 = -1, since = -1, ms3 = -1;
    std::sscanf(LogCapture::lines()[0].c_str(), "1| --- phase: %d", &ms1);
    std::sscanf(LogCapture::lines()[1].c_str(), "1| --- phase [07]: %d msec  (+ %d", &ms2, &since);
    std::sscanf(LogCapture::lines()[2].c_str(), "1| --- phase [12]: %d", &ms3);
    EXPECT_EQ(LogCapture::lines()[0], "1| --- phase: " + std::to_string(ms1) + " msec\n");
    EXPECT_EQ(LogCapture::lines()[1],
              "1| --- phase [07]: " + std::to_string(ms2) + " msec  (+ " + std::to_string(since) + " ms)\n");
    EXPECT_EQ(LogCapture::lines()[2], "1| --- phase [12]: " + std::to_string(ms3) + " msec\n");
    EXPECT_GE(since, 15);
    // Both parts are cut from the same two readings, so they differ by at most one millisecond.
    EXPECT_LE(std::abs(ms2 - ms1 - since), 1);
}

TEST(ZmScopedWatch, AddsItsBlockToAStoppedWatchAndLeavesARunningOneAlone)
{
    ZmWatch w(true);
    const double before = w.stop2();
    {
        ZmScopedWatch scope(w);
        EXPECT_TRUE(w.isRunning());
        sleepMs(10);
    }
    EXPECT_FALSE(w.isRunning());
    EXPECT_GE(w.getTime2(), before + 0.010);

    ZmWatch ref(true);
    {
        ZmScopedWatch scope(w, true); // reset first: the block alone
        sleepMs(5);
    }
    EXPECT_GE(w.getTime2(), 0.005);
    EXPECT_LE(w.getTime2(), ref.getTime2());
    {
        ZmScopedWatch scope(ref);
    }
    EXPECT_TRUE(ref.isRunning());
}
