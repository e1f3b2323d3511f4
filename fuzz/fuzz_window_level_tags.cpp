// Fuzzes the conversion between the DICOM window attribute texts and window/level presets.
//
// Input layout: centre text, a zero byte, width text, a zero byte, explanation text (the rest;
// missing texts are empty). Checks:
// - every preset has a non-empty centre and width, no text holds the value separator, and there
//   are no more presets than centre values; unequal numbers of centre and width values give none;
// - createFromTags -> toTags -> createFromTags gives the same presets, text for text, and toTags
//   of that gives the same texts again;
// - when every centre and width value is non-empty, toTags writes the centre and width texts back
//   unchanged, and the explanation text too when it has exactly one value per pair;
// - numeric access is strtod of the text, narrowed;
// - merging the list with itself gives both copies, the seam collapsed when the last preset
//   equals the first, whenever no neighbours within the list are equal.
#include "FuzzCheck.h"

#include <zmlib/ZmWindowLevel.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

size_t valueCount(const std::string& text)
{
    return text.empty() ? 0 : static_cast<size_t>(std::count(text.begin(), text.end(), '\\')) + 1;
}

bool hasEmptyValue(const std::string& text)
{
    return text.empty() || text.front() == '\\' || text.back() == '\\' ||
           text.find("\\\\") != std::string::npos;
}

bool sameTexts(const std::vector<ZmWindowLevel>& a, const std::vector<ZmWindowLevel>& b)
{
    if (a.size() != b.size()) {
        return false;
    }
    for (size_t i = 0; i < a.size(); ++i) {
        if (a[i].centerString() != b[i].centerString() || a[i].widthString() != b[i].widthString() ||
            a[i].explanation() != b[i].explanation()) {
            return false;
        }
    }
    return true;
}

// Bit for bit, so NaNs compare equal to themselves and the sign of zero counts.
bool sameFloat(float a, float b)
{
    uint32_t x;
    uint32_t y;
    std::memcpy(&x, &a, sizeof x);
    std::memcpy(&y, &b, sizeof y);
    return x == y;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string input(reinterpret_cast<const char*>(data), size);
    std::array<std::string, 3> texts;
    size_t start = 0;
    for (size_t k = 0; k < 3 && start <= input.size(); ++k) {
        const size_t end = k < 2 ? input.find('\0', start) : std::string::npos;
        texts[k] = input.substr(start, end == std::string::npos ? std::string::npos : end - start);
        start = end == std::string::npos ? input.size() + 1 : end + 1;
    }

    const ZmWindowLevelTagGroup tags(texts);
    FUZZ_CHECK(tags.toArray() == texts);
    const std::vector<ZmWindowLevel> list = ZmWindowLevel::createFromTags(tags);
    const size_t centers = valueCount(texts[0]);
    if (centers != valueCount(texts[1])) {
        FUZZ_CHECK(list.empty());
    }
    FUZZ_CHECK(list.size() <= centers);
    for (const ZmWindowLevel& p : list) {
        const std::string c = p.centerString();
        const std::string w = p.widthString();
        const std::string e = p.explanation();
        FUZZ_CHECK(!c.empty() && !w.empty());
        FUZZ_CHECK(c.find('\\') == std::string::npos && w.find('\\') == std::string::npos &&
                   e.find('\\') == std::string::npos);
        FUZZ_CHECK(sameFloat(p.center(), static_cast<float>(std::strtod(c.c_str(), nullptr))));
        FUZZ_CHECK(sameFloat(p.width(), static_cast<float>(std::strtod(w.c_str(), nullptr))));
    }

    const ZmWindowLevelTagGroup written = ZmWindowLevel::toTags(list);
    const std::vector<ZmWindowLevel> again = ZmWindowLevel::createFromTags(written);
    FUZZ_CHECK(sameTexts(again, list));
    FUZZ_CHECK(ZmWindowLevel::toTags(again).toArray() == written.toArray());

    if (centers > 0 && centers == valueCount(texts[1]) && !hasEmptyValue(texts[0]) &&
        !hasEmptyValue(texts[1])) {
        FUZZ_CHECK(list.size() == centers);
        const std::array<std::string, 3> out = written.toArray();
        FUZZ_CHECK(out[0] == texts[0] && out[1] == texts[1]);
        if (valueCount(texts[2]) == centers) {
            FUZZ_CHECK(out[2] == texts[2]);
        }
    }

    const std::vector<ZmWindowLevel> merged = ZmWindowLevel::merge(list, list);
    FUZZ_CHECK(merged.size() <= 2 * list.size());
    bool equalNeighbours = false;
    for (size_t i = 1; i < list.size(); ++i) {
        equalNeighbours = equalNeighbours || list[i - 1] == list[i];
    }
    if (!equalNeighbours) {
        // Only the seam between the two copies can collapse, and it does when the last preset
        // equals the first.
        const size_t expected = list.empty() ? 0 : 2 * list.size() - (list.back() == list.front() ? 1 : 0);
        FUZZ_CHECK(merged.size() == expected);
        FUZZ_CHECK(sameTexts(std::vector<ZmWindowLevel>(merged.begin(), merged.begin() + list.size()), list));
    }
    return 0;
}
