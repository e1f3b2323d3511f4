// The raw voxel operations against straightforward reference loops, on fixed-seed random data
// with the extremes of each type mixed in, over odd sizes and 1 to 4 components.
#include "../FailureInjection.h"
#include "../LogCapture.h"
#include "../ScratchDir.h"

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmRawData.h>
#include <zmlib/ZmRawData2D.h>
#include <zmlib/ZmRawData3D.h>

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <random>
#include <unistd.h>
#include <vector>

namespace {

template <class T>
std::vector<T> randomValues(size_t n, unsigned seed)
{
    std::mt19937_64 rng(seed);
    std::vector<T> v(n);
    for (size_t i = 0; i < n; ++i) {
        if constexpr (std::is_floating_point_v<T>) {
            std::uniform_real_distribution<double> d(-70000.0, 70000.0);
            v[i] = T(d(rng));
        } else {
            v[i] = T(rng());
        }
    }
    // The extremes, both ends of every smaller type and a NaN where there is one.
    const double specials[] = {0.0,          -1.0,          255.0,        256.0, -129.0, 32767.0,
                               32768.0,      -32769.0,      65535.5,      300.7, 2.9,    -2.9,
                               2147483647.0, -2147483648.0, 4294967295.0, 1e12,  -1e12};
    for (size_t k = 0; k < sizeof specials / sizeof specials[0] && k < n; ++k) {
        const double s = specials[k];
        if (std::is_floating_point_v<T> ||
            (s >= double(std::numeric_limits<T>::lowest()) && s <= double(std::numeric_limits<T>::max()))) {
            v[k * 3 % n] = T(s);
        }
    }
    if constexpr (std::is_floating_point_v<T>) {
        v[n / 2] = std::numeric_limits<T>::quiet_NaN();
    }
    return v;
}

// The conversion rule written out plainly: NaN -> 0, clamp, truncate.
template <class D, class S>
D referenceConvert(S s)
{
    if constexpr (std::is_floating_point_v<D>) {
        return D(s);
    } else {
        const long double v = (long double)s;
        if (v != v) {
            return 0;
        }
        if (v <= (long double)std::numeric_limits<D>::min()) {
            return std::numeric_limits<D>::min();
        }
        if (v >= (long double)std::numeric_limits<D>::max()) {
            return std::numeric_limits<D>::max();
        }
        return D(std::trunc(v));
    }
}

template <class T>
bool sameBits(const std::vector<T>& a, const std::vector<T>& b)
{
    return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(T)) == 0;
}

template <class D, class S>
void checkConversion(unsigned seed)
{
    const size_t n = 1031;
    std::vector<S> src = randomValues<S>(n, seed);
    std::vector<D> dst(n), want(n);
    for (size_t i = 0; i < n; ++i) {
        want[i] = referenceConvert<D>(src[i]);
    }
    ZmRawData::memcpy(ZmTypedPointer(dst.data()), ZmTypedPointer(src.data()), int64_t(n));
    EXPECT_TRUE(sameBits(dst, want)) << ZmPrimType(dst.data()).getName() << " <- "
                                     << ZmPrimType(src.data()).getName();

    // mapLinear: the same conversion of (s + offset) * scale computed in float.
    const double offset = 12.25, scale = -0.75;
    for (size_t i = 0; i < n; ++i) {
        want[i] = referenceConvert<D>((float(src[i]) + float(offset)) * float(scale));
    }
    ZmRawData::mapLinear(ZmTypedPointer(dst.data()), ZmTypedPointer(src.data()), n, offset, scale);
    EXPECT_TRUE(sameBits(dst, want)) << "mapLinear " << ZmPrimType(dst.data()).getName() << " <- "
                                     << ZmPrimType(src.data()).getName();
}

template <class S>
void checkConversionsFrom(unsigned seed)
{
    checkConversion<uint8_t, S>(seed);
    checkConversion<int16_t, S>(seed);
    checkConversion<int32_t, S>(seed);
    checkConversion<float, S>(seed);
    checkConversion<double, S>(seed);
    checkConversion<uint16_t, S>(seed);
}

} // namespace

