// ZmThreadLocalStorageBase is a thin layer over the POSIX thread-specific key: all platform code.
#include <zmlib/ZmThreadLocalStorageBase.h>

#include <pthread.h>

struct ZmThreadLocalStorageKey {
    pthread_key_t key;
};

ZmThreadLocalStorageBase::ZmThreadLocalStorageBase() : ZmThreadLocalStorageBase(nullptr)
{}

ZmThreadLocalStorageBase::ZmThreadLocalStorageBase(void (*destructor)(void*))
    : m_key(new ZmThreadLocalStorageKey)
{
    pthread_key_create(&m_key->key, destructor);
}

ZmThreadLocalStorageBase::~ZmThreadLocalStorageBase()
{
    if (pthread_key_delete(m_key->key) == 0) {
        delete m_key;
    }
}

void* ZmThreadLocalStorageBase::get() const
{
    return pthread_getspecific(m_key->key);
}

void ZmThreadLocalStorageBase::set(void* value)
{
    pthread_setspecific(m_key->key, value);
}
