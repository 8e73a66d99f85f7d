#!/usr/bin/env bash
# Mixing background audio of every kind, into audio and into a video: the
# video's packets unchanged, the audio as long as the recording and where
# ffmpeg places it, compressed backgrounds mixed as their PCM would be, and
# damage reported. Needs ffmpeg and ffprobe.
set -u
qnedit=$1
samples=$2
media=$(cd "$(dirname "$0")/../media" && pwd)
source "$(dirname "$0")/checks.sh"
q() { "$qnedit" --quiet "$@"; }
ff() { ffmpeg -nostdin -v error -y "$@"; }
# Video packets as (size, hash) and their times in ms: the bytes and times,
# not the time base or the order of muxing.
packets() { ffmpeg -nostdin -v error -i "$1" -map 0:v -c copy -f framemd5 - | grep -v '^#' | awk -F, '{print $5, $6}'; }
packet_times() { ffprobe -v error -select_streams v -show_entries packet=pts_time -of csv=p=0 "$1" | awk '{printf "%.3f\n", $1}'; }
decoded_seconds() {  # the audio ffmpeg decodes, in seconds
  ffmpeg -nostdin -v error -i "$1" -map 0:a -f s16le -ac 1 -ar 44100 - | wc -c | awk '{print $1 / 88200}'
}
clean_decode() { [ -z "$(ffmpeg -nostdin -v error -i "$1" -f null - 2>&1)" ]; }

if ! command -v ffmpeg >/dev/null || ! command -v ffprobe >/dev/null; then
  echo "skip: ffmpeg and ffprobe are needed"; exit 0
fi

# Same mix with a compressed background as with ffmpeg's decode of it as WAV.
cat >"$work/compare.py" <<'PY'
import sys, wave, array
def pcm(path):
    w = wave.open(path)
    return w.getnchannels(), w.getframerate(), array.array('h', w.readframes(w.getnframes()))
a, b = pcm(sys.argv[1]), pcm(sys.argv[2])
assert a[:2] == b[:2], (a[:2], b[:2])
assert len(a[2]) == len(b[2]), (len(a[2]), len(b[2]))
worst = max((abs(x - y) for x, y in zip(a[2], b[2])), default=0)
assert worst <= int(sys.argv[3]), worst
PY
for bgm in mp3/vbr_tags.mp3 mp4/aac.m4a audio/stereo.ogg audio/nb.amr; do
  n=$(basename "$bgm")
  # An Ogg stream ends at its last granule position (Vorbis I, A.2), inside
  # the last packet; ffmpeg's WAV keeps the whole packet.
  trim=()
  [[ $n == *.ogg ]] && trim=(-af "atrim=end_sample=$(ffprobe -v error -show_entries stream=duration_ts -of csv=p=0 "$media/$bgm")")
  ff -i "$media/$bgm" -map 0:a "${trim[@]}" -c:a pcm_s16le "$work/bgm_$n.wav"
  check "mix with $n" q mix "$samples/voice.flac" "$media/$bgm" "$work/mix_$n.wav" --offset 250 --bgm-gain -3
  q mix "$samples/voice.flac" "$work/bgm_$n.wav" "$work/ref_$n.wav" --offset 250 --bgm-gain -3 2>/dev/null
  check "$n mixes as its PCM does" python3 "$work/compare.py" "$work/mix_$n.wav" "$work/ref_$n.wav" 3
done