TEST(ZmPrimType, TableNamesAndSignedness)
{
    for (int code = 0; code < 10; ++code) {
        ZmPrimType::Type t;
        ASSERT_TRUE(ZmPrimType::nameToType(ZmPrimType(code).getName(), t));
        EXPECT_EQ(int(t), code);
    }
    ZmPrimType::Type t = ZmPrimType::INT;
    EXPECT_FALSE(ZmPrimType::nameToType("Byte", t));
    EXPECT_EQ(t, ZmPrimType::INT);
    EXPECT_EQ(ZmPrimType(static_cast<char*>(nullptr)), ZmPrimType::SBYTE);
    EXPECT_EQ(ZmTypedPointer(static_cast<unsigned int*>(nullptr)).primType(), ZmPrimType::UINT);
    ZmPrimType f(ZmPrimType::FLOAT);
    EXPECT_EQ(f.makeSigned(), ZmPrimType::FLOAT);
    ZmPrimType u(ZmPrimType::USHORT);
    EXPECT_EQ(u.makeSigned(), ZmPrimType::SHORT);
    EXPECT_EQ(u.makeUnsigned(), ZmPrimType::USHORT);
    EXPECT_FALSE(ZmPrimType(ZmPrimType::UINT).isSigned());
    EXPECT_TRUE(ZmPrimType(ZmPrimType::COMPLEX).isSigned());
}

TEST(ZmRawData, ConversionsAndMappingMatchTheReferenceForEveryTypePair)
{
    checkConversionsFrom<uint8_t>(1);
    checkConversionsFrom<int16_t>(2);
    checkConversionsFrom<int32_t>(3);
    checkConversionsFrom<float>(4);
    checkConversionsFrom<double>(5);
    checkConversionsFrom<uint16_t>(6);
    checkConversionsFrom<uint32_t>(7);
    checkConversionsFrom<int8_t>(8);
}

TEST(ZmRawData, UnsupportedTypesLogAndLeaveTheDestination)
{
    LogCapture log;
    unsigned int u[3] = {1, 2, 3};
    ZmRawData::memset(ZmTypedPointer(u), 7, 3);
    short s[3] = {-5, 1, 2};
    ZmRawData::memcpy(ZmTypedPointer(u), ZmTypedPointer(s), 3);
    float c[4] = {1, 5, -2, 0};
    ZmRawData::memcpy(ZmTypedPointer(s), ZmTypedPointer(c, ZmPrimType::COMPLEX), 2);
    ZmRawData::mapLinear(ZmTypedPointer(s), ZmTypedPointer(c, ZmPrimType::COMPLEX), 2, 0, 1);
    EXPECT_EQ(u[0] + u[1] + u[2], 6u);
    EXPECT_EQ(s[0], -5);
    EXPECT_EQ(log.matching("Unsupported data type uint in ZmRawData::memset()").size(), 1u);
    EXPECT_EQ(log.matching("Unsupported data type uint in ZmRawData()").size(), 1u);
    EXPECT_EQ(log.matching("ERROR: ZmRawData::memcpy(), complex data are not supported").size(), 1u);
    EXPECT_EQ(log.matching("mapping from complex to real is not supported").size(), 1u);
}

