#!/usr/bin/env bash
# Header-only probes and the memory of a short cut from a long file.
#
# 1. `qnedit probe` of a long H.264+AAC MP4, a long FLAC and a long WAVE
#    against `ffprobe -show_format -show_streams`, runs alternated (ours,
#    ffprobe, ours, ...) so that a busy machine weighs on both alike; medians
#    of wall and CPU time (user + sys), largest peak RSS.
# 2. Peak RSS of a 10-s trim from the middle of a short and a long MP4 of the
#    same kind: what the index costs as the file grows.
#
# The MP4s are small pictures (320x180, 30 fps, a key frame every 2 s) with
# 128 kbit/s AAC: the index, which is what a probe reads, has as many entries
# as a 720p file of the same length. Media are made by ffmpeg and kept in
# MEDIA_DIR between runs.
#
# Usage: probe_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   LONG_MINUTES sets the long files' length (default 60), SHORT_MINUTES the
#   short MP4's (6).
set -euo pipefail
build=${1:?usage: probe_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit=(env "LD_LIBRARY_PATH=$build/lib" "$build/bin/qnedit")
media=${2:-}
runs=${3:-7}
long=${LONG_MINUTES:-60}
short=${SHORT_MINUTES:-6}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${media:-$out/media}
mkdir -p "$media"

make_mp4() {
  local minutes=$1 file=$media/probe_${1}m.mp4 secs=$(($1 * 60))
  [[ -s $file ]] || ffmpeg -hide_banner -loglevel error -y \
    -f lavfi -i "testsrc2=size=320x180:rate=30:duration=$secs" \
    -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=$secs" \
    -c:v libx264 -preset ultrafast -g 60 -c:a aac -b:a 128k -shortest "$file"
  echo "$file"
}
mp4=$(make_mp4 "$long")
mp4_short=$(make_mp4 "$short")
flac=$media/probe_${long}m.flac
wav=$media/probe_${long}m.wav
if [[ ! -s $flac ]]; then
  # Noise keeps the frames as large as music's.
  ffmpeg -hide_banner -loglevel error -y -f lavfi \
    -i "aevalsrc=0.3*sin(440*2*PI*t)+0.2*random(0)|0.3*sin(660*2*PI*t)+0.2*random(1):s=44100:d=$((long * 60))" \
    -c:a flac "$flac"
fi
[[ -s $wav ]] || ffmpeg -hide_banner -loglevel error -y -i "$flac" -c:a pcm_s16le "$wav"

source "$(dirname "$0")/alternate.sh"
ours_cmd=$(printf '%q ' "${qnedit[@]}")
row() { printf '  %-40s wall %7.3f s  cpu %7.3f s  peak RSS %4d MB\n' "$1" "$2" "$3" $(($4 / 1024)); }

probe() {
  alternate "probe $(basename "$1") ($(stat -L -c %s "$1") bytes)" "$ours_cmd --quiet probe '$1'" \
    "ffprobe -v error -show_format -show_streams '$1'" "qnedit probe" "ffprobe -show_format -show_streams"
}

probe "$mp4"
probe "$flac"
probe "$wav"

echo "== 10-s trim from the middle: peak RSS, largest of $runs runs"
for file in "$mp4_short" "$mp4"; do
  secs=$(ffprobe -v error -show_entries format=duration -of csv=p=0 "$file")
  mid=$(awk -v d="$secs" 'BEGIN { printf "%d", d / 2 }')
  r=()
  for _ in $(seq "$runs"); do
    r+=("$(measure_once "$ours_cmd --quiet trim '$file' '$out/cut.mp4' --start $mid --end $((mid + 10))")")
    rm -f "$out/cut.mp4"
  done
  read -r w c m <<<"$(stats_of "${r[@]}")"
  row "trim $(basename "$file")" "$w" "$c" "$m"
done
