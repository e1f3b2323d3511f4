// Runs the built zmtool (path in $ZMTOOL) as a user would: `zmtool orient`.
#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

extern char** environ;

namespace {

struct ToolRun {
    int status = -1; ///< exit status, -1 if it did not exit normally
    std::string out;
    std::string err;
};

const char* tool()
{
    const char* path = std::getenv("ZMTOOL");
    return path != nullptr && path[0] != 0 && access(path, X_OK) == 0 ? path : nullptr;
}

/// "zmtool orient ARGS...", its standard output and error caught in files.
ToolRun orient(std::vector<std::string> args)
{
    ScratchDir dir;
    args.insert(args.begin(), {tool(), "orient"});
    std::vector<char*> argv;
    for (std::string& a : args) {
        argv.push_back(a.data());
    }
    argv.push_back(nullptr);
    posix_spawn_file_actions_t files;
    posix_spawn_file_actions_init(&files);
    posix_spawn_file_actions_addopen(&files, 1, (dir / "out").c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawn_file_actions_addopen(&files, 2, (dir / "err").c_str(), O_WRONLY | O_CREAT, 0600);
    pid_t pid = -1;
    int status = 0;
    ToolRun run;
    if (posix_spawn(&pid, argv[0], &files, nullptr, argv.data(), environ) == 0 &&
        waitpid(pid, &status, 0) == pid && WIFEXITED(status)) {
        run = {WEXITSTATUS(status), dir.read("out"), dir.read("err")};
    }
    posix_spawn_file_actions_destroy(&files);
    return run;
}

} // namespace

TEST(ZmtoolOrient, PrintsLettersAndViewClass)
{
    if (tool() == nullptr) {
        GTEST_SKIP() << "ZMTOOL does not name the built zmtool";
    }
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"1", "0", "0", "0", "0", "1", "0", "0", "0", "0", "1", "0", "0", "0", "0", "1"}, "L/A/R/P axial\n"},
        {std::vector<std::string>(16, "0"), "L/R/R/L none\n"},
        {{"-0", "-1e-3", "0.5", "0", "0", "0", "-2", "0", "1", "0", "0", "0", "4", "5", "6", "1"},
         "H/R/F/L coronal\n"},
        {{"--rotate", "z,90"}, "P/L/A/R axial\n"},
        {{"--rotate", "x,90"}, "L/F/R/H coronal\n"},
        {{"--rotate", "0,2,0,90"}, "F/A/H/P sagittal\n"},
        {{"--rotate", "z,90", "--rotate", "x,90"}, "H/L/F/R coronal\n"}, // z first, then x
        {{"--rotate", "x,90", "--rotate", "z,90"}, "P/F/A/H sagittal\n"},
        {{"--rotate", "1,1,1,120"}, "P/F/A/H sagittal\n"},
    };
    for (const auto& c : cases) {
        const ToolRun r = orient(c.first);
        EXPECT_TRUE(r.status == 0 && r.out == c.second && r.err.empty()) << c.second << r.out << r.err;
    }
}

TEST(ZmtoolOrient, BadArgumentsAreNamedAndExitTwo)
{
    if (tool() == nullptr) {
        GTEST_SKIP() << "ZMTOOL does not name the built zmtool";
    }
    auto with = [](size_t i, const std::string& v) {
        std::vector<std::string> a(16, "0");
        a[i] = v;
        return a;
    };
    // The arguments and the one line that must name what is wrong.
    const std::vector<std::pair<std::vector<std::string>, std::string>> bad = {
        {{}, "needs 16 matrix entries or --rotate AXIS,ANGLE"},
        {std::vector<std::string>(15, "1"), "expected 16 matrix entries, got 15"},
        {with(5, "1x"), "'1x' is not a finite number (matrix entry M11)"},
        {with(0, "nan"), "'nan' is not a finite number (matrix entry M00)"},
        {with(7, "1e39"), "'1e39' is not a finite number (matrix entry M13)"},
        {with(2, ""), "'' is not a finite number (matrix entry M02)"},
        {with(3, " 1"), "' 1' is not a finite number (matrix entry M03)"},
        {{"--rotate"}, "--rotate needs AXIS,ANGLE"},
        {{"--rotate", "w,90"}, "'--rotate w,90': the axis 'w' is not x, y or z"},
        {{"--rotate", "x,inf"}, "'--rotate x,inf': the angle 'inf' is not a finite number"},
        {{"--rotate", "0,0,0,90"}, "'--rotate 0,0,0,90': the axis must not be zero"},
        {{"--rotate", "x,90,1"}, "'--rotate x,90,1': expected AXIS,ANGLE or X,Y,Z,ANGLE"},
        {{"--rotate", "z,90", "1"}, "'1': matrix entries cannot be combined with --rotate"},
        {{"--bogus"}, "unknown option '--bogus'"},
    };
    for (const auto& b : bad) {
        const ToolRun r = orient(b.first);
        EXPECT_TRUE(r.status == 2 && r.out.empty()) << b.second;
        EXPECT_EQ(r.err.substr(0, r.err.find('\n')), "zmtool orient: " + b.second);
        EXPECT_NE(r.err.find("\nusage: zmtool orient M00 M01"), std::string::npos) << r.err;
    }
}
