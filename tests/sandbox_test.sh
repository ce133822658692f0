#!/usr/bin/env bash
# scripts/sandbox itself, run within a sandbox, so that a fault cannot touch the machine's own files.
set -uo pipefail
if [[ ${RUV_SANDBOX:?run this test through scripts/sandbox or ctest} != namespace ]]; then
  echo "skipped: namespaces are refused here"
  exit 77
fi
checkout=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
sandbox=$checkout/scripts/sandbox
cd "$(mktemp -d)" || exit 1
failures=0

# expect STATUS TEXT COMMAND...: the command ends with the status and prints the text, a pattern, and nothing else.
expect() {
  local status=0 output
  output=$("${@:3}" 2>&1) || status=$?
  # shellcheck disable=SC2053 # a pattern
  [[ $status -eq $1 && $output == $2 ]] && return
  echo "${*:3}: status $status, expected $1; expected to print '$2', printed: $output" >&2
  ((++failures))
}
refuse=(setpriv --bounding-set=-sys_admin --inh-caps=-sys_admin)
# shellcheck disable=SC2317 # called by expect
refused() { "${refuse[@]}" "$sandbox" "$@"; }
# shellcheck disable=SC2016 # for the shell in the sandbox
write='mkdir -p /var/ZEM_Support /tmp/tav && echo "$RUV_SANDBOX $(ls /var/ZEM_Support)"; touch /var/ZEM_Support/package
  exit 7'
list='ls -d /var/*ZEM* /var/ruv* /tmp/tav /opt/ruv 2>/dev/null; exit 0'

expect 7 'namespace ' "$sandbox" sh -c "$write"
expect 7 'namespace ' "$sandbox" --state state sh -c "$write"
expect 7 'namespace package' "$sandbox" --state state sh -c "$write"
expect 125 'sandbox: no command was given' "$sandbox" --state state
expect 0 'Runs a command*--keep*' "$sandbox" --help

# Where namespaces are refused, the state is kept too, and the real paths are removed.
expect 7 'real-paths package' refused --state state sh -c "$write"
expect 7 'real-paths ' refused sh -c "$write"
expect 0 '' sh -c "$list"
expect 0 'package' ls state/var/ZEM_Support
expect 0 '' "$sandbox" --state outer --keep . "${refuse[@]}" "$sandbox" --state "$PWD/inner" mkdir -p /opt/ruv/data
expect 0 'data' ls inner/opt/ruv
expect 0 '' ls outer/opt

# What was there before is left alone.
mkdir -p /var/log/ZEM_Support
expect 125 'sandbox: namespaces are refused here and /var/log/ZEM_Support is in use: *' refused touch ran
expect 2 '*ran*' ls ran /var/log/ZEM_Support
rmdir /var/log/ZEM_Support

# A run that was killed leaves the paths, and the next one removes them.
# shellcheck disable=SC2016 # for the shell in the sandbox
expect 137 '*' refused sh -c 'mkdir -p /var/ZEM_Support /tmp/tav; kill -9 $PPID'
expect 0 $'/tmp/tav\n/var/ZEM_Support\n/var/ruv-sandbox' sh -c "$list"
expect 0 '/var/ruv-sandbox' refused sh -c "$list"
expect 0 '' sh -c "$list"

# A run waits for one from another clone.
mkdir clone
cp -r "$checkout/scripts" "$checkout/packaging" clone
"${refuse[@]}" clone/scripts/sandbox sh -c 'mkdir /var/ZEM_Support; sleep 1; touch finished' &
for ((tries = 0; tries < 100; ++tries)); do [[ ! -d /var/ZEM_Support ]] || break && sleep 0.1; done
expect 0 'finished' refused ls finished
wait
exit "$((failures > 0))"
