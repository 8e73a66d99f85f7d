#!/usr/bin/env bash
# Small videos from independent producers for the video decoder tests, and
# ffmpeg's picture at a few times in each (ffmpeg -ss T -i F -frames:v 1,
# turned and cropped as ffmpeg shows it, made 8-bit 4:2:0 as the decoder
# hands pictures on, then RGB 5:6:5 with each channel's low bits dropped).
# OUTDIR/video/pictures.txt lines:
#   FILE TIME_US WIDTH HEIGHT REFERENCE
set -euo pipefail
out=${1:?usage: video.sh OUTDIR}
dir="$out/video"
mkdir -p "$dir"
ff() { ffmpeg -nostdin -hide_banner -loglevel error -y -bitexact "$@"; }
src=(-f lavfi -i testsrc2=size=96x64:rate=25)

# x264 with B-frames in a pyramid: pictures come out of order.
ff "${src[@]}" -t 2 -c:v libx264 -preset veryfast -bf 3 -x264-params b-pyramid=normal:keyint=12 \
   -b:v 150k -pix_fmt yuv420p "$dir/avc_bpyramid.mp4"
# HEVC Main 10 with B-frames, tagged BT.709.
ff "${src[@]}" -t 1 -c:v libx265 -preset veryfast -tag:v hvc1 -pix_fmt yuv420p10le \
   -color_primaries bt709 -color_trc bt709 -colorspace bt709 \
   -x265-params log-level=error:bframes=3:keyint=10 -b:v 150k "$dir/hevc_main10.mp4"
# A quarter turn in the track header.
ff "${src[@]}" -t 1 -c:v libx264 -preset veryfast -bf 2 -g 10 -b:v 150k -pix_fmt yuv420p "$dir/plain.mp4"
ff -i "$dir/plain.mp4" -c copy -metadata:s:v:0 rotate=90 "$dir/avc_rotated.mp4"
rm "$dir/plain.mp4"
# 90x58: coded as 96x64 with a crop in the sequence parameters.
ff -f lavfi -i testsrc2=size=90x58:rate=25 -t 1 -c:v libx264 -preset veryfast -bf 2 -g 10 -b:v 150k \
   -pix_fmt yuv420p "$dir/avc_cropped.mp4"
# High 4:4:4 (smooth colours: 4:2:0 keeps them).
ff -f lavfi -i gradients=size=96x64:rate=25:speed=0.05 -t 1 -c:v libx264 -preset veryfast -pix_fmt yuv444p \
   -bf 2 -g 10 -b:v 150k "$dir/avc_444.mp4"
# GStreamer's own encoder and muxer.
gst-launch-1.0 -q videotestsrc num-buffers=25 pattern=smpte \
  ! video/x-raw,format=I420,width=96,height=64,framerate=25/1 \
  ! x264enc bitrate=150 key-int-max=10 bframes=2 ! h264parse ! mp4mux ! filesink location="$dir/gst_avc.mp4"

list="$dir/pictures.txt"
: > "$list"
rm -f "$dir"/*.rgb565
picture() {  # picture FILE SECONDS
  local file=$1 t=$2 us size base
  us=$(awk -v t="$t" 'BEGIN { printf "%d", t * 1000000 + 0.5 }')
  base="${file%.mp4}@${us}.rgb565"
  # What a player shows: ffmpeg turns the picture and reads the stream's matrix.
  local matrix=bt601
  [[ $file == hevc_main10.mp4 ]] && matrix=bt709
  ff -ss "$t" -i "$dir/$file" -frames:v 1 -vf "format=yuv420p,scale=in_color_matrix=$matrix,format=rgb24" "$dir/ref.png"
  size=$(ffprobe -v error -show_entries stream=width,height -of csv=p=0 "$dir/ref.png")
  ff -i "$dir/ref.png" -f rawvideo -pix_fmt rgb24 "$dir/rgb"
  python3 - "$dir/rgb" "$dir/$base" <<'PY'
import sys
rgb = open(sys.argv[1], "rb").read()
out = bytearray()
for i in range(0, len(rgb), 3):
    r, g, b = rgb[i], rgb[i + 1], rgb[i + 2]
    px = (r >> 3) << 11 | (g >> 2) << 5 | b >> 3
    out += bytes((px & 0xFF, px >> 8))
open(sys.argv[2], "wb").write(out)
PY
  rm -f "$dir/rgb" "$dir/ref.png"
  echo "$file $us ${size/,/ } $base" >> "$list"
}
picture avc_bpyramid.mp4 0
picture avc_bpyramid.mp4 0.53
picture avc_bpyramid.mp4 1.27
picture hevc_main10.mp4 0.21
picture hevc_main10.mp4 0.63
picture avc_rotated.mp4 0.45
picture avc_cropped.mp4 0.33
picture avc_cropped.mp4 0.87
picture avc_444.mp4 0.45
picture gst_avc.mp4 0.61
