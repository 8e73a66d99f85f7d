#!/usr/bin/env bash
# What ffmpeg decodes the compressed test files to, for the decoder tests, and
# one more file the decoder takes: MP3 (LAME, with its priming) inside MP4.
# OUTDIR/codec/decoded.txt lines: "<file> <key> <value>" with keys
#   frames     PCM frames per channel after the priming is dropped
#   pcm_fnv    FNV-1a 64 of those frames as 16-bit little-endian interleaved
#   concealed  packet times (us) ffmpeg could not decode and dropped, where
#              our decoder puts silence (AMR only); "-" when none
# Ogg Vorbis is cut to the granule position of its last page (Vorbis I, A.2),
# which ffmpeg does not apply at the end.
# Runs after audio.sh, mp3.sh and mp4.sh (the names sort so): it reads their files from OUTDIR.
set -euo pipefail
out=${1:?usage: pcm_reference.sh OUTDIR}
here=$(cd "$(dirname "$0")" && pwd)
dir="$out/codec"
mkdir -p "$dir"
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
ff() { ffmpeg -nostdin -hide_banner -loglevel error -y -bitexact "$@"; }
probe() { ffprobe -v error -select_streams a:0 "$@"; }

tone=(-f lavfi -i "sine=frequency=523:sample_rate=44100:duration=1" -f lavfi
      -i "anoisesrc=color=pink:amplitude=0.1:sample_rate=44100:duration=1:seed=3")
mix=(-filter_complex "[0][1]amix=inputs=2:normalize=0")
ff "${tone[@]}" "${mix[@]}" -ac 2 -c:a libmp3lame -b:a 48k "$dir/mp3.mp4"

facts="$dir/decoded.txt"
: > "$facts"
for f in mp4/aac.m4a mp4/amr_nb.3gp mp4/avc_aac.mp4 audio/nb.amr audio/wb.awb audio/mono.ogg audio/stereo.ogg \
         codec/mp3.mp4 mp3/vbr_tags.mp3 mp3/cbr_mpeg2.mp3 mp3/mpeg25_ape.mp3 mp3/gst_cbr.mp3; do
  # The tags at the end must not change the audio (ffmpeg decodes some of them).
  src="$out/$f"
  [[ $f == mp3/mpeg25_ape.mp3 ]] && python3 "$here/mp3_tags.py" untagged "$src" "$tmp/untagged.mp3" && src="$tmp/untagged.mp3"
  ff -i "$src" -map 0:a:0 -f s16le "$tmp/pcm" 2>/dev/null || true
  channels=$(probe -show_entries stream=channels -of csv=p=0 "$out/$f")
  bytes=$(stat -c %s "$tmp/pcm")
  frames=$((bytes / 2 / channels))
  if [[ $f == *.ogg ]]; then
    frames=$(probe -show_entries stream=duration_ts -of csv=p=0 "$out/$f")
    truncate -s $((frames * 2 * channels)) "$tmp/pcm"
  fi
  # AMR packets without a decoded frame of the same time: comfort noise and
  # lost frames (3GPP TS 26.201), which ffmpeg does not decode. Other codecs
  # legitimately give nothing for some packets (Vorbis' first, AAC priming).
  concealed=-
  [[ $f == *.amr || $f == *.awb || $f == *.3gp ]] && {
  tb=$(probe -show_entries stream=time_base -of csv=p=0 "$out/$f")
  concealed=$(comm -23 <(probe -show_entries packet=pts -of csv=p=0 "$out/$f" | sort) \
                       <(probe -show_entries frame=pts -of csv=p=0 "$out/$f" 2>/dev/null | sort) |
              awk -F/ -v tb="$tb" 'BEGIN { split(tb, r, "/") } { printf "%s%d", n++ ? "," : "", $1 * 1000000 * r[1] / r[2] + 0.5 }')
  }
  echo "$f frames $frames" >> "$facts"
  echo "$f pcm_fnv $(python3 "$here/audio_tool.py" fnv "$tmp/pcm")" >> "$facts"
  echo "$f concealed ${concealed:--}" >> "$facts"
done
