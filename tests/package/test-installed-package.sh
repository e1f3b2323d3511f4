#!/usr/bin/env bash
# Installs the build into a scratch prefix and proves the package from the outside:
#  - no installed header includes an operating-system header;
#  - examples/ configures with find_package(zmlib CONFIG), builds and runs;
#  - the same program builds with the flags of zmlib.pc alone, in C++17 and in C++20, and a C++14
#    build is refused with a clear message;
#  - the installed zmtool starts without any library path set, also after the prefix is moved.
# usage: test-installed-package.sh BUILD_DIR EXAMPLES_DIR CXX
set -euo pipefail
build=$1 examples=$2 cxx=$3
work=$(mktemp -d "${TMPDIR:-/tmp}/zmlib-package.XXXXXX")
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

cmake --install "$build" --prefix "$prefix" >/dev/null

bad=$(grep -lE '#\s*include\s*<(pthread\.h|dlfcn\.h|unistd\.h|sys/|netinet/|arpa/|windows\.h)' \
      "$prefix"/include/zmlib/*.h || true)
if [ -n "$bad" ]; then
  echo "installed headers include operating-system headers: $bad" >&2
  exit 1
fi
[ -f "$prefix/include/zmlib/zmlib.h" ] || { echo "umbrella header not installed" >&2; exit 1; }
for h in "$prefix"/include/zmlib/*.h; do
  name=$(basename "$h")
  [ "$name" = zmlib.h ] && continue
  grep -q "#include <zmlib/$name>" "$prefix/include/zmlib/zmlib.h" ||
    { echo "zmlib.h does not include $name" >&2; exit 1; }
done

expected='zmlib [0-9.]+: 5 fields, 2 match scan_\*: scan_001.dcm scan_002.raw'

cmake -S "$examples" -B "$work/cmake-consumer" -G Ninja -DCMAKE_CXX_COMPILER="$cxx" \
      -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/cmake-consumer" >/dev/null
out=$("$work/cmake-consumer/split_header")
echo "find_package consumer: $out"
[[ $out =~ ^$expected$ ]] || { echo "unexpected output from the CMake consumer" >&2; exit 1; }

export PKG_CONFIG_PATH=$prefix/lib/pkgconfig
for std in c++17 c++20; do
  # shellcheck disable=SC2046
  "$cxx" -std=$std "$examples/split_header.cpp" -o "$work/pc-consumer" $(pkg-config --cflags --libs zmlib)
  out=$(LD_LIBRARY_PATH=$prefix/lib "$work/pc-consumer")
  echo "pkg-config consumer ($std): $out"
  [[ $out =~ ^$expected$ ]] || { echo "unexpected output from the pkg-config consumer" >&2; exit 1; }
done
# The consumer's own standard must be the one in effect (the package's flags may not override it),
# and a standard older than C++17 is refused with the library's message.
# shellcheck disable=SC2046
"$cxx" -std=c++20 -fsyntax-only -x c++ - $(pkg-config --cflags zmlib) <<<'#include <zmlib/zmlib.h>
static_assert(__cplusplus >= 202002L, "the package flags replaced the consumer standard");' ||
  { echo "a C++20 consumer is not compiled as C++20 with the package flags" >&2; exit 1; }
# shellcheck disable=SC2046
if "$cxx" -std=c++14 -fsyntax-only -x c++ - $(pkg-config --cflags zmlib) <<<'#include <zmlib/zmlib.h>' \
     2>"$work/cxx14.err"; then
  echo "a C++14 build of the headers was not refused" >&2; exit 1
fi
grep -q 'zmlib needs C++17 or later' "$work/cxx14.err" ||
  { echo "a C++14 build failed without the library's message:" >&2; head -5 "$work/cxx14.err" >&2; exit 1; }
# The installed zmtool, with no library path: it must find libzmlib through its own run path,
# and still after the whole prefix has moved.
printf 'installed zmtool\n' >"$work/sample.txt"
want=$(cd "$work" && md5sum sample.txt)
for dir in "$prefix" "$work/moved"; do
  [ "$dir" = "$prefix" ] || mv "$prefix" "$dir"
  got=$(cd "$work" && env -u LD_LIBRARY_PATH "$dir/bin/zmtool" md5 sample.txt)
  [ "$got" = "$want" ] || { echo "installed zmtool in $dir printed '$got', md5sum '$want'" >&2; exit 1; }
  if env -u LD_LIBRARY_PATH "$dir/bin/zmtool" md5 "$work/no-such-file" >/dev/null 2>&1; then
    echo "installed zmtool reported success for a missing file" >&2; exit 1
  fi
done
echo "installed zmtool OK: $want"

echo "installed package OK"
