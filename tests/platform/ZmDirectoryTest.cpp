#include <zmlib/ZmDirectory.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmFilenameCollector.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmTmpDir.h>

#include "LogCapture.h"
#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <filesystem>
#include <fnmatch.h>
#include <string>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace fs = std::filesystem;

namespace {

std::vector<std::string> toVector(const ZmDArray<ZmString>& a)
{
    std::vector<std::string> v;
    for (const ZmString& s : a) {
        v.push_back(s.getString());
    }
    return v;
}

/// A scratch directory (its real path); restores the current directory and $TMPDIR.
class FsFixture : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_FALSE(m_scratch.path().empty());
        m_dir = fs::canonical(m_scratch.path());
        m_cwd = fs::current_path();
        const char* tmp = std::getenv("TMPDIR");
        m_oldTmp = tmp != nullptr ? tmp : "\x01";
    }
    void TearDown() override
    {
        fs::current_path(m_cwd);
        m_oldTmp == "\x01" ? ::unsetenv("TMPDIR") : ::setenv("TMPDIR", m_oldTmp.c_str(), 1);
    }
    std::string path(const std::string& rel) const { return m_dir + "/" + rel; }
    void write(const std::string& rel, const std::string& text = "") const { m_scratch.write(rel, text); }
    std::string read(const std::string& rel) const { return m_scratch.read(rel); }
    void link(const std::string& target, const std::string& rel) const
    {
        fs::create_symlink(target, path(rel));
    }
    ScratchDir m_scratch;
    std::string m_dir;
    std::string m_oldTmp;
    fs::path m_cwd;
};

using ZmDirectoryFs = FsFixture;
using ZmTmpDirFs = FsFixture;
using ZmFilenameCollectorFs = FsFixture;

} // namespace

TEST_F(ZmDirectoryFs, ScansFilterLikeFnmatchAndNeverCallALinkADirectory)
{
    const std::vector<std::string> files = {"a.log", "B.log",    "abc.txt",    "axc",
                                            "_",     "z.log.gz", ".hidden.log"};
    for (const std::string& f : files) {
        write(f);
    }
    fs::create_directories(path("sub.log"));
    fs::create_directories(path("Dir"));
    link(m_dir, "loop");
    std::vector<std::string> all = files;
    all.insert(all.end(), {"sub.log", "Dir", "loop"});
    for (const char* pattern : {"*", "*.log", "a?c*", "nothing*"}) {
        std::vector<std::string> expected;
        std::copy_if(all.begin(), all.end(), std::back_inserter(expected),
                     [&](const std::string& f) { return ::fnmatch(pattern, f.c_str(), 0) == 0; });
        std::sort(expected.begin(), expected.end());
        ZmDArray<ZmString> names;
        EXPECT_EQ(ZmDirectory::scanSortedByName(m_dir.c_str(), names, pattern, false), int(expected.size()));
        EXPECT_EQ(toVector(names), expected) << pattern;
        std::vector<ZmDirectory::FileInfo> infos;
        EXPECT_EQ(ZmDirectory::scan(path("").c_str(), infos, pattern, false), int(expected.size()));
    }
    ZmDArray<ZmString> files2;
    ZmDArray<ZmString> dirs;
    ASSERT_TRUE(ZmDirectory::scanSortedByName(m_dir.c_str(), files2, dirs, "*"));
    EXPECT_EQ(toVector(dirs), (std::vector<std::string>{"Dir", "sub.log"}));
    EXPECT_EQ(files2.size(), 8) << "files and the link";
    EXPECT_EQ(ZmDirectory::scanSortedByName(m_dir.c_str(), files2, nullptr, true), 2);
    write("sub.log/inner");
    EXPECT_EQ(ZmDirectory::scanSortedByName(m_dir.c_str(), files2, "sub.log/*", false), 1);

    std::vector<ZmDirectory::FileInfo> infos(3);
    EXPECT_EQ(ZmDirectory::scan("", infos, nullptr, false), -1);
    EXPECT_TRUE(infos.empty()) << "emptied first";
    EXPECT_EQ(ZmDirectory::scan(path("missing").c_str(), infos, nullptr, false), -1);
    EXPECT_FALSE(ZmDirectory::scanSortedByName(path("a.log").c_str(), files2, dirs, nullptr));
    EXPECT_EQ(ZmDirectory::pathDelimiter(), '/');
    EXPECT_TRUE(ZmDirectory::isDirectory(path("loop").c_str())) << "isDirectory follows links";
    EXPECT_FALSE(ZmDirectory::isDirectory(path("a.log").c_str()));
}

