#!/usr/bin/env bash
# Builds the Linux build with its benchmarks, runs every benchmark program one
# after another and prints one table of the key figures: each benchmark prints
# lines "SUMMARY <benchmark> | <figure> | <value>", collected here.
#
#   scripts/bench.sh                 full inputs (a few minutes on two cores)
#   BENCH_QUICK=1 scripts/bench.sh   small inputs, well under a minute
#   BENCH_BUILD=folder               another build folder than build/linux
#
# The benchmarks write their data under the system temporary folder (TMPDIR);
# the ingest figures depend on that disk. Each program's whole output is kept
# in the build folder's bench-results/.
set -uo pipefail
cd "$(dirname "$0")/.."

build=${BENCH_BUILD:-build/linux}
quick=${BENCH_QUICK:-0}
results=$build/bench-results

step() { printf '\n=== %s\n' "$*"; }

targets=()
for source in bench/*_bench.cpp; do
  name=$(basename "$source" _bench.cpp)
  targets+=("bench_$name")
done

step "Build (${targets[*]})"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DALERTSUMMARY_BENCH=ON >/dev/null || exit 1
cmake --build "$build" -j"$(nproc)" --target "${targets[@]}" || exit 1

# Arguments per program; quick mode shrinks the inputs, not the method.
arguments() {
  if [[ "$quick" == 1 ]]; then
    case "$1" in
      bench_extract) echo 500 ;;
      bench_store) echo 100000 ;;
      bench_collect_ingest) echo 200 1 0 ;;
      bench_collect_idle) echo 50000 3 ;;
    esac
  else
    case "$1" in
      bench_collect_ingest) echo 2000 3 1 ;;
      bench_collect_idle) echo 100000 5 ;;
    esac
  fi
}

line_buffered=()
command -v stdbuf >/dev/null && line_buffered=(stdbuf -oL)

mkdir -p "$results"
summary=()
failed=0
for target in "${targets[@]}"; do
  program=$build/bench/$target
  read -r -a args <<<"$(arguments "$target")"
  step "$target ${args[*]}"
  started=$SECONDS
  "${line_buffered[@]}" "$program" "${args[@]}" 2>&1 | tee "$results/$target.txt"
  status=${PIPESTATUS[0]}
  printf '(%d s)\n' $((SECONDS - started))
  if [[ $status -ne 0 ]]; then
    summary+=("SUMMARY ${target#bench_} | FAILED (exit $status) | -")
    failed=1
  fi
  while IFS= read -r line; do summary+=("$line"); done < <(grep '^SUMMARY ' "$results/$target.txt")
done

step "Summary$([[ "$quick" == 1 ]] && echo ' (quick mode: small inputs)')"
printf '%s\n' "${summary[@]}" | awk -F' [|] ' '
  { sub(/^SUMMARY /, "", $1); name[NR] = $1; figure[NR] = $2; value[NR] = $3
    if (length($1) > w1) w1 = length($1); if (length($2) > w2) w2 = length($2) }
  END {
    format = "%-" w1 "s  %-" w2 "s  %s\n"
    printf format, "benchmark", "figure", "value"
    for (i = 1; i <= NR; i++) printf format, name[i], figure[i], value[i]
  }'
exit $failed
