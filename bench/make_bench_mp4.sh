#!/usr/bin/env bash
# Makes the demux benchmark's input: 60 s of 720p H.264 (noise keeps the
# bitrate up) with stereo AAC, about 120 MB. Not committed; it goes to the
# path given (default /tmp/mediaeditor_demux_bench.mp4) and is kept when it
# already exists.
set -euo pipefail
out=${1:-/tmp/mediaeditor_demux_bench.mp4}
if [ -s "$out" ]; then
  echo "$out exists"
  exit 0
fi
ffmpeg -hide_banner -loglevel error -y \
  -f lavfi -i testsrc2=size=1280x720:rate=30 -f lavfi -i sine=frequency=440:sample_rate=48000 -t 60 \
  -vf noise=alls=20:allf=t -c:v libx264 -preset ultrafast -b:v 16M -maxrate 16M -bufsize 32M -g 60 \
  -pix_fmt yuv420p -c:a aac -b:a 128k -ac 2 "$out.tmp.mp4"
mv "$out.tmp.mp4" "$out"
ls -l "$out"
