/// \file
/// The library's byte string.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>
#include <zmlib/zmWildMatch.h>

#include <cstdarg>
#include <cstdint>
#include <cstring>

/// A byte string: a `ZmDArray<char>` that always ends in a zero byte, so `getString()` can be
/// handed to anything expecting a zero-terminated text.
///
/// Invariant: size() >= 1 and the last element is 0; `length()` is size() - 1. A new empty string
/// has capacity 16. No encoding is assumed; case operations use the runtime's `tolower`/`toupper`
/// in the current locale. Lengths and positions are `int`, as the callers use them.
///
/// The move constructor and move assignment copy, and the moved-from string keeps its text: old
/// call sites read a string after "moving" it, so moves must not empty it.
///
/// Allocation failure throws `ZmMemoryException`; nothing else is reported. Positions are not
/// checked except by `index(const char*, int)`. Not thread-safe: one thread at a time.
class ZMLIB_API ZmString : public ZmDArray<char> {
public:
    ZmString() : ZmDArray<char>(1, 16) { m_data[0] = 0; }
    /// A copy of \p s; null gives the empty string.
    ZmString(const char* s);
    /// The \p n bytes at \p s + \p start, then a terminator.
    ZmString(const char* s, int start, int n);
    /// \p n copies of \p c.
    ZmString(char c, unsigned int n);
    /// printf-formatted; the first argument only tells this constructor apart from the others.
    ZmString(int, const char* fmt, ...) ZMLIB_PRINTF(3, 4);
    ZmString(const ZmString& other) : ZmDArray<char>(other) {}
    /// Copies: the source keeps its text.
    // NOLINTNEXTLINE(performance-move-constructor-init,performance-noexcept-move-constructor)
    ZmString(ZmString&& other) : ZmDArray<char>(other) {}
    ~ZmString() = default;

    ZmString& operator=(const ZmString& other)
    {
        ZmDArray<char>::operator=(other);
        return *this;
    }
    /// Copies: the source keeps its text.
    // NOLINTNEXTLINE(performance-noexcept-move-constructor)
    ZmString& operator=(ZmString&& other)
    {
        ZmDArray<char>::operator=(static_cast<const ZmDArray<char>&>(other));
        return *this;
    }
    /// Null gives the empty string.
    ZmString& operator=(const char* s);

    // --- access and tests ----------------------------------------------------------------------

    char* getString() noexcept { return m_data; }
    const char* getString() const noexcept { return m_data; }
    int length() const noexcept { return static_cast<int>(m_size - 1); }
    bool isEmptyString() const noexcept { return m_size == 1 || m_data[0] == 0; }
    /// Every byte an ASCII letter or digit (true for the empty string).
    bool isAlnum() const;
    /// Every byte an ASCII letter (true for the empty string).
    bool isAlpha() const;
    /// Every byte an ASCII digit (true for the empty string).
    bool isDigit() const;

    // --- comparison (byte-wise) ----------------------------------------------------------------

    bool operator==(const ZmString& other) const
    {
        return m_size == other.m_size && std::strcmp(m_data, other.m_data) == 0;
    }
    bool operator!=(const ZmString& other) const { return !(*this == other); }
    /// \p s must not be null.
    bool operator==(const char* s) const { return std::strcmp(m_data, s) == 0; }
    /// A null \p s is never reported different (the result is length() == -1, always false):
    /// callers test strings against possibly-null texts and rely on that.
    bool operator!=(const char* s) const;
    bool operator<(const char* s) const { return std::strcmp(m_data, s) < 0; }
    bool operator<=(const char* s) const { return std::strcmp(m_data, s) <= 0; }
    bool operator>(const char* s) const { return std::strcmp(m_data, s) > 0; }
    bool operator>=(const char* s) const { return std::strcmp(m_data, s) >= 0; }
    /// Equal lengths, then equal bytes (case-insensitively with \p ignoreCase).
    bool isEqualTo(const ZmString& other, bool ignoreCase) const;

    static int strcasecmp(const char* a, const char* b);
    static int strncasecmp(const char* a, const char* b, uint64_t n);
    /// The runtime's re-entrant tokenizer.
    static char* strtok(char* s, const char* delims, char** context);

    // --- searching (positions, -1 when not found) ----------------------------------------------

