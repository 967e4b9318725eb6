#!/usr/bin/env bash
# Builds the libFuzzer targets (clang, AddressSanitizer and
# UndefinedBehaviorSanitizer) and runs each for a bounded time from a fresh
# copy of its seed corpus fuzz/corpus/<target>/; the repository is never
# written. A crash, leak, timeout, out-of-memory or sanitizer report fails the
# script and names the reproducer.
#   scripts/fuzz.sh                       every target, 30 s each
#   FUZZ_SECONDS=600 scripts/fuzz.sh mail collect   chosen targets, 10 min each
set -euo pipefail
cd "$(dirname "$0")/.."

seconds=${FUZZ_SECONDS:-30}
build=build/fuzz
run=$build/run

if (($#)); then
  targets=("$@")
else
  targets=()
  for file in fuzz/*_fuzz.cpp; do
    name=$(basename "$file" .cpp)
    targets+=("${name%_fuzz}")
  done
fi

CC=clang CXX=clang++ cmake -S . -B "$build" -G Ninja -DALERTSUMMARY_FUZZ=ON \
  -DALERTSUMMARY_TESTS=OFF -DALERTSUMMARY_BENCH=OFF >/dev/null
cmake --build "$build" -j"$(nproc)" --target "${targets[@]/#/fuzz_}"

# Reports end the process so libFuzzer records the input; stacks are printed.
export ASAN_OPTIONS=print_stacktrace=1:detect_leaks=1
export UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1

failed=()
summary=()
for target in "${targets[@]}"; do
  work=$run/$target
  rm -rf "$work"
  mkdir -p "$work/corpus" "$work/artifacts"
  [[ -d fuzz/corpus/$target ]] && cp -R "fuzz/corpus/$target/." "$work/corpus/"
  printf '\n=== fuzz_%s for %s s\n' "$target" "$seconds"
  status=0
  "$build/fuzz/fuzz_$target" -max_total_time="$seconds" -timeout=30 -rss_limit_mb=2048 \
    -print_final_stats=1 -artifact_prefix="$work/artifacts/" "$work/corpus" \
    >"$work/log.txt" 2>&1 || status=$?
  runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$work/log.txt" | tail -1)
  if ((status != 0)); then
    tail -n 60 "$work/log.txt"
    reproducer=$(sed -n 's/.*Test unit written to \(.*\)$/\1/p' "$work/log.txt" | tail -1)
    echo "fuzz_$target FAILED (exit $status); reproducer: ${reproducer:-none written}"
    [[ -n "$reproducer" ]] && echo "  rerun: $build/fuzz/fuzz_$target $reproducer"
    failed+=("$target")
    summary+=("fuzz_$target: FAILED after ${runs:-?} executions, log $work/log.txt")
  else
    summary+=("fuzz_$target: ${runs:-?} executions clean in $seconds s")
  fi
done

printf '\n=== Fuzzing summary\n'
printf '%s\n' "${summary[@]}"
if ((${#failed[@]})); then
  echo "fuzzing failed: ${failed[*]}"
  exit 1
fi
