// The session: one run of the launcher is one TAVMaster, and every step of the run is one of its members.
//
// A run goes: main extends the search paths, the constructor discovers the machine, TAVMasterMain reads the command
// line and takes one of two roads (update mode or launch mode), the destructor ends the session. The member definitions
// are divided by subject over src/launcher, src/log, src/cli, src/support, src/packages and src/launch.
//
// Conventions of all members:
// - Strings are byte strings in no particular encoding; paths have no trailing slash.
// - Commands run through the shell and are waited for, with no time limit. Paths are double-quoted in a command
//   (FormatPathString) unless a member says "bare"; nothing inside the quotes is escaped.
// - A working member writes "[Debug:] Entering TAVMaster::X()" and "[Debug:] Exiting TAVMaster::X()" to the trace.
// - Console texts go to standard output.
#ifndef RUV_LAUNCHER_TAV_H
#define RUV_LAUNCHER_TAV_H

#include <set>
#include <string>
#include <vector>

namespace NZEMRUVTAV {

class TAVMaster {
 public:
  // ---- Session ------------------------------------------------------------------------------------------------------

  // Discovers the machine and fills every field: the launcher's directory, the identity that guihelper.sh reports, the
  // support list, the fixed directories. Prints a warning for each of the two files that cannot be opened. Throws a
  // plain std::exception when the launcher's own directory cannot be found.
  TAVMaster();
  TAVMaster(const TAVMaster&) = delete;
  TAVMaster& operator=(const TAVMaster&) = delete;

  // Writes its two trace lines while all fields are still there.
  virtual ~TAVMaster();

  // The driver: parses the command line as the process received it, then updates packages or launches the application.
  // Returns 0 whatever failed on the way; the steps that end the process themselves are ParseParameters and
  // HandleTAVToolReturnValue.
  int TAVMasterMain(int argc, char** argv);

  // Copies of the fields of the same name.
  std::string GetOperatingSystemType() const;
  std::string GetMachineType() const;
  std::string GetOperatingSystemArch() const;
  std::string GetWorkingPath() const;
  std::string GetUncompressedPath() const;
  std::string GetRepositoryPath() const;
  std::string GetPortablePath() const;

  bool isPrebootGUI() const;
  bool isPrebootCmd() const;
  bool isIgnoreTAVPackage() const;
  // Whether this is a WinPE 3.x pre-installation environment: never, on this platform.
  bool IsWinPE3_X() const;

  // True when stat finds something at the path that is not a directory (links followed).
  bool FileExist(std::string path) const;
  // True when stat finds a directory at the path (links followed); every failure of stat is false.
  bool DirExists(std::string path) const;

  // Puts a double quote before and after the path, in place. Escapes and examines nothing inside.
  void FormatPathString(std::string& path) const;
  // The hook that every tool, copy-script and application command passes just before it runs; changes nothing.
  void FormatCommandString(std::string& command) const;

  // ---- Start-up discovery -------------------------------------------------------------------------------------------

  // Returns the directory of the launcher's executable as the dynamic loader reports it, cut at the last slash
  // (relative for a launcher started by a relative path, empty for one in the root directory). A reported name without
  // a slash, as after a start through the search path, is looked up through /proc/self/exe instead. Throws
  // std::exception, without an exit trace line, when neither gives a directory.
  std::string GetTAVBinaryPath() const;
  // Sets operatingSystemType to the package tool's name for an operating-system code; a code that the table does not
  // list changes nothing.
  void OSMapping(int code);
  // True when ZEM_PORTABLE_EXEC_DIR was set and not empty. Writes one status line on every call.
  bool isPortableRUV() const;

  // ---- Trace log ----------------------------------------------------------------------------------------------------

  // Appends "[TAVRUV]: ", the printf-formatted message cut at 511 bytes, and a line feed to the trace file. Prints
  // "Failed to save log into logfile" when the file cannot be opened; never fails otherwise, never throws.
  void DebugLog(const char* format, ...) const noexcept __attribute__((format(printf, 2, 3)));
  // Returns the trace file's path; runs mkdir -p (bare path, output not discarded) when its directory is missing.
  std::string GetLogfileName() const;

  // ---- Command line -------------------------------------------------------------------------------------------------

  // Takes the launcher's own options out of the command line: sets the flags, overrides the identity, and fills
  // passThroughParams with everything else. Ends the process after the usage text (status 0) and after a rejected
  // combination of options (one line on the console, status 1).
  void ParseParameters(int argc, char** argv);
  // Prints the help text of the shared command line.
  void PrintUsage() const;

  // ---- Support list -------------------------------------------------------------------------------------------------