TEST(ZmRawData, FillRangeAndConstancy)
{
    std::vector<uint16_t> us(1000);
    ZmRawData::memset(ZmTypedPointer(us.data()), 70000, int64_t(us.size()));
    EXPECT_EQ(us[999], uint16_t(70000));
    std::vector<int16_t> sh(5);
    ZmRawData::memset(ZmTypedPointer(sh.data()), -2.5, 5); // floor(-2.0) = -2
    EXPECT_EQ(sh[4], -2);

    std::mt19937 rng(9);
    for (size_t n : {1u, 7u, 8u, 9u, 100003u}) {
        std::vector<float> v = randomValues<float>(n, unsigned(n));
        float lo = v[0], hi = v[0];
        for (float x : v) {
            lo = x < lo ? x : lo;
            hi = x > hi ? x : hi;
        }
        float mn = 0, mx = 0;
        ZmRawData::getRange(ZmTypedPointer(v.data()), n, mn, mx);
        // A NaN first value stays (n = 1 here); NaN later on is passed over.
        EXPECT_TRUE(mn == lo || (std::isnan(mn) && std::isnan(lo))) << n;
        EXPECT_TRUE(mx == hi || (std::isnan(mx) && std::isnan(hi))) << n;
        EXPECT_EQ(ZmRawData::isConstant(ZmTypedPointer(v.data()), n), n == 1);
    }
    float c[4] = {1, 5, -2, 0}; // 1+5i, -2+0i
    float mn = 0, mx = 0;
    ZmRawData::getRange(ZmTypedPointer(c, ZmPrimType::COMPLEX), 2, mn, mx);
    EXPECT_EQ(mn, -2.0f);
    EXPECT_EQ(mx, 5.0f);
    std::vector<int32_t> same(70000, -4);
    EXPECT_TRUE(ZmRawData::isConstant(ZmTypedPointer(same.data()), same.size()));
    same[69999] = -3;
    EXPECT_FALSE(ZmRawData::isConstant(ZmTypedPointer(same.data()), same.size()));
    EXPECT_TRUE(ZmRawData::isConstant(ZmTypedPointer(same.data()), 0));
    EXPECT_FALSE(ZmRawData::isConstant(ZmTypedPointer(same.data(), ZmPrimType::UINT), 3));
}

TEST(ZmRawData, ByteOrderRoundTripsThroughFiles)
{
    ScratchDir dir;
    // More than 4 MiB, not a whole number of 1 MiB chunks: every chunk boundary is crossed.
    const size_t n = 5 * 1048576 / 8 + 333;
    std::vector<double> v = randomValues<double>(n, 11);
    v[n / 2] = 1.5; // no NaN here: the comparison below is by value
    const std::string path = dir.path() + "/big.raw";
    FILE* f = std::fopen(path.c_str(), "wb");
    ASSERT_NE(f, nullptr);
    EXPECT_EQ(ZmRawData::writeBigEndian(ZmTypedPointer(v.data()), n, f), n);
    std::fclose(f);
    // The file holds each double's bytes reversed; the caller's buffer is unchanged.
    std::vector<unsigned char> bytes(n * 8);
    const int fd = ::open(path.c_str(), O_RDONLY);
    ASSERT_GE(fd, 0);
    EXPECT_EQ(ZmRawData::read(fd, bytes.data(), int64_t(bytes.size()) + 10, true), int64_t(bytes.size()));
    ::close(fd);
    for (size_t i = 0; i < n; i += 4099) {
        unsigned char want[8];
        std::memcpy(want, &v[i], 8);
        for (int k = 0; k < 8; ++k) {
            ASSERT_EQ(bytes[i * 8 + size_t(k)], want[7 - k]) << i;
        }
    }
    f = std::fopen(path.c_str(), "rb");
    std::vector<double> back(n);
    EXPECT_EQ(ZmRawData::readBigEndian(ZmTypedPointer(back.data()), n + 5, f), n);
    std::fclose(f);
    EXPECT_TRUE(sameBits(back, v));

    // Complex swaps as two 32-bit words per element.
    float c[2] = {1.0f, 2.0f};
    uint32_t w[2];
    std::memcpy(w, c, 8);
    ZmRawData::swapBytes(ZmTypedPointer(c, ZmPrimType::COMPLEX), 1);
    uint32_t got[2];
    std::memcpy(got, c, 8);
    EXPECT_EQ(got[0], __builtin_bswap32(w[0]));
    EXPECT_EQ(got[1], __builtin_bswap32(w[1]));

    const int out = ::open((dir.path() + "/w.raw").c_str(), O_WRONLY | O_CREAT, 0600);
    EXPECT_EQ(ZmRawData::write(out, bytes.data(), 4096), 4096u);
    ::close(out);
    LogCapture log;
    EXPECT_EQ(ZmRawData::write(-1, bytes.data(), 1), uint64_t(-1));
    EXPECT_EQ(ZmRawData::read(-1, bytes.data(), 10, true), 0);
    EXPECT_EQ(log.matching("ZmRawData::read() failed, ret=-1, size=10, errno=9").size(), 1u);
}

