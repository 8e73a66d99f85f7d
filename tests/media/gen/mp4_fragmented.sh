#!/usr/bin/env bash
# Fragmented MP4 files from three independent writers, and a file cut by a
# multi-segment edit list, for the MPEG-4 extractor tests. Facts are recorded
# with ffprobe as mp4.sh does (see there for the line format); the edit-list
# file is checked against its source's facts instead, since the probe does
# not apply edits after the first.
#   mp4_fragmented.sh OUTDIR    (needs mp4.sh's output in OUTDIR/mp4)
set -euo pipefail
out=${1:?usage: mp4_fragmented.sh OUTDIR}
here=$(cd "$(dirname "$0")" && pwd)
dir="$out/mp4"
src="$dir/avc_aac.mp4"
[ -f "$src" ] || { echo "run mp4.sh first" >&2; exit 1; }
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

ff() { ffmpeg -hide_banner -loglevel error -y -bitexact "$@"; }

# ffmpeg: an empty movie box and a fragment per key frame (base data offsets
# in the track fragment headers, and a random access box at the end); the
# same with the first samples in the movie box and offsets from each 'moof';
# and DASH-style with segment indexes.
ff -i "$src" -map 0 -c copy -movflags frag_keyframe+empty_moov "$dir/frag_empty_moov.mp4"
ff -i "$src" -map 0 -c copy -movflags +frag_keyframe+default_base_moof "$dir/frag_base_moof.mp4"
ff -i "$src" -map 0 -c copy -movflags +dash "$dir/frag_dash.mp4"
# HEVC with B-frames and signed composition offsets (version 1 'trun').
ff -i "$dir/hevc.mp4" -c copy -movflags frag_keyframe+empty_moov+negative_cts_offsets "$dir/frag_hevc.mp4"

# GStreamer: its own H.264 and AAC encoders, a fragment every 500 ms, one
# track per fragment.
gst-launch-1.0 -q \
  videotestsrc num-buffers=40 pattern=ball ! video/x-raw,width=160,height=120,framerate=25/1 \
    ! x264enc bitrate=60 key-int-max=20 bframes=2 ! h264parse ! queue ! mp4mux name=mux fragment-duration=500 \
    ! filesink location="$dir/frag_gst.mp4" \
  audiotestsrc num-buffers=35 samplesperbuffer=1024 ! audio/x-raw,rate=22050,channels=1 \
    ! avenc_aac ! aacparse ! queue ! mux.

# mediabunny (npm) under node, copying the packets of the ffmpeg file.
(cd "$tmp" && npm init -y >/dev/null && npm install --silent --no-audit --no-fund mediabunny@1.61.0 >/dev/null)
cp "$here/mp4_fragment_remux.mjs" "$tmp/"
node "$tmp/mp4_fragment_remux.mjs" "$src" "$dir/frag_mediabunny.mp4" 0.5

# Edit lists that play 0.4 s from 0.4 s and 0.3 s from 1.2 s after 0.25 s of
# nothing, on both tracks (the video's second segment starts between key frames).
python3 "$here/mp4_edit_list.py" "$src" "$dir/edits_segments.mp4" \
  "1:0.25,-;0.4,0.4;0.3,1.2" "2:0.25,-;0.4,0.4;0.3,1.2"

. "$here/mp4_facts.sh"
for f in "$dir"/frag_*.mp4; do
  facts "$f" > "$f.facts"
done
