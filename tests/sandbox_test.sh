#!/usr/bin/env bash
# scripts/sandbox itself, run within a sandbox, so that a fault cannot touch the machine's own files.
set -uo pipefail
[[ ${RUV_SANDBOX:?run this test through scripts/sandbox or ctest} == namespace ]] || exit 77
sandbox=$(cd "$(dirname "${BASH_SOURCE[0]}")/../scripts" && pwd)/sandbox
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
# shellcheck disable=SC2317 # called by expect
refused() { setpriv --bounding-set=-sys_admin --inh-caps=-sys_admin "$sandbox" "$@"; }
# shellcheck disable=SC2016 # for the shell in the view
write='mkdir -p /var/ZEM_Support /tmp/tav && echo "$RUV_SANDBOX $(ls /var/ZEM_Support)"; touch /var/ZEM_Support/package
  exit 7'

expect 7 'namespace ' "$sandbox" sh -c "$write"
expect 7 'namespace ' "$sandbox" --state state sh -c "$write"
expect 7 'namespace package' "$sandbox" --state state sh -c "$write"
expect 125 'sandbox: no command was given' "$sandbox" --state state
# The state is the same one where namespaces are refused, and the paths themselves are left as they were.
expect 7 'real-paths package' refused --state state sh -c "$write"
expect 7 'real-paths ' refused sh -c "$write"
expect 2 '*ZEM_Support*tav*' ls /var/ZEM_Support /tmp/tav
expect 0 'package' ls state/var/ZEM_Support
# What was there before is the machine's own.
mkdir -p /var/log/ZEM_Support
expect 125 'sandbox: namespaces are refused here and /var/log/ZEM_Support exists: *' refused touch ran
expect 2 '*ran*' ls ran /var/log/ZEM_Support
exit "$((failures > 0))"
