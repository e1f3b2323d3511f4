/// \file
/// The exception of a failed allocation.
#pragma once

#include <zmlib/ZmException.h>

#include <cstdint>

/// Thrown by `zmmalloc`/`zmrealloc` when the heap cannot serve a request.
///
/// Holds the requested byte count (0 when unknown). `what()` formats its text anew on each call:
/// "could not allocate enough memory" for 0, else "could not allocate N bytes".
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
};
