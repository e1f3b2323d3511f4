#include <zmlib/ZmAllocator.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>
#include <sys/wait.h>
#include <unistd.h>

#if defined(__SANITIZE_ADDRESS__)
#define ZM_TEST_ASAN 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define ZM_TEST_ASAN 1
#endif
#endif

#ifdef ZM_TEST_ASAN
// By default the sanitizer aborts on a request it cannot serve instead of returning null, which
// would hide the very failure path these tests exercise. Weak, so that another definition in the
// test program wins without a link error; the probe below notices if it lost.
extern "C" __attribute__((weak, visibility("default"))) const char* __asan_default_options()
{
    return "allocator_may_return_null=1";
}
#endif

namespace {

// Far beyond any address space: the heap must refuse it.
constexpr uint64_t kHuge = uint64_t(1) << 62;

// True when a refused request reaches zmmalloc as null (and so as an exception) rather than
// ending the process. Probed in a child so that an aborting allocator cannot take the test down.
bool heapRefusalIsReported()
{
    const pid_t pid = fork();
    if (pid == 0) {
        try {
            zmfree(zmmalloc(kHuge));
        } catch (const ZmMemoryException&) {
            _exit(0);
        }
        _exit(1);
    }
    int status = 0;
    return pid > 0 && waitpid(pid, &status, 0) == pid && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// Counting allocation functions for ZmAllocator: plain function pointers, so the state is global.
int g_allocCalls = 0, g_failuresLeft = 0, g_freeCalls = 0, g_hookCalls = 0;

void* failingAlloc(uint64_t n)
{
    ++g_allocCalls;
    if (g_failuresLeft > 0) {
        --g_failuresLeft;
        return nullptr;
    }
    return std::malloc(n);
}

void countingFree(void* p)
{
    ++g_freeCalls;
    std::free(p);
}

void resetCounters(int failures)
{
    g_allocCalls = g_freeCalls = g_hookCalls = 0;
    g_failuresLeft = failures;
}

/// Installs a counting retry hook and removes it again, also when an assertion ends the test early.
struct HookGuard {
    HookGuard()
    {
        ZmAllocator::setFreeUnusedUncompressedDataCB([] { ++g_hookCalls; });
    }
    ~HookGuard() { ZmAllocator::setFreeUnusedUncompressedDataCB({}); }
    HookGuard(const HookGuard&) = delete;
    HookGuard& operator=(const HookGuard&) = delete;
};

} // namespace

// --- zmmalloc / zmrealloc / zmfree ---------------------------------------------------------------

TEST(ZmMemory, ReallocOfNullIsMallocAndToZeroFrees)
{
    // A zero-size request gives what the runtime gives for malloc(0).
    void* runtime = std::malloc(0);
    void* p = zmrealloc(nullptr, 0);
    EXPECT_EQ(p == nullptr, runtime == nullptr);
    std::free(runtime);
    zmfree(p);

    void* q = zmrealloc(nullptr, 32);
    ASSERT_NE(q, nullptr);
    std::memset(q, 0x5a, 32);
    EXPECT_EQ(zmrealloc(q, 0), nullptr); // q is freed: LSan would report it otherwise
    zmfree(nullptr);
}

TEST(ZmMemory, ReallocPreservesContents)
{
    auto* p = static_cast<unsigned char*>(zmmalloc(64));
    for (int i = 0; i < 64; ++i) {
        p[i] = static_cast<unsigned char>(i * 7 + 1);
    }
    p = static_cast<unsigned char*>(zmrealloc(p, 1 << 20));
    for (int i = 0; i < 64; ++i) {
        ASSERT_EQ(p[i], static_cast<unsigned char>(i * 7 + 1)) << i;
    }
    p = static_cast<unsigned char*>(zmrealloc(p, 8));
    for (int i = 0; i < 8; ++i) {
        ASSERT_EQ(p[i], static_cast<unsigned char>(i * 7 + 1)) << i;
    }
    zmfree(p);
}

TEST(ZmMemory, RefusedRequestsThrowAndKeepTheOldBlock)
{
    if (!heapRefusalIsReported()) {
        GTEST_SKIP() << "this heap aborts on an impossible request instead of returning null "
                        "(under ASan: allocator_may_return_null=1)";
    }
    try {
        zmfree(zmmalloc(kHuge));
        FAIL() << "zmmalloc returned";
    } catch (const ZmMemoryException& e) {
        EXPECT_EQ(e.getNumBytes(), kHuge);
        EXPECT_STREQ(e.what(), "could not allocate 4611686018427387904 bytes");
    }
    EXPECT_THROW(zmrealloc(nullptr, kHuge), ZmMemoryException);

    auto* p = static_cast<char*>(zmmalloc(16));
    std::memcpy(p, "fifteen chars..", 16);
    try {
        zmrealloc(p, kHuge);
        FAIL() << "zmrealloc returned";
    } catch (const ZmMemoryException& e) {
        EXPECT_EQ(e.getNumBytes(), kHuge);
    }
    EXPECT_STREQ(p, "fifteen chars.."); // still valid and ours: ASan reports a freed block here
    p = static_cast<char*>(zmrealloc(p, 32));
    EXPECT_STREQ(p, "fifteen chars..");
    zmfree(p);
}

// --- ZmAllocator ---------------------------------------------------------------------------------

TEST(ZmAllocator, PresetsAndEquality)
{
    const ZmAllocator none(ZmAllocator::AllocatorType(0));
    const ZmAllocator mallocPair(ZmAllocator::AllocatorType(1));
    const ZmAllocator runtimePair(ZmAllocator::AllocatorType(2));
    const ZmAllocator arrayPair(ZmAllocator::AllocatorType(3));
    EXPECT_FALSE(none.hasAlloc());
    EXPECT_FALSE(none.hasFree());
    EXPECT_TRUE(none == ZmAllocator(nullptr, nullptr));
    EXPECT_TRUE(mallocPair == runtimePair);
    EXPECT_TRUE(mallocPair == ZmAllocator());
    EXPECT_TRUE(arrayPair.hasAlloc() && arrayPair.hasFree());
    EXPECT_FALSE(arrayPair == mallocPair);
    EXPECT_TRUE(arrayPair != mallocPair);
    EXPECT_FALSE(ZmAllocator(failingAlloc, nullptr) == ZmAllocator(failingAlloc, countingFree));

    ZmAllocator assigned(nullptr, nullptr);
    assigned = arrayPair;
    EXPECT_TRUE(assigned == arrayPair);
    EXPECT_TRUE(ZmAllocator(static_cast<ZmAllocator::AllocatorType>(4)) == none); // unknown preset
}

TEST(ZmAllocator, PresetPairsMatchTheirRuntimeFunctions)
{
    // Under ASan a block released by the wrong family is reported as an alloc-dealloc mismatch.
    const ZmAllocator mallocPair(ZmAllocator::AllocatorType(1));
    void* p = mallocPair.allocate(24);
    ASSERT_NE(p, nullptr);
    std::free(p);
    mallocPair.deallocate(std::malloc(24));

    const ZmAllocator arrayPair(ZmAllocator::AllocatorType(3));
    void* q = arrayPair.allocate(24);
    ASSERT_NE(q, nullptr);
    std::memset(q, 1, 24);
    ::operator delete[](q);
    arrayPair.deallocate(new char[24]);
}

TEST(ZmAllocator, RetryHookRunsOnceAfterAFailedAllocation)
{
    const HookGuard hook;
    const ZmAllocator alloc(failingAlloc, countingFree);

    resetCounters(1); // fails once: the retry succeeds
    void* p = alloc.allocate(40);
    EXPECT_NE(p, nullptr);
    EXPECT_EQ(g_allocCalls, 2);
    EXPECT_EQ(g_hookCalls, 1);
    alloc.deallocate(p);
    EXPECT_EQ(g_freeCalls, 1);

    resetCounters(5); // keeps failing: null after exactly one retry
    EXPECT_EQ(alloc.allocate(40), nullptr);
    EXPECT_EQ(g_allocCalls, 2);
    EXPECT_EQ(g_hookCalls, 1);

    resetCounters(0); // succeeds at once: no hook
    p = alloc.allocate(40);
    EXPECT_EQ(g_hookCalls, 0);
    alloc.deallocate(p);
}

TEST(ZmAllocator, NoHookWithoutAllocFunctionOrWhenCleared)
{
    {
        const HookGuard hook;
        resetCounters(0);
        const ZmAllocator none(ZmAllocator::AllocatorType(0));
        EXPECT_EQ(none.allocate(10), nullptr);
        EXPECT_EQ(g_hookCalls, 0);

        ZmAllocator::setFreeUnusedUncompressedDataCB(std::function<void()>());
        resetCounters(1);
        EXPECT_EQ(ZmAllocator(failingAlloc, countingFree).allocate(10), nullptr);
        EXPECT_EQ(g_allocCalls, 1);
        EXPECT_EQ(g_hookCalls, 0);
    }
    resetCounters(1); // never installed at all
    EXPECT_EQ(ZmAllocator(failingAlloc, countingFree).allocate(10), nullptr);
    EXPECT_EQ(g_allocCalls, 1);
}

TEST(ZmAllocator, DeallocateIgnoresNullPointersAndMissingFree)
{
    resetCounters(0);
    const ZmAllocator alloc(failingAlloc, countingFree);
    alloc.deallocate(nullptr);
    EXPECT_EQ(g_freeCalls, 0);

    const ZmAllocator neverFrees(failingAlloc, nullptr);
    void* p = neverFrees.allocate(8);
    ASSERT_NE(p, nullptr);
    neverFrees.deallocate(p); // both do nothing: the block is still ours to free
    ZmAllocator(ZmAllocator::AllocatorType(0)).deallocate(p);
    std::memset(p, 0, 8);
    std::free(p);
    EXPECT_EQ(g_freeCalls, 0);
}
