#include <zmlib/ZmAllocator.h>

#include <cstdlib>
#include <new>
#include <utility>

namespace {

// The hook lives in a function-local static so that no global constructor runs at load time.
std::function<void()>& freeUnusedHook()
{
    static std::function<void()> hook;
    return hook;
}

void* mallocFn(uint64_t n)
{
    return std::malloc(n);
}

void freeFn(void* p)
{
    std::free(p);
}

// allocate() never throws: the array form of new is used in its non-throwing variant.
void* newArrayFn(uint64_t n)
{
    return ::operator new[](n, std::nothrow);
}

void deleteArrayFn(void* p)
{
    ::operator delete[](p);
}

} // namespace

ZmAllocator::ZmAllocator() : m_alloc(mallocFn), m_free(freeFn)
{}

ZmAllocator::ZmAllocator(AllocatorType type)
{
    switch (type) {
    case MallocFree:
    case CRuntime:
        m_alloc = mallocFn;
        m_free = freeFn;
        break;
    case NewDeleteArray:
        m_alloc = newArrayFn;
        m_free = deleteArrayFn;
        break;
    default:
        break;
    }
}

ZmAllocator::ZmAllocator(AllocFn alloc, FreeFn free) : m_alloc(alloc), m_free(free)
{}

bool ZmAllocator::operator==(const ZmAllocator& other) const
{
    return m_alloc == other.m_alloc && m_free == other.m_free;
}

void* ZmAllocator::allocate(uint64_t n) const
{
    if (m_alloc == nullptr) {
        return nullptr;
    }
    if (void* p = m_alloc(n)) {
        return p;
    }
    const std::function<void()>& hook = freeUnusedHook();
    if (!hook) {
        return nullptr;
    }
    hook();
    return m_alloc(n);
}

void ZmAllocator::deallocate(void* p) const
{
    if (m_free != nullptr && p != nullptr) {
        m_free(p);
    }
}

void ZmAllocator::setFreeUnusedUncompressedDataCB(std::function<void()> cb)
{
    freeUnusedHook() = std::move(cb);
}
