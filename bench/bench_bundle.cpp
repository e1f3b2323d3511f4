// Parameter trees: lookup in a sorted bundle against std::map with the same case-insensitive key,
// and the text form written and read back against fixed throughputs (the "peer" of those is the
// time the target throughput would take for the same text, so a ratio at or below 1 meets it).
#include "zmbench.h"

#include <zmlib/HxParamBundle.h>
#include <zmlib/ZmString.h>

#include <algorithm>
#include <cstdio>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

ZMBENCH_TARGET("HxParamBundle_find", 1.5,
               "lookup of one of 10^4 parameters of a sorted bundle by a key in another case (peer: "
               "std::map<std::string, HxParameter*> with an ASCII case-insensitive less)");
ZMBENCH_REPORTED(
    "HxParamBundle_findSorted",
    "an insertion, then a lookup that sorts the 10^4 parameters again (lazy sort), per iteration");
ZMBENCH_TARGET(
    "HxParamBundle_print", 1.0,
    "the string form of a tree of 10^5 parameters (peer: the time 100 MB/s of that text would take)");
ZMBENCH_TARGET("HxParamBundle_parse", 1.0,
               "reading that text back into a tree (peer: the time 50 MB/s of that text would take)");

namespace {

constexpr int kParameters = 10000;

std::string nameOf(int i)
{
    char name[16];
    std::snprintf(name, sizeof name, "Param%05d", i);
    return name;
}

std::string lowered(std::string s)
{
    std::transform(s.begin(), s.end(), s.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? char(c + 32) : c; });
    return s;
}

// The lookup keys, in another case and a shuffled order.
const std::vector<std::string>& keys()
{
    static const std::vector<std::string> k = [] {
        std::vector<std::string> v;
        for (int i = 0; i < kParameters; ++i) {
            v.push_back(lowered(nameOf(i)));
        }
        std::shuffle(v.begin(), v.end(), std::mt19937(3));
        return v;
    }();
    return k;
}

HxParamBundle& sortedBundle()
{
    static HxParamBundle* b = [] {
        auto* bundle = new HxParamBundle("Many");
        for (int i = kParameters - 1; i >= 0; --i) {
            bundle->insert(new HxParameter(nameOf(i).c_str(), i), 0);
        }
        bundle->sortParameters();
        return bundle;
    }();
    return *b;
}

struct CaseInsensitiveLess {
    bool operator()(const std::string& a, const std::string& b) const
    {
        return std::lexicographical_compare(a.begin(), a.end(), b.begin(), b.end(), [](char x, char y) {
            return (x >= 'a' && x <= 'z' ? x - 32 : x) < (y >= 'a' && y <= 'z' ? y - 32 : y);
        });
    }
};

void FindZm(benchmark::State& state)
{
    const HxParamBundle& b = sortedBundle();
    size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(b.find(keys()[i].c_str()));
        i = i + 1 == keys().size() ? 0 : i + 1;
    }
}

void FindPeer(benchmark::State& state)
{
    std::map<std::string, HxParameter*, CaseInsensitiveLess> map;
    for (int i = 0; i < kParameters; ++i) {
        map[nameOf(i)] = sortedBundle().find(nameOf(i).c_str());
    }
    size_t i = 0;
    for (auto _ : state) {
        const auto it = map.find(keys()[i]);
        benchmark::DoNotOptimize(it == map.end() ? nullptr : it->second);
        i = i + 1 == keys().size() ? 0 : i + 1;
    }
}
BENCHMARK(FindZm)->Name("HxParamBundle_find/zm");
BENCHMARK(FindPeer)->Name("HxParamBundle_find/peer");

void FindSortedZm(benchmark::State& state)
{
    HxParamBundle b(sortedBundle());
    size_t i = 0;
    for (auto _ : state) {
        // A new parameter clears the sorted state (its removal keeps it).
        auto* extra = new HxParameter("Extra", int(i));
        b.insert(extra, 0);
        benchmark::DoNotOptimize(b.findSorted(keys()[i].c_str()));
        b.remove(extra);
        i = i + 1 == keys().size() ? 0 : i + 1;
    }
}
BENCHMARK(FindSortedZm)->Name("HxParamBundle_findSorted/zm")->Unit(benchmark::kMicrosecond);

// 100 bundles of 1000 parameters: ints, float triples, doubles and texts.
const std::string& treeText()
{
    static const std::string text = [] {
        HxParamBundle root("Root");
        for (int b = 0; b < 100; ++b) {
            HxParamBundle* sub = root.bundle(("Series" + std::to_string(b)).c_str(), 1);
            for (int i = 0; i < 1000; ++i) {
                const std::string name = nameOf(i);
                const float v[3] = {0.5f * float(i), -1.25f, float(b) / 3.0f};
                switch (i % 4) {
                case 0:
                    sub->set(name.c_str(), i * 7919);
                    break;
                case 1:
                    sub->set(name.c_str(), 3, v);
                    break;
                case 2:
                    sub->set(name.c_str(), double(i) / 7.0);
                    break;
                default:
                    sub->set(name.c_str(), ("label \"" + std::to_string(i) + "\": value").c_str());
                    break;
                }
            }
        }
        ZmString out;
        root.print(out);
        return std::string(out.getString());
    }();
    return text;
}

void PrintZm(benchmark::State& state)
{
    HxParamBundle tree("T");
    if (!tree.parse(treeText().data(), treeText().size()).ok()) {
        state.SkipWithError("the tree text did not read back");
        return;
    }
    for (auto _ : state) {
        ZmString out;
        tree.print(out);
        benchmark::DoNotOptimize(out.getString());
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(treeText().size()));
}

void ParseZm(benchmark::State& state)
{
    for (auto _ : state) {
        HxParamBundle tree("T");
        benchmark::DoNotOptimize(tree.parse(treeText().data(), treeText().size()).ok());
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(treeText().size()));
}

// The time a throughput of \p bytesPerSecond would take for the text.
void ThroughputBudget(benchmark::State& state, double bytesPerSecond)
{
    const double seconds = double(treeText().size()) / bytesPerSecond;
    for (auto _ : state) {
        state.SetIterationTime(seconds);
    }
}
BENCHMARK(PrintZm)->Name("HxParamBundle_print/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ThroughputBudget, print, 100e6)
    ->Name("HxParamBundle_print/peer")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(ParseZm)->Name("HxParamBundle_parse/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ThroughputBudget, parse, 50e6)
    ->Name("HxParamBundle_parse/peer")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

} // namespace
