#include <zmlib/ZmStdStringTokenizer.h>

ZmStdStringTokenizer::ZmStdStringTokenizer(const std::string& s, const char* delims)
    : m_delimiters(delims == nullptr ? " \f\n\r\t\v" : delims), m_text(s)
{
    m_tokenStart = m_text.find_first_not_of(m_delimiters);
    m_tokenEnd = m_text.find_first_of(m_delimiters, m_tokenStart);
}

ZmStdStringTokenizer::ZmStdStringTokenizer(const ZmStdStringTokenizer& other) = default;

ZmStdStringTokenizer& ZmStdStringTokenizer::operator=(const ZmStdStringTokenizer& other) = default;

void ZmStdStringTokenizer::nextToken(std::string& out)
{
    if (m_tokenStart == std::string::npos) {
        return;
    }
    if (m_tokenEnd != std::string::npos) {
        out.assign(m_text, m_tokenStart, m_tokenEnd - m_tokenStart);
        m_tokenStart = m_text.find_first_not_of(m_delimiters, m_tokenEnd);
        m_tokenEnd = m_text.find_first_of(m_delimiters, m_tokenStart);
    } else {
        out.assign(m_text, m_tokenStart, std::string::npos);
        m_tokenStart = std::string::npos;
    }
}

uint64_t ZmStdStringTokenizer::countTokens() const
{
    if (!m_tokenCountValid) {
        uint64_t count = 0;
        for (size_t start = m_text.find_first_not_of(m_delimiters); start != std::string::npos;) {
            ++count;
            const size_t end = m_text.find_first_of(m_delimiters, start);
            start = end == std::string::npos ? end : m_text.find_first_not_of(m_delimiters, end);
        }
        m_tokenCount = count;
        m_tokenCountValid = true;
    }
    return m_tokenCount;
}
