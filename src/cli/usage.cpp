// The help text of the command line that the launcher and the application share.
#include "launcher/console.h"
#include "launcher/tav.h"

namespace NZEMRUVTAV {
namespace {

// RUV_DOWNLOAD_URL, the application's download page, is set when the launcher is configured for its build.
constexpr const char* kDownloadPage = "         " RUV_DOWNLOAD_URL;

constexpr const char* kUsageLines[] = {
    "Syntax:  RUV_Executable_Program [options]",
    "",
    "Options:",
    "",
    "-b       Run in batch mode.",
    "",
    "--chkupd [--proxy-address=] [--proxy-port=] [--proxy-user=] [--proxy-password=]",
    "         Detect if there are available RUV update(s) on the internet.",
    "         This checks for Tavlet(s).",
    "         A different version of RUV may be available for your system at:",
    kDownloadPage,
    "",
    "-d <dir>",
    "         Place RUV output files in the specified directory rather than",
    "         in the default location, which is /var/log/ZEM_Support.",
    "",
    "-diags   Execute all non-destructive diagnostic tests.",
    "",
    "--disable-qan-lan",
    "         Turn off USB Over Lan interface after running RUV.",
    "",
    "--no-qan-lan",
    "         Turn off RUV Data collection for iVOR.",
    "         This option will keep lan_over_usb status unchanged when run ruv.",
    "",
    "-dumpxml Write the RUV .xml.gz file after each plugin runs.",
    "",
    "-f       Collect the full VUNT log.",
    "",
    "-h,-?,--help",
    "         Display help for RUV command-line options.",
    "",
    "-html <dir>",
    "         Specify HTML output directory.",
    "",
    "-i <file>",
    "         Read input from <file> rather than collecting data from",
    "         the local server.",
    "",
    "-zemid   Provide your ZEM Identifier. Work with -upload",
    "",
    "--ipmi-lan <userid:password@IP [:port]>",
    "         Collect IPMI log via Out-Of-Band mode.",
    "",
    "-l       Display license and exit.",
    "",
    "-r <file>",
    "         Run the CIM difference engine comparing the collected or",
    "         specified (via -i) data to this file.",
    "",
    "-t       Transfer collected data to ZEM Service & Support w/o arguments.",
    "         In the other side, you could upload to your own ftp server.",
    "         The parameter value should be double-quoted if it contains spaces.",
    "         Example: -t username:password@ftphost/path/.",
    "",
    "-text    Create TEXT output files.",
    "",
    "--update [--proxy-address=] [--proxy-port=] [--proxy-user=] [--proxy-password=]",
    "         Acquire available RUV update(s) from the internet.",
    "         This downloads Tavlet(s).",
    "         A different version of RUV may be available for your system at:",
    kDownloadPage,
    "",
    "--update_arch [32][64]",
    "         This option is used with the option \"--chkupd\" or \"--update\"",
    "         to specify OS architecture",
    "",
    "--update_m [XXXX]",
    "         This option is used with the option \"--chkupd\" or \"--update\"",
    "         to specify machine type. XXXX is 4 digital number of machine type.",
    "",
    "--update_os [windows][rhel3][rhel4][rhel5][rhel6][sles9][sles10][sles11]",
    "            [vmware3.5][vmware4.0]",
    "         This option is used with the option \"--chkupd\" or \"--update\"",
    "         to specify OS type.",
    "",
    "-upload  [--proxy-address=] [--proxy-port=] [--proxy-user=] [--proxy-password=]",
    "         Upload RUV results to ZEM service. NO SUPPORT FOR PPC!",
    "",
    "-ux [--proxy-address=] [--proxy-port=] [--proxy-user=] [--proxy-password=]",
    "         Use eNOV client for Morvex check.",
    "",
    "-v       Create HTML output files.",
    "",
    "--vmware-esxi <userid:password@IP [:port]>",
    "         Retrieve system information from the remote target system loaded",
    "         with VMWare Embedded Hypervisor.",
    "",
    "--zfld   Get ZFLD data from QAN locally.",
    "",
    "--remote-zfld <userid:password@IP [:port]>",
    "         Get ZFLD data from PYR remotely.",
    "",
    "-x       Do not create a compressed XML file.",
    "",
    "Note: All options must be separated with one or more spaces.",
};

}  // namespace

void TAVMaster::PrintUsage() const {
  for (const char* line : kUsageLines) {
    Print(line);
    Print("\n");
  }
}

}  // namespace NZEMRUVTAV
