#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>

#include "LogCapture.h"
#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <fcntl.h>
#include <filesystem>
#include <random>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace {

std::string realPath(const std::string& p)
{
    char* r = ::realpath(p.c_str(), nullptr);
    const std::string s = r != nullptr ? r : "";
    std::free(r);
    return s;
}

/// A scratch directory (its real path); restores the current directory, $TMPDIR and $HOME.
class ZmFilenameFs : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_FALSE(m_scratch.path().empty());
        m_dir = realPath(m_scratch.path());
        m_cwd = std::filesystem::current_path();
        for (const char* var : {"TMPDIR", "HOME"}) {
            const char* v = std::getenv(var);
            m_env.emplace_back(var, v != nullptr ? v : "\x01");
        }
    }
    void TearDown() override
    {
        std::filesystem::current_path(m_cwd);
        for (const auto& [var, value] : m_env) {
            value == "\x01" ? ::unsetenv(var.c_str()) : ::setenv(var.c_str(), value.c_str(), 1);
        }
    }
    std::string path(const std::string& rel) const { return m_dir + "/" + rel; }
    void write(const std::string& rel, const std::string& text = "") const { m_scratch.write(rel, text); }
    std::string read(const std::string& rel) const { return m_scratch.read(rel); }
    ScratchDir m_scratch;
    std::string m_dir;
    std::filesystem::path m_cwd;
    std::vector<std::pair<std::string, std::string>> m_env;
};

} // namespace

TEST(ZmFilename, PathTextRules)
{
    const struct {
        const char *path, *base, *ext, *dir;
    } cases[] = {{"a/b\\c.txt", "c.txt", ".txt", "a/b"},
                 {"dir.d/file", "file", "", "dir.d"},
                 {"x/a.tar.gz", "a.tar.gz", ".gz", "x"},
                 {".rc", ".rc", ".rc", "."},
                 {"/top", "top", "", "/"},
                 {"a/b/", "", "", "a/b"},
                 {"C:/x.y", "x.y", ".y", "C:/"},
                 {"", "", "", "."}};
    for (const auto& c : cases) {
        const ZmFilename f(c.path);
        EXPECT_STREQ(f.basename(), c.base) << c.path;
        EXPECT_STREQ(f.extension(), c.ext) << c.path;
        EXPECT_STREQ(f.dirname().getString(), c.dir) << c.path;
        ZmFilename cut(c.path);
        cut.removeExtension();
        EXPECT_EQ(std::string(cut.getString()) + c.ext, c.path);
    }
    EXPECT_STREQ(ZmFilename::basename(nullptr), "");
    ZmFilename win("C:\\data\\x");
    win.fixSlashes();
    EXPECT_STREQ(win.getString(), "C:/data/x");

    for (const char* absolute : {"/x", "C:/x", "C:\\x", "C:/"}) {
        EXPECT_FALSE(ZmFilename(absolute).isRelative()) << absolute;
    }
    for (const char* relative : {"C:x", "C:", "\\x", "x/y", ""}) {
        EXPECT_TRUE(ZmFilename(relative).isRelative()) << relative;
    }

    // Above a root there is nothing to climb to; a relative name keeps its leading "..".
    const char* packs[][2] = {{"./a//b/../c/", "a/c/"}, {"a/..", "."},         {"a/../../b/./c", "../b/c"},
                              {"/../x", "/x"},          {"C:/a/../..", "C:/"}, {"", ""}};
    for (const auto& p : packs) {
        ZmFilename f(p[0]);
        f.pack();
        EXPECT_STREQ(f.getString(), p[1]) << p[0];
    }

    const char* joins[][3] = {
        {"a", "b", "a/b"}, {"a//", "/b/c", "a/b/c"}, {"/", "b", "/b"}, {"", "b", "b"}, {"a", "", "a"}};
    for (const auto& j : joins) {
        ZmFilename f(j[0]);
        f.appendFile(j[1]);
        EXPECT_STREQ(f.getString(), j[2]) << j[0] << " + " << j[1];
    }
    ZmString out;
    ZmFilename::enumerate(out, "d.x/a.txt", 2);
    EXPECT_STREQ(out.getString(), "d.x/a.2.txt");
    ZmFilename::enumerate(out, "dir.d/file", 3);
    EXPECT_STREQ(out.getString(), "dir.d/file.3");
}

