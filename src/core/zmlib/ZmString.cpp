#include <zmlib/ZmString.h>

#include <cctype>
#include <charconv>
#include <cstdio>
#include <cstdlib>

// The exported instantiation of the array behind every string.
template class ZmDArray<char>;

namespace {

bool isAsciiDigit(char c)
{
    return c >= '0' && c <= '9';
}

bool isAsciiAlpha(char c)
{
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}

} // namespace

template <class Pred>
bool ZmString::allBytes(Pred pred) const
{
    for (int i = 0; i < length(); ++i) {
        if (!pred(m_data[i])) {
            return false;
        }
    }
    return true;
}

ZmString::ZmString(const char* s) : ZmDArray<char>(0, 16)
{
    if (s == nullptr) {
        append('\0');
    } else {
        append(int64_t(std::strlen(s)) + 1, s);
    }
}

ZmString::ZmString(const char* s, int start, int n) : ZmDArray<char>(0, int64_t(n) + 1)
{
    append(n, s + start);
    append('\0');
}

ZmString::ZmString(char c, unsigned int n) : ZmDArray<char>(int64_t(n) + 1, int64_t(n) + 1)
{
    std::memset(m_data, c, n);
    m_data[n] = 0;
}

ZmString::ZmString(int, const char* fmt, ...) : ZmString()
{
    va_list args;
    va_start(args, fmt);
    vprintf(fmt, args);
    va_end(args);
}

ZmString& ZmString::operator=(const char* s)
{
    if (s == nullptr) {
        clear();
        return *this;
    }
    // s may point into our own text; insert() re-addresses a source inside the block.
    const int64_t n = int64_t(std::strlen(s)) + 1;
    m_size = 0;
    insert(0, n, s);
    return *this;
}

bool ZmString::isAlnum() const
{
    return allBytes([](char c) { return isAsciiAlpha(c) || isAsciiDigit(c); });
}

bool ZmString::isAlpha() const
{
    return allBytes(isAsciiAlpha);
}

bool ZmString::isDigit() const
{
    return allBytes(isAsciiDigit);
}

bool ZmString::operator!=(const char* s) const
{
    if (s == nullptr) {
        return length() == -1;
    }
    if (length() != static_cast<int>(std::strlen(s))) {
        return true;
    }
    return std::strcmp(m_data, s) != 0;
}

bool ZmString::isEqualTo(const ZmString& other, bool ignoreCase) const
{
    if (length() != other.length()) {
        return false;
    }
    if (ignoreCase) {
        return strncasecmp(m_data, other.m_data, size_t(length())) == 0;
    }
    return std::strcmp(m_data, other.m_data) == 0;
}

int ZmString::rindex(char c, int start) const
{
    int i = start < 0 ? static_cast<int>(m_size - 1) : start;
    for (; i >= 0; --i) {
        if (m_data[i] == c) {
            return i;
        }
    }
    return -1;
}

int ZmString::index(const char* sub) const
{
    if (m_size < 1) {
        return -1;
    }
    const char* p = std::strstr(m_data, sub);
    return p == nullptr ? -1 : static_cast<int>(p - m_data);
}

int ZmString::index(const char* sub, int start) const
{
    if (start < 0 || start >= m_size) {
        return -1;
    }
    const char* p = std::strstr(m_data + start, sub);
    return p == nullptr ? -1 : static_cast<int>(p - m_data);
}

int ZmString::iindex(const char* sub) const
{
    const int n = static_cast<int>(std::strlen(sub));
    if (length() < n) {
        return -1;
    }
    const int first = std::toupper(static_cast<unsigned char>(sub[0]));
    for (int p = 0; p <= length() - n; ++p) {
        if (std::toupper(static_cast<unsigned char>(m_data[p])) == first &&
            strncasecmp(m_data + p, sub, size_t(n)) == 0) {
            return p;
        }
    }
    return -1;
}

int ZmString::matches(const char* pattern) const
{
    return zmWildMatch(m_data, pattern);
}

ZmString ZmString::operator+(const ZmString& other) const
{
    ZmString result(*this);
    if (other.m_data != nullptr) {
        result += other.m_data;
    }
    return result;
}

void ZmString::insertStr(int pos, const char* s)
{
    insert(pos, int64_t(std::strlen(s)), s);
}

void ZmString::replace(char from, char to)
{
    for (int i = 0; i < length(); ++i) {
        if (m_data[i] == from) {
            m_data[i] = to;
        }
    }
}

void ZmString::replaceSubStr(const char* from, const char* to)
{
    if (from == nullptr || from[0] == 0) {
        return;
    }
    const size_t fromLen = std::strlen(from);
    const size_t toLen = to == nullptr ? 0 : std::strlen(to);
    const size_t len = size_t(length());
    ZmString result;
    result.remax(int64_t(len) + 1, 0);
    size_t p = 0;
    while (p < len) {
        // Leftmost match at or after p: the bytes up to it are copied as they are.
        const void* hit = ::memmem(m_data + p, len - p, from, fromLen);
        const size_t at = hit == nullptr ? len : size_t(static_cast<const char*>(hit) - m_data);
        result.append(int64_t(at - p), m_data + p);
        if (hit == nullptr) {
            break;
        }
        result.append(int64_t(toLen), to);
        p = at + fromLen;
    }
    result.append('\0');
    swapWith(result);
}

