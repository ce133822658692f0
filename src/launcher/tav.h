// The session: one run of the launcher is one TAVMaster, and every step of the run is one of its members.
//
// A run: main extends the search paths, the constructor discovers the machine, TAVMasterMain parses the command line
// and runs in update mode or launch mode, and the destructor ends the session. The members are defined by subject in
// src/launcher (the constructor in discovery.cpp, the destructor in session.cpp), src/log, src/cli, src/support,
// src/packages and src/launch.
//
// Conventions of all members:
// - Strings are byte strings in no particular encoding; paths have no trailing slash.
// - Commands run through the shell and are waited for, with no time limit. Paths are double-quoted in a command
//   (FormatPathString) unless a member says "bare"; nothing inside the quotes is escaped.
// - A member with a TraceScope traces "[Debug:] Entering TAVMaster::X()" and "[Debug:] Exiting TAVMaster::X()".
// - Console texts go to standard output.
#pragma once

#include <set>
#include <string>
#include <vector>

namespace NZEMRUVTAV {

class TAVMaster {
 public:
  // ---- Session ------------------------------------------------------------------------------------------------------

  // Discovers the machine and fills every field: the launcher's directory, the identity that guihelper.sh (bare path)
  // reports, the support list, the fixed directories. Prints a warning if guihelp.dat or the support list cannot be
  // opened. Throws a plain std::exception if the launcher's own directory cannot be found.
  TAVMaster();
  TAVMaster(const TAVMaster&) = delete;
  TAVMaster& operator=(const TAVMaster&) = delete;

  // Traces its entry and exit; the fields are still valid then.
  virtual ~TAVMaster();

  // The driver: parses the command line as the process received it, then updates packages or launches the application.
  // Returns 0 whatever failed on the way. ParseParameters and HandleTAVToolReturnValue may end the process themselves.
  int TAVMasterMain(int argc, char** argv);

  // Return copies of the fields of the same name.
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
  // True in a WinPE 3.x pre-installation environment: never on this platform.
  bool IsWinPE3_X() const;

  // True if stat finds something at the path that is not a directory (links followed).
  bool FileExist(std::string path) const;
  // True if stat finds a directory at the path (links followed); false after any failure of stat.
  bool DirExists(std::string path) const;

  // Puts a double quote before and after the path, in place. Neither escapes nor examines what is inside.
  void FormatPathString(std::string& path) const;
  // Hook applied to every tool, copy-script and application command before it runs. Leaves the command unchanged.
  void FormatCommandString(std::string& command) const;

  // ---- Start-up discovery -------------------------------------------------------------------------------------------

  // Returns the directory of the launcher's executable as the dynamic loader reports it, cut at the last slash
  // (relative for a launcher started by a relative path, empty for one in the root directory). If the reported name has
  // no slash, as after a start through the search path, asks the kernel for the path instead. Throws a plain
  // std::exception, without an exit line in the trace, if neither gives a directory.
  std::string GetTAVBinaryPath() const;
  // Sets operatingSystemType to the package tool's name for an operating-system code. A code that is not in the table
  // changes nothing.
  void OSMapping(int code);
  // True if ZEM_PORTABLE_EXEC_DIR was set and not empty. Writes one status line on every call.
  bool isPortableRUV() const;

  // ---- Trace log ----------------------------------------------------------------------------------------------------

  // Appends "[TAVRUV]: ", the printf-formatted message cut at 511 bytes, and a line feed to the trace file. Prints
  // "Failed to save log into logfile" if it cannot be opened or memory runs out; a failed write is not reported. Never
  // throws. ruv-trace reads the messages in their order: a change of one also changes tools/ruv-trace/parser.cpp.
  void DebugLog(const char* format, ...) const noexcept __attribute__((format(printf, 2, 3)));
  // Returns the trace file's path. Runs mkdir -p (bare path, output not discarded) if its directory is missing.
  std::string GetLogfileName() const;

  // ---- Command line -------------------------------------------------------------------------------------------------

  // Takes the launcher's own options out of the command line: sets the flags, overrides the identity, and puts
  // everything else into passThroughParams. For example, "-b --Update_M 5678 --UPDATE --proxy=x two" sets batchMode,
  // doUpdate, updateTargetGiven and machineType "5678", and passes on: -b --proxy=x "two" 2>/dev/null
  // Ends the process after the usage text (status 0) and after a rejected combination of options (one line on the
  // console, status 1).
  void ParseParameters(int argc, char** argv);
  // Prints the help text, which includes the application's options.
  void PrintUsage() const;

  // ---- Support list -------------------------------------------------------------------------------------------------

