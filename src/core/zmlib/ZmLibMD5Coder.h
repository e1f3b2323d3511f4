/// \file
/// Incremental MD5 over typed values.
#pragma once

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmLibMD5.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmUniqueID.h>

#include <cstdint>
#include <string>

class ZmBox3f;
class ZmBox3i;
class ZmMat3f;
class ZmMat4f;
class ZmPlane;
class ZmVec2f;
class ZmVec2i;
class ZmVec3f;
class ZmVec3i;
class ZmVec3l;
class ZmVec4f;

namespace ZmLib {

class MD5List;

/// Computes an MD5 digest from bytes and typed values fed one after another (`append` and the
/// `operator<<` overloads below), for fingerprints of data built from many pieces.
///
/// Owns a `ZmCoder` context and a running flag, true from construction until `finalize()`; copies
/// carry the running digest. One thread at a time. Nothing fails.
class ZMLIB_API MD5Coder {
public:
    MD5Coder() noexcept = default;
    MD5Coder(const MD5Coder&) noexcept = default;
    MD5Coder& operator=(const MD5Coder&) noexcept = default;

    /// Feeds \p n bytes. n = 0 feeds the four bytes of the integer 4711 (67 12 00 00) instead, so
    /// that an empty piece still changes the digest; only the low 32 bits of \p n are used.
    /// Ignored once finalised.
    void append(const void* data, uint64_t n) noexcept;
    /// Adds the padding and the length and returns the digest; the coder stops running. A second
    /// call returns the same digest.
    MD5 finalize() noexcept;
    /// The context's current state words as a digest, without finalising (the final digest once
    /// finalised).
    MD5 hash() const noexcept;
    bool isRunning() const noexcept { return m_running; }

private:
    ZmCoder m_coder;
    bool m_running = true;
};

// Typed values are fed as their bytes in memory (little-endian).
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, char v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, unsigned char v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, short v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, unsigned short v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, int v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, unsigned int v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, float v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, int64_t v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, uint64_t v) noexcept;
/// The identifier's 64-bit value.
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmUniqueID& v) noexcept;
/// The 16 digest bytes.
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const MD5& v) noexcept;
/// A 64-bit count strlen + 1, then the text with its zero byte; null counts as "".
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const char* v) noexcept;
/// A 64-bit count of the stored bytes (length + 1), then those bytes with the terminator.
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmString& v) noexcept;
/// A 64-bit count of the characters, then the characters (no terminator).
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const std::string& v) noexcept;
/// The list's combined digest (16 bytes).
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const MD5List& v);

// Geometry values are fed as their components in storage order: 8 bytes for the 2-vectors, 12 for
// the 3-vectors of floats and integers, 16 for ZmVec4f and ZmPlane (normal, distance), 24 for the
// boxes (xmin, xmax, ymin, ymax, zmin, zmax) and ZmVec3l, 36 and 64 for the matrices (row by row).
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec2f& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec2i& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec3f& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec3i& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec3l& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmVec4f& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmPlane& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmBox3f& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmBox3i& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmMat3f& v) noexcept;
ZMLIB_API MD5Coder& operator<<(MD5Coder& coder, const ZmMat4f& v) noexcept;

} // namespace ZmLib
