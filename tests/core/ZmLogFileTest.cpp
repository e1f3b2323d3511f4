#include "LogCapture.h"
#include "ScratchDir.h"

#include <zmlib/ZmLogFile.h>

#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

namespace {

// True when \p text has the shape of \p pattern, where '#' stands for one digit and every other
// character for itself.
bool hasShape(const std::string& text, const std::string& pattern)
{
    if (text.size() != pattern.size()) {
        return false;
    }
    for (size_t i = 0; i < text.size(); ++i) {
        if (pattern[i] == '#' ? !std::isdigit(static_cast<unsigned char>(text[i])) : text[i] != pattern[i]) {
            return false;
        }
    }
    return true;
}

// The log is process-wide: every test leaves its settings as it found them.
class ZmLogFileTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        ZmLogFile& log = getTheLogInstance();
        m_folder = log.baseFolder();
        m_count = log.maxNumLogFiles();
        m_size = log.maxLogFileSizeInBytes();
        m_format = log.dateTimeFormat();
        m_module = log.defaultModule();
    }
    void TearDown() override
    {
        ZmLogFile& log = getTheLogInstance();
        log.close();
        log.setBaseFolder(m_folder);
        log.setMaxNumLogFiles(m_count);
        log.setMaxLogFileSizeInBytes(m_size);
        log.setDateTimeFormat(m_format);
        log.setDefaultModule(m_module.c_str());
    }

    // The names of the log files in \p dir, sorted.
    static std::vector<std::string> logFiles(const std::string& dir)
    {
        std::vector<std::string> names;
        for (const auto& e : std::filesystem::directory_iterator(dir)) {
            if (e.path().extension() == ".log") {
                names.push_back(e.path().filename());
            }
        }
        std::sort(names.begin(), names.end());
        return names;
    }
    static std::vector<std::string> readLines(const std::string& path)
    {
        std::ifstream in(path);
        std::vector<std::string> lines;
        for (std::string line; std::getline(in, line);) {
            lines.push_back(line);
        }
        return lines;
    }

    std::string m_folder;
    int64_t m_count = 0;
    uint64_t m_size = 0;
    ZmLogFile::DateTimeFormat m_format = ZmLogFile::TimeOfDay;
    std::string m_module;
};

TEST(ZmLogLevel, TextForms)
{
    const char* expected[] = {"D", "I", "W", "E", "C", ""};
    for (int level = 0; level <= 5; ++level) {
        EXPECT_STREQ(ZmLogLevelToString(ZmLogLevel(level)), expected[level]);
    }
    // The first character decides.
    const struct {
        const char* text;
        ZmLogLevel level;
        bool ok;
    } cases[] = {{"warning", ZmLogWarning, true}, {"Debug", ZmLogDebug, true},   {"error", ZmLogError, true},
                 {"Info", ZmLogInfo, true},       {"crit", ZmLogCritical, true}, {"x", ZmLogCritical, false},
                 {nullptr, ZmLogCritical, false}};
    for (const auto& c : cases) {
        bool ok = !c.ok;
        EXPECT_EQ(ZmLogLevelFromString(c.text, &ok), c.level) << (c.text ? c.text : "null");
        EXPECT_EQ(ok, c.ok) << (c.text ? c.text : "null");
    }
    EXPECT_EQ(ZmLogLevelFromString("I", nullptr), ZmLogInfo);
}

TEST_F(ZmLogFileTest, LineLayoutPerFormatAndLevel)
{
    ZmLogFile& log = getTheLogInstance();
    LogCapture capture(ZmLogInfo);
    log.trace(ZmLogDebug, "Mod", "dropped");
    char before[16];
    const time_t t0 = time(nullptr);
    strftime(before, sizeof before, "%H:%M:%S", localtime(&t0));
    log.trace(ZmLogInfo, "Mod", "text");
    char after[16];
    const time_t t1 = time(nullptr);
    strftime(after, sizeof after, "%H:%M:%S", localtime(&t1));
    ASSERT_EQ(LogCapture::lines().size(), 1u);
    const std::string line = LogCapture::lines()[0];
    ASSERT_TRUE(hasShape(line, "1|##:##:##.###:   [Mod] text\n")) << line;
    EXPECT_GE(line.substr(2, 8), before);
    EXPECT_LE(line.substr(2, 8), after);

    log.setDateTimeFormat(ZmLogFile::DateAndTime);
    log.setDefaultModule("Default");
    log.tracef(ZmLogCritical, nullptr, "%d-%s", 7, "x");
    EXPECT_TRUE(hasShape(LogCapture::lines()[1], "4|####-##-## ##:##:##.###: C [Default] 7-x\n"))
        << LogCapture::lines()[1];
    log.setDateTimeFormat(ZmLogFile::NoDateTime);
    log.warn("", "w");
    log.errorf("e%d\n", 1); // its own line feed: no second one
    log.writeLine(ZmLogInfo, "already ends\n");
    log.print("P", "plain");
    log.printf("n=%d", 3);
    {
        ZmLogFileDefaultModuleModifier scoped("Scoped");
        log.trace(ZmLogWarning, nullptr, nullptr);
    }
    log.trace(ZmLogWarning, nullptr, "back");
    const std::vector<std::string> expected = {
        "2|W [Default] w\n", "3|E [Default] e1\n", "1|already ends\n",    "1|[P] plain\n",
        "1|n=3\n",           "2|W [Scoped] \n",    "2|W [Default] back\n"};
    EXPECT_EQ(std::vector<std::string>(LogCapture::lines().begin() + 2, LogCapture::lines().end()), expected);
}

