#!/usr/bin/env bash
# Long lossless cuts: `qnedit trim` over most of a long 720p H.264+AAC MP4 and
# a long FLAC, against `ffmpeg -ss -t -c copy` and `cp` of the whole file.
# Runs are alternated (ours, ffmpeg, cp, ours, ...) so that a busy machine
# weighs on all three alike; reports medians of wall time and of CPU time
# (user + sys), and the largest peak RSS seen. Every output is fsynced by its
# writer before it appears (ours does this itself; ffmpeg and cp are followed
# by `sync FILE` inside the timed command so that all three pay for it).
#
# Usage: long_copy_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]
#   MEDIA_DIR keeps the generated media between runs (default: a temp dir).
#   LONG_MINUTES sets the MP4's length (default 10), FLAC_MINUTES the FLAC's (30).
#   BASE_BUILD=DIR adds another build of qnedit (say, before a change) to the
#   alternation, as "qnedit (base)".
#   STRACE=1 adds a syscall count of one run of each.
set -euo pipefail
build=${1:?usage: long_copy_bench.sh BUILD_DIR [MEDIA_DIR] [RUNS]}
qnedit=$build/bin/qnedit
base=${BASE_BUILD:-}
# The command that runs a build's qnedit with its own library (through env,
# so that /usr/bin/time can start it).
run_qnedit() { local b=$1; echo env "LD_LIBRARY_PATH=$b/lib" "$b/bin/qnedit"; }
media=${2:-}
runs=${3:-5}
minutes=${LONG_MINUTES:-10}
flac_minutes=${FLAC_MINUTES:-30}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
media=${media:-$out/media}
mkdir -p "$media"
mp4=$media/long_${minutes}m.mp4
flac=$media/long_${flac_minutes}m.flac
secs=$((minutes * 60))
flac_secs=$((flac_minutes * 60))
if [[ ! -s $mp4 ]]; then
  ffmpeg -hide_banner -loglevel error -y -f lavfi -i "testsrc2=size=1280x720:rate=30:duration=$secs" \
    -f lavfi -i "sine=frequency=440:sample_rate=44100:duration=$secs" \
    -c:v libx264 -preset ultrafast -g 60 -c:a aac -b:a 128k -shortest "$mp4"
fi
if [[ ! -s $flac ]]; then
  # Noise keeps the frames as large as music's (~14 KB per 4096-sample block).
  ffmpeg -hide_banner -loglevel error -y -f lavfi \
    -i "aevalsrc=0.3*sin(440*2*PI*t)+0.2*random(0)|0.3*sin(660*2*PI*t)+0.2*random(1):s=44100:d=$flac_secs" \
    -c:a flac "$flac"
fi

# "wall cpu peak_kb" of one run.
measure() {
  /usr/bin/time -o "$out/time.txt" -f "%e %U %S %M" "$@" >/dev/null 2>&1 || echo "failed: $*" >&2
  awk '{ printf "%s %.2f %s\n", $1, $2 + $3, $4 }' "$out/time.txt"
}
median() { sort -n | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }

# bench NAME FILE START END EXT
bench() {
  local name=$1 file=$2 start=$3 end=$4 ext=$5
  local dur
  dur=$(awk -v a="$start" -v b="$end" 'BEGIN { print b - a }')
  local ours=() basr=() ff=() cpr=()
  for _ in $(seq "$runs"); do
    ours+=("$(measure $(run_qnedit "$build") --quiet trim "$file" "$out/ours.$ext" --start "$start" --end "$end")")
    rm -f "$out/ours.$ext"
    if [[ -n $base ]]; then
      basr+=("$(measure $(run_qnedit "$base") --quiet trim "$file" "$out/base.$ext" --start "$start" --end "$end")")
      rm -f "$out/base.$ext"
    fi
    ff+=("$(measure bash -c "ffmpeg -hide_banner -loglevel error -y -ss $start -t $dur -i '$file' -map 0 -c copy '$out/ff.$ext' && sync '$out/ff.$ext'")")
    rm -f "$out/ff.$ext"
    cpr+=("$(measure bash -c "cp '$file' '$out/cp.$ext' && sync '$out/cp.$ext'")")
    rm -f "$out/cp.$ext"
  done
  col() { printf '%s\n' "$@" | awk -v c="$COL" '{ print $c }'; }
  stats() {
    local w c m
    w=$(COL=1 col "$@" | median); c=$(COL=2 col "$@" | median); m=$(COL=3 col "$@" | sort -n | tail -1)
    echo "$w $c $m"
  }
  read -r ow oc om <<<"$(stats "${ours[@]}")"
  read -r fw fc fm <<<"$(stats "${ff[@]}")"
  read -r cw cc cm <<<"$(stats "${cpr[@]}")"
  ratio() { awk -v a="$1" -v b="$2" 'BEGIN { if (b > 0) printf "%.2f", a / b; else print "n/a" }'; }
  echo "== $name: $(basename "$file") ($(stat -L -c %s "$file") bytes), --start $start --end $end, median of $runs alternated runs"
  printf '  %-22s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "qnedit trim" "$ow" "$oc" $((om / 1024))
  if [[ -n $base ]]; then
    read -r bw bc bm <<<"$(stats "${basr[@]}")"
    printf '  %-22s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "qnedit trim (base)" "$bw" "$bc" $((bm / 1024))
  fi
  printf '  %-22s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "ffmpeg -ss -t -c copy" "$fw" "$fc" $((fm / 1024))
  printf '  %-22s wall %6.2f s  cpu %6.2f s  peak RSS %4d MB\n' "cp (whole file)" "$cw" "$cc" $((cm / 1024))
  echo "  ours/ffmpeg: wall $(ratio "$ow" "$fw"), cpu $(ratio "$oc" "$fc");  ours/cp: wall $(ratio "$ow" "$cw"), cpu $(ratio "$oc" "$cc")"
  if [[ ${STRACE:-0} == 1 ]] && command -v strace >/dev/null; then
    echo "  syscalls of one qnedit run (strace -f -c, top 6):"
    LD_LIBRARY_PATH=$build/lib strace -f -c -o "$out/strace.txt" "$qnedit" --quiet trim "$file" "$out/ours.$ext" --start "$start" --end "$end" >/dev/null 2>&1 || true
    sed -n '3,8p' "$out/strace.txt" | sed 's/^/    /'
    rm -f "$out/ours.$ext"
  fi
}

echo "Every writer of ours fsyncs its output on a successful stop; ffmpeg and cp are timed with a sync of theirs."
bench "long MP4 cut" "$mp4" 30 $((secs - 30)) mp4
bench "long FLAC cut" "$flac" 30 $((flac_secs - 30)) flac
