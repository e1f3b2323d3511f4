/// \file
/// The MD5 digest as a value.
#pragma once

#include <zmlib/Zm128.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>

namespace ZmLib {

/// A 16-byte MD5 digest, a content fingerprint used for caching and change detection.
///
/// The bytes are kept in the standard MD5 output order as a `Zm128` (bytes 0-7 in `first`, 8-15 in
/// `second`, each word little-endian). All zero means "no digest". Ordered as `Zm128`: first word,
/// then second, unsigned. A plain value: copy it freely between threads. Nothing fails; malformed
/// text gives the zero digest or, for 32 characters that are not all hexadecimal, some digest.
class ZMLIB_API MD5 {
public:
    /// The zero digest ("no digest").
    MD5() noexcept = default;
    explicit MD5(const Zm128& value) noexcept : m_value(value) {}

    /// The 16 bytes in output order.
    static MD5 fromBytes(const unsigned char bytes[16]) noexcept;
    void getBytes(unsigned char bytes[16]) const noexcept;
    const Zm128& value() const noexcept { return m_value; }

    /// -1, 0 or 1, as `Zm128::compare`.
    static int compare(const MD5& a, const MD5& b) noexcept { return Zm128::compare(a.m_value, b.m_value); }
    bool operator==(const MD5& o) const noexcept { return m_value == o.m_value; }
    bool operator!=(const MD5& o) const noexcept { return m_value != o.m_value; }
    bool operator<(const MD5& o) const noexcept { return m_value < o.m_value; }

    /// Replaces \p out with 32 upper-case hexadecimal digits, or "" for the zero digest.
    void toString(ZmString& out) const;
    /// Exactly 32 characters, one byte per pair, letters of either case; anything else gives the
    /// zero digest. Characters are not validated.
    static MD5 fromString(const ZmString& s) noexcept;

    /// The digest of zero bytes, D41D8CD98F00B204E9800998ECF8427E.
    static MD5 hashOfEmptyMessage() noexcept;
    bool isHashOfEmptyMessage() const noexcept { return *this == hashOfEmptyMessage(); }

private:
    Zm128 m_value;
};

/// The low 32 bits of the first word.
ZMLIB_API uint32_t zm_hash(const MD5& d) noexcept;

} // namespace ZmLib
