#!/usr/bin/env bash
# Builds the project and runs the editor's main jobs on the bundled sample
# media, printing where each result is.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
"$root/scripts/deps.sh"
cmake -S "$root" -B "$root/build" -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build "$root/build" -j"$(nproc)" --target qnedit
qnedit="$root/build/bin/qnedit"
samples="$root/samples"
out="$root/out/demo"
mkdir -p "$out"

step() { printf '\n== %s\n$ %s\n' "$1" "${*:2}"; "${@:2}"; }

step "What is in the clip" "$qnedit" probe "$samples/clip.mp4"
step "Trim the clip losslessly to 2.5 s .. 6 s" \
  "$qnedit" trim "$samples/clip.mp4" "$out/clip_2.5-6.mp4" --start 2.5 --end 6
step "The trimmed clip" "$qnedit" probe "$out/clip_2.5-6.mp4"
step "Trim the FLAC recording to 1.2 s .. 5 s (renumbered frames, new header)" \
  "$qnedit" trim "$samples/voice.flac" "$out/voice_1.2-5.flac" --start 1.2 --end 5
if command -v flac >/dev/null; then
  step "The flac tool checks the trimmed stream" flac --test --silent "$out/voice_1.2-5.flac"
fi
step "The recording's waveform as a picture" "$qnedit" waveform "$samples/voice.flac" -o "$out/voice_waveform.png"
step "The waveform of the same recording kept as AAC (M4A), decoded first" \
  "$qnedit" waveform "$samples/voice.m4a" -o "$out/voice_m4a_waveform.png"
step "Mix background music in, 6 dB down, starting after 0.5 s" \
  "$qnedit" mix "$samples/voice.flac" "$samples/music.wav" "$out/voice_with_music.wav" --bgm-gain -6 --offset 500
step "MP3 music under the clip, repeated to its end: video copied, audio re-encoded as AAC" \
  "$qnedit" mix "$samples/clip.mp4" "$samples/music.mp3" "$out/clip_with_music.mp4" --bgm-gain -9 --offset 0 --loop
step "The clip with music" "$qnedit" probe "$out/clip_with_music.mp4"
step "The clip's picture at 3 s, turned upright as a player shows it" \
  "$qnedit" frame "$samples/clip.mp4" --at 3 -o "$out/clip_3s.png"
step "Eight thumbnails along the clip, the strip under a timeline" \
  "$qnedit" frame "$samples/clip.mp4" --count 8 -o "$out/strip/"
step "A decoded NV12 frame as an RGB 5:6:5 picture" \
  "$qnedit" frame "$samples/frame_320x240.nv12" --size 320x240 --format nv12 -o "$out/frame.png"

printf '\nResults in %s:\n' "$out"
ls -l "$out"
