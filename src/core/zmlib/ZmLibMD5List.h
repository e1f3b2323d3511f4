/// \file
/// A set of MD5 digests combined into one.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmLibMD5.h>

namespace ZmLib {

/// Many digests combined into one fingerprint, e.g. of a data set made of many parts.
///
/// Owns its values: in insertion order, or, for a sorted list, in ascending `MD5::compare`
/// order, so that the combined digest does not depend on the order of insertion. The combined
/// digest is cached until the next insert. One thread at a time (hash() fills the cache even on a
/// const list). Allocation failure throws `ZmMemoryException`; nothing else fails.
class ZMLIB_API MD5List {
public:
    /// \p sorted is fixed for the list's life.
    explicit MD5List(bool sorted) : m_sorted(sorted) {}
    MD5List(const MD5List&) = default;
    MD5List& operator=(const MD5List&) = default;
    ~MD5List() = default;

    /// Appends \p d, or for a sorted list inserts it at its place (after equal values).
    void insert(const MD5& d);
    /// MD5 over the 16 bytes of each value, from the last value to the first; cached.
    MD5 hash() const;
    bool isSorted() const noexcept { return m_sorted; }
    const ZmDArray<MD5>& values() const noexcept { return m_values; }

private:
    bool m_sorted;
    ZmDArray<MD5> m_values;
    mutable MD5 m_hash; // zero = not computed
};

} // namespace ZmLib
