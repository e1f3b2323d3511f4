// Wildcard matching and tokenizing over about 1 MiB of text: a listing of file-name-like lines
// ("study_0042/series_017/IM_001234.dcm 524288 CT"). The figures are reported (MiB/s) next to
// the peers a user would otherwise pick: fnmatch(3) and a split built on std::string::find.

#include "zmbench.h"

#include <zmlib/ZmStdStringTokenizer.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>
#include <zmlib/ZmStringTokenizerGeneral.h>
#include <zmlib/zmWildMatch.h>

#include <cstdio>
#include <fnmatch.h>
#include <string>
#include <vector>

namespace {

constexpr size_t kTextBytes = 1 << 20;
constexpr const char* kWhiteSpace = " \t\n\v\f\r"; // what isspace() accepts in the C locale
constexpr const char* kPathDelimiters = " /_.\n";

// The listing, made of whole lines, at most 1 MiB; the same bytes for every run (fixed seed).
const std::string& listing()
{
    static const std::string text = [] {
        static const char* const kinds[] = {"CT", "MR", "US", "MONOCHROME2", "RGB", "SR"};
        std::string t;
        unsigned x = 20240601;
        char line[128];
        for (;;) {
            x = x * 1103515245u + 12345u;
            const unsigned a = x >> 8;
            x = x * 1103515245u + 12345u;
            const unsigned b = x >> 8;
            const int n =
                std::snprintf(line, sizeof line, "study_%04u/series_%03u/IM_%06u.dcm %u %s\n", a % 10000,
                              b % 1000, (a ^ b) % 1000000, 1000 + b % 9000000, kinds[(a >> 3) % 6]);
            if (t.size() + size_t(n) > kTextBytes) {
                return t;
            }
            t.append(line, size_t(n));
        }
    }();
    return text;
}

// The lines of the listing as separate zero-terminated texts (line feeds replaced by zeros).
struct Lines {
    std::string storage;
    std::vector<const char*> lines;
    int64_t bytes = 0; // text bytes, without the terminators
};

const Lines& lines()
{
    static const Lines result = [] {
        Lines l;
        l.storage = listing();
        size_t start = 0;
        for (size_t i = 0; i < l.storage.size(); ++i) {
            if (l.storage[i] == '\n') {
                l.storage[i] = 0;
                l.lines.push_back(l.storage.data() + start);
                l.bytes += int64_t(i - start);
                start = i + 1;
            }
        }
        return l;
    }();
    return result;
}

// --- zmWildMatch -----------------------------------------------------------------------------------

ZMBENCH_REPORTED("zmWildMatch_lines",
                 "Every line of the listing (about 21600 lines of about 48 bytes) matched one by one against "
                 "`*/series_0*/IM_*7.dcm *`; peer: `fnmatch(pattern, line, 0)`. The match counts may differ: "
                 "the library's matcher does not retry the byte that broke a partial match.");

constexpr const char* kLinePattern = "*/series_0*/IM_*7.dcm *";

void WildMatchLinesZm(benchmark::State& state)
{
    const Lines& l = lines();
    int64_t matches = 0;
    for (auto _ : state) {
        matches = 0;
        for (const char* line : l.lines) {
            matches += zmWildMatch(line, kLinePattern);
        }
        benchmark::DoNotOptimize(matches);
    }
    state.counters["matches"] = double(matches);
    state.SetLabel("zmWildMatch");
    state.SetBytesProcessed(state.iterations() * l.bytes);
}
BENCHMARK(WildMatchLinesZm)->Name("zmWildMatch_lines/zm")->Unit(benchmark::kMicrosecond);

void WildMatchLinesPeer(benchmark::State& state)
{
    const Lines& l = lines();
    int64_t matches = 0;
    for (auto _ : state) {
        matches = 0;
        for (const char* line : l.lines) {
            matches += fnmatch(kLinePattern, line, 0) == 0 ? 1 : 0;
        }
        benchmark::DoNotOptimize(matches);
    }
    state.counters["matches"] = double(matches);
    state.SetLabel("fnmatch(3)");
    state.SetBytesProcessed(state.iterations() * l.bytes);
}
BENCHMARK(WildMatchLinesPeer)->Name("zmWildMatch_lines/peer")->Unit(benchmark::kMicrosecond);

ZMBENCH_REPORTED("zmWildMatch_whole",
                 "One match of the whole 1 MiB listing (one zero-terminated text) against "
                 "`*/IM_9999999.dcm*`, which does not occur, so both scan to the end; peer: `fnmatch`.");

constexpr const char* kWholePattern = "*/IM_9999999.dcm*";

void WildMatchWholeZm(benchmark::State& state)
{
    const std::string& text = listing();
    int result = 0;
    for (auto _ : state) {
        result = zmWildMatch(text.c_str(), kWholePattern);
        benchmark::DoNotOptimize(result);
    }
    state.counters["matches"] = double(result);
    state.SetLabel("zmWildMatch");
    state.SetBytesProcessed(state.iterations() * int64_t(text.size()));
}
BENCHMARK(WildMatchWholeZm)->Name("zmWildMatch_whole/zm")->Unit(benchmark::kMicrosecond);

void WildMatchWholePeer(benchmark::State& state)
{
    const std::string& text = listing();
    int result = 0;
    for (auto _ : state) {
        result = fnmatch(kWholePattern, text.c_str(), 0) == 0 ? 1 : 0;
        benchmark::DoNotOptimize(result);
    }
    state.counters["matches"] = double(result);
    state.SetLabel("fnmatch(3)");
    state.SetBytesProcessed(state.iterations() * int64_t(text.size()));
}
BENCHMARK(WildMatchWholePeer)->Name("zmWildMatch_whole/peer")->Unit(benchmark::kMicrosecond);

// --- tokenizers ------------------------------------------------------------------------------------

// The peer of every tokenizer: the split a user writes with std::string::find_first_(not_)of,
// producing each token into one reused std::string as the tokenizers do into their token.
int64_t findSplit(const std::string& text, const char* delimiters, std::string& token)
{
    int64_t count = 0;
    size_t start = text.find_first_not_of(delimiters);
    while (start != std::string::npos) {
        const size_t end = text.find_first_of(delimiters, start);
        token.assign(text, start, end == std::string::npos ? std::string::npos : end - start);
        benchmark::DoNotOptimize(token.data());
        ++count;
        start = end == std::string::npos ? end : text.find_first_not_of(delimiters, end);
    }
    return count;
}

void FindSplit(benchmark::State& state, const char* delimiters, const char* label)
{
    const std::string& text = listing();
    std::string token;
    int64_t tokens = 0;
    for (auto _ : state) {
        tokens = findSplit(text, delimiters, token);
        benchmark::ClobberMemory();
    }
    state.counters["tokens"] = double(tokens);
    state.SetLabel(label);
    state.SetBytesProcessed(state.iterations() * int64_t(text.size()));
}

ZMBENCH_REPORTED("ZmStringTokenizer",
                 "The listing split at white space (3 tokens per line) with `ZmStringTokenizer` over a "
                 "`ZmString`; peer: a `find_first_of`/`find_first_not_of` split of a `std::string` with the "
                 "same six white-space characters.");

void StringTokenizerZm(benchmark::State& state)
{
    const ZmString text(listing().c_str());
    int64_t tokens = 0;
    for (auto _ : state) {
        tokens = 0;
        ZmStringTokenizer tokenizer(text);
        while (tokenizer.hasMoreTokens()) {
            const ZmString& token = tokenizer.nextToken();
            benchmark::DoNotOptimize(token.getString());
            ++tokens;
        }
        benchmark::ClobberMemory();
    }
    state.counters["tokens"] = double(tokens);
    state.SetLabel("ZmStringTokenizer");
    state.SetBytesProcessed(state.iterations() * int64_t(text.length()));
}
BENCHMARK(StringTokenizerZm)->Name("ZmStringTokenizer/zm")->Unit(benchmark::kMicrosecond);

void StringTokenizerPeer(benchmark::State& state)
{
    FindSplit(state, kWhiteSpace, "std::string find split");
}
BENCHMARK(StringTokenizerPeer)->Name("ZmStringTokenizer/peer")->Unit(benchmark::kMicrosecond);

ZMBENCH_REPORTED("ZmStringTokenizerGeneral",
                 "The listing split into path components with the delimiters `\" /_.\\n\"` "
                 "(9 tokens per line) with `ZmStringTokenizerGeneral`; peer: the `std::string` find "
                 "split with the same delimiters.");

void StringTokenizerGeneralZm(benchmark::State& state)
{
    const ZmString text(listing().c_str());
    int64_t tokens = 0;
    for (auto _ : state) {
        tokens = 0;
        ZmStringTokenizerGeneral tokenizer(text, kPathDelimiters);
        while (tokenizer.hasMoreTokens()) {
            const ZmString& token = tokenizer.nextToken();
            benchmark::DoNotOptimize(token.getString());
            ++tokens;
        }
        benchmark::ClobberMemory();
    }
    state.counters["tokens"] = double(tokens);
    state.SetLabel("ZmStringTokenizerGeneral");
    state.SetBytesProcessed(state.iterations() * int64_t(text.length()));
}
BENCHMARK(StringTokenizerGeneralZm)->Name("ZmStringTokenizerGeneral/zm")->Unit(benchmark::kMicrosecond);

void StringTokenizerGeneralPeer(benchmark::State& state)
{
    FindSplit(state, kPathDelimiters, "std::string find split");
}
BENCHMARK(StringTokenizerGeneralPeer)->Name("ZmStringTokenizerGeneral/peer")->Unit(benchmark::kMicrosecond);

ZMBENCH_REPORTED("ZmStdStringTokenizer",
                 "The listing split at white space with `ZmStdStringTokenizer` (its construction, which "
                 "copies the text, included) into a reused `std::string`; peer: the `std::string` find split "
                 "of the caller's string.");

void StdStringTokenizerZm(benchmark::State& state)
{
    const std::string& text = listing();
    std::string token;
    int64_t tokens = 0;
    for (auto _ : state) {
        tokens = 0;
        ZmStdStringTokenizer tokenizer(text);
        while (tokenizer.hasMoreTokens()) {
            tokenizer.nextToken(token);
            benchmark::DoNotOptimize(token.data());
            ++tokens;
        }
        benchmark::ClobberMemory();
    }
    state.counters["tokens"] = double(tokens);
    state.SetLabel("ZmStdStringTokenizer");
    state.SetBytesProcessed(state.iterations() * int64_t(text.size()));
}
BENCHMARK(StdStringTokenizerZm)->Name("ZmStdStringTokenizer/zm")->Unit(benchmark::kMicrosecond);

void StdStringTokenizerPeer(benchmark::State& state)
{
    FindSplit(state, kWhiteSpace, "std::string find split");
}
BENCHMARK(StdStringTokenizerPeer)->Name("ZmStdStringTokenizer/peer")->Unit(benchmark::kMicrosecond);

} // namespace
