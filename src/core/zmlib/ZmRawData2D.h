/// \file
/// Strided 2D images.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

/// A 2D image of width x height pixels with strides: pixels of a line lie `getElemSize()` bytes
/// apart, lines `getBytesPerLine()` bytes apart; a pixel's value has `getBytesPerPixel()` bytes.
///
/// Either owns its buffer (from `malloc`, freed by the destructor and by every `init`) or views
/// memory owned elsewhere. Copies of an owning image own a packed copy of the source's buffer;
/// copies of a view are views of the same memory. Allocation failure leaves a null data pointer.
/// Not synchronised.
class ZMLIB_API ZmRawData2D {
public:
    ZmRawData2D() noexcept = default;
    /// An owned packed buffer of w*h*bytesPerPixel bytes (none when that is 0), uninitialised.
    ZmRawData2D(int w, int h, int bytesPerPixel);
    /// A view of packed memory.
    ZmRawData2D(int w, int h, int bytesPerPixel, void* data) noexcept;
    /// A view of memory with packed pixels and lines \p bytesPerLine apart.
    ZmRawData2D(int w, int h, int bytesPerPixel, int bytesPerLine, void* data) noexcept;
    /// A view of fully strided memory.
    ZmRawData2D(int w, int h, int bytesPerPixel, int elemSize, int bytesPerLine, void* data) noexcept;
    ZmRawData2D(const ZmRawData2D& other);
    ZmRawData2D& operator=(const ZmRawData2D& other);
    ~ZmRawData2D();

    // Every init first frees an owned buffer; the forms are those of the constructors.
    void init(int w, int h, int bytesPerPixel);
    void init(int w, int h, int bytesPerPixel, void* data) noexcept;
    void init(int w, int h, int bytesPerPixel, int bytesPerLine, void* data) noexcept;
    void init(int w, int h, int bytesPerPixel, int elemSize, int bytesPerLine, void* data) noexcept;
    /// Adopts \p buffer (from `malloc`, packed) as owned.
    void commit(int w, int h, int bytesPerPixel, void* buffer) noexcept;

    int sizeX() const noexcept { return m_dims[0]; }
    int sizeY() const noexcept { return m_dims[1]; }
    const int* dims() const noexcept { return m_dims; }
    int getBytesPerPixel() const noexcept { return m_bytesPerPixel; }
    int getElemSize() const noexcept { return m_elemSize; }
    int getBytesPerLine() const noexcept { return m_bytesPerLine; }
    /// bytesPerLine * height.
    int64_t getBytesPerImage() const noexcept { return int64_t(m_bytesPerLine) * m_dims[1]; }
    unsigned char* dataPtr() const noexcept { return m_data; }
    unsigned char* address(int x, int y) const noexcept
    {
        return m_data + int64_t(m_elemSize) * x + int64_t(m_bytesPerLine) * y;
    }
    /// Packed lines of packed pixels.
    bool isContiguous() const noexcept
    {
        return int64_t(m_bytesPerLine) == int64_t(m_elemSize) * m_dims[0] && m_elemSize == m_bytesPerPixel;
    }
    /// Whether this image owns its buffer.
    bool islocal() const noexcept { return m_owned != nullptr; }

    /// Copies the pixels of \p src, honouring both images' strides (one block copy when both are
    /// contiguous, a line at a time when both have packed pixels). False, nothing copied, unless width,
    /// height and bytes per pixel agree.
    bool copyData(const ZmRawData2D& src) noexcept;
    /// Zeros the value bytes of every pixel; the gaps between strided pixels are left alone.
    void clear() noexcept;
    /// Turns a view into an owned packed copy; an owning image stays as it is. On allocation
    /// failure the image keeps its size and has a null data pointer.
    void makeLocal();

private:
    void release() noexcept;

    int m_dims[2] = {0, 0};
    int m_bytesPerPixel = 0;
    int m_elemSize = 0;
    int m_bytesPerLine = 0;
    unsigned char* m_data = nullptr;
    void* m_owned = nullptr;
};
