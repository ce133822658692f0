// The trace file: its lines, and runs in which it cannot be written.
#include "installation.h"
#include "launcher/tav.h"

TEST(TraceLog, CutsAMessageAfter511Bytes) {
  const Installation machine;
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
  EXPECT_THAT(machine.TraceLines("[Status:]"), ElementsAre("n = -7"));
}

// With a directory in the file's place, and with a file in the directory's place: then mkdir is tried for every line.
TEST(TraceLog, PrintsAMessageForEveryLineThatCannotBeSaved) {
  const Installation machine;
  machine.Run();
  const std::size_t lines = machine.TraceLines("").size();
  std::string expected;
  for (std::size_t i = 0; i < lines; ++i) expected += "Failed to save log into logfile\n";
  fs::remove(kTraceFile);
  fs::create_directory(kTraceFile);
  EXPECT_EQ(machine.Run().out, expected);

  fs::remove_all(kTraceDirectory);
  WriteFile(kTraceDirectory, "");
  const std::string out = machine.Run().out;
  std::size_t complaints = 0;
  for (std::size_t at = 0; (at = out.find("mkdir:", at)) != std::string::npos; ++at) ++complaints;
  EXPECT_EQ(complaints, lines);
  EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre("", "", ""));
}
