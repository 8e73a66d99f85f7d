#!/usr/bin/env bash
# Builds the project and runs the editor on the bundled sample media.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
"$root/scripts/deps.sh"
cmake -S "$root" -B "$root/build" -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build "$root/build" -j"$(nproc)"
echo "built: $root/build/lib/libmediaeditorservice_utils.so"
