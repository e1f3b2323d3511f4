// The platform's case-insensitive comparisons and re-entrant tokenizer behind ZmString.
#include <zmlib/ZmString.h>

#include <cstring>
#include <strings.h>

int ZmString::strcasecmp(const char* a, const char* b)
{
    return ::strcasecmp(a, b);
}

int ZmString::strncasecmp(const char* a, const char* b, uint64_t n)
{
    return ::strncasecmp(a, b, n);
}

char* ZmString::strtok(char* s, const char* delims, char** context)
{
    return ::strtok_r(s, delims, context);
}
