// Start-up discovery: the launcher's directory, and the machine described by the system information file.
#include <fcntl.h>
#include <unistd.h>

#include "installation.h"
#include "launcher/line_reader.h"
#include "launcher/tav.h"

namespace {

// The operating system, machine type and architecture in the trace of the last run.
Strings Identity(const Installation& machine) {
  Strings identity;
  for (const std::string key : {"OS", "MT", "ARCH"})
    identity.push_back(machine.LastTraceLine("[Status:]" + key + " = "));
  return identity;
}

// A prelude that starts the launcher under another name than its full path.
std::string StartedAs(const std::string& name) {
  return "exec bash -c 'exec -a \"$0\" \"$@\"' '" + name + "' \"$launcher\" \"$@\"";
}

}  // namespace

TEST(Discovery, ReadsTheSystemInformationFile) {
  const std::pair<std::string, Strings> rows[] = {
      {"", {"windows", "0000", "64"}},
      {"\n\nZEM_SYSTEM_OS=105\n\nZEM_SYSTEM_ARCH=32", {"windows", "0000", "32"}},
      {"ZEM_SYSTEM_OS=206\nZEM_SYSTEM_OS=150\n", {"sles10", "0000", "64"}},
      {"ZEM_SYSTEM_OS=0\n", {"NONE", "0000", "64"}},
      {"x ZEM_SYSTEM_MT=12 ZEM_SYSTEM_MT=34\n", {"windows", "12 ZEM_SYSTEM_MT=34", "64"}},
      {"ZEM_SYSTEM_MT=1234 abc\r\n", {"windows", "1234 abc\r", "64"}},
      {"ZEM_SYSTEM_MT=1111\nZEM_SYSTEM_MT=2222\n", {"windows", "2222", "64"}},
      {"ZEM_SYSTEM_MT=1 ZEM_SYSTEM_OS=201\n", {"rhel3", "0000", "64"}},
      {"ZEM_SYSTEM_OS=201 ZEM_SYSTEM_MT=1 ZEM_SYSTEM_ARCH=8\n", {"rhel3", "0000", "64"}},
      {"ZEM_SYSTEM_ARCH=8 ZEM_SYSTEM_MT=7\n", {"windows", "7", "64"}},
      {"ZEM_SYSTEM_MT=7 ZEM_SYSTEM_ARCH=8\n", {"windows", "7 ZEM_SYSTEM_ARCH=8", "64"}},
      {"zem_system_os=201\nZEM_SYSTEM_MT\nZEM_SYSTEM_ARCH=\n", {"windows", "0000", ""}},
  };
  const Installation machine;
  for (const auto& [text, identity] : rows) {
    SCOPED_TRACE(text);
    WriteFile(kSystemInformationFile, text);
    EXPECT_THAT(machine.Run({"-r", "file"}).out, "");
    EXPECT_EQ(Identity(machine), identity);
  }
}

TEST(Discovery, ReadsAnIntAndIgnoresOtherCodes) {
  const Installation machine;
  WriteFile(kSystemInformationFile,
            "ZEM_SYSTEM_OS=1x\nZEM_SYSTEM_OS=+2\nZEM_SYSTEM_OS= \t304\n"
            "ZEM_SYSTEM_OS=206\nZEM_SYSTEM_OS=abc\nZEM_SYSTEM_OS=\nZEM_SYSTEM_OS=99999999999999999999\n"
            "ZEM_SYSTEM_OS=4294967297\nZEM_SYSTEM_OS=-4294967295\nZEM_SYSTEM_OS=2147483647\n");
  machine.Run({"-b"});
  EXPECT_EQ(Identity(machine).at(0), "sles10");
  EXPECT_THAT(machine.TraceLines("[Debug:] Entering TAVMaster::OSMapping(), code = "),
              ElementsAre("1", "2", "304", "206", "-1", "-1", "-1", "-1", "-1", "2147483647"));
}

TEST(Discovery, MapsOperatingSystemCodes) {
  std::map<int, std::string> names = {{0, "NONE"},       {1, "vmware"},     {2, "yev"},       {201, "rhel3"},
                                      {202, "rhel4"},    {203, "rhel5"},    {204, "sles8"},   {205, "sles9"},
                                      {206, "sles10"},   {207, "sles11"},   {208, "rhel6"},   {301, "vmware20"},
                                      {302, "vmware30"}, {303, "vmware35"}, {304, "vmware40"}};
  for (int code = 101; code <= 110; ++code) names[code] = "windows";
  const Installation machine;
  NZEMRUVTAV::TAVMaster session;
  for (int code = -2; code <= 306; ++code) {
    session.OSMapping(203);
    session.OSMapping(code);
    EXPECT_EQ(session.GetOperatingSystemType(), names.count(code) != 0 ? names.at(code) : "rhel5") << code;
  }
}

TEST(Discovery, CallsAMachineWithoutInformationUnknown) {
  const Installation machine;
  fs::remove(kSystemInformationFile);
  EXPECT_THAT(machine.Run({"-b"}).out, StartsWith("WARNING:Unable to get system information!\nYou might need"));
  EXPECT_THAT(Identity(machine), ElementsAre("unknown", "unknown", "unknown"));
}

