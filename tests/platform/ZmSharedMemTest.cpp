#include <zmlib/ZmSharedMem.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <fstream>
#include <sstream>
#include <string>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace {

const std::string kShmDir = "/dev/shm/";

/// The entries of /dev/shm containing \p token, each with its size.
std::vector<std::pair<std::string, int64_t>> shmEntries(const std::string& token)
{
    std::vector<std::pair<std::string, int64_t>> found;
    if (DIR* dir = opendir(kShmDir.c_str())) {
        while (const dirent* e = readdir(dir)) {
            struct stat st;
            if (std::strstr(e->d_name, token.c_str()) != nullptr &&
                stat((kShmDir + e->d_name).c_str(), &st) == 0) {
                found.emplace_back(e->d_name, int64_t(st.st_size));
            }
        }
        closedir(dir);
    }
    std::sort(found.begin(), found.end());
    return found;
}

/// The mapping that contains \p p is a shared-memory object still linked under its name.
bool mappedObjectIsLinked(const void* p)
{
    std::ifstream maps("/proc/self/maps");
    std::string line;
    while (std::getline(maps, line)) {
        std::istringstream fields(line);
        uintptr_t start = 0, end = 0;
        char dash = 0;
        if (fields >> std::hex >> start >> dash >> end && uintptr_t(p) >= start && uintptr_t(p) < end) {
            return line.find("/zmshm.") != std::string::npos && line.find("(deleted)") == std::string::npos;
        }
    }
    return false;
}

int exitCode(pid_t pid)
{
    int status = 0;
    return waitpid(pid, &status, 0) == pid && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

class ZmSharedMemTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        if (access(kShmDir.c_str(), R_OK | X_OK) != 0) {
            GTEST_SKIP() << "/dev/shm is not readable, so leftovers cannot be checked";
        }
    }
    void TearDown() override { EXPECT_TRUE(shmEntries(token).empty()) << "left behind in /dev/shm"; }

    const int64_t page = sysconf(_SC_PAGESIZE);
    /// A prefix no other process uses, to find this test's objects.
    const std::string token = "zmtest-" + std::to_string(getpid()) + "-" +
                              ::testing::UnitTest::GetInstance()->current_test_info()->name();
};

} // namespace

TEST_F(ZmSharedMemTest, ObjectsOfOneProcessShareABlockOfWholePagesPlusOne)
{
    ZmSharedMem first, second, whole, copy;
    char* p = first.buffer(token.c_str(), 100);
    ASSERT_NE(p, nullptr);
    char* q = second.buffer(token.c_str(), 10 * page); // an existing block keeps its size
    ASSERT_NE(q, nullptr);
    std::strcpy(p, "through the first");
    EXPECT_STREQ(q, "through the first");
    q[page - 1] = 'z';
    EXPECT_EQ(p[page - 1], 'z');
    EXPECT_EQ(first.buffer("another", 1), p); // once mapped, the view is kept
    const std::string odd = token + "/a\\b c%";
    ASSERT_NE(whole.buffer(odd.c_str(), page), nullptr);
    using Entries = std::vector<std::pair<std::string, int64_t>>;
    EXPECT_EQ(shmEntries(token),
              (Entries{{"zmshm." + token, page}, {"zmshm." + token + "%2Fa%5Cb%20c%25", 2 * page}}));

    // Long names are cut and told apart by a hash.
    ZmSharedMem longA, longB;
    char* a = longA.buffer((token + std::string(300, 'x') + "A").c_str(), 8);
    char* b = longB.buffer((token + std::string(300, 'x') + "B").c_str(), 8);
    ASSERT_TRUE(a != nullptr && b != nullptr);
    a[0] = 'A';
    EXPECT_EQ(b[0], 0);
    EXPECT_EQ(shmEntries(token).size(), 4u);

    // Copies share the view; the last one lets go.
    copy = first;
    first = ZmSharedMem();
    second = ZmSharedMem();
    EXPECT_EQ(ZmSharedMem(copy).buffer(nullptr, 0), p);
    p[1] = 'x';
    EXPECT_EQ(shmEntries(token).size(), 4u);
    copy = ZmSharedMem();
    EXPECT_EQ(shmEntries(token).size(), 3u);
}

