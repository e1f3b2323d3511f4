/// \file
/// Caller-chosen heaps for large pixel buffers.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>
#include <functional>

/// A pair of function pointers (allocate, free) that data-access objects carry so that large
/// buffers can come from a heap of the caller's choosing.
///
/// A value type, freely copied. `allocate` reports failure only by returning null, after one retry
/// behind the process-wide "free unused uncompressed data" hook. That hook is unguarded process
/// state: install it at start-up, before threads that allocate run.
class ZMLIB_API ZmAllocator {
public:
    using AllocFn = void* (*)(uint64_t);
    using FreeFn = void (*)(void*);

    /// Preset pairs.
    enum AllocatorType : int {
        NoAllocator = 0,   ///< cannot allocate, never frees
        MallocFree = 1,    ///< runtime malloc / free
        CRuntime = 2,      ///< the same pair as MallocFree
        NewDeleteArray = 3 ///< global operator new[] / operator delete[]
    };

    /// The malloc/free pair.
    ZmAllocator();
    /// The preset of \p type; an unknown value gives the empty pair.
    explicit ZmAllocator(AllocatorType type);
    /// The given pair; either may be null.
    ZmAllocator(AllocFn alloc, FreeFn free);

    ZmAllocator(const ZmAllocator&) = default;
    ZmAllocator& operator=(const ZmAllocator&) = default;
    /// Both pointers equal.
    bool operator==(const ZmAllocator& other) const;
    bool operator!=(const ZmAllocator& other) const { return !(*this == other); }

    bool hasAlloc() const { return m_alloc != nullptr; }
    bool hasFree() const { return m_free != nullptr; }

    /// alloc(n); when that fails and the process-wide hook is set, calls the hook once and returns
    /// a second alloc(n), null included. Null without an alloc function. Never throws.
    void* allocate(uint64_t n) const;
    /// free(p) when there is a free function and p is not null.
    void deallocate(void* p) const;

    /// Replaces the process-wide hook that releases cached uncompressed data when an allocation
    /// fails; an empty function clears it.
    static void setFreeUnusedUncompressedDataCB(std::function<void()> cb);

private:
    AllocFn m_alloc = nullptr;
    FreeFn m_free = nullptr;
};
