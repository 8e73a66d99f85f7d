#!/usr/bin/env bash
# Builds the project and runs the whole test suite, then runs it again under
# AddressSanitizer + UndefinedBehaviorSanitizer.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
"$root/scripts/deps.sh"
jobs=$(nproc)

cmake -S "$root" -B "$root/build" -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build "$root/build" -j"$jobs"
(cd "$root/build" && ctest --output-on-failure -j"$jobs")

if [ "${SKIP_SANITIZERS:-0}" != "1" ]; then
  cmake -S "$root" -B "$root/build-asan" -DCMAKE_BUILD_TYPE=Debug -DMEDIAEDITOR_SANITIZE=address,undefined \
        -DMEDIAEDITOR_BUILD_BENCH=OFF -DMEDIAEDITOR_BUILD_TOOLS=OFF >/dev/null
  cmake --build "$root/build-asan" -j"$jobs"
  (cd "$root/build-asan" && ASAN_OPTIONS=detect_leaks=1 UBSAN_OPTIONS=print_stacktrace=1 \
     ctest --output-on-failure -j"$jobs")
fi
