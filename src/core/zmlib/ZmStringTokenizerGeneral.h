/// \file
/// Tokenizing with a caller-given delimiter set.
#pragma once

#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmStringTokenizer.h>

/// `ZmStringTokenizer` with the delimiters given as a set of bytes instead of white space; quotes
/// and backslash escapes work the same. The delimiter test is one bit look-up. The text is not
/// copied and must outlive the tokenizer.
class ZMLIB_API ZmStringTokenizerGeneral : public ZmStringTokenizer {
public:
    /// Every byte of \p delims separates tokens (the initial skip already uses them).
    ZmStringTokenizerGeneral(const ZmString& s, const char* delims);
    ZmStringTokenizerGeneral(const char* s, const char* delims);
    ZmStringTokenizerGeneral(const ZmStringTokenizerGeneral& other);
    ZmStringTokenizerGeneral& operator=(const ZmStringTokenizerGeneral& other);
    ~ZmStringTokenizerGeneral() override;

    using ZmStringTokenizer::operator=;

protected:
    /// Rebuilds the delimiter set from the bytes of \p delims.
    void init(const char* delims);
    int isSpace(char c) override;

    ZmBitfield m_delimiters;
};