  // Replaces the set's content with the machine types in data/supportlist.xml in the launcher's directory. Returns 0,
  // or -1 with a warning on the console if the file cannot be opened. A read error ends the reading: the entries read
  // before it are kept and the result is 0.
  int TAVMasterGetSupportList();
  // Adds the machine type to the set and appends it to the file, even if it is there already. Returns 1, or 0 with a
  // warning on the console if the file cannot be opened for appending. Writes no trace line.
  int UpdateSupportList();
  // True if the machine type is in the set, byte for byte. Writes no trace line.
  bool isSystemInSupportList() const;

  // ---- Update packages ----------------------------------------------------------------------------------------------

  // Maps the status that system() returned for a tavtool command to the step's result: 0 success, 1 failure (the
  // message of a known code is printed and traced), 2 a package to install, 3 no payload. Traces the exit code. If
  // Ctrl-C ended the tool, ends the process with status 1.
  int HandleTAVToolReturnValue(int status) const;
  // Asks the tool whether there is a newer package for this machine on the web. Returns the tool result: 0 if there is.
  int CheckUpdate() const;
  // Has the tool download the newest package into the repository or, in a portable installation, into its update
  // folder. Creates the directory if it is missing. Returns the tool result: 0 if the package was downloaded.
  int AcquireUpdate() const;
  // Asks the tool whether the repository has a package to install, and sets packageVersion from the tool's output.
  // Creates both directories if they are missing; leaves "tav.log" in the current directory. Returns the tool result: 2
  // if there is a package to install.
  int CompareTAVPackage(std::string repository_path, std::string installation_path);
  // Has the tool (bare path) expand the repository's package into the expansion directory and installs it with the
  // package's copy script; reports the outcome to the user. Creates both directories if they are missing. Returns 0, or
  // 1 if the tool failed or the package has no copy script.
  int DecompressTAV(std::string repository_path, std::string expansion_path) const;
  // Runs ruv/data/copy.sh of the expansion directory with the arguments expansion directory, working path, package
  // source (a path, or "NO_TAV_PAYLOAD") and package version (bare); its output is appended to the trace file (bare
  // path). Returns 1 if it was run, whatever its status, and 0 if there is no such file.
  int CopyTAVToRUVFoler(std::string package_source, std::string expansion_path, std::string working_path) const;
  // Has the tool copy the packages in a portable installation's update folder to the repository, which is created if it
  // is missing. Returns the tool result, or 1 if there is no update folder.
  int CopyPortableTAVToRepository() const;

  // ---- Application launch -------------------------------------------------------------------------------------------

  // Runs the application (path already quoted) with the arguments and waits for it. If warn_unsupported is set, prints
  // a warning first and, except in batch mode, starts the application only if the user agrees. Always returns 1.
  int InvokeRUV(std::string application_path, std::vector<std::string> arguments, bool warn_unsupported) const;

 private:
  struct LongOption;
  struct ToolCall;

  // ---- Steps of the members above -----------------------------------------------------------------------------------

  void ReadSystemInformation();
  void RunUpdateMode();
  void RunLaunchMode();
  void InstallRepositoryPackage();
  bool NeedsSupportWarning() const;
  std::string LaunchCommand(const std::string& application_path, const std::vector<std::string>& arguments) const;

  // ---- Parsing ------------------------------------------------------------------------------------------------------

  static const LongOption* FindLongOption(const std::string& folded_name);
  void TakeArguments(int argc, char** argv);
  // Apply one argument of the command line; next is the argument after it, or null. TakeLongOption returns true if it
  // consumed next.
  bool TakeLongOption(const std::string& argument, const char* next, bool& show_stderr);
  void TakeOrdinaryArgument(std::string argument, const char* next);
  // Returns the message for a combination of options that is not allowed, or null.
  const char* RejectedCombination() const;

  // ---- Paths and commands -------------------------------------------------------------------------------------------

  // Returns the path in double quotes.
  std::string Quoted(std::string path) const;
  // Returns the folder with the packages of a portable installation.
  std::string PortableUpdateFolder() const;
  // Builds a tavtool command line; no other member does.
  std::string ToolCommand(const ToolCall& call) const;
  // Runs mkdir -p on the bare path if it is not a directory, and ignores the outcome. If traced_by names a member,
  // traces the command under that name.
  void EnsureDirectory(const std::string& path, const char* traced_by = nullptr) const;

  // ---- Fields -------------------------------------------------------------------------------------------------------

  std::string operatingSystemType;    // in the package tool's vocabulary, such as "rhel5"
  std::string machineType;            // normally four characters; the key of the support list
  std::string operatingSystemArch;    // "32" or "64"
  std::set<std::string> supportList;  // machine types that the installed application supports
  std::string packageVersion;         // at most four characters; empty until a comparison finds one
  std::string workingPath;            // the launcher's own directory
  std::string uncompressedPath;       // where packages are expanded
  std::string repositoryPath;         // where downloaded and imported packages are kept
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
