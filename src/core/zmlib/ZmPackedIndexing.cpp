#include <zmlib/ZmPackedIndexing.h>

namespace {

/// The one pass shared by both constructors: the running count at the start of each block and
/// the in-block rank of each selected element (0 for the others). Returns the count.
template <typename Selected>
int build(int n, ZmDArray<int>& blockBase, ZmDArray<unsigned char>& offsetInBlock, int block,
          Selected selected)
{
    blockBase.resize((int64_t(n) + block - 1) / block);
    offsetInBlock.resize(n);
    int count = 0;
    int base = 0;
    for (int i = 0; i < n; ++i) {
        if (i % block == 0) {
            base = count;
            blockBase[i / block] = base;
        }
        if (selected(i)) {
            offsetInBlock[i] = static_cast<unsigned char>(count - base);
            ++count;
        } else {
            offsetInBlock[i] = 0;
        }
    }
    return count;
}

} // namespace

ZmPackedIndexing::ZmPackedIndexing(const ZmBitfield& mask)
{
    const unsigned int* words = mask.dataPtr();
    m_packedSize = build(static_cast<int>(mask.nBits()), m_blockBase, m_offsetInBlock, kBlock,
                         [words](int i) { return ((words[i / 32] >> (i % 32)) & 1u) != 0; });
}

ZmPackedIndexing::ZmPackedIndexing(const unsigned char* mask, int n)
{
    m_packedSize =
        build(n < 0 ? 0 : n, m_blockBase, m_offsetInBlock, kBlock, [mask](int i) { return mask[i] != 0; });
}
