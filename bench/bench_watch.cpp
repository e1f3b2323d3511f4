// The stopwatch against the clock it reads: reading a running watch vs one bare reading of the
// monotonic clock.

#include "zmbench.h"

#include <zmlib/ZmWatch.h>

#include <time.h>

namespace {

ZMBENCH_TARGET("ZmWatch_getTime2", 1.2,
               "`ZmWatch::getTime2()` of a running watch (clock reading, tick arithmetic, conversion to "
               "seconds) vs a bare `clock_gettime(CLOCK_MONOTONIC)` call, the least a user could do.");

void GetTime2Zm(benchmark::State& state)
{
    ZmWatch watch(true);
    for (auto _ : state) {
        benchmark::DoNotOptimize(watch.getTime2());
    }
    state.SetLabel("ZmWatch::getTime2");
}
BENCHMARK(GetTime2Zm)->Name("ZmWatch_getTime2/zm");

void GetTime2Peer(benchmark::State& state)
{
    timespec ts;
    for (auto _ : state) {
        clock_gettime(CLOCK_MONOTONIC, &ts);
        benchmark::DoNotOptimize(ts);
    }
    state.SetLabel("clock_gettime(CLOCK_MONOTONIC)");
}
BENCHMARK(GetTime2Peer)->Name("ZmWatch_getTime2/peer");

} // namespace
