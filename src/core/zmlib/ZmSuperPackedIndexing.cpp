#include <zmlib/ZmSuperPackedIndexing.h>

#include <algorithm>

void ZmSuperPackedIndexing::appendIndexSpace(const unsigned char* mask, int64_t n)
{
    if (n <= 0) {
        return;
    }
    const int64_t start = m_numElems;
    const int64_t end = start + n;
    // Many small pieces must not reallocate the bits every time: grow geometrically.
    if (uint64_t(end) > m_validMask.nBits()) {
        m_validMask.resize(std::max(uint64_t(end), m_validMask.nBits() + m_validMask.nBits() / 2),
                           ZmBitfield::CLEAR);
    }
    m_offsetInBlock.resize(end);
    m_blockBase.resize((end + kBlock - 1) / kBlock);

    int64_t count = m_packedSize;
    // A piece may start inside a block begun by the previous piece: its base is already there.
    int64_t base = start % kBlock != 0 ? m_blockBase[start / kBlock] : count;
    for (int64_t i = start; i < end; ++i) {
        if (i % kBlock == 0) {
            base = count;
            m_blockBase[i / kBlock] = base;
        }
        const bool selected = mask[i - start] != 0;
        m_validMask.set(uint64_t(i), selected);
        if (selected) {
            m_offsetInBlock[i] = static_cast<unsigned char>(count - base);
            ++count;
        } else {
            m_offsetInBlock[i] = 0;
        }
    }
    m_numElems = end;
    m_packedSize = count;
}
