#compdef ruv-trace
# Completion of ruv-trace's command line for zsh: options and files.
_arguments \
  '--problems[show only problems and runs whose outcome is unknown]' \
  '(--json --check)--long[also show the line number, full reason and commands of each run]' \
  '(--long)--json[print one JSON object per run]' \
  '(--long)--check[judge the last run that launched or updated]' \
  '--max-age=[with --check: an older trace is a problem]:days:' \
  '--show-passwords[show the passwords in commands]' \
  '(- *)'{-h,--help}'[show the options]' \
  '(- *)--version[show the version]' \
  '*:trace file:_files'
