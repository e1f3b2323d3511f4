/// \file
/// Intrusive reference counting for objects used by one thread at a time.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// Base of single-threaded reference-counted objects, held through `ZmHandle<T>`.
///
/// A new object has count 0 ("virgin"). `unref()` deletes the object when the count falls below
/// 1, so releasing an object that was never referenced deletes it. During teardown the object is
/// flagged as being destroyed: `notifyDelete()` runs first, and references taken or dropped from
/// inside the teardown are ignored, so it can never be deleted twice.
///
/// The count belongs to the object, not to its value: a copy starts at 0 and assignment copies
/// nothing. Not thread-safe; use `ZmHandableThreaded` for objects shared between threads.
class ZMLIB_API ZmHandable {
public:
    /// Increments the count (ignored while the object is being destroyed).
    void ref() const
    {
        if (!m_destructionInProgress) {
            ++m_refCount;
        }
    }
    /// Decrements the count; below 1 the object is torn down and deleted.
    void unref() const
    {
        if (m_destructionInProgress) {
            return;
        }
        if (--m_refCount >= 1) {
            return;
        }
        destroy();
    }
    /// Decrements the count without ever deleting (ignored while the object is being destroyed).
    void unrefNoDelete() const
    {
        if (!m_destructionInProgress) {
            --m_refCount;
        }
    }
    int refCount() const { return m_refCount; }
    /// Count 0 and not being destroyed.
    bool isVirgin() const { return m_refCount == 0 && !m_destructionInProgress; }
    bool isDestructionInProgress() const { return m_destructionInProgress; }
    /// Set just before the destructor runs: derived destructors can tell a teardown through
    /// `unref()` from a direct deletion.
    bool isDestructorCalled() const { return m_destructorCalled; }

protected:
    ZmHandable() = default;
    /// A fresh object: the source's count is not copied.
    ZmHandable(const ZmHandable&) {}
    /// Copies nothing: the count stays this object's own.
    ZmHandable& operator=(const ZmHandable&) { return *this; }
    virtual ~ZmHandable();
    /// Called once, just before the object deletes itself; does nothing by default.
    virtual void notifyDelete();

private:
    void destroy() const;

    mutable int32_t m_refCount = 0;
    mutable bool m_destructionInProgress = false;
    mutable bool m_destructorCalled = false;
};
