#include <zmlib/ZmBox3f.h>
#include <zmlib/ZmBox3i.h>
#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmLibMD5List.h>
#include <zmlib/ZmMat3f.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmPlane.h>
#include <zmlib/ZmVec2f.h>
#include <zmlib/ZmVec2i.h>
#include <zmlib/ZmVec3f.h>
#include <zmlib/ZmVec3l.h>
#include <zmlib/ZmVec4f.h>

#include <cstring>

namespace ZmLib {

void MD5Coder::append(const void* data, uint64_t n) noexcept
{
    if (!m_running) {
        return;
    }
    if (n == 0) {
        // Intended: an empty piece feeds the integer 4711 so that it still changes the digest;
        // stored fingerprints depend on it.
        static const unsigned char k4711[4] = {0x67, 0x12, 0x00, 0x00};
        m_coder.crcMD5Update(k4711, 4);
        return;
    }
    // Intended: the count is passed on as 32 bits, as the stored fingerprints were computed.
    m_coder.crcMD5Update(static_cast<const unsigned char*>(data), static_cast<unsigned int>(n));
}

MD5 MD5Coder::finalize() noexcept
{
    if (m_running) {
        m_coder.crcMD5Final();
        m_running = false;
    }
    return hash();
}

MD5 MD5Coder::hash() const noexcept
{
    unsigned char bytes[16];
    m_coder.crcMD5Query(bytes);
    return MD5::fromBytes(bytes);
}

namespace {

template <class T>
MD5Coder& feed(MD5Coder& coder, const T& v) noexcept
{
    coder.append(&v, sizeof v);
    return coder;
}

// A 64-bit count, then \p n bytes (none for n = 0: the count alone says "empty").
MD5Coder& feedCounted(MD5Coder& coder, const void* data, uint64_t n) noexcept
{
    coder.append(&n, sizeof n);
    if (n != 0) {
        coder.append(data, n);
    }
    return coder;
}

} // namespace

MD5Coder& operator<<(MD5Coder& coder, char v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, unsigned char v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, short v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, unsigned short v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, int v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, unsigned int v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, float v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, int64_t v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, uint64_t v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmUniqueID& v) noexcept
{
    return feed(coder, v.value());
}

MD5Coder& operator<<(MD5Coder& coder, const MD5& v) noexcept
{
    unsigned char bytes[16];
    v.getBytes(bytes);
    coder.append(bytes, 16);
    return coder;
}

MD5Coder& operator<<(MD5Coder& coder, const char* v) noexcept
{
    if (v == nullptr) {
        v = "";
    }
    return feedCounted(coder, v, std::strlen(v) + 1);
}

MD5Coder& operator<<(MD5Coder& coder, const ZmString& v) noexcept
{
    return feedCounted(coder, v.getString(), uint64_t(v.size()));
}

MD5Coder& operator<<(MD5Coder& coder, const std::string& v) noexcept
{
    return feedCounted(coder, v.data(), v.size());
}

MD5Coder& operator<<(MD5Coder& coder, const MD5List& v)
{
    return coder << v.hash();
}

// Geometry values are fed as their bytes: each is its components in storage order and nothing else.
static_assert(sizeof(ZmVec2f) == 8 && sizeof(ZmVec2i) == 8 && sizeof(ZmVec3f) == 12 &&
                  sizeof(ZmVec3i) == 12 && sizeof(ZmVec4f) == 16 && sizeof(ZmPlane) == 16 &&
                  sizeof(ZmVec3l) == 24 && sizeof(ZmBox3f) == 24 && sizeof(ZmBox3i) == 24 &&
                  sizeof(ZmMat3f) == 36 && sizeof(ZmMat4f) == 64,
              "geometry layouts");

MD5Coder& operator<<(MD5Coder& coder, const ZmVec2f& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmVec2i& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmVec3f& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmVec3i& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmVec3l& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmVec4f& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmPlane& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmBox3f& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmBox3i& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmMat3f& v) noexcept
{
    return feed(coder, v);
}
MD5Coder& operator<<(MD5Coder& coder, const ZmMat4f& v) noexcept
{
    return feed(coder, v);
}

} // namespace ZmLib
