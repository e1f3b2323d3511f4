// MD5 and the cksum CRC over 64 MiB of random bytes.
// - ZmCoder_md5: the MD5 context (init, update, final, query) against OpenSSL's MD5 through EVP
//   (its assembler block function), CPU time.
// - ZmCoder_crc: ZmCoder::crc over the buffer in memory against running GNU `cksum` on a file of
//   the same bytes that sits in the page cache (written and read once before timing): what a user
//   would otherwise do. Wall-clock time, since the peer's work happens in a child process; the
//   table-driven path of ZmCoder::crc is reported beside them.

#include "zmbench.h"

#include <zmlib/ZmCoder.h>

#if ZMBENCH_HAVE_OPENSSL
#include <openssl/evp.h>
#endif

#include <stdio.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstring>
#include <fstream>
#include <random>
#include <string>
#include <vector>

namespace {

ZMBENCH_TARGET("ZmCoder_md5", 1.053,
               "MD5 of 64 MiB in memory: `ZmCoder` crcMD5Init/Update/Final/Query vs OpenSSL "
               "`EVP_Digest(..., EVP_md5())` (at least 0.95x its throughput).");
ZMBENCH_TARGET("ZmCoder_crc", 1.0,
               "cksum CRC of 64 MiB: `ZmCoder::crc` on the bytes in memory vs running GNU `cksum` on a "
               "file of the same bytes in the page cache (wall-clock time, process start included); "
               "peer-portable is the library's table-driven path.");

constexpr size_t kSize = size_t(64) << 20;

// The bytes, and a file holding them in a scratch directory that is removed at exit.
struct Input {
    std::vector<unsigned char> bytes;
    std::string dir;
    std::string file;

    Input() : bytes(kSize)
    {
        std::mt19937_64 rng(12345);
        for (size_t i = 0; i < kSize; i += 8) {
            const uint64_t v = rng();
            std::memcpy(bytes.data() + i, &v, 8);
        }
        const char* tmp = getenv("TMPDIR");
        std::string pattern =
            std::string(tmp != nullptr && tmp[0] != 0 ? tmp : "/tmp") + "/zmbench-coder.XXXXXX";
        if (mkdtemp(pattern.data()) != nullptr) {
            dir = pattern;
            file = dir + "/data.bin";
            std::ofstream(file, std::ios::binary)
                .write(reinterpret_cast<const char*>(bytes.data()), std::streamsize(kSize));
        }
    }
    ~Input()
    {
        if (!file.empty()) {
            unlink(file.c_str());
            rmdir(dir.c_str());
        }
    }
};

const Input& input()
{
    static const Input in;
    return in;
}

void Md5Zm(benchmark::State& state)
{
    const Input& in = input();
    unsigned char digest[16];
    for (auto _ : state) {
        ZmCoder coder;
        coder.crcMD5Init();
        coder.crcMD5Update(in.bytes.data(), static_cast<unsigned int>(kSize));
        coder.crcMD5Final();
        coder.crcMD5Query(digest);
        benchmark::DoNotOptimize(digest);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(kSize));
    state.counters["digest0"] = digest[0];
    state.SetLabel("ZmCoder crcMD5*");
}
BENCHMARK(Md5Zm)->Name("ZmCoder_md5/zm")->Unit(benchmark::kMillisecond);

#if ZMBENCH_HAVE_OPENSSL
void Md5Peer(benchmark::State& state)
{
    const Input& in = input();
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int length = 0;
    for (auto _ : state) {
        EVP_Digest(in.bytes.data(), kSize, digest, &length, EVP_md5(), nullptr);
        benchmark::DoNotOptimize(digest);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(kSize));
    state.counters["digest0"] = digest[0];
    state.SetLabel("OpenSSL EVP_md5");
}
BENCHMARK(Md5Peer)->Name("ZmCoder_md5/peer")->Unit(benchmark::kMillisecond);
#else
ZMBENCH_MISSING_PEER("ZmCoder_md5/peer", "OpenSSL (libssl-dev) not found at configure time");
#endif

void crcInMemory(benchmark::State& state, ZmCoder::CrcImplementation which, const char* label)
{
    const Input& in = input();
    ZmCoder::setCrcImplementation(which);
    unsigned int crc = 0;
    for (auto _ : state) {
        crc = ZmCoder::crc(in.bytes.data(), static_cast<unsigned int>(kSize));
        benchmark::DoNotOptimize(crc);
    }
    ZmCoder::setCrcImplementation(ZmCoder::CrcImplementation::Automatic);
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(kSize));
    state.counters["crc"] = crc;
    state.SetLabel(label);
}

void CrcZm(benchmark::State& state)
{
    crcInMemory(state, ZmCoder::CrcImplementation::Automatic, "ZmCoder::crc");
}
BENCHMARK(CrcZm)->Name("ZmCoder_crc/zm")->Unit(benchmark::kMillisecond)->UseRealTime();

void CrcPortable(benchmark::State& state)
{
    crcInMemory(state, ZmCoder::CrcImplementation::Portable, "ZmCoder::crc, table path");
}
BENCHMARK(CrcPortable)->Name("ZmCoder_crc/peer-portable")->Unit(benchmark::kMillisecond)->UseRealTime();

// One run of `cksum file`; its CRC, or -1.
double runCksum(const std::string& file)
{
    const std::string cmd = "exec cksum '" + file + "'";
    FILE* pipe = popen(cmd.c_str(), "r");
    if (pipe == nullptr) {
        return -1;
    }
    unsigned long crc = 0;
    const bool ok = fscanf(pipe, "%lu", &crc) == 1;
    return pclose(pipe) == 0 && ok ? double(crc) : -1;
}

void CrcPeer(benchmark::State& state)
{
    const Input& in = input();
    if (in.file.empty() || runCksum(in.file) < 0) { // also brings the file into the page cache
        state.SkipWithError("cannot write the scratch file or run cksum");
        return;
    }
    double crc = 0;
    for (auto _ : state) {
        crc = runCksum(in.file);
        benchmark::DoNotOptimize(crc);
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(kSize));
    state.counters["crc"] = crc;
    state.SetLabel("cksum (GNU coreutils) on a cached file");
}
BENCHMARK(CrcPeer)->Name("ZmCoder_crc/peer")->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
