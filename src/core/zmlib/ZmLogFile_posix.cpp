#include <zmlib/ZmLogFile_p.h>

#include <unistd.h>

FILE* zmLogOpenConsole()
{
    // "e": close-on-exec.
    return std::fopen("/dev/tty", "we");
}

void zmLogRedirectStandardError()
{
    ::dup2(::fileno(stdout), STDERR_FILENO);
}
