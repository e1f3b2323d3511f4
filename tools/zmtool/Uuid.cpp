// zmtool uuid: prints random (version 4) UUIDs, one per line.
#include "zmtool.h"

#include <zmlib/ZmUUID.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

int usage(const char* what)
{
    std::fprintf(stderr,
                 "zmtool uuid: %s\n"
                 "usage: zmtool uuid [-n N] [--formatted]\n"
                 "  -n N          print N UUIDs (default 1)\n"
                 "  --formatted   print the braced form {XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}\n",
                 what);
    return 2;
}

// A whole decimal number >= 1, or false.
bool parseCount(const char* text, long long& out)
{
    if (text[0] < '0' || text[0] > '9') {
        return false; // no sign, no blanks
    }
    errno = 0;
    char* end = nullptr;
    const long long v = std::strtoll(text, &end, 10);
    if (errno != 0 || *end != 0 || v < 1) {
        return false;
    }
    out = v;
    return true;
}

} // namespace

int zmtool::runUuid(int argc, char** argv)
{
    long long count = 1;
    bool formatted = false;
    for (int i = 0; i < argc; ++i) {
        if (std::strcmp(argv[i], "--formatted") == 0) {
            formatted = true;
        } else if (std::strcmp(argv[i], "-n") == 0) {
            if (i + 1 >= argc) {
                return usage("-n needs a number");
            }
            if (!parseCount(argv[++i], count)) {
                return usage("the count after -n must be a whole number of at least 1");
            }
        } else {
            char what[256];
            std::snprintf(what, sizeof what, "unknown argument '%s'", argv[i]);
            return usage(what);
        }
    }
    for (long long i = 0; i < count; ++i) {
        const ZmUUID u = ZmUUID::generateUUID();
        if (!u.isValid()) {
            std::fprintf(stderr, "zmtool uuid: no random source available\n");
            return 1;
        }
        const ZmString text = formatted ? u.toFormattedString() : u.toString();
        if (std::fputs(text.getString(), stdout) == EOF || std::fputc('\n', stdout) == EOF) {
            break;
        }
    }
    if (std::fflush(stdout) != 0 || std::ferror(stdout)) {
        std::fprintf(stderr, "zmtool uuid: cannot write the output: %s\n", std::strerror(errno));
        return 1;
    }
    return 0;
}
