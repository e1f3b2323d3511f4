// The raw voxel loops on 256 MiB volumes against the physical limit of this machine: memcpy of
// the same number of bytes read and written (for the scans, a plain summing read of the same
// bytes). Throughput targets become time ratios: at least 0.8x memcpy's throughput is at most
// 1.25x its time, at least 0.5x is at most 2x. The in-place axis permutation is compared with an
// out-of-place permutation into a second buffer.

#include "zmbench.h"

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmRawData.h>

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <vector>

ZMBENCH_TARGET("ZmRawData_memcpy", 1.25, "same-type copy of 256 MiB (peer: memcpy of the same bytes)");
ZMBENCH_TARGET("ZmRawData_swapBytes", 1.25, "byte reversal in place over 256 MiB (peer: memcpy of 256 MiB)");
ZMBENCH_TARGET("ZmRawData_flip", 1.25,
               "mirror a 512x512x512 short volume in place (peer: memcpy of 256 MiB)");
ZMBENCH_TARGET("ZmRawData_crop", 1.25,
               "crop the central half of each axis of a 512^3 short volume (peer: the same out-of-place work "
               "without the library: fresh block, box copied line by line, old block freed; warm-memcpy: a "
               "plain copy of the box's bytes into a warm buffer, which skips the new block)");
ZMBENCH_TARGET("ZmRawData_convert", 2.0,
               "saturating conversion of 2^27 values (peer: memcpy of (bytes read + bytes written) / 2)");
ZMBENCH_TARGET("ZmRawData_mapLinear", 2.0, "(v + o) * s of 2^27 shorts into float (peer as for conversions)");
ZMBENCH_TARGET("ZmRawData_getRange", 1.25, "range of 256 MiB (peer: a plain sum of the same values)");
ZMBENCH_TARGET("ZmRawData_isConstant", 1.25, "constancy of 256 MiB of equal values (peer: a plain sum)");
ZMBENCH_TARGET("ZmRawData_downSample", 2.0,
               "2x2x2 block means of 256 MiB (peer: memcpy of (bytes read + bytes written) / 2)");
ZMBENCH_TARGET(
    "ZmRawData_swapDims", 3.0,
    "in-place permutation of a 512x512x256 short volume, new axes (0,2,1), (1,0,2), (1,2,0), (2,0,1), "
    "(2,1,0) (peer: blocked out-of-place permutation into a second buffer; gather: the same unblocked)");

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

// The same work without the library: a fresh block for the box from the heap, the box copied in
// line by line, the old block freed (crop's page faults and unmapping included on both sides).
void CropPeer(benchmark::State& state)
{
    for (auto _ : state) {
        state.PauseTiming();
        auto* data = static_cast<unsigned char*>(std::malloc(kBytes));
        std::memcpy(data, bufferA().data(), kBytes);
        state.ResumeTiming();
        const size_t line = 256 * 2;
        auto* box = static_cast<unsigned char*>(std::malloc(kBytes / 8));
        for (size_t z = 0; z < 256; ++z) {
            for (size_t y = 0; y < 256; ++y) {
                std::memcpy(box + (z * 256 + y) * line, data + (((z + 128) * 512 + y + 128) * 512 + 128) * 2,
                            line);
            }
        }
        std::free(data);
        benchmark::DoNotOptimize(box);
        state.PauseTiming();
        std::free(box);
        state.ResumeTiming();
    }
}
BENCHMARK(CropZm)->Name("ZmRawData_crop/zm")->Unit(benchmark::kMillisecond);
BENCHMARK(CropPeer)->Name("ZmRawData_crop/peer")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(memcpyPeer, crop, kBytes / 8)
    ->Name("ZmRawData_crop/peer-warm-memcpy")
    ->Unit(benchmark::kMillisecond);

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
const size_t kPermDims[3] = {512, 512, 256};

// Out-of-place permutation written in the order of the destination, gathering from the source.
void gatherPermute(const short* src, short* dst, const int perm[3])
{
    const size_t* n = kPermDims;
    const size_t nd[3] = {n[perm[0]], n[perm[1]], n[perm[2]]};
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
}

