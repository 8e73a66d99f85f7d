#!/usr/bin/env bash
# Small H.264 + AAC files from muxers other than ours, for the editor's exact
# trim test (tests/tool/qnedit_trim_test.py): ffmpeg with B-frames (2, and 3
# with a pyramid), an open GOP, edit lists with an empty edit and with a
# media time, two audio tracks beside subtitle, chapter and timecode tracks;
# GStreamer's qtmux, mp4mux and 3gppmux; mediabunny under node. cuts.txt
# lists the cuts the test makes in each.
#   needs: ffmpeg, gst-launch-1.0 with x264enc/avenc_aac/voaacenc (the
#   gstreamer1.0-plugins-{good,bad,ugly} and gstreamer1.0-libav packages),
#   node and npm (mediabunny is installed into a temporary directory).
set -euo pipefail
out=${1:?usage: trim.sh OUTDIR}
dir="$out/trim"
mkdir -p "$dir"
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

ff() { ffmpeg -hide_banner -loglevel error -y -bitexact "$@"; }
video() { echo "-f lavfi -i testsrc2=size=160x120:rate=$1"; }
tone() { echo "-f lavfi -i sine=frequency=$1:sample_rate=$2"; }
x264() { echo "-c:v libx264 -preset veryfast -b:v 50k -pix_fmt yuv420p -x264-params $1:scenecut=0"; }
aac="-c:a aac -b:a 24k -ac 1"

# ffmpeg: two B-frames, and three with a pyramid (the P-frame is stored two
# and three frames before the B-frames shown before it).
ff $(video 25) $(tone 330 44100) -t 3 $(x264 bframes=2:b-pyramid=none:keyint=12) $aac "$dir/ff_b2.mp4"
ff $(video 30) $(tone 440 48000) -t 3 $(x264 bframes=3:b-pyramid=normal:keyint=20) $aac "$dir/ff_b3_pyramid.mp4"
# An open GOP: the leading B-frames of each I-frame refer to the GOP before.
ff $(video 25) $(tone 550 32000) -t 3 $(x264 bframes=3:b-pyramid=normal:keyint=15:min-keyint=15:open-gop=1) $aac \
   -f mov "$dir/ff_open_gop.mov"
# Audio 0.3 s late: an empty edit, and audio times off any 1 ms grid.
ff $(video 25) -t 3 $(x264 bframes=2:keyint=12) "$tmp/v.mp4"
ff $(tone 660 44100) -t 2.5 $aac "$tmp/a.m4a"
ff -i "$tmp/v.mp4" -itsoffset 0.3 -i "$tmp/a.m4a" -map 0 -map 1 -c copy "$dir/ff_empty_edit.mp4"
# A stream copy from the middle of a GOP: media-time edits in both tracks.
ff $(video 25) $(tone 770 44100) -t 4 $(x264 bframes=2:keyint=25) $aac "$tmp/long.mp4"
ff -ss 1.3 -i "$tmp/long.mp4" -map 0 -c copy "$dir/ff_ss_copy.mp4"
# Two audio tracks, a subtitle, chapters and a timecode track beside them.
printf '1\n00:00:00,500 --> 00:00:02,000\nhello\n' >"$tmp/s.srt"
printf ';FFMETADATA1\n[CHAPTER]\nTIMEBASE=1/1000\nSTART=0\nEND=1500\ntitle=one\n[CHAPTER]\nTIMEBASE=1/1000\nSTART=1500\nEND=3000\ntitle=two\n' >"$tmp/ch.txt"
ff $(video 25) $(tone 330 48000) $(tone 880 22050) -i "$tmp/s.srt" -i "$tmp/ch.txt" -t 3 \
   -map 0 -map 1 -map 2 -map 3 -map_chapters 4 $(x264 bframes=2:keyint=12) $aac -c:s mov_text \
   -timecode 01:00:00:00 -f mov "$dir/ff_two_audio_sub.mov"

# GStreamer: B-frames from x264enc, AAC from libav's and VisualOn's encoders.
gst() {  # gst MUXER FILE AUDIO_ENCODER RATE
  gst-launch-1.0 -q videotestsrc num-buffers=75 pattern=ball ! video/x-raw,width=160,height=120,framerate=25/1 \
    ! x264enc bframes=2 key-int-max=15 bitrate=50 speed-preset=veryfast ! h264parse ! queue ! mux. \
    audiotestsrc num-buffers=$((3 * $4 / 1024)) samplesperbuffer=1024 freq=500 ! audio/x-raw,rate=$4,channels=1 \
    ! audioconvert ! $3 bitrate=24000 ! aacparse ! queue ! mux. $1 name=mux ! filesink location="$2"
}
gst qtmux "$dir/gst_qtmux.mov" avenc_aac 44100
gst mp4mux "$dir/gst_mp4mux.mp4" voaacenc 48000
gst 3gppmux "$dir/gst_3gppmux.3gp" avenc_aac 32000

# mediabunny: the packets of an ffmpeg file remuxed through its packet API
# (it encodes only through WebCodecs, which node lacks).
ff $(video 25) $(tone 500 32000) -t 3 $(x264 bframes=2:keyint=15) $aac "$tmp/mb_src.mp4"
(cd "$tmp" && npm init -y >/dev/null && npm install --silent --no-audit --no-fund mediabunny@1.61.0 >/dev/null)
cat >"$tmp/remux.mjs" <<'EOF'
import { Input, ALL_FORMATS, FilePathSource, Output, Mp4OutputFormat, FilePathTarget,
         EncodedPacketSink, EncodedVideoPacketSource, EncodedAudioPacketSource } from 'mediabunny';
const [src, dst] = process.argv.slice(2);
const input = new Input({ source: new FilePathSource(src), formats: ALL_FORMATS });
const output = new Output({ format: new Mp4OutputFormat({ fastStart: 'in-memory' }), target: new FilePathTarget(dst) });
const video = await input.getPrimaryVideoTrack(), audio = await input.getPrimaryAudioTrack();
const vs = new EncodedVideoPacketSource('avc'), as = new EncodedAudioPacketSource('aac');
output.addVideoTrack(vs, { frameRate: 25 });
output.addAudioTrack(as);
await output.start();
const feed = async (track, source) => {
  const config = await track.getDecoderConfig();
  let first = true;
  for await (const packet of new EncodedPacketSink(track).packets()) {
    await source.add(packet, first ? { decoderConfig: config } : undefined);
    first = false;
  }
  source.close();
};
await Promise.all([feed(video, vs), feed(audio, as)]);
await output.finalize();
EOF
node "$tmp/remux.mjs" "$tmp/mb_src.mp4" "$dir/mediabunny.mp4"

# FILE then cuts START-END (END empty: to the end), times in seconds; the
# copy from 0 to the end is made for every file. "shifted": the video edit
# starts inside a frame (ffmpeg's -ss copy), which ffmpeg shows moved earlier;
# cuts there avoid the 20 ms after a frame start, where its view and the
# file's differ.
cat >"$dir/cuts.txt" <<'EOF'
ff_b2.mp4 0.5-2 1.03-2.47
ff_b3_pyramid.mp4 0.52-2.01 1.1-
ff_open_gop.mov 0.55-2.3
ff_empty_edit.mp4 0.2-1.9 0.61-2.35
ff_ss_copy.mp4 shifted 0.31-1.71
ff_two_audio_sub.mov 0.7-2.2
gst_qtmux.mov 1.03-2.47
gst_mp4mux.mp4 0.9-2.6
gst_3gppmux.3gp 0.41-1.99
mediabunny.mp4 1.03-2.47
EOF
