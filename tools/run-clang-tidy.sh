#!/usr/bin/env bash
# clang-tidy over the library's sources with the checks of .clang-tidy; any finding fails.
# usage: tools/run-clang-tidy.sh BUILD_DIR   (a configured build with compile_commands.json)
set -euo pipefail
build=${1:?usage: run-clang-tidy.sh BUILD_DIR}
cd "$(dirname "$0")/.."
log=$(mktemp)
trap 'rm -f "$log"' EXIT
run-clang-tidy -p "$build" -j "$(nproc)" -quiet "$PWD/src/core/zmlib/.*\\.cpp" >"$log" 2>&1 || true
findings=$(grep -cE '(warning|error): ' "$log" || true)
if [ "$findings" -ne 0 ]; then
  grep -E '(warning|error): ' -A3 "$log" | sed 's/\x1b\[[0-9;]*m//g' >&2
  echo "clang-tidy: $findings finding(s)" >&2
  exit 1
fi
echo "clang-tidy: no findings in $(ls src/core/zmlib/*.cpp | wc -l) library sources"
