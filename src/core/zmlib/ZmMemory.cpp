#include <zmlib/ZmMemory.h>

#include <zmlib/ZmMemoryException.h>

#include <atomic>
#include <cstddef>
#include <cstdio>
#include <cstdlib>

namespace {

// Constant-initialised (no global constructor) and atomic, since any allocating thread reads it.
std::atomic<ZmAllocationFailureHook> g_failureHook{nullptr};

bool injectedFailure(uint64_t size)
{
    const ZmAllocationFailureHook hook = g_failureHook.load(std::memory_order_acquire);
    return hook != nullptr && hook(size);
}

} // namespace

void* zmmalloc(uint64_t size)
{
    void* p = injectedFailure(size) ? nullptr : std::malloc(size);
    if (p == nullptr) {
        throw ZmMemoryException(size);
    }
    return p;
}

void* zmrealloc(void* p, uint64_t size)
{
    if (p == nullptr) {
        return zmmalloc(size);
    }
    if (size == 0) {
        std::free(p);
        return nullptr;
    }
    void* q = injectedFailure(size) ? nullptr : std::realloc(p, size);
    if (q == nullptr) {
        // The failure text is formatted and dropped as it always was (the exception formats its
        // own, which callers see), but on the stack: nothing on this path may allocate.
        char text[64];
        std::snprintf(text, sizeof text, "could not reallocate %zd bytes", static_cast<ptrdiff_t>(size));
        throw ZmMemoryException(size);
    }
    return q;
}

void zmfree(void* p)
{
    if (p != nullptr) {
        std::free(p);
    }
}

ZmAllocationFailureHook zmSetAllocationFailureHook(ZmAllocationFailureHook hook)
{
    return g_failureHook.exchange(hook, std::memory_order_acq_rel);
}
