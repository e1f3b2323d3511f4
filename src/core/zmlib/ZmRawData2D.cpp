#include <zmlib/ZmRawData2D.h>

#include <cstdlib>
#include <cstring>

ZmRawData2D::ZmRawData2D(int w, int h, int bytesPerPixel)
{
    init(w, h, bytesPerPixel);
}

ZmRawData2D::ZmRawData2D(int w, int h, int bytesPerPixel, void* data) noexcept
{
    init(w, h, bytesPerPixel, data);
}

ZmRawData2D::ZmRawData2D(int w, int h, int bytesPerPixel, int bytesPerLine, void* data) noexcept
{
    init(w, h, bytesPerPixel, bytesPerLine, data);
}

ZmRawData2D::ZmRawData2D(int w, int h, int bytesPerPixel, int elemSize, int bytesPerLine, void* data) noexcept
{
    init(w, h, bytesPerPixel, elemSize, bytesPerLine, data);
}

ZmRawData2D::ZmRawData2D(const ZmRawData2D& other)
{
    *this = other;
}

ZmRawData2D& ZmRawData2D::operator=(const ZmRawData2D& other)
{
    if (this == &other) {
        return *this;
    }
    release();
    std::memcpy(m_dims, other.m_dims, sizeof m_dims);
    m_bytesPerPixel = other.m_bytesPerPixel;
    m_elemSize = other.m_elemSize;
    m_bytesPerLine = other.m_bytesPerLine;
    m_data = other.m_data;
    if (other.m_owned != nullptr) {
        const size_t bytes = size_t(m_dims[0]) * size_t(m_dims[1]) * size_t(m_bytesPerPixel);
        m_owned = std::malloc(bytes);
        m_data = static_cast<unsigned char*>(m_owned);
        if (m_owned != nullptr) {
            std::memcpy(m_owned, other.m_owned, bytes);
        }
    }
    return *this;
}

ZmRawData2D::~ZmRawData2D()
{
    release();
}

void ZmRawData2D::release() noexcept
{
    std::free(m_owned);
    m_owned = nullptr;
    m_data = nullptr;
}

void ZmRawData2D::init(int w, int h, int bytesPerPixel)
{
    release();
    init(w, h, bytesPerPixel, nullptr);
    const int64_t bytes = int64_t(w) * h * bytesPerPixel;
    if (bytes > 0) {
        m_owned = std::malloc(size_t(bytes));
        m_data = static_cast<unsigned char*>(m_owned);
    }
}

void ZmRawData2D::init(int w, int h, int bytesPerPixel, void* data) noexcept
{
    init(w, h, bytesPerPixel, bytesPerPixel, w * bytesPerPixel, data);
}

void ZmRawData2D::init(int w, int h, int bytesPerPixel, int bytesPerLine, void* data) noexcept
{
    init(w, h, bytesPerPixel, bytesPerPixel, bytesPerLine, data);
}

void ZmRawData2D::init(int w, int h, int bytesPerPixel, int elemSize, int bytesPerLine, void* data) noexcept
{
    release();
    m_dims[0] = w;
    m_dims[1] = h;
    m_bytesPerPixel = bytesPerPixel;
    m_elemSize = elemSize;
    m_bytesPerLine = bytesPerLine;
    m_data = static_cast<unsigned char*>(data);
}

void ZmRawData2D::commit(int w, int h, int bytesPerPixel, void* buffer) noexcept
{
    init(w, h, bytesPerPixel, buffer);
    m_owned = buffer;
}

bool ZmRawData2D::copyData(const ZmRawData2D& src) noexcept
{
    if (src.m_dims[0] != m_dims[0] || src.m_dims[1] != m_dims[1] || src.m_bytesPerPixel != m_bytesPerPixel) {
        return false;
    }
    if (m_data == nullptr || src.m_data == nullptr) {
        return m_dims[0] == 0 || m_dims[1] == 0 || m_bytesPerPixel == 0;
    }
    if (isContiguous() && src.isContiguous()) {
        std::memmove(m_data, src.m_data, size_t(getBytesPerImage()));
        return true;
    }
    if (m_elemSize == m_bytesPerPixel && src.m_elemSize == m_bytesPerPixel) {
        // Packed pixels on both sides: a line at a time.
        for (int y = 0; y < m_dims[1]; ++y) {
            std::memmove(address(0, y), src.address(0, y), size_t(m_dims[0]) * size_t(m_bytesPerPixel));
        }
        return true;
    }
    for (int y = 0; y < m_dims[1]; ++y) {
        for (int x = 0; x < m_dims[0]; ++x) {
            std::memcpy(address(x, y), src.address(x, y), size_t(m_bytesPerPixel));
        }
    }
    return true;
}

void ZmRawData2D::clear() noexcept
{
    if (m_data == nullptr) {
        return;
    }
    if (isContiguous()) {
        std::memset(m_data, 0, size_t(getBytesPerImage()));
        return;
    }
    for (int y = 0; y < m_dims[1]; ++y) {
        for (int x = 0; x < m_dims[0]; ++x) {
            std::memset(address(x, y), 0, size_t(m_bytesPerPixel));
        }
    }
}

void ZmRawData2D::makeLocal()
{
    if (m_owned != nullptr) {
        return;
    }
    ZmRawData2D packed(m_dims[0], m_dims[1], m_bytesPerPixel);
    if (packed.m_data != nullptr) {
        packed.copyData(*this);
    }
    // A failed allocation leaves `packed` empty, and so this image.
    *this = ZmRawData2D();
    std::memcpy(m_dims, packed.m_dims, sizeof m_dims);
    m_bytesPerPixel = packed.m_bytesPerPixel;
    m_elemSize = packed.m_elemSize;
    m_bytesPerLine = packed.m_bytesPerLine;
    m_data = packed.m_data;
    m_owned = packed.m_owned;
    packed.m_owned = nullptr;
    packed.m_data = nullptr;
}