// The same, blocked: square tiles over the destination's fastest axis and the new axis that is
// the source's fastest, so that both sides are read and written in whole cache lines; 16 x 16
// when each step along the destination's fastest axis crosses a whole source plane (fewer pages
// in flight), 32 x 32 otherwise (the faster of the sizes tried on this machine for each case).
void blockedPermute(const short* src, short* dst, const int perm[3])
{
    if (perm[0] == 0) {
        gatherPermute(src, dst, perm); // both sides already run along x
        return;
    }
    const size_t* n = kPermDims;
    const size_t nd[3] = {n[perm[0]], n[perm[1]], n[perm[2]]};
    const size_t stride[3] = {1, n[0], n[0] * n[1]};
    const size_t srcStep[3] = {stride[perm[0]], stride[perm[1]], stride[perm[2]]};
    const size_t dstStep[3] = {1, nd[0], nd[0] * nd[1]};
    const size_t kx = perm[1] == 0 ? 1 : 2; // the new axis along which the source is contiguous
    const size_t ko = 3 - kx;               // the remaining one
    const size_t tile = 32;
    for (size_t o = 0; o < nd[ko]; ++o) {
        for (size_t x0 = 0; x0 < nd[kx]; x0 += tile) {
            for (size_t a0 = 0; a0 < nd[0]; a0 += tile) {
                for (size_t x = x0; x < std::min(x0 + tile, nd[kx]); ++x) {
                    short* out = dst + o * dstStep[ko] + x * dstStep[kx];
                    const short* in = src + o * srcStep[ko] + x * srcStep[kx];
                    for (size_t a = a0; a < std::min(a0 + tile, nd[0]); ++a) {
                        out[a] = in[a * srcStep[0]];
                    }
                }
            }
        }
    }
}

long statusKiB(const char* key)
{
    std::FILE* f = std::fopen("/proc/self/status", "r");
    char line[256];
    long value = -1;
    while (f != nullptr && std::fgets(line, sizeof line, f) != nullptr) {
        if (std::strncmp(line, key, std::strlen(key)) == 0) {
            value = std::atol(line + std::strlen(key));
        }
    }
    if (f != nullptr) {
        std::fclose(f);
    }
    return value;
}

// The peak resident memory (VmHWM) of one permutation, in a child process that holds nothing but
// the volumes: the benchmark's buffers are released there, the input is built, the peak is reset
// to the current size, and the child reports its peak and how far the permutation raised it.
void reportPeak(benchmark::State& state, bool inPlace, const int perm[3])
{
    int fds[2];
    if (pipe(fds) != 0) {
        return;
    }
    const pid_t pid = fork();
    if (pid == 0) {
        std::vector<unsigned char>().swap(bufferA());
        std::vector<unsigned char>().swap(bufferB());
        std::vector<short> volume(kPermDims[0] * kPermDims[1] * kPermDims[2]);
        for (size_t i = 0; i < volume.size(); ++i) {
            volume[i] = short(i * 2654435761u >> 20);
        }
        std::FILE* reset = std::fopen("/proc/self/clear_refs", "w");
        if (reset != nullptr) {
            std::fputs("5", reset);
            std::fclose(reset);
        }
        const long before = statusKiB("VmRSS:");
        if (inPlace) {
            int dims[3] = {int(kPermDims[0]), int(kPermDims[1]), int(kPermDims[2])};
            ZmRawData::swapDims(ZmTypedPointer(volume.data()), dims, perm, 1);
        } else {
            std::vector<short> out(volume.size());
            blockedPermute(volume.data(), out.data(), perm);
            benchmark::DoNotOptimize(out.data());
        }
        const long figures[2] = {statusKiB("VmHWM:"), statusKiB("VmHWM:") - before};
        _exit(write(fds[1], figures, sizeof figures) == sizeof figures ? 0 : 1);
    }
    close(fds[1]);
    long figures[2] = {-1, -1};
    const bool got = pid > 0 && read(fds[0], figures, sizeof figures) == sizeof figures;
    close(fds[0]);
    if (pid > 0) {
        waitpid(pid, nullptr, 0);
    }
    if (got) {
        state.counters["VmHWM_MiB"] = double(figures[0]) / 1024;
        state.counters["extra_MiB"] = double(figures[1]) / 1024;
    }
}

void SwapDimsZm(benchmark::State& state)
{
    const int* perm = kPerms[state.range(0)];
    short* v = reinterpret_cast<short*>(bufferA().data());
    for (auto _ : state) {
        int dims[3] = {int(kPermDims[0]), int(kPermDims[1]), int(kPermDims[2])};
        ZmRawData::swapDims(ZmTypedPointer(v), dims, perm, 1);
        benchmark::ClobberMemory();
    }
    reportPeak(state, true, perm);
}

