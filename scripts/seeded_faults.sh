#!/usr/bin/env bash
# Seeds one-line faults into the code, one at a time, and tells which of them
# the suite catches. Not part of CI: it rebuilds a test program per fault and
# takes a while (run it on a quiet machine, one core is enough).
#
#   scripts/seeded_faults.sh [LIST] [FILTER]
#
# LIST (default scripts/seeded_faults.txt) holds one fault per line:
#   path | exact original text | replacement | label[,label...] | what it breaks
# The original text must occur exactly once in the file; <NL> stands for a
# line end inside it (for a line that is not unique on its own). The labels name the
# ctest labels to run (and the test_<label> programs to rebuild); e2e never
# runs. FILTER, a regular expression, keeps only the lines that match.
# Lines starting with '#' and blank lines are skipped. Every file is restored
# after its fault, also when the script is interrupted.
#
# Environment: BUILD_DIR (default build/linux), JOBS (ninja -j, default 1).
set -u
cd "$(dirname "$0")/.."
list=${1:-scripts/seeded_faults.txt}
filter=${2:-}
build=${BUILD_DIR:-build/linux}
jobs=${JOBS:-1}
work=$(mktemp -d)
backup=""
target_file=""

restore() {
  if [ -n "$backup" ] && [ -f "$backup" ]; then
    # A plain copy gives the file a new time, so ninja rebuilds from it.
    cat "$backup" > "$target_file"
    rm -f "$backup"
  fi
  backup=""
}
trap 'restore; rm -rf "$work"' EXIT
trap 'echo "interrupted: file restored" >&2; exit 130' INT TERM

[ -f "$build/build.ninja" ] || { echo "configure $build first (cmake -G Ninja)" >&2; exit 2; }
# Read from a copy, so the list can be edited while a run goes on.
cp "$list" "$work/list"

# Splits a list line into its five fields, one per line of output.
split_line() {
  python3 -c 'import sys
f = [p.strip() for p in sys.argv[1].split(" | ")]
if len(f) == 4: f.append("")
if len(f) != 5: sys.exit(1)
print("\n".join(f))' "$1"
}

# Replaces the one occurrence of ORIGINAL in FILE; exit 3 when it is missing
# or occurs more than once.
apply_fault() {
  python3 -c 'import sys
path, old, new = (a.replace("<NL>", "\n") for a in sys.argv[1:4])
text = open(path, encoding="utf-8").read()
if text.count(old) != 1: sys.exit(3)
open(path, "w", encoding="utf-8").write(text.replace(old, new))' "$1" "$2" "$3"
}

total=0
caught=0
rows=()
built=()
while IFS= read -r line || [ -n "$line" ]; do
  case "$line" in ''|'#'*) continue ;; esac
  if [ -n "$filter" ] && ! printf '%s\n' "$line" | grep -Eq -- "$filter"; then continue; fi
  if ! fields=$(split_line "$line"); then
    echo "bad line: $line" >&2
    continue
  fi
  mapfile -t f <<<"$fields"
  path=${f[0]} original=${f[1]} replacement=${f[2]} labels=${f[3]} what=${f[4]:-${f[1]}}
  name="${path#src/}: $what"
  if [ ! -f "$path" ]; then
    rows+=("$(printf '%-8s %-14s %s' "$labels" "NO FILE" "$name")")
    continue
  fi
  target_file=$path
  backup="$work/backup"
  cp "$path" "$backup"
  if ! apply_fault "$path" "$original" "$replacement"; then
    restore
    rows+=("$(printf '%-8s %-14s %s' "$labels" "TEXT NOT ONCE" "$name")")
    continue
  fi
  targets=()
  for label in ${labels//,/ }; do
    if ninja -C "$build" -t query "test_$label" > /dev/null 2>&1; then targets+=("test_$label"); fi
  done
  built+=("${targets[@]}")
  echo "== $name" >&2
  if [ ${#targets[@]} -gt 0 ] && ! ninja -C "$build" -j "$jobs" "${targets[@]}" > "$work/build.log" 2>&1; then
    restore
    rows+=("$(printf '%-8s %-14s %s' "$labels" "NO BUILD" "$name")")
    tail -5 "$work/build.log" >&2
    continue
  fi
  regex="^(${labels//,/|})\$"
  total=$((total + 1))
  if ctest --test-dir "$build" -LE e2e -L "$regex" --timeout 120 > "$work/test.log" 2>&1; then
    result="MISSED"
    by=""
  else
    result="caught"
    caught=$((caught + 1))
    by=$(sed -n 's/^[[:space:]]*[0-9]* - \([^ ]*\) .*/\1/p' "$work/test.log" | head -2 | paste -sd' ')
  fi
  restore
  rows+=("$(printf '%-8s %-14s %s%s' "$labels" "$result" "$name" "${by:+  <- $by}")")
done < "$work/list"

# Rebuild from the restored sources, so the build folder holds the real code again.
if [ ${#built[@]} -gt 0 ]; then
  ninja -C "$build" -j "$jobs" $(printf '%s\n' "${built[@]}" | sort -u) > /dev/null 2>&1 || true
fi

printf '%-8s %-14s %s\n' "label" "result" "fault  <- first failing tests"
printf '%s\n' "${rows[@]}"
if [ "$total" -gt 0 ]; then
  printf 'caught %d of %d (%d%%)\n' "$caught" "$total" $((100 * caught / total))
fi
