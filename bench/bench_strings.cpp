// The growable array and the string against the standard containers a user would otherwise pick.
// Each pair does the same work on the same data and hands its result to DoNotOptimize the same way.

#include "zmbench.h"

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmString.h>

#include <array>
#include <cstdio>
#include <string>
#include <vector>

namespace {

constexpr int kAppends = 1000000;

// --- ZmDArray<int>::append ----------------------------------------------------------------------

ZMBENCH_TARGET("ZmDArray_append", 1.1,
               "10^6 `ZmDArray<int>::append` into a new array (growth included, array freed at the end) vs "
               "`std::vector<int>::push_back` into a new vector, with the heap warm and cold (see README).");

using zmbench::Heap;

void DArrayAppendZm(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    for (auto _ : state) {
        ZmDArray<int> a;
        for (int i = 0; i < kAppends; ++i) {
            a.append(i);
        }
        benchmark::DoNotOptimize(a.dataPtr());
        benchmark::ClobberMemory();
    }
    state.SetLabel("ZmDArray<int>::append");
    state.SetBytesProcessed(state.iterations() * kAppends * int64_t(sizeof(int)));
}
BENCHMARK_CAPTURE(DArrayAppendZm, warm, Heap::Warm)
    ->Name("ZmDArray_append/heap:warm/zm")
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(DArrayAppendZm, cold, Heap::Cold)
    ->Name("ZmDArray_append/heap:cold/zm")
    ->Unit(benchmark::kMicrosecond);

void DArrayAppendPeer(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    for (auto _ : state) {
        std::vector<int> v;
        for (int i = 0; i < kAppends; ++i) {
            v.push_back(i);
        }
        benchmark::DoNotOptimize(v.data());
        benchmark::ClobberMemory();
    }
    state.SetLabel("std::vector<int>::push_back");
    state.SetBytesProcessed(state.iterations() * kAppends * int64_t(sizeof(int)));
}
BENCHMARK_CAPTURE(DArrayAppendPeer, warm, Heap::Warm)
    ->Name("ZmDArray_append/heap:warm/peer")
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(DArrayAppendPeer, cold, Heap::Cold)
    ->Name("ZmDArray_append/heap:cold/peer")
    ->Unit(benchmark::kMicrosecond);

// The same appends into an array that already has the room (emptied between rounds): the hot path
// alone, without the growth policy.
ZMBENCH_REPORTED(
    "ZmDArray_appendReused",
    "Diagnostic, no target: 10^6 appends into an emptied array that keeps its block (`clear()`), "
    "i.e. the append path alone, vs the same with `std::vector::clear()`. A loop of 1 to 2 cycles "
    "per element, so its figure also moves with where the compiler happens to place the loop.");

void DArrayAppendReusedZm(benchmark::State& state)
{
    ZmDArray<int> a;
    for (auto _ : state) {
        a.clear();
        for (int i = 0; i < kAppends; ++i) {
            a.append(i);
        }
        benchmark::DoNotOptimize(a.dataPtr());
        benchmark::ClobberMemory();
    }
    state.SetLabel("ZmDArray<int>::append");
    state.SetBytesProcessed(state.iterations() * kAppends * int64_t(sizeof(int)));
}
BENCHMARK(DArrayAppendReusedZm)->Name("ZmDArray_appendReused/zm")->Unit(benchmark::kMicrosecond);

void DArrayAppendReusedPeer(benchmark::State& state)
{
    std::vector<int> v;
    for (auto _ : state) {
        v.clear();
        for (int i = 0; i < kAppends; ++i) {
            v.push_back(i);
        }
        benchmark::DoNotOptimize(v.data());
        benchmark::ClobberMemory();
    }
    state.SetLabel("std::vector<int>::push_back");
    state.SetBytesProcessed(state.iterations() * kAppends * int64_t(sizeof(int)));
}
BENCHMARK(DArrayAppendReusedPeer)->Name("ZmDArray_appendReused/peer")->Unit(benchmark::kMicrosecond);

// --- ZmString += char -----------------------------------------------------------------------------

ZMBENCH_TARGET("ZmString_appendChar", 1.1,
               "10^6 `+= 'x'` into a new `ZmString` (freed at the end) vs the same into a new `std::string`, "
               "with the heap warm and cold.");

void StringAppendCharZm(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    for (auto _ : state) {
        ZmString s;
        for (int i = 0; i < kAppends; ++i) {
            s += 'x';
        }
        benchmark::DoNotOptimize(s.getString());
        benchmark::ClobberMemory();
    }
    state.SetLabel("ZmString += char");
    state.SetBytesProcessed(state.iterations() * kAppends);
}
BENCHMARK_CAPTURE(StringAppendCharZm, warm, Heap::Warm)
    ->Name("ZmString_appendChar/heap:warm/zm")
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(StringAppendCharZm, cold, Heap::Cold)
    ->Name("ZmString_appendChar/heap:cold/zm")
    ->Unit(benchmark::kMicrosecond);

void StringAppendCharPeer(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    for (auto _ : state) {
        std::string s;
        for (int i = 0; i < kAppends; ++i) {
            s += 'x';
        }
        benchmark::DoNotOptimize(s.data());
        benchmark::ClobberMemory();
    }
    state.SetLabel("std::string += char");
    state.SetBytesProcessed(state.iterations() * kAppends);
}
BENCHMARK_CAPTURE(StringAppendCharPeer, warm, Heap::Warm)
    ->Name("ZmString_appendChar/heap:warm/peer")
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(StringAppendCharPeer, cold, Heap::Cold)
    ->Name("ZmString_appendChar/heap:cold/peer")
    ->Unit(benchmark::kMicrosecond);

// --- ZmString += const char* --------------------------------------------------------------------

ZMBENCH_TARGET(
    "ZmString_appendText", 1.1,
    "A new string grown to 1 MiB by appending the same short text (`+= text`, a `const char*` "
    "whose length the compiler does not know) vs `std::string +=`; len = length of the text; heap warm "
    "and cold.");

constexpr int64_t kTextTotal = 1 << 20;

const char* shortText(int len)
{
    static const std::array<const char*, 4> texts = {"abcd", "abcdefgh", "abcdefghijklmnop",
                                                     "abcdefghijklmnopqrstuvwxyz012345"};
    const char* text = len <= 4 ? texts[0] : len <= 8 ? texts[1] : len <= 16 ? texts[2] : texts[3];
    // Both sides see the text as a run-time pointer, as when appending a name from elsewhere.
    benchmark::DoNotOptimize(text);
    return text;
}

void StringAppendTextZm(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    const int len = int(state.range(0));
    const char* text = shortText(len);
    const int64_t count = kTextTotal / len;
    for (auto _ : state) {
        ZmString s;
        for (int64_t i = 0; i < count; ++i) {
            s += text;
        }
        benchmark::DoNotOptimize(s.getString());
        benchmark::ClobberMemory();
    }
    state.SetLabel("ZmString += const char*");
    state.SetBytesProcessed(state.iterations() * count * len);
}

void StringAppendTextPeer(benchmark::State& state, Heap heap)
{
    const zmbench::HeapScope scope(heap);
    const int len = int(state.range(0));
    const char* text = shortText(len);
    const int64_t count = kTextTotal / len;
    for (auto _ : state) {
        std::string s;
        for (int64_t i = 0; i < count; ++i) {
            s += text;
        }
        benchmark::DoNotOptimize(s.data());
        benchmark::ClobberMemory();
    }
    state.SetLabel("std::string += const char*");
    state.SetBytesProcessed(state.iterations() * count * len);
}

void textLengths(benchmark::internal::Benchmark* b)
{
    b->ArgName("len")->Arg(4)->Arg(8)->Arg(16)->Arg(32)->Unit(benchmark::kMicrosecond);
}
BENCHMARK_CAPTURE(StringAppendTextZm, warm, Heap::Warm)
    ->Name("ZmString_appendText/heap:warm/zm")
    ->Apply(textLengths);
BENCHMARK_CAPTURE(StringAppendTextPeer, warm, Heap::Warm)
    ->Name("ZmString_appendText/heap:warm/peer")
    ->Apply(textLengths);
BENCHMARK_CAPTURE(StringAppendTextZm, cold, Heap::Cold)
    ->Name("ZmString_appendText/heap:cold/zm")
    ->Apply(textLengths);
BENCHMARK_CAPTURE(StringAppendTextPeer, cold, Heap::Cold)
    ->Name("ZmString_appendText/heap:cold/peer")
    ->Apply(textLengths);

// --- ZmString::printf -----------------------------------------------------------------------------

ZMBENCH_TARGET(
    "ZmString_printf", 1.1,
    "One line `\"%s %05d %8.3f\"` (21 characters, varying values of constant width) formatted into a "
    "reused `ZmString` vs `snprintf` into a reused `char[64]`; also reported: the same "
    "`snprintf` then assigned to a reused `std::string`.");

struct Row {
    const char* name;
    int number;
    double value;
};

// 1024 rows of constant printed width: a 6-letter name, 5 digits, 8 characters of fixed point.
const std::vector<Row>& rows()
{
    static const std::vector<Row> table = [] {
        static const char* const names[] = {"alpha1", "bravo2", "charly", "delta4", "echo55", "foxtrt"};
        std::vector<Row> t;
        unsigned x = 12345;
        for (int i = 0; i < 1024; ++i) {
            x = x * 1103515245u + 12345u;
            t.push_back(Row{names[i % 6], int(x % 100000), 1000.0 + double(x % 8999999) / 1000.0});
        }
        return t;
    }();
    return table;
}

constexpr const char* kLineFormat = "%s %05d %8.3f";

void StringPrintfZm(benchmark::State& state)
{
    const std::vector<Row>& r = rows();
    ZmString s;
    size_t i = 0;
    for (auto _ : state) {
        const Row& row = r[i++ & 1023];
        s.printf(kLineFormat, row.name, row.number, row.value);
        benchmark::DoNotOptimize(s.getString());
        benchmark::ClobberMemory();
    }
    if (s.length() != 21) {
        state.SkipWithError("the line does not have the expected constant width");
    }
    state.SetLabel("ZmString::printf");
}
BENCHMARK(StringPrintfZm)->Name("ZmString_printf/zm");

void StringPrintfPeer(benchmark::State& state)
{
    const std::vector<Row>& r = rows();
    char buffer[64];
    size_t i = 0;
    int n = 0;
    for (auto _ : state) {
        const Row& row = r[i++ & 1023];
        n = std::snprintf(buffer, sizeof buffer, kLineFormat, row.name, row.number, row.value);
        benchmark::DoNotOptimize(+buffer);
        benchmark::ClobberMemory();
    }
    if (n != 21) {
        state.SkipWithError("the line does not have the expected constant width");
    }
    state.SetLabel("snprintf into char[64]");
}
BENCHMARK(StringPrintfPeer)->Name("ZmString_printf/peer");

void StringPrintfStdString(benchmark::State& state)
{
    const std::vector<Row>& r = rows();
    std::string s;
    size_t i = 0;
    for (auto _ : state) {
        const Row& row = r[i++ & 1023];
        char buffer[64];
        const int n = std::snprintf(buffer, sizeof buffer, kLineFormat, row.name, row.number, row.value);
        s.assign(buffer, size_t(n));
        benchmark::DoNotOptimize(s.data());
        benchmark::ClobberMemory();
    }
    state.SetLabel("snprintf + std::string::assign");
}
BENCHMARK(StringPrintfStdString)->Name("ZmString_printf/peer-stdstring");

} // namespace
