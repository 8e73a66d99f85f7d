#!/usr/bin/env bash
# Small MP4/M4A/3GP files for the MPEG-4 extractor tests, and a facts file
# per file recorded with ffprobe: one "stream" line per track and one
# "packet" line per sample (times in microseconds, rounded):
#   format DURATION LOCATION
#   stream INDEX CODEC TAG DURATION WIDTH HEIGHT RATE CHANNELS ROTATION(ccw)
#   packet STREAM PTS DTS SIZE KEY
set -euo pipefail
out=${1:?usage: mp4.sh OUTDIR}
dir="$out/mp4"
mkdir -p "$dir"
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

ff() { ffmpeg -hide_banner -loglevel error -y -bitexact "$@"; }
video=(-f lavfi -i testsrc=size=320x240:rate=25)
tone() { echo "-f lavfi -i sine=frequency=440:sample_rate=$1"; }

# H.264 with B-frames (so composition offsets and an edit list exist) and AAC
# (encoder delay); the index at the end, location stored by the muxer.
ff "${video[@]}" $(tone 44100) -t 2 \
   -c:v libx264 -preset veryfast -bf 2 -g 25 -b:v 80k -pix_fmt yuv420p \
   -c:a aac -b:a 32k -ac 1 -metadata location="+35.6812+139.7671/" \
   "$dir/avc_aac.mp4"
# The same samples with the index first.
ff -i "$dir/avc_aac.mp4" -map 0 -c copy -movflags +faststart "$dir/avc_aac_faststart.mp4"
# The same samples after a tagging tool: its metadata in front, the index
# moved ahead of the media with padding between.
AtomicParsley "$dir/avc_aac.mp4" --artist "Field Recorder" --title "Harbour at dawn" \
  --comment "tagged by a tagging tool" -o "$dir/avc_aac_tagged.mp4" >/dev/null
# And in a QuickTime file, whose sound description keeps the esds in a 'wave' box.
ff -i "$dir/avc_aac.mp4" -map 0 -c copy -f mov "$dir/avc_aac.mov"

# HEVC (hvc1) with B-frames, no audio.
ff "${video[@]}" -t 1 -c:v libx265 -preset veryfast -tag:v hvc1 -b:v 60k -pix_fmt yuv420p \
   -x265-params log-level=error:bframes=2:keyint=12 "$dir/hevc.mp4"

# Stereo AAC in an M4A: encoder delay becomes an edit-list offset.
ff $(tone 48000) -t 1.5 -ac 2 -c:a aac -b:a 48k "$dir/aac.m4a"

# A short H.264 clip whose track header matrix turns it a quarter turn.
ff "${video[@]}" -t 0.5 -c:v libx264 -preset veryfast -bf 0 -g 5 -b:v 60k -pix_fmt yuv420p "$tmp/plain.mp4"
ff -i "$tmp/plain.mp4" -map 0 -c copy -metadata:s:v:0 rotate=270 "$dir/avc_rotated.mp4"

# AMR-NB in 3GP (ffmpeg has no AMR encoder; sox has).
sox -R -D -n -r 8000 -c 1 -t amr-nb "$tmp/tone.amr" synth 1 sine 440
ff -i "$tmp/tone.amr" -c copy "$dir/amr_nb.3gp"

. "$(dirname "$0")/mp4_facts.sh"
for f in "$dir"/*.mp4 "$dir"/*.mov "$dir"/*.m4a "$dir"/*.3gp; do
  facts "$f" > "$f.facts"
done
