#!/usr/bin/env bash
# Installs the build into a scratch prefix and proves the package from the outside:
#  - no installed header includes an operating-system header;
#  - examples/ configures with find_package(zmlib CONFIG), builds and runs;
#  - the same program builds with the flags of zmlib.pc alone.
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
# shellcheck disable=SC2046
"$cxx" "$examples/split_header.cpp" -o "$work/pc-consumer" $(pkg-config --cflags --libs zmlib)
out=$(LD_LIBRARY_PATH=$prefix/lib "$work/pc-consumer")
echo "pkg-config consumer:   $out"
[[ $out =~ ^$expected$ ]] || { echo "unexpected output from the pkg-config consumer" >&2; exit 1; }
echo "installed package OK"
