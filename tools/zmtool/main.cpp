// zmtool: the library's user-facing services on the command line.
#include "zmtool.h"

#include <zmlib/zmlibVersion.h>

#include <cstdio>
#include <cstring>

namespace {

struct Command {
    const char* name;
    const char* summary;
    int (*run)(int argc, char** argv);
};

const Command kCommands[] = {
    {"demo", "walk through the library on built-in sample data", zmtool::runDemo},
    {"md5", "MD5 digests of files, printed as md5sum does", zmtool::runMd5},
    {"cksum", "CRC and size of files, printed as cksum does", zmtool::runCksum},
    {"uuid", "random (version 4) UUIDs, plain or braced", zmtool::runUuid},
    {"orient", "anatomical edge labels and view class of a screen-to-patient matrix", zmtool::runOrient},
    {"raw", "inspect, convert, flip, crop, permute and down-sample raw volume files", zmtool::runRaw},
    {"bundle", "print parameter trees and read values by path or DICOM tag", zmtool::runBundle},
};

void printUsage(FILE* out)
{
    std::fprintf(out, "usage: zmtool [--help] [--version] COMMAND [ARGS...]\n\ncommands:\n");
    for (const Command& c : kCommands) {
        std::fprintf(out, "  %-10s %s\n", c.name, c.summary);
    }
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 2) {
        printUsage(stderr);
        return 2;
    }
    const char* verb = argv[1];
    if (std::strcmp(verb, "--help") == 0 || std::strcmp(verb, "-h") == 0 || std::strcmp(verb, "help") == 0) {
        printUsage(stdout);
        return 0;
    }
    if (std::strcmp(verb, "--version") == 0) {
        std::printf("zmtool (zmlib) %s\n", ZMLIB_VERSION_STRING);
        return 0;
    }
    for (const Command& c : kCommands) {
        if (std::strcmp(verb, c.name) == 0) {
            return c.run(argc - 2, argv + 2);
        }
    }
    std::fprintf(stderr, "zmtool: unknown command '%s'\n", verb);
    printUsage(stderr);
    return 2;
}
