// The main() of every benchmark program: runs Google Benchmark with its usual console output and
// writes a Markdown section with one table per comparison group (see zmbench.h for the names).
//
// Extra options, removed before Google Benchmark sees the command line:
//   --zm_markdown=FILE   write the Markdown section to FILE (default: print it after the run)
//   --zm_title=TEXT      heading of the section (default: the program's name)
// Defaults added unless given on the command line: 9 repetitions, 0.15 s minimum time, random
// interleaving of the repetitions, aggregates only on the console. Ratios compare medians of the
// CPU time per iteration, so a burst of load from another process moves single repetitions, not
// the verdict. The heap is put in a fixed state first (zmbench::Heap).

#include "zmbench.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <limits>
#include <malloc.h>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

namespace zmbench {
namespace {

struct Declaration {
    double maxRatio = 0; // 0: reported without a target
    std::string description;
};

std::map<std::string, Declaration>& declarations()
{
    static std::map<std::string, Declaration> table;
    return table;
}

} // namespace

bool declareTarget(const char* scope, double maxRatio, const char* description)
{
    declarations()[scope] = Declaration{maxRatio, description};
    return true;
}

bool declareReported(const char* scope, const char* description)
{
    declarations()[scope] = Declaration{0, description};
    return true;
}

bool declareMissingPeer(const char* benchmarkName, const char* reason)
{
    const std::string message = std::string("skipped: ") + reason;
    benchmark::RegisterBenchmark(benchmarkName,
                                 [message](benchmark::State& state) {
                                     state.SkipWithError(message.c_str());
                                     for (auto _ : state) {
                                     }
                                 })
        ->Iterations(1)
        ->Repetitions(1);
    return true;
}

void setHeap(Heap heap)
{
#if defined(__GLIBC__)
    if (heap == Heap::Warm) {
        mallopt(M_MMAP_THRESHOLD, 32 << 20);
        mallopt(M_TRIM_THRESHOLD, 64 << 20);
    } else {
        mallopt(M_MMAP_THRESHOLD, 128 << 10);
        mallopt(M_TRIM_THRESHOLD, 128 << 10);
    }
#else
    (void)heap;
#endif
}

const char* heapName(Heap heap)
{
    return heap == Heap::Warm ? "warm" : "cold";
}

} // namespace zmbench

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// What the report keeps of one benchmark (one "<case>/<side>" name).
struct Measure {
    std::pair<int64_t, int64_t> declared{0, 0}; // family and instance: the order of declaration
    double medianNs = kNaN;                     // from the "median" aggregate
    double medianBytesPerSec = kNaN;
    std::vector<double> samplesNs; // single runs, used when there is no aggregate
    std::vector<double> samplesBytesPerSec;
    std::map<std::string, double> counters; // other user counters (of the median, else last run)
    std::string label;
    std::string error;
    int64_t repetitions = 0;

    double timeNs() const { return std::isnan(medianNs) ? median(samplesNs) : medianNs; }
    double bytesPerSec() const
    {
        return std::isnan(medianBytesPerSec) ? median(samplesBytesPerSec) : medianBytesPerSec;
    }
    static double median(std::vector<double> v)
    {
        if (v.empty()) {
            return kNaN;
        }
        std::sort(v.begin(), v.end());
        const size_t n = v.size();
        return n % 2 == 1 ? v[n / 2] : (v[n / 2 - 1] + v[n / 2]) / 2;
    }
};

// The time a case is judged by: CPU time, or the wall-clock time for cases registered with
// UseRealTime() (threaded cases, where the CPU time of one thread says little), or the time a
// case measured itself (UseManualTime(): a peer timed in another process).
double cpuNanoseconds(const benchmark::BenchmarkReporter::Run& run)
{
    const bool realTime = run.benchmark_name().find("/real_time") != std::string::npos ||
                          run.benchmark_name().find("/manual_time") != std::string::npos;
    const double t = realTime ? run.GetAdjustedRealTime() : run.GetAdjustedCPUTime();
    return t / benchmark::GetTimeUnitMultiplier(run.time_unit) * 1e9;
}

// Console output as usual; every run is also kept for the Markdown section.
class CollectingReporter : public benchmark::ConsoleReporter {
public:
    explicit CollectingReporter(OutputOptions options) : ConsoleReporter(options) {}

    void ReportRuns(const std::vector<Run>& runs) override
    {
        for (const Run& run : runs) {
            collect(run);
        }
        ConsoleReporter::ReportRuns(runs);
    }

