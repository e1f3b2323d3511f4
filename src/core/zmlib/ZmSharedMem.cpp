#include <zmlib/ZmSharedMem.h>
#include <zmlib/ZmSharedMem_p.h>

#include <cstdint>

void ZmSharedMemPrivate::destroy(ZmSharedMemPrivate* d)
{
    zmSharedMemRelease(*d);
    delete d;
}

ZmSharedMem::ZmSharedMem() : m_d(new ZmSharedMemPrivate)
{}

// Copies share the attachment on purpose: both return the same view, and the last one releases it.
ZmSharedMem::ZmSharedMem(const ZmSharedMem& other) : m_d(ZmSharedPart<ZmSharedMemPrivate>::share(other.m_d))
{}

ZmSharedMem& ZmSharedMem::operator=(const ZmSharedMem& other)
{
    if (this != &other) {
        ZmSharedPart<ZmSharedMemPrivate>::assign(m_d, other.m_d);
    }
    return *this;
}

ZmSharedMem::~ZmSharedMem()
{
    ZmSharedPart<ZmSharedMemPrivate>::release(m_d);
}

char* ZmSharedMem::buffer(const char* name, uint64_t size)
{
    if (m_d->valid) {
        return m_d->view;
    }
    // An earlier call may have opened the object without mapping it; start from scratch.
    zmSharedMemRelease(*m_d);
    const uint64_t granule = zmSharedMemGranularity();
    // Intended: always one granule more than size rounded down, even when size is a whole number
    // of granules.
    const uint64_t granules = size / granule + 1;
    if (granules > uint64_t(INT64_MAX) / granule) {
        return nullptr;
    }
    return zmSharedMemAttach(*m_d, name, granules * granule) ? m_d->view : nullptr;
}
