#include <zmlib/ZmMat4fCache.h>

void ZmMat4fCache::setMatrix(const ZmMat4f& m) noexcept
{
    m_matrix = m;
    m_invMatrix = m.inverse();
}
