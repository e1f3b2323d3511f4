#include <zmlib/ZmBitfield.h>

#include <zmlib/ZmMemory.h>

#include <cstring>
#include <utility>

ZmBitfield::ZmBitfield(uint64_t n, INIT init)
{
    resize(n, init);
}

ZmBitfield::ZmBitfield(const ZmBitfield& other) : m_nBits(other.m_nBits), m_nWords(other.m_nWords)
{
    if (m_nWords != 0) {
        m_data = static_cast<unsigned int*>(zmmalloc(other.memSize()));
        std::memcpy(m_data, other.m_data, other.memSize());
    }
}

ZmBitfield& ZmBitfield::operator=(const ZmBitfield& other)
{
    if (this != &other) {
        ZmBitfield copy(other);
        swap(copy);
    }
    return *this;
}

ZmBitfield::~ZmBitfield()
{
    zmfree(m_data);
}

void ZmBitfield::swap(ZmBitfield& other) noexcept
{
    std::swap(m_nBits, other.m_nBits);
    std::swap(m_nWords, other.m_nWords);
    std::swap(m_data, other.m_data);
}

void ZmBitfield::resize(uint64_t n, INIT init)
{
    if (n == 0) {
        zmfree(m_data);
        m_data = nullptr;
        m_nBits = 0;
        m_nWords = 0;
        return;
    }
    const uint64_t words = n / NBITS + 1;
    if (words != m_nWords) {
        m_data = static_cast<unsigned int*>(zmrealloc(m_data, words * sizeof(uint32_t)));
        if (words > m_nWords && (init == SET || init == CLEAR)) {
            std::memset(m_data + m_nWords, init == SET ? 0xff : 0x00, (words - m_nWords) * sizeof(uint32_t));
        }
    }
    if (n > m_nBits && m_nBits % NBITS != 0) {
        const uint32_t high = ~((1u << (m_nBits % NBITS)) - 1u);
        if (init == SET) {
            m_data[m_nBits / NBITS] |= high;
        } else if (init == CLEAR) {
            m_data[m_nBits / NBITS] &= ~high;
        }
    }
    m_nBits = n;
    m_nWords = words;
}
