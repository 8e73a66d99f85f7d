# Shared by the benchmarks that time our command against a peer's: sourced,
# with $out (a scratch directory) and $runs set.
#   alternate NAME "OURS..." "PEER..."  runs both $runs times, alternated, and
#   prints medians of wall and CPU time (user + sys) and the largest peak RSS.
# Commands are strings run by bash -c; each may leave output in $out.

# "wall cpu peak_kb" of one run.
measure_once() {
  /usr/bin/time -o "$out/time.txt" -f "%e %U %S %M" bash -c "$1" >/dev/null 2>"$out/err.txt" ||
    { echo "failed: $1" >&2; cat "$out/err.txt" >&2; }
  awk '{ printf "%s %.3f %s\n", $1, $2 + $3, $4 }' "$out/time.txt"
}
median() { sort -n | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }
column_of() { printf '%s\n' "${@:2}" | awk -v c="$1" '{ print $c }'; }
stats_of() {  # "wall cpu peak_kb" over runs
  echo "$(column_of 1 "$@" | median) $(column_of 2 "$@" | median) $(column_of 3 "$@" | sort -n | tail -1)"
}
ratio() { awk -v a="$1" -v b="$2" 'BEGIN { if (b > 0) printf "%.2f", a / b; else print "n/a" }'; }

alternate() {
  local name=$1 ours_cmd=$2 peer_cmd=$3 ours_label=${4:-qnedit} peer_label=${5:-peer}
  local ours=() peer=()
  for _ in $(seq "$runs"); do
    ours+=("$(measure_once "$ours_cmd")")
    peer+=("$(measure_once "$peer_cmd")")
  done
  local ow oc om pw pc pm
  read -r ow oc om <<<"$(stats_of "${ours[@]}")"
  read -r pw pc pm <<<"$(stats_of "${peer[@]}")"
  echo "== $name, median of $runs alternated runs"
  printf '  %-40s wall %7.3f s  cpu %7.3f s  peak RSS %4d MB\n' "$ours_label" "$ow" "$oc" $((om / 1024))
  printf '  %-40s wall %7.3f s  cpu %7.3f s  peak RSS %4d MB\n' "$peer_label" "$pw" "$pc" $((pm / 1024))
  echo "  ours/peer: wall $(ratio "$ow" "$pw"), cpu $(ratio "$oc" "$pc")"
}
