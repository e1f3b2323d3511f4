/// \file
/// A 128-bit value of two 64-bit words: keys, UUIDs and digests are built on it.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// Two unsigned 64-bit words in storage order: `first` holds bytes 0-7 and `second` bytes 8-15,
/// each word in host (little-endian) order. Ordered by the first word, then the second, both
/// unsigned. All zero is "not valid". A plain value: copy it freely between threads.
class Zm128 {
public:
    constexpr Zm128() noexcept = default;
    constexpr Zm128(uint64_t firstWord, uint64_t secondWord) noexcept : first(firstWord), second(secondWord)
    {}

    /// Either word is not zero.
    constexpr bool isValid() const noexcept { return first != 0 || second != 0; }

    /// -1, 0 or 1.
    static constexpr int compare(const Zm128& a, const Zm128& b) noexcept
    {
        if (a.first != b.first) {
            return a.first < b.first ? -1 : 1;
        }
        if (a.second != b.second) {
            return a.second < b.second ? -1 : 1;
        }
        return 0;
    }

    constexpr bool operator==(const Zm128& o) const noexcept
    {
        return first == o.first && second == o.second;
    }
    constexpr bool operator!=(const Zm128& o) const noexcept { return !(*this == o); }
    constexpr bool operator<(const Zm128& o) const noexcept { return compare(*this, o) < 0; }
    constexpr bool operator<=(const Zm128& o) const noexcept { return compare(*this, o) <= 0; }
    constexpr bool operator>(const Zm128& o) const noexcept { return compare(*this, o) > 0; }
    constexpr bool operator>=(const Zm128& o) const noexcept { return compare(*this, o) >= 0; }

    uint64_t first = 0;
    uint64_t second = 0;
};

/// The low 32 bits of the first word.
inline uint32_t zm_hash(const Zm128& v) noexcept
{
    return static_cast<uint32_t>(v.first);
}
