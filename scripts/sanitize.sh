#!/usr/bin/env bash
# Sanitizer builds of the Linux tree; any report fails the script.
#   1. build/asan: AddressSanitizer + UndefinedBehaviorSanitizer (with
#      LeakSanitizer), the whole ctest suite but the slow e2e label.
#   2. build/tsan: ThreadSanitizer, the tests that run threads against each
#      other (selection below).
#   scripts/sanitize.sh            both
#   scripts/sanitize.sh asan|tsan  one of them
#   SANITIZE_E2E=1 scripts/sanitize.sh asan   the e2e label too (slow; leak
#                                             checking off there, see below)
set -euo pipefail
cd "$(dirname "$0")/.."

which=${1:-all}
jobs=$(nproc)
export TZ=UTC
export CTEST_OUTPUT_ON_FAILURE=1

# Every report is fatal, names its stack, and ends the process with an abort
# that ctest sees as a failure (the builds also carry -fno-sanitize-recover).
export ASAN_OPTIONS=halt_on_error=1:abort_on_error=1:print_stacktrace=1:detect_leaks=1:strict_init_order=1:check_initialization_order=1:detect_stack_use_after_return=1
export UBSAN_OPTIONS=halt_on_error=1:abort_on_error=1:print_stacktrace=1
# The processing thread's objects are left allocated on purpose; see the file.
export LSAN_OPTIONS=print_suppressions=0:suppressions=$PWD/tests/sanitizers/lsan.supp
# glibc's own locale loading is suppressed; see the file.
export TSAN_OPTIONS=halt_on_error=1:abort_on_error=1:second_deadlock_stack=1:history_size=4:suppressions=$PWD/tests/sanitizers/tsan.supp

# The tests of the ThreadSanitizer build: all of test_entry (the processing
# thread), and from the other programs the tests whose names say they run
# threads against each other.
tsan_labels='^entry$'
tsan_other_labels='^(log|store|collect|faults)$'
tsan_regex='Concurren|Stress|ProcessingThread|BusyBudget'

step() { printf '\n=== %s\n' "$*"; }

configure() {
  # GCC: its sanitizer runtimes come with g++ and, unlike clang's, are linked
  # into the shared library too, which the library's -Wl,--no-undefined needs.
  CC=gcc CXX=g++ cmake -S . -B "$1" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
    -DALERTSUMMARY_SANITIZE="$2" -DALERTSUMMARY_BENCH=OFF >/dev/null
}

if [[ "$which" == all || "$which" == asan ]]; then
  step "AddressSanitizer + UndefinedBehaviorSanitizer build"
  configure build/asan address,undefined
  targets=()
  if [[ "${SANITIZE_E2E:-0}" != 1 ]]; then
    # Without the e2e label only the test programs run; the library and the
    # tools (the slowest part of the build) need not be built.
    for dir in tests/*/; do
      name=$(basename "$dir")
      [[ "$name" != support ]] && compgen -G "$dir*.cpp" >/dev/null && targets+=(--target "test_$name")
    done
  fi
  cmake --build build/asan -j"$jobs" "${targets[@]}"
  step "AddressSanitizer + UndefinedBehaviorSanitizer: whole test suite"
  (cd build/asan && ctest -j"$jobs" --timeout 600 -LE '^e2e$')
  if [[ "${SANITIZE_E2E:-0}" == 1 ]]; then
    # A host that unloads the library leaves behind what the library keeps
    # for its detached thread (environment, application, thread objects); with
    # the library unmapped no frame names them, so no suppression can. Leak
    # checking stays on for every other test.
    (cd build/asan && ASAN_OPTIONS=$ASAN_OPTIONS:detect_leaks=0 ctest --timeout 600 -L '^e2e$')
  fi
fi

if [[ "$which" == all || "$which" == tsan ]]; then
  step "ThreadSanitizer build"
  configure build/tsan thread
  cmake --build build/tsan -j"$jobs" --target test_log test_store test_collect test_entry test_faults
  step "ThreadSanitizer: concurrency tests"
  # -j1: the tests time threads against each other, and the machine is small.
  (cd build/tsan && ctest --timeout 900 -L "$tsan_labels" --no-tests=error)
  (cd build/tsan && ctest --timeout 900 -L "$tsan_other_labels" -R "$tsan_regex" --no-tests=error)
fi

step "Sanitizer builds clean"
