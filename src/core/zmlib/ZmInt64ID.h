/// \file
/// The signed 64-bit identifiers' shared conversions.
#pragma once

#include <zmlib/ZmID.h>
#include <zmlib/ZmString.h>

#include <cstdint>

/// A `ZmID<int64_t, emptyValue>` with the number and text conversions that every signed 64-bit
/// identifier (`ZmUniqueID`, `ZmTransferID`, `ZmFrameID`) offers, returning the identifier type
/// \p Derived itself.
///
/// A plain value: copy it freely between threads. Nothing fails: a text that is no number reads
/// as the runtime's 64-bit `atoi` reads it (0 when nothing converts); allocation failure of
/// `toZmString` throws `ZmMemoryException`.
template <class Derived, int64_t emptyValue>
class ZmInt64ID : public ZmID<int64_t, emptyValue> {
public:
    constexpr ZmInt64ID() noexcept = default;
    constexpr explicit ZmInt64ID(int64_t v) noexcept : ZmID<int64_t, emptyValue>(v) {}

    static Derived fromInt64(int64_t v) noexcept { return Derived(v); }
    /// The number at the start of \p text (`ZmString::toInt64`); null reads as 0.
    static Derived fromLatin1(const char* text) { return Derived(ZmString::toInt64(text)); }
    /// The decimal value.
    ZmString toZmString() const { return ZmString::fromInt64(this->value()); }
};
