#!/usr/bin/env bash
# One picture from the middle of a long video: `qnedit frame --at` against
# `ffmpeg -ss T -i x.mp4 -frames:v 1 x.png` on a 720p H.264 MP4, and the same
# on a 1080p one with B-frames, whose peak RSS is the figure to watch.
# Alternated runs, medians of wall and CPU time, peak RSS (see alternate.sh).
# The media are made by ffmpeg (x264, a key frame every 2 s); MEDIA_DIR may
# be shared with long_copy_bench.sh, whose 720p file is the same.
#
# Usage: frame_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   LONG_MINUTES sets the 720p video's length (default 10).
set -euo pipefail
build=${1:?usage: frame_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit="env LD_LIBRARY_PATH=$build/lib $build/bin/qnedit"
runs=${3:-5}
minutes=${LONG_MINUTES:-10}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${2:-$out/media}
mkdir -p "$media"
source "$(dirname "$0")/alternate.sh"

mp4=$media/long_${minutes}m.mp4
hd=$media/hd_1080p.mp4
secs=$((minutes * 60))
[[ -s $mp4 ]] || ffmpeg -nostdin -hide_banner -loglevel error -y -f lavfi -i "testsrc2=size=1280x720:rate=30:duration=$secs" \
  -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=$secs" \
  -c:v libx264 -preset ultrafast -g 60 -c:a aac -b:a 128k -shortest "$mp4"
[[ -s $hd ]] || ffmpeg -nostdin -hide_banner -loglevel error -y -f lavfi -i "testsrc2=size=1920x1080:rate=30:duration=20" \
  -c:v libx264 -preset veryfast -bf 3 -g 60 "$hd"

# A second past a key frame near the middle: a typical place, not a key frame.
at=$(awk -v s="$secs" 'BEGIN { printf "%.3f", s / 2 + 1.017 }')
alternate "one picture at $at s of a ${minutes}-minute 720p MP4 (goal: wall <= 1.2x)" \
  "$qnedit --quiet frame '$mp4' --at $at -o '$out/ours.png'" \
  "ffmpeg -nostdin -hide_banner -loglevel error -y -ss $at -i '$mp4' -frames:v 1 '$out/ff.png'" \
  "qnedit frame --at" "ffmpeg -ss -frames:v 1"
alternate "one picture of a 1080p MP4 with B-frames (goal: peak RSS < 128 MB)" \
  "$qnedit --quiet frame '$hd' --at 11.5 -o '$out/ours.png'" \
  "ffmpeg -nostdin -hide_banner -loglevel error -y -ss 11.5 -i '$hd' -frames:v 1 '$out/ff.png'" \
  "qnedit frame --at" "ffmpeg -ss -frames:v 1"
