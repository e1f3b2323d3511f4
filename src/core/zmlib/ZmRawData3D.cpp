#include <zmlib/ZmRawData2D.h>
#include <zmlib/ZmRawData3D.h>

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>

#include <cstring>

namespace {

/// zmmalloc without the exception: a volume answers a failed allocation with a null pointer.
void* allocate(uint64_t bytes) noexcept
{
    try {
        return bytes == 0 ? nullptr : zmmalloc(bytes);
    } catch (const ZmMemoryException&) {
        return nullptr;
    }
}

uint64_t byteCount(int nx, int ny, int nz, int elemSize)
{
    if (nx < 1 || ny < 1 || nz < 1 || elemSize < 1) {
        return 0;
    }
    return uint64_t(nx) * uint64_t(ny) * uint64_t(nz) * uint64_t(elemSize);
}

} // namespace

ZmRawData3D::ZmRawData3D(int nx, int ny, int nz, int elemSize)
{
    init(nx, ny, nz, elemSize);
}

ZmRawData3D::ZmRawData3D(int nx, int ny, int nz, int elemSize, void* data) noexcept
{
    init(nx, ny, nz, elemSize, data);
}

ZmRawData3D::ZmRawData3D(const ZmRawData3D& other)
{
    *this = other;
}

ZmRawData3D& ZmRawData3D::operator=(const ZmRawData3D& other)
{
    if (this == &other) {
        return *this;
    }
    init(other.m_dims[0], other.m_dims[1], other.m_dims[2], other.m_elemSize, other.m_data);
    if (other.m_owned != nullptr) {
        const uint64_t bytes = byteCount(m_dims[0], m_dims[1], m_dims[2], m_elemSize);
        m_owned = allocate(bytes);
        m_data = m_owned;
        if (m_owned != nullptr) {
            std::memcpy(m_owned, other.m_data, bytes);
        }
    }
    return *this;
}

ZmRawData3D::~ZmRawData3D()
{
    release();
}

void ZmRawData3D::release() noexcept
{
    zmfree(m_owned);
    m_owned = nullptr;
    m_data = nullptr;
}

void ZmRawData3D::init(int nx, int ny, int nz, int elemSize)
{
    init(nx, ny, nz, elemSize, nullptr);
    m_owned = allocate(byteCount(nx, ny, nz, elemSize));
    m_data = m_owned;
}

void ZmRawData3D::init(int nx, int ny, int nz, int elemSize, void* data) noexcept
{
    release();
    m_dims[0] = nx;
    m_dims[1] = ny;
    m_dims[2] = nz;
    m_elemSize = elemSize;
    m_data = data;
}

void ZmRawData3D::commit(int nx, int ny, int nz, int elemSize, void* buffer) noexcept
{
    init(nx, ny, nz, elemSize, buffer);
    m_owned = buffer;
}

void ZmRawData3D::resize(int nx, int ny, int nz)
{
    m_dims[0] = nx;
    m_dims[1] = ny;
    m_dims[2] = nz;
    if (m_owned == nullptr) {
        return;
    }
    const uint64_t bytes = byteCount(nx, ny, nz, m_elemSize);
    void* grown = nullptr;
    try {
        grown = zmrealloc(m_owned, bytes);
    } catch (const ZmMemoryException&) {
        zmfree(m_owned);
    }
    m_owned = grown;
    m_data = grown;
}

void ZmRawData3D::swapDataPtr(void*& p) noexcept
{
    void* mine = m_data;
    m_data = p;
    p = mine;
    if (m_owned != nullptr) {
        m_owned = m_data;
    }
}

void ZmRawData3D::clear() noexcept
{
    // The count wraps as a 32-bit int would (see the header).
    const int bytes = int(uint32_t(uint64_t(uint32_t(m_dims[0])) * uint32_t(m_dims[1]) * uint32_t(m_dims[2]) *
                                   uint32_t(m_elemSize)));
    if (m_data != nullptr && bytes > 0) {
        std::memset(m_data, 0, size_t(bytes));
    }
}

int64_t ZmRawData3D::getOffset(int i, int j, int k, int orientation) const noexcept
{
    const int64_t nx = m_dims[0], ny = m_dims[1];
    switch (orientation) {
    case 0:
        return (ny * j + i) * nx + k;
    case 1:
        return (ny * j + k) * nx + i;
    default:
        return (ny * k + j) * nx + i;
    }
}

void ZmRawData3D::getDims(int orientation, int& w, int& h, int& depth) const noexcept
{
    switch (orientation) {
    case 0:
        w = m_dims[1];
        h = m_dims[2];
        depth = m_dims[0];
        break;
    case 1:
        w = m_dims[0];
        h = m_dims[2];
        depth = m_dims[1];
        break;
    default:
        w = m_dims[0];
        h = m_dims[1];
        depth = m_dims[2];
        break;
    }
}

void ZmRawData3D::getDims(int dims[3], int orientation) const noexcept
{
    getDims(orientation, dims[0], dims[1], dims[2]);
}

void ZmRawData3D::accessSlice(int orientation, int index, void*& ptr, int& elemStride,
                              int& lineStride) const noexcept
{
    const int64_t s = m_elemSize, nx = m_dims[0], ny = m_dims[1];
    unsigned char* d = static_cast<unsigned char*>(m_data);
    switch (orientation) {
    case 0:
        ptr = d + s * index;
        elemStride = int(nx * s);
        lineStride = int(nx * ny * s);
        break;
    case 1:
        ptr = d + nx * s * index;
        elemStride = int(s);
        lineStride = int(nx * ny * s);
        break;
    default:
        ptr = d + nx * ny * s * index;
        elemStride = int(s);
        lineStride = int(nx * s);
        break;
    }
}

void ZmRawData3D::getSlice(int orientation, int index, ZmRawData2D& out, int copy) const
{
    int w, h, depth;
    getDims(orientation, w, h, depth);
    void* ptr;
    int elemStride, lineStride;
    accessSlice(orientation, index, ptr, elemStride, lineStride);
    if (copy == 0) {
        out.init(w, h, m_elemSize, elemStride, lineStride, ptr);
        return;
    }
    if (out.dataPtr() == nullptr || out.sizeX() != w || out.sizeY() != h ||
        out.getBytesPerPixel() != m_elemSize || m_data == nullptr) {
        return;
    }
    const ZmRawData2D slice(w, h, m_elemSize, elemStride, lineStride, ptr);
    out.copyData(slice);
}

void ZmRawData3D::putSlice(int orientation, int index, const ZmRawData2D& in)
{
    int w, h, depth;
    getDims(orientation, w, h, depth);
    if (in.dataPtr() == nullptr || in.sizeX() != w || in.sizeY() != h ||
        in.getBytesPerPixel() != m_elemSize || m_data == nullptr) {
        return;
    }
    void* ptr;
    int elemStride, lineStride;
    accessSlice(orientation, index, ptr, elemStride, lineStride);
    ZmRawData2D slice(w, h, m_elemSize, elemStride, lineStride, ptr);
    slice.copyData(in);
}
