// zmtool bundle: parameter trees in their text form (the form data-file headers carry).
//   zmtool bundle print FILE              read FILE and print the tree back (or the error's place)
//   zmtool bundle get FILE PATH           the value of a parameter by a slash-separated path
//   zmtool bundle get FILE --tag G,E      the value of a DICOM attribute (group, element in hex)
#include "zmtool.h"

#include <zmlib/HxParamBundle.h>
#include <zmlib/ZmString.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>

namespace {

const char kUsage[] =
    "usage: zmtool bundle print FILE\n"
    "       zmtool bundle get FILE PATH          (PATH: Sub/Bundle/Parameter)\n"
    "       zmtool bundle get FILE --tag GGGG,EEEE\n"
    "Exit status: 0 done, 1 the file cannot be read or holds no such value, 2 bad command line.\n";

int usage()
{
    std::fputs(kUsage, stderr);
    return 2;
}

// Reads FILE into \p tree; false after reporting why.
bool load(const char* path, HxParamBundle& tree)
{
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        std::fprintf(stderr, "zmtool bundle: %s: %s\n", path, std::strerror(errno));
        return false;
    }
    std::ostringstream text;
    text << in.rdbuf();
    const std::string s = text.str();
    const ZmResult r = tree.parse(s.data(), s.size());
    if (!r.ok()) {
        std::fprintf(stderr, "zmtool bundle: %s: %s\n", path, r.text());
        return false;
    }
    return true;
}

// "0028,0030" as the parameter name "G0028-0030".
bool tagName(const char* text, std::string& name)
{
    unsigned group = 0;
    unsigned element = 0;
    char tail = 0;
    if (std::strlen(text) != 9 || std::sscanf(text, "%4x,%4x%c", &group, &element, &tail) != 2) {
        return false;
    }
    name = ZmString(0, "G%04X-%04X", group, element).getString();
    return true;
}

int get(const char* path, const char* what, bool isTag)
{
    HxParamBundle tree("Bundle");
    if (!load(path, tree)) {
        return 1;
    }
    if (isTag) {
        std::string name;
        if (!tagName(what, name)) {
            std::fprintf(stderr, "zmtool bundle: --tag: '%s' is not GGGG,EEEE in hex\n", what);
            return 2;
        }
        const char* value = tree.findTag(name.c_str(), nullptr);
        if (value == nullptr) {
            std::fprintf(stderr, "zmtool bundle: %s: no DICOM attribute %s\n", path, name.c_str());
            return 1;
        }
        std::printf("%s\n", value);
        return 0;
    }
    // Bundles along the path, the parameter at its end.
    const HxParamBundle* at = &tree;
    std::string rest = what;
    for (size_t slash = rest.find('/'); slash != std::string::npos && at != nullptr; slash = rest.find('/')) {
        at = at->bundle(rest.substr(0, slash).c_str());
        rest.erase(0, slash + 1);
    }
    const HxParameter* p = at != nullptr ? at->find(rest.c_str(), 0, 255) : nullptr;
    if (p == nullptr) {
        std::fprintf(stderr, "zmtool bundle: %s: no parameter %s\n", path, what);
        return 1;
    }
    std::printf("%s\n", p->getString());
    return 0;
}

} // namespace

int zmtool::runBundle(int argc, char** argv)
{
    if (argc >= 1 && (std::strcmp(argv[0], "--help") == 0 || std::strcmp(argv[0], "-h") == 0)) {
        std::fputs(kUsage, stdout);
        return 0;
    }
    if (argc == 2 && std::strcmp(argv[0], "print") == 0) {
        HxParamBundle tree("Bundle");
        if (!load(argv[1], tree)) {
            return 1;
        }
        ZmString out;
        tree.print(out);
        std::fputs(out.getString(), stdout);
        return std::fflush(stdout) == 0 ? 0 : 1;
    }
    if (argc == 3 && std::strcmp(argv[0], "get") == 0) {
        return get(argv[1], argv[2], false);
    }
    if (argc == 4 && std::strcmp(argv[0], "get") == 0 && std::strcmp(argv[2], "--tag") == 0) {
        return get(argv[1], argv[3], true);
    }
    return usage();
}
