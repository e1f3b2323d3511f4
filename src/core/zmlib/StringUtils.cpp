#include <zmlib/StringUtils.h>

#include <cstdlib>

namespace {

template <class V, class Parse>
V parseWhole(const char* s, V dflt, bool* ok, Parse parse)
{
    bool good = false;
    V value = dflt;
    if (s != nullptr) {
        char* end = nullptr;
        const V v = parse(s, &end);
        if (end != s && *end == 0) {
            value = v;
            good = true;
        }
    }
    if (ok != nullptr) {
        *ok = good;
    }
    return value;
}

} // namespace

namespace StringUtils {

double toDouble(const char* s, double dflt, bool* ok)
{
    return parseWhole(s, dflt, ok, [](const char* t, char** end) { return std::strtod(t, end); });
}

long toLong(const char* s, long dflt, bool* ok)
{
    return parseWhole(s, dflt, ok, [](const char* t, char** end) { return std::strtol(t, end, 0); });
}

unsigned long toULong(const char* s, unsigned long dflt, bool* ok)
{
    return parseWhole(s, dflt, ok, [](const char* t, char** end) { return std::strtoul(t, end, 0); });
}

} // namespace StringUtils
