/// \file
/// Intrusive reference counting for objects shared between threads.
#pragma once

#include <zmlib/ZmExport.h>

#include <atomic>
#include <cstdint>

/// Base of reference-counted objects that several threads hold and release concurrently.
///
/// The count changes only atomically. The final release takes a private spin lock around the
/// decrement and the commit to deletion: the thread that takes the count from exactly 1 to 0 parks
/// it at `DELETE_OFFSET`, so every other holder sees the object as being destroyed and it is
/// deleted exactly once. Unlike `ZmHandable`, a count that goes negative never deletes (releasing
/// a never-referenced object leaves it alive at -1): only the exact transition to 0 does. That
/// asymmetry is deliberate; code that creates an object and hands it to a holder relies on it.
///
/// The count belongs to the object: a copy starts at 0 and assignment copies nothing.
class ZMLIB_API ZmHandableThreaded {
public:
    /// A count at or above this value means the object is being destroyed.
    static constexpr int32_t DELETE_OFFSET = 16777215;

    void ref() const { m_refCount.fetch_add(1, std::memory_order_relaxed); }
    /// Decrements the count; the thread that brings it to exactly 0 deletes the object.
    void unref() const;
    /// Decrements the count without ever deleting.
    void unrefNoDelete() const { m_refCount.fetch_sub(1, std::memory_order_acq_rel); }
    /// The count, or 0 once the object is being destroyed.
    int refCount() const
    {
        const int32_t c = m_refCount.load(std::memory_order_acquire);
        return c >= DELETE_OFFSET ? 0 : c;
    }
    /// Count exactly 0 (tested under the spin lock).
    bool isVirgin() const;
    bool isDestructionInProgress() const
    {
        return m_refCount.load(std::memory_order_acquire) >= DELETE_OFFSET;
    }

protected:
    ZmHandableThreaded() = default;
    /// A fresh object: the source's count is not copied.
    ZmHandableThreaded(const ZmHandableThreaded&) {}
    /// Copies nothing: the count stays this object's own.
    ZmHandableThreaded& operator=(const ZmHandableThreaded&) { return *this; }
    virtual ~ZmHandableThreaded();
    /// Called once, by the thread that won the deletion, just before deleting.
    virtual void notifyDelete();

private:
    void lock() const;
    void unlock() const { m_lock.store(0, std::memory_order_release); }

    mutable std::atomic<char> m_lock{0};
    mutable std::atomic<int32_t> m_refCount{0};
};
