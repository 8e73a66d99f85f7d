#!/usr/bin/env bash
# The editor never loses a user's data: every case checks what is left on disk
# afterwards. Outputs that name an input or are not regular files are refused,
# failures and signals leave nothing behind and the old OUT intact, a full disk
# and damaged inputs are reported as such, hostile numbers are refused, and
# cuts start on the right sample or frame.
set -u
qnedit=$1
samples=$2
source "$(dirname "$0")/checks.sh"
mounted=""
cleanup() {
  [ -n "$mounted" ] && umount "$mounted" 2>/dev/null
  rm -rf "$work"
}
trap cleanup EXIT
# status WANT COMMAND...: the exit status, and at most one line on stderr
status() {
  local want=$1; shift
  "$@" >"$work/out.txt" 2>"$work/err.txt"
  local got=$?
  [ "$got" -eq "$want" ] || { echo "exit $got, wanted $want"; cat "$work/err.txt"; return 1; }
  [ "$(grep -cv warning "$work/err.txt")" -le 1 ] || { echo "more than one error line:"; cat "$work/err.txt"; return 1; }
}
said() { grep -qi -- "$1" "$work/err.txt" || { echo "stderr lacks '$1':"; cat "$work/err.txt"; return 1; }; }
same() { cmp -s "$1" "$2" || { echo "$1 changed"; return 1; }; }
no_temp() {  # no temporary left in a directory
  local left; left=$(find "$1" -maxdepth 1 -name '.*.qnedit-*')
  [ -z "$left" ] || { echo "left behind: $left"; return 1; }
}
q() { "$qnedit" --quiet "$@"; }

d=$work/d
mkdir -p "$d"
cp "$samples/clip.mp4" "$samples/voice.flac" "$samples/music.wav" "$d/"

# An output that is an input: refused before anything is opened for writing,
# through a symbolic link and a hard link too.
ln -s clip.mp4 "$d/link.mp4"
ln "$d/clip.mp4" "$d/hard.mp4"
for out in clip.mp4 link.mp4 hard.mp4; do
  check "trim into its own input ($out)" status 2 q trim "$d/clip.mp4" "$d/$out" --start 1
  check "input intact after $out" same "$samples/clip.mp4" "$d/clip.mp4"
done
check "flac into itself" status 2 q trim "$d/voice.flac" "$d/voice.flac" --start 1
check "flac intact" same "$samples/voice.flac" "$d/voice.flac"
check "mix into the background" status 2 q mix "$d/voice.flac" "$d/music.wav" "$d/music.wav"
check "background intact" same "$samples/music.wav" "$d/music.wav"
check "waveform into its input" status 2 q waveform "$d/voice.flac" -o "$d/link.mp4"
check "still a link" test -L "$d/link.mp4"

# An existing OUT that is not a regular file is refused and left alone.
mkfifo "$d/fifo.mp4"
mkdir "$d/dir.mp4"
check "fifo as output" status 2 q trim "$samples/clip.mp4" "$d/fifo.mp4" --start 1
check "fifo kept" test -p "$d/fifo.mp4"
check "directory as output" status 2 q trim "$samples/clip.mp4" "$d/dir.mp4" --start 1
check "directory kept" test -d "$d/dir.mp4"
if [ "$(id -u)" -eq 0 ] && mknod "$d/null.mp4" c 1 3 2>/dev/null; then
  check "device as output" status 2 q trim "$samples/clip.mp4" "$d/null.mp4" --start 1
  check "device kept" test -c "$d/null.mp4"
else
  echo "skip: device node as output (needs root)"
fi

# Inputs that are not regular files are refused at once, a FIFO without a
# writer included.
check "probe of a fifo does not block" status 1 timeout 10 "$qnedit" probe "$d/fifo.mp4"
check "trim of a directory" status 1 q trim "$d/dir.mp4" "$d/x.mp4" --start 1

# A failed run leaves an existing OUT as it was and no temporary.
printf 'the old file' >"$d/old.mp4"
cp "$d/old.mp4" "$d/old.ref"
check "start past the end fails" status 1 q trim "$samples/clip.mp4" "$d/old.mp4" --start 60
check "old output intact" same "$d/old.ref" "$d/old.mp4"
check "no temporary after failure" no_temp "$d"

