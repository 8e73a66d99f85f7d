#!/usr/bin/env bash
# Background music mixes: `qnedit mix` of an MP3 into a long 720p H.264+AAC
# video (video copied, audio decoded, mixed and encoded to AAC) against
# `ffmpeg -filter_complex amix -c:v copy -c:a aac`, and of a long WAV into a
# long WAV against ffmpeg's amix to WAV. Alternated runs, medians of wall and
# CPU time, peak RSS (see alternate.sh).
#
# Usage: mix_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   MEDIA_DIR keeps the generated media between runs (default: a temp dir).
#   MIX_MINUTES sets the video's and the WAVs' length (default 10).
set -euo pipefail
build=${1:?usage: mix_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit="env LD_LIBRARY_PATH=$build/lib $build/bin/qnedit"
runs=${3:-5}
minutes=${MIX_MINUTES:-10}
secs=$((minutes * 60))
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${2:-$out/media}
mkdir -p "$media"
source "$(dirname "$0")/alternate.sh"
ff="ffmpeg -nostdin -hide_banner -loglevel error -y"

video=$media/mix_${minutes}m.mp4
bgm=$media/bgm_3m.mp3
main_wav=$media/main_${minutes}m.wav
bgm_wav=$media/bgm_${minutes}m.wav
[[ -s $video ]] || $ff -f lavfi -i "testsrc2=size=1280x720:rate=30:duration=$secs" \
  -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=$secs" \
  -c:v libx264 -preset ultrafast -g 60 -c:a aac -b:a 128k -ac 2 -shortest "$video"
# Three minutes of music, looped under the whole video.
[[ -s $bgm ]] || $ff -f lavfi -i "aevalsrc=0.2*sin(2*PI*(330+20*sin(t))*t)|0.2*sin(2*PI*495*t):s=44100:d=180" \
  -c:a libmp3lame -b:a 192k "$bgm"
[[ -s $main_wav ]] || $ff -f lavfi -i "aevalsrc=0.3*sin(440*2*PI*t)+0.1*random(0)|0.3*sin(660*2*PI*t):s=44100:d=$secs" \
  -c:a pcm_s16le "$main_wav"
[[ -s $bgm_wav ]] || $ff -f lavfi -i "aevalsrc=0.2*sin(523*2*PI*t)|0.2*sin(784*2*PI*t):s=44100:d=$secs" \
  -c:a pcm_s16le "$bgm_wav"

alternate "MP3 background into a ${minutes}-minute 720p video" \
  "$qnedit --quiet mix '$video' '$bgm' '$out/ours.mp4' --offset 0 --loop" \
  "$ff -i '$video' -stream_loop -1 -i '$bgm' -filter_complex '[0:a][1:a]amix=inputs=2:duration=first[a]' -map 0:v -map '[a]' -c:v copy -c:a aac '$out/ff.mp4' && sync '$out/ff.mp4'" \
  "qnedit mix --loop" "ffmpeg amix -c:v copy -c:a aac"
alternate "${minutes}-minute WAV into a ${minutes}-minute WAV" \
  "$qnedit --quiet mix '$main_wav' '$bgm_wav' '$out/ours.wav' --offset 0" \
  "$ff -i '$main_wav' -i '$bgm_wav' -filter_complex amix=inputs=2:duration=first '$out/ff.wav' && sync '$out/ff.wav'" \
  "qnedit mix" "ffmpeg amix"
