// Fuzzes the version parser ZmVersion(const std::string&).
//
// The whole input, zero bytes included, is the text. Checks:
// - for texts without '+' or '-' (which stream extraction would take as signs) the values equal a
//   reference parse done with std::istringstream: extract an unsigned number, then the text must
//   end or go on with a dot, up to four numbers; any failure gives the null version;
// - the printed form is the four values in decimal joined by dots, and it parses back to an equal
//   version;
// - the printed form followed by a dot and any text (the input itself) parses to the same version.
#include "FuzzCheck.h"
#include "ModelVersion.h"

#include <zmlib/ZmVersion.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <sstream>
#include <string>

namespace {

std::array<unsigned, 4> valuesOf(const ZmVersion& v)
{
    return {v.majorVersion(), v.minorVersion(), v.patchLevel(), v.buildNumber()};
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    const ZmVersion v(text);

    if (text.find_first_of("+-") == std::string::npos) {
        FUZZ_CHECK(valuesOf(v) == model::streamParseVersion(text));
    }

    const std::string printed = v.toString();
    FUZZ_CHECK(printed == std::to_string(v.majorVersion()) + "." + std::to_string(v.minorVersion()) + "." +
                              std::to_string(v.patchLevel()) + "." + std::to_string(v.buildNumber()));
    const ZmVersion again(printed);
    FUZZ_CHECK(again == v);
    FUZZ_CHECK(again.toString() == printed);
    // Whatever follows the dot after a fourth number is not looked at, here the input itself.
    FUZZ_CHECK(ZmVersion(printed + "." + text) == v);
    return 0;
}
