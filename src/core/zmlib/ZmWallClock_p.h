/// \file
/// The wall clock and local calendar time (private). Inline, since the log reads the clock on
/// every line; with ZmMonotonicClock_p.h the only clock calls of the library, so a port replaces
/// these two headers.
#pragma once

#include <cstdint>
#include <ctime>
#include <time.h>

/// A moment of the wall clock: seconds since 1970-01-01 UTC and the nanoseconds of the second.
struct ZmWallTime {
    int64_t seconds;
    int32_t nanoseconds;
};

inline ZmWallTime zmWallClock() noexcept
{
    timespec ts;
    clock_gettime(CLOCK_REALTIME, &ts);
    return ZmWallTime{int64_t(ts.tv_sec), int32_t(ts.tv_nsec)};
}

/// The local calendar time of \p seconds since 1970-01-01 UTC (thread-safe).
inline std::tm zmLocalTime(int64_t seconds) noexcept
{
    const time_t t = time_t(seconds);
    std::tm out{};
    localtime_r(&t, &out);
    return out;
}
