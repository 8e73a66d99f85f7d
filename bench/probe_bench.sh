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

# "wall cpu peak_kb" of one run.
measure() {
  /usr/bin/time -o "$out/time.txt" -f "%e %U %S %M" "$@" >/dev/null 2>&1 || echo "failed: $*" >&2
  awk '{ printf "%s %.3f %s\n", $1, $2 + $3, $4 }' "$out/time.txt"
}
median() { sort -n | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }
col() { printf '%s\n' "${@:2}" | awk -v c="$1" '{ print $c }'; }
stats() { echo "$(col 1 "$@" | median) $(col 2 "$@" | median) $(col 3 "$@" | sort -n | tail -1)"; }
ratio() { awk -v a="$1" -v b="$2" 'BEGIN { if (b > 0) printf "%.2f", a / b; else print "n/a" }'; }
row() { printf '  %-34s wall %6.3f s  cpu %6.3f s  peak RSS %4d MB\n' "$1" "$2" "$3" $(($4 / 1024)); }

probe() {
  local file=$1 ours=() ff=()
  for _ in $(seq "$runs"); do
    ours+=("$(measure "${qnedit[@]}" --quiet probe "$file")")
    ff+=("$(measure ffprobe -v error -show_format -show_streams "$file")")
  done
  read -r ow oc om <<<"$(stats "${ours[@]}")"
  read -r fw fc fm <<<"$(stats "${ff[@]}")"
  echo "== probe $(basename "$file") ($(stat -L -c %s "$file") bytes), median of $runs alternated runs"
  row "qnedit probe" "$ow" "$oc" "$om"
  row "ffprobe -show_format -show_streams" "$fw" "$fc" "$fm"
  echo "  ours/ffprobe: wall $(ratio "$ow" "$fw"), cpu $(ratio "$oc" "$fc")"
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
    r+=("$(measure "${qnedit[@]}" --quiet trim "$file" "$out/cut.mp4" --start "$mid" --end $((mid + 10)))")
    rm -f "$out/cut.mp4"
  done
  read -r w c m <<<"$(stats "${r[@]}")"
  row "trim $(basename "$file")" "$w" "$c" "$m"
done
