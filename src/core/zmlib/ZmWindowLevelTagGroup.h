/// \file
/// The three DICOM window attributes of a data set, as texts.
#pragma once

#include <zmlib/ZmExport.h>

#include <array>
#include <string>

/// The texts of the attributes Window Center, Window Width and Window Center & Width Explanation
/// of one data set, each holding the values of all presets separated by a backslash (the DICOM
/// value separator). `ZmWindowLevel::createFromTags` and `toTags` convert it to and from presets.
///
/// A plain value that owns its three texts; not synchronised (one writer at a time). Nothing
/// fails except allocation, which throws `std::bad_alloc`.
class ZMLIB_API ZmWindowLevelTagGroup {
public:
    /// Three empty texts.
    ZmWindowLevelTagGroup() = default;
    /// Centre, width and explanation texts, in this order.
    explicit ZmWindowLevelTagGroup(const std::array<std::string, 3>& texts)
        : m_center(texts[0]), m_width(texts[1]), m_explanation(texts[2])
    {}
    ZmWindowLevelTagGroup(const ZmWindowLevelTagGroup&) = default;
    ZmWindowLevelTagGroup& operator=(const ZmWindowLevelTagGroup&) = default;
    ~ZmWindowLevelTagGroup() = default;

    /// Centre, width and explanation texts, in this order.
    std::array<std::string, 3> toArray() const { return {m_center, m_width, m_explanation}; }

private:
    std::string m_center;
    std::string m_width;
    std::string m_explanation;
};
