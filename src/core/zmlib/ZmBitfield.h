/// \file
/// Fixed-length bit arrays.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// An array of bits packed into 32-bit words, least significant bit first: bit i lives in word
/// i / 32 at position i % 32.
///
/// Owns its words (from `zmmalloc`/`zmrealloc`, null for 0 bits). The word count is always
/// nBits / 32 + 1, one more than a multiple of 32 needs, so 32 bits take two words: code that
/// reads the raw words relies on that spare word. Bits past nBits in the last word are unspecified
/// unless an operation says otherwise. Indices are not checked. Allocation failure throws
/// `ZmMemoryException`. Not thread-safe: callers serialise access.
class ZMLIB_API ZmBitfield {
public:
    /// The word width.
    static constexpr unsigned int NBITS = 32;

    /// How new words are filled.
    enum INIT {
        SET = 0,          ///< every new bit set
        CLEAR = 1,        ///< every new bit cleared
        UNINITIALIZED = 2 ///< new memory left as the heap gives it (any value but 0 and 1)
    };

    ZmBitfield() noexcept = default;
    /// \p n bits, every word filled according to \p init.
    ZmBitfield(uint64_t n, INIT init);
    ZmBitfield(const ZmBitfield& other);
    ZmBitfield& operator=(const ZmBitfield& other);
    ~ZmBitfield();
    /// Exchanges the contents of two fields.
    void swap(ZmBitfield& other) noexcept;

    uint64_t nBits() const noexcept { return m_nBits; }
    /// Bytes held by the words.
    uint64_t memSize() const noexcept { return m_nWords * sizeof(uint32_t); }
    unsigned int* dataPtr() noexcept { return m_data; }
    const unsigned int* dataPtr() const noexcept { return m_data; }

    /// Bit \p i as 0 or 1.
    int operator[](uint64_t i) const noexcept { return int((m_data[i / NBITS] >> (i % NBITS)) & 1u); }
    void set(uint64_t i) noexcept { m_data[i / NBITS] |= 1u << (i % NBITS); }
    void unset(uint64_t i) noexcept { m_data[i / NBITS] &= ~(1u << (i % NBITS)); }
    void toggle(uint64_t i) noexcept { m_data[i / NBITS] ^= 1u << (i % NBITS); }
    void set(uint64_t i, bool value) noexcept
    {
        if (value) {
            set(i);
        } else {
            unset(i);
        }
    }

    /// Resizes to \p n bits. Added words are filled according to \p init; when growing, the
    /// unused high bits of the old last word are set or cleared the same way, so every new bit
    /// reads as the initial value. 0 frees the words.
    void resize(uint64_t n, INIT init);

private:
    uint64_t m_nBits = 0;
    uint64_t m_nWords = 0;
    unsigned int* m_data = nullptr;
};
