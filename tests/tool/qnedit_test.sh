#!/usr/bin/env bash
# The editor as a user runs it: every subcommand on the sample media, the
# results checked with ffprobe, ffmpeg and the flac tool, and bad input and
# bad usage answered with one line and the right exit status.
set -u
qnedit=$1
samples=$2
source "$(dirname "$0")/checks.sh"
duration() { ffprobe -v error -show_entries format=duration -of csv=p=0 "$1"; }

# probe
check "probe text" "$qnedit" --quiet probe "$samples/clip.mp4"
check "probe json names both tracks" bash -c "'$qnedit' probe --json '$samples/clip.mp4' | python3 -c '
import json, sys
j = json.load(sys.stdin)
assert [t[\"codec\"] for t in j[\"tracks\"]] == [\"h264\", \"aac\"], j
assert j[\"tracks\"][0][\"samples\"] == 200 and j[\"tracks\"][0][\"syncSamples\"] == 4, j
assert j[\"device\"][\"orientation\"] == 270, j
'"
for f in "$samples/clip.mp4" "$samples/voice.flac" "$samples/music.wav"; do
  check "probe from the index is what reading $(basename "$f") gives" \
    cmp <("$qnedit" probe --json "$f") <("$qnedit" probe --json --verify "$f")
done

# trim MP4: presentation starts at --start and lasts to --end, pre-roll hidden
check "trim mp4" "$qnedit" --quiet trim "$samples/clip.mp4" "$work/cut.mp4" --start 2.5 --end 6
if have ffprobe; then
  check "trimmed mp4 lasts 3.5 s" near "$(duration "$work/cut.mp4")" 3.5 0.05
  # The audio from 0; the video from its first frame at or after --start (25 fps).
  check "trimmed mp4 starts at 0" bash -c "ffprobe -v error -show_entries stream=start_time -of csv=p=0 '$work/cut.mp4' | awk '{ if (\$1 + 0 < 0 || \$1 + 0 >= 0.04) exit 1; if (\$1 + 0 == 0) zero = 1 } END { exit !zero }'"
  check "trimmed mp4 decodes" ffmpeg -v error -i "$work/cut.mp4" -f null -
  check "rotation kept" bash -c "ffprobe -v error -show_streams '$work/cut.mp4' | grep -q rotation=90"
fi
check "trim mp4 from the key frame" "$qnedit" --quiet trim "$samples/clip.mp4" "$work/key.mp4" --start 2.5 --end 6 --keyframe
have ffprobe && check "key-frame trim is longer" bash -c "awk -v d=\$(ffprobe -v error -show_entries format=duration -of csv=p=0 '$work/key.mp4') 'BEGIN { exit !(d > 3.5) }'"
check "audio only into m4a" "$qnedit" --quiet trim "$samples/clip.mp4" "$work/cut.m4a" --start 1 --end 3
have ffprobe && check "m4a holds aac only" bash -c "[ \"\$(ffprobe -v error -show_entries stream=codec_name -of csv=p=0 '$work/cut.m4a')\" = aac ]"

# trim FLAC through the frame converter
check "trim flac" "$qnedit" --quiet trim "$samples/voice.flac" "$work/cut.flac" --start 1.2 --end 5
have flac && check "trimmed flac passes flac -t" flac --test --silent "$work/cut.flac"
# Frames of varying block sizes cannot be renumbered: refused, nothing written.
vbs="$(dirname "$0")/../media/audio/vbs.flac"
check "variable block size flac refused" expect_status 1 "$qnedit" trim "$vbs" "$work/vbs.flac" --start 0.1
check "refusal names the cause" grep -q "variable block size" "$work/err.txt"
check "refused trim leaves no output" test ! -e "$work/vbs.flac"
# trim WAV exactly
check "trim wav" "$qnedit" --quiet trim "$samples/music.wav" "$work/cut.wav" --start 1 --end 2.5
have ffprobe && check "trimmed wav lasts 1.5 s" near "$(duration "$work/cut.wav")" 1.5 0.001

# waveform
check "waveform json" bash -c "'$qnedit' waveform '$samples/voice.flac' | python3 -c '
import json, sys
j = json.load(sys.stdin)
assert j[\"intervalUs\"] == 20000 and j[\"count\"] == 400 == len(j[\"values\"]), j[\"count\"]
'"
check "waveform png" "$qnedit" waveform "$samples/voice.flac" -o "$work/w.png"
check "png signature" bash -c "head -c 8 '$work/w.png' | od -An -tx1 | grep -q '89 50 4e 47'"

# mix
check "mix" "$qnedit" --quiet mix "$samples/voice.flac" "$samples/music.wav" "$work/mix.flac" --bgm-gain -6 --offset 500
have flac && check "mixed flac passes flac -t" flac --test --silent "$work/mix.flac"
have ffprobe && check "mix keeps the main length" near "$(duration "$work/mix.flac")" 8 0.01

# frame
check "frame" "$qnedit" frame "$samples/frame_320x240.nv12" --size 320x240 --format nv12 -o "$work/f.png"
check "cropped frame" "$qnedit" frame "$samples/frame_320x240.nv12" --size 320x240 --format nv12 --crop 10,10,169,129 --range full -o "$work/c.png"

# bad input: status 1, one line, no output left behind
head -c 5000 "$samples/clip.mp4" >"$work/broken.mp4"
printf 'not media at all' >"$work/junk.bin"
check "missing file" expect_status 1 "$qnedit" probe "$work/none.mp4"
check "junk file" expect_status 1 "$qnedit" probe "$work/junk.bin"
check "truncated input" expect_status 1 "$qnedit" trim "$work/broken.mp4" "$work/never.mp4" --start 1
check "no half-written output" test ! -e "$work/never.mp4"
check "short frame file" expect_status 1 "$qnedit" frame "$work/junk.bin" --size 320x240 --format nv12 -o "$work/never.png"
check "no picture left" test ! -e "$work/never.png"
check "start past the end" expect_status 1 "$qnedit" trim "$samples/music.wav" "$work/never.wav" --start 60
# bad usage: status 2
check "unknown command" expect_status 2 "$qnedit" cut a b
check "missing --start" expect_status 2 "$qnedit" trim "$samples/clip.mp4" "$work/x.mp4"
check "bad number" expect_status 2 "$qnedit" trim "$samples/clip.mp4" "$work/x.mp4" --start abc
check "unknown option" expect_status 2 "$qnedit" probe --colour "$samples/clip.mp4"
check "help" "$qnedit" trim --help

# Files of other producers (tests/media/gen/foreign_audio.sh): RF64, pipe-written
# and G.711 WAVE trimmed sample-exactly (ffmpeg decodes the same span of the
# source), FLAC behind an ID3v2 tag, chained Ogg, and refusals that say why.
foreign="$(dirname "$0")/../media/foreign"
refused="$(dirname "$0")/../media/refused"
for f in rf64.wav bw64.wav pipe.wav alaw.wav mulaw_ext.wav id3.flac chain_same.ogg bell.oga; do
  check "probe $f" "$qnedit" --quiet probe "$foreign/$f"
done
check "chained ogg lasts both links" bash -c "'$qnedit' probe --json '$foreign/chain_same.ogg' | python3 -c '
import json, sys
j = json.load(sys.stdin)
assert j[\"durationUs\"] == 2300000 and j[\"tracks\"][0][\"samples\"] == 102, j
'"
for f in rf64.wav pipe.wav alaw.wav mulaw_ext.wav; do
  check "trim $f" "$qnedit" --quiet trim "$foreign/$f" "$work/foreign_$f" --start 0.1 --end 0.3
  have ffmpeg && check "trimmed $f holds the source's samples" bash -c "
    r=\$(ffprobe -v error -show_entries stream=sample_rate -of csv=p=0 '$foreign/$f')
    cmp <(ffmpeg -v error -i '$foreign/$f' -af atrim=start_sample=\$((r / 10)):end_sample=\$((r * 3 / 10)) -f s16le -) \
        <(ffmpeg -v error -i '$work/foreign_$f' -f s16le -)"
done
check "trim tagged flac" "$qnedit" --quiet trim "$foreign/id3.flac" "$work/foreign_id3.flac" --start 0.1 --end 0.4
have flac && check "trimmed tagged flac passes flac -t" flac --test --silent "$work/foreign_id3.flac"
check "waveform of mu-law wav" "$qnedit" waveform "$foreign/mulaw.wav" -o "$work/foreign_w.png"
check "waveform of tagged flac" "$qnedit" waveform "$foreign/id3.flac" -o "$work/foreign_f.png"
while IFS='|' read -r f why; do
  check "$f refused" expect_status 1 "$qnedit" probe "$refused/$f"
  check "$f refusal says why" grep -qF "$why" "$work/err.txt"
done <<'LIST'
ima_adpcm.wav|WAVE encoding 17 (IMA ADPCM) is not supported
flac_in.ogg|Ogg stream holds FLAC, which is not supported
LIST

# Fragmented MP4 (tests/media/gen/mp4_fragmented.sh): probed with every sample
# the producer wrote, and trimmed into a plain MP4.
frag="$(dirname "$0")/../media/mp4"
check "probe fragmented mp4" bash -c "'$qnedit' probe --json '$frag/frag_gst.mp4' | python3 -c '
import json, sys
j = json.load(sys.stdin)
assert [t[\"samples\"] for t in j[\"tracks\"]] == [40, 36] and j[\"tracks\"][0][\"syncSamples\"] == 2, j
'"
check "trim fragmented mp4" "$qnedit" --quiet trim "$frag/frag_mediabunny.mp4" "$work/frag_cut.mp4" --start 0.5 --end 1.5
have ffprobe && check "trimmed fragmented mp4 lasts the span" near "$(duration "$work/frag_cut.mp4")" 1.0 0.05

# Waveforms of compressed audio and of PCM the builder does not take as it is
# (8-bit, float, six channels): the same values as from ffmpeg's conversion to
# 16-bit WAV (within 1); also for the audio of a video, and with --track.
media="$(dirname "$0")/../media"
wave_values() { "$qnedit" waveform "$@" | python3 -c 'import json, sys; print(*json.load(sys.stdin)["values"])'; }
for f in "$media/mp4/aac.m4a" "$media/audio/nb.amr" "$media/audio/stereo.ogg" "$media/codec/mp3.mp4" "$media/mp3/vbr_tags.mp3" "$samples/clip.mp4" \
         "$media/audio/u8_mono.wav" "$media/audio/f32_mono.wav" "$media/audio/s24_ext_6ch.wav"; do
  have ffmpeg || break
  n=$(basename "$f")
  # The six channels of that file are one: their mean is the first.
  mix=(); [[ $n == *6ch* ]] && mix=(-af 'pan=mono|c0=c0')
  ffmpeg -nostdin -v error -y -i "$f" -vn "${mix[@]}" -c:a pcm_s16le "$work/dec_$n.wav"
  check "waveform of $n as of its wav" python3 -c '
import sys
a, b = (list(map(int, open(p).read().split())) for p in sys.argv[1:])
assert len(a) == len(b) and all(abs(x - y) <= 1 for x, y in zip(a, b)), (len(a), len(b))
' <(wave_values "$f") <(wave_values "$work/dec_$n.wav")
done
check "waveform --track 1 of a video" cmp <(wave_values "$samples/clip.mp4") <(wave_values "$samples/clip.mp4" --track 1)
check "waveform --track of a video track refused" expect_status 1 "$qnedit" waveform "$samples/clip.mp4" --track 0

# A tagging tool's rewrite (metadata in front, index moved ahead, padding)
# trims to the same frames as the file it came from.
mp4media=$(dirname "$0")/../media/mp4
check "tagged mp4 trims" "$qnedit" --quiet trim "$mp4media/avc_aac_tagged.mp4" "$work/tagged_cut.mp4" --start 0.5 --end 1.5
check "untagged mp4 trims" "$qnedit" --quiet trim "$mp4media/avc_aac.mp4" "$work/plain_cut.mp4" --start 0.5 --end 1.5
have ffmpeg && check "same frames with or without tags" bash -c "
  cmp <(ffmpeg -v error -i '$work/tagged_cut.mp4' -f framemd5 - | grep -v '^#') <(ffmpeg -v error -i '$work/plain_cut.mp4' -f framemd5 - | grep -v '^#')"

echo "$pass passed, $fail failed"
[ "$fail" -eq 0 ]
