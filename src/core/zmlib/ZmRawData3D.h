/// \file
/// Dense 3D volumes.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

class ZmRawData2D;

/// A dense volume of nx x ny x nz elements of `getElemSize()` bytes, x fastest.
///
/// Either owns its buffer (from `zmmalloc`, freed with `zmfree`) or views memory owned elsewhere;
/// copies of an owning volume own a copy of its bytes, copies of a view are views. Allocation
/// failure leaves a null data pointer (nothing throws). Slices are named by their orientation, the
/// axis normal to them: 0 (constant x, ny x nz), 1 (constant y, nx x nz), 2 (constant z, nx x ny).
/// Not synchronised.
class ZMLIB_API ZmRawData3D {
public:
    ZmRawData3D() noexcept = default;
    /// An owned, uninitialised buffer of nx*ny*nz*elemSize bytes.
    ZmRawData3D(int nx, int ny, int nz, int elemSize);
    /// A view of \p data.
    ZmRawData3D(int nx, int ny, int nz, int elemSize, void* data) noexcept;
    ZmRawData3D(const ZmRawData3D& other);
    ZmRawData3D& operator=(const ZmRawData3D& other);
    ~ZmRawData3D();

    // Every init first frees an owned buffer.
    void init(int nx, int ny, int nz, int elemSize);
    void init(int nx, int ny, int nz, int elemSize, void* data) noexcept;
    /// Adopts \p buffer (from `zmmalloc`) as owned.
    void commit(int nx, int ny, int nz, int elemSize, void* buffer) noexcept;
    /// New dims: an owned buffer is resized with `zmrealloc`, keeping its leading bytes (on
    /// failure it is freed and the data pointer is null); a view only takes the new dims, so its
    /// owner must provide the memory.
    void resize(int nx, int ny, int nz);
    /// Exchanges the data pointer with \p p. Ownership stays with the object: an owning volume now
    /// owns the memory it got, and the caller the memory it received.
    void swapDataPtr(void*& p) noexcept;
    /// Zeros the volume's bytes. Intended: their count is taken as a 32-bit int, as it always has
    /// been, so a volume of 2 GiB or more is cleared only partly, or not at all when the count
    /// wraps negative.
    void clear() noexcept;

    int sizeX() const noexcept { return m_dims[0]; }
    int sizeY() const noexcept { return m_dims[1]; }
    int sizeZ() const noexcept { return m_dims[2]; }
    const int* getDims() const noexcept { return m_dims; }
    int getElemSize() const noexcept { return m_elemSize; }
    void* dataPtr() const noexcept { return m_data; }
    bool islocal() const noexcept { return m_owned != nullptr; }
    int64_t getNumElems() const noexcept { return int64_t(m_dims[0]) * m_dims[1] * m_dims[2]; }
    /// The element index (ny*z + y)*nx + x.
    int64_t getOffset(int x, int y, int z) const noexcept
    {
        return (int64_t(m_dims[1]) * z + y) * m_dims[0] + x;
    }
    /// The element index of slice coordinates (i, j) in slice \p k of \p orientation.
    int64_t getOffset(int i, int j, int k, int orientation) const noexcept;
    void* address(int x, int y, int z) const noexcept
    {
        return static_cast<unsigned char*>(m_data) + getOffset(x, y, z) * m_elemSize;
    }

    /// Width, height and depth as seen along \p orientation: (ny, nz, nx), (nx, nz, ny), (nx, ny,
    /// nz) for 0, 1, 2.
    void getDims(int orientation, int& w, int& h, int& depth) const noexcept;
    void getDims(int dims[3], int orientation) const noexcept;
    /// The first element of slice \p index and the strides between its elements and its lines.
    void accessSlice(int orientation, int index, void*& ptr, int& elemStride, int& lineStride) const noexcept;
    /// With \p copy 0, \p out becomes a view of the slice with the volume's strides. Otherwise the
    /// slice's elements are copied into the buffer \p out already has, which must be an image of the
    /// slice's width and height with the volume's element size (else nothing is copied).
    void getSlice(int orientation, int index, ZmRawData2D& out, int copy) const;
    /// Copies the image \p in (the slice's width and height, the volume's element size, any strides)
    /// into slice \p index; nothing when it does not match.
    void putSlice(int orientation, int index, const ZmRawData2D& in);

private:
    void release() noexcept;

    int m_dims[3] = {0, 0, 0};
    int m_elemSize = 0;
    void* m_data = nullptr;
    void* m_owned = nullptr;
};
