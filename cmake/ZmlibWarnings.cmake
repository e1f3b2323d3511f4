# Warning flags shared by every target of the project (the library, tools, tests, benchmarks).
add_library(zmlib_warnings INTERFACE)
target_compile_options(zmlib_warnings INTERFACE -Wall -Wextra -Wpedantic -Wshadow
                       -Wnon-virtual-dtor -Woverloaded-virtual -Wcast-align)
if(ZMLIB_WERROR)
  target_compile_options(zmlib_warnings INTERFACE -Werror)
endif()
