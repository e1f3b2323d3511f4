// The raw voxel loops on 256 MiB volumes against the physical limit of this machine: memcpy of
// the same number of bytes read and written (for the scans, a plain summing read of the same
// bytes). Throughput targets become time ratios: at least 0.8x memcpy's throughput is at most
// 1.25x its time, at least 0.5x is at most 2x. The in-place axis permutation is compared with an
// out-of-place permutation into a second buffer.

#include "zmbench.h"

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmRawData.h>

#include <cstring>
#include <random>
#include <vector>

ZMBENCH_TARGET("ZmRawData_memcpy", 1.25, "same-type copy of 256 MiB (peer: memcpy of the same bytes)");
ZMBENCH_TARGET("ZmRawData_swapBytes", 1.25, "byte reversal in place over 256 MiB (peer: memcpy of 256 MiB)");
ZMBENCH_TARGET("ZmRawData_flip", 1.25,
               "mirror a 512x512x512 short volume in place (peer: memcpy of 256 MiB)");
ZMBENCH_TARGET("ZmRawData_crop", 1.25,
               "crop the central half of each axis (peer: memcpy of the output bytes)");
ZMBENCH_TARGET("ZmRawData_convert", 2.0,
               "saturating conversion of 2^27 values (peer: memcpy of (bytes read + bytes written) / 2)");
ZMBENCH_TARGET("ZmRawData_mapLinear", 2.0, "(v + o) * s of 2^27 shorts into float (peer as for conversions)");
ZMBENCH_TARGET("ZmRawData_getRange", 1.25, "range of 256 MiB (peer: a plain sum of the same values)");
ZMBENCH_TARGET("ZmRawData_isConstant", 1.25, "constancy of 256 MiB of equal values (peer: a plain sum)");
ZMBENCH_TARGET("ZmRawData_downSample", 2.0,
               "2x2x2 block means of 256 MiB (peer: memcpy of (bytes read + bytes written) / 2)");
ZMBENCH_TARGET("ZmRawData_swapDims", 3.0,
               "in-place permutation of a 512x512x256 short volume (peer: out-of-place permutation into a "
               "second buffer)");

