#!/usr/bin/env bash
# scripts/sandbox itself, run within a sandbox, so that a fault cannot touch the machine's own files.
set -uo pipefail
[[ ${RUV_SANDBOX:?run this test through scripts/sandbox or ctest} == namespace ]] ||
  { echo "skipped: namespaces are refused here" && exit 77; }
sandbox=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)/scripts/sandbox
refuse=(setpriv --bounding-set=-sys_admin --inh-caps=-sys_admin "$sandbox")
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
# shellcheck disable=SC2016 # for the shell in the sandbox
write='mkdir -p /var/ZEM_Support /tmp/tav && echo "$RUV_SANDBOX $(ls /var/ZEM_Support)"; touch /var/ZEM_Support/package
  exit 7'

expect 7 'namespace ' "$sandbox" sh -c "$write"
expect 7 'namespace ' "$sandbox" --state state sh -c "$write"
expect 7 'namespace package' "$sandbox" --state state sh -c "$write"
expect 125 '*no command was given' "$sandbox" --state state

# Where namespaces are refused, the state is kept too, and the real paths are removed, by the next run if one was killed.
expect 7 'real-paths package' "${refuse[@]}" --state state sh -c "$write"
expect 0 'package' ls state/var/ZEM_Support
# shellcheck disable=SC2016 # for the shell in the sandbox
expect 137 '*' "${refuse[@]}" sh -c 'mkdir -p /var/ZEM_Support; kill -9 $PPID'
expect 7 'real-paths ' "${refuse[@]}" sh -c "$write"
expect 2 '*' ls -d /var/ZEM_Support

# What was there before is left alone.
mkdir -p /var/log/ZEM_Support
expect 125 '*namespaces are refused here and /var/log/ZEM_Support is in use: *' "${refuse[@]}" touch ran
expect 0 '' eval '[[ ! -e ran ]] && ls /var/log/ZEM_Support'
exit "$((failures > 0))"