    /// First position >= \p start holding \p c; the terminator is included, so searching for 0
    /// gives length().
    int index(char c, int start = 0) const
    {
        const void* p = std::memchr(m_data + start, c, size_t(m_size - start));
        return p == nullptr ? -1 : static_cast<int>(static_cast<const char*>(p) - m_data);
    }
    /// Last position <= \p start holding \p c; a negative \p start searches from the terminator.
    int rindex(char c, int start = -1) const;
    int index(const char* sub) const;
    /// Searches from \p start, which must lie in 0 .. size() - 1 (else -1).
    int index(const char* sub, int start) const;
    /// Case-insensitive first occurrence of \p sub.
    int iindex(const char* sub) const;
    /// zmWildMatch of this text against \p pattern.
    int matches(const char* pattern) const;

    // --- editing -------------------------------------------------------------------------------

    /// Empty text; the capacity is kept.
    void clear()
    {
        m_size = 1;
        m_data[0] = 0;
    }
    /// \p c takes the terminator's place and a new terminator follows.
    ZmString& operator+=(char c)
    {
        // Grow first, then write both bytes through one pointer: a failed growth leaves the text
        // intact, and the size is not re-read between the two stores.
        if (m_size < m_max) {
            ++m_size;
        } else {
            insertMemory(m_size, 1);
        }
        char* end = m_data + m_size;
        end[-2] = c;
        end[-1] = 0;
        return *this;
    }
    /// Null does nothing.
    ZmString& operator+=(const char* s)
    {
        if (s != nullptr) {
            remove0();
            try {
                append(int64_t(std::strlen(s)) + 1, s);
            } catch (...) {
                ++m_size; // the terminator is still in place: a failed append changes nothing
                throw;
            }
        }
        return *this;
    }
    ZmString& operator+=(const ZmString& s) { return *this += s.getString(); }
    ZmString operator+(const ZmString& other) const;
    /// Inserts the bytes of \p s at \p pos.
    void insertStr(int pos, const char* s);
    /// Removes the last \p n characters.
    void removeLast(int64_t n)
    {
        m_size -= n + 1;
        append('\0');
    }
    void replace(char from, char to);
    /// Replaces every non-overlapping occurrence of \p from (scanned left to right in the original
    /// text) by \p to (nothing for null); an empty \p from changes nothing.
    void replaceSubStr(const char* from, const char* to);
    void toLower();
    void toUpper();
    /// Removes trailing, then leading blanks (the byte ' ' only).
    void unpad();
    /// Bytes \p from to \p to inclusive; unchecked.
    ZmString substr(unsigned int from, unsigned int to) const;
    /// Splits at \p sep into \p out (emptied first); always yields at least one piece.
    void explode(char sep, ZmDArray<ZmString>& out) const;
    /// A form that ZmStringTokenizer reads back as one token: quoted when forced, empty or holding
    /// white space; double quotes and backslashes escaped.
    ZmString protect(bool forceQuotes = false) const;

    // --- numbers -------------------------------------------------------------------------------

    /// Replaces the content with the formatted text; returns the data pointer. Formats into the
    /// string's own block, doubling it while the text does not fit. When that growth fails, the
    /// string holds the start of the formatted text (terminated at its length) as the
    /// `ZmMemoryException` leaves; every other editing operation leaves the text as it was.
    char* printf(const char* fmt, ...) ZMLIB_PRINTF(2, 3);
    char* vprintf(const char* fmt, va_list args);
    /// The decimal text of \p v.
    void setInt64(int64_t v);
    static ZmString fromInt64(int64_t v);
    /// "%d"; \p ok tells whether one value was converted (0 when none).
    int toInt(bool& ok) const;
    /// "%f"; \p ok tells whether one value was converted (0 when none).
    float toFloat(bool& ok) const;
    /// 0 for the empty string, else the runtime's 64-bit atoi.
    int64_t toInt64() const;
    static int64_t toInt64(const char* s);

private:
    friend class ZmException;
    struct NoBlock {};
    /// Holds no block at all (size 0, data null): the one state that breaks the invariant, used
    /// only by exceptions that must be built without allocating. getString() is null there.
    explicit ZmString(NoBlock) noexcept {}

    /// Drops the terminator before appending.
    void remove0() { --m_size; }
    /// \p pred holds for every byte of the text (true for the empty text).
    template <class Pred>
    bool allBytes(Pred pred) const;
};
