#!/usr/bin/env bash
# Compares the completions for bash and zsh with the usage text: they must offer the same options and values.
# Usage: tests/completion_test.sh LAUNCHER     (exit status 77, "skipped", without zsh)
set -euo pipefail
launcher=$1
cd "$(dirname "${BASH_SOURCE[0]}")/../completions"
if ! command -v zsh >/dev/null; then
  echo "skipped: zsh is not installed"
  exit 77
fi

# The launcher takes these options although the usage text does not list them.
unlisted=(--gui --cmd --show_stderr)

usage=$("$launcher" -h | sed '1,/^Options:$/d')
options() { grep '^-' | grep -oE '(^|[ ,[])--?([a-z][a-z_-]*=?|\?)' | tr -d ' ,['; }
values_of() { sed -n "/^$1 /,/^ *This/p" <<<"$usage" | grep -oE '\[[a-z0-9.]+\]' | tr -d '[]'; }

# Prints what bash offers after the words of a command line.
in_bash() {
  bash -c 'compopt() { :; }
    source ./launcher.bash
    COMP_WORDS=("$@") COMP_CWORD=$(($# - 1))
    _launcher
    printf "%s\n" "${COMPREPLY[@]}"' bash "$@"
}

# The option descriptions passed to zsh's own function: "(EXCLUDED)OPTION[TEXT]:WHAT:(VALUES)".
zsh_descriptions=$(zsh -fc '_arguments() { print -rl -- "$@" }; source ./launcher.zsh')
in_zsh() { sed -n "s/^[^:]*$1\[.*:(\(.*\))\$/\1/p" <<<"$zsh_descriptions" | tr ' ' '\n'; }

failed=
expect_same() { # WHAT EXPECTED ACTUAL
  diff --label "$1: usage text" --label "completion" -U 0 <(sort -u <<<"$2") <(sort -u <<<"$3") || failed=yes
}
expected=$(options <<<"$usage" && printf '%s\n' "${unlisted[@]}")
expect_same "bash, options" "$expected" "$(in_bash launcher -)"
expect_same "zsh, options" "$expected" "$(sed -E 's/^\([^)]*\)//; s/\[.*//; s/\\//' <<<"$zsh_descriptions")"
for option in --update_os --update_arch; do
  expect_same "bash, $option" "$(values_of "$option")" "$(in_bash launcher "$option" '')"
  expect_same "zsh, $option" "$(values_of "$option")" "$(in_zsh "$option")"
done
[[ -z $failed ]]