TEST_F(ZmLogFileTest, CallbackLevelAndDisablers)
{
    ZmLogFile& log = getTheLogInstance();
    LogCapture capture(ZmLogDebug);
    log.setWriteCallback(log.writeCallback(), ZmLogWarning);
    EXPECT_TRUE(log.debugEnabled()) << "the log level is still debug";
    {
        ZmLogFileScopedWriteCallbackDisabler off;
        EXPECT_EQ(log.writeCallback(), nullptr);
        log.trace(ZmLogError, "M", "unseen");
    }
    ZmLogFileWriteCallbackDisabler disabler;
    disabler.restoreWriteCallback(); // nothing taken yet: a no-op
    ASSERT_NE(log.writeCallback(), nullptr);
    log.trace(ZmLogInfo, "M", "below the callback level");
    log.trace(ZmLogWarning, "M", "seen");
    disabler.disableWriteCallback();
    disabler.disableWriteCallback();
    log.trace(ZmLogError, "M", "unseen");
    disabler.restoreWriteCallback();
    EXPECT_EQ(log.writeCallbackLogLevel(), ZmLogWarning);
    ASSERT_EQ(LogCapture::lines().size(), 1u);
    EXPECT_NE(LogCapture::lines()[0].find("W [M] seen"), std::string::npos);
}

TEST_F(ZmLogFileTest, EightThreadsThroughRotationLoseNothing)
{
    ScratchDir dir;
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setMaxNumLogFiles(0);
    log.setMaxLogFileSizeInBytes(32 * 1024);
    ASSERT_TRUE(log.open(true));
    EXPECT_FALSE(log.open(false)) << "already open";
    constexpr int kThreads = 8;
    constexpr int kLines = 20000;
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([t, &log] {
            for (int i = 0; i < kLines; ++i) {
                log.tracef(ZmLogInfo, "T", "t%d n%d", t, i);
            }
        });
    }
    for (std::thread& t : threads) {
        t.join();
    }
    log.close();

    const std::vector<std::string> files = logFiles(dir.path());
    ASSERT_GT(files.size(), 50u) << "rotation must have happened many times";
    std::vector<int> next(kThreads, 0);
    for (size_t k = 0; k < files.size(); ++k) {
        const std::vector<std::string> lines = readLines(dir / files[k]);
        ASSERT_FALSE(lines.empty());
        size_t first = 0;
        if (k > 0) {
            EXPECT_EQ(lines[0], "This file continues " + (dir / files[k - 1])) << files[k];
            first = 1;
        }
        for (size_t i = first; i < lines.size(); ++i) {
            // "HH:MM:SS.mmm:   [T] t<thread> n<number>", whole
            const std::string& line = lines[i];
            ASSERT_TRUE(line.size() > 24 && hasShape(line.substr(0, 24), "##:##:##.###:   [T] t# n"))
                << files[k] << ": " << line;
            const int t = line[21] - '0';
            ASSERT_LT(t, kThreads);
            ASSERT_EQ(line.substr(24), std::to_string(next[t])) << "thread " << t << " in " << files[k];
            ++next[t];
        }
    }
    EXPECT_EQ(next, std::vector<int>(kThreads, kLines));
}

