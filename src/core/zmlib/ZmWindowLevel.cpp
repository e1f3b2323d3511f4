#include <zmlib/ZmWindowLevel.h>

#include <charconv>
#include <cstdlib>

namespace {

// The DICOM value separator of multi-valued attributes.
const char kSeparator = '\\';

// The shortest text that reads back to the same float, plain or with an exponent, whichever is
// shorter (plain on a tie): 40 gives "40", 0.1f "0.1", 1e20f "1e+20". At most 15 characters, so it
// always fits a DICOM decimal string.
std::string floatText(float value)
{
    char buf[32];
    const std::to_chars_result r = std::to_chars(buf, buf + sizeof buf, value);
    return std::string(buf, r.ptr);
}

float textValue(const std::string& text)
{
    return static_cast<float>(std::strtod(text.c_str(), nullptr));
}

// The values of an attribute text: none for the empty text, else the pieces between separators,
// empty pieces included.
std::vector<std::string> splitValues(const std::string& text)
{
    std::vector<std::string> values;
    if (text.empty()) {
        return values;
    }
    size_t start = 0;
    for (;;) {
        const size_t end = text.find(kSeparator, start);
        if (end == std::string::npos) {
            values.push_back(text.substr(start));
            return values;
        }
        values.push_back(text.substr(start, end - start));
        start = end + 1;
    }
}

} // namespace

ZmWindowLevel::ZmWindowLevel(const std::string& center, const std::string& width)
    : m_center(center), m_width(width)
{}

ZmWindowLevel::ZmWindowLevel(const std::string& center, const std::string& width,
                             const std::string& explanation)
    : m_center(center), m_width(width), m_explanation(explanation)
{}

ZmWindowLevel::ZmWindowLevel(float center, float width, const std::string& explanation)
    : m_center(floatText(center)), m_width(floatText(width)), m_explanation(explanation)
{}

float ZmWindowLevel::center() const
{
    return textValue(m_center);
}

float ZmWindowLevel::width() const
{
    return textValue(m_width);
}

void ZmWindowLevel::setCenter(float center)
{
    m_center = floatText(center);
}

void ZmWindowLevel::setWidth(float width)
{
    m_width = floatText(width);
}

bool ZmWindowLevel::operator==(const ZmWindowLevel& other) const
{
    return std::atof(m_center.c_str()) == std::atof(other.m_center.c_str()) &&
           std::atof(m_width.c_str()) == std::atof(other.m_width.c_str()) &&
           m_explanation == other.m_explanation;
}

std::vector<ZmWindowLevel> ZmWindowLevel::createFromTags(const ZmWindowLevelTagGroup& tags)
{
    const std::array<std::string, 3> texts = tags.toArray();
    const std::vector<std::string> centers = splitValues(texts[0]);
    const std::vector<std::string> widths = splitValues(texts[1]);
    const std::vector<std::string> explanations = splitValues(texts[2]);
    std::vector<ZmWindowLevel> presets;
    if (centers.size() != widths.size() || centers.empty()) {
        return presets;
    }
    for (size_t i = 0; i < centers.size(); ++i) {
        // A pair with a missing value is dropped, but i still advances so that explanation i
        // stays with pair i.
        if (centers[i].empty() || widths[i].empty()) {
            continue;
        }
        presets.emplace_back(centers[i], widths[i],
                             i < explanations.size() ? explanations[i] : std::string());
    }
    return presets;
}

ZmWindowLevelTagGroup ZmWindowLevel::toTags(const std::vector<ZmWindowLevel>& presets)
{
    std::array<std::string, 3> texts;
    for (size_t i = 0; i < presets.size(); ++i) {
        if (i > 0) {
            for (std::string& text : texts) {
                text += kSeparator;
            }
        }
        texts[0] += presets[i].m_center;
        texts[1] += presets[i].m_width;
        texts[2] += presets[i].m_explanation;
    }
    return ZmWindowLevelTagGroup(texts);
}

std::vector<ZmWindowLevel> ZmWindowLevel::merge(const std::vector<ZmWindowLevel>& a,
                                                const std::vector<ZmWindowLevel>& b)
{
    std::vector<ZmWindowLevel> result;
    result.reserve(a.size() + b.size());
    for (const std::vector<ZmWindowLevel>* list : {&a, &b}) {
        for (const ZmWindowLevel& preset : *list) {
            // Intended: only neighbours are compared, so the order of a and b is kept and equal
            // presets further apart all stay.
            if (result.empty() || !(result.back() == preset)) {
                result.push_back(preset);
            }
        }
    }
    return result;
}
