// Runs the built zmtool (path in $ZMTOOL) as a user would.
#include <zmlib/ZmUUID.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

namespace {

struct ToolRun {
    int status = -1; ///< exit status, -1 if it did not exit normally
    std::string out;
    std::string err;
};

std::string readAll(int fd)
{
    std::string s;
    char buf[4096];
    ssize_t r;
    while ((r = read(fd, buf, sizeof buf)) > 0) {
        s.append(buf, size_t(r));
    }
    return s;
}

/// Runs "zmtool uuid ARGS..." with stdout and stderr captured.
ToolRun runUuid(const char* tool, std::vector<std::string> args)
{
    ToolRun run;
    int out[2];
    int err[2];
    if (pipe(out) != 0 || pipe(err) != 0) {
        return run;
    }
    args.insert(args.begin(), {tool, "uuid"});
    const pid_t pid = fork();
    if (pid == 0) {
        dup2(out[1], 1);
        dup2(err[1], 2);
        close(out[0]);
        close(err[0]);
        close(out[1]);
        close(err[1]);
        std::vector<char*> argv;
        for (std::string& a : args) {
            argv.push_back(a.data());
        }
        argv.push_back(nullptr);
        execv(tool, argv.data());
        _exit(127);
    }
    close(out[1]);
    close(err[1]);
    run.out = readAll(out[0]); // stderr stays far below a pipe's buffer
    run.err = readAll(err[0]);
    close(out[0]);
    close(err[0]);
    int status = 0;
    if (pid > 0 && waitpid(pid, &status, 0) == pid && WIFEXITED(status)) {
        run.status = WEXITSTATUS(status);
    }
    return run;
}

std::vector<std::string> linesOf(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        lines.push_back(line);
    }
    return lines;
}

/// 32 upper-case hexadecimal characters with the version and variant of a random UUID.
bool isPlainV4(const std::string& s)
{
    return s.size() == 32 && s.find_first_not_of("0123456789ABCDEF") == std::string::npos && s[12] == '4' &&
           std::string("89AB").find(s[16]) != std::string::npos;
}

const char* tool()
{
    const char* path = std::getenv("ZMTOOL");
    return path != nullptr && path[0] != 0 && access(path, X_OK) == 0 ? path : nullptr;
}

} // namespace

TEST(ZmtoolUuid, PrintsDistinctUuidsInBothForms)
{
    if (tool() == nullptr) {
        GTEST_SKIP() << "ZMTOOL does not name the built zmtool";
    }
    ToolRun one = runUuid(tool(), {});
    ASSERT_EQ(one.status, 0) << one.err;
    EXPECT_EQ(one.err, "");
    ASSERT_EQ(linesOf(one.out).size(), 1u) << one.out;
    EXPECT_TRUE(isPlainV4(linesOf(one.out)[0])) << one.out;
    EXPECT_EQ(one.out.back(), '\n');

    ToolRun many = runUuid(tool(), {"-n", "1000"});
    ASSERT_EQ(many.status, 0) << many.err;
    const std::vector<std::string> plain = linesOf(many.out);
    ASSERT_EQ(plain.size(), 1000u);
    for (const std::string& s : plain) {
        ASSERT_TRUE(isPlainV4(s)) << s;
    }
    EXPECT_EQ(std::set<std::string>(plain.begin(), plain.end()).size(), 1000u);

    ToolRun braced = runUuid(tool(), {"--formatted", "-n", "50"});
    ASSERT_EQ(braced.status, 0) << braced.err;
    const std::vector<std::string> forms = linesOf(braced.out);
    ASSERT_EQ(forms.size(), 50u);
    std::set<std::string> distinct;
    for (const std::string& s : forms) {
        ASSERT_EQ(s.size(), 38u) << s;
        ASSERT_TRUE(s[0] == '{' && s[9] == '-' && s[14] == '-' && s[19] == '-' && s[24] == '-' &&
                    s[37] == '}')
            << s;
        const std::string hex =
            s.substr(1, 8) + s.substr(10, 4) + s.substr(15, 4) + s.substr(20, 4) + s.substr(25, 12);
        ASSERT_TRUE(isPlainV4(hex)) << s;
        ASSERT_EQ(ZmUUID::fromFormattedString(s.c_str()).toString().getString(), hex);
        distinct.insert(s);
    }
    EXPECT_EQ(distinct.size(), 50u);
}

TEST(ZmtoolUuid, BadArgumentsGiveUsageAndExitTwo)
{
    if (tool() == nullptr) {
        GTEST_SKIP() << "ZMTOOL does not name the built zmtool";
    }
    const std::vector<std::vector<std::string>> bad = {
        {"-n"},
        {"-n", "0"},
        {"-n", "-3"},
        {"-n", "x"},
        {"-n", "5x"},
        {"-n", ""},
        {"-n", "99999999999999999999999"},
        {"--bogus"},
        {"-n", "2", "extra"},
        {"--formatted", "-n"},
    };
    for (const std::vector<std::string>& args : bad) {
        std::string shown;
        for (const std::string& a : args) {
            shown += " '" + a + "'";
        }
        ToolRun r = runUuid(tool(), args);
        EXPECT_EQ(r.status, 2) << shown;
        EXPECT_EQ(r.out, "") << shown;
        EXPECT_EQ(r.err.rfind("zmtool uuid: ", 0), 0u) << shown << ": " << r.err;
        EXPECT_NE(r.err.find("usage: zmtool uuid [-n N] [--formatted]"), std::string::npos) << shown;
    }
}
