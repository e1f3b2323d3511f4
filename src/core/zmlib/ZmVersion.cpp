#include <zmlib/ZmVersion.h>

#include <boost/format.hpp>

#include <cstdint>

static_assert(sizeof(unsigned) == 4, "version values are unsigned 32-bit");

namespace {

// The white space that stream extraction skips in the classic locale, independent of the
// process's locale.
bool isBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

// Reads one unsigned decimal number at text[pos], after optional white space, as stream extraction
// of an unsigned int does (except that a sign is not accepted). Advances pos past the digits.
bool readNumber(const std::string& text, size_t& pos, unsigned& value)
{
    const size_t n = text.size();
    while (pos < n && isBlank(text[pos])) {
        ++pos;
    }
    const size_t start = pos;
    uint64_t v = 0;
    bool overflow = false;
    while (pos < n && text[pos] >= '0' && text[pos] <= '9') {
        if (!overflow) {
            v = v * 10 + static_cast<unsigned>(text[pos] - '0');
            overflow = v > UINT32_MAX;
        }
        ++pos;
    }
    if (pos == start || overflow) {
        return false;
    }
    value = static_cast<unsigned>(v);
    return true;
}

} // namespace

ZmVersion::ZmVersion(const std::string& text)
{
    unsigned values[4] = {0, 0, 0, 0};
    size_t pos = 0;
    for (unsigned& value : values) {
        if (!readNumber(text, pos, value)) {
            return;
        }
        if (pos == text.size()) {
            break;
        }
        if (text[pos] != '.') {
            return;
        }
        ++pos;
    }
    // Intended: once a dot follows the fourth number, the rest of the text is not looked at.
    setValues(values[0], values[1], values[2], values[3]);
}

void ZmVersion::setValues(unsigned major, unsigned minor, unsigned patch, unsigned build)
{
    m_major = major;
    m_minor = minor;
    m_patch = patch;
    m_build = build;
}

void ZmVersion::setValues(const std::array<unsigned int, 4>& values)
{
    setValues(values[0], values[1], values[2], values[3]);
}

std::pair<unsigned, unsigned> ZmVersion::firstMismatchingValues(const ZmVersion& other) const
{
    if (m_major != other.m_major) {
        return {m_major, other.m_major};
    }
    if (m_minor != other.m_minor) {
        return {m_minor, other.m_minor};
    }
    if (m_patch != other.m_patch) {
        return {m_patch, other.m_patch};
    }
    if (m_build != other.m_build) {
        return {m_build, other.m_build};
    }
    return {0, 0};
}

bool ZmVersion::operator==(const ZmVersion& other) const
{
    return m_major == other.m_major && m_minor == other.m_minor && m_patch == other.m_patch &&
           m_build == other.m_build;
}

bool ZmVersion::operator<(const ZmVersion& other) const
{
    // Equal versions give (0, 0), which is not "less".
    const std::pair<unsigned, unsigned> v = firstMismatchingValues(other);
    return v.first < v.second;
}

bool ZmVersion::sameMajorMinor(const ZmVersion& other) const
{
    return m_major == other.m_major && m_minor == other.m_minor;
}

bool ZmVersion::isBetween(const ZmVersion& low, const ZmVersion& high) const
{
    return low <= *this && *this <= high;
}

std::string ZmVersion::toString() const
{
    return (boost::format("%u.%u.%u.%u") % m_major % m_minor % m_patch % m_build).str();
}
