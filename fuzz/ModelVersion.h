// A reference reading of version texts, shared by the version fuzz target and the version tests.
#pragma once

#include <array>
#include <sstream>
#include <string>

namespace model {

/// The parse as stream extraction does it, step by step: a number, then the end or a dot, up to
/// four numbers; all zero when that fails. Only valid for texts without '+' or '-', which the
/// stream would take as signs.
inline std::array<unsigned, 4> streamParseVersion(const std::string& text)
{
    std::istringstream in(text);
    std::array<unsigned, 4> v{};
    for (unsigned& value : v) {
        if (!(in >> value)) {
            return {};
        }
        const int c = in.peek();
        if (c == std::char_traits<char>::eof()) {
            break;
        }
        if (c != '.') {
            return {};
        }
        in.get();
    }
    return v;
}

} // namespace model
