/// \file
/// A stopwatch over the system's monotonic high-resolution clock.
#pragma once

#include <zmlib/ZmExport.h>

#include <atomic>
#include <cstdint>

class ZmString;

/// Measures elapsed wall-clock time, accumulated over several running periods.
///
/// `start()` begins a fresh measurement, `stop()` ends a period and adds it to the total, `cont()`
/// begins another period on top of the total. Times are counted in ticks of the monotonic clock
/// (one nanosecond) and converted to seconds with the process-wide tick length, which only
/// `start()` sets up. The watch owns a copy of its optional name, used by `dump()`.
///
/// A watch is a plain value for one thread at a time; different watches may be used by different
/// threads at once. Nothing fails: the clock cannot be refused.
class ZMLIB_API ZmWatch {
public:
    explicit ZmWatch(bool start = false);
    /// \p name null gives a watch without a name (`dump()` then writes nothing).
    explicit ZmWatch(const char* name, bool start = false);
    /// Copies the fields; the copy owns its own copy of the name.
    ZmWatch(const ZmWatch& other);
    ZmWatch& operator=(const ZmWatch& other);
    ~ZmWatch();

    /// Clears the total and begins a running period (and the dump history).
    void start();
    /// Begins a running period, keeping the total.
    void cont();
    /// Stops and clears the total.
    void reset();
    /// Ends the running period; the total in seconds.
    float stop();
    double stop2();
    /// Ends the running period; the total in milliseconds, rounded.
    int stopMSec();
    /// The total in seconds, the current period included, without stopping.
    float getTime() const;
    double getTime2() const;
    /// As `getTime()`, in milliseconds, rounded.
    int getTimeMSec() const;
    bool isRunning() const { return m_running; }

    /// Writes " --- <name> [<index>]: <ms> msec" (no "[index]" for 0) to the log's plain output,
    /// followed by "  (+ <ms> ms)", the time since the previous dump, from the second dump on.
    /// Nothing for a watch without a name or with an empty one.
    void dump(int index = 0);

private:
    bool m_running = false;
    ZmString* m_name = nullptr;
    /// Seconds at the previous dump; negative before the first.
    float m_lastDumpTime = -1.0f;
    int64_t m_accumulated = 0;
    int64_t m_startedAt = 0;

    /// Seconds per tick for the whole process; 0 until the first `start()`.
    static std::atomic<double> m_tickLength;
};
