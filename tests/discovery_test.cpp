// Where the launcher lives, and the machine that the system information file describes.
#include <unistd.h>

#include <filesystem>

#include "launcher_fixture.h"

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;
using ::testing::StartsWith;

namespace fs = std::filesystem;

class Discovery : public LauncherTest {};

TEST_F(Discovery, SystemInformationFile) {
  struct Row {
    std::string text;
    std::string os, mt, arch;
  };
  const Row rows[] = {
      {"", "windows", "0000", "64"},
      {"ZEM_SYSTEM_OS=105\nZEM_SYSTEM_ARCH=32", "windows", "0000", "32"},
      {"ZEM_SYSTEM_OS=206\nZEM_SYSTEM_OS=150\n", "sles10", "0000", "64"},
      {"ZEM_SYSTEM_OS=206\nZEM_SYSTEM_OS=abc\nZEM_SYSTEM_OS=\nZEM_SYSTEM_OS=99999999999999999999\n"
       "ZEM_SYSTEM_OS=4294967297\n",
       "sles10", "0000", "64"},
      {"ZEM_SYSTEM_OS=0\n", "NONE", "0000", "64"},
      {"ZEM_SYSTEM_OS=1x\n", "vmware", "0000", "64"},
      {"ZEM_SYSTEM_OS=+2\n", "yev", "0000", "64"},
      {"ZEM_SYSTEM_OS= \t304\n", "vmware40", "0000", "64"},
      {"ZEM_SYSTEM_OS=-1\n", "windows", "0000", "64"},
      {"x ZEM_SYSTEM_MT=12 ZEM_SYSTEM_MT=34\n", "windows", "12 ZEM_SYSTEM_MT=34", "64"},
      {"ZEM_SYSTEM_MT=1234 abc\r\n", "windows", "1234 abc\r", "64"},
      {"ZEM_SYSTEM_MT=1111\nZEM_SYSTEM_MT=2222\n", "windows", "2222", "64"},
      {"ZEM_SYSTEM_MT=1 ZEM_SYSTEM_OS=201\nZEM_SYSTEM_ARCH=8 ZEM_SYSTEM_MT=7\n", "rhel3", "7", "64"},
      {"zem_system_os=201\nZEM_SYSTEM_MT\nZEM_SYSTEM_ARCH=\n", "windows", "0000", ""},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.text);
    fs::remove(kTraceFile);
    WriteFile(kSystemInformationFile, row.text);
    EXPECT_THAT(Run({"-b"}).out, ::testing::Not(HasSubstr("WARNING")));
    EXPECT_THAT(TraceLines("[Status:]OS = "), ElementsAre(row.os));
    EXPECT_THAT(TraceLines("[Status:]MT = "), ElementsAre(row.mt));
    EXPECT_THAT(TraceLines("[Status:]ARCH = "), ElementsAre(row.arch));
  }
}

TEST_F(Discovery, EveryOperatingSystemCodeAndItsNeighbours) {
  std::string expected;
  for (const char* name : {"rhel3", "rhel4", "rhel5", "sles8", "sles9", "sles10", "sles11", "rhel6"}) {
    expected += name + std::string(" ");
  }
  std::string found;
  for (int code = 200; code <= 209; ++code) {
    fs::remove(kTraceFile);
    WriteFile(kSystemInformationFile, "ZEM_SYSTEM_OS=304\nZEM_SYSTEM_OS=" + std::to_string(code));
    Run({"-b"});
    const std::string name = TraceLines("[Status:]OS = ").at(0);
    if (name != "vmware40") found += name + " ";
    EXPECT_THAT(TraceLines("[Debug:] Entering TAVMaster::OSMapping(), code = "),
                ElementsAre("304", std::to_string(code)));
  }
  EXPECT_EQ(found, expected);
  const std::pair<int, const char*> edges[] = {{100, "sles8"}, {101, "windows"},  {110, "windows"},  {111, "sles8"},
                                               {300, "sles8"}, {301, "vmware20"}, {302, "vmware30"}, {303, "vmware35"},
                                               {305, "sles8"}, {3, "sles8"},      {-2, "sles8"}};
  for (const auto& [code, name] : edges) {
    fs::remove(kTraceFile);
    WriteFile(kSystemInformationFile, "ZEM_SYSTEM_OS=204\nZEM_SYSTEM_OS=" + std::to_string(code));
    Run({"-b"});
    EXPECT_THAT(TraceLines("[Status:]OS = "), ElementsAre(name)) << code;
  }
}