TEST_F(ZmDirectoryFs, TimesAreTicksSince1601AndSortOldestFirst)
{
    const uint64_t at1970 = 116444736000000000ull;
    const uint64_t before = at1970 + uint64_t(std::time(nullptr) - 2) * 10000000u;
    // The file-system clock may be coarse: generous gaps between creations.
    for (const char* name : {"c", "a", "b"}) {
        write(name);
        std::this_thread::sleep_for(std::chrono::milliseconds(60));
    }
    fs::create_directory(path("d"));
    const struct timespec times[2] = {{1000000000, 0}, {1234567890, 123456789}};
    ASSERT_EQ(::utimensat(AT_FDCWD, path("a").c_str(), times, 0), 0);
    const uint64_t after = at1970 + uint64_t(std::time(nullptr) + 2) * 10000000u;

    std::vector<ZmDirectory::FileInfo> infos;
    ASSERT_EQ(ZmDirectory::scan(m_dir.c_str(), infos, "a", false), 1);
    EXPECT_EQ(infos[0].lastWriteTime, at1970 + 1234567890ull * 10000000u + 1234567u);
    EXPECT_GE(infos[0].creationTime, before);
    EXPECT_LE(infos[0].creationTime, after);

    ZmDArray<ZmString> names;
    ZmDArray<uint64_t> created;
    ASSERT_EQ(ZmDirectory::scanSortedByCreationTime(m_dir.c_str(), names, &created, nullptr, false), 4);
    EXPECT_EQ(toVector(names), (std::vector<std::string>{"c", "a", "b", "d"}));
    ASSERT_EQ(created.size(), 4);
    EXPECT_TRUE(std::is_sorted(created.begin(), created.end()));
    EXPECT_EQ(created[1], infos[0].creationTime);
}

TEST_F(ZmDirectoryFs, CopyReplicatesTheTreeAndKeepsLinksAsLinks)
{
    fs::create_directories(path("src/a/b"));
    fs::create_directories(path("outside"));
    write("outside/secret", "keep");
    write("src/top", "1");
    write("src/a/mid", "22");
    write("src/a/b/deep", std::string(70000, 'q'));
    ASSERT_EQ(::chmod(path("src/a/mid").c_str(), 0700), 0);
    link("../../outside", "src/a/out");

    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("dst").c_str()), 0);
    EXPECT_EQ(read("dst/top") + read("dst/a/mid"), "122");
    EXPECT_EQ(read("dst/a/b/deep"), std::string(70000, 'q'));
    EXPECT_EQ(fs::status(path("dst/a/mid")).permissions() & fs::perms::owner_all, fs::perms::owner_all);
    EXPECT_TRUE(fs::is_symlink(path("dst/a/out")));
    EXPECT_EQ(fs::read_symlink(path("dst/a/out")), "../../outside");

    write("src/top", "new");
    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("dst").c_str()), 0);
    EXPECT_EQ(read("dst/top"), "new") << "merged and overwritten";
    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("src/inner").c_str()), 0);
    EXPECT_EQ(read("src/inner/a/b/deep"), std::string(70000, 'q'));
    EXPECT_FALSE(fs::exists(path("src/inner/inner"))) << "not copied into itself";

    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("src").c_str()), -1);
    EXPECT_EQ(ZmDirectory::copy(path("src/top").c_str(), path("x").c_str()), -1) << "not a directory";
    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("no/parent").c_str()), -1);
    ASSERT_EQ(::mkfifo(path("src/pipe").c_str(), 0600), 0);
    EXPECT_EQ(ZmDirectory::copy(path("src").c_str(), path("dst2").c_str()), -1) << "a pipe is not copied";
    EXPECT_EQ(read("dst2/a/mid"), "22") << "the rest still is";
    EXPECT_EQ(read("outside/secret"), "keep");
}

TEST_F(ZmDirectoryFs, FreeSpaceMatchesStatvfsAndLogsFailure)
{
    struct statvfs vfs;
    ASSERT_EQ(::statvfs(m_dir.c_str(), &vfs), 0);
    const int64_t got = ZmDirectory::freeSpace(path("not-yet-there.bin").c_str());
    EXPECT_NEAR(double(got), double(vfs.f_bavail) * double(vfs.f_frsize), 256.0 * 1024 * 1024);
    LogCapture log(ZmLogWarning);
    EXPECT_EQ(ZmDirectory::freeSpace(path("missing\\file").c_str()), -1);
    EXPECT_EQ(
        LogCapture::matching("Could not determine free disk space in >" + path("missing") + "<\n").size(),
        1u);
}

