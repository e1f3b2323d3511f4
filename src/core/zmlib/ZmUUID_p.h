/// \file
/// The random source of ZmUUID (private; ZmUUID_posix.cpp on POSIX systems).
#pragma once

#include <cstddef>

namespace ZmUUIDPlatform {

/// Fills \p n bytes from the system's random source; false if it cannot.
bool kernelRandom(unsigned char* out, size_t n);

/// The fallback when that is not available: four bytes at a time from the system's random device,
/// from the last four bytes to the first, stopping at the first failure. Returns how many bytes
/// were filled.
int fallbackRandom(unsigned char (&bytes)[16]);

} // namespace ZmUUIDPlatform
