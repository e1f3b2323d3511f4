// The platform step of ZmDArray::sort: glibc's qsort_r takes the context as the comparison's
// third argument (the BSD and Windows forms order the arguments differently).
#include <zmlib/ZmDArray.h>

#include <cstdlib>

void zmSortWithContext(void* base, size_t n, size_t size, int (*compare)(const void*, const void*, void*),
                       void* context)
{
    ::qsort_r(base, n, size, compare, context);
}