# Into the video: every video packet kept, AAC as long as the video within
# one AAC frame, a clean decode, the rotation carried.
check "mix into a video" q mix "$samples/clip.mp4" "$media/mp3/vbr_tags.mp3" "$work/clip_bgm.mp4" --offset 0 --loop
check "video packets unchanged" cmp <(packets "$samples/clip.mp4") <(packets "$work/clip_bgm.mp4")
check "video times unchanged" cmp <(packet_times "$samples/clip.mp4") <(packet_times "$work/clip_bgm.mp4")
video=$(ffprobe -v error -select_streams v -show_entries stream=duration -of csv=p=0 "$samples/clip.mp4")
check "audio lasts as long as the video" near "$(decoded_seconds "$work/clip_bgm.mp4")" "$video" 0.0233
check "ffmpeg decodes it cleanly" clean_decode "$work/clip_bgm.mp4"
check "rotation carried" bash -c "'$qnedit' probe --json '$work/clip_bgm.mp4' | grep -q '\"orientation\": 270'"
check "a video needs an mp4" bash -c "! '$qnedit' --quiet mix '$samples/clip.mp4' '$samples/music.wav' '$work/x.m4a' 2>/dev/null"
check "m4a main gives m4a" q mix "$media/mp4/aac.m4a" "$samples/music.wav" "$work/aac_bgm.m4a" --offset 0
check "m4a out is one AAC track" bash -c "[ \"\$(ffprobe -v error -show_entries stream=codec_name -of csv=p=0 '$work/aac_bgm.m4a')\" = aac ]"
check "m4a out keeps the length" near "$(decoded_seconds "$work/aac_bgm.m4a")" "$(decoded_seconds "$media/mp4/aac.m4a")" 0.0233

# The encoder's output lines up with its input: main audio only, through AAC
# and ffmpeg's decoder, against the FLAC decoded directly.
q mix "$samples/voice.flac" "$samples/music.wav" "$work/voice.m4a" --mixer 0 --offset 0 2>/dev/null
ff -i "$work/voice.m4a" -map 0:a -f s16le -ac 1 "$work/voice_aac.raw"
ff -i "$samples/voice.flac" -f s16le -ac 1 "$work/voice_flac.raw"
check "AAC lines up with the source within 1 ms" python3 - "$work/voice_flac.raw" "$work/voice_aac.raw" <<'PY'
import sys, array
a, b = (array.array('h', open(p, 'rb').read()) for p in sys.argv[1:3])
assert abs(len(a) - len(b)) < 1024, (len(a), len(b))
start, n, reach = 44100, 6000, 300
# The least difference, not the largest product: a chord's correlation
# peaks a period away as well.
def error(lag):
    return sum((a[start + i] - b[start + i + lag]) ** 2 for i in range(0, n, 3))
best = min(range(-reach, reach + 1), key=error)
assert abs(best) <= 44, best
PY

# --loop repeats a short background; without it the end is silent.
q mix "$samples/voice.flac" "$samples/music.wav" "$work/once.wav" --mixer 1 --offset 0 2>/dev/null
q mix "$samples/voice.flac" "$samples/music.wav" "$work/looped.wav" --mixer 1 --offset 0 --loop 2>/dev/null
cat >"$work/tail.py" <<'PY'
import sys, wave, array
w = wave.open(sys.argv[1])
rate, ch = w.getframerate(), w.getnchannels()
s = array.array('h', w.readframes(w.getnframes()))
tail = s[int(6.5 * rate) * ch:]
loud = max(abs(x) for x in tail)
assert (loud > 1000) == (sys.argv[2] == 'loud'), loud
PY
check "without --loop the end is silent" python3 "$work/tail.py" "$work/once.wav" quiet
check "with --loop the background goes on" python3 "$work/tail.py" "$work/looped.wav" loud

# A truncated video: damage reported, nothing written; kept with --salvage.
head -c 250000 "$samples/clip.mp4" >"$work/cut.mp4"
check "truncated video refused" bash -c "! '$qnedit' --quiet mix '$work/cut.mp4' '$samples/music.wav' '$work/bad.mp4' 2>'$work/err.txt' && grep -q damaged '$work/err.txt'"
check "no output from damage" test ! -e "$work/bad.mp4"
check "salvaged" q mix "$work/cut.mp4" "$samples/music.wav" "$work/salvaged.mp4" --salvage

echo "$pass passed, $fail failed"
[ "$fail" -eq 0 ]
