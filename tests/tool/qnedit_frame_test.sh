#!/usr/bin/env bash
# Pictures from videos as a user asks for them: each one against ffmpeg's
# picture at the same time (PSNR at least 40 dB, turned and cropped as ffmpeg
# shows them), a strip of evenly spaced pictures, and bad numbers, missing
# pictures and damaged files answered with one line and the right status.
set -u
qnedit=$1
samples=$2
media=$3
source "$(dirname "$0")/checks.sh"
# like_ffmpeg FILE SEC MATRIX: our picture and ffmpeg's agree
like_ffmpeg() {
  local file=$1 t=$2 matrix=$3 name
  name=$(basename "$file" .mp4)-$t
  "$qnedit" --quiet frame "$file" --at "$t" -o "$work/$name.png" || return 1
  # ffmpeg's picture made 8-bit 4:2:0 as ours is, then RGB 5:6:5 without
  # dither, widened as our PNG writer widens it.
  local r5='bitand(val\,248)+floor(val/32)' g6='bitand(val\,252)+floor(val/64)'
  ffmpeg -nostdin -v error -y -ss "$t" -i "$file" -frames:v 1 \
    -vf "format=yuv420p,scale=in_color_matrix=$matrix,format=rgb24,lutrgb=r=$r5:g=$g6:b=$r5" "$work/$name.ref.png" || return 1
  local psnr
  psnr=$(ffmpeg -nostdin -v info -i "$work/$name.png" -i "$work/$name.ref.png" -lavfi psnr -f null - 2>&1 |
         sed -n 's/.*PSNR.* average:\([0-9.inf]*\).*/\1/p')
  echo "$name: PSNR $psnr dB"
  [ "$psnr" = inf ] || awk -v p="$psnr" 'BEGIN { exit !(p >= 40) }'
}

if have ffmpeg; then
  for t in 0 2.5 6.97; do check "clip at $t s (turned)" like_ffmpeg "$samples/clip.mp4" "$t" bt601; done
  check "B-pyramid" like_ffmpeg "$media/video/avc_bpyramid.mp4" 1.13 bt601
  # ffmpeg dithers 10 bits down to 8 where ours rounds: ~40.5 dB, not more.
  check "HEVC Main 10, BT.709" like_ffmpeg "$media/video/hevc_main10.mp4" 0.21 bt709
  check "cropped stream" like_ffmpeg "$media/video/avc_cropped.mp4" 0.5 bt601
  check "quarter turn" like_ffmpeg "$media/video/avc_rotated.mp4" 0.7 bt601
  check "High 4:4:4" like_ffmpeg "$media/video/avc_444.mp4" 0.7 bt601
  check "GStreamer file" like_ffmpeg "$media/video/gst_avc.mp4" 0.3 bt601
fi

# A strip: N pictures, the first the video's first picture.
check "strip of 6" "$qnedit" --quiet frame "$samples/clip.mp4" --count 6 -o "$work/strip/"
check "six pictures" test "$(ls "$work/strip" | tr '\n' ' ')" = "frame-001.png frame-002.png frame-003.png frame-004.png frame-005.png frame-006.png "
check "first at 0" "$qnedit" --quiet frame "$samples/clip.mp4" --at 0 -o "$work/first.png"
check "strip starts with it" cmp "$work/strip/frame-001.png" "$work/first.png"
have ffprobe && check "turned as the track says" bash -c \
  "[ \"\$(ffprobe -v error -show_entries stream=width,height -of csv=p=0 '$work/first.png')\" = 360,640 ]"
check "strip into a file refused" expect_status 2 "$qnedit" frame "$samples/clip.mp4" --count 2 -o "$work/first.png"

# Bad numbers and bad combinations are usage errors; nothing is written.
for bad in "--at -1" "--at abc" "--at 1e30" "--count 0" "--count 1001" "--count x" "--at 1 --count 2" "" \
           "--at 1 --stride 64" "--at 1 --track -2"; do
  # shellcheck disable=SC2086
  check "usage: '$bad'" expect_status 2 "$qnedit" frame "$samples/clip.mp4" $bad -o "$work/bad.png"
done
check "usage errors write nothing" test ! -e "$work/bad.png"
check "raw options refuse --at" expect_status 2 "$qnedit" frame "$samples/frame_320x240.nv12" --size 320x240 \
  --format nv12 --at 1 -o "$work/bad.png"
check "input as output refused" expect_status 2 "$qnedit" frame "$samples/clip.mp4" --at 1 -o "$samples/clip.mp4"

# No picture there, no video, a damaged file: one line, status 1, no output.
check "past the end" expect_status 1 "$qnedit" frame "$samples/clip.mp4" --at 9 -o "$work/late.png"
check "past the end says so" grep -q "no picture at or after" "$work/err.txt"
check "audio only" expect_status 1 "$qnedit" frame "$samples/voice.m4a" --at 1 -o "$work/audio.png"
check "audio track chosen" expect_status 1 "$qnedit" frame "$samples/clip.mp4" --at 1 --track 1 -o "$work/audio.png"
check "nothing written for them" test ! -e "$work/late.png" -a ! -e "$work/audio.png"
head -c 150000 "$samples/clip.mp4" > "$work/cut.mp4"
check "truncated file ends in a status" bash -c "'$qnedit' --quiet frame '$work/cut.mp4' --at 7 -o '$work/cut.png'; [ \$? -le 2 ]"
python3 - "$samples/clip.mp4" "$work/noisy.mp4" <<'PY'
import sys
data = bytearray(open(sys.argv[1], "rb").read())
for i in range(4096, len(data), 797):  # damage inside the samples, not the index at the end
    if i < len(data) - 8192:
        data[i] ^= 0x5A
open(sys.argv[2], "wb").write(data)
PY
check "damaged samples still give a picture" "$qnedit" --quiet frame "$work/noisy.mp4" --at 4 -o "$work/noisy.png"

echo "qnedit frame: $pass passed, $fail failed"
[ "$fail" -eq 0 ]
