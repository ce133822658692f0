# Completion of ruv-trace's command line for bash: options and files.
_ruv_trace() {
  local current=${COMP_WORDS[COMP_CWORD]}
  if [[ $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W '--problems --long --json --check --max-age= --show-passwords -h --help --version' \
      -- "$current")
    if [[ ${COMPREPLY[*]} == *= ]]; then compopt -o nospace; fi
  else
    compopt -o filenames
    mapfile -t COMPREPLY < <(compgen -f -- "$current")
  fi
}
complete -F _ruv_trace ruv-trace
