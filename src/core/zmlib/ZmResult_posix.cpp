#include <zmlib/ZmResult_p.h>

#include <cstring>

const char* zmSystemErrorText(int error, char* buffer, size_t size)
{
    // The GNU form: it returns the text, which need not be in the buffer.
    return strerror_r(error, buffer, size);
}
