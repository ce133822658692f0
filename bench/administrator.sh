#!/bin/sh
# What an administrator would write instead of the launcher: an ordinary launch-mode run as a shell script. It lies in
# the launcher's place, calls the same programs by the same command lines and writes the same trace. Written to be
# quick: it starts no process but those programs, and no shell for them. Update mode, portable media and the
# installation of a package are left out.
set -u

trace_directory=/var/log/ZEM_Support
system_information=/var/log/TAV_Support/guihelp.dat
repository=/var/ZEM_Support
expansion=/tmp/tav

trace() {
  [ -d $trace_directory ] || mkdir -p $trace_directory
  printf '[TAVRUV]: %.511s\n' "$1" >>$trace_directory/ruvtav.log || echo "Failed to save log into logfile"
}
entering() { trace "[Debug:] Entering TAVMaster::$1()"; }
exiting() { trace "[Debug:] Exiting TAVMaster::$1()"; }

map_operating_system() {
  trace "[Debug:] Entering TAVMaster::OSMapping(), code = $1"
  case $1 in
    0) system=NONE ;;
    1) system=vmware ;;
    2) system=yev ;;
    10[1-9] | 110) system=windows ;;
    201) system=rhel3 ;;
    202) system=rhel4 ;;
    203) system=rhel5 ;;
    204) system=sles8 ;;
    205) system=sles9 ;;
    206) system=sles10 ;;
    207) system=sles11 ;;
    208) system=rhel6 ;;
    301) system=vmware20 ;;
    302) system=vmware30 ;;
    303) system=vmware35 ;;
    304) system=vmware40 ;;
  esac
  exiting OSMapping
}

read_system_information() {
  if ! [ -r $system_information ]; then
    echo "WARNING:Unable to get system information!"
    system=unknown machine_type=unknown architecture=unknown
    return
  fi
  while IFS= read -r line || [ -n "$line" ]; do
    case $line in
      *ZEM_SYSTEM_OS=*) map_operating_system "${line#*ZEM_SYSTEM_OS=}" ;;
      *ZEM_SYSTEM_MT=*) machine_type=${line#*ZEM_SYSTEM_MT=} ;;
      *ZEM_SYSTEM_ARCH=*) architecture=${line#*ZEM_SYSTEM_ARCH=} ;;
    esac
  done <$system_information
}

read_support_list() {
  entering TAVMasterGetSupportList
  if [ -r "$here/data/supportlist.xml" ]; then
    while IFS= read -r line || [ -n "$line" ]; do
      case $line in *"<MT>"*) supported="$supported${line#????} " ;; esac
    done <"$here/data/supportlist.xml"
  else
    echo "WARNING:Unable to get system support information!"
  fi
  exiting TAVMasterGetSupportList
}

discover() {
  trace "[Debug:] Enter: TAVMaster::TAVMaster()"
  entering GetTAVBinaryPath
  here=${0%/*}
  exiting GetTAVBinaryPath
  command="$here/guihelper.sh 1>/dev/null 2>&1"
  trace "[Status:]TAVMaster: command = $command"
  eval "$command"
  system=windows machine_type=0000 architecture=64 supported=' '
  read_system_information
  read_support_list
  trace "[Status:]OS = $system"
  trace "[Status:]MT = $machine_type"
  trace "[Status:]ARCH = $architecture"
  trace "[Status:]Working Path = $here"
  trace "[Status:]Repository Path = $repository"
  trace "[Status:]TAV Uncompressed Path = $expansion"
  exiting TAVMaster
}

parse_parameters() {
  entering ParseParameters
  forwarded='' batch=
  for argument; do
    case $argument in
      -b) batch=yes ;;
      *-*) ;;
      *) argument=\"$argument\" ;;
    esac
    forwarded="$forwarded $argument"
  done
  forwarded="$forwarded 2>/dev/null"
  exiting ParseParameters
}

compare_package() {
  entering CompareTAVPackage
  [ -d "$here" ] || mkdir -p "$here" 1>/dev/null 2>&1
  command="\"$here/tavtool\" comparelocal -l \"$repository\" -s \"$here\""
  command="$command -m $machine_type -o $system -a $architecture 1>tav.log 2>&1"
  trace "[Status:]CompareTAVPackage: TAVToolCmd = $command"
  eval "$command"
  trace "[Status:]Return Code from tavtool = $?"
  version=
  while IFS= read -r line || [ -n "$line" ]; do
    case $line in
      *Version=*)
        rest=${line#*Version=}
        # shellcheck disable=SC2034 # an installation would hand it to the package's copy script
        version=${rest%"${rest#????}"}
        break
        ;;
    esac
  done <tav.log
  exiting CompareTAVPackage
}

agreed() {
  case $supported in *" $machine_type</MT> "*) return 0 ;; esac
  echo "You might need to download an update for RUV to support this system."
  echo "Use the -? or -h parameter for more information about downloading updates."
  [ -z "$batch" ] || return 0
  while printf '%s' "Do you want to proceed anyway (function may be limited)? (Y/N)" && read -r answer; do
    case $answer in
      [yY]) return 0 ;;
      [nN]) break ;;
    esac
  done
  echo "Exit RUV"
  return 1
}

launch() {
  entering InvokeRUV
  command="\"$here/ruv\"$forwarded"
  trace "[Status:]InvokeRUV: command = $command"
  if agreed; then eval "$command"; fi
  exiting InvokeRUV
}

libraries=./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia
export LD_LIBRARY_PATH="${LD_LIBRARY_PATH+$LD_LIBRARY_PATH:}$libraries"
export PATH="${PATH+$PATH:}./mellanox"
discover
entering TAVMasterMain
parse_parameters "$@"
trace "[Status:]This is not portable version of RUV"
if [ -d $repository ]; then compare_package; fi
launch
exiting TAVMasterMain
entering '~TAVMaster'
exiting '~TAVMaster'
exit 0
