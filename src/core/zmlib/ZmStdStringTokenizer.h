/// \file
/// A plain splitter over a standard string.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>
#include <string>

/// Splits a copy of a standard string at any of a set of delimiter characters. No quotes, no
/// escapes; runs of delimiters separate like one. One tokenizer per thread.
class ZMLIB_API ZmStdStringTokenizer {
public:
    /// \p delims null means the white space " \f\n\r\t\v"; an empty \p delims is an empty set.
    ZmStdStringTokenizer(const std::string& s, const char* delims = nullptr);
    ZmStdStringTokenizer& operator=(const ZmStdStringTokenizer& other);

    bool hasMoreTokens() const { return m_tokenStart != m_tokenEnd; }
    /// Stores the next token in \p out; leaves \p out unchanged when none is left.
    void nextToken(std::string& out);
    /// The number of tokens in the whole text (not only those left); computed once.
    uint64_t countTokens() const;

private:
    ZmStdStringTokenizer(const ZmStdStringTokenizer& other);

    std::string m_delimiters;
    std::string m_text;
    uint64_t m_tokenStart = std::string::npos;
    uint64_t m_tokenEnd = std::string::npos;
    mutable uint64_t m_tokenCount = 0;
    mutable bool m_tokenCountValid = false;
};
