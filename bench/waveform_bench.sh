#!/usr/bin/env bash
# The waveform of a long AAC recording (M4A): `qnedit waveform` (decoding the
# whole track) against `ffmpeg -i x.m4a -f null -` (decoding it and nothing
# else). Alternated runs, medians of wall and CPU time, peak RSS (see
# alternate.sh).
#
# Usage: waveform_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   MEDIA_DIR keeps the generated media between runs (default: a temp dir).
#   WAVE_MINUTES sets the recording's length (default 60).
set -euo pipefail
build=${1:?usage: waveform_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit="env LD_LIBRARY_PATH=$build/lib $build/bin/qnedit"
runs=${3:-5}
minutes=${WAVE_MINUTES:-60}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${2:-$out/media}
mkdir -p "$media"
source "$(dirname "$0")/alternate.sh"

m4a=$media/speech_${minutes}m.m4a
[[ -s $m4a ]] || ffmpeg -nostdin -hide_banner -loglevel error -y -f lavfi \
  -i "aevalsrc=0.3*sin(2*PI*220*t)*abs(sin(2*PI*0.7*t))+0.05*random(0)|0.3*sin(2*PI*330*t)*abs(sin(2*PI*0.5*t)):s=44100:d=$((minutes * 60))" \
  -c:a aac -b:a 128k "$m4a"

alternate "waveform of a ${minutes}-minute M4A" \
  "$qnedit --quiet waveform '$m4a' -o '$out/w.bin'" \
  "ffmpeg -nostdin -hide_banner -loglevel error -i '$m4a' -f null -" \
  "qnedit waveform" "ffmpeg -f null"
