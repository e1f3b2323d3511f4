// Runs a program in a child process, with its output collected in files so that no pipe can fill.
#pragma once

#include "ScratchDir.h"

#include <fcntl.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <string>
#include <vector>

using Args = std::vector<std::string>;

struct Outcome {
    std::string out;
    std::string err;
    int status = -1; // exit status, or -1 when the program did not exit normally
};

struct RunOptions {
    std::string inputPath; // standard input ("" for /dev/null)
    // The program starts with a SIGINT pending (blocked until it unblocks it), as if Ctrl-C had
    // been pressed at its first instruction.
    bool pendingInterrupt = false;
};

// Runs \p argv (found through PATH) in \p dir; stdout and stderr go to files in \p dir.
inline Outcome runProgram(const ScratchDir& dir, const std::vector<std::string>& argv,
                          const RunOptions& options = {})
{
    const std::string outPath = dir / ".stdout";
    const std::string errPath = dir / ".stderr";
    const pid_t pid = fork();
    if (pid == 0) {
        const std::string& input = options.inputPath;
        const int in = open(input.empty() ? "/dev/null" : input.c_str(), O_RDONLY);
        const int out = open(outPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
        const int err = open(errPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
        if (in < 0 || out < 0 || err < 0 || chdir(dir.path().c_str()) != 0 || dup2(in, 0) < 0 ||
            dup2(out, 1) < 0 || dup2(err, 2) < 0) {
            _exit(126);
        }
        signal(SIGINT, SIG_DFL);
        if (options.pendingInterrupt) {
            sigset_t set;
            sigemptyset(&set);
            sigaddset(&set, SIGINT);
            sigprocmask(SIG_BLOCK, &set, nullptr);
            raise(SIGINT);
        }
        std::vector<char*> args;
        for (const std::string& a : argv) {
            args.push_back(const_cast<char*>(a.c_str()));
        }
        args.push_back(nullptr);
        execvp(args[0], args.data());
        _exit(127);
    }
    Outcome r;
    int status = 0;
    if (pid > 0 && waitpid(pid, &status, 0) == pid && WIFEXITED(status)) {
        r.status = WEXITSTATUS(status);
    }
    r.out = dir.read(".stdout");
    r.err = dir.read(".stderr");
    return r;
}

// A test of zmtool in a scratch directory: the test build names the program in ZMTOOL.
class ZmtoolTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        const char* tool = getenv("ZMTOOL");
        if (tool == nullptr || tool[0] == 0) {
            GTEST_SKIP() << "ZMTOOL is not set (the test build sets it to the built zmtool)";
        }
        m_tool = tool;
        ASSERT_FALSE(m_dir.path().empty());
    }

    std::string m_tool;
    ScratchDir m_dir;
};