TEST_F(ZmLogFileTest, TheFirstLineBeyondTheSizeLimitStartsTheNextFile)
{
    ScratchDir dir;
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setMaxLogFileSizeInBytes(100);
    log.setDateTimeFormat(ZmLogFile::NoDateTime);
    ASSERT_TRUE(log.open(true));
    const std::string first = log.filePath().getString();
    for (int i = 1; i <= 5; ++i) {
        log.tracef(ZmLogInfo, "M", "line %d of thirty bytes.", i); // "  [M] " + 23 + "\n" = 30 bytes
    }
    log.close();
    const std::vector<std::string> files = logFiles(dir.path());
    ASSERT_EQ(files.size(), 2u);
    EXPECT_EQ(dir / files[0], first);
    EXPECT_EQ(readLines(dir / files[0]).size(), 4u) << "120 bytes: only then is the limit exceeded";
    const std::vector<std::string> second = readLines(dir / files[1]);
    ASSERT_EQ(second.size(), 2u);
    EXPECT_EQ(second[0], "This file continues " + first);
    EXPECT_EQ(second[1], "  [M] line 5 of thirty bytes.");
}

TEST_F(ZmLogFileTest, DateFoldersHoldTheFilesAndAreNeverPruned)
{
    ScratchDir dir;
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setDateFoldersEnabled(true);
    log.setMaxNumLogFiles(1);
    ASSERT_TRUE(log.open(true));
    ASSERT_TRUE(log.open(true));
    const std::string path = log.filePath().getString();
    log.close();
    log.setDateFoldersEnabled(false);
    char today[16];
    const time_t now = time(nullptr);
    strftime(today, sizeof today, "%Y%m%d", localtime(&now));
    const std::string folder = path.substr(0, path.rfind('/'));
    EXPECT_TRUE(folder == dir / today || folder < dir / today) << folder << " (midnight may have passed)";
    EXPECT_EQ(logFiles(folder).size(), 2u) << "no clean-up with date folders";
}

TEST_F(ZmLogFileTest, OpenPrunesTheOldestFilesAndTheirDumps)
{
    ScratchDir dir;
    for (const char* name :
         {"20000101-000000-1000001.log", "20000101-000000-1000002.log", "20000101-000000-1000001.dmp",
          "20000102-000000-1000001.log", "20000102-000000-1000001.dmp", "20000103-000000-1000001.log",
          "20000104-000000-1000001.log", "20000104-000000-1000001.dmp", "other.txt"}) {
        std::ofstream(dir / name) << "x";
    }
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setMaxNumLogFiles(3);
    ASSERT_TRUE(log.open(true));
    const std::string opened = log.filePath().getString();
    log.close();
    const std::vector<std::string> left = logFiles(dir.path());
    ASSERT_EQ(left.size(), 3u);
    EXPECT_EQ(left[0], "20000103-000000-1000001.log");
    EXPECT_EQ(left[1], "20000104-000000-1000001.log");
    EXPECT_EQ(dir / left[2], opened);
    for (const char* name : {"20000101-000000-1000001.dmp", "20000102-000000-1000001.dmp"}) {
        EXPECT_FALSE(std::filesystem::exists(dir / name)) << name;
    }
    for (const char* name : {"20000104-000000-1000001.dmp", "other.txt"}) {
        EXPECT_TRUE(std::filesystem::exists(dir / name)) << name;
    }
}

// A negative limit disables the clean-up like 0, through the setter and through the environment
// (read when the log is created: a real zmtool run, whose log lives in $TMPDIR).
TEST_F(ZmLogFileTest, NegativeFileLimitDeletesNothing)
{
    ScratchDir dir;
    const std::vector<std::string> old = {"20000101-000000-1000001.log", "20000102-000000-1000001.log"};
    for (const std::string& name : old) {
        std::ofstream(dir / name) << "x";
    }
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setMaxNumLogFiles(-1);
    ASSERT_TRUE(log.open(true));
    log.close();
    EXPECT_EQ(logFiles(dir.path()).size(), old.size() + 1);

    const char* tool = std::getenv("ZMTOOL");
    if (tool == nullptr || tool[0] == 0) {
        GTEST_SKIP() << "ZMTOOL is not set (the test build sets it to the built zmtool)";
    }
    const std::string demoLogs = dir / "zmtool-logs"; // the demo's log folder under $TMPDIR
    std::filesystem::create_directory(demoLogs);
    for (const std::string& name : old) {
        std::ofstream(demoLogs + "/" + name) << "x";
    }
    const std::string command =
        "TMPDIR='" + dir.path() + "/' KORVO_MAXNUMLOGFILES=-3 '" + tool + "' demo >/dev/null 2>&1";
    ASSERT_EQ(std::system(command.c_str()), 0);
    const std::vector<std::string> left = logFiles(demoLogs);
    EXPECT_EQ(left.size(), old.size() + 1) << "the demo's own log joins the two";
    EXPECT_TRUE(std::includes(left.begin(), left.end(), old.begin(), old.end()));
}