namespace {

constexpr size_t kBytes = size_t(256) << 20;

std::vector<unsigned char>& bufferA()
{
    static std::vector<unsigned char> b = [] {
        // Twice the volume: the peers of the widening conversions copy up to 1.5 volumes.
        std::vector<unsigned char> v(kBytes * 2);
        std::mt19937 rng(1);
        for (size_t i = 0; i < v.size(); i += 4) {
            const uint32_t r = rng() & 0x3fff3fffu; // short values in 0..16383: no saturation
            std::memcpy(&v[i], &r, 4);
        }
        return v;
    }();
    return b;
}

std::vector<unsigned char>& bufferB()
{
    static std::vector<unsigned char> b(kBytes * 2);
    return b;
}

void memcpyPeer(benchmark::State& state, size_t bytes)
{
    unsigned char* src = bufferA().data();
    unsigned char* dst = bufferB().data();
    for (auto _ : state) {
        std::memcpy(dst, src, bytes);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(bytes) * 2);
}

template <class T>
void sumPeer(benchmark::State& state)
{
    const T* v = reinterpret_cast<const T*>(bufferA().data());
    const size_t n = kBytes / sizeof(T);
    for (auto _ : state) {
        // Integers sum exactly in any order, so the compiler may vectorise this; it is the fastest
        // plain read. Floats are read as 32-bit integers for the same reason.
        uint64_t s = 0;
        const uint32_t* w = reinterpret_cast<const uint32_t*>(v);
        for (size_t i = 0; i < kBytes / 4; ++i) {
            s += w[i];
        }
        benchmark::DoNotOptimize(s);
    }
    (void)n;
}

template <class D, class S>
void convertZm(benchmark::State& state)
{
    const size_t n = (size_t(1) << 27);
    S* src = reinterpret_cast<S*>(bufferA().data());
    D* dst = reinterpret_cast<D*>(bufferB().data());
    if constexpr (std::is_floating_point_v<S>) {
        static bool filled = false;
        if (!filled) {
            for (size_t i = 0; i < n && (i + 1) * sizeof(S) <= kBytes; ++i) {
                src[i] = S(int(i % 70000) - 35000) * S(1.25);
            }
            filled = true;
        }
    }
    const size_t count = std::min(n, kBytes / sizeof(S));
    for (auto _ : state) {
        ZmRawData::memcpy(ZmTypedPointer(dst), ZmTypedPointer(src), int64_t(count));
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(count * (sizeof(S) + sizeof(D))));
}

#define ZM_CONVERT_CASE(NAME, D, S)                                                                          \
    BENCHMARK(convertZm<D, S>)->Name("ZmRawData_convert/" NAME "/zm")->Unit(benchmark::kMillisecond);        \
    BENCHMARK_CAPTURE(memcpyPeer, NAME,                                                                      \
                      std::min(size_t(1) << 27, kBytes / sizeof(S)) * (sizeof(S) + sizeof(D)) / 2)           \
        ->Name("ZmRawData_convert/" NAME "/peer")                                                            \
        ->Unit(benchmark::kMillisecond);

ZM_CONVERT_CASE("short-byte", unsigned char, short)
ZM_CONVERT_CASE("float-short", short, float)
ZM_CONVERT_CASE("ushort-float", float, unsigned short)
ZM_CONVERT_CASE("int-double", double, int)

void MemcpyZm(benchmark::State& state)
{
    short* src = reinterpret_cast<short*>(bufferA().data());
    short* dst = reinterpret_cast<short*>(bufferB().data());
    for (auto _ : state) {
        ZmRawData::memcpy(ZmTypedPointer(dst), ZmTypedPointer(src), int64_t(kBytes / 2));
        benchmark::ClobberMemory();
    }
}
BENCHMARK(MemcpyZm)->Name("ZmRawData_memcpy/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, same, kBytes)->Name("ZmRawData_memcpy/peer")->Unit(benchmark::kMillisecond);

template <int Size>
void SwapBytesZm(benchmark::State& state)
{
    void* p = bufferA().data();
    for (auto _ : state) {
        if (Size == 2) {
            ZmRawData::swapBytesWord2(p, kBytes / 2);
        } else if (Size == 4) {
            ZmRawData::swapBytesWord4(p, kBytes / 4);
        } else {
            ZmRawData::swapBytesWord8(p, kBytes / 8);
        }
        benchmark::ClobberMemory();
    }
}
BENCHMARK(SwapBytesZm<2>)->Name("ZmRawData_swapBytes/2/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(SwapBytesZm<4>)->Name("ZmRawData_swapBytes/4/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(SwapBytesZm<8>)->Name("ZmRawData_swapBytes/8/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, swap2, kBytes)
    ->Name("ZmRawData_swapBytes/2/peer")
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, swap4, kBytes)
    ->Name("ZmRawData_swapBytes/4/peer")
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, swap8, kBytes)
    ->Name("ZmRawData_swapBytes/8/peer")
    ->Unit(benchmark::kMillisecond);

void FlipZm(benchmark::State& state)
{
    const int dims[3] = {512, 512, 512};
    for (auto _ : state) {
        ZmRawData::flip(bufferA().data(), 2, dims, int(state.range(0)));
        benchmark::ClobberMemory();
    }
}
BENCHMARK(FlipZm)->Name("ZmRawData_flip/zm")->Arg(0)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, flip, kBytes)
    ->Name("ZmRawData_flip/peer")
    ->Arg(0)
    ->Arg(1)
    ->Arg(2)
    ->Unit(benchmark::kMillisecond);

void CropZm(benchmark::State& state)
{
    // The volume is copied in first (not timed): crop replaces its block.
    for (auto _ : state) {
        state.PauseTiming();
        void* data = zmmalloc(kBytes);
        std::memcpy(data, bufferA().data(), kBytes);
        int dims[3] = {512, 512, 512};
        const int lo[3] = {128, 128, 128}, hi[3] = {383, 383, 383};
        state.ResumeTiming();
        ZmRawData::crop(data, 2, dims, lo, hi, nullptr);
        state.PauseTiming();
        zmfree(data);
        state.ResumeTiming();
    }
}
BENCHMARK(CropZm)->Name("ZmRawData_crop/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, crop, kBytes / 8)->Name("ZmRawData_crop/peer")->Unit(benchmark::kMillisecond);

void MapLinearZm(benchmark::State& state)
{
    const size_t n = size_t(1) << 27;
    short* src = reinterpret_cast<short*>(bufferA().data());
    float* dst = reinterpret_cast<float*>(bufferB().data());
    for (auto _ : state) {
        ZmRawData::mapLinear(ZmTypedPointer(dst), ZmTypedPointer(src), n, -1024.0, 0.5);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(MapLinearZm)->Name("ZmRawData_mapLinear/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, map, (size_t(1) << 27) * 6 / 2)
    ->Name("ZmRawData_mapLinear/peer")
    ->Unit(benchmark::kMillisecond);

template <class T>
void RangeZm(benchmark::State& state)
{
    T* v = reinterpret_cast<T*>(bufferA().data());
    for (auto _ : state) {
        float lo = 0, hi = 0;
        ZmRawData::getRange(ZmTypedPointer(v), kBytes / sizeof(T), lo, hi);
        benchmark::DoNotOptimize(lo);
        benchmark::DoNotOptimize(hi);
    }
}
BENCHMARK(RangeZm<short>)->Name("ZmRawData_getRange/short/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(RangeZm<float>)->Name("ZmRawData_getRange/float/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(sumPeer<short>)->Name("ZmRawData_getRange/short/peer")->Unit(benchmark::kMillisecond);
BENCHMARK(sumPeer<float>)->Name("ZmRawData_getRange/float/peer")->Unit(benchmark::kMillisecond);

void ConstantZm(benchmark::State& state)
{
    std::vector<unsigned char>& b = bufferB();
    std::memset(b.data(), 0, kBytes);
    for (auto _ : state) {
        benchmark::DoNotOptimize(
            ZmRawData::isConstant(ZmTypedPointer(reinterpret_cast<short*>(b.data())), kBytes / 2));
    }
}
BENCHMARK(ConstantZm)->Name("ZmRawData_isConstant/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(sumPeer<short>)->Name("ZmRawData_isConstant/peer")->Unit(benchmark::kMillisecond);

template <class T>
void DownSampleZm(benchmark::State& state)
{
    const uint64_t nx = 512, ny = 512, nz = kBytes / sizeof(T) / (512 * 512);
    for (auto _ : state) {
        ZmRawData::downSample3D(bufferB().data(), ZmTypedPointer(reinterpret_cast<T*>(bufferA().data())), nx,
                                ny, nz, 2, 2, 2, nullptr);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(DownSampleZm<short>)->Name("ZmRawData_downSample/short/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(DownSampleZm<float>)->Name("ZmRawData_downSample/float/zm")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, ds1, (kBytes + kBytes / 8) / 2)
    ->Name("ZmRawData_downSample/short/peer")
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, ds2, (kBytes + kBytes / 8) / 2)
    ->Name("ZmRawData_downSample/float/peer")
    ->Unit(benchmark::kMillisecond);

const int kPerms[5][3] = {{0, 2, 1}, {1, 0, 2}, {1, 2, 0}, {2, 0, 1}, {2, 1, 0}};

void SwapDimsZm(benchmark::State& state)
{
    const int* perm = kPerms[state.range(0)];
    short* v = reinterpret_cast<short*>(bufferA().data());
    for (auto _ : state) {
        int dims[3] = {512, 512, 256};
        ZmRawData::swapDims(ZmTypedPointer(v), dims, perm, 1);
        benchmark::ClobberMemory();
    }
}

void SwapDimsPeer(benchmark::State& state)
{
    const int* perm = kPerms[state.range(0)];
    const short* src = reinterpret_cast<const short*>(bufferA().data());
    short* dst = reinterpret_cast<short*>(bufferB().data());
    const size_t n[3] = {512, 512, 256};
    const size_t nd[3] = {n[perm[0]], n[perm[1]], n[perm[2]]};
    for (auto _ : state) {
        // Written in the order of the destination, gathering from the source.
        const size_t stride[3] = {1, n[0], n[0] * n[1]};
        const size_t s0 = stride[perm[0]], s1 = stride[perm[1]], s2 = stride[perm[2]];
        for (size_t c = 0; c < nd[2]; ++c) {
            for (size_t b = 0; b < nd[1]; ++b) {
                short* out = dst + (c * nd[1] + b) * nd[0];
                const short* in = src + c * s2 + b * s1;
                for (size_t a = 0; a < nd[0]; ++a) {
                    out[a] = in[a * s0];
                }
            }
        }
        benchmark::ClobberMemory();
    }
}
BENCHMARK(SwapDimsZm)
    ->Name("ZmRawData_swapDims/zm")
    ->DenseRange(0, 4)
    ->Iterations(1)
    ->Unit(benchmark::kMillisecond);
BENCHMARK(SwapDimsPeer)
    ->Name("ZmRawData_swapDims/peer")
    ->DenseRange(0, 4)
    ->Iterations(3)
    ->Unit(benchmark::kMillisecond);

} // namespace
