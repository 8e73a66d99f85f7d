#!/usr/bin/env bash
# Builds the libFuzzer targets with clang (AddressSanitizer + UndefinedBehavior-
# Sanitizer) and runs each for a bounded time, seeded from the test media and
# the saved regression inputs. Fails on any finding; the input that caused it is
# left in findings/ of the build (build-fuzz/findings by default).
#   FUZZ_SECONDS  time per target (default 60)
#   FUZZ_JOBS     targets run side by side (default: the number of cores)
#   FUZZ_TARGETS  names to run (default: every fuzz_* target)
#   FUZZ_BUILD    an existing clang build configured with MEDIAEDITOR_BUILD_FUZZ
#                 and address,undefined (default: build-fuzz, made here)
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
seconds=${FUZZ_SECONDS:-60}
jobs=${FUZZ_JOBS:-$(nproc)}
build=${FUZZ_BUILD:-}

"$root/scripts/deps.sh" --fuzz
if [ -z "$build" ]; then
  build="$root/build-fuzz"
  CC=clang CXX=clang++ cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo \
    -DMEDIAEDITOR_BUILD_FUZZ=ON -DMEDIAEDITOR_SANITIZE=address,undefined \
    -DMEDIAEDITOR_BUILD_TESTS=OFF -DMEDIAEDITOR_BUILD_BENCH=OFF -DMEDIAEDITOR_BUILD_TOOLS=OFF >/dev/null
fi
cmake --build "$build" -j"$(nproc)"

seeds="$build/seeds"
rm -rf "$seeds" "$build/findings" && mkdir -p "$seeds" "$build/findings"
python3 "$root/fuzz/make_seeds.py" "$root/tests/media" "$seeds"

targets=${FUZZ_TARGETS:-$(cd "$build/bin" && ls fuzz_*)}

fuzz_env() { ASAN_OPTIONS=detect_leaks=1:allocator_may_return_null=1 UBSAN_OPTIONS=print_stacktrace=1 "$@"; }

# A libFuzzer "timeout" on a starved machine is often an input that runs in
# milliseconds alone. Such a finding is replayed by itself with a generous
# limit; only one that still runs over (or fails some other way) counts, and
# fuzzing then goes on for the time that was left. Crashes, leaks, sanitizer
# reports and out-of-memory fail at once.
replays_alone() {
  local name=$1 input=$2 start=$SECONDS
  if fuzz_env "$build/bin/$name" -timeout=120 -rss_limit_mb=2048 -malloc_limit_mb=1024 "$input" \
       >>"$build/$name.replay.log" 2>&1; then
    echo "   $name: timeout did not reproduce alone ($((SECONDS - start)) s): a starved machine, not a finding"
    return 0
  fi
  return 1
}

run_one() {
  local name=$1 corpus="$build/corpus/$1" regressions="$root/tests/fuzz-regressions/$1"
  mkdir -p "$corpus" "$seeds/$name"
  local dirs=("$corpus" "$seeds/$name")
  [ -d "$regressions" ] && dirs+=("$regressions")
  local extra=()
  [ -f "$root/fuzz/$name.dict" ] && extra+=("-dict=$root/fuzz/$name.dict")
  local left=$seconds attempt start timeouts
  for attempt in 1 2 3; do
    start=$SECONDS
    # Leak checks stay on: a leak in a parser is a finding like any other.
    if fuzz_env "$build/bin/$name" "${dirs[@]}" "${extra[@]}" -max_total_time="$left" -timeout=10 \
         -rss_limit_mb=2048 -malloc_limit_mb=1024 -max_len=262144 -print_final_stats=1 \
         -artifact_prefix="$build/findings/$name-" >"$build/$name.log" 2>&1; then
      return 0
    fi
    grep -q 'SUMMARY: libFuzzer: timeout' "$build/$name.log" || return 1
    timeouts=("$build/findings/$name"-timeout-*)
    [ -f "${timeouts[0]}" ] || return 1
    local t
    for t in "${timeouts[@]}"; do
      replays_alone "$name" "$t" || return 1
      mv "$t" "$build/$(basename "$t").not-reproduced"
    done
    left=$((left - (SECONDS - start)))
    [ "$left" -gt 5 ] || return 0
  done
  return 0
}

status=0
running=0
declare -A pids
for name in $targets; do
  echo "== $name (${seconds}s)"
  run_one "$name" & pids[$name]=$!
  running=$((running + 1))
  if [ "$running" -ge "$jobs" ]; then wait -n || true; running=$((running - 1)); fi
done
for name in $targets; do
  if ! wait "${pids[$name]}"; then
    echo "!! $name found a problem:"; grep -v '^#' "$build/$name.log" | tail -n 60; status=1
  fi
  execs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$build/$name.log")
  rate=$(sed -n 's/^stat::average_exec_per_sec: *//p' "$build/$name.log")
  rss=$(sed -n 's/^stat::peak_rss_mb: *//p' "$build/$name.log")
  printf '%-22s executions %-10s exec/s %-8s peak rss %s MB\n' "$name" "${execs:-?}" "${rate:-?}" "${rss:-?}"
done
[ "$status" -eq 0 ] || echo "findings are in $build/findings"
exit $status
