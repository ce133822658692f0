#!/usr/bin/env bash
# scripts/private-view itself, run within a view, so that what it may not touch is a view's and not the machine's.
set -uo pipefail
[[ ${RUV_PRIVATE_VIEW:?run this test through scripts/private-view or ctest} == namespace ]] || exit 77
private_view=$(cd "$(dirname "${BASH_SOURCE[0]}")/../scripts" && pwd)/private-view
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
refused() { setpriv --bounding-set=-sys_admin --inh-caps=-sys_admin "$private_view" "$@"; }
# shellcheck disable=SC2016 # for the shell in the view
write='mkdir -p /var/ZEM_Support /tmp/tav && echo "$RUV_PRIVATE_VIEW $(ls /var/ZEM_Support)"; touch /var/ZEM_Support/package
  exit 7'

expect 7 'namespace ' "$private_view" sh -c "$write"
expect 7 'namespace ' "$private_view" --state state sh -c "$write"
expect 7 'namespace package' "$private_view" --state state sh -c "$write"
expect 125 'private-view: no command was given' "$private_view" --state state
# The state is the same one where namespaces are refused, and the paths themselves are left as they were.
expect 7 'real-paths package' refused --state state sh -c "$write"
expect 7 'real-paths ' refused sh -c "$write"
expect 2 '*ZEM_Support*tav*' ls /var/ZEM_Support /tmp/tav
expect 0 'package' ls state/var/ZEM_Support
# What was there before is the machine's own.
mkdir -p /var/log/ZEM_Support
expect 125 'private-view: namespaces are refused here and /var/log/ZEM_Support exists: *' refused touch ran
expect 2 '*ran*' ls ran /var/log/ZEM_Support
exit "$((failures > 0))"
