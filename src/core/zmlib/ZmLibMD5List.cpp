#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmLibMD5List.h>

namespace ZmLib {

namespace {

int compareDigests(const MD5& a, const MD5& b)
{
    return MD5::compare(a, b);
}

} // namespace

void MD5List::insert(const MD5& d)
{
    m_hash = MD5();
    if (m_sorted) {
        m_values.insertSorted(d, compareDigests);
    } else {
        m_values.append(d);
    }
}

MD5 MD5List::hash() const
{
    if (!m_hash.value().isValid()) {
        MD5Coder coder;
        // Intended: last value first; stored combined fingerprints were computed in this order.
        for (int64_t i = m_values.size() - 1; i >= 0; --i) {
            coder << m_values[i];
        }
        m_hash = coder.finalize();
    }
    return m_hash;
}

} // namespace ZmLib
