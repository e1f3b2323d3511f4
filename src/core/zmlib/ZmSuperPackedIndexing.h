/// \file
/// Packed indexing built piece by piece, with 64-bit packed positions.
#pragma once

#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>

#include <cstdint>

/// The incremental, 64-bit variant of `ZmPackedIndexing`: the mask arrives in pieces (for example
/// one slice or one volume at a time) through appendIndexSpace(), and the elements of each piece
/// continue the element positions of the pieces before it. Packed positions and counts are 64-bit;
/// element indices passed to index() and valid() are `int`, as callers use them.
///
/// Per block of 256 elements it keeps the number of selected elements before the block (64-bit),
/// per element its rank within its block (one byte), and a bit per element saying whether it is
/// selected. Owns its tables; copies copy them. Allocation failure throws `ZmMemoryException`;
/// nothing else fails. Not thread-safe while pieces are appended; afterwards it may be read from
/// any number of threads.
class ZMLIB_API ZmSuperPackedIndexing {
public:
    /// No elements.
    ZmSuperPackedIndexing() = default;

    /// Appends \p n elements, selected where mask[i] != 0; they become elements getNumElems() to
    /// getNumElems() + n - 1. \p n <= 0 appends nothing.
    void appendIndexSpace(const unsigned char* mask, int64_t n);

    /// The packed position of a selected element \p i (the number of selected elements before it,
    /// over all pieces); for an element that is not selected the value has no meaning. Not checked.
    int64_t index(int i) const noexcept { return m_blockBase[i / kBlock] + m_offsetInBlock[i]; }
    /// Whether element \p i is selected. \p i must be below getNumElems().
    bool valid(int i) const noexcept { return m_validMask[uint64_t(i)] != 0; }
    /// The number of elements appended so far.
    int64_t getNumElems() const noexcept { return m_numElems; }
    /// The number of selected elements so far.
    int64_t getNumPackedElems() const noexcept { return m_packedSize; }
    /// The same as getNumPackedElems(): the size of the packed array.
    int64_t getPackedSize() const noexcept { return m_packedSize; }

private:
    static constexpr int kBlock = 256;

    ZmDArray<int64_t> m_blockBase;
    ZmDArray<unsigned char> m_offsetInBlock;
    ZmBitfield m_validMask; // grows ahead of m_numElems, by half its size at least
    int64_t m_numElems = 0;
    int64_t m_packedSize = 0;
};
