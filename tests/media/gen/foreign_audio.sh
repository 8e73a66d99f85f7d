#!/usr/bin/env bash
# Audio as other producers write it: RF64/BW64 and pipe-written WAVE, A-law
# and mu-law WAVE, FLAC with an ID3v2 tag in front, chained Ogg Vorbis, two
# real recordings from Debian's sound-theme-freedesktop, and (in
# OUTDIR/refused) files that are refused with a reason. Written to
# OUTDIR/foreign with facts in facts.txt
# ("<file> <key> <value>", as audio.sh):
#   pcm_fnv     FNV-1a 64 of the 16-bit PCM ffmpeg (or `flac -d`) decodes to
#   frames      PCM frames per channel; rate, channels
#   frame_offset (FLAC) where the first frame starts, after the tag
#   <file>.packets  ffprobe's "pts,duration,size" per packet
# A chain is the `cat` of link_*.ogg files, whose own facts give the
# expected packets of each link.
set -euo pipefail
out="$1/foreign"
here=$(cd "$(dirname "$0")" && pwd)
mkdir -p "$out"
cd "$out"
rm -f ./*.wav ./*.flac ./*.ogg ./*.oga ./*.packets facts.txt
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

ff() { ffmpeg -nostdin -hide_banner -loglevel error -y "$@"; }
fact() { echo "$1 $2 $3" >> facts.txt; }
fnv() { python3 "$here/audio_tool.py" fnv "$1"; }
packets() {
  ffprobe -v error -select_streams a:0 -show_entries packet=pts,duration,size -of csv=p=0 "$1" > "$1.packets"
}
tone() { # rate channels seconds frequency -> wav path
  local f="$tmp/tone_$1_$2_$3_$4.wav"
  ff -f lavfi -i "sine=frequency=$4:sample_rate=$1:duration=$3" \
     -f lavfi -i "anoisesrc=color=pink:amplitude=0.2:sample_rate=$1:duration=$3:seed=11" \
     -filter_complex "[0][1]amix=inputs=2:normalize=0,aformat=channel_layouts=$([ "$2" = 1 ] && echo mono || echo stereo)" \
     -c:a pcm_s16le "$f"
  echo "$f"
}
pcm_facts() { # file: what ffmpeg decodes it to, as 16-bit PCM
  ff -i "$1" -f s16le -c:a pcm_s16le "$tmp/raw"
  fact "$1" pcm_fnv "$(fnv "$tmp/raw")"
  fact "$1" frames $(( $(stat -c %s "$tmp/raw") / 2 / $(ffprobe -v error -show_entries stream=channels -of csv=p=0 "$1") ))
}

# WAVE. RF64 from ffmpeg; BW64 is the same layout under another magic
# (ITU-R BS.2088); a WAVE written to a pipe carries 0xFFFFFFFF sizes.
ff -i "$(tone 16000 2 0.4 440)" -rf64 always -c:a pcm_s16le rf64.wav
python3 - rf64.wav bw64.wav <<'PY'
import sys
d = bytearray(open(sys.argv[1], "rb").read()); d[0:4] = b"BW64"; open(sys.argv[2], "wb").write(d)
PY
ff -i "$(tone 22050 1 0.4 330)" -f wav -c:a pcm_s16le - | cat > pipe.wav
# G.711: ffmpeg and sox, plain and (three channels) WAVE_FORMAT_EXTENSIBLE.
ff -i "$(tone 8000 1 0.5 440)" -c:a pcm_alaw alaw.wav
ff -i "$(tone 8000 1 0.5 440)" -c:a pcm_mulaw mulaw.wav
sox "$(tone 8000 2 0.3 550)" -e a-law alaw_sox.wav
sox "$(tone 8000 2 0.3 550)" -e mu-law mulaw_sox.wav
ff -i "$(tone 8000 1 0.3 440)" -af "pan=3.0|c0=c0|c1=c0|c2=c0" -c:a pcm_mulaw mulaw_ext.wav
for f in rf64.wav pipe.wav alaw.wav mulaw.wav alaw_sox.wav mulaw_sox.wav mulaw_ext.wav; do pcm_facts "$f"; done
grep "^rf64.wav " facts.txt | sed 's/^rf64.wav /bw64.wav /' >> facts.txt

# FLAC with an ID3v2 tag in front (the id3v2 tool; v2 only: a trailing ID3v1
# tag is not part of this case).
flac -s -f --no-padding -b 4096 -o id3.flac "$(tone 44100 2 0.5 440)"
id3v2 -2 -t "Tagged in front" -a "Some artist" id3.flac
flac -s -t id3.flac
flac -s -f -d --force-raw-format --endian=little --sign=signed -o "$tmp/raw" id3.flac
fact id3.flac pcm_fnv "$(fnv "$tmp/raw")"
fact id3.flac frames $(( $(stat -c %s "$tmp/raw") / 4 ))
fact id3.flac frame_offset "$(python3 - id3.flac <<'PY'
import sys
d = open(sys.argv[1], "rb").read()
pos = 10 + ((d[6] << 21) | (d[7] << 14) | (d[8] << 7) | d[9])
assert d[pos:pos + 4] == b"fLaC"
pos += 4
while True:
    hdr, length = d[pos], int.from_bytes(d[pos + 1:pos + 4], "big")
    pos += 4 + length
    if hdr & 0x80:
        break
print(pos)
PY
)"
packets id3.flac

# Ogg Vorbis links from oggenc, chained with cat: alike (same rate, channels
# and quality, so the same set-up), one file twice (the same serial number),
# and a change of rate.
oggenc -Q -q 0 -s 101 "$(tone 22050 1 1.0 440)" -o link_a.ogg
oggenc -Q -q 0 -s 202 "$(tone 22050 1 1.3 660)" -o link_b.ogg
oggenc -Q -q 0 -s 303 "$(tone 16000 1 0.6 440)" -o link_c.ogg
cat link_a.ogg link_b.ogg > chain_same.ogg
cat link_a.ogg link_a.ogg > chain_twice.ogg
cat link_a.ogg link_c.ogg > chain_rate.ogg
# Real recordings.
for f in bell dialog-information; do cp "/usr/share/sounds/freedesktop/stereo/$f.oga" "$f.oga"; done
for f in link_a.ogg link_b.ogg link_c.ogg bell.oga dialog-information.oga; do
  packets "$f"
  fact "$f" frames "$(ffprobe -v error -select_streams a:0 -count_packets -show_entries stream=duration_ts -of csv=p=0 "$f")"
done

# Refused, each with its reason.
mkdir -p ../refused
rm -f ../refused/*
ff -i "$(tone 8000 1 0.1 440)" -c:a adpcm_ima_wav ../refused/ima_adpcm.wav
ff -i "$(tone 8000 1 0.1 440)" -c:a flac -f ogg ../refused/flac_in.ogg
