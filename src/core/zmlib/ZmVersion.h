/// \file
/// Four-part version numbers.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmVec4i.h>

#include <array>
#include <cstdint>
#include <string>
#include <utility>

/// A version number of four unsigned 32-bit values: major version, minor version, patch level and
/// build number. Used to compare versions of data, modules and the product, to test whether a
/// version lies in a range, and to print one.
///
/// A plain value that owns nothing; the default is the null version 0.0.0.0. Not synchronised:
/// share a constant version freely, change one from one thread at a time. Nothing throws except
/// the allocation of a printed text; a text that does not parse gives the null version.
class ZMLIB_API ZmVersion {
public:
    /// The null version.
    ZmVersion() = default;
    ZmVersion(unsigned major, unsigned minor, unsigned patch, unsigned build)
        : m_major(major), m_minor(minor), m_patch(patch), m_build(build)
    {}
    /// Parses "major[.minor[.patch[.build]]]" in decimal; missing values are 0.
    ///
    /// Each number may be preceded by white space (blank, tab, line feed, vertical tab, form feed,
    /// carriage return), as stream extraction allows, and is one or more digits without a sign;
    /// a value above 4294967295 does not parse. After a number the text must end or go on with a
    /// dot. Once a dot follows the fourth number, everything after it is ignored. Any other text
    /// ("7.1.", "7.1-beta", "", "7.1x") gives the null version, even if some values were read.
    explicit ZmVersion(const std::string& text);

    unsigned majorVersion() const { return m_major; }
    unsigned minorVersion() const { return m_minor; }
    unsigned patchLevel() const { return m_patch; }
    unsigned buildNumber() const { return m_build; }
    void setMajorVersion(unsigned v) { m_major = v; }
    void setMinorVersion(unsigned v) { m_minor = v; }
    void setPatchLevel(unsigned v) { m_patch = v; }
    void setBuildNumber(unsigned v) { m_build = v; }
    void setValues(unsigned major, unsigned minor, unsigned patch, unsigned build);
    /// Major, minor, patch level, build number, in this order.
    void setValues(const std::array<unsigned int, 4>& values);

    /// All four values are 0.
    bool isNull() const { return m_major == 0 && m_minor == 0 && m_patch == 0 && m_build == 0; }
    void makeNull() { setValues(0, 0, 0, 0); }

    /// Comparisons take the four values in order, major first; the first that differs decides.
    bool operator==(const ZmVersion& other) const;
    bool operator!=(const ZmVersion& other) const { return !(*this == other); }
    bool operator<(const ZmVersion& other) const;
    bool operator<=(const ZmVersion& other) const { return !(other < *this); }
    bool operator>(const ZmVersion& other) const { return other < *this; }
    bool operator>=(const ZmVersion& other) const { return !(*this < other); }

    /// Major and minor versions are equal.
    bool sameMajorMinor(const ZmVersion& other) const;
    /// low <= *this <= high, both ends included.
    bool isBetween(const ZmVersion& low, const ZmVersion& high) const;

    /// "major.minor.patch.build" in decimal, always all four values.
    std::string toString() const;
    /// The four values in order; values above 2147483647 come out negative (two's complement).
    ZmVec4i asZmVec4i() const
    {
        return ZmVec4i(int32_t(m_major), int32_t(m_minor), int32_t(m_patch), int32_t(m_build));
    }

protected:
    /// This version's and \p other's value at the first position where they differ; (0, 0) when
    /// all four are equal.
    std::pair<unsigned, unsigned> firstMismatchingValues(const ZmVersion& other) const;

private:
    unsigned m_major = 0;
    unsigned m_minor = 0;
    unsigned m_patch = 0;
    unsigned m_build = 0;
};
