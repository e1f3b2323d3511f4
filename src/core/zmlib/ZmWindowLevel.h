/// \file
/// Window/level display presets.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmWindowLevelTagGroup.h>

#include <string>
#include <vector>

/// One display preset of an image: window centre, window width and an explanation naming it, as
/// the DICOM attributes Window Center, Window Width and Window Center & Width Explanation carry
/// them.
///
/// Centre and width are kept as the texts that stand in the data, so a preset read from a data
/// set is written back unchanged; numeric access converts on demand. A plain value that owns its
/// three texts; not synchronised (one writer at a time). Nothing reports failure: a text that does
/// not start with a number reads as 0. Allocation failure throws `std::bad_alloc`.
///
/// Numbers written as text take the shortest form that reads back to the same float through
/// `strtod`, plain or with an exponent, whichever is shorter, plain on a tie: 40 gives "40", 0.1f
/// "0.1", 1e20f "1e+20", infinities "inf" and "-inf", NaN "nan" or "-nan". At most 15
/// characters, within the 16 of a DICOM decimal string.
class ZMLIB_API ZmWindowLevel {
public:
    /// Three empty texts.
    ZmWindowLevel() = default;
    ZmWindowLevel(const std::string& center, const std::string& width);
    ZmWindowLevel(const std::string& center, const std::string& width, const std::string& explanation);
    /// Centre and width written as text.
    ZmWindowLevel(float center, float width, const std::string& explanation);
    ZmWindowLevel(const ZmWindowLevel&) = default;
    ZmWindowLevel& operator=(const ZmWindowLevel&) = default;
    ~ZmWindowLevel() = default;

    /// The centre text read with `strtod` and narrowed: empty or non-numeric text gives 0, text
    /// after the number is ignored.
    float center() const;
    /// The width text, read as `center()` reads the centre.
    float width() const;
    std::string centerString() const { return m_center; }
    std::string widthString() const { return m_width; }
    std::string explanation() const { return m_explanation; }

    void setCenter(const std::string& center) { m_center = center; }
    void setWidth(const std::string& width) { m_width = width; }
    void setExplanation(const std::string& explanation) { m_explanation = explanation; }
    /// Replaces the centre text by \p center written as text.
    void setCenter(float center);
    /// Replaces the width text by \p width written as text.
    void setWidth(float width);

    /// Centres and widths compare as numbers (`atof`, as double: "40" equals "40.0"), explanations
    /// as exact, case-sensitive texts. A NaN centre or width makes a preset unequal to every preset,
    /// itself included.
    bool operator==(const ZmWindowLevel& other) const;
    bool operator!=(const ZmWindowLevel& other) const { return !(*this == other); }

    /// The presets of a data set's window attributes.
    ///
    /// Each text is split at every backslash; an empty text has no values, and empty values
    /// between separators (or before the first or after the last) are kept as empty values. When
    /// the numbers of centre and width values differ, or are 0, the list is empty. Otherwise pair
    /// i gives a preset, with explanation i when there is one (else an empty explanation), unless
    /// its centre or width is empty: such a pair is skipped and its explanation with it.
    static std::vector<ZmWindowLevel> createFromTags(const ZmWindowLevelTagGroup& tags);
    /// The window attribute texts of \p presets: each text joins the presets' values in order with
    /// backslashes, an empty explanation staying an empty value. An empty list gives three empty
    /// texts. Texts holding a backslash are written as they are (DICOM has no escape for it).
    static ZmWindowLevelTagGroup toTags(const std::vector<ZmWindowLevel>& presets);
    /// \p a followed by \p b, with each run of neighbouring equal presets (under operator==)
    /// collapsed to its first member. Equal presets that are not neighbours all stay.
    static std::vector<ZmWindowLevel> merge(const std::vector<ZmWindowLevel>& a,
                                            const std::vector<ZmWindowLevel>& b);

private:
    std::string m_center;
    std::string m_width;
    std::string m_explanation;
};
