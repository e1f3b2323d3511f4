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

/// Asked before every request that `zmmalloc`/`zmrealloc` pass to the heap, with its byte count.
/// Returning true makes that request fail exactly as an exhausted heap would (the
/// `ZmMemoryException` is thrown and a block being resized stays as it was).
using ZmAllocationFailureHook = bool (*)(uint64_t size);

/// Installs \p hook (null removes it) and returns the previous one.
///
/// A testing aid, so that the out-of-memory paths of the library and of its callers can be
/// exercised without exhausting a real heap: fail the Nth request, or every request from the Nth
/// on. The hook may be called from any thread that allocates, concurrently; it must not allocate
/// through these functions itself. Process-wide; install it while no other thread allocates
/// through the library if the count must be exact.
ZMLIB_API ZmAllocationFailureHook zmSetAllocationFailureHook(ZmAllocationFailureHook hook);
