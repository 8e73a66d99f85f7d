#!/usr/bin/env bash
# MP3 files for the MP3 extractor tests, from two encoders (ffmpeg's LAME and
# GStreamer's), with the tags taggers put around them, and the facts ffprobe
# records about them in OUTDIR/mp3/facts.txt: "<file> <key> <value>" with
# keys rate, channels, packets, duration_us.
set -euo pipefail
out=${1:?usage: mp3.sh OUTDIR}
here=$(cd "$(dirname "$0")" && pwd)
dir="$out/mp3"
mkdir -p "$dir"
rm -f "$dir"/*.mp3 "$dir/facts.txt"
ff() { ffmpeg -nostdin -hide_banner -loglevel error -y -bitexact "$@"; }
tone() { # rate seconds
  echo "-f lavfi -i sine=frequency=660:sample_rate=$1:duration=$2 -f lavfi"
  echo "-i anoisesrc=color=pink:amplitude=0.1:sample_rate=$1:duration=$2:seed=5"
}
mix=(-filter_complex "[0][1]amix=inputs=2:normalize=0")

# MPEG-1 VBR with its Xing and LAME frame, ID3v2 in front and ID3v1 at the end.
ff $(tone 44100 1) "${mix[@]}" -ac 2 -c:a libmp3lame -q:a 6 -id3v2_version 3 -write_id3v1 1 \
   -metadata title=vbr "$dir/vbr_tags.mp3"
# MPEG-2 CBR without an info frame: duration from the bitrate.
ff $(tone 22050 0.8) "${mix[@]}" -ac 1 -c:a libmp3lame -b:a 32k -write_xing 0 -id3v2_version 0 "$dir/cbr_mpeg2.mp3"
# MPEG-2.5 with an APE tag (header and footer) and ID3v1 after it.
ff $(tone 8000 1) "${mix[@]}" -ac 1 -c:a libmp3lame -b:a 16k -id3v2_version 0 "$dir/mpeg25_ape.mp3"
python3 "$here/mp3_tags.py" ape "$dir/mpeg25_ape.mp3"
# GStreamer's LAME, its own ID3v2 writer.
gst-launch-1.0 -q audiotestsrc num-buffers=40 samplesperbuffer=1152 wave=sine freq=330 ! \
  audio/x-raw,rate=48000,channels=2 ! lamemp3enc target=bitrate bitrate=96 cbr=true ! \
  id3v2mux ! filesink location="$dir/gst_cbr.mp3"

for f in "$dir"/*.mp3; do
  n=$(basename "$f")
  while IFS== read -r k v; do
    case $k in
      sample_rate) echo "$n rate $v" ;;
      channels) echo "$n channels $v" ;;
      duration) echo "$n duration_us $(awk -v d="$v" 'BEGIN { printf "%d", d * 1000000 + 0.5 }')" ;;
    esac
  done < <(ffprobe -v error -select_streams a:0 -show_entries stream=sample_rate,channels,duration -of default=nw=1 "$f")
  echo "$n packets $(ffprobe -v error -select_streams a:0 -show_entries packet=pts -of csv=p=0 "$f" | wc -l)"
done > "$dir/facts.txt"
