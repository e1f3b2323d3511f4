// Log lines per second to a file, against spdlog's synchronous multi-threaded file sink.
// Both sides write the same bytes: spdlog's pattern is set to the log's default layout
// ("HH:MM:SS.mmm:   [module] text"), at information level, with the same formatted text, no
// flush per line and no rotation. Run with 1 and with 4 threads.

#include "zmbench.h"

#include <zmlib/ZmLogFile.h>

#if ZMBENCH_HAVE_SPDLOG
#include <spdlog/sinks/basic_file_sink.h>
#include <spdlog/spdlog.h>
#endif

#include <ftw.h>
#include <stdlib.h>

#include <memory>
#include <string>

namespace {

ZMBENCH_TARGET(
    "ZmLogFile_tracef", 1.0,
    "One `tracef(ZmLogInfo, \"bench\", \"request %d took %d us, status %s\", ...)` line into a log "
    "file with the default time stamp vs spdlog's `basic_file_sink_mt` with the same pattern and "
    "text. Time per line over all threads (real time).");

std::string& scratch()
{
    static std::string dir;
    if (dir.empty()) {
        const char* tmp = getenv("TMPDIR");
        std::string pattern =
            std::string(tmp != nullptr && tmp[0] != 0 ? tmp : "/tmp") + "/zmbench-log.XXXXXX";
        dir = mkdtemp(pattern.data()) != nullptr ? pattern : "/tmp";
    }
    return dir;
}

void removeScratch()
{
    nftw(
        scratch().c_str(), [](const char* p, const struct stat*, int, struct FTW*) { return ::remove(p); }, 8,
        FTW_DEPTH | FTW_PHYS);
}

void LogZm(benchmark::State& state)
{
    ZmLogFile& log = getTheLogInstance();
    if (state.thread_index() == 0) {
        log.setBaseFolder(scratch());
        log.setMaxLogFileSizeInBytes(0);
        log.setMaxNumLogFiles(0);
        log.setLogLevel(ZmLogInfo);
        log.open(true);
    }
    int i = 0;
    for (auto _ : state) {
        log.tracef(ZmLogInfo, "bench", "request %d took %d us, status %s", i, i * 3, "ok");
        ++i;
    }
    if (state.thread_index() == 0) {
        log.close();
        removeScratch();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(LogZm)->Name("ZmLogFile_tracef/zm")->Threads(1)->Threads(4)->UseRealTime();

#if ZMBENCH_HAVE_SPDLOG
std::shared_ptr<spdlog::logger>& spdLogger()
{
    static std::shared_ptr<spdlog::logger> logger;
    return logger;
}

void LogPeer(benchmark::State& state)
{
    if (state.thread_index() == 0) {
        auto sink = std::make_shared<spdlog::sinks::basic_file_sink_mt>(scratch() + "/peer.log", true);
        spdLogger() = std::make_shared<spdlog::logger>("bench", sink);
        spdLogger()->set_pattern("%H:%M:%S.%e:   [%n] %v");
        spdLogger()->set_level(spdlog::level::info);
    }
    int i = 0;
    // The logger is made by thread 0 before the loop's start barrier: read it inside the loop.
    for (auto _ : state) {
        spdLogger()->info("request {} took {} us, status {}", i, i * 3, "ok");
        ++i;
    }
    if (state.thread_index() == 0) {
        spdLogger().reset();
        removeScratch();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(LogPeer)->Name("ZmLogFile_tracef/peer")->Threads(1)->Threads(4)->UseRealTime();
#else
ZMBENCH_MISSING_PEER("ZmLogFile_tracef/peer", "spdlog (Debian libspdlog-dev) was not found");
#endif

} // namespace
