/// \file
/// Identifiers of data transfers.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmID.h>
#include <zmlib/ZmString.h>

#include <cstdint>

/// Names a data transfer between client and server with a signed 64-bit number; 0 is empty.
/// Ordered by the signed value.
///
/// A plain value: copy it freely between threads. Nothing fails: a text that is no number reads
/// as the runtime's 64-bit `atoi` reads it (0 when nothing converts).
class ZMLIB_API ZmTransferID : public ZmID<int64_t, 0> {
public:
    constexpr ZmTransferID() noexcept = default;
    constexpr explicit ZmTransferID(int64_t v) noexcept : ZmID<int64_t, 0>(v) {}

    static ZmTransferID fromInt64(int64_t v) noexcept { return ZmTransferID(v); }
    /// The number at the start of \p text (`ZmString::toInt64`); null gives the empty identifier.
    static ZmTransferID fromLatin1(const char* text);
    /// The decimal value.
    ZmString toZmString() const;
};