void ZmString::toLower()
{
    for (int i = length() - 1; i >= 0; --i) {
        m_data[i] = static_cast<char>(std::tolower(static_cast<unsigned char>(m_data[i])));
    }
}

void ZmString::toUpper()
{
    for (int i = length() - 1; i >= 0; --i) {
        m_data[i] = static_cast<char>(std::toupper(static_cast<unsigned char>(m_data[i])));
    }
}

void ZmString::unpad()
{
    int end = length();
    // The trailing scan never removes position 0; the leading scan below takes it if it is blank.
    while (end - 1 > 0 && m_data[end - 1] == ' ') {
        --end;
    }
    int begin = 0;
    while (begin < end && m_data[begin] == ' ') {
        ++begin;
    }
    const int n = end - begin;
    if (begin > 0) {
        std::memmove(m_data, m_data + begin, size_t(n));
    }
    m_data[n] = 0;
    m_size = n + 1;
}

ZmString ZmString::substr(unsigned int from, unsigned int to) const
{
    const unsigned int n = to - from + 1;
    return ZmString(m_data, static_cast<int>(from), static_cast<int>(n));
}

void ZmString::explode(char sep, ZmDArray<ZmString>& out) const
{
    out.clear();
    const char* p = m_data;
    const char* end = m_data + length();
    for (;;) {
        const void* hit = std::memchr(p, sep, size_t(end - p));
        const char* stop = hit == nullptr ? end : static_cast<const char*>(hit);
        out.append(ZmString(p, 0, static_cast<int>(stop - p)));
        if (hit == nullptr) {
            break;
        }
        p = stop + 1;
    }
}

ZmString ZmString::protect(bool forceQuotes) const
{
    bool quote = forceQuotes || length() == 0;
    for (int i = 0; !quote && i < length(); ++i) {
        quote = std::isspace(static_cast<unsigned char>(m_data[i])) != 0;
    }
    ZmString result;
    result.remax(int64_t(length()) + 4, 0);
    if (quote) {
        result.append('"');
    }
    for (int i = 0; i < length(); ++i) {
        const char c = m_data[i];
        if (c == '"' || c == '\\') {
            result.append('\\');
        }
        result.append(c);
    }
    if (quote) {
        result.append('"');
    }
    result.append('\0');
    return result;
}

char* ZmString::printf(const char* fmt, ...)
{
    va_list args;
    va_start(args, fmt);
    char* result = vprintf(fmt, args);
    va_end(args);
    return result;
}

char* ZmString::vprintf(const char* fmt, va_list args)
{
    // The defined algorithm formats with the current *size* as the limit, doubles the size while
    // the text does not fit (the formatter reports -1 there) and appends a terminator when the
    // text fills the limit exactly. glibc reports the needed length instead, so the text is
    // formatted once into the whole block and the sizes and capacity that algorithm would leave
    // are derived from the length: the same figures, and one formatting pass in the common case.
    if (m_size < 2) {
        resize(64);
    }
    va_list first;
    va_copy(first, args);
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): initialised by va_copy above
    const int len = std::vsnprintf(m_data, size_t(m_max), fmt, first);
    va_end(first);
    if (len < 0) {
        clear(); // an encoding error: nothing sensible to keep
        return m_data;
    }
    const bool complete = len < m_max;
    int64_t limit = m_size;
    while (len > limit) {
        limit *= 2;
    }
    try {
        if (limit != m_size) {
            resize(limit); // the reallocation keeps the bytes already formatted
        }
        resize(len == limit ? limit + 1 : int64_t(len) + 1);
    } catch (...) {
        // The block holds the formatted text cut at its end: keep it cut at the size, so that the
        // string stays terminated where length() says.
        m_data[m_size - 1] = 0;
        throw;
    }
    if (!complete) {
        va_list second;
        va_copy(second, args);
        std::vsnprintf(m_data, size_t(m_size), fmt, second);
        va_end(second);
    }
    return m_data;
}

void ZmString::setInt64(int64_t v)
{
    char text[24];
    const auto res = std::to_chars(text, text + sizeof text, v);
    const auto n = int64_t(res.ptr - text);
    resize(n + 1);
    std::memcpy(m_data, text, size_t(n));
    m_data[n] = 0;
}

ZmString ZmString::fromInt64(int64_t v)
{
    ZmString s;
    s.setInt64(v);
    return s;
}

int ZmString::toInt(bool& ok) const
{
    int v = 0;
    ok = std::sscanf(m_data, "%d", &v) == 1;
    return ok ? v : 0;
}

float ZmString::toFloat(bool& ok) const
{
    float v = 0;
    ok = std::sscanf(m_data, "%f", &v) == 1;
    return ok ? v : 0.0f;
}

int64_t ZmString::toInt64() const
{
    return isEmptyString() ? 0 : std::atoll(m_data);
}

int64_t ZmString::toInt64(const char* s)
{
    return s == nullptr ? 0 : std::atoll(s);
}
