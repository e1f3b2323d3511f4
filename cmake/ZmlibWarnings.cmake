# Warning flags shared by every target of the project (the library, tools, tests, benchmarks).
add_library(zmlib_warnings INTERFACE)
target_compile_options(zmlib_warnings INTERFACE -Wall -Wextra -Wpedantic -Wshadow
                       -Wnon-virtual-dtor -Woverloaded-virtual -Wcast-align)
if(ZMLIB_WERROR)
  target_compile_options(zmlib_warnings INTERFACE -Werror)
endif()
# Library only, under Clang: no global constructors or destructors (process-wide state is created
# on first use; test registrations are global objects by design), and the lock analysis over the
# annotated mutex and the classes with lock rules (the tests misuse locks on purpose).
add_library(zmlib_library_warnings INTERFACE)
if(CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  target_compile_options(zmlib_library_warnings INTERFACE -Wglobal-constructors -Wthread-safety)
endif()