# A successful run replaces OUT, keeps its mode, and writes through a link.
chmod 600 "$d/old.mp4"
check "trim over an old output" q trim "$samples/clip.mp4" "$d/old.mp4" --start 1 --end 2
check "mode kept" test "$(stat -c %a "$d/old.mp4")" = 600
check "replaced by a real file" ffprobe -v error "$d/old.mp4"
ln -s old.mp4 "$d/to-old.mp4"
check "trim through a link" q trim "$samples/clip.mp4" "$d/to-old.mp4" --start 2 --end 4
check "link stays a link" test -L "$d/to-old.mp4"
check "the link's target replaced" bash -c "ffprobe -v error -show_entries format=duration -of csv=p=0 '$d/old.mp4' | awk '{ exit !(\$1 > 1.9 && \$1 < 2.1) }'"
check "no temporary after success" no_temp "$d"

# Damaged inputs: failure naming where the damage starts, no output; with
# --salvage what could be read, and a warning.
head -c 200000 "$samples/clip.mp4" >"$d/short.mp4"
check "truncated mp4" status 1 q trim "$d/short.mp4" "$d/cut.mp4" --start 1 --end 8
check "says where" said "damaged after"
check "no output from a damaged input" test ! -e "$d/cut.mp4"
check "probe reports the damage too" status 1 "$qnedit" probe "$d/short.mp4"
check "probe says where" said "damaged after"
check "an unreadable second Ogg link is not passed off as the whole" status 1 "$qnedit" probe "$(dirname "$0")/../media/foreign/chain_rate.ogg"
check "salvage" status 0 q trim "$d/short.mp4" "$d/cut.mp4" --start 1 --end 8 --salvage
check "salvage warns" said "warning"
check "salvaged output plays" ffmpeg -v error -i "$d/cut.mp4" -f null -
python3 - "$samples/voice.flac" "$d/holes.flac" "$d/ruined.flac" <<'EOF'
import sys
data = bytearray(open(sys.argv[1], 'rb').read())
one = bytearray(data)
one[len(one) // 2] ^= 0x55          # one frame damaged in the middle
open(sys.argv[2], 'wb').write(one)
for i in range(8000, len(data), 700):  # every frame damaged
    data[i] ^= 0x55
open(sys.argv[3], 'wb').write(data)
EOF
check "flac with a damaged frame" status 1 q trim "$d/holes.flac" "$d/cut.flac" --start 0
check "flac damage located" said "damaged after"
check "flac with every frame damaged" status 1 q trim "$d/ruined.flac" "$d/cut.flac" --start 0
check "flac damage to wav" status 1 q trim "$d/holes.flac" "$d/cut.wav" --start 0
check "no damaged outputs" bash -c "[ ! -e '$d/cut.flac' ] && [ ! -e '$d/cut.wav' ]"
# Numbered by samples with one block size throughout: renumbering its frames
# would write a stream that plays at the wrong times.
python3 "$(dirname "$0")/../media/gen/flac_vbs.py" "$d/uniform.flac" --uniform
check "sample-numbered flac refused" status 1 q trim "$d/uniform.flac" "$d/cut.flac" --start 0.1
check "says why" said "variable block size"
check "empty range is an error" status 1 q trim "$samples/music.wav" "$d/empty.flac" --start 1 --end 1.000001
check "no empty output" test ! -e "$d/empty.flac"
check "damaged main recording in a mix" status 1 q mix "$d/holes.flac" "$samples/music.wav" "$d/mix.wav"
check "no mix output" test ! -e "$d/mix.wav"

# Hostile numbers are refused, never overflowed or allocated.
check "huge start" status 2 q trim "$samples/clip.mp4" "$d/x.mp4" --start 1e300
check "huge end" status 2 q trim "$samples/clip.mp4" "$d/x.mp4" --start 1 --end 1e300
check "end past the file" status 1 q trim "$samples/clip.mp4" "$d/x.mp4" --start 1 --end 100
check "says past the end" said "past the end"
check "huge offset" status 2 q mix "$samples/voice.flac" "$samples/music.wav" "$d/x.wav" --offset 99999999999
check "offset past the main recording" status 2 q mix "$samples/voice.flac" "$samples/music.wav" "$d/x.wav" --offset 60000
check "huge gain" status 2 q mix "$samples/voice.flac" "$samples/music.wav" "$d/x.wav" --bgm-gain 4294967296
check "huge stride" status 2 q frame "$samples/frame_320x240.nv12" --size 320x240 --format nv12 --stride 2147483647 -o "$d/x.png"
check "huge size" status 2 q frame "$samples/frame_320x240.nv12" --size 4294967616x240 --format nv12 -o "$d/x.png"
check "empty -o" status 2 q waveform "$samples/voice.flac" -o ""
check "empty OUT" status 2 q trim "$samples/clip.mp4" "" --start 1
check "nothing written by refusals" bash -c "[ -z \"\$(ls '$d' | grep -E '^x\\.')\" ]"

# A full disk: the cause reaches the user, nothing is left on the full volume.
full=$work/full
mkdir -p "$full"
if [ "$(id -u)" -eq 0 ] && mount -t tmpfs -o size=160k tmpfs "$full" 2>/dev/null; then
  mounted=$full
  check "mp4 onto a full disk" status 1 q trim "$samples/clip.mp4" "$full/cut.mp4" --start 0
  check "says no space" said "no space left on device"
  check "flac onto a full disk" status 1 q trim "$samples/voice.flac" "$full/cut.flac" --start 0
  check "says no space (flac)" said "no space left on device"
  check "full disk left empty" test -z "$(ls -A "$full")"
  umount "$full" && mounted=""
else
  echo "skip: full file system (needs root and tmpfs)"
fi

# A signal in the middle of a long trim removes the temporary and exits 128+N.
sox -n -r 48000 -c 2 -b 16 "$d/long.wav" synth 180 sine 440 2>/dev/null ||
  ffmpeg -v error -f lavfi -i sine=frequency=440:sample_rate=48000 -ac 2 -t 180 "$d/long.wav"
interrupt() {  # interrupt SIGNAL WANT_STATUS
  set -m  # background jobs get their own group and keep SIGINT
  "$qnedit" --quiet trim "$d/long.wav" "$d/long.flac" --start 0 2>"$work/sig.txt" &
  local pid=$! i
  set +m
  for i in $(seq 1 500); do
    [ -n "$(find "$d" -maxdepth 1 -name '.long.flac.qnedit-*' -size +1k)" ] && break
    sleep 0.02
  done
  # Stopped first, so the signal lands while the trim is surely unfinished.
  kill -STOP "$pid"; kill -"$1" "$pid"; kill -CONT "$pid"
  wait "$pid"
  local got=$?
  [ "$got" -eq "$2" ] || { echo "exit $got, wanted $2"; cat "$work/sig.txt"; return 1; }
  [ ! -e "$d/long.flac" ] || { echo "output left"; return 1; }
  no_temp "$d"
}
check "SIGINT mid-trim" interrupt INT 130
check "SIGTERM mid-trim" interrupt TERM 143
check "SIGHUP mid-trim" interrupt HUP 129

# Cuts start where asked: a PCM trim's first sample is the source's sample at
# --start, and --keyframe starts at the sync sample at or before --start.
check "pcm trim" q trim "$samples/music.wav" "$d/cut.wav" --start 1.25 --end 2
check "first kept sample" python3 - "$samples/music.wav" "$d/cut.wav" <<'EOF'
import sys, wave
src, out = (wave.open(p, 'rb') for p in sys.argv[1:3])
first = int(round(1.25 * src.getframerate()))
src.setpos(first)
want = src.readframes(out.getnframes())
got = out.readframes(out.getnframes())
assert out.getnframes() == int(round(0.75 * src.getframerate())), out.getnframes()
assert got == want, "first kept sample is not the source's sample at --start"
EOF
check "key-frame trim" q trim "$samples/clip.mp4" "$d/key.mp4" --start 2.5 --end 6 --keyframe
check "starts at the sync sample" bash -c "
  sync=\$(ffprobe -v error -select_streams v -skip_frame nokey -show_entries frame=pts_time -of csv=p=0 '$samples/clip.mp4' |
         awk '\$1 <= 2.5 { t = \$1 } END { print t }')
  ffmpeg -v error -ss \"\$sync\" -i '$samples/clip.mp4' -map 0:v -frames:v 1 -f framemd5 - | grep -v '^#' | awk -F, '{ print \$NF }' >'$work/want.md5'
  ffmpeg -v error -i '$d/key.mp4' -map 0:v -frames:v 1 -f framemd5 - | grep -v '^#' | awk -F, '{ print \$NF }' >'$work/got.md5'
  cmp -s '$work/want.md5' '$work/got.md5' || { echo \"first frame differs from the sync frame at \$sync\"; exit 1; }
  d=\$(ffprobe -v error -select_streams v -show_entries stream=duration -of csv=p=0 '$d/key.mp4')
  awk -v d=\"\$d\" -v s=\"\$sync\" 'BEGIN { e = d - (6 - s); if (e < 0) e = -e; exit !(e < 0.05) }' || { echo \"video lasts \$d, wanted 6 - \$sync\"; exit 1; }"

echo "$pass passed, $fail failed"
[ "$fail" -eq 0 ]
