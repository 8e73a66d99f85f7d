# Shared by the editor's command-line tests (sourced): a scratch directory
# removed on exit, and the counted checks each script reports at its end.
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
pass=0
fail=0
check() {  # check NAME COMMAND...
  local name=$1; shift
  if "$@" >"$work/last.log" 2>&1; then pass=$((pass + 1)); else fail=$((fail + 1)); echo "FAIL: $name"; cat "$work/last.log"; fi
}
expect_status() {  # expect_status STATUS COMMAND...: the exit status and at most one error line
  local want=$1; shift
  "$@" >"$work/out.txt" 2>"$work/err.txt"
  local got=$?
  [ "$got" -eq "$want" ] || { echo "exit $got, wanted $want"; cat "$work/err.txt"; return 1; }
  [ "$(wc -l <"$work/err.txt")" -le 1 ] || { echo "more than one error line:"; cat "$work/err.txt"; return 1; }
}
have() { command -v "$1" >/dev/null; }
near() { awk -v a="$1" -v b="$2" -v e="$3" 'BEGIN { d = a - b; if (d < 0) d = -d; exit !(d <= e) }'; }
