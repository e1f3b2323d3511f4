// Bit field scans over 10^8 bits (12.5 MB per field, random bits from a fixed seed): counting,
// first/last set bit, &=, |=, intersection and superset tests. The target is absolute: at least
// 1 GB/s for each, counted in bytes of one field per operation. Each is shown next to
// boost::dynamic_bitset<uint64_t> (peer) and, where that has no such operation or to show what a
// hand-written loop gives, a plain loop over uint64_t words (peer-loop).

#include "zmbench.h"

#include <zmlib/ZmBitfield.h>

#include <boost/dynamic_bitset.hpp>

#include <cstdint>
#include <cstring>
#include <vector>

namespace {

constexpr uint64_t kBits = 100000000;
constexpr int64_t kBytes = int64_t(kBits / 8);

using Dyn = boost::dynamic_bitset<uint64_t>;

/// The same bits three ways: a ZmBitfield, a dynamic_bitset and plain 64-bit words.
struct Field {
    ZmBitfield zm;
    Dyn dyn;
    std::vector<uint64_t> words;

    explicit Field(std::vector<uint64_t> w) : zm(kBits, ZmBitfield::CLEAR), words(std::move(w))
    {
        words.resize((kBits + 63) / 64);
        if (kBits % 64 != 0) {
            words.back() &= (uint64_t(1) << (kBits % 64)) - 1;
        }
        std::memcpy(zm.dataPtr(), words.data(), kBits / 8);
        dyn = Dyn(words.begin(), words.end());
        dyn.resize(kBits);
    }
};

std::vector<uint64_t> randomWords(uint64_t seed)
{
    std::vector<uint64_t> w((kBits + 63) / 64);
    uint64_t x = seed;
    for (auto& v : w) {
        x ^= x << 13;
        x ^= x >> 7;
        x ^= x << 17;
        v = x;
    }
    return w;
}

std::vector<uint64_t> oneBit(uint64_t bit)
{
    std::vector<uint64_t> w((kBits + 63) / 64, 0);
    w[bit / 64] |= uint64_t(1) << (bit % 64);
    return w;
}

const Field& randomA()
{
    static const Field f(randomWords(0x9E3779B97F4A7C15ull));
    return f;
}

const Field& randomB()
{
    static const Field f(randomWords(0xD1B54A32D192ED03ull));
    return f;
}

const Field& nearEnd()
{
    static const Field f(oneBit(kBits - 100));
    return f;
}

const Field& nearStart()
{
    static const Field f(oneBit(100));
    return f;
}

/// randomA's complement: no common bit with randomA, so the intersection test scans to the end.
const Field& complementA()
{
    static const Field f = [] {
        std::vector<uint64_t> w = randomA().words;
        for (auto& v : w) {
            v = ~v;
        }
        return Field(w);
    }();
    return f;
}

/// A subset of randomA (every other set bit dropped), so the superset test scans to the end.
const Field& subsetA()
{
    static const Field f = [] {
        std::vector<uint64_t> w = randomA().words;
        for (auto& v : w) {
            v &= 0x5555555555555555ull;
        }
        return Field(w);
    }();
    return f;
}

void finish(benchmark::State& state, const char* label, double result)
{
    state.counters["result"] = result;
    state.SetLabel(label);
    state.SetBytesProcessed(state.iterations() * kBytes);
}

// --- nSetBits ------------------------------------------------------------------------------------

ZMBENCH_REPORTED("ZmBitfield_nSetBits",
                 "Set bits of 10^8 random bits. Target: at least 1 GB/s (absolute). peer: "
                 "boost::dynamic_bitset::count(); peer-loop: __builtin_popcountll over uint64_t words, "
                 "compiled for the x86-64 baseline like the rest of the program.");

void CountZm(benchmark::State& state)
{
    const Field& f = randomA();
    uint64_t n = 0;
    for (auto _ : state) {
        n = f.zm.nSetBits();
        benchmark::DoNotOptimize(n);
    }
    finish(state, "ZmBitfield::nSetBits", double(n));
}
BENCHMARK(CountZm)->Name("ZmBitfield_nSetBits/zm")->Unit(benchmark::kMicrosecond);

void CountPeer(benchmark::State& state)
{
    const Field& f = randomA();
    uint64_t n = 0;
    for (auto _ : state) {
        n = f.dyn.count();
        benchmark::DoNotOptimize(n);
    }
    finish(state, "dynamic_bitset::count", double(n));
}
BENCHMARK(CountPeer)->Name("ZmBitfield_nSetBits/peer")->Unit(benchmark::kMicrosecond);

void CountLoop(benchmark::State& state)
{
    const Field& f = randomA();
    uint64_t n = 0;
    for (auto _ : state) {
        n = 0;
        for (const uint64_t v : f.words) {
            n += uint64_t(__builtin_popcountll(v));
        }
        benchmark::DoNotOptimize(n);
    }
    finish(state, "popcount loop", double(n));
}
BENCHMARK(CountLoop)->Name("ZmBitfield_nSetBits/peer-loop")->Unit(benchmark::kMicrosecond);

// --- firstSetBit ---------------------------------------------------------------------------------

ZMBENCH_REPORTED("ZmBitfield_firstSetBit",
                 "The first set bit of 10^8 bits whose only set bit is 100 from the end. Target: at least "
                 "1 GB/s (absolute). peer: boost::dynamic_bitset::find_first(); peer-loop: a forward "
                 "loop over uint64_t words.");

void FirstZm(benchmark::State& state)
{
    const Field& f = nearEnd();
    int64_t r = 0;
    for (auto _ : state) {
        r = f.zm.firstSetBit();
        benchmark::DoNotOptimize(r);
    }
    finish(state, "ZmBitfield::firstSetBit", double(r));
}
BENCHMARK(FirstZm)->Name("ZmBitfield_firstSetBit/zm")->Unit(benchmark::kMicrosecond);

void FirstPeer(benchmark::State& state)
{
    const Field& f = nearEnd();
    size_t r = 0;
    for (auto _ : state) {
        r = f.dyn.find_first();
        benchmark::DoNotOptimize(r);
    }
    finish(state, "dynamic_bitset::find_first", double(r));
}
BENCHMARK(FirstPeer)->Name("ZmBitfield_firstSetBit/peer")->Unit(benchmark::kMicrosecond);

void FirstLoop(benchmark::State& state)
{
    const Field& f = nearEnd();
    int64_t r = 0;
    for (auto _ : state) {
        r = -1;
        for (size_t k = 0; k < f.words.size(); ++k) {
            if (f.words[k] != 0) {
                r = int64_t(k * 64 + size_t(__builtin_ctzll(f.words[k])));
                break;
            }
        }
        benchmark::DoNotOptimize(r);
    }
    finish(state, "forward word loop", double(r));
}
BENCHMARK(FirstLoop)->Name("ZmBitfield_firstSetBit/peer-loop")->Unit(benchmark::kMicrosecond);

// --- lastSetBit ----------------------------------------------------------------------------------

ZMBENCH_REPORTED("ZmBitfield_lastSetBit",
                 "The last set bit of 10^8 bits whose only set bit is bit 100. Target: at least 1 GB/s "
                 "(absolute). boost::dynamic_bitset has no backward search; peer: a backward loop over "
                 "uint64_t words.");

void LastZm(benchmark::State& state)
{
    const Field& f = nearStart();
    int64_t r = 0;
    for (auto _ : state) {
        r = f.zm.lastSetBit();
        benchmark::DoNotOptimize(r);
    }
    finish(state, "ZmBitfield::lastSetBit", double(r));
}
BENCHMARK(LastZm)->Name("ZmBitfield_lastSetBit/zm")->Unit(benchmark::kMicrosecond);

void LastLoop(benchmark::State& state)
{
    const Field& f = nearStart();
    int64_t r = 0;
    for (auto _ : state) {
        r = -1;
        for (size_t k = f.words.size(); k > 0; --k) {
            if (f.words[k - 1] != 0) {
                r = int64_t((k - 1) * 64 + 63 - size_t(__builtin_clzll(f.words[k - 1])));
                break;
            }
        }
        benchmark::DoNotOptimize(r);
    }
    finish(state, "backward word loop", double(r));
}
BENCHMARK(LastLoop)->Name("ZmBitfield_lastSetBit/peer")->Unit(benchmark::kMicrosecond);

// --- &= and |= -----------------------------------------------------------------------------------

ZMBENCH_REPORTED("ZmBitfield_andAssign",
                 "a &= b over two fields of 10^8 random bits (bytes of one field per operation; a copy "
                 "of a is combined again and again, which keeps the work the same). Target: at least "
                 "1 GB/s (absolute). peer: boost::dynamic_bitset::operator&=.");
ZMBENCH_REPORTED("ZmBitfield_orAssign", "As ZmBitfield_andAssign, with |=.");

void AndZm(benchmark::State& state)
{
    ZmBitfield a(randomA().zm);
    const ZmBitfield& b = randomB().zm;
    for (auto _ : state) {
        a &= b;
        benchmark::ClobberMemory();
    }
    finish(state, "ZmBitfield::operator&=", double(a.nSetBits()));
}
BENCHMARK(AndZm)->Name("ZmBitfield_andAssign/zm")->Unit(benchmark::kMicrosecond);

void AndPeer(benchmark::State& state)
{
    Dyn a(randomA().dyn);
    const Dyn& b = randomB().dyn;
    for (auto _ : state) {
        a &= b;
        benchmark::ClobberMemory();
    }
    finish(state, "dynamic_bitset::operator&=", double(a.count()));
}
BENCHMARK(AndPeer)->Name("ZmBitfield_andAssign/peer")->Unit(benchmark::kMicrosecond);

void OrZm(benchmark::State& state)
{
    ZmBitfield a(randomA().zm);
    const ZmBitfield& b = randomB().zm;
    for (auto _ : state) {
        a |= b;
        benchmark::ClobberMemory();
    }
    finish(state, "ZmBitfield::operator|=", double(a.nSetBits()));
}
BENCHMARK(OrZm)->Name("ZmBitfield_orAssign/zm")->Unit(benchmark::kMicrosecond);

void OrPeer(benchmark::State& state)
{
    Dyn a(randomA().dyn);
    const Dyn& b = randomB().dyn;
    for (auto _ : state) {
        a |= b;
        benchmark::ClobberMemory();
    }
    finish(state, "dynamic_bitset::operator|=", double(a.count()));
}
BENCHMARK(OrPeer)->Name("ZmBitfield_orAssign/peer")->Unit(benchmark::kMicrosecond);

// --- hasIntersection and isSuperset --------------------------------------------------------------

ZMBENCH_REPORTED("ZmBitfield_hasIntersection",
                 "Two disjoint fields of 10^8 bits (a random field and its complement), so the test reads "
                 "both to the end (bytes of one field per test). Target: at least 1 GB/s (absolute). "
                 "peer: boost::dynamic_bitset::intersects().");

void IntersectZm(benchmark::State& state)
{
    const ZmBitfield& a = randomA().zm;
    const ZmBitfield& b = complementA().zm;
    bool r = true;
    for (auto _ : state) {
        r = a.hasIntersection(b);
        benchmark::DoNotOptimize(r);
    }
    finish(state, "ZmBitfield::hasIntersection", double(r));
}
BENCHMARK(IntersectZm)->Name("ZmBitfield_hasIntersection/zm")->Unit(benchmark::kMicrosecond);

void IntersectPeer(benchmark::State& state)
{
    const Dyn& a = randomA().dyn;
    const Dyn& b = complementA().dyn;
    bool r = true;
    for (auto _ : state) {
        r = a.intersects(b);
        benchmark::DoNotOptimize(r);
    }
    finish(state, "dynamic_bitset::intersects", double(r));
}
BENCHMARK(IntersectPeer)->Name("ZmBitfield_hasIntersection/peer")->Unit(benchmark::kMicrosecond);

ZMBENCH_REPORTED("ZmBitfield_isSuperset",
                 "A field of 10^8 random bits against a subset of it, so the test reads both to the end "
                 "(bytes of one field per test). Target: at least 1 GB/s (absolute). peer: "
                 "boost::dynamic_bitset::is_subset_of().");

void SupersetZm(benchmark::State& state)
{
    const ZmBitfield& a = randomA().zm;
    const ZmBitfield& b = subsetA().zm;
    bool r = false;
    for (auto _ : state) {
        r = a.isSuperset(b);
        benchmark::DoNotOptimize(r);
    }
    finish(state, "ZmBitfield::isSuperset", double(r));
}
BENCHMARK(SupersetZm)->Name("ZmBitfield_isSuperset/zm")->Unit(benchmark::kMicrosecond);

void SupersetPeer(benchmark::State& state)
{
    const Dyn& a = randomA().dyn;
    const Dyn& b = subsetA().dyn;
    bool r = false;
    for (auto _ : state) {
        r = b.is_subset_of(a);
        benchmark::DoNotOptimize(r);
    }
    finish(state, "dynamic_bitset::is_subset_of", double(r));
}
BENCHMARK(SupersetPeer)->Name("ZmBitfield_isSuperset/peer")->Unit(benchmark::kMicrosecond);

} // namespace