TEST_F(ZmFilenameFs, PackAgreesWithRealpathOnRandomWalks)
{
    // Directories a|b|c four levels deep, no links: lexical and physical resolution must agree.
    const char* names[] = {"a", "b", "c"};
    for (int leaf = 0; leaf < 81; ++leaf) {
        std::string p;
        for (int depth = 0, n = leaf; depth < 4; ++depth, n /= 3) {
            p += std::string("/") + names[n % 3];
        }
        std::filesystem::create_directories(path(p));
    }
    std::mt19937 rng(20240607);
    for (int round = 0; round < 500; ++round) {
        std::string walk = m_dir;
        for (int depth = 0, steps = 1 + int(rng() % 8); steps > 0; --steps) {
            const unsigned pick = rng() % 6;
            const bool down = pick < 3 && depth < 4;
            const bool up = pick == 3 && depth > 0;
            depth += down ? 1 : up ? -1 : 0;
            walk += std::string("/") + (down ? names[pick] : up ? ".." : pick == 4 ? "." : "");
        }
        ZmFilename f(walk.c_str());
        f.pack();
        std::string got = f.getString();
        if (got.size() > 1 && got.back() == '/') {
            got.pop_back();
        }
        EXPECT_EQ(got, realPath(walk)) << walk;
    }
}

TEST_F(ZmFilenameFs, ExpandCanonizeAndMakeRelativeTo)
{
    for (const char* d : {"w", "a/b/c", "d/e"}) {
        std::filesystem::create_directories(path(d));
    }
    std::filesystem::current_path(path("w"));
    ZmFilename f("x/../y/");
    f.canonizePath();
    EXPECT_EQ(std::string(f.getString()), path("w/y"));
    f = "../z";
    f.expandPath();
    EXPECT_EQ(std::string(f.getString()), path("z"));
    f = "/abs/./p/";
    f.expandPath();
    EXPECT_STREQ(f.getString(), "/abs/./p/") << "absolute paths are left alone";
    f = "/";
    f.canonizePath();
    EXPECT_STREQ(f.getString(), "/");
    ::setenv("HOME", "/h/ome", 1);
    f = "~/q/../r";
    f.expandPath();
    EXPECT_STREQ(f.getString(), "/h/ome/r");

    const char* cases[][3] = {{"d/e/f.txt", "a/b/c", "../../../d/e/f.txt"},
                              {"a/b/c", "a", "b/c"},
                              {"a", "a/b/c", "../.."},
                              {"a/b", "a/b/", "."}};
    for (const auto& c : cases) {
        ZmFilename target(path(c[0]).c_str());
        ZmFilename base(path(c[1]).c_str());
        ASSERT_TRUE(target.makeRelativeTo(base));
        EXPECT_STREQ(target.getString(), c[2]) << c[0] << " from " << c[1];
        EXPECT_EQ(std::string(base.getString()), path(c[1])) << "the base is not changed";
    }
    std::filesystem::current_path(m_dir);
    ZmFilename rel("d/e/f.txt");
    ZmFilename base("a/b");
    ASSERT_TRUE(rel.makeRelativeTo(base));
    EXPECT_STREQ(rel.getString(), "../../d/e/f.txt") << "relative inputs start at the current directory";
    ZmFilename drive("C:/x");
    ZmFilename other("D:/y");
    EXPECT_FALSE(drive.makeRelativeTo(other));
    EXPECT_STREQ(drive.getString(), "C:/x");
}

