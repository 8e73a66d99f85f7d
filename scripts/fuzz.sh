#!/usr/bin/env bash
# Builds the libFuzzer targets with clang (AddressSanitizer + UndefinedBehavior-
# Sanitizer) and runs each for a bounded time, seeded from the test media and
# the saved regression inputs. Fails on any finding; the input that caused it is
# left in build-fuzz/findings.
#   FUZZ_SECONDS  time per target (default 60)
#   FUZZ_JOBS     targets run side by side (default: the number of cores)
#   FUZZ_TARGETS  names to run (default: every fuzz_* target)
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
seconds=${FUZZ_SECONDS:-60}
jobs=${FUZZ_JOBS:-$(nproc)}
build="$root/build-fuzz"

"$root/scripts/deps.sh" --fuzz
CC=clang CXX=clang++ cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DMEDIAEDITOR_BUILD_FUZZ=ON -DMEDIAEDITOR_SANITIZE=address,undefined \
  -DMEDIAEDITOR_BUILD_TESTS=OFF -DMEDIAEDITOR_BUILD_BENCH=OFF -DMEDIAEDITOR_BUILD_TOOLS=OFF >/dev/null
cmake --build "$build" -j"$(nproc)"

seeds="$build/seeds"
rm -rf "$seeds" "$build/findings" && mkdir -p "$seeds" "$build/findings"
python3 "$root/fuzz/make_seeds.py" "$root/tests/media" "$seeds"

targets=${FUZZ_TARGETS:-$(cd "$build/bin" && ls fuzz_*)}

run_one() {
  local name=$1 corpus="$build/corpus/$1" regressions="$root/tests/fuzz-regressions/$1"
  mkdir -p "$corpus" "$seeds/$name"
  local dirs=("$corpus" "$seeds/$name")
  [ -d "$regressions" ] && dirs+=("$regressions")
  local extra=()
  [ -f "$root/fuzz/$name.dict" ] && extra+=("-dict=$root/fuzz/$name.dict")
  # Leak checks stay on: a leak in a parser is a finding like any other.
  ASAN_OPTIONS=detect_leaks=1:allocator_may_return_null=1 UBSAN_OPTIONS=print_stacktrace=1 \
    "$build/bin/$name" "${dirs[@]}" "${extra[@]}" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 \
      -malloc_limit_mb=1024 -max_len=262144 -print_final_stats=1 \
      -artifact_prefix="$build/findings/$name-" >"$build/$name.log" 2>&1
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
