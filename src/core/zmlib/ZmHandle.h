/// \file
/// The holder of reference-counted objects.
#pragma once

/// Holds one counted reference to an object derived from `ZmHandable` or `ZmHandableThreaded`
/// (anything with `ref()`/`unref()`), possibly const.
///
/// Taking a non-null pointer calls `ref()`, dropping it calls `unref()`, so the object dies with
/// its last holder. A handle is as thread-safe as a plain pointer: one handle per thread, while
/// the object may be shared when it is a `ZmHandableThreaded`.
template <class T>
class ZmHandle {
public:
    ZmHandle() noexcept = default;
    ZmHandle(T* p) : m_p(p)
    {
        if (m_p != nullptr) {
            m_p->ref();
        }
    }
    ZmHandle(const ZmHandle& other) : ZmHandle(other.m_p) {}
    ZmHandle(ZmHandle&& other) noexcept : m_p(other.m_p) { other.m_p = nullptr; }
    /// From a handle of a derived (or less const) type.
    template <class U>
    ZmHandle(const ZmHandle<U>& other) : ZmHandle(other.get())
    {}
    ~ZmHandle() { reset(); }

    ZmHandle& operator=(const ZmHandle& other)
    {
        if (this != &other) {
            reset(other.m_p);
        }
        return *this;
    }
    /// Takes over \p other's reference and releases the old object at once.
    ZmHandle& operator=(ZmHandle&& other) noexcept
    {
        if (this != &other) {
            T* old = m_p;
            m_p = other.m_p;
            other.m_p = nullptr;
            if (old != nullptr) {
                old->unref();
            }
        }
        return *this;
    }
    ZmHandle& operator=(T* p)
    {
        reset(p);
        return *this;
    }

    /// Holds \p p instead (referenced before the old object is released, so re-assigning the
    /// same object is safe).
    void reset(T* p = nullptr)
    {
        if (p != nullptr) {
            p->ref();
        }
        T* old = m_p;
        m_p = p;
        if (old != nullptr) {
            old->unref();
        }
    }
    /// Drops the reference.
    void release() { reset(); }

    T* get() const noexcept { return m_p; }
    T& operator*() const noexcept { return *m_p; }
    T* operator->() const noexcept { return m_p; }
    explicit operator bool() const noexcept { return m_p != nullptr; }
    bool operator==(const ZmHandle& other) const noexcept { return m_p == other.m_p; }
    bool operator!=(const ZmHandle& other) const noexcept { return m_p != other.m_p; }

private:
    T* m_p = nullptr;
};
