/// \file
/// The reference count of a private part that copies of a class share (private).
#pragma once

#include <atomic>

/// Starts at 1, for the object that made the part. Increments are relaxed, as for shared-pointer
/// counts; the decrement that reaches 0 acquires what the other holders released, so the last
/// holder sees every write made through the others before it tears the part down.
class ZmSharedCount {
public:
    void ref() noexcept { m_refs.fetch_add(1, std::memory_order_relaxed); }
    /// True when this was the last reference: the caller then tears the part down.
    bool unref() noexcept { return m_refs.fetch_sub(1, std::memory_order_acq_rel) == 1; }

private:
    std::atomic<int> m_refs{1};
};
