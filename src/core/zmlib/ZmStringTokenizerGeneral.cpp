#include <zmlib/ZmStringTokenizerGeneral.h>

#include <cstring>

ZmStringTokenizerGeneral::ZmStringTokenizerGeneral(const ZmString& s, const char* delims)
{
    // The set must exist before the first skip, which the base constructor would run with the
    // base class's white-space test.
    init(delims);
    setText(s.getString(), s.length());
}

ZmStringTokenizerGeneral::ZmStringTokenizerGeneral(const char* s, const char* delims)
{
    init(delims);
    setText(s, s == nullptr ? 0 : int64_t(std::strlen(s)));
}

ZmStringTokenizerGeneral::ZmStringTokenizerGeneral(const ZmStringTokenizerGeneral& other) = default;

ZmStringTokenizerGeneral&
ZmStringTokenizerGeneral::operator=(const ZmStringTokenizerGeneral& other) = default;

ZmStringTokenizerGeneral::~ZmStringTokenizerGeneral() = default;

void ZmStringTokenizerGeneral::init(const char* delims)
{
    m_delimiters = ZmBitfield(256, ZmBitfield::CLEAR);
    for (const char* p = delims; p != nullptr && *p != 0; ++p) {
        m_delimiters.set(static_cast<unsigned char>(*p));
    }
}

int ZmStringTokenizerGeneral::isSpace(char c)
{
    return m_delimiters[static_cast<unsigned char>(c)];
}
