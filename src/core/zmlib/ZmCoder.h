/// \file
/// Low-level coders: the MD5 context, the checksum CRC and two byte-to-text encodings.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstddef>
#include <cstdint>

/// An MD5 context (the digest of RFC 1321, computed by the library's own code) plus static helpers:
/// the CRC of the POSIX `cksum` command, hexadecimal text and the "letter" encoding (one byte as two
/// letters 'A' to 'P').
///
/// A ZmCoder owns nothing but its context (state words, byte count, a 64-byte buffer for a partial
/// block); copying it copies the running digest. One object is used by one thread at a time; the
/// static functions are safe from any number of threads (the CRC implementation switch excepted,
/// see setCrcImplementation()). Nothing here fails, except that the letter encoders return null
/// when `malloc` does (or, for abcEncode(), when 2n would not fit an int).
class ZMLIB_API ZmCoder {
public:
    /// The context starts initialised (as after crcMD5Init()).
    ZmCoder() noexcept { crcMD5Init(); }

    // --- MD5 -----------------------------------------------------------------------------------

    /// Starts a new digest.
    void crcMD5Init() noexcept;
    /// Feeds \p n bytes; any alignment, any split into calls.
    void crcMD5Update(const unsigned char* data, unsigned int n) noexcept;
    /// Appends the padding and the bit length; the state then holds the digest. Feeding more
    /// bytes afterwards needs a new crcMD5Init().
    void crcMD5Final() noexcept;
    /// The current state words as 16 bytes in MD5 output order (the digest after crcMD5Final()).
    void crcMD5Query(unsigned char digest[16]) const noexcept;

    // --- CRC of `cksum` ------------------------------------------------------------------------

    /// The POSIX `cksum` checksum of \p n bytes (CRC-32, polynomial 0x04C11DB7, most significant
    /// bit first, start 0, then the length bytes, complemented). n = 0 gives 0xFFFFFFFF.
    static unsigned int crc(const unsigned char* data, unsigned int n) noexcept;
    /// Continues a raw CRC (start with 0) over \p n more bytes, for data that arrives in pieces.
    static uint32_t crcUpdate(uint32_t crc, const unsigned char* data, size_t n) noexcept;
    /// Completes a raw CRC over \p totalLength bytes: feeds the length bytes, then complements.
    /// crc(data, n) == crcFinish(crcUpdate(0, data, n), n).
    static uint32_t crcFinish(uint32_t crc, uint64_t totalLength) noexcept;

    /// Which code computes crcUpdate(). Both give identical results.
    enum class CrcImplementation {
        Automatic,         ///< only for setCrcImplementation(): the fastest the processor supports
        Portable,          ///< table-driven, eight bytes per step
        CarrylessMultiply, ///< folding with the x86 carry-less multiply instruction
    };
    /// Chooses the CRC code for the whole process (Automatic at start); asking for
    /// CarrylessMultiply on a processor without it gives Portable. Meant for tests and
    /// measurements; call it while no other thread computes a CRC. Returns the code now in use.
    static CrcImplementation setCrcImplementation(CrcImplementation which) noexcept;
    /// The code in use (never Automatic).
    static CrcImplementation crcImplementation() noexcept;

    // --- text encodings ------------------------------------------------------------------------

    /// Replaces \p out with two hexadecimal digits per byte, no separators.
    static void dataToHexString(const unsigned char* data, unsigned int n, ZmString& out, bool upperCase);
    /// Writes hex.length() / 2 bytes to \p out, one per pair of characters; a trailing odd character
    /// is ignored and a character that is not a hexadecimal digit (either case) counts as 0.
    static void hexStringToData(unsigned char* out, const ZmString& hex) noexcept;
    /// Each byte as two letters 'A' + high nibble, 'A' + low nibble; \p outLength = 2n. Returns a
    /// malloc'd, NUL-terminated buffer the caller frees; null \p data or n <= 0 give "" (length 0).
    /// Null (\p outLength 0) when malloc fails or n > INT_MAX / 2.
    static char* abcEncode(const unsigned char* data, int n, int& outLength);
    /// The inverse of abcEncode(): \p outLength = n / 2 bytes, one per pair of letters ('A' to 'P'
    /// or 'a' to 'p'); any other character counts as 0 and a trailing odd character is ignored.
    /// Malloc'd and NUL-terminated (the zero byte not counted); null \p text or n <= 0 give "".
    static char* abcDecode(const char* text, int n, int& outLength);

private:
    void md5Blocks(const unsigned char* data, size_t blocks) noexcept;

    uint32_t m_state[4];
    uint64_t m_count;           // bytes fed so far
    unsigned char m_buffer[64]; // the partial block, m_count % 64 bytes
};
