/// \file
/// One slot of thread-local storage.
#pragma once

#include <zmlib/ZmExport.h>

struct ZmThreadLocalStorageKey;

/// A per-thread `void*` slot over a POSIX thread-specific key.
///
/// Every thread sees its own value, null until it sets one. The optional destructor function runs
/// at the exit of each thread whose value is not null. The slot should outlive the threads that
/// use it. Not copyable.
class ZMLIB_API ZmThreadLocalStorageBase {
public:
    ZmThreadLocalStorageBase();
    /// \p destructor is called with a thread's value when that thread exits.
    explicit ZmThreadLocalStorageBase(void (*destructor)(void*));
    /// Deletes the key. Should deleting it fail, the key holder is deliberately leaked, since a key
    /// that may still be in use must not be freed.
    ~ZmThreadLocalStorageBase();
    ZmThreadLocalStorageBase(const ZmThreadLocalStorageBase&) = delete;
    ZmThreadLocalStorageBase& operator=(const ZmThreadLocalStorageBase&) = delete;

    /// This thread's value.
    void* get() const;
    /// Sets this thread's value.
    void set(void* value);

private:
    ZmThreadLocalStorageKey* m_key;
};
