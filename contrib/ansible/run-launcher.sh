#!/bin/sh
# Runs the launcher unattended on this server, under the lock, and prints what ruv-trace --json says of this run. A
# further line, also JSON, overrides the verdict where the trace alone cannot give it. run-launcher.yml runs this on
# each server.
# Usage: run-launcher.sh DIRECTORY OUTPUT LOCK_TIMEOUT TIMEOUT [ARGUMENT...]
#   DIRECTORY     of the launcher and the application
#   OUTPUT        file for the output of the launcher and the application
#   LOCK_TIMEOUT  seconds to wait for another run to end
#   TIMEOUT       seconds after which the launcher and all it started are killed
set -u
directory=$1 output=$2 lock_timeout=$3 timeout=$4
shift 4
lock=/run/ruv-launcher.lock
trace=/var/log/ZEM_Support/ruvtav.log

override() { printf '{"verdict": "%s", "reason": "%s"}\n' "$1" "$2"; }

rm -f "$output" # an earlier run's
for program in launcher bin/ruv-trace ruv; do
  [ -x "$directory/$program" ] && continue
  override problem "$directory/$program is missing"
  exit
done
exec 9>"$lock"
if ! flock -w "$lock_timeout" 9; then
  override problem "another run has held $lock for $lock_timeout s"
  exit
fi

# Keeps the trace open at its end, to read later what this run appends, even if the trace is renamed meanwhile.
[ -e "$trace" ] || trace_before=/dev/null
exec 3<"${trace_before-$trace}"
cat <&3 >/dev/null

(umask 077 && : >"$output")
cd "$directory" || exit
status=0
begin=$(date +%s)
timeout -s KILL "$timeout" "$directory/launcher" -b "$@" </dev/null >"$output" 2>&1 3<&- 9>&- || status=$?

runs=$({
  cat <&3
  # shellcheck disable=SC3013 # every sh of Linux has -ef
  [ "$trace" -ef /dev/fd/3 ] || cat "$trace"
} | bin/ruv-trace --json -)
case $runs in
  '') override unknown "the launcher wrote no trace" ;;
  *'
'*) override unknown "another run wrote to the trace at the same time" ;;
  *) echo "$runs" ;;
esac
case $status in
  0) ;;
  137) override problem "the launcher was killed after $(($(date +%s) - begin)) s" ;;
  *) override problem "the launcher ended with status $status" ;;
esac
