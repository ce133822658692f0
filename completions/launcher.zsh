#compdef launcher
# Completion of the launcher's command line for zsh: the options of the launcher and of the application.

local systems='(windows rhel3 rhel4 rhel5 rhel6 sles9 sles10 sles11 vmware3.5 vmware4.0)'

_arguments \
  '(- *)'{-h,-\?}'[display help]' \
  '--help[display the help of the application]' \
  '(--update)--chkupd[is there an update on the internet?]' \
  '(--chkupd)--update[download and install updates from the internet]' \
  '--update_m[update mode: machine type]:machine type, four digits:' \
  "--update_os[update mode: operating system]:operating system:$systems" \
  '--update_arch[update mode: architecture]:architecture:(32 64)' \
  '--proxy-address=[proxy server]:address:_hosts' \
  '--proxy-port=[port of the proxy server]:port:' \
  '--proxy-user=[user at the proxy server]:user:' \
  '--proxy-password=[password at the proxy server]:password:' \
  '--show_stderr[keep the standard error of the application]' \
  '--gui[accepted, changes nothing]' \
  '--cmd[accepted, changes nothing]' \
  '-b[batch mode: ask nothing]' \
  '-d[directory for output files]:directory:_directories' \
  '-diags[run all non-destructive diagnostic tests]' \
  '--disable-qan-lan[turn off the USB over LAN interface afterwards]' \
  '--no-qan-lan[no data collection for iVOR]' \
  '-dumpxml[write the .xml.gz file after each plugin]' \
  '-f[collect the full VUNT log]' \
  '-html[directory for HTML output]:directory:_directories' \
  '-i[read input from a file]:input file:_files' \
  '-zemid[ZEM identifier, with -upload]:ZEM identifier:' \
  '--ipmi-lan[collect the IPMI log out of band]:userid\:password@IP[ \:port]:' \
  '-l[display the license and exit]' \
  '-r[compare with a file]:file:_files' \
  '-t[transfer the collected data to the service, or to an FTP server]::username\:password@host/path/:' \
  '-text[create TEXT output files]' \
  '-upload[upload the results to the ZEM service]' \
  '-ux[use the eNOV client for the Morvex check]' \
  '-v[create HTML output files]' \
  '--vmware-esxi[collect from a remote VMWare Embedded Hypervisor]:userid\:password@IP[ \:port]:' \
  '--zfld[get ZFLD data from QAN locally]' \
  '--remote-zfld[get ZFLD data from PYR remotely]:userid\:password@IP[ \:port]:' \
  '-x[create no compressed XML file]'