TEST(Discovery, TreatsDirectoriesInPlaceOfItsFilesAsEmpty) {
  const Installation machine;
  machine.CreateRepository();
  for (const std::string path : {kSystemInformationFile, "data/supportlist.xml", "cwd/tav.log"}) {
    fs::remove(fs::path(machine.Directory()) / path);
    fs::create_directory(fs::path(machine.Directory()) / path);
  }
  EXPECT_THAT(machine.Run({"-b"}).out, Not(HasSubstr("WARNING")));
  EXPECT_THAT(Identity(machine), ElementsAre("windows", "0000", "64"));
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(1));
}

// The master side of a pseudoterminal: reading fails with EIO once the other side is closed.
TEST(Discovery, IgnoresALineThatAReadErrorCutsShort) {
  const int descriptor = dup(STDIN_FILENO);
  close(descriptor);  // the file gets the same number
  NZEMRUVTAV::LineReader file("/dev/ptmx");
  ASSERT_EQ(unlockpt(descriptor), 0);
  const int other_side = open(ptsname(descriptor), O_RDWR | O_NOCTTY);
  ASSERT_EQ(write(other_side, "whole\ncut", 9), 9);
  close(other_side);
  std::string_view line;
  EXPECT_TRUE(file.Next(line));
  EXPECT_EQ(line, "whole\r");
  EXPECT_FALSE(file.Next(line));
}

// 60 MB without a line feed, in each of the files that the launcher reads.
TEST(Discovery, EndsWithOneLineIfALineDoesNotFitIntoMemory) {
  if (IsInstrumented()) GTEST_SKIP() << "needs more memory than the launcher";
  for (const std::string file : {kSystemInformationFile, "../data/supportlist.xml", "tav.log"}) {
    SCOPED_TRACE(file);
    const Installation machine;
    machine.OfferPackage();
    machine.Install("guihelper.sh", "truncate -s 60M " + file);
    machine.Install("tavtool", "truncate -s 60M " + file + "; exit 21");
    const RunResult run = machine.Run({"-v"}, "with='prlimit --as=40000000'");
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "ERROR: Not enough memory, RUV launcher ends.\n");
    EXPECT_THAT(machine.CallsOf("copy.sh"), IsEmpty());
    EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
  }
}

TEST(Discovery, RunsTheHelperScriptFirst) {
  const Installation machine;
  machine.Install("guihelper.sh", "echo noise; echo ZEM_SYSTEM_MT=1234 >" + std::string(kSystemInformationFile));
  EXPECT_EQ(machine.Run().out, "");
  EXPECT_THAT(Identity(machine), ElementsAre("windows", "1234", "64"));
}

TEST(Discovery, FindsTheLaunchersDirectory) {
  const Installation machine;
  const std::pair<std::string, std::string> rows[] = {
      {"../launcher", ".."},
      {"./../cwd/other name", "./../cwd"},  // where there is no application
      {"launcher", "@"},                    // found through the search path
      {"/launcher", ""},
  };
  for (const auto& [name, working_path] : rows) {
    EXPECT_EQ(machine.Run({"-b"}, StartedAs(name)).status, 0);
    EXPECT_EQ(machine.LastTraceLine("[Status:]Working Path = "), working_path);
  }
  // A link on the search path leads to the directory of the executable, not to its own.
  const std::string name(200, 'd'), long_path = "/" + name + "/" + name + "/" + name;
  fs::create_directories(machine.Directory() + long_path);
  fs::copy(machine.Directory(), machine.Directory() + long_path);
  fs::create_directory(machine.Directory() + "/links");
  fs::create_symlink(".." + long_path + "/launcher", machine.Directory() + "/links/launcher");
  machine.Run({}, "PATH=\"" + machine.Directory() + "/links:$PATH\"; exec launcher -b");
  EXPECT_THAT(machine.LastTraceLine("[Status:]Working Path = "), StartsWith("@/" + name + "/" + name));
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(3));
}

TEST(Discovery, EndsTheRunWithOneLineIfTheDirectoryIsUnknown) {
  const Installation machine;
  const RunResult run = machine.Run({"-v"}, StartedAs(""));
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.out, "ERROR: Unable to find the directory of the RUV launcher, RUV is not started.\n");
  EXPECT_THAT(machine.Trace(), EndsWith("[TAVRUV]: [Debug:] Entering TAVMaster::GetTAVBinaryPath()\n"));
  EXPECT_THAT(machine.CallsOf("guihelper.sh"), IsEmpty());
}

TEST(Discovery, FindsTheDirectoryWithoutProcIfThePathIsKnown) {
  if (IsInstrumented() || std::getenv("RUV_SANDBOX") != std::string("namespace")) GTEST_SKIP() << "needs namespaces";
  const Installation machine;
  const std::string without_proc = "exec unshare --mount sh -c 'mount -t tmpfs none /proc; ";
  const std::string on_search_path = "PATH=\"" + machine.Directory() + ":$PATH\"; exec launcher'";
  EXPECT_EQ(machine.Run({}, without_proc + on_search_path).out, "");
  EXPECT_THAT(machine.TraceLines("[Status:]Working Path = "), ElementsAre("@"));
  // An empty element of the search path is the current directory: the kernel, too, gets the bare name.
  const std::string in_current_directory = "cd ..; exec env PATH= launcher'";
  EXPECT_THAT(machine.Run({}, without_proc + in_current_directory).out, StartsWith("ERROR: Unable to find"));
}
