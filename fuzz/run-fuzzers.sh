#!/usr/bin/env bash
# Runs every libFuzzer target built in BUILD_DIR for SECONDS seconds each, one after the other.
#   fuzz/run-fuzzers.sh BUILD_DIR SECONDS [TARGET...]
# Each target works on a fresh scratch copy of its seed corpus (BUILD_DIR/fuzz-work/<target>), so
# the committed corpus is never flooded; crash, leak and time-out inputs go to
# BUILD_DIR/fuzz-artifacts, the full output to BUILD_DIR/fuzz-logs/<target>.log. One summary line
# per target; the exit status is non-zero when any target failed or was not built.
set -uo pipefail

if [ $# -lt 2 ]; then
  echo "usage: $0 BUILD_DIR SECONDS [TARGET...]" >&2
  exit 2
fi
build=$1
seconds=$2
shift 2
here=$(cd "$(dirname "$0")" && pwd)

targets=("$@")
if [ ${#targets[@]} -eq 0 ]; then
  for src in "$here"/fuzz_*.cpp; do
    targets+=("$(basename "$src" .cpp)")
  done
fi

work=$build/fuzz-work
artifacts=$build/fuzz-artifacts
logs=$build/fuzz-logs
mkdir -p "$work" "$artifacts" "$logs"

failed=0
printf '%-32s %6s %12s %7s %7s %7s  %s\n' target seconds runs cov ft corpus result
for name in "${targets[@]}"; do
  bin=$build/fuzz/$name
  if [ ! -x "$bin" ]; then
    printf '%-32s %6s %12s %7s %7s %7s  %s\n' "$name" - - - - - "NOT BUILT ($bin)"
    failed=1
    continue
  fi
  rm -rf "${work:?}/$name"
  mkdir -p "$work/$name"
  if [ -d "$here/corpus/$name" ]; then
    cp -R "$here/corpus/$name/." "$work/$name/"
  fi
  log=$logs/$name.log
  start=$(date +%s)
  # -timeout: any single input running longer than 10 s counts as a hang.
  "$bin" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 -print_final_stats=1 \
    -artifact_prefix="$artifacts/$name-" "$work/$name" >"$log" 2>&1
  rc=$?
  elapsed=$(($(date +%s) - start))
  runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log" | tail -n 1)
  cov=$(grep -o 'cov: [0-9]*' "$log" | tail -n 1 | cut -d' ' -f2)
  ft=$(grep -o 'ft: [0-9]*' "$log" | tail -n 1 | cut -d' ' -f2)
  corpus=$(find "$work/$name" -type f | wc -l)
  if [ $rc -eq 0 ]; then
    result=ok
  else
    failed=1
    artifact=$(sed -n 's/.*Test unit written to //p' "$log" | tail -n 1)
    what=$(grep -m 1 -oE 'ERROR: (AddressSanitizer|UndefinedBehaviorSanitizer|libFuzzer|LeakSanitizer): [^ ]+( [^ ]+)?|runtime error: .*|check failed: .*' "$log")
    result="FAILED (exit $rc${what:+: $what}${artifact:+; input $artifact}; log $log)"
  fi
  printf '%-32s %6s %12s %7s %7s %7s  %s\n' "$name" "$elapsed" "${runs:-?}" "${cov:-?}" "${ft:-?}" "$corpus" "$result"
done
exit $failed
