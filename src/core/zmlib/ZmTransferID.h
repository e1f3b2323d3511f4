/// \file
/// Identifiers of data transfers.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmInt64ID.h>

#include <cstdint>

/// Names a data transfer between client and server with a signed 64-bit number; 0 is empty.
/// Ordered by the signed value.
///
/// A plain value: copy it freely between threads. Nothing fails: a text that is no number reads
/// as the runtime's 64-bit `atoi` reads it (0 when nothing converts).
class ZMLIB_API ZmTransferID : public ZmInt64ID<ZmTransferID, 0> {
public:
    constexpr ZmTransferID() noexcept = default;
    constexpr explicit ZmTransferID(int64_t v) noexcept : ZmInt64ID<ZmTransferID, 0>(v) {}
};
