/// \file
/// A 4x4 matrix together with its inverse.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMat4f.h>

/// A transform that is inverted often (picking, projecting back and forth): the matrix and its
/// `ZmMat4f::inverse()`, computed once when the matrix is set, so both getters cost nothing.
///
/// Owns the two matrices by value (128 bytes, matrix first). The default constructor leaves both
/// uninitialised, like every geometry value; copies copy both without recomputing. Nothing fails
/// (a singular matrix gets the inverse that `ZmMat4f::inverse()` gives it). Concurrent reads are
/// safe.
class ZMLIB_API ZmMat4fCache {
public:
    ZmMat4fCache() noexcept {}
    explicit ZmMat4fCache(const ZmMat4f& m) noexcept { setMatrix(m); }

    /// Stores \p m and its inverse.
    void setMatrix(const ZmMat4f& m) noexcept;
    const ZmMat4f& getMatrix() const noexcept { return m_matrix; }
    const ZmMat4f& getInvMatrix() const noexcept { return m_invMatrix; }

private:
    ZmMat4f m_matrix;
    ZmMat4f m_invMatrix;
};
