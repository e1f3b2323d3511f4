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

/// The copy, assignment and release of a class whose copies share one private part \p P, written
/// once: \p P has a `ZmSharedCount refs` and a `static void destroy(P*)` that tears the part down
/// and deletes it. The last holder destroys; a self-assignment changes nothing.
template <class P>
struct ZmSharedPart {
    /// For a copy constructor: one more holder of \p d.
    static P* share(P* d) noexcept
    {
        d->refs.ref();
        return d;
    }
    /// For an assignment: \p mine lets go of its part and shares \p other.
    static void assign(P*& mine, P* other) noexcept
    {
        if (mine != other) {
            other->refs.ref();
            release(mine);
            mine = other;
        }
    }
    /// For a destructor (and any other holder letting go).
    static void release(P* d) noexcept
    {
        if (d->refs.unref()) {
            P::destroy(d);
        }
    }
};
