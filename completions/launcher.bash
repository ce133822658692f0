# Completion of the launcher's command line for bash: the options of the launcher and of the application.
_launcher() {
  local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
  local proxy='--proxy-address= --proxy-port= --proxy-user= --proxy-password='
  local own='-h -? --chkupd --update --update_m --update_os --update_arch --gui --cmd --show_stderr'
  local application='--help -b -d -diags --disable-qan-lan --no-qan-lan -dumpxml -f -html -i -zemid --ipmi-lan -l -r -t
    -text -upload -ux -v --vmware-esxi --zfld --remote-zfld -x'

  COMPREPLY=()
  case $previous in
    --update_arch) mapfile -t COMPREPLY < <(compgen -W '32 64' -- "$current") ;;
    --update_os)
      mapfile -t COMPREPLY < <(compgen -W 'windows rhel3 rhel4 rhel5 rhel6 sles9 sles10 sles11 vmware3.5 vmware4.0' \
        -- "$current")
      ;;
    --update_m | --ipmi-lan | --vmware-esxi | --remote-zfld) ;; # a machine type or an address: not known here
    -d | -html)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -d -- "$current")
      ;;
    -i | -r)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -f -- "$current")
      ;;
    *)
      [[ $current == -* ]] || return 0
      mapfile -t COMPREPLY < <(compgen -W "$own $application $proxy" -- "$current")
      [[ ${COMPREPLY[*]} != --proxy-*= ]] || compopt -o nospace
      ;;
  esac
}
complete -F _launcher launcher
