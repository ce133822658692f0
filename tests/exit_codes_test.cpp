// What becomes of the package tool's exit codes, seen in runs and, for the statuses that no run gives, in a call.
#include <filesystem>
#include <set>

#include "launcher/tav.h"
#include "launcher_fixture.h"

namespace fs = std::filesystem;

class ExitCodes : public LauncherTest {};

TEST_F(ExitCodes, ResultsAndMessages) {
  const std::string none = "There's no update available for this system on internet currently.\n";
  const std::string corrupted =
      "Error, package corrupted or not enough free space on disk.\n"
      "Ensure that there is enough system disk space and have written permissions.";
  const std::map<int, std::string> messages = {
      {1, "Invalid command parameter specified.\n"},
      {30, "You already have the latest version RUV.\n"},
      {31, none},
      {33, none},
      {40, none},
      {41, "Server Response Error.\nRUV can not acquire update from website currently.\n"},
      {42, "Unable to connect to update website.\nPlease check network connection and settings.\n"},
      {45, "Couldn't ping KRO, maybe the KRO is down.\n"},
      {51, corrupted + "\n"},
      {60, corrupted + ".\n"},
      {255,
       "Internal Error.\nPlease check your network environment and try again.\n"
       "If you need to access internet through proxy, please use --proxy and try again.\n"},
  };
  const std::map<int, int> results = {{0, 0}, {32, 0}, {21, 2}, {52, 3}, {61, 3}};
  NZEMRUVTAV::TAVMaster session;
  for (int exit_code = -1; exit_code <= 256; ++exit_code) {
    fs::remove(kTraceFile);
    ::testing::internal::CaptureStdout();
    const int result = session.HandleTAVToolReturnValue(exit_code == -1 ? -1 : exit_code << 8);
    const std::string out = ::testing::internal::GetCapturedStdout();
    const bool known = messages.count(exit_code) != 0;
    EXPECT_EQ(result, results.count(exit_code) != 0 ? results.at(exit_code) : 1) << exit_code;
    EXPECT_EQ(out, known ? messages.at(exit_code) : "") << exit_code;
    EXPECT_EQ(Trace(), "[TAVRUV]: [Status:]Return Code from tavtool = " + std::to_string(exit_code) + "\n" +
                           (known ? "[TAVRUV]: " + messages.at(exit_code) : ""))
        << exit_code;
  }
}

TEST_F(ExitCodes, AToolThatCannotBeRunIsASilentFailure) {
  fs::create_directory(kRepository);
  fs::remove(Directory() + "/tavtool");
  EXPECT_EQ(Run({}).out, "");
  WriteFile(Directory() + "/tavtool", "not executable");
  EXPECT_EQ(Run({}).out, "");
  // An exit code of 2 is no interrupt.
  Install("tavtool", "exit 2");
  EXPECT_EQ(Run({}).out, "");
  EXPECT_THAT(TraceLines("[Status:]Return Code from tavtool = "), ::testing::ElementsAre("127", "126", "2"));
  EXPECT_THAT(CallsOf("ruv"), ::testing::SizeIs(3));
}