TEST_F(ZmFilenameFs, UniqueAndTemporaryNames)
{
    ZmFilename f(path("a.txt").c_str());
    f.makeUnique();
    EXPECT_EQ(std::string(f.getString()), path("a.txt")) << "a free name stays";
    write("a.txt");
    write("a.1.txt");
    f.makeUnique();
    EXPECT_EQ(std::string(f.getString()), path("a.2.txt"));
    std::filesystem::create_directory(path("dir.d"));
    std::filesystem::create_symlink("nowhere", path("dir.d/file"));
    f = path("dir.d/file").c_str();
    f.makeUnique();
    EXPECT_EQ(std::string(f.getString()), path("dir.d/file.1")) << "a dangling link takes its name";

    auto number = [](const ZmFilename& n) { return std::atoi(n.basename() + 3); };
    const ZmFilename first = ZmFilename::getTempFilename((m_dir + "/").c_str());
    EXPECT_EQ(std::string(first.getString()), m_dir + "//" + first.basename()) << "intended double slash";
    EXPECT_EQ(std::string(first.basename()).size(), 7u);
    const ZmFilename second = ZmFilename::getTempFilename(m_dir.c_str());
    EXPECT_EQ(std::string(second.getString()), m_dir + "/" + second.basename());
    EXPECT_EQ(number(second), (number(first) + 1) % 10000);
    // A taken name goes through makeUnique, where the number counts as the extension.
    int next = (number(second) + 1) % 10000;
    const ZmString taken(0, "zm.%04d", next);
    write(taken.getString());
    EXPECT_EQ(std::string(ZmFilename::getTempFilename(m_dir.c_str()).basename()),
              std::string(ZmString(0, "zm.1.%04d", next).getString()));
    // The call whose count is a multiple of 10000 gives zm.0000; the next ones go on from 1.
    next = (next + 1) % 10000;
    for (int i = 0; i <= (10000 - next) % 10000; ++i) {
        f = ZmFilename::getTempFilename(m_dir.c_str());
    }
    EXPECT_STREQ(f.basename(), "zm.0000");
    std::filesystem::current_path(m_dir);
    EXPECT_STREQ(ZmFilename::getTempFilename("").getString(), "zm.0001");
    ::setenv("TMPDIR", m_dir.c_str(), 1);
    EXPECT_EQ(std::string(ZmFilename::getTempFilename(nullptr).getString()), m_dir + "/zm.0002");
}

TEST_F(ZmFilenameFs, GeneratedNamesAreStampedDistinctAndSortByAge)
{
    ZmString dir;
    ZmString name;
    std::vector<std::string> names;
    const std::time_t before = std::time(nullptr);
    for (int i = 0; i < 2000; ++i) {
        ASSERT_TRUE(ZmFilename::generateFilePath(dir, name, ZmString(m_dir.c_str()), false, false));
        names.push_back(name.getString());
    }
    const std::time_t after = std::time(nullptr);
    EXPECT_EQ(std::string(dir.getString()), m_dir);
    for (size_t i = 1; i < names.size(); ++i) {
        ASSERT_EQ(names[i].size(), 23u) << names[i];
        EXPECT_LT(names[i - 1], names[i]) << "distinct and in age order";
        EXPECT_EQ(std::stoul(names[i].substr(16)), std::stoul(names[i - 1].substr(16)) + 1);
    }
    bool stampSeen = false;
    for (std::time_t t = before; t <= after; ++t) {
        struct tm lt;
        char buf[32];
        ::localtime_r(&t, &lt);
        std::strftime(buf, sizeof(buf), "%Y%m%d-%H%M%S-", &lt);
        stampSeen |= names.front().compare(0, 16, buf) == 0;
    }
    EXPECT_TRUE(stampSeen) << names.front();

    // Date folder with missing parents; backslashes fixed, one trailing slash dropped.
    ASSERT_TRUE(
        ZmFilename::generateFilePath(dir, name, ZmString((m_dir + "\\deep/er/").c_str()), true, true));
    EXPECT_EQ(std::string(dir.getString()), m_dir + "/deep/er/" + std::string(name.getString(), 8));
    EXPECT_TRUE(std::filesystem::is_directory(dir.getString()));
    ::setenv("TMPDIR", (m_dir + "/").c_str(), 1);
    ASSERT_TRUE(ZmFilename::generateFilePath(dir, name, ZmString(), false, true));
    EXPECT_EQ(std::string(dir.getString()), m_dir);

    write("plain");
    LogCapture log(ZmLogWarning);
    EXPECT_FALSE(ZmFilename::generateFilePath(dir, name, ZmString(path("plain/sub").c_str()), false, true));
    const std::string text =
        "ZmFilename::generateFilePath() failed (error code: " + std::to_string(ENOTDIR) + ")\n";
    EXPECT_EQ(LogCapture::matching(text).size(), 1u);
}

