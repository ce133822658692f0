// The trace file itself: its lines, and what happens where it cannot be written. Also the session's small helpers.
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "launcher/tav.h"
#include "launcher_fixture.h"

using ::testing::ElementsAre;

namespace fs = std::filesystem;

class TraceLog : public LauncherTest {};

TEST_F(TraceLog, LinesAreCutAt511BytesOfMessage) {
  NZEMRUVTAV::TAVMaster session;
  const std::pair<std::string, std::string> rows[] = {
      {"", ""},
      {"two\nlines", "two\nlines"},
      {"100 %s\xff", "100 %s\xff"},
      {std::string(511, 'a'), std::string(511, 'a')},
      {std::string(600, 'b'), std::string(511, 'b')},
  };
  for (const auto& [message, logged] : rows) {
    fs::remove(kTraceFile);
    session.DebugLog("%s", message.c_str());
    EXPECT_EQ(ReadFile(kTraceFile), "[TAVRUV]: " + logged + "\n");
  }
  session.DebugLog("[Status:]%s = %d", "n", -7);
  EXPECT_THAT(TraceLines("[Status:]"), ElementsAre("n = -7"));
}

TEST_F(TraceLog, AFileThatCannotBeOpenedCostsAMessageALine) {
  fs::remove_all("/var/log/ZEM_Support");
  const std::size_t lines = TraceLines("").size();
  Run({});
  EXPECT_GT(TraceLines("").size(), lines) << "the directory was not made";

  const std::size_t lines_of_a_run = TraceLines("").size();
  fs::remove_all("/var/log/ZEM_Support");
  fs::create_directories(kTraceFile);
  std::string expected;
  for (std::size_t i = 0; i < lines_of_a_run; ++i) expected += "Failed to save log into logfile\n";
  EXPECT_EQ(Run({}).out, expected);

  // A file in the directory's place: mkdir is tried again, and says so, for every line.
  fs::remove_all("/var/log/ZEM_Support");
  WriteFile("/var/log/ZEM_Support", "");
  const std::string out = Run({}).out;
  std::size_t complaints = 0;
  for (std::size_t at = 0; (at = out.find("mkdir:", at)) != std::string::npos; ++at) ++complaints;
  EXPECT_EQ(complaints, lines_of_a_run);
  EXPECT_THAT(CallsOf("ruv"), ElementsAre("", "", ""));
}

TEST_F(TraceLog, FullDiskEndsNothing) {
  fs::remove_all("/var/log/ZEM_Support");
  fs::create_directories("/var/log/ZEM_Support");
  fs::create_symlink("/dev/full", kTraceFile);
  const RunResult run = Run({"-v"});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out, "");
  EXPECT_THAT(CallsOf("ruv"), ElementsAre("[-v]"));
}

TEST_F(TraceLog, FileAndDirectoryTestsFollowLinks) {
  const NZEMRUVTAV::TAVMaster session;
  const std::string base = Directory() + "/kinds/";
  WriteFile(base + "file", "");
  fs::create_symlink("file", base + "link");
  fs::create_symlink("..", base + "directory link");
  fs::create_symlink("nowhere", base + "dangling");
  ASSERT_EQ(mkfifo((base + "pipe").c_str(), 0600), 0);
  struct Row {
    std::string path;
    bool file;
    bool directory;
  };
  const Row rows[] = {
      {base + "file", true, false},
      {base + "link", true, false},
      {base + "pipe", true, false},
      {"/dev/null", true, false},
      {base, false, true},
      {base + "directory link", false, true},
      {base + "dangling", false, false},
      {base + "file/below", false, false},
      {"", false, false},
      {base + std::string(300, 'n'), false, false},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(session.FileExist(row.path), row.file) << row.path;
    EXPECT_EQ(session.DirExists(row.path), row.directory) << row.path;
  }
  std::string path;
  session.FormatPathString(path);
  EXPECT_EQ(path, "\"\"");
  session.FormatPathString(path);
  EXPECT_EQ(path, "\"\"\"\"");
}
