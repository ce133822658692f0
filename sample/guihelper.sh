#!/bin/sh
# Looks at this machine and writes the system information file that the launcher reads.
# RUV_SAMPLE_OS, RUV_SAMPLE_MT and RUV_SAMPLE_ARCH, where set, stand in for what is found.
# Exit status: 0, or 1 with a message on standard error if the file cannot be written; the old one then stays.
set -u

directory=/var/log/TAV_Support
file=$directory/guihelp.dat

# The launcher's code for the distribution. A release newer than all with a code gets the newest code; an
# unknown distribution gets 0, "NONE".
operating_system_code() {
  ID='' VERSION_ID=''
  # shellcheck source=/dev/null
  [ ! -r /etc/os-release ] || . /etc/os-release
  case $ID:${VERSION_ID%%.*} in
    rhel:3) echo 201 ;;
    rhel:4) echo 202 ;;
    rhel:5) echo 203 ;;
    rhel:* | centos:* | rocky:* | almalinux:* | ol:*) echo 208 ;;
    sles:8) echo 204 ;;
    sles:9) echo 205 ;;
    sles:10) echo 206 ;;
    sles:*) echo 207 ;;
    *) echo 0 ;;
  esac
}

# The first four letters or digits of the product name that the firmware reports; 0000 without one. No other
# characters, because the launcher puts the machine type on command lines unquoted.
machine_type() {
  product=$(tr -cd 'A-Za-z0-9' 2>/dev/null </sys/class/dmi/id/product_name | cut -c 1-4)
  echo "${product:-0000}"
}

mkdir -p "$directory" || exit 1
{
  echo "ZEM_SYSTEM_OS=${RUV_SAMPLE_OS-$(operating_system_code)}"
  echo "ZEM_SYSTEM_MT=${RUV_SAMPLE_MT-$(machine_type 2>/dev/null)}"
  echo "ZEM_SYSTEM_ARCH=${RUV_SAMPLE_ARCH-$(getconf LONG_BIT)}"
} >"$file.new" && mv "$file.new" "$file" || exit 1
