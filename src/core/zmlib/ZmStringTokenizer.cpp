#include <zmlib/ZmStringTokenizer.h>

#include <cctype>
#include <cstdlib>
#include <cstring>

namespace {

// Appends a run of bytes to a token in one copy, keeping the terminator.
void appendRun(ZmString& token, const char* p, int64_t n)
{
    if (n <= 0) {
        return;
    }
    token.ZmDArray<char>::removeLast(1);
    token.append(n, p);
    token.append('\0');
}

} // namespace

ZmStringTokenizer::ZmStringTokenizer() = default;

ZmStringTokenizer::ZmStringTokenizer(const ZmString& s)
{
    setText(s.getString(), s.length());
}

ZmStringTokenizer::ZmStringTokenizer(const char* s)
{
    setText(s, s == nullptr ? 0 : int64_t(std::strlen(s)));
}

ZmStringTokenizer::ZmStringTokenizer(const ZmStringTokenizer& other) = default;

ZmStringTokenizer& ZmStringTokenizer::operator=(const ZmStringTokenizer& other) = default;

ZmStringTokenizer::~ZmStringTokenizer() = default;

ZmStringTokenizer& ZmStringTokenizer::operator=(const char* s)
{
    setText(s, s == nullptr ? 0 : int64_t(std::strlen(s)));
    return *this;
}

void ZmStringTokenizer::setText(const char* s, int64_t len)
{
    m_text = s;
    m_len = len;
    m_pos = 0;
    skipSpace();
}

void ZmStringTokenizer::skipSpace()
{
    while (m_pos < m_len && isSpace(m_text[m_pos])) {
        ++m_pos;
    }
}

int ZmStringTokenizer::isSpace(char c)
{
    return std::isspace(static_cast<unsigned char>(c));
}

ZmString& ZmStringTokenizer::nextToken()
{
    m_token.clear();
    while (m_pos < m_len) {
        const char c = m_text[m_pos];
        if (isSpace(c)) {
            break;
        }
        if (c == '\\') {
            // The escaped byte is taken as it is, delimiter, quote or backslash.
            ++m_pos;
            if (m_pos < m_len) {
                m_token += m_text[m_pos];
            }
            ++m_pos;
        } else if (c == '"') {
            // Inside quotes every byte counts; pos ends past the closing quote (or past the end
            // of an unclosed quote).
            const int64_t start = ++m_pos;
            while (m_pos < m_len && m_text[m_pos] != '"') {
                ++m_pos;
            }
            appendRun(m_token, m_text + start, m_pos - start);
            ++m_pos;
        } else {
            // A run of plain bytes is copied at once.
            const int64_t start = m_pos;
            do {
                ++m_pos;
            } while (m_pos < m_len && m_text[m_pos] != '\\' && m_text[m_pos] != '"' &&
                     !isSpace(m_text[m_pos]));
            appendRun(m_token, m_text + start, m_pos - start);
        }
    }
    skipSpace();
    return m_token;
}

int ZmStringTokenizer::nextInt()
{
    return std::atoi(nextToken().getString());
}

float ZmStringTokenizer::nextFloat()
{
    return static_cast<float>(std::atof(nextToken().getString()));
}
