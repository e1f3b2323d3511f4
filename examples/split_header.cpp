// Splits a quoted header line into fields and keeps those that match a wildcard, using only the
// installed zmlib package.
#include <zmlib/zmlib.h>

#include <cstdio>

int main(int argc, char** argv)
{
    const char* line = argc > 1 ? argv[1] : "series \"CT chest 2.0\" scan_001.dcm scan_002.raw notes.txt";
    const char* pattern = argc > 2 ? argv[2] : "scan_*";

    ZmDArray<ZmString> matching;
    ZmStringTokenizer tokens(line);
    int count = 0;
    while (tokens.hasMoreTokens()) {
        ZmString& token = tokens.nextToken();
        ++count;
        if (token.matches(pattern)) {
            matching.append(token);
        }
    }
    ZmString report(0, "zmlib %s: %d fields, %lld match %s:", ZMLIB_VERSION_STRING, count,
                    static_cast<long long>(matching.size()), pattern);
    for (const ZmString& m : matching) {
        report += " ";
        report += m.protect(false);
    }
    std::printf("%s\n", report.getString());
    return 0;
}
