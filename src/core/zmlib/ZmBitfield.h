/// \file
/// Fixed-length bit arrays.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

class ZmString;

/// An array of bits packed into 32-bit words, least significant bit first: bit i lives in word
/// i / 32 at position i % 32. Used as a voxel mask, as a character set and as a set of indices
/// with union, intersection and subset tests.
///
/// Owns its words (from `zmmalloc`/`zmrealloc`, null for 0 bits). The word count is always
/// nBits / 32 + 1, one more than a multiple of 32 needs, so 32 bits take two words: code that
/// reads the raw words relies on that spare word. Bits past nBits in the last word are unspecified
/// memory unless an operation says otherwise; counting, searching and the subset and intersection
/// tests never look at them. Indices are not checked. Allocation failure throws
/// `ZmMemoryException`; file functions return false. Not thread-safe: callers serialise access.
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

    /// How toLabels() writes into a byte image. "Set" and "clear" refer to the bit of each byte.
    enum InsertPolicy {
        /// Set bits write the label; bytes of clear bits are left alone.
        INSERT_OVERWRITE = 1,
        /// Set bits write the label, clear bits write 0: the image becomes this mask.
        INSERT_REPLACE = 2,
        /// Set bits write the label only into bytes that are 0; nothing else changes.
        INSERT_INTO_EMPTY = 3,
        /// Bytes that are 0 or already hold the label get the label (set bit) or 0 (clear bit);
        /// bytes holding another label are kept. Re-inserting an edited mask of one label this
        /// way leaves every other label intact.
        INSERT_OWN_LABEL = 4
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

    // --- single bits ---------------------------------------------------------------------------

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

    // --- ranges and whole fields ---------------------------------------------------------------

    /// Sets bits \p from to \p to inclusive (nothing when from > to); \p to must be below nBits.
    void setRange(uint64_t from, uint64_t to) noexcept;
    /// Clears bits \p from to \p to inclusive (nothing when from > to); \p to must be below nBits.
    void unsetRange(uint64_t from, uint64_t to) noexcept;
    /// These four work on every word, the spare bits past nBits included.
    void setAll() noexcept;
    void unsetAll() noexcept;
    /// The same as unsetAll().
    void clearAll() noexcept { unsetAll(); }
    void toggleAll() noexcept;

    /// Resizes to \p n bits. The word block is reallocated when the word count changes; added
    /// words are filled according to \p init. When growing from a size that is not a multiple of
    /// 32, the unused high bits of the old last word are set or cleared the same way, so every new
    /// bit reads as the initial value. When the old size is a multiple of 32 the old spare word
    /// is not touched (intended: the word-wise algorithm does only this), so ZmBitfield(32, SET)
    /// resized to 40 bits with CLEAR reads bits 32-39 as set. 0 frees the words.
    void resize(uint64_t n, INIT init);

    // --- counting and search (bits below nBits only) -------------------------------------------

    uint64_t nSetBits() const noexcept;
    /// nBits() - nSetBits().
    uint64_t nUnsetBits() const noexcept { return m_nBits - nSetBits(); }
    /// The lowest set bit, or -1 when no bit is set.
    int64_t firstSetBit() const noexcept;
    /// The lowest clear bit, or -1 when every bit is set.
    int64_t firstUnsetBit() const noexcept;
    /// The highest set bit, or -1 when no bit is set.
    int64_t lastSetBit() const noexcept;
    bool isAnyBitSet() const noexcept { return firstSetBit() >= 0; }
    bool isAnyBitUnset() const noexcept { return firstUnsetBit() >= 0; }

    // --- set operations ------------------------------------------------------------------------
    //
    // A field stands for the set of its indices below nBits; a bit past a field's end counts as
    // clear. The operators never change nBits. With equal nBits they combine every word, the
    // spare bits included. Otherwise `&=` clears the bits of this field that \p other does not
    // reach, `|=` and `^=` change only the bits both fields have (bits of \p other past this
    // field's end are dropped), and the spare bits of this field are left as they were.

    ZmBitfield& operator&=(const ZmBitfield& other) noexcept;
    ZmBitfield& operator|=(const ZmBitfield& other) noexcept;
    ZmBitfield& operator^=(const ZmBitfield& other) noexcept;
    /// Whether some bit is set in both fields.
    bool hasIntersection(const ZmBitfield& other) const noexcept;
    /// Whether every bit set in \p other is set here too (a bit of \p other past this field's
    /// end that is set makes the answer false).
    bool isSuperset(const ZmBitfield& other) const noexcept;
    /// other.isSuperset(*this).
    bool isSubset(const ZmBitfield& other) const noexcept { return other.isSuperset(*this); }
    /// Equal nBits, equal full words (nBits / 32 of them), and equal bits below nBits in the word
    /// after them; when nBits is a multiple of 32 that word is the spare word and is compared
    /// whole (intended: it agrees with md5(), so equal fields always have equal fingerprints).
    bool operator==(const ZmBitfield& other) const noexcept;
    bool operator!=(const ZmBitfield& other) const noexcept { return !(*this == other); }

    // --- byte label images ---------------------------------------------------------------------

    /// Resizes to \p n bits, then bit i = 1 exactly when labels[i] == \p label. Every word is
    /// written, so the spare bits of the last word come out cleared.
    void fromLabels(uint64_t n, const unsigned char* labels, unsigned char label);
    /// Writes this mask into the \p n bytes at \p labels according to \p policy (an InsertPolicy
    /// value 1 to 4; any other value writes nothing). \p n must not exceed nBits.
    void toLabels(uint64_t n, unsigned char* labels, unsigned char label, InsertPolicy policy) const noexcept;

    // --- files and fingerprints ----------------------------------------------------------------

    /// Resizes to \p n bits (new words cleared) and reads (n + 7) / 8 bytes of \p fileName into the
    /// words, bit i being bit i % 8 of byte i / 8. False when the file cannot be opened or holds
    /// fewer bytes; the size is then n and the bits are partly read. No header.
    bool load(const ZmString& fileName, uint64_t n);
    /// Writes the first (nBits + 7) / 8 bytes of the words as they lie in memory (little-endian)
    /// to \p fileName, replacing it. No header. False when the file cannot be written completely.
    bool save(const ZmString& fileName) const;
    /// MD5 of the first nBits / 32 words as raw bytes, then (nBits > 0) of one more word holding
    /// only the bits below nBits. When nBits is a multiple of 32 that extra word is the spare word
    /// and is hashed as it stands, unmasked (intended: existing fingerprints depend on it).
    void md5(unsigned char* digest16) const;
    /// md5() as 32 upper-case hexadecimal digits.
    void md5(ZmString& hex) const;
    /// Replaces \p out with one character per bit, bit 0 first: '1' set, '0' clear.
    void print(ZmString& out) const;

private:
    uint64_t m_nBits = 0;
    uint64_t m_nWords = 0;
    unsigned int* m_data = nullptr;
};
