// The package tool's exit codes: each step's result, and the message for the user.
#include <regex>
#include <sstream>

#include "installation.h"
#include "launcher/tav.h"
#include "packages/exit_code_tables.h"

TEST(ExitCodes, GiveResultsAndMessages) {
  std::map<int, std::string> messages;
  for (const NZEMRUVTAV::ErrMsg& known : NZEMRUVTAV::ErrMsgs)
    messages[known.exit_code] = known.message + std::string("\n");
  const std::map<int, int> results = {{0, 0}, {32, 0}, {21, 2}, {52, 3}, {61, 3}};
  const Installation machine;
  const NZEMRUVTAV::TAVMaster session;
  for (int exit_code = -1; exit_code <= 256; ++exit_code) {
    SCOPED_TRACE(exit_code);
    fs::remove(kTraceFile);
    ::testing::internal::CaptureStdout();
    const int result = session.HandleTAVToolReturnValue(exit_code == -1 ? -1 : exit_code << 8);
    const std::string out = ::testing::internal::GetCapturedStdout();
    const bool known = messages.count(exit_code) != 0;
    EXPECT_EQ(result, results.count(exit_code) != 0 ? results.at(exit_code) : 1);
    EXPECT_EQ(out, known ? messages.at(exit_code) : "");
    EXPECT_EQ(machine.Trace(), "[TAVRUV]: [Status:]Return Code from tavtool = " + std::to_string(exit_code) + "\n" +
                                   (known ? "[TAVRUV]: " + messages.at(exit_code) : ""));
  }
}

// The manual repeats the texts.
TEST(ExitCodes, AreAllInTheManual) {
  std::map<int, std::string> in_table;
  for (const NZEMRUVTAV::ErrMsg& known : NZEMRUVTAV::ErrMsgs) {
    in_table[known.exit_code] = std::regex_replace(known.message, std::regex("\n"), " ");
  }
  // An item such as: .It Sy 31 , 33 Dq There's no update available
  std::map<int, std::string> in_manual;
  const std::regex item("\\.It (.*) Dq (.*)"), number("[0-9]+");
  std::istringstream page(ReadFile(MANUAL_PAGE));
  for (std::string line; std::getline(page, line);) {
    std::smatch parts;
    if (!std::regex_match(line, parts, item)) continue;
    const std::string codes = parts[1];
    for (std::sregex_iterator code(codes.begin(), codes.end(), number); code != std::sregex_iterator(); ++code) {
      in_manual[std::stoi(code->str())] = parts[2];
    }
  }
  EXPECT_EQ(in_manual, in_table);
}

TEST(ExitCodes, AToolThatCannotRunFailsSilently) {
  const Installation machine;
  machine.CreateRepository();
  fs::remove(machine.Directory() + "/tavtool");
  EXPECT_EQ(machine.Run().out, "");
  WriteFile(machine.Directory() + "/tavtool", "not executable");
  EXPECT_EQ(machine.Run().out, "");
  machine.InstallTool({{"comparelocal", 2}});  // exit code 2 is not signal 2, an interrupt
  EXPECT_EQ(machine.Run().out, "");
  EXPECT_THAT(machine.TraceLines("[Status:]Return Code from tavtool = "), ElementsAre("127", "126", "2"));
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(3));
}