  // Loads the machine types from data/supportlist.xml beside the launcher, replacing what the set held. Returns 0, or
  // -1 with a warning on the console when the file cannot be opened. A read error ends the reading; the entries read
  // until then stay and the result is 0.
  int TAVMasterGetSupportList();
  // Adds the machine type to the set and appends it to the file, also when it is there already. Returns 1, or 0 with a
  // warning on the console when the file cannot be opened for appending. Writes no trace line.
  int UpdateSupportList();
  // Whether the machine type is an element of the set, byte for byte. Writes no trace line.
  bool isSystemInSupportList() const;

  // ---- Update packages ----------------------------------------------------------------------------------------------

  // Turns the status that system() returned for a tavtool command into the step's result: 0 success, 1 failure (a known
  // code's message is printed and traced), 2 a package to install, 3 no payload. Traces the exit code. Ends the process
  // with status 1 when an interrupt ended the tool.
  int HandleTAVToolReturnValue(int status) const;
  // Asks the tool whether the web has a newer package for this machine. Returns the tool result: 0 when it has.
  int CheckUpdate();
  // Has the tool download the newest package: into the repository, or into the update folder of a portable
  // installation; the directory is created when missing. Returns the tool result: 0 when it was downloaded.
  int AcquireUpdate();
  // Asks the tool whether the repository holds a package that the installed copy should take, and sets packageVersion
  // from the tool's output. Creates both directories when missing; leaves "tav.log" in the current directory. Returns
  // the tool result: 2 when a package is to be installed.
  int CompareTAVPackage(std::string repository_path, std::string installation_path);
  // Has the tool expand the repository's package into the expansion directory and installs it with the package's copy
  // script; tells the user how it went. Creates both directories when missing. Returns 0, or 1 when the tool failed or
  // the package brought no copy script.
  int DecompressTAV(std::string repository_path, std::string expansion_path);
  // Runs ruv/data/copy.sh of the expansion directory with the arguments expansion directory, working path, package
  // source (a path, or "NO_TAV_PAYLOAD") and package version (bare); its output is appended to the trace file. Returns
  // 1 when it was run, whatever its status, and 0 when there is no such file.
  int CopyTAVToRUVFoler(std::string package_source, std::string expansion_path, std::string working_path);
  // Has the tool copy the packages of a portable installation's update folder into the repository, which is created
  // when missing. Returns the tool result, or 1 when there is no update folder.
  int CopyPortableTAVToRepository();

  // ---- Application launch -------------------------------------------------------------------------------------------

  // Runs the application (its path already quoted) with the arguments, after a warning when warn_unsupported is set,
  // and then, outside batch mode, only if the user agrees. Waits for it. Always returns 1.
  int InvokeRUV(std::string application_path, std::vector<std::string> arguments, bool warn_unsupported);

 private:
  struct LongOption;
  struct ToolCall;

  void ReadSystemInformation();
  void RunUpdateMode();
  void RunLaunchMode();
  void InstallRepositoryPackage();
  bool NeedsSupportWarning() const;

  static const LongOption* FindLongOption(const std::string& folded_name);
  // Apply one argument of the command line; next is the argument behind it, or null. TakeLongOption returns whether the
  // option took that as its value.
  bool TakeLongOption(const std::string& argument, const char* next, bool& show_stderr);
  void TakeOrdinaryArgument(std::string argument, const char* next);

  // Returns the path in double quotes.
  std::string Quoted(std::string path) const;
  // Returns the folder of a portable installation that holds its packages.
  std::string PortableUpdateFolder() const;
  // Builds the command line that a tool call describes: the one place where tavtool commands are put together.
  std::string ToolCommand(const ToolCall& call) const;

  // Runs mkdir -p on the bare path when it is not a directory; its status is not looked at. The command ends with the
  // redirection unless that is empty. When traced_by names a member, the command is traced under that name.
  void EnsureDirectory(const std::string& path, const std::string& redirection, const char* traced_by = nullptr) const;

  std::string operatingSystemType;    // in the package tool's vocabulary, such as "rhel5"
  std::string machineType;            // normally four characters; the key of the support list
  std::string operatingSystemArch;    // "32" or "64"
  std::set<std::string> supportList;  // machine types that the installed application supports
  std::string packageVersion;         // at most four characters; empty until a comparison finds one
  std::string workingPath;            // the launcher's own directory
  std::string uncompressedPath;       // where packages are expanded
  std::string repositoryPath;         // where downloaded or imported packages lie
  std::string portablePath;           // empty unless the installation is portable

  bool checkUpdate = false;
  bool doUpdate = false;
  bool prebootGUI = false;
  bool prebootCmd = false;
  bool inputFileGiven = false;
  bool batchMode = false;
  bool ignoreTAVPackage = false;
  bool updateTargetGiven = false;

  std::vector<std::string> passThroughParams;  // normally ends with "2>/dev/null"
};

}  // namespace NZEMRUVTAV

#endif  // RUV_LAUNCHER_TAV_H