namespace {

// The permuted volume built out of place, the obvious way.
template <class T>
std::vector<T> referencePermute(const std::vector<T>& v, const int dims[3], const int perm[3], int nc)
{
    const int nd[3] = {dims[perm[0]], dims[perm[1]], dims[perm[2]]};
    std::vector<T> out(v.size());
    for (int z = 0; z < dims[2]; ++z) {
        for (int y = 0; y < dims[1]; ++y) {
            for (int x = 0; x < dims[0]; ++x) {
                const int old[3] = {x, y, z};
                const size_t from = (size_t(z) * size_t(dims[1]) + size_t(y)) * size_t(dims[0]) + size_t(x);
                const size_t to =
                    (size_t(old[perm[2]]) * size_t(nd[1]) + size_t(old[perm[1]])) * size_t(nd[0]) +
                    size_t(old[perm[0]]);
                for (int c = 0; c < nc; ++c) {
                    out[to * size_t(nc) + size_t(c)] = v[from * size_t(nc) + size_t(c)];
                }
            }
        }
    }
    return out;
}

template <class T>
void checkPermutations(const int shape[3], int nc)
{
    const int perms[5][3] = {{0, 2, 1}, {1, 0, 2}, {1, 2, 0}, {2, 0, 1}, {2, 1, 0}};
    for (const auto& perm : perms) {
        std::vector<T> v =
            randomValues<T>(size_t(shape[0]) * size_t(shape[1]) * size_t(shape[2]) * size_t(nc), 5);
        const std::vector<T> want = referencePermute(v, shape, perm, nc);
        int dims[3] = {shape[0], shape[1], shape[2]};
        ASSERT_TRUE(ZmRawData::swapDims(ZmTypedPointer(v.data()), dims, perm, nc));
        EXPECT_EQ(dims[0], shape[perm[0]]);
        EXPECT_EQ(dims[2], shape[perm[2]]);
        EXPECT_TRUE(sameBits(v, want)) << shape[0] << "x" << shape[1] << "x" << shape[2] << " nc " << nc
                                       << " perm " << perm[0] << perm[1] << perm[2];
    }
}

} // namespace

TEST(ZmRawData, SwapDimsMatchesAnOutOfPlacePermutation)
{
    // Past one transposition tile (32), square planes, and a thin middle axis (the other way round).
    const int shapes[][3] = {{7, 5, 3},  {1, 9, 1},   {4, 4, 4},  {13, 1, 6},
                             {2, 3, 11}, {40, 40, 3}, {37, 2, 45}};
    for (const auto& s : shapes) {
        checkPermutations<uint8_t>(s, 1);
        checkPermutations<int16_t>(s, 2); // moved as int
        checkPermutations<float>(s, 3);
        checkPermutations<double>(s, 4);
    }
    // A constant volume only changes its dims; an unsupported type logs and refuses.
    std::vector<int16_t> flat(60, 3);
    int dims[3] = {3, 4, 5};
    const int perm[3] = {2, 0, 1};
    EXPECT_TRUE(ZmRawData::swapDims(ZmTypedPointer(flat.data()), dims, perm, 1));
    EXPECT_EQ(dims[0], 5);
    LogCapture log;
    std::vector<uint32_t> u = randomValues<uint32_t>(24, 1);
    int udims[3] = {2, 3, 4};
    EXPECT_FALSE(ZmRawData::swapDims(ZmTypedPointer(u.data()), udims, perm, 3));
    EXPECT_EQ(log.matching("Unsupported data type uint in ZmRawData::swapDims()").size(), 1u);
    EXPECT_EQ(udims[0], 2);
    const int notAPermutation[3] = {0, 0, 1};
    EXPECT_FALSE(ZmRawData::swapDims(ZmTypedPointer(flat.data()), dims, notAPermutation, 1));
}

