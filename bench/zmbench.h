/// \file
/// Shared pieces of the benchmark programs: naming convention and targets.
///
/// Every comparison is a pair (or more) of Google Benchmark functions named
///   "<case>/zm"            the library's side,
///   "<case>/peer"          the peer a user would otherwise pick (the target applies to it),
///   "<case>/peer-<what>"   further peers, reported without a target.
/// "<case>" may itself hold '/' (for example "ZmString_appendText/len=8"); its first component is
/// the group, and every group gets one table in the Markdown report. Arguments added with ->Arg()
/// after the side are folded back into the case name.
///
/// Targets live next to the benchmarks they judge:
///   ZMBENCH_TARGET("ZmDArray_append", 1.1, "what is compared");
/// declares that zmlib time / peer time must stay at or below 1.1 for every case of that group
/// (or for one case, when the full case name is given; the longest matching scope wins).
/// ZMBENCH_REPORTED declares a comparison that is measured and shown without a target.
/// ZMBENCH_MISSING_PEER registers a stand-in for a peer that was not found at configure time, so
/// that the console and the report both say the comparison was skipped and why.
#pragma once

#include <benchmark/benchmark.h>

namespace zmbench {

/// The state of the C library's heap while a benchmark runs. glibc adapts its thresholds for
/// large blocks to what the process freed before (and gives memory back to the system above a
/// trim threshold), so without a fixed state a growth benchmark's figure depends on which
/// benchmark ran before it. Every program starts in Warm; a benchmark that wants Cold sets it
/// with a HeapScope for its own duration.
enum class Heap {
    /// Blocks below 32 MiB come from the heap and freed memory stays in the process (no page
    /// faults after the first round): the state of a long-running process.
    Warm,
    /// glibc's start-up thresholds, held fixed: blocks of 128 KiB and more are mapped and unmapped
    /// each time, as in a short-lived process (page faults on every round).
    Cold,
};
void setHeap(Heap heap);
const char* heapName(Heap heap);

/// Sets a heap state for the lifetime of the scope, then restores Warm.
class HeapScope {
public:
    explicit HeapScope(Heap heap) { setHeap(heap); }
    ~HeapScope() { setHeap(Heap::Warm); }
    HeapScope(const HeapScope&) = delete;
    HeapScope& operator=(const HeapScope&) = delete;
};

bool declareTarget(const char* scope, double maxRatio, const char* description);
bool declareReported(const char* scope, const char* description);
bool declareMissingPeer(const char* benchmarkName, const char* reason);

} // namespace zmbench

#define ZMBENCH_CONCAT_(a, b) a##b
#define ZMBENCH_CONCAT(a, b) ZMBENCH_CONCAT_(a, b)
#define ZMBENCH_TARGET(scope, maxRatio, description)                                                         \
    [[maybe_unused]] static const bool ZMBENCH_CONCAT(zmbenchDecl_, __LINE__) =                              \
        ::zmbench::declareTarget(scope, maxRatio, description)
#define ZMBENCH_REPORTED(scope, description)                                                                 \
    [[maybe_unused]] static const bool ZMBENCH_CONCAT(zmbenchDecl_, __LINE__) =                              \
        ::zmbench::declareReported(scope, description)
#define ZMBENCH_MISSING_PEER(benchmarkName, reason)                                                          \
    [[maybe_unused]] static const bool ZMBENCH_CONCAT(zmbenchDecl_, __LINE__) =                              \
        ::zmbench::declareMissingPeer(benchmarkName, reason)