// The default module's text stays valid while another thread replaces it (it used to point into a
// string that the next setDefaultModule freed: a use after free under ASan, a race under TSan).
TEST_F(ZmLogFileTest, DefaultModuleTextSurvivesConcurrentChanges)
{
    ZmLogFile& log = getTheLogInstance();
    const std::string names[] = {"reader", "a module name long enough to need a bigger block"};
    std::atomic<bool> stop{false};
    std::thread setter([&] {
        for (int i = 0; i < 20000; ++i) {
            log.setDefaultModule(names[i % 2].c_str());
        }
        stop = true;
    });
    int bad = 0;
    while (!stop) {
        const char* text = log.defaultModule();
        const std::string copy(text); // reads the text after the lock is gone
        bad += copy != names[0] && copy != names[1] && !copy.empty();
        const ZmLogFileDefaultModuleModifier scoped("scoped");
    }
    setter.join();
    EXPECT_EQ(bad, 0);
    log.setDefaultModule(names[1].c_str());
    const char* before = log.defaultModule();
    log.setDefaultModule("another");
    EXPECT_STREQ(before, names[1].c_str()); // the old text is still there
    EXPECT_STREQ(log.defaultModule(), "another");
}

TEST_F(ZmLogFileTest, UnwritableFolderKeepsOutputOnStandardOutput)
{
    ScratchDir dir;
    std::ofstream(dir / "file") << "x";
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir / "file/sub"); // below a regular file: not even root can make it
    log.close();
    EXPECT_FALSE(log.open(true));
    EXPECT_FALSE(log.isOpen());
    testing::internal::CaptureStdout();
    log.trace(ZmLogWarning, "M", "still here");
    log.flush();
    EXPECT_NE(testing::internal::GetCapturedStdout().find("W [M] still here\n"), std::string::npos);
}

TEST_F(ZmLogFileTest, RemovingTheFolderWhileLoggingCrashesNothing)
{
    ScratchDir dir;
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(dir.path());
    log.setMaxLogFileSizeInBytes(4096);
    ASSERT_TRUE(log.open(true));
    std::atomic<bool> done{false};
    std::thread remover([&] {
        while (!done) {
            ScratchDir::removeTree(dir.path());
            std::this_thread::yield();
        }
    });
    std::vector<std::thread> writers;
    for (int t = 0; t < 4; ++t) {
        writers.emplace_back([&log] {
            for (int i = 0; i < 5000; ++i) {
                log.tracef(ZmLogInfo, "R", "line %d", i);
            }
        });
    }
    for (std::thread& t : writers) {
        t.join();
    }
    done = true;
    remover.join();
    ASSERT_TRUE(log.open(true)) << "the folder is made again";
    log.trace(ZmLogInfo, "R", "after");
    log.close();
    const std::vector<std::string> files = logFiles(dir.path());
    ASSERT_FALSE(files.empty());
    const std::vector<std::string> lines = readLines(dir / files.back());
    ASSERT_FALSE(lines.empty());
    EXPECT_NE(lines.back().find("[R] after"), std::string::npos);
}

TEST_F(ZmLogFileTest, ConsoleRedirectionAndRelativeStampsInAChild)
{
    // A child process: the redirection of its standard streams cannot be undone.
    ScratchDir dir;
    std::fflush(nullptr);
    const pid_t pid = fork();
    if (pid == 0) {
        ZmLogFile& log = getTheLogInstance();
        log.setBaseFolder(dir.path());
        log.setConsoleToLogEnabled(true);
        if (!log.open(true)) {
            _exit(1);
        }
        std::printf("from printf\n");
        std::fflush(stdout); // stderr is unbuffered and shares the descriptor's offset
        std::fprintf(stderr, "from stderr\n");
        log.print(nullptr, "via log");
        log.resetTimeStamp();
        ZmString stamp;
        log.timeString(stamp, ZmLogFile::TimeOfDay);
        log.print(nullptr, stamp.getString());
        log.flush();
        _exit(0);
    }
    int status = -1;
    waitpid(pid, &status, 0);
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "child status " << status;
    const std::vector<std::string> files = logFiles(dir.path());
    ASSERT_EQ(files.size(), 1u);
    const std::vector<std::string> lines = readLines(dir / files[0]);
    ASSERT_EQ(lines.size(), 4u);
    EXPECT_EQ(lines[0], "from printf");
    EXPECT_EQ(lines[1], "from stderr");
    EXPECT_EQ(lines[2], "via log");
    EXPECT_TRUE(hasShape(lines[3], "00:00:0#.###")) << lines[3];
}

} // namespace
