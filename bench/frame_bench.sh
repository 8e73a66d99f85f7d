#!/usr/bin/env bash
# One picture from the middle of a long video: `qnedit frame --at` against
# `ffmpeg -ss T -i x.mp4 -frames:v 1 x.png` on a 720p H.264 MP4 (runs
# alternated, medians of wall and CPU time, the largest peak RSS), and the
# peak RSS of one picture from a 1080p video. The media are made by ffmpeg
# (x264, a key frame every 2 s); MEDIA_DIR may be shared with
# long_copy_bench.sh, whose 720p file is the same.
#
# Usage: frame_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   LONG_MINUTES sets the 720p video's length (default 10).
set -euo pipefail
build=${1:?usage: frame_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit=(env "LD_LIBRARY_PATH=$build/lib" "$build/bin/qnedit")
media=${2:-}
runs=${3:-5}
minutes=${LONG_MINUTES:-10}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${media:-$out/media}
mkdir -p "$media"
mp4=$media/long_${minutes}m.mp4
hd=$media/hd_1080p.mp4
secs=$((minutes * 60))
if [[ ! -s $mp4 ]]; then
  ffmpeg -hide_banner -loglevel error -y -f lavfi -i "testsrc2=size=1280x720:rate=30:duration=$secs" \
    -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=$secs" \
    -c:v libx264 -preset ultrafast -g 60 -c:a aac -b:a 128k -shortest "$mp4"
fi
if [[ ! -s $hd ]]; then
  ffmpeg -hide_banner -loglevel error -y -f lavfi -i "testsrc2=size=1920x1080:rate=30:duration=20" \
    -c:v libx264 -preset veryfast -bf 3 -g 60 "$hd"
fi

# "wall cpu peak_kb" of one run.
measure() {
  /usr/bin/time -o "$out/time.txt" -f "%e %U %S %M" "$@" >/dev/null 2>&1 || echo "failed: $*" >&2
  awk '{ printf "%s %.2f %s\n", $1, $2 + $3, $4 }' "$out/time.txt"
}
median() { sort -n | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }
col() { printf '%s\n' "${@:2}" | awk -v c="$1" '{ print $c }'; }
stats() { echo "$(col 1 "$@" | median) $(col 2 "$@" | median) $(col 3 "$@" | sort -n | tail -1)"; }
ratio() { awk -v a="$1" -v b="$2" 'BEGIN { if (b > 0) printf "%.2f", a / b; else print "n/a" }'; }

# One second after a key frame's half-way point: a typical place, not a key frame.
at=$(awk -v s="$secs" 'BEGIN { printf "%.3f", s / 2 + 1.017 }')
ours=() ff=()
for _ in $(seq "$runs"); do
  ours+=("$(measure "${qnedit[@]}" --quiet frame "$mp4" --at "$at" -o "$out/ours.png")")
  rm -f "$out/ours.png"
  ff+=("$(measure ffmpeg -hide_banner -loglevel error -y -ss "$at" -i "$mp4" -frames:v 1 "$out/ff.png")")
  rm -f "$out/ff.png"
done
read -r ow oc om <<<"$(stats "${ours[@]}")"
read -r fw fc fm <<<"$(stats "${ff[@]}")"
echo "== one picture at $at s of $(basename "$mp4") (720p, $(stat -L -c %s "$mp4") bytes), median of $runs alternated runs"
printf '  %-30s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "qnedit frame --at" "$ow" "$oc" $((om / 1024))
printf '  %-30s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "ffmpeg -ss -i -frames:v 1" "$fw" "$fc" $((fm / 1024))
echo "  ours/ffmpeg: wall $(ratio "$ow" "$fw") (goal <= 1.2), cpu $(ratio "$oc" "$fc")"

read -r hw hc hm <<<"$(measure "${qnedit[@]}" --quiet frame "$hd" --at 11.5 -o "$out/hd.png")"
read -r gw gc gm <<<"$(measure ffmpeg -hide_banner -loglevel error -y -ss 11.5 -i "$hd" -frames:v 1 "$out/hd_ff.png")"
echo "== one 1080p picture (B-frames, key frame every 2 s)"
printf '  %-30s wall %6.2f s  peak RSS %4d MB (goal < 128)\n' "qnedit frame --at" "$hw" $((hm / 1024))
printf '  %-30s wall %6.2f s  peak RSS %4d MB\n' "ffmpeg -ss -i -frames:v 1" "$gw" $((gm / 1024))
