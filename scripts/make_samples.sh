#!/usr/bin/env bash
# Makes the demo's sample media under samples/ with ffmpeg (synthetic
# pictures and sounds, so nothing here carries anyone's rights).
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
out="$root/samples"
mkdir -p "$out"
ff() { ffmpeg -hide_banner -loglevel error -y "$@"; }

# 8 s of 640x360 H.264 (with B-frames) and AAC, rotated 90 degrees.
ff -f lavfi -i testsrc2=size=640x360:rate=25:duration=8 \
   -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=8" \
   -c:v libx264 -preset veryfast -crf 32 -g 50 -bf 2 -pix_fmt yuv420p \
   -c:a aac -b:a 64k -ac 2 "$out/clip.tmp.mp4"
# The rotation tag is taken on a stream copy.
ff -i "$out/clip.tmp.mp4" -map 0 -c copy -metadata:s:v:0 rotate=90 -movflags +faststart "$out/clip.mp4"
rm -f "$out/clip.tmp.mp4"

# 8 s of a rising chord as 16-bit stereo FLAC with a fixed block size.
ff -f lavfi -i "aevalsrc=0.3*sin(2*PI*(220+40*t)*t)+0.2*sin(2*PI*330*t)*(0.5+0.5*sin(2*PI*0.5*t))|0.3*sin(2*PI*(221+40*t)*t):s=44100:d=8" \
   -c:a pcm_s16le -fflags +bitexact "$out/voice.wav"
flac --silent --force --blocksize=4096 -o "$out/voice.flac" "$out/voice.wav"
rm -f "$out/voice.wav"

# 6 s of background music: 22.05 kHz mono, so the mix must convert it.
ff -f lavfi -i "aevalsrc=0.25*sin(2*PI*523*t)*abs(sin(2*PI*2*t)):s=22050:d=6" -c:a pcm_s16le -fflags +bitexact "$out/music.wav"

# The recording as a phone keeps it (AAC in M4A), and the background music as
# MP3, for the compressed-audio waveform and mix.
ff -i "$out/voice.flac" -c:a aac -b:a 64k -fflags +bitexact "$out/voice.m4a"
ff -i "$out/music.wav" -c:a libmp3lame -b:a 64k -fflags +bitexact "$out/music.mp3"

# One 320x240 NV12 frame, as a decoder would hand it out.
ff -f lavfi -i testsrc2=size=320x240:rate=1:duration=1 -frames:v 1 -pix_fmt nv12 -f rawvideo "$out/frame_320x240.nv12"
ls -l "$out"
