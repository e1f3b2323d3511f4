/// \file
/// The system's monotonic clock in nanoseconds (private). Inline, since the stopwatch reads it on
/// every query; the one platform call of the stopwatch, so a port replaces this header.
#pragma once

#include <cstdint>
#include <time.h>

/// Nanoseconds of the monotonic clock plus \p offset. The offset joins the nanosecond part before
/// the seconds are scaled, which keeps the arithmetic after the clock reading short.
inline int64_t zmMonotonicNanoseconds(int64_t offset = 0) noexcept
{
    timespec ts;
    clock_gettime(CLOCK_MONOTONIC, &ts);
    return int64_t(ts.tv_sec) * 1000000000 + (ts.tv_nsec + offset);
}