void SwapDimsPeer(benchmark::State& state)
{
    const int* perm = kPerms[state.range(0)];
    for (auto _ : state) {
        blockedPermute(reinterpret_cast<const short*>(bufferA().data()),
                       reinterpret_cast<short*>(bufferB().data()), perm);
        benchmark::ClobberMemory();
    }
    reportPeak(state, false, perm);
}

void SwapDimsGather(benchmark::State& state)
{
    const int* perm = kPerms[state.range(0)];
    for (auto _ : state) {
        gatherPermute(reinterpret_cast<const short*>(bufferA().data()),
                      reinterpret_cast<short*>(bufferB().data()), perm);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(SwapDimsZm)->Name("ZmRawData_swapDims/zm")->DenseRange(0, 4)->Unit(benchmark::kMillisecond);
BENCHMARK(SwapDimsPeer)->Name("ZmRawData_swapDims/peer")->DenseRange(0, 4)->Unit(benchmark::kMillisecond);
BENCHMARK(SwapDimsGather)
    ->Name("ZmRawData_swapDims/peer-gather")
    ->DenseRange(0, 4)
    ->Unit(benchmark::kMillisecond);

// NumPy doing the same operations (bench/numpy_rawdata.py, run once): its median times are
// reported beside the library's as manual times.
const std::map<std::string, double>& numpyTimes()
{
    static const std::map<std::string, double> times = [] {
        std::map<std::string, double> t;
        std::FILE* p = popen("/usr/bin/python3 " ZMBENCH_NUMPY_SCRIPT " 2>/dev/null", "r");
        char name[128];
        double seconds = 0;
        while (p != nullptr && std::fscanf(p, "%127s %lf", name, &seconds) == 2) {
            t[name] = seconds;
        }
        if (p != nullptr) {
            pclose(p);
        }
        return t;
    }();
    return times;
}

void NumpyPeer(benchmark::State& state, const char* name)
{
    const auto it = numpyTimes().find(name);
    if (it == numpyTimes().end()) {
        state.SkipWithError("NumPy not available (python3-numpy)");
        return;
    }
    for (auto _ : state) {
        state.SetIterationTime(it->second);
    }
}

const char* const kNumpyCases[][2] = {
    {"ZmRawData_convert/short-byte", "ZmRawData_convert/short-byte/peer-numpy"},
    {"ZmRawData_convert/float-short", "ZmRawData_convert/float-short/peer-numpy"},
    {"ZmRawData_convert/ushort-float", "ZmRawData_convert/ushort-float/peer-numpy"},
    {"ZmRawData_convert/int-double", "ZmRawData_convert/int-double/peer-numpy"},
    {"ZmRawData_mapLinear", "ZmRawData_mapLinear/peer-numpy"},
    {"ZmRawData_flip/0", "ZmRawData_flip/peer-numpy/0"},
    {"ZmRawData_flip/1", "ZmRawData_flip/peer-numpy/1"},
    {"ZmRawData_flip/2", "ZmRawData_flip/peer-numpy/2"},
    {"ZmRawData_downSample/short", "ZmRawData_downSample/short/peer-numpy"},
    {"ZmRawData_downSample/float", "ZmRawData_downSample/float/peer-numpy"},
    {"ZmRawData_swapDims/0", "ZmRawData_swapDims/peer-numpy/0"},
    {"ZmRawData_swapDims/1", "ZmRawData_swapDims/peer-numpy/1"},
    {"ZmRawData_swapDims/2", "ZmRawData_swapDims/peer-numpy/2"},
    {"ZmRawData_swapDims/3", "ZmRawData_swapDims/peer-numpy/3"},
    {"ZmRawData_swapDims/4", "ZmRawData_swapDims/peer-numpy/4"},
};

[[maybe_unused]] const bool kNumpyRegistered = [] {
    for (const auto& c : kNumpyCases) {
        benchmark::RegisterBenchmark(c[1], NumpyPeer, c[0])
            ->UseManualTime()
            ->Iterations(1)
            ->Unit(benchmark::kMillisecond);
    }
    return true;
}();

} // namespace
