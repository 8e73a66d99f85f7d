#!/usr/bin/env bash
# Builds the project and runs the whole test suite, then the suite again under
# AddressSanitizer + UndefinedBehaviorSanitizer, the thread tests under
# ThreadSanitizer, and every fuzz target for a bounded time.
#   SKIP_SANITIZERS=1  skip the ASan/UBSan and TSan steps
#   SKIP_FUZZ=1        skip the fuzzing step
#   FUZZ_SECONDS       time per fuzz target (default 60)
# Every step runs even when an earlier one failed; the exit status is non-zero
# when any failed.
set -uo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
jobs=$(nproc)
failed=()
times=()

step() {
  local name=$1; shift
  local start=$SECONDS
  echo "=== $name"
  if "$@"; then
    times+=("$(printf '%-12s %5ds ok' "$name" $((SECONDS - start)))")
  else
    times+=("$(printf '%-12s %5ds FAILED' "$name" $((SECONDS - start)))")
    failed+=("$name")
  fi
}

# The damage sweeps run in the sanitizer pass only, where a fault they provoke
# is also caught.
plain() {
  cmake -S "$root" -B "$root/build" -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null &&
  cmake --build "$root/build" -j"$jobs" &&
  (cd "$root/build" && ctest --output-on-failure -j"$jobs" -E 'SweepTest')
}

# Sanitizer builds: tests only, -O1 so that the suite runs in reasonable time.
#   sanitized DIR SANITIZERS [CMAKE_ARGS...]
sanitized() {
  local dir=$1 sanitizers=$2; shift 2
  cmake -S "$root" -B "$root/$dir" -DCMAKE_BUILD_TYPE=Debug -DCMAKE_CXX_FLAGS_DEBUG="-O1 -g" \
        -DCMAKE_C_FLAGS_DEBUG="-O1 -g" -DMEDIAEDITOR_SANITIZE="$sanitizers" \
        -DMEDIAEDITOR_BUILD_BENCH=OFF -DMEDIAEDITOR_BUILD_TOOLS=OFF "$@" >/dev/null &&
  cmake --build "$root/$dir" -j"$jobs"
}

# One clang build serves the ASan+UBSan test run and the fuzz step: the fuzz
# targets are built into it, the whole tree carrying libFuzzer's coverage.
asan() {
  sanitized build-asan address,undefined -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
            -DMEDIAEDITOR_BUILD_FUZZ=ON &&
  (cd "$root/build-asan" && ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 \
     UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 ctest --output-on-failure -j"$jobs")
}

# The thread tests are the suites named *Concurrency* or *Stress*; they are
# short, so each runs a few times to meet more interleavings.
tsan() {
  sanitized build-tsan thread &&
  (cd "$root/build-tsan" && TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1 \
     ctest --output-on-failure -j"$jobs" --no-tests=error -R 'Concurrency|Stress' --repeat until-fail:5)
}

step deps "$root/scripts/deps.sh" --fuzz
step build+test plain
if [ "${SKIP_SANITIZERS:-0}" != "1" ]; then
  step asan+ubsan asan
  step tsan tsan
  fuzz_build="$root/build-asan"
else
  fuzz_build=""  # fuzz.sh makes its own
fi
if [ "${SKIP_FUZZ:-0}" != "1" ]; then
  step fuzz env FUZZ_SECONDS="${FUZZ_SECONDS:-60}" FUZZ_BUILD="$fuzz_build" "$root/scripts/fuzz.sh"
fi

echo "=== step times"
printf '%s\n' "${times[@]}"
if [ ${#failed[@]} -gt 0 ]; then
  echo "FAILED: ${failed[*]}"
  exit 1
fi
