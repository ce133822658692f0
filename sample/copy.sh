#!/bin/sh
# Installs an expanded package into the application's folder. Its output goes to the launcher's trace.
# Usage: copy.sh EXPANSION_DIRECTORY APPLICATION_DIRECTORY (PACKAGE_SOURCE | NO_TAV_PAYLOAD) [VERSION]
set -eu
expansion=$1 application=$2 source=$3 version=${4-}

if [ "$source" = NO_TAV_PAYLOAD ]; then
  echo "copy.sh: the package has no payload, nothing to copy"
else
  cp -R "$expansion/ruv/payload/." "$application/"
  echo "copy.sh: copied the payload of $source to $application"
fi
[ -n "$version" ] || exit 0
mkdir -p "$application/data"
echo "$version" >"$application/data/version.new"
mv "$application/data/version.new" "$application/data/version"
echo "copy.sh: the installed version is $version"
