#!/usr/bin/env bash
# sample/tavtool on real packages: its exit codes and the files that it writes. Run it in a sandbox, as ctest does.
set -uo pipefail
sample=$(cd "$(dirname "${BASH_SOURCE[0]}")/../sample" && pwd)
directory=$(mktemp -d)
trap 'rm -rf "$directory"' EXIT
cd "$directory" || exit 1
mkdir -p application/data site repository expanded payload/data
echo 1.50 >application/data/version
echo content >payload/data/file
package() { "$sample/build-package" "$@" >/dev/null; }
failures=0

# expect CODE PATTERN VERB ARGUMENT...: the tool ends with the code, and its output matches the pattern.
expect() {
  local code=$1 pattern=$2 output status
  shift 2
  output=$(TAV_SITE=${site-$PWD/site} "$sample/tavtool" "$@" 2>&1)
  status=$?
  [[ $status -eq $code && $output =~ $pattern ]] && return
  echo "tavtool $*: code $status, expected $code; output, expected to match '$pattern': $output" >&2
  ((++failures))
}
identity=(-m 1234 -o rhel5 -a 64)

site='' expect 42 'no site' compareweb -l application "${identity[@]}" --latest
expect 31 'no package' compareweb -l application "${identity[@]}" --latest
package site 9.00 5678 any any payload # another machine's
package site 1.50 any any any payload
expect 30 'latest' compareweb -l application "${identity[@]}" --latest
package site 2.00 1234 rhel5 64 payload
package site 1.90 any rhel5 any payload
expect 0 '2.00 is newer than 1.50' compareweb -l application "${identity[@]}" --latest
expect 0 'Copied' acquire -l repository "${identity[@]}" --force --latest -x '--proxy=a b'
expect 32 'already' acquire -l repository "${identity[@]}" --latest
expect 21 $'^Name=tavlet_2.00_1234_rhel5_64.tgz\nVersion=2.00$' comparelocal -l repository -s application "${identity[@]}"
expect 0 '' expand -l repository -t expanded "${identity[@]}"
sh expanded/ruv/data/copy.sh "$PWD/expanded" "$PWD/application" repository 2.00 >/dev/null
cmp payload/data/file application/data/file || ((++failures))
expect 0 'Version=2.00' comparelocal -l repository -s application "${identity[@]}"
package repository 2.10 any any any
expect 52 '' expand -l repository -t expanded "${identity[@]}"
expect 0 'Copied.*Copied.*Copied' copy -l site -t repository "${identity[@]}"
expect 32 'no package' copy -l expanded -t repository "${identity[@]}"

truncate -s 100 repository/tavlet_2.10_any_any_any.tgz
expect 51 'damaged' expand -l repository -t expanded "${identity[@]}"
mkdir full
if mount -t tmpfs -o size=4k full full 2>/dev/null; then
  head -c 4096 /dev/zero >full/filler
  expect 60 'cannot write' copy -l site -t full "${identity[@]}"
  [[ $(ls -A full) == filler ]] || { echo "a part of a package was left on the full disk" >&2 && ((++failures)); }
  umount full
else
  echo "not tested: the full disk, since mounting is refused here"
fi
expect 60 'cannot write' copy -l site -t nowhere "${identity[@]}"
expect 1 'unknown verb' compare -l site "${identity[@]}"
expect 1 'needs a value' copy -l
expect 1 'missing option' copy -l site "${identity[@]}"
exit "$((failures > 0))"