TEST_F(ZmFilenameFs, FileQueriesAgreeWithTheSystem)
{
    const ZmFilename file(path("f").c_str());
    EXPECT_EQ(file.create(0640), 1);
    EXPECT_EQ(file.create(0600), 0) << "an existing file is not made again";
    EXPECT_EQ(file.getMode(), 0640) << "the umask does not apply";
    write("f", std::string(12345, 'x'));
    EXPECT_EQ(file.fileSize(), 12345);
    EXPECT_EQ(file.setMode(0604), 0);
    struct stat st;
    ASSERT_EQ(::stat(file.getString(), &st), 0);
    EXPECT_EQ(st.st_mode & 07777, 0604u);
    const struct timespec times[2] = {{1000000000, 5000000}, {1200000000, 999999999}};
    ASSERT_EQ(::utimensat(AT_FDCWD, file.getString(), times, 0), 0);
    EXPECT_EQ(file.getAccessTime(), 1000000000);
    EXPECT_EQ(file.getModTime(), 1200000000);
    EXPECT_NEAR(double(file.getCreateTime()), double(std::time(nullptr)), 60.0);
    EXPECT_TRUE(file.doesExist() && file.isReadable() && file.isWriteable() && !file.isDirectory());
    EXPECT_TRUE(ZmFilename(m_dir.c_str()).isDirectory());
    if (::geteuid() != 0) {
        ASSERT_EQ(file.setMode(0400), 0);
        EXPECT_FALSE(file.isWriteable());
    }

    const ZmFilename missing(path("missing").c_str());
    EXPECT_FALSE(missing.doesExist() || missing.isReadable() || missing.isWriteable());
    for (int64_t v : {missing.fileSize(), missing.getModTime(), missing.getAccessTime(),
                      missing.getCreateTime(), int64_t(missing.getMode()), int64_t(missing.setMode(0600))}) {
        EXPECT_EQ(v, -1);
    }
    EXPECT_EQ(ZmFilename(path("no/such/f").c_str()).create(0600), 0);
    std::filesystem::create_symlink("missing", path("link"));
    EXPECT_TRUE(ZmFilename(path("link").c_str()).doesExist()) << "the name is taken";
    EXPECT_EQ(ZmFilename(path("link").c_str()).fileSize(), -1);
}

TEST_F(ZmFilenameFs, CopyRenameUnlinkAnswerZeroOrMinusOne)
{
    std::string data(200000, '\0');
    std::mt19937 rng(7);
    for (char& c : data) {
        c = char(rng());
    }
    write("src", data);
    ASSERT_EQ(::chmod(path("src").c_str(), 0750), 0);
    const ZmFilename src(path("src").c_str());
    EXPECT_EQ(src.copy(path("dst").c_str()), 0);
    EXPECT_EQ(read("dst"), data);
    struct stat st;
    ASSERT_EQ(::stat(path("dst").c_str(), &st), 0);
    EXPECT_EQ(st.st_mode & 0700, 0700u) << "permission bits follow the source";
    write("src", "new");
    EXPECT_EQ(src.copy(path("dst").c_str()), 0);
    EXPECT_EQ(read("dst"), "new") << "an existing target is truncated";

    EXPECT_EQ(src.copy(path("src").c_str()), -1) << "onto itself";
    EXPECT_EQ(read("src"), "new");
    EXPECT_EQ(src.copy(m_dir.c_str()), -1) << "onto a directory";
    EXPECT_EQ(ZmFilename(path("missing").c_str()).copy(path("x").c_str()), -1);
    EXPECT_FALSE(std::filesystem::exists(path("x")));
    ASSERT_EQ(::mkfifo(path("fifo").c_str(), 0600), 0);
    EXPECT_EQ(ZmFilename(path("fifo").c_str()).copy(path("y").c_str()), -1) << "a pipe is refused, not read";

    EXPECT_EQ(src.rename(path("moved").c_str()), 0);
    EXPECT_EQ(std::string(src.getString()), path("src")) << "the object keeps its text";
    EXPECT_EQ(read("moved"), "new");
    EXPECT_EQ(src.rename(path("again").c_str()), -1);
    EXPECT_EQ(ZmFilename(path("moved").c_str()).unlink(), 0);
    EXPECT_EQ(ZmFilename(path("moved").c_str()).unlink(), -1);
    EXPECT_EQ(ZmFilename(m_dir.c_str()).unlink(), -1) << "not a directory";
}
