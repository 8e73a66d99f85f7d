#!/usr/bin/env bash
# Small audio files for the WAVE, FLAC, AMR and Ogg extractor tests, and the
# facts recorded about them (from ffprobe, flac and the raw PCM) in
# OUTDIR/audio/facts.txt and OUTDIR/audio/*.packets.
#
# facts.txt lines: "<file> <key> <value>". Keys: rate, channels, bits,
# frames (PCM frames per channel), pcm_fnv (FNV-1a 64 of the raw PCM the file
# decodes to: the data chunk for WAVE, `flac -d` output for FLAC),
# frame_offset (FLAC: where the first frame starts), items (device items).
# <file>.packets: ffprobe's packet list, "pts,duration,size" per line.
set -euo pipefail
out="$1/audio"
here=$(cd "$(dirname "$0")" && pwd)
mkdir -p "$out"
cd "$out"
rm -f ./*.wav ./*.flac ./*.amr ./*.awb ./*.ogg ./*.packets facts.txt
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

ff() { ffmpeg -nostdin -hide_banner -loglevel error -y "$@"; }
# A tone with some noise, so that compressed frames are not trivially small.
src() { # rate channels seconds
  ff -f lavfi -i "sine=frequency=440:sample_rate=$1:duration=$3" \
     -f lavfi -i "anoisesrc=color=pink:amplitude=0.2:sample_rate=$1:duration=$3:seed=7" \
     -filter_complex "[0][1]amix=inputs=2:normalize=0,aformat=channel_layouts=$([ "$2" = 1 ] && echo mono || echo stereo)" \
     -c:a pcm_s32le -f wav "$tmp/src_$1_$2_$3.wav"
  echo "$tmp/src_$1_$2_$3.wav"
}
fact() { echo "$1 $2 $3" >> facts.txt; }
fnv() { python3 "$here/audio_tool.py" fnv "$1"; }
packets() {
  ffprobe -v error -select_streams a:0 -show_entries packet=pts,duration,size -of csv=p=0 "$1" > "$1.packets"
}

# Records rate, channels, bits and frames; prints the codec name.
stream_facts() {
  local k v codec="" bits=0 raw=0
  while IFS== read -r k v; do
    case $k in
      codec_name) codec=$v ;;
      sample_rate) fact "$1" rate "$v" ;;
      channels) fact "$1" channels "$v" ;;
      duration_ts) fact "$1" frames "$v" ;;
      bits_per_sample) bits=$v ;;
      bits_per_raw_sample) raw=$v ;;
    esac
  done < <(ffprobe -v error -select_streams a:0 -show_entries \
    stream=codec_name,sample_rate,channels,bits_per_sample,bits_per_raw_sample,duration_ts \
    -of default=nw=1 "$1")
  [ "$bits" = 0 ] && bits=$raw
  fact "$1" bits "$bits"
  echo "$codec"
}

# WAVE: plain PCM and float from sox (-t wavpcm keeps the plain header),
# WAVE_FORMAT_EXTENSIBLE from ffmpeg.
wav() { # name sox-encoding-args rate channels
  local name=$1 rate=$3 ch=$4
  sox -R "$(src "$rate" "$ch" 0.5)" $2 -t wavpcm "$name"
}
wav u8_mono.wav "-e unsigned -b 8" 8000 1
wav s16_stereo.wav "-e signed -b 16" 22050 2
wav s24_mono.wav "-e signed -b 24" 16000 1
wav s32_stereo.wav "-e signed -b 32" 16000 2
wav f32_mono.wav "-e float -b 32" 16000 1
ff -i "$(src 8000 1 0.2)" -af "pan=5.1|c0=c0|c1=c0|c2=c0|c3=c0|c4=c0|c5=c0" -c:a pcm_s24le s24_ext_6ch.wav
# The device's chunks after the data chunk (odd text length: padded).
python3 "$here/audio_tool.py" wavitems s16_stereo.wav items.wav
for f in u8_mono s16_stereo s24_mono s32_stereo f32_mono s24_ext_6ch items; do
  f=$f.wav
  codec=$(stream_facts "$f")
  ff -i "$f" -c copy -f "${codec#pcm_}" "$tmp/raw"
  fact "$f" pcm_fnv "$(fnv "$tmp/raw")"
done
fact items.wav items "wafm:0001fffe7fff umsg:hello-device rmod:vr180 bksz:4660"

# FLAC: fixed block sizes 4096 and 1152, a 24-bit stream, one with the
# device's APPLICATION blocks, and one with variable block sizes.
sox -R "$(src 44100 2 1)" -b 16 "$tmp/s16.wav"
flac -s -f --no-padding -b 4096 -o b4096.flac "$tmp/s16.wav"
sox -R "$(src 22050 1 1)" -b 16 "$tmp/m16.wav"
flac -s -f --no-padding -b 1152 -o b1152.flac "$tmp/m16.wav"
sox -R "$(src 48000 2 0.5)" -b 24 "$tmp/s24.wav"
flac -s -f --no-padding -b 4096 -o s24.flac "$tmp/s24.wav"
python3 "$here/audio_tool.py" flacitems b1152.flac items.flac
# Variable block sizes (sync code 0xFFF9), built by hand; both reference
# decoders must take it and agree.
python3 "$here/flac_vbs.py" vbs.flac
flac -s -t vbs.flac
flac -s -f -d --force-raw-format --endian=little --sign=signed -o "$tmp/vbs_flac.raw" vbs.flac
ff -xerror -i vbs.flac -f s16le "$tmp/vbs_ff.raw"
cmp "$tmp/vbs_flac.raw" "$tmp/vbs_ff.raw"
for f in b4096 b1152 s24 items vbs; do
  f=$f.flac
  stream_facts "$f" > /dev/null
  flac -s -f -d --force-raw-format --endian=little --sign=signed -o "$tmp/raw" "$f"
  fact "$f" pcm_fnv "$(fnv "$tmp/raw")"
  fact "$f" frame_offset "$(python3 "$here/audio_tool.py" flacoffset "$f")"
  packets "$f"
done

# AMR: NB from sox; WB assembled from frame headers and payloads, since no
# encoder for it is at hand.
sox -R "$(src 8000 1 1)" -r 8000 -t amr-nb nb.amr
python3 "$here/audio_tool.py" amrwb wb.awb
for f in nb.amr wb.awb; do packets "$f"; done

# Ogg Vorbis: a stereo file whose end is trimmed by the last granule position,
# and a longer mono one with many pages for seeking.
ff -i "$(src 44100 2 1)" -t 0.7731 -c:a libvorbis -q:a 2 stereo.ogg
ff -i "$(src 22050 1 3)" -c:a libvorbis -q:a 0 -page_duration 100000 mono.ogg
for f in stereo.ogg mono.ogg; do
  packets "$f"
  fact "$f" frames "$(ffprobe -v error -select_streams a:0 -count_packets -show_entries stream=duration_ts -of csv=p=0 "$f")"
done
