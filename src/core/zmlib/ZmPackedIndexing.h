/// \file
/// Packed indexing: positions of the selected elements of a mask in an array holding only them.
#pragma once

#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>

/// Maps the positions of a mask of n elements to consecutive positions in a packed array that
/// holds only the selected elements, in order: the k-th selected element has packed position k.
///
/// The table is built once by the constructor in one pass: per block of 256 elements the number
/// of selected elements before the block (int), per element its rank within its block (one
/// byte), so index() is two loads and an add. Owns its tables; copies copy them. Element counts
/// and positions are `int` (fewer than 2^31 elements). Nothing fails except allocation, which
/// throws `ZmMemoryException`. Immutable after construction, so it may be read from any number
/// of threads.
class ZMLIB_API ZmPackedIndexing {
public:
    /// Element i is selected when bit i of \p mask is set; n = mask.nBits().
    explicit ZmPackedIndexing(const ZmBitfield& mask);
    /// Element i is selected when mask[i] != 0; a negative \p n counts as 0.
    ZmPackedIndexing(const unsigned char* mask, int n);

    /// The packed position of a selected element \p i; for an element that is not selected the
    /// value has no meaning. \p i is not checked.
    int index(int i) const noexcept { return m_blockBase[i / kBlock] + m_offsetInBlock[i]; }
    /// The number of selected elements.
    int getPackedSize() const noexcept { return m_packedSize; }
    /// The same as getPackedSize().
    int getNumPackedElems() const noexcept { return m_packedSize; }

private:
    static constexpr int kBlock = 256;

    ZmDArray<int> m_blockBase;
    ZmDArray<unsigned char> m_offsetInBlock;
    ZmBitfield m_validMask; // left empty: this class does not answer validity (see ZmSuperPackedIndexing)
    int m_packedSize = 0;
};