TEST_F(Discovery, FilesThatCannotBeReadDoNotStopTheRun) {
  fs::remove(kSystemInformationFile);
  RunResult run = Run({"-b"});
  EXPECT_THAT(run.out, StartsWith("WARNING:Unable to get system information!\nYou might need"));
  EXPECT_THAT(TraceLines("[Status:]OS = "), ElementsAre("unknown"));
  EXPECT_THAT(TraceLines("[Status:]MT = "), ElementsAre("unknown"));
  EXPECT_THAT(TraceLines("[Status:]ARCH = "), ElementsAre("unknown"));

  // Directories in the places of all three files that are read: they open, and no read of them succeeds.
  fs::remove(kTraceFile);
  fs::create_directories({kSystemInformationFile});
  fs::remove(Directory() + "/data/supportlist.xml");
  fs::create_directory(Directory() + "/data/supportlist.xml");
  fs::create_directory(Directory() + "/cwd/tav.log");
  fs::create_directory(kRepository);
  run = Run({"-b"});
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, ::testing::Not(HasSubstr("WARNING")));
  EXPECT_THAT(TraceLines("[Status:]MT = "), ElementsAre("0000"));
  EXPECT_THAT(CallsOf("ruv"), SizeIs(2));
}

TEST_F(Discovery, HelperScriptRunsBeforeItsFileIsReadAndMayBeMissing) {
  Install("guihelper.sh", "echo noise; echo ZEM_SYSTEM_MT=5678 >'" + std::string(kSystemInformationFile) + "'");
  EXPECT_THAT(Run({"-b"}).out, ::testing::Not(HasSubstr("noise")));
  EXPECT_THAT(TraceLines("[Status:]MT = "), ElementsAre("5678"));
  fs::remove(Directory() + "/guihelper.sh");
  EXPECT_EQ(Run({"-b"}).status, 0);
  EXPECT_THAT(CallsOf("ruv"), SizeIs(2));
}

TEST_F(Discovery, LauncherDirectory) {
  const std::string long_name(200, 'd');
  const std::string long_directory = Directory() + "/" + long_name + "/" + long_name + "/" + long_name;
  fs::create_directories(long_directory);
  for (const char* file : {"launcher", "ruv", "tavtool", "guihelper.sh"}) {
    fs::copy_file(Directory() + "/" + file, long_directory + "/" + file);
  }
  struct Row {
    std::string what;
    std::string argv0;
    std::string working_path;
  };
  const Row rows[] = {
      {"absolute", "", Directory()},
      {"relative", "../launcher", ".."},
      {"another name", "./../cwd/other name", "./../cwd"},
      {"found through the search path", "launcher", Directory()},
      {"login shell's name", "-launcher", Directory()},
      {"over 511 bytes", long_directory + "/launcher", long_directory},
      {"in the root directory", "/launcher", ""},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.what);
    fs::remove(kTraceFile);
    EXPECT_EQ(Run({"-b"}, row.argv0.empty() ? RunOptions() : StartedAs(row.argv0)).status, 0);
    // A message is cut at 511 bytes, and with it a long path.
    const std::string message = ("[Status:]Working Path = " + row.working_path).substr(0, 511);
    EXPECT_THAT(TraceLines(WithPlainDirectory(message)), ElementsAre(""));
  }
  fs::remove(kTraceFile);
  Run({}, Prelude("set -- bash -c 'exec -a launcher \"$0\" -b' " + long_directory + "/launcher"));
  EXPECT_THAT(TraceLines("[Status:]Working Path = ").at(0), StartsWith("@/" + long_name + "/" + long_name));
  // The stand-ins were found but for the name in a directory without any, and for the root directory.
  EXPECT_THAT(CallsOf("ruv"), SizeIs(6));
}

TEST_F(Discovery, NoNameAtAllEndsTheRunWithOneClearLine) {
  const RunResult run = Run({"-v"}, StartedAs(""));
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.out, "ERROR: Unable to find the directory of the RUV launcher, RUV is not started.\n");
  EXPECT_THAT(Trace(), EndsWith("[TAVRUV]: [Debug:] Entering TAVMaster::GetTAVBinaryPath()\n"));
  EXPECT_THAT(CallsOf("guihelper.sh"), IsEmpty());
}

TEST_F(Discovery, PortableDirectory) {
  const std::pair<std::optional<std::string>, std::string> rows[] = {
      {std::nullopt, "[Status:]This is not portable version of RUV"},
      {"", "[Status:]This is not portable version of RUV"},
      {"/media/usb ruv", "[Status:]This is a portable RUV,portablePath = /media/usb ruv"},
  };
  for (const auto& [variable, line] : rows) {
    fs::remove(kTraceFile);
    Run({}, Environment("ZEM_PORTABLE_EXEC_DIR", variable));
    EXPECT_THAT(TraceLines(line), ElementsAre(""));
  }
}
