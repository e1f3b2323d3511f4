/// \file
/// The exception of a failed allocation.
#pragma once

#include <zmlib/ZmException.h>

#include <cstdint>

/// Thrown by `zmmalloc`/`zmrealloc` when the heap cannot serve a request.
///
/// Holds the requested byte count (0 when unknown). `what()` formats its text anew on each call:
/// "could not allocate enough memory" for 0, else "could not allocate N bytes".
///
/// Nothing about it allocates: construction, copies, `throw` and `what()` work while the heap
/// refuses every request, which is exactly when it is thrown. Its text lives in the object.
class ZMLIB_API ZmMemoryException : public ZmException {
public:
    ZmMemoryException();
    explicit ZmMemoryException(uint64_t numBytes);
    ZmMemoryException(const ZmMemoryException& other);
    ZmMemoryException& operator=(const ZmMemoryException& other);
    ~ZmMemoryException() override;

    uint64_t getNumBytes() const { return m_numBytes; }

    const char* what() const noexcept override;

private:
    uint64_t m_numBytes = 0;
    /// Room for the longest text, "could not allocate 18446744073709551615 bytes".
    mutable char m_text[48] = {};
};
