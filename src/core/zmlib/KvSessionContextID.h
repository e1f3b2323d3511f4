/// \file
/// Identifiers of client sessions.
#pragma once

#include <zmlib/ZmID.h>

/// Names a session on the server; -1 is empty. Converts to and from `int` (explicitly from, so
/// that comparing with an int is never ambiguous).
///
/// `isValid()` is true for every value >= -1, the empty value included; only more negative values
/// are invalid. That is intended: callers treat "no session yet" as a valid state.
///
/// A plain value: copy it freely between threads. Nothing fails.
class KvSessionContextID : public ZmID<int, -1> {
public:
    constexpr KvSessionContextID() noexcept = default;
    constexpr explicit KvSessionContextID(int v) noexcept : ZmID<int, -1>(v) {}

    constexpr operator int() const noexcept { return value(); }

    constexpr bool operator==(const KvSessionContextID& o) const noexcept { return value() == o.value(); }
    constexpr bool operator<(const KvSessionContextID& o) const noexcept { return value() < o.value(); }

    /// -1, 0 or 1.
    static constexpr int compare(const KvSessionContextID& a, const KvSessionContextID& b) noexcept
    {
        return a.value() < b.value() ? -1 : (a.value() > b.value() ? 1 : 0);
    }

    /// Every value >= -1 (intended, see above).
    constexpr bool isValid() const noexcept { return value() >= -1; }
};
