#!/usr/bin/env bash
# Keeps the platform layer in place: in the library's sources, only the *_posix.cpp files and the
# private *_p.h headers may include an operating-system header, and no installed header may carry
# an architecture intrinsic. The files listed in PENDING still hold POSIX calls of their own
# (recorded in docs/porting.md); the list may only shrink.
# usage: check-platform-layer.sh SOURCE_DIR
set -euo pipefail
src=$1/src/core/zmlib
os_headers='#\s*include\s*<(pthread\.h|dlfcn\.h|unistd\.h|sys/[a-z/]+\.h|netinet/|arpa/|fcntl\.h|dirent\.h|signal\.h|strings\.h|time\.h|ifaddrs\.h|net/|semaphore\.h|spawn\.h)'
PENDING="ZmDirectory.cpp ZmFilename.cpp ZmLogFile.cpp ZmSharedMem.cpp ZmThread.cpp ZmTmpDir.cpp"
bad=()
for f in "$src"/*.cpp "$src"/*.h; do
  name=$(basename "$f")
  case "$name" in *_posix.cpp | *_p.h) continue ;; esac
  [[ " $PENDING " == *" $name "* ]] && continue
  grep -qE "$os_headers" "$f" && bad+=("$name")
done
for f in "$src"/*.h; do
  case "$(basename "$f")" in *_p.h) continue ;; esac
  grep -qE '#\s*include\s*<[a-z0-9]*intrin\.h>|__m128|_mm_' "$f" && bad+=("$(basename "$f") (intrinsics)")
done
for name in $PENDING; do
  [ -f "$src/$name" ] && grep -qE "$os_headers" "$src/$name" ||
    { echo "$name no longer needs to be listed as pending: take it off the list" >&2; exit 1; }
done
if [ ${#bad[@]} -ne 0 ]; then
  echo "operating-system code outside the platform files: ${bad[*]}" >&2
  exit 1
fi
echo "platform layer OK (pending: $PENDING)"