TEST(ZmRawData, CropAndFlipMatchTheReference)
{
    const int shape[3] = {7, 5, 3};
    const std::vector<int32_t> v = randomValues<int32_t>(105, 3);
    auto at = [&](int x, int y, int z) { return v[size_t((z * 5 + y) * 7 + x)]; };

    // A box reaching outside the volume on every side, filled with -9.
    void* data = zmmalloc(v.size() * 4);
    std::memcpy(data, v.data(), v.size() * 4);
    int dims[3] = {7, 5, 3};
    const int lo[3] = {-1, 2, -2}, hi[3] = {8, 6, 1};
    const int32_t fill = -9;
    ASSERT_EQ(ZmRawData::crop(data, 4, dims, lo, hi, &fill), 1);
    ASSERT_EQ(dims[0], 10);
    ASSERT_EQ(dims[1], 5);
    ASSERT_EQ(dims[2], 4);
    const int32_t* c = static_cast<const int32_t*>(data);
    for (int z = 0; z < 4; ++z) {
        for (int y = 0; y < 5; ++y) {
            for (int x = 0; x < 10; ++x) {
                const int sx = x - 1, sy = y + 2, sz = z - 2;
                const bool in = sx >= 0 && sx < 7 && sy < 5 && sz >= 0;
                ASSERT_EQ(c[(z * 5 + y) * 10 + x], in ? at(sx, sy, sz) : fill) << x << "," << y << "," << z;
            }
        }
    }
    const int empty[3] = {3, 3, 3}, below[3] = {2, 3, 3};
    EXPECT_EQ(ZmRawData::crop(data, 4, dims, empty, below, nullptr), 0);
    zmfree(data);

    for (int axis = 0; axis < 3; ++axis) {
        std::vector<int32_t> f = v;
        ASSERT_EQ(ZmRawData::flip(f.data(), 4, shape, axis), 1);
        for (int z = 0; z < 3; ++z) {
            for (int y = 0; y < 5; ++y) {
                for (int x = 0; x < 7; ++x) {
                    const int m[3] = {axis == 0 ? 6 - x : x, axis == 1 ? 4 - y : y, axis == 2 ? 2 - z : z};
                    ASSERT_EQ(f[size_t((z * 5 + y) * 7 + x)], at(m[0], m[1], m[2]));
                }
            }
        }
    }
    EXPECT_EQ(ZmRawData::flip(nullptr, 4, shape, 0), 0);
    EXPECT_EQ(ZmRawData::flip(const_cast<int32_t*>(v.data()), 4, shape, 3), 0);
}

namespace {

template <class T>
void checkMeans(const int shape[3], int bx, int by, int bz, int nc)
{
    const std::vector<T> v = randomValues<T>(size_t(shape[0] * shape[1] * shape[2] * nc), 21);
    const int o[3] = {shape[0] / bx, shape[1] / by, shape[2] / bz};
    std::vector<T> got(size_t(o[0] * o[1] * o[2] * nc)), want(got.size());
    using Sum = std::conditional_t<std::is_floating_point_v<T>, T, int64_t>;
    for (int z = 0; z < o[2]; ++z) {
        for (int y = 0; y < o[1]; ++y) {
            for (int x = 0; x < o[0]; ++x) {
                for (int c = 0; c < nc; ++c) {
                    Sum s = 0;
                    for (int dz = 0; dz < bz; ++dz) {
                        for (int dy = 0; dy < by; ++dy) {
                            for (int dx = 0; dx < bx; ++dx) {
                                s += Sum(v[size_t(
                                    (((z * bz + dz) * shape[1] + y * by + dy) * shape[0] + x * bx + dx) * nc +
                                    c)]);
                            }
                        }
                    }
                    want[size_t(((z * o[1] + y) * o[0] + x) * nc + c)] = T(s / Sum(bx * by * bz));
                }
            }
        }
    }
    ZmRawData::downSample3DN(got.data(), ZmTypedPointer(const_cast<T*>(v.data())), uint64_t(shape[0]),
                             uint64_t(shape[1]), uint64_t(shape[2]), bx, by, bz, nc, nullptr);
    EXPECT_TRUE(sameBits(got, want)) << bx << by << bz << " nc " << nc;
}

} // namespace