TEST_F(ZmTmpDirFs, SystemTmpPathFollowsTmpdirOnEveryCall)
{
    const char* cases[][2] = {
        {"/some/where", "/some/where/"}, {"/ends/in/", "/ends/in/"}, {"C:\\Temp", "C:/Temp/"}, {"", "/tmp/"}};
    for (const auto& c : cases) {
        ::setenv("TMPDIR", c[0], 1);
        EXPECT_STREQ(ZmTmpDir::getSystemTmpPath(), c[1]);
    }
    ::setenv("TMPDIR", std::string(1023, 'x').c_str(), 1);
    EXPECT_STREQ(ZmTmpDir::getSystemTmpPath(), "/tmp/") << "too long for the buffer";
    ::unsetenv("TMPDIR");
    const char* p = ZmTmpDir::getSystemTmpPath();
    EXPECT_STREQ(p, "/tmp/");
    ::setenv("TMPDIR", "/x", 1);
    EXPECT_EQ(ZmTmpDir::getSystemTmpPath(), p) << "one process-wide buffer";
    EXPECT_STREQ(p, "/x/");
}

TEST_F(ZmTmpDirFs, UniqueNamesCountFromTwoInTheirParent)
{
    ::setenv("TMPDIR", m_dir.c_str(), 1);
    {
        ZmTmpDir first("work", true, true);
        EXPECT_EQ(std::string(first.str()), path("work/"));
        EXPECT_TRUE(first.doesExist());
        ZmTmpDir second("sub/work/", true, true);
        EXPECT_EQ(std::string(second.str()), path("work.2/")) << "a relative name lives in the system tmp";
        ZmTmpDir third("work", false, true);
        EXPECT_EQ(std::string(third.str()), path("work.3/"));
        EXPECT_FALSE(third.doesExist());
        EXPECT_EQ(third.create(), 1);
        EXPECT_EQ(third.create(), 0) << "made only once";
        ZmTmpDir unnamed(nullptr, false, false);
        EXPECT_EQ(std::string(unnamed.str()), path("tmp/"));
    }
    EXPECT_FALSE(fs::exists(path("work")) || fs::exists(path("work.2")) || fs::exists(path("work.3")));

    fs::create_directory(path("cwd"));
    fs::current_path(path("cwd"));
    write("cwd/work");
    ZmTmpDir local("./work", true, false);
    EXPECT_STREQ(local.str(), "./work.2/") << "./ keeps the current directory; a file takes a name too";
    EXPECT_TRUE(fs::is_directory(path("cwd/work.2")));
    ZmTmpDir absolute(path("abs/").c_str(), false, false);
    EXPECT_EQ(std::string(absolute.str()), path("abs/"));
    EXPECT_EQ(absolute.create(0750), 1);
    EXPECT_EQ(fs::status(path("abs")).permissions() & ~fs::perms(0750), fs::perms::none);
}

TEST_F(ZmTmpDirFs, RemovalNeverFollowsSymbolicLinksOutOfTheTree)
{
    fs::create_directories(path("outside/inner"));
    write("outside/data", "precious");
    write("outside/inner/more", "also precious");
    write("lonely", "file");
    {
        ZmTmpDir tree(path("tree").c_str(), true, true);
        fs::create_directories(path("tree/a/b"));
        write("tree/a/b/f", "x");
        link(path("outside"), "tree/a/dirlink");
        link(path("outside"), "tree/dirlink");
        link(path("lonely"), "tree/a/b/filelink");
        link("nowhere", "tree/dangling");
        LogCapture log(ZmLogWarning);
        EXPECT_EQ(tree.remove(), 0);
        EXPECT_TRUE(LogCapture::lines().empty());
        EXPECT_FALSE(tree.doesExist());
        ZmTmpDir tree2(path("tree2").c_str(), true, true);
        link(path("outside"), "tree2/d");
    } // tree2 goes through the destructor
    EXPECT_FALSE(fs::exists(fs::symlink_status(path("tree"))) ||
                 fs::exists(fs::symlink_status(path("tree2"))));
    EXPECT_EQ(read("outside/data") + read("outside/inner/more") + read("lonely"),
              "preciousalso preciousfile");

    // A path that is a link to a directory, or a plain file, is not a directory: -1, nothing deleted.
    link(path("outside"), "linkdir");
    ZmTmpDir viaLink(path("x").c_str(), false, false);
    static_cast<ZmString&>(viaLink) = path("linkdir/").c_str();
    EXPECT_FALSE(viaLink.doesExist());
    EXPECT_EQ(viaLink.remove(), -1);
    ZmTmpDir file(path("f").c_str(), false, true);
    write("f", "data");
    EXPECT_EQ(file.remove(), -1);
    EXPECT_EQ(read("f") + read("outside/data"), "dataprecious");
}

