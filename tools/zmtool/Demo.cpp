// zmtool demo: an end-to-end walk through the library on built-in sample data. Each subsystem adds
// a section; a section prints what it did and returns false if something did not come out as the
// library promises, which makes the demo exit non-zero.
#include "zmtool.h"

#include <zmlib/zmlib.h>

#include <cstdio>

namespace {

void heading(const char* title)
{
    std::printf("\n== %s ==\n", title);
}

// A header line as an acquisition export writes it: blanks separate fields, quotes keep blanks
// inside a field, a backslash outside quotes escapes the next byte (inside quotes every byte is
// taken as it is).
const char kHeaderLine[] = "PATIENT \"Doe^Jane\" STUDY \"CT chest, low dose\" NOTE \\\"draft\\\" SLICES 212 "
                           "SPACING 0.625 WINDOW \"-600 1500\" FILE scan\\ 01.raw";

const char* const kFileNames[] = {"IM_0001.dcm",     "IM_0002.dcm", "IM_0010.DCM",     "scan_01.raw",
                                  "scan_01.raw.md5", "report.txt",  "IM_0003.dcm.bak", "localizer.dcm"};

const char* const kPatterns[] = {"IM_*.dcm", "*.raw", "IM_000?.dcm", "*.dcm*", "scan_??.*"};

const char* const kNumberTexts[] = {"512", "0x200", "-0.625", "1e-3", "017", "12 ", "", "3.5mm", "NaN", "0x"};

bool demoStrings()
{
    heading("strings: splitting a quoted header line");
    std::printf("line: %s\n", kHeaderLine);
    ZmStringTokenizer tokens(kHeaderLine);
    ZmDArray<ZmString> fields;
    while (tokens.hasMoreTokens()) {
        fields.append(tokens.nextToken());
    }
    for (int64_t i = 0; i + 1 < fields.size(); i += 2) {
        std::printf("  %-8s = %s\n", fields[i].getString(), fields[i + 1].getString());
    }
    // Writing the fields back with protect() and splitting again must give the same fields.
    ZmString rebuilt;
    for (const ZmString& f : fields) {
        if (!rebuilt.isEmptyString()) {
            rebuilt += ' ';
        }
        rebuilt += f.protect(false);
    }
    ZmStringTokenizer again(rebuilt);
    bool same = true;
    for (const ZmString& f : fields) {
        same = same && again.hasMoreTokens() && again.nextToken() == f;
    }
    same = same && !again.hasMoreTokens();
    std::printf("protected again: %s\n  round trip %s\n", rebuilt.getString(), same ? "ok" : "FAILED");

    heading("strings: matching file names against wildcards");
    for (const char* pattern : kPatterns) {
        ZmString hits;
        for (const char* name : kFileNames) {
            if (zmWildMatch(name, pattern) != 0) {
                hits += hits.isEmptyString() ? "" : ", ";
                hits += name;
            }
        }
        std::printf("  %-12s -> %s\n", pattern, hits.isEmptyString() ? "(none)" : hits.getString());
    }

    heading("strings: parsing numbers");
    int notNumbers = 0;
    for (const char* text : kNumberTexts) {
        bool isLong = false;
        bool isDouble = false;
        const long l = StringUtils::toLong(text, 0, &isLong);
        const double d = StringUtils::toDouble(text, 0.0, &isDouble);
        ZmString quoted(0, "\"%s\"", text);
        if (isLong) {
            std::printf("  %-8s integer %ld\n", quoted.getString(), l);
        } else if (isDouble) {
            std::printf("  %-8s real    %g\n", quoted.getString(), d);
        } else {
            std::printf("  %-8s not a number\n", quoted.getString());
            ++notNumbers;
        }
    }
    std::printf("  %d of %zu texts are not numbers\n", notNumbers,
                sizeof kNumberTexts / sizeof *kNumberTexts);
    return same;
}

} // namespace

int zmtool::runDemo(int argc, char** argv)
{
    (void)argv;
    if (argc > 0) {
        std::fprintf(stderr, "usage: zmtool demo\n");
        return 2;
    }
    std::printf("zmlib %s demo\n", ZMLIB_VERSION_STRING);
    bool ok = true;
    ok = demoStrings() && ok;
    std::printf("\ndemo %s\n", ok ? "finished" : "FAILED");
    return ok ? 0 : 1;
}
