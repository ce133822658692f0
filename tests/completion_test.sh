#!/usr/bin/env bash
# Compares the completions for bash and zsh with the usage texts: they must offer the same options and values.
# Usage: tests/completion_test.sh LAUNCHER RUV-TRACE     (exit status 77, "skipped", without zsh)
set -euo pipefail
launcher=$1 ruv_trace=$2
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

# Prints what bash offers for the last word of a command line.
in_bash() { # WORD...
  bash -c 'compopt() { :; }
    source "./$1.bash"
    COMP_WORDS=("$@") COMP_CWORD=$(($# - 1))
    "_${1//-/_}"
    printf "%s\n" "${COMPREPLY[@]}"' bash "$@"
}

# Prints what a program's completion passes to zsh's own function: "(EXCLUDED)OPTION[TEXT]:WHAT:(VALUES)" per line.
zsh_descriptions() { zsh -fc '_arguments() { print -rl -- "$@" }; source "./$1.zsh"' zsh "$1"; }
options_in() { sed -En 's/^(\([^)]*\))?(-[^[]*)\[.*/\2/p' | tr -d "\\"; }
in_zsh() { zsh_descriptions launcher | sed -n "s/^[^:]*$1\[.*:(\(.*\))\$/\1/p" | tr ' ' '\n'; }

failed=
expect_same() { # WHAT EXPECTED ACTUAL
  diff --label "$1: usage text" --label "completion" -U 0 <(sort -u <<<"$2") <(sort -u <<<"$3") || failed=yes
}
expected=$(options <<<"$usage" && printf '%s\n' "${unlisted[@]}")
expect_same "bash, options" "$expected" "$(in_bash launcher -)"
expect_same "zsh, options" "$expected" "$(zsh_descriptions launcher | options_in)"
for option in --update_os --update_arch; do
  expect_same "bash, $option" "$(values_of "$option")" "$(in_bash launcher "$option" '')"
  expect_same "zsh, $option" "$(values_of "$option")" "$(in_zsh "$option")"
done

expected=$("$ruv_trace" --help | grep -oE '^  -[^ =]+=?( -[^ ]+)?' | tr -d , | tr ' ' '\n' | grep .)
expect_same "bash, ruv-trace" "$expected" "$(in_bash ruv-trace -)"
expect_same "zsh, ruv-trace" "$expected" "$(zsh_descriptions ruv-trace | options_in)"
expect_same "bash, files" "$(ls)" "$(in_bash ruv-trace '')"
[[ -z $failed ]]
