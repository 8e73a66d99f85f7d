#!/usr/bin/env bash
# Makes the sample media under tests/media with ffmpeg, flac and sox, and
# records facts about them (from ffprobe) beside them. Each format's files
# come from one script in tests/media/gen.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
out="$root/tests/media"
"$root/scripts/deps.sh" --gen
mkdir -p "$out"
for gen in "$root"/tests/media/gen/*.sh; do
  echo "== $(basename "$gen")"
  bash "$gen" "$out"
done
