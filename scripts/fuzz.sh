#!/usr/bin/env bash
# Builds the libFuzzer targets with clang (AddressSanitizer + UndefinedBehavior-
# Sanitizer) and runs each for a bounded time, seeded from the test media.
# Fails on any finding; the crashing input is left in build-fuzz/findings.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
seconds=${FUZZ_SECONDS:-60}
build="$root/build-fuzz"
CC=clang CXX=clang++ cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DMEDIAEDITOR_BUILD_FUZZ=ON -DMEDIAEDITOR_SANITIZE=address,undefined \
  -DMEDIAEDITOR_BUILD_TESTS=OFF -DMEDIAEDITOR_BUILD_BENCH=OFF -DMEDIAEDITOR_BUILD_TOOLS=OFF >/dev/null
cmake --build "$build" -j"$(nproc)"

seeds="$build/seeds"
rm -rf "$seeds" && mkdir -p "$seeds/media" "$build/findings"
find "$root/tests/media" -type f ! -name '*.sh' ! -name '*.json' ! -name '*.txt' -size -300k \
  -exec cp {} "$seeds/media/" \; 2>/dev/null || true
[ -d "$root/tests/fuzz-regressions" ] && cp -r "$root/tests/fuzz-regressions/." "$seeds/media/" 2>/dev/null || true

status=0
for target in "$build"/bin/fuzz_*; do
  name=$(basename "$target")
  corpus="$build/corpus/$name"
  mkdir -p "$corpus"
  echo "== $name (${seconds}s)"
  if ! "$target" "$corpus" "$seeds/media" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 \
       -max_len=1048576 -print_final_stats=1 -artifact_prefix="$build/findings/$name-" \
       >"$build/$name.log" 2>&1; then
    echo "!! $name found a problem:"; tail -n 40 "$build/$name.log"; status=1
  fi
  grep -E '^(stat::number_of_executed_units|stat::average_exec_per_sec|stat::peak_rss_mb)' "$build/$name.log" || true
done
exit $status
