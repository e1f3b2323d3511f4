/// \file
/// The leaves of a parameter tree: named, typed values.
#pragma once

#include <zmlib/HxParamBase.h>
#include <zmlib/ZmPrimType.h>

class ZmString;

/// A named array of values of one `ZmPrimType`, or one text (type "string", dimension 1). Values
/// are always copied in; the caller keeps its buffers.
///
/// Conversions: `getNum` gives integer types their value, rounds float and double by adding 0.5
/// and truncating toward zero (so -1.7 gives -1 and 2.5 gives 3, as it always has), takes the real
/// part of complex values (rounded the same way) and converts a text as a decimal integer
/// (`atoi`); `getReal` gives the values unrounded (the real part of complex, `strtod` of a text).
/// An index outside the array gives 0.
///
/// Text form (`print`): the elements separated by single spaces; integers in decimal, float with
/// "%.8g", double with "%.12g", a text with its double quotes dropped; complex prints nothing.
class ZMLIB_API HxParameter : public HxParamBase {
public:
    /// A text parameter (null is taken as "").
    HxParameter(const char* name, const char* text);
    HxParameter(const char* name, int value);
    HxParameter(const char* name, double value);
    HxParameter(const char* name, int n, const int* values);
    HxParameter(const char* name, int n, const float* values);
    HxParameter(const char* name, int n, const double* values);
    /// Any type: for "string" \p data is the text (duplicated; null gives ""), otherwise \p n
    /// elements are copied from \p data, or zero-filled when it is null.
    HxParameter(const char* name, int n, ZmPrimType type, const void* data);
    HxParameter(const HxParameter& other);
    /// The base assignment (touch bits cleared, flags copied, renamed), then the value; a
    /// different value touches the parameter with 0x02.
    HxParameter& operator=(const HxParameter& other);
    ~HxParameter() override;

    /// A new text parameter owned by the caller.
    static HxParameter* create(const char* name, const char* text);
    HxParamBase* duplicate() const override;

    // Setters: nothing happens when the new value equals the stored one (type, dimension and
    // elements; texts by their characters); otherwise type, dimension and storage are replaced
    // and the parameter is touched with 0x02.
    void set(int value);
    void set(double value);
    void set(int n, const int* values);
    void set(int n, const float* values);
    void set(int n, const double* values);
    /// A text value (null is taken as "").
    void set(const char* text);
    /// Any type, with the rules of the matching constructor.
    void set(int n, ZmPrimType type, const void* data);

    int dim() const noexcept { return m_dim; }
    ZmPrimType primType() const noexcept { return ZmPrimType(m_type); }
    /// The elements, or the text for "string"; null for a dimension of 0.
    void* dataPtr() const noexcept { return m_data; }

    int getNum(int i) const;
    /// All elements into \p out (dim() values).
    void getNum(int* out) const;
    double getReal(int i) const;
    void getReal(double* out) const;
    /// The text of a "string" parameter; any other type printed into one of four process-wide
    /// buffers used in rotation: the text stays valid until four more such calls.
    const char* getString() const;
    /// A DICOM attribute's value: the text after the first ":" and the character after it (the
    /// space of "label: value"). Returns 0, with \p out untouched, when the text has no ":" or
    /// nothing follows it, or the parameter is not a text.
    int getBundleTagValue(const char*& out) const;
    /// Appends the text form to \p out, which is cleared first unless \p append.
    void print(ZmString& out, bool append) const;

    /// Same dimension, type and elements (texts by their characters); names are not compared.
    bool operator==(const HxParameter& other) const;
    bool operator!=(const HxParameter& other) const { return !(*this == other); }

private:
    bool sameValue(int n, int type, const void* data) const;
    void replaceValue(int n, int type, const void* data);

    int32_t m_dim = 0;
    int32_t m_type = ZmPrimType::INT;
    void* m_data = nullptr;
};