TEST(ZmRawData, DownSamplingMatchesTheReference)
{
    const int shape[3] = {9, 7, 5};
    for (int nc = 1; nc <= 2; ++nc) {
        checkMeans<uint8_t>(shape, 2, 2, 2, nc);
        checkMeans<int16_t>(shape, 3, 2, 1, nc);
        checkMeans<int32_t>(shape, 2, 2, 2, nc);
        checkMeans<float>(shape, 2, 2, 2, nc);
        checkMeans<double>(shape, 4, 3, 2, nc);
        checkMeans<uint16_t>(shape, 1, 1, 5, nc);
    }
    // Long lines through the 2x2x2 paths: the 16-bit vector loop with its tail, and the line
    // sums in chunks of 512 pairs.
    const int wide[3] = {1101, 3, 4};
    checkMeans<int16_t>(wide, 2, 2, 2, 1);
    checkMeans<uint16_t>(wide, 2, 2, 2, 1);
    checkMeans<uint8_t>(wide, 2, 2, 2, 1);
    checkMeans<int32_t>(wide, 2, 2, 2, 1);
    checkMeans<float>(wide, 2, 2, 2, 1);
    // 5x5x5 in 2x2x2 blocks gives 2x2x2.
    std::vector<float> cube(125, 1.0f), small(9, -1.0f);
    ZmRawData::downSample3D(small.data(), ZmTypedPointer(cube.data()), 5, 5, 5, 2, 2, 2, nullptr);
    EXPECT_EQ(small[7], 1.0f);
    EXPECT_EQ(small[8], -1.0f);

    // Labels: the most frequent in the block, the lowest on a tie; maxima per component.
    uint8_t labels[8] = {4, 2, 4, 2, 7, 7, 7, 1};
    uint8_t perSlice[2] = {0, 0};
    ZmRawData::downSampleLabels3D(perSlice, ZmTypedPointer(labels), 2, 2, 2, 2, 2, 1, nullptr);
    EXPECT_EQ(perSlice[0], 2); // 4, 2, 4, 2: a tie goes to the lower label
    EXPECT_EQ(perSlice[1], 7);
    uint8_t whole = 0;
    ZmRawData::downSampleLabels3D(&whole, ZmTypedPointer(labels), 2, 2, 2, 2, 2, 2, nullptr);
    EXPECT_EQ(whole, 7);
    int16_t comps[8] = {1, -5, 9, -7, 3, 2, -1, 0}; // four voxels of two components
    int16_t peak[2] = {0, 0};
    ZmRawData::downSampleMaxFilterComponents3DN(peak, ZmTypedPointer(comps), 4, 1, 1, 4, 1, 1, 2, nullptr);
    EXPECT_EQ(peak[0], 9);
    EXPECT_EQ(peak[1], 2);
    LogCapture log;
    ZmRawData::downSample3D(small.data(), ZmTypedPointer(cube.data(), ZmPrimType::UINT), 5, 5, 5, 2, 2, 2,
                            nullptr);
    EXPECT_EQ(log.matching("Unsupported data type uint in ZmRawData::downSample3D").size(), 1u);
}

