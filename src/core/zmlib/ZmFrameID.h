/// \file
/// Identifiers of frames.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmInt64ID.h>

#include <cstdint>

/// Names a frame with a signed 64-bit number; -1 is empty. Ordered by the signed value.
///
/// `isValid()` is true for every value >= -1, the empty value included; only more negative values
/// are invalid. That is intended: callers treat "no frame yet" as a valid state.
///
/// A plain value: copy it freely between threads. Nothing fails: a text that is no number reads
/// as the runtime's 64-bit `atoi` reads it (0 when nothing converts).
class ZMLIB_API ZmFrameID : public ZmInt64ID<ZmFrameID, -1> {
public:
    constexpr ZmFrameID() noexcept = default;
    constexpr explicit ZmFrameID(int64_t v) noexcept : ZmInt64ID<ZmFrameID, -1>(v) {}

    /// Every value >= -1 (intended, see above).
    bool isValid() const noexcept { return value() >= -1; }
    /// Whether this frame lies within [\p first, \p last]; an empty bound is open on its side.
    bool isInRange(const ZmFrameID& first, const ZmFrameID& last) const noexcept
    {
        return (first.isEmpty() || first.value() <= value()) && (last.isEmpty() || value() <= last.value());
    }
};