TEST_F(ZmTmpDirFs, UndeletableEntriesAreLoggedAndRemovalGoesOn)
{
    // A chain of directories longer than PATH_MAX cannot be reached by path even as root: removal
    // must log it, carry on with the rest and report failure.
    ZmTmpDir tree(path("long").c_str(), true, false);
    EXPECT_FALSE(tree.autoRemove());
    write("long/afile");
    write("long/zfile");
    const std::string segment(200, 'd');
    int fd = ::open(path("long").c_str(), O_RDONLY | O_DIRECTORY);
    for (int i = 0; i < 24; ++i) {
        ASSERT_EQ(::mkdirat(fd, segment.c_str(), 0755), 0);
        const int next = ::openat(fd, segment.c_str(), O_RDONLY | O_DIRECTORY);
        ::close(fd);
        ASSERT_GE(fd = next, 0);
    }
    ::close(fd);
    LogCapture log(ZmLogWarning);
    EXPECT_EQ(tree.remove(), -1);
    EXPECT_EQ(
        LogCapture::matching("Can't delete " + path("long") + ":\n" + std::strerror(ENOTEMPTY) + "\n").size(),
        1u);
    EXPECT_EQ(LogCapture::matching(segment + ":\n" + std::strerror(ENAMETOOLONG) + "\n").size(), 1u);
    EXPECT_FALSE(fs::exists(path("long/afile")) || fs::exists(path("long/zfile"))) << "removal went on";
    EXPECT_TRUE(tree.doesExist());
    // Clear the chain from half-way down, where the rest is within reach of a relative path.
    std::string half = path("long");
    for (int i = 0; i < 12; ++i) {
        half += "/" + segment;
    }
    fs::current_path(half);
    ScratchDir::removeTree(segment);
}

TEST_F(ZmFilenameCollectorFs, CollectsMatchingFilesDepthFirstWithoutFollowingLinks)
{
    fs::create_directories(path("start/b/c"));
    fs::create_directories(path("start/a"));
    fs::create_directories(path("outside"));
    for (const char* f : {"start/x.txt", "start/y.dat", "start/a/q.txt", "start/b/r.txt", "start/b/c/s.txt",
                          "outside/o.txt"}) {
        write(f);
    }
    link(path("outside"), "start/b/link.txt");
    link(path("outside"), "start/ldir");

    ZmDArray<ZmString> out;
    ZmFilenameCollector c;
    c.setStartDir((path("start") + "/").c_str());
    c.setFileName(ZmString("*.txt"));
    ASSERT_EQ(c.collect(out), 5);
    const std::string s = path("start");
    EXPECT_EQ(toVector(out), (std::vector<std::string>{s + "/x.txt", s + "/a/q.txt", s + "/b/link.txt",
                                                       s + "/b/r.txt", s + "/b/c/s.txt"}));
    // Against the standard library's walk, which does not follow links either.
    std::vector<std::string> model;
    for (const auto& e : fs::recursive_directory_iterator(s)) {
        if (e.symlink_status().type() != fs::file_type::directory) {
            model.push_back(e.path().string());
        }
    }
    std::sort(model.begin(), model.end());
    ASSERT_EQ(ZmFilenameCollector::collect(out, s.c_str(), nullptr), int(model.size()));
    std::vector<std::string> got = toVector(out);
    std::sort(got.begin(), got.end());
    EXPECT_EQ(got, model);

    fs::current_path(s);
    c.setStartDir(ZmFilename(""));
    c.setFileName("?.dat");
    ASSERT_EQ(c.collect(out), 1);
    EXPECT_STREQ(out[0].getString(), "y.dat") << "relative below the current directory";
    EXPECT_EQ(ZmFilenameCollector::collect(out, path("missing").c_str(), "*"), -1);
    EXPECT_EQ(out.size(), 0);
}
