#!/usr/bin/env bash
# Runs every benchmark program of a build and writes the Markdown report.
#   bench/run-benchmarks.sh BUILD_DIR OUT_MD [benchmark flags...]
# BUILD_DIR is a build with ZMLIB_BUILD_BENCH=ON (preset `release`: build/release); OUT_MD is
# usually docs/benchmarks.md. Further arguments go to every program (for example
# --benchmark_repetitions=15 or --benchmark_filter=printf). Console output goes to the terminal;
# the report gets a header describing the machine and one section per program.
set -euo pipefail

if [ $# -lt 2 ]; then
  echo "usage: $0 BUILD_DIR OUT_MD [benchmark flags...]" >&2
  exit 2
fi
build_dir=$1
out_md=$2
shift 2

bench_dir="$build_dir/bench"
# bench/CMakeLists.txt lists the programs it builds; leftovers of removed targets are not run.
if [ ! -f "$bench_dir/programs.txt" ]; then
  echo "run-benchmarks: $bench_dir/programs.txt missing (configure with ZMLIB_BUILD_BENCH=ON)" >&2
  exit 1
fi
programs=()
while read -r name; do
  [ -n "$name" ] || continue
  if [ ! -x "$bench_dir/$name" ]; then
    echo "run-benchmarks: $bench_dir/$name is not built (run cmake --build first)" >&2
    exit 1
  fi
  programs+=("$bench_dir/$name")
done <"$bench_dir/programs.txt"
if [ ${#programs[@]} -eq 0 ]; then
  echo "run-benchmarks: no benchmark program listed in $bench_dir/programs.txt" >&2
  exit 1
fi

cache_value() { # the value of a CMake cache entry, or empty
  sed -n "s/^$1:[A-Z]*=//p" "$build_dir/CMakeCache.txt" 2>/dev/null | head -n 1
}
cxx=$(cache_value CMAKE_CXX_COMPILER)
build_type=$(cache_value CMAKE_BUILD_TYPE)
build_type_upper=$(printf '%s' "$build_type" | tr '[:lower:]' '[:upper:]')
flags="$(cache_value CMAKE_CXX_FLAGS) $(cache_value "CMAKE_CXX_FLAGS_$build_type_upper")"
flags=$(echo "$flags" | xargs)
shared=$(cache_value ZMLIB_SHARED)
compiler=$("${cxx:-c++}" --version 2>/dev/null | head -n 1 || echo "${cxx:-unknown}")
cpu=$(sed -n 's/^model name[[:space:]]*:[[:space:]]*//p' /proc/cpuinfo | head -n 1)
cores=$(nproc)
kernel=$(uname -sr)
source_dir=$(cd "$(dirname "$0")/.." && pwd)
revision=$(git -C "$source_dir" rev-parse --short HEAD 2>/dev/null || echo unknown)
if [ "$revision" != unknown ] && ! git -C "$source_dir" diff --quiet HEAD 2>/dev/null; then
  revision="$revision with local changes"
fi
load=$(cut -d ' ' -f 1-3 /proc/loadavg)
started=$(date -u '+%Y-%m-%d %H:%M UTC')

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

failed=0
for program in "${programs[@]}"; do
  name=$(basename "$program")
  echo "=== $name"
  status=0
  "$program" --zm_markdown="$work/$name.md" "$@" || status=$?
  if [ $status -ne 0 ]; then
    failed=1
    printf '## %s\n\nThe program failed (exit status %s); no figures.\n\n' "$name" "$status" >"$work/$name.md"
  fi
done

{
  echo "# Benchmarks"
  echo
  echo "Written by \`bench/run-benchmarks.sh\` (\`make bench\`); see \`bench/README.md\`. Do not edit by hand."
  echo
  echo "- Date: $started"
  echo "- Machine: $cpu, $cores cores ($kernel); load average at start: $load"
  echo "- Compiler: $compiler"
  echo "- Build: ${build_type:-unknown} (\`${flags:-no flags}\`), libzmlib $([ "$shared" = OFF ] && echo static || echo shared)"
  echo "- Source: $revision"
  echo
  echo "Each figure is the median over the repetitions of the CPU time per iteration (the repetitions of"
  echo "all benchmarks of a program are interleaved in random order); ratio = zmlib time / peer time, so"
  echo "below 1 the library is faster. A target is met when the ratio, as printed, is at or below it."
  echo "Throughputs are in MiB/s."
  echo
  for program in "${programs[@]}"; do
    cat "$work/$(basename "$program").md"
  done
} >"$work/report.md"
mkdir -p "$(dirname "$out_md")"
cp "$work/report.md" "$out_md"
echo "run-benchmarks: wrote $out_md"
exit $failed
