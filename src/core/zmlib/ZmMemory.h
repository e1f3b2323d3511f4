/// \file
/// The heap functions behind every array and string of the library.
///
/// They are the runtime's malloc/realloc/free, except that running out of memory throws
/// `ZmMemoryException` (holding the requested byte count) instead of returning null. Thread-safe as
/// the runtime heap is.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// Allocates \p size bytes; never returns null (throws `ZmMemoryException(size)`).
ZMLIB_API void* zmmalloc(uint64_t size);

/// Resizes a block from `zmmalloc`.
/// - \p p null: as `zmmalloc(size)`.
/// - \p size 0: frees \p p and returns null.
/// - otherwise the runtime realloc; on failure throws `ZmMemoryException(size)` and \p p stays valid.
ZMLIB_API void* zmrealloc(void* p, uint64_t size);

/// Frees a block from `zmmalloc`/`zmrealloc`; null is ignored.
ZMLIB_API void zmfree(void* p);
