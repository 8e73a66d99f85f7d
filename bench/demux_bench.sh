#!/usr/bin/env bash
# Times demuxing every sample of a ~120 MB MP4 against
# `ffmpeg -i FILE -map 0 -c copy -f null -` on the same file, and compares
# peak memory. Usage: demux_bench.sh BUILD_DIR [FILE]
set -euo pipefail
build=${1:?usage: demux_bench.sh BUILD_DIR [FILE]}
file=${2:-/tmp/mediaeditor_demux_bench.mp4}
here=$(cd "$(dirname "$0")" && pwd)
"$here/make_bench_mp4.sh" "$file" >/dev/null
runs=5

best=""
for _ in $(seq $runs); do
  t=$( { /usr/bin/time -f "%e %M" ffmpeg -hide_banner -loglevel error -i "$file" -map 0 -c copy -f null - ; } 2>&1 | tail -1)
  best=$(printf '%s\n%s\n' "$best" "$t" | sed '/^$/d' | sort -n | head -1)
done
ff_s=${best% *}
ff_kb=${best#* }

json=$(mktemp)
trap 'rm -f "$json"' EXIT
mem=$( { DEMUX_BENCH_FILE="$file" /usr/bin/time -f "%M" "$build/bin/DemuxBench" --benchmark_repetitions=$runs \
          --benchmark_format=json --benchmark_out="$json" >/dev/null; } 2>&1 | tail -1)
best_ms() { jq "[.benchmarks[] | select(.run_type == \"iteration\" and (.run_name | startswith(\"$1\"))) | .real_time] | min" "$json"; }
wrapper_ms=$(best_ms Wrapper)
extractor_ms=$(best_ms Extractor)
samples=$(jq '.benchmarks[0].samples' "$json")

echo "file: $file ($(stat -c %s "$file") bytes, $samples samples)"
echo "ffmpeg -c copy: best of $runs ${ff_s} s, peak RSS $((ff_kb / 1024)) MB"
echo "wrapper:        best of $runs $(jq -n "$wrapper_ms | round / 1000") s (extractor alone $(jq -n "$extractor_ms | round / 1000") s), peak RSS $((mem / 1024)) MB"
echo "time ratio (wrapper / ffmpeg): $(jq -n "$wrapper_ms / 1000 / $ff_s * 1000 | round / 1000")"
echo "memory ratio (wrapper / ffmpeg): $(jq -n "$mem / $ff_kb * 1000 | round / 1000")"