    std::map<std::string, Measure> measures;
    std::vector<std::string> order; // names in order of first report

private:
    void collect(const Run& run)
    {
        std::string name = run.run_name.function_name;
        if (!run.run_name.args.empty()) {
            name += "/" + run.run_name.args;
        }
        // Runs of one benchmark with different thread counts are different cases.
        if (!run.run_name.threads.empty()) {
            name += "/" + run.run_name.threads;
        }
        auto it = measures.find(name);
        if (it == measures.end()) {
            it = measures.emplace(name, Measure{}).first;
            it->second.declared = {run.family_index, run.per_family_instance_index};
            order.push_back(name);
        }
        Measure& m = it->second;
        if (run.error_occurred) {
            m.error = run.error_message;
            return;
        }
        if (m.label.empty()) {
            m.label = run.report_label;
        }
        const auto bytes = run.counters.find("bytes_per_second");
        if (run.run_type == Run::RT_Aggregate) {
            if (run.aggregate_name != "median") {
                return;
            }
            m.medianNs = cpuNanoseconds(run);
            if (bytes != run.counters.end()) {
                m.medianBytesPerSec = bytes->second.value;
            }
            keepCounters(m, run);
        } else {
            m.samplesNs.push_back(cpuNanoseconds(run));
            if (bytes != run.counters.end()) {
                m.samplesBytesPerSec.push_back(bytes->second.value);
            }
            m.repetitions = std::max<int64_t>(m.repetitions, run.repetitions);
            if (std::isnan(m.medianNs)) {
                keepCounters(m, run);
            }
        }
        m.repetitions = std::max<int64_t>(m.repetitions, run.repetitions);
    }

    static void keepCounters(Measure& m, const Run& run)
    {
        for (const auto& [key, counter] : run.counters) {
            if (key != "bytes_per_second" && key != "items_per_second") {
                m.counters[key] = counter.value;
            }
        }
    }
};

// --- Markdown ------------------------------------------------------------------------------------

std::vector<std::string> splitPath(const std::string& s)
{
    std::vector<std::string> parts;
    std::string part;
    std::istringstream in(s);
    while (std::getline(in, part, '/')) {
        parts.push_back(part);
    }
    return parts;
}

bool isSide(const std::string& component)
{
    return component == "zm" || component == "peer" || component.rfind("peer-", 0) == 0;
}

std::string formatTime(double ns)
{
    if (std::isnan(ns)) {
        return "n/a";
    }
    char text[64];
    if (ns >= 1e9) {
        std::snprintf(text, sizeof text, "%.3g s", ns / 1e9);
    } else if (ns >= 1e6) {
        std::snprintf(text, sizeof text, "%.3g ms", ns / 1e6);
    } else if (ns >= 1e3) {
        std::snprintf(text, sizeof text, "%.3g us", ns / 1e3);
    } else {
        std::snprintf(text, sizeof text, "%.3g ns", ns);
    }
    return text;
}

std::string formatMeasure(const Measure& m)
{
    if (!m.error.empty()) {
        return "-";
    }
    std::string text = formatTime(m.timeNs());
    const double bps = m.bytesPerSec();
    if (!std::isnan(bps)) {
        char rate[48];
        std::snprintf(rate, sizeof rate, " (%.0f MiB/s)", bps / (1024.0 * 1024.0));
        text += rate;
    }
    return text;
}

std::string formatCounters(const Measure& m)
{
    std::string text;
    for (const auto& [key, value] : m.counters) {
        char item[96];
        std::snprintf(item, sizeof item, "%s%s=%.6g", text.empty() ? "" : ", ", key.c_str(), value);
        text += item;
    }
    return text;
}

// Markdown table cells must not contain '|'.
std::string cell(std::string s)
{
    for (size_t p = 0; (p = s.find('|', p)) != std::string::npos; p += 2) {
        s.replace(p, 1, "\\|");
    }
    return s;
}

struct CaseRows {
    std::string name;
    const Measure* zm = nullptr;
    std::vector<std::pair<std::string, const Measure*>> peers; // side, measure
    std::pair<int64_t, int64_t> declared{std::numeric_limits<int64_t>::max(), 0};
};

const zmbench::Declaration* findDeclaration(const std::string& caseName)
{
    const auto& table = zmbench::declarations();
    std::string scope = caseName;
    for (;;) {
        const auto it = table.find(scope);
        if (it != table.end()) {
            return &it->second;
        }
        const size_t slash = scope.rfind('/');
        if (slash == std::string::npos) {
            return nullptr;
        }
        scope.erase(slash);
    }
}

