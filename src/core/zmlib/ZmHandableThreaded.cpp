#include <zmlib/ZmHandableThreaded.h>

ZmHandableThreaded::~ZmHandableThreaded() = default;

void ZmHandableThreaded::notifyDelete()
{}

void ZmHandableThreaded::lock() const
{
    // A plain busy wait: the lock is held for two atomic operations only.
    while (m_lock.exchange(1, std::memory_order_acquire) != 0) {
    }
}

void ZmHandableThreaded::unref() const
{
    lock();
    bool won = false;
    if (m_refCount.fetch_sub(1, std::memory_order_acq_rel) - 1 == 0) {
        int32_t expected = 0;
        won = m_refCount.compare_exchange_strong(expected, DELETE_OFFSET, std::memory_order_acq_rel);
    }
    unlock();
    if (won) {
        auto* self = const_cast<ZmHandableThreaded*>(this);
        self->notifyDelete();
        delete self;
    }
}

bool ZmHandableThreaded::isVirgin() const
{
    lock();
    const bool virgin = m_refCount.load(std::memory_order_relaxed) == 0;
    unlock();
    return virgin;
}
