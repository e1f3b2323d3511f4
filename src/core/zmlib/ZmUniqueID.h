/// \file
/// Identifiers of unique objects.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmInt64ID.h>

#include <cstdint>

/// Names a unique object with a signed 64-bit number; 0 is empty. Ordered by the signed value.
///
/// A plain value: copy it freely between threads. Nothing fails: a text that is no number reads
/// as the runtime's 64-bit `atoi` reads it (0 when nothing converts).
class ZMLIB_API ZmUniqueID : public ZmInt64ID<ZmUniqueID, 0> {
public:
    constexpr ZmUniqueID() noexcept = default;
    constexpr explicit ZmUniqueID(int64_t v) noexcept : ZmInt64ID<ZmUniqueID, 0>(v) {}

    /// -1, 0 or 1, by the signed value.
    static int compare(const ZmUniqueID& a, const ZmUniqueID& b) noexcept
    {
        return a.value() < b.value() ? -1 : (a.value() > b.value() ? 1 : 0);
    }
};
