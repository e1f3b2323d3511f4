#include "LogCapture.h"
#include "ScratchDir.h"

#include <zmlib/ZmProcessInfo.h>
#include <zmlib/ZmTerminateProcess.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <map>
#include <string>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

/// The "Vm..." figures of /proc/<pid>/status in bytes, read independently of the library.
std::map<std::string, uint64_t> vmFigures(pid_t pid)
{
    std::map<std::string, uint64_t> out;
    std::ifstream in("/proc/" + std::to_string(pid) + "/status");
    std::string key;
    uint64_t kb = 0;
    while (in >> key) {
        if (key.rfind("Vm", 0) == 0 && in >> kb) {
            out[key.substr(0, key.size() - 1)] = kb * 1024;
        }
    }
    return out;
}

std::string g_exitMarker;

} // namespace

TEST(ZmProcessInfo, FiguresMatchProcStatusAndAMissingProcessHasNone)
{
    const auto before = vmFigures(getpid());
    const ZmProcessInfo info(getpid());
    const auto after = vmFigures(getpid());
    ASSERT_TRUE(info.found());
    EXPECT_TRUE(before.at("VmHWM") <= info.peakWorkingSetSize() &&
                info.peakWorkingSetSize() <= after.at("VmHWM"));
    EXPECT_TRUE(before.at("VmPeak") <= info.peakPagefileUsage() &&
                info.peakPagefileUsage() <= after.at("VmPeak"));
    const uint64_t slack = 64 << 20; // current figures move a little between the readings
    EXPECT_LE(info.workingSetSize(), after.at("VmRSS") + slack);
    EXPECT_GE(info.workingSetSize() + slack, before.at("VmRSS"));
    EXPECT_LE(info.pagefileUsage(), after.at("VmData") + slack);
    EXPECT_GE(info.pagefileUsage() + slack, before.at("VmData"));

    LogCapture capture(ZmLogInfo);
    info.log();
    ZmProcessInfo missing(getpid());
    missing = ZmProcessInfo(999999999); // above any kernel's pid limit
    EXPECT_FALSE(missing.found());
    EXPECT_EQ(missing.workingSetSize() + missing.peakWorkingSetSize() + missing.pagefileUsage() +
                  missing.peakPagefileUsage(),
              0u);
    missing.log(); // writes nothing
    ASSERT_EQ(LogCapture::lines().size(), 1u);
    const std::string expected =
        "  [ProcessInfo] Working set size: " + std::to_string(info.workingSetSize() / 1024) + "Kb (peak " +
        std::to_string(info.peakWorkingSetSize() / 1024) + "Kb)\n";
    const std::string line = LogCapture::lines()[0];
    EXPECT_EQ(line.substr(0, 2), "1|");
    EXPECT_EQ(line.substr(line.size() - expected.size()), expected) << line;
}

TEST(ZmTerminateProcess, EndsAtOnceWithTheStatusAndRunsNoCleanUp)
{
    ScratchDir dir;
    ASSERT_FALSE(dir.path().empty());
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        g_exitMarker = dir / "atexit-ran";
        std::atexit([] {
            if (FILE* f = std::fopen(g_exitMarker.c_str(), "w")) {
                std::fclose(f);
            }
        });
        if (FILE* f = std::fopen((dir / "buffered").c_str(), "w")) {
            std::fputs("never flushed", f);
        }
        ZmTerminateProcess(42);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    EXPECT_EQ(WEXITSTATUS(status), 42);
    struct stat st;
    EXPECT_NE(stat((dir / "atexit-ran").c_str(), &st), 0); // no exit handler ran
    ASSERT_EQ(stat((dir / "buffered").c_str(), &st), 0);
    EXPECT_EQ(st.st_size, 0); // no stream was flushed
}
