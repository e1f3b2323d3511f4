/// \file
/// Splitting text into white-space separated tokens with quotes and escapes.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>

/// Splits a text into tokens separated by white space (the runtime's `isspace`).
///
/// A backslash takes the next byte as it is (an escaped blank, quote or backslash); a double quote
/// starts a run, possibly in the middle of a token, in which every byte up to the next double
/// quote is taken as it is; an unclosed quote runs to the end. `ZmString::protect` writes texts in
/// exactly this form.
///
/// The text is not copied: it must outlive the tokenizer. The token returned by `nextToken` is
/// overwritten by the next call. One tokenizer per thread.
class ZMLIB_API ZmStringTokenizer {
public:
    explicit ZmStringTokenizer(const ZmString& s);
    explicit ZmStringTokenizer(const char* s);
    virtual ~ZmStringTokenizer();

    /// Re-targets to \p s; the current token stays until the next `nextToken`.
    ZmStringTokenizer& operator=(const char* s);

    /// Non-zero while a token is left.
    int hasMoreTokens() const { return m_pos < m_len; }
    /// The next token (empty when none is left).
    ZmString& nextToken();
    /// The runtime's atoi of the next token.
    int nextInt();
    /// The runtime's atof of the next token.
    float nextFloat();

protected:
    ZmStringTokenizer();
    ZmStringTokenizer(const ZmStringTokenizer& other);
    ZmStringTokenizer& operator=(const ZmStringTokenizer& other);

    /// Sets the text and skips leading delimiters.
    void setText(const char* s, int64_t len);
    void skipSpace();
    /// Whether \p c separates tokens: the runtime's isspace (of the byte value).
    virtual int isSpace(char c);

    ZmString m_token;
    int64_t m_pos = 0;
    int64_t m_len = 0;
    const char* m_text = nullptr;
};