std::string writeMarkdown(const CollectingReporter& reporter, const std::string& title)
{
    // Pair the sides of each case; keep groups and cases in the order the benchmarks were declared.
    std::map<std::string, CaseRows> cases;
    std::vector<std::string> unpaired;
    int64_t repetitions = 0;
    for (const std::string& name : reporter.order) {
        const Measure& m = reporter.measures.at(name);
        repetitions = std::max(repetitions, m.repetitions);
        std::vector<std::string> parts = splitPath(name);
        int sideAt = -1;
        for (int i = int(parts.size()) - 1; i >= 0; --i) {
            if (isSide(parts[size_t(i)])) {
                sideAt = i;
                break;
            }
        }
        if (sideAt <= 0) {
            unpaired.push_back(name);
            continue;
        }
        const std::string side = parts[size_t(sideAt)];
        parts.erase(parts.begin() + sideAt);
        std::string caseName;
        for (const std::string& p : parts) {
            caseName += (caseName.empty() ? "" : "/") + p;
        }
        CaseRows& rows = cases[caseName];
        rows.name = caseName;
        rows.declared = std::min(rows.declared, m.declared);
        if (side == "zm") {
            rows.zm = &m;
        } else {
            rows.peers.emplace_back(side, &m);
        }
    }
    std::vector<const CaseRows*> sorted;
    for (auto& [name, rows] : cases) {
        // The peer that carries the target first, then the others by name.
        std::sort(rows.peers.begin(), rows.peers.end(), [](const auto& a, const auto& b) {
            return std::make_pair(a.first != "peer", a.first) < std::make_pair(b.first != "peer", b.first);
        });
        sorted.push_back(&rows);
    }
    std::stable_sort(sorted.begin(), sorted.end(),
                     [](const CaseRows* a, const CaseRows* b) { return a->declared < b->declared; });
    std::vector<std::string> groups;
    std::map<std::string, std::vector<const CaseRows*>> byGroup;
    for (const CaseRows* rows : sorted) {
        const std::string group = splitPath(rows->name).front();
        if (byGroup.find(group) == byGroup.end()) {
            groups.push_back(group);
        }
        byGroup[group].push_back(rows);
    }

    std::ostringstream body;
    int targets = 0;
    int met = 0;
    std::vector<std::string> missed;
    for (const std::string& group : groups) {
        const zmbench::Declaration* groupDecl = findDeclaration(group);
        body << "### " << group << "\n\n";
        if (groupDecl != nullptr && !groupDecl->description.empty()) {
            body << groupDecl->description << "\n\n";
        }
        bool withNotes = false;
        for (const CaseRows* rows : byGroup[group]) {
            withNotes = withNotes || (rows->zm != nullptr && !rows->zm->counters.empty());
            for (const auto& peer : rows->peers) {
                withNotes = withNotes || !peer.second->counters.empty();
            }
        }
        body << "| Case | Peer | zmlib | peer | Ratio | Target | Verdict |" << (withNotes ? " Notes |" : "")
             << "\n|---|---|---:|---:|---:|---:|---|" << (withNotes ? "---|" : "") << "\n";
        for (const CaseRows* rows : byGroup[group]) {
            const zmbench::Declaration* decl = findDeclaration(rows->name);
            if (rows->peers.empty()) {
                body << "| " << cell(rows->name) << " | (none) | "
                     << (rows->zm != nullptr ? formatMeasure(*rows->zm) : "-") << " | - | - | - | no peer |"
                     << (withNotes ? " |" : "") << "\n";
                continue;
            }
            for (const auto& [side, peer] : rows->peers) {
                const std::string peerName = peer->label.empty() ? side : peer->label;
                const bool primary = side == "peer";
                const double maxRatio = primary && decl != nullptr ? decl->maxRatio : 0;
                std::string ratioText = "-";
                std::string targetText = maxRatio > 0 ? "" : "-";
                std::string verdict;
                if (maxRatio > 0) {
                    char t[32];
                    std::snprintf(t, sizeof t, "<= %.2f", maxRatio);
                    targetText = t;
                }
                if (rows->zm == nullptr) {
                    verdict = "no zmlib side";
                } else if (!rows->zm->error.empty()) {
                    verdict = "zmlib side failed: " + rows->zm->error;
                } else if (!peer->error.empty()) {
                    verdict = peer->error;
                } else {
                    const double ratio = rows->zm->timeNs() / peer->timeNs();
                    char r[32];
                    std::snprintf(r, sizeof r, "%.2f", ratio);
                    ratioText = r;
                    if (maxRatio > 0) {
                        ++targets;
                        // Judged on the printed figure, so the table never contradicts itself.
                        if (std::strtod(r, nullptr) <= maxRatio) {
                            ++met;
                            verdict = "met";
                        } else {
                            verdict = "**MISSED**";
                            missed.push_back(rows->name);
                        }
                    } else {
                        verdict = "reported";
                    }
                }
                body << "| " << cell(rows->name) << " | " << cell(peerName) << " | "
                     << (rows->zm != nullptr ? formatMeasure(*rows->zm) : "-") << " | "
                     << formatMeasure(*peer) << " | " << ratioText << " | " << targetText << " | "
                     << cell(verdict) << " |";
                if (withNotes) {
                    std::string notes;
                    if (rows->zm != nullptr && !rows->zm->counters.empty()) {
                        notes += "zmlib: " + formatCounters(*rows->zm);
                    }
                    if (!peer->counters.empty()) {
                        notes += (notes.empty() ? "" : "; ") + std::string("peer: ") + formatCounters(*peer);
                    }
                    body << " " << cell(notes) << " |";
                }
                body << "\n";
            }
        }
        body << "\n";
    }
    if (!unpaired.empty()) {
        body << "### Other measurements\n\n| Benchmark | Time |\n|---|---:|\n";
        for (const std::string& name : unpaired) {
            body << "| " << cell(name) << " | " << formatMeasure(reporter.measures.at(name)) << " |\n";
        }
        body << "\n";
    }

    std::ostringstream out;
    out << "## " << title << "\n\n";
    out << "Median of " << repetitions << (repetitions == 1 ? " run" : " repetitions")
        << " of the CPU time per iteration (the wall-clock time for cases marked real_time, the time "
           "measured by "
           "the case for manual_time); ratio = zmlib "
           "time / peer time.";
    if (targets > 0) {
        out << " Targets met: " << met << " of " << targets << ".";
        if (!missed.empty()) {
            out << " Missed:";
            for (size_t i = 0; i < missed.size(); ++i) {
                out << (i == 0 ? " " : ", ") << "`" << missed[i] << "`";
            }
            out << ".";
        }
    }
    out << "\n\n" << body.str();
    return out.str();
}