TEST(ZmRawData3D, SlicesAndViews)
{
    ZmRawData3D vol(4, 3, 2, 2);
    ASSERT_NE(vol.dataPtr(), nullptr);
    int16_t* d = static_cast<int16_t*>(vol.dataPtr());
    for (int i = 0; i < 24; ++i) {
        d[i] = int16_t(i);
    }
    for (int o = 0; o < 3; ++o) {
        int w, h, depth;
        vol.getDims(o, w, h, depth);
        for (int k = 0; k < depth; ++k) {
            ZmRawData2D view, copy(w, h, 2);
            vol.getSlice(o, k, view, 0);
            vol.getSlice(o, k, copy, 1);
            for (int j = 0; j < h; ++j) {
                for (int i = 0; i < w; ++i) {
                    const int16_t want = d[vol.getOffset(i, j, k, o)];
                    int16_t a, b;
                    std::memcpy(&a, view.address(i, j), 2);
                    std::memcpy(&b, copy.address(i, j), 2);
                    ASSERT_EQ(a, want);
                    ASSERT_EQ(b, want);
                }
            }
            // Writing the negated copy back through putSlice.
            for (int j = 0; j < h; ++j) {
                for (int i = 0; i < w; ++i) {
                    int16_t* p = reinterpret_cast<int16_t*>(copy.address(i, j));
                    *p = int16_t(-*p);
                }
            }
            vol.putSlice(o, k, copy);
            vol.putSlice(o, k, ZmRawData2D(w + 1, h, 2)); // wrong size: ignored
        }
    }
    // Each voxel lies in one slice of each orientation: negated three times.
    for (int i = 0; i < 24; ++i) {
        ASSERT_EQ(d[i], -i);
    }
    ZmRawData3D copy(vol);
    EXPECT_TRUE(copy.islocal());
    EXPECT_NE(copy.dataPtr(), vol.dataPtr());
    EXPECT_EQ(std::memcmp(copy.dataPtr(), vol.dataPtr(), 48), 0);
    ZmRawData3D view(4, 3, 2, 2, vol.dataPtr());
    ZmRawData3D viewCopy = view;
    EXPECT_FALSE(viewCopy.islocal());
    EXPECT_EQ(viewCopy.dataPtr(), vol.dataPtr());
    vol.clear();
    EXPECT_EQ(d[23], 0);

    // A packed image into a view with a larger line stride: pixel rows land at the stride.
    unsigned char wide[3 * 8] = {};
    ZmRawData2D strided(3, 3, 2, 8, wide);
    unsigned char packedBytes[18];
    for (int i = 0; i < 18; ++i) {
        packedBytes[i] = static_cast<unsigned char>(i + 1);
    }
    ZmRawData2D packed(3, 3, 2, packedBytes);
    EXPECT_TRUE(strided.copyData(packed));
    EXPECT_EQ(wide[8], 7);
    EXPECT_EQ(wide[6], 0);
    EXPECT_FALSE(strided.copyData(ZmRawData2D(3, 2, 2, packedBytes)));
    strided.makeLocal();
    EXPECT_TRUE(strided.islocal());
    EXPECT_TRUE(strided.isContiguous());
    EXPECT_EQ(strided.address(0, 1)[0], 7);
}

TEST(ZmRawData, FailedAllocationsLeaveTheVolumeAsItWas)
{
    const int shape[3] = {6, 5, 4};
    const std::vector<int16_t> original = randomValues<int16_t>(120, 4);
    std::vector<int16_t> v = original;
    int dims[3] = {6, 5, 4};
    const int perm[3] = {2, 0, 1};
    void* block = zmmalloc(240);
    std::memcpy(block, original.data(), 240);
    const int lo[3] = {1, 1, 1}, hi[3] = {3, 3, 3};
    {
        FailAllocation fail(1, true);
        EXPECT_FALSE(ZmRawData::swapDims(ZmTypedPointer(v.data()), dims, perm, 1));
        EXPECT_EQ(ZmRawData::flip(v.data(), 2, shape, 1), 0);
        EXPECT_EQ(ZmRawData::crop(block, 2, dims, lo, hi, nullptr), 0);
        ZmRawData3D vol(6, 5, 4, 2);
        EXPECT_EQ(vol.dataPtr(), nullptr);
    }
    EXPECT_TRUE(sameBits(v, original));
    EXPECT_EQ(dims[0], 6);
    EXPECT_EQ(std::memcmp(block, original.data(), 240), 0);
    zmfree(block);
}