TEST_F(ZmSharedMemTest, BlockLivesWhileAnyProcessHoldsIt)
{
    ZmSharedMem parent;
    char* p = parent.buffer(token.c_str(), 256);
    ASSERT_NE(p, nullptr);
    std::strcpy(p, "from the parent");
    pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        ZmSharedMem own;
        char* c = own.buffer(token.c_str(), 1);
        const bool ok = c != nullptr && std::strcmp(c, "from the parent") == 0;
        if (ok) {
            std::strcpy(c + 128, "from the child");
        }
        own = ZmSharedMem(); // lets go normally; the parent still holds the block
        _exit(ok ? 0 : 1);
    }
    ASSERT_EQ(exitCode(child), 0);
    EXPECT_STREQ(p + 128, "from the child");
    EXPECT_EQ(shmEntries(token).size(), 1u);

    // Holders that end without letting go (_exit after another process attached and let go, a
    // SIGKILL) leave orphans; the next attach of any block reclaims them, never a held one.
    const std::string left = token + "-left", killed = token + "-killed", held = token + "-held";
    int ready[2], release[2];
    ASSERT_EQ(pipe(ready), 0);
    ASSERT_EQ(pipe(release), 0);
    const pid_t exiting = fork();
    if (exiting == 0) {
        char* c = (new ZmSharedMem)->buffer(left.c_str(), 3 * page);
        std::strcpy(c, "left behind");
        (void)!write(ready[1], "x", 1);
        char go = 0;
        (void)!read(release[0], &go, 1); // the parent attaches and lets go meanwhile
        _exit(0);
    }
    char byte = 0;
    ASSERT_EQ(read(ready[0], &byte, 1), 1);
    {
        ZmSharedMem visitor;
        ASSERT_NE(visitor.buffer(left.c_str(), 1), nullptr);
    }
    ASSERT_EQ(write(release[1], "x", 1), 1);
    ASSERT_EQ(exitCode(exiting), 0);
    // An orphan now (unless another process attached meanwhile); the attaches below reclaim it.
    const pid_t victim = fork(), holder = victim == 0 ? 0 : fork();
    if (victim == 0 || holder == 0) {
        char* c = (new ZmSharedMem)->buffer((victim == 0 ? killed : held).c_str(), 1);
        std::strcpy(c, "still here");
        (void)!write(ready[1], "x", 1);
        (void)!read(release[0], &byte, 1); // the victim is killed while it waits here
        _exit(0);
    }
    // No fatal assertion until the holder is released: it must not be left waiting.
    EXPECT_EQ(read(ready[0], &byte, 1), 1);
    EXPECT_EQ(read(ready[0], &byte, 1), 1);
    kill(victim, SIGKILL);
    waitpid(victim, nullptr, 0);
    EXPECT_TRUE(shmEntries(left).empty());
    {
        ZmSharedMem unrelated;
        EXPECT_NE(unrelated.buffer((token + "-unrelated").c_str(), 1), nullptr);
        EXPECT_TRUE(shmEntries(killed).empty());
        ZmSharedMem same;
        const char* q = same.buffer(held.c_str(), 1); // held by the live child: the same block
        EXPECT_TRUE(q != nullptr && std::strcmp(q, "still here") == 0);
        ZmSharedMem fresh;
        const char* f = fresh.buffer(left.c_str(), 1); // a reclaimed name starts afresh
        EXPECT_TRUE(f != nullptr && f[0] == 0);
    }
    ASSERT_EQ(write(release[1], "x", 1), 1);
    EXPECT_EQ(exitCode(holder), 0);
    for (int fd : {ready[0], ready[1], release[0], release[1]}) {
        close(fd);
    }
    EXPECT_TRUE(shmEntries(left).empty()); // its last holder let go normally
    // The holder _exited holding its block: an orphan the next attach reclaims (checked when the
    // test ends).

    // One whose creator died before sizing it is empty and unlocked: reclaimed like any orphan.
    const int fd = shm_open(("/zmshm." + left).c_str(), O_RDWR | O_CREAT | O_EXCL, 0600);
    ASSERT_GE(fd, 0);
    close(fd);
    ZmSharedMem next;
    ASSERT_NE(next.buffer(left.c_str(), 16), nullptr);
    EXPECT_EQ(shmEntries(left)[0].second, page);
}

TEST_F(ZmSharedMemTest, ProcessesAttachingAndLettingGoAtOnceNeverHoldARemovedBlock)
{
    // Creation, attachment and removal race between the processes; a holder must always hold
    // the block that is linked under the name.
    std::vector<pid_t> children;
    for (int i = 0; i < 3; ++i) {
        children.push_back(fork());
        ASSERT_GE(children.back(), 0);
        if (children.back() == 0) {
            int bad = 0;
            for (int round = 0; round < 300; ++round) {
                ZmSharedMem m;
                char* c = m.buffer(token.c_str(), 64);
                bad += c == nullptr || !mappedObjectIsLinked(c);
            }
            _exit(bad == 0 ? 0 : 1);
        }
    }
    for (pid_t child : children) {
        EXPECT_EQ(exitCode(child), 0);
    }
}
