/// \file
/// The deadline arithmetic of ZmWaitCondition (private; shared with its tests).
#pragma once

#include <time.h>

/// The absolute deadline of a wait of \p ms milliseconds that starts at the monotonic time \p now.
/// The clock is taken in whole milliseconds first, so a deadline may come up to 1 ms early; that
/// truncation is intended (it keeps the arithmetic of the original millisecond clock).
inline timespec zmWaitConditionDeadline(const timespec& now, unsigned long ms)
{
    const long m = now.tv_nsec / 1000000 + static_cast<long>(ms % 1000);
    timespec deadline;
    deadline.tv_sec = now.tv_sec + static_cast<time_t>(ms / 1000) + m / 1000;
    deadline.tv_nsec = (m % 1000) * 1000000;
    return deadline;
}
