/// \file
/// 128-bit universally unique identifiers and their two text forms.
#pragma once

#include <zmlib/Zm128.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>

/// A UUID: 16 bytes in storage order, held as the two words of a `Zm128` (bytes 0-7 in `first`,
/// 8-15 in `second`, each word little-endian). All zero is the nil UUID (`isValid()` false).
/// Ordered, compared and tested like `Zm128`.
///
/// The text forms show the bytes in storage order, high nibble first: 32 upper-case hexadecimal
/// characters, or the same grouped 8-4-4-4-12 with dashes inside braces. The bytes are not
/// re-ordered into the mixed-endian field order some systems use for GUIDs; both forms read back
/// to the same value.
///
/// A plain value: copy it freely between threads; `generateUUID()` may be called from any thread.
/// Nothing throws or reports. Text of the wrong length or shape reads as the nil UUID; characters
/// are not checked beyond that, so 32 characters that are not all hexadecimal read as some UUID
/// (see `fromString()`), not as nil.
class ZMLIB_API ZmUUID : public Zm128 {
public:
    /// The nil UUID.
    constexpr ZmUUID() noexcept = default;
    constexpr ZmUUID(uint64_t firstWord, uint64_t secondWord) noexcept : Zm128(firstWord, secondWord) {}
    constexpr explicit ZmUUID(const Zm128& v) noexcept : Zm128(v) {}

    /// A random (version 4, RFC 4122 variant) UUID from the kernel's random source, with
    /// /dev/urandom as the fallback. Byte 6 has the high nibble 4 and byte 8 the top bits 10, so
    /// the 13th character of `toString()` is '4' and the 17th one of "89AB". Nil only if no
    /// random byte could be obtained at all.
    static ZmUUID generateUUID();

    /// 32 upper-case hexadecimal characters, one pair per byte in storage order.
    ZmString toString() const;
    /// "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}": `toString()` grouped, 38 characters.
    ZmString toFormattedString() const;

    /// Reads the form of `toString()` (either letter case); any length but 32 gives nil. The
    /// characters are not validated: below 'A' counts as a digit, below 'a' as an upper-case
    /// letter, anything else as a lower-case letter (intended: callers pass texts this library
    /// wrote), and each pair is truncated to a byte.
    static ZmUUID fromString(const ZmString& s);
    /// Reads the form of `toFormattedString()`: exactly 38 characters with '{' at 0, '-' at 9,
    /// 14, 19 and 24 and '}' at 37, else nil; the hexadecimal characters as in `fromString()`.
    static ZmUUID fromFormattedString(const ZmString& s);

    /// Bytes 12-15 read as a little-endian 32-bit integer (the high half of `second`).
    static uint32_t zm_hash(const ZmUUID& u) noexcept { return static_cast<uint32_t>(u.second >> 32); }
};

/// Bytes 12-15 read as a little-endian 32-bit integer.
inline uint32_t zm_hash(const ZmUUID& u) noexcept
{
    return ZmUUID::zm_hash(u);
}