bool hasFlag(const std::vector<std::string>& args, const char* flag)
{
    const size_t n = std::strlen(flag);
    for (const std::string& a : args) {
        if (a.compare(0, n, flag) == 0 && (a.size() == n || a[n] == '=')) {
            return true;
        }
    }
    return false;
}

} // namespace

int main(int argc, char** argv)
{
    std::string markdownPath;
    std::string title;
    {
        const char* slash = std::strrchr(argv[0], '/');
        title = slash != nullptr ? slash + 1 : argv[0];
    }
    std::vector<std::string> args;
    args.emplace_back(argv[0]);
    for (int i = 1; i < argc; ++i) {
        const std::string a = argv[i];
        if (a.rfind("--zm_markdown=", 0) == 0) {
            markdownPath = a.substr(std::strlen("--zm_markdown="));
        } else if (a.rfind("--zm_title=", 0) == 0) {
            title = a.substr(std::strlen("--zm_title="));
        } else {
            args.push_back(a);
        }
    }
    // Defaults first, so that the same flag given on the command line (parsed later) wins.
    std::vector<std::string> defaults;
    if (!hasFlag(args, "--benchmark_repetitions")) {
        defaults.emplace_back("--benchmark_repetitions=9");
    }
    if (!hasFlag(args, "--benchmark_min_time")) {
        defaults.emplace_back("--benchmark_min_time=0.15");
    }
    if (!hasFlag(args, "--benchmark_enable_random_interleaving")) {
        defaults.emplace_back("--benchmark_enable_random_interleaving=true");
    }
    if (!hasFlag(args, "--benchmark_display_aggregates_only") &&
        !hasFlag(args, "--benchmark_report_aggregates_only")) {
        defaults.emplace_back("--benchmark_display_aggregates_only=true");
    }
    args.insert(args.begin() + 1, defaults.begin(), defaults.end());

    std::vector<char*> cargs;
    for (std::string& a : args) {
        cargs.push_back(a.data());
    }
    cargs.push_back(nullptr);
    int cargc = int(args.size());
    benchmark::Initialize(&cargc, cargs.data());
    if (benchmark::ReportUnrecognizedArguments(cargc, cargs.data())) {
        return 1;
    }

    zmbench::setHeap(zmbench::Heap::Warm);
    CollectingReporter reporter(isatty(STDOUT_FILENO) ? benchmark::ConsoleReporter::OO_Color
                                                      : benchmark::ConsoleReporter::OO_None);
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();

    const std::string markdown =
        reporter.order.empty() ? "## " + title + "\n\nNo benchmark ran (filtered out or only listed).\n\n"
                               : writeMarkdown(reporter, title);
    if (markdownPath.empty()) {
        if (!reporter.order.empty()) {
            std::cout << "\n" << markdown;
        }
    } else {
        std::ofstream file(markdownPath);
        file << markdown;
        if (!file) {
            std::cerr << "cannot write " << markdownPath << "\n";
            return 1;
        }
    }
    return 0;
}
