// zmtool demo: an end-to-end walk through the library on built-in sample data.
#include "zmtool.h"

#include <zmlib/zmlib.h>

#include <cstdio>

int zmtool::runDemo(int, char**)
{
    std::printf("zmlib demo\n");
    return 0;
}
