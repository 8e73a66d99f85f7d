#!/usr/bin/env bash
# Times the lossless copy of a ~120 MB MP4 (extractor wrapper -> muxer ->
# MP4 writer) against
# `ffmpeg -i IN -map 0 -c copy OUT.mp4` and `cp IN OUT`, best of N runs each,
# with peak memory. Usage: remux_bench.sh BUILD_DIR [FILE]
set -euo pipefail
build=${1:?usage: remux_bench.sh BUILD_DIR [FILE]}
file=${2:-/tmp/mediaeditor_demux_bench.mp4}
here=$(cd "$(dirname "$0")" && pwd)
"$here/make_bench_mp4.sh" "$file" >/dev/null
out=$(mktemp -d)
json=$(mktemp)
trap 'rm -rf "$out" "$json"' EXIT
runs=5

# Best "seconds peak_kb" of N runs of a command.
best_of() {
  local best="" t
  for _ in $(seq $runs); do
    t=$( { /usr/bin/time -f "%e %M" "$@" >/dev/null; } 2>&1 | tail -1)
    best=$(printf '%s\n%s\n' "$best" "$t" | sed '/^$/d' | sort -n | head -1)
  done
  echo "$best"
}

cp_r=$(best_of cp "$file" "$out/cp.mp4")
ff_r=$(best_of ffmpeg -hide_banner -loglevel error -y -i "$file" -map 0 -c copy "$out/ff.mp4")
mem=$( { REMUX_BENCH_FILE="$file" REMUX_BENCH_OUT="$out/ours.mp4" /usr/bin/time -f "%M" \
          "$build/bin/RemuxBench" --benchmark_repetitions=$runs --benchmark_format=json \
          --benchmark_out="$json" >/dev/null; } 2>&1 | tail -1)
ours_s=$(jq '[.benchmarks[] | select(.run_type == "iteration") | .real_time] | min / 1000' "$json")
ffmpeg -hide_banner -loglevel error -i "$out/ours.mp4" -map 0 -c copy -f null - || echo "output does not demux"

echo "file: $file ($(stat -c %s "$file") bytes)"
echo "cp:             ${cp_r% *} s, peak RSS $((${cp_r#* } / 1024)) MB"
echo "ffmpeg -c copy: ${ff_r% *} s, peak RSS $((${ff_r#* } / 1024)) MB"
echo "wrapper->muxer: ${ours_s} s, peak RSS $((mem / 1024)) MB"
echo "time ratio ours / ffmpeg: $(jq -n "$ours_s / ${ff_r% *} * 100 | round / 100")"
echo "time ratio ours / cp:     $(jq -n "$ours_s / ${cp_r% *} * 100 | round / 100")"
