// The list of supported machine types: what is read as an entry, and what an installation appends.
#include <filesystem>

#include "launcher_fixture.h"

using ::testing::HasSubstr;
using ::testing::Not;

namespace fs = std::filesystem;

class SupportList : public LauncherTest {
 protected:
  std::string List() const { return Directory() + "/data/supportlist.xml"; }

  // Whether a run on a machine of this type starts the application without a warning.
  bool Supported(const std::string& machine_type) {
    WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=" + machine_type + "\n");
    return Run({"-b"}).out.find("You might need") == std::string::npos;
  }
};

TEST_F(SupportList, Entries) {
  struct Row {
    std::string text;
    Strings supported;
    Strings unsupported;
  };
  const Row rows[] = {
      {"<?xml?>\r\n<MT>1234</MT>\r\n<MT>1234</MT>\n<x><MT>\n", {"1234", "MT>"}, {"5678", "123", "12345", "1234\r"}},
      {"<MT>12</MT>", {"12</"}, {"12"}},
      {"<MT>12345</MT>\n<MT>7", {"1234", "7"}, {"12345", "2345"}},
      {"  <MT>1234</MT>\n", {"T>12"}, {"1234"}},
      {"<mt>1234</mt>\n<MT >5678</MT>\n", {}, {"1234", "5678"}},
      {"<MT>aBcD</MT>\n<MT>\xff\xfe..</MT>", {"aBcD", "\xff\xfe.."}, {"abcd", "ABCD"}},
      {"", {}, {"1234", ""}},
      {"<MT>", {""}, {"1234"}},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.text);
    WriteFile(List(), row.text);
    for (const std::string& machine_type : row.supported) EXPECT_TRUE(Supported(machine_type)) << machine_type;
    for (const std::string& machine_type : row.unsupported) EXPECT_FALSE(Supported(machine_type)) << machine_type;
  }
}

TEST_F(SupportList, AMissingListIsAWarningAndSupportsNothing) {
  fs::remove(List());
  EXPECT_THAT(Run({"-b"}).out, ::testing::StartsWith("WARNING:Unable to get system support information!\nYou might"));
}

TEST_F(SupportList, EveryInstallationAppendsAnEntry) {
  fs::create_directory(kRepository);
  InstallTool({{"comparelocal", 21}});
  InstallCopyScript();
  const std::string done =
      "Discovered RUV update(s) in local drive for this system.\nApplying update(s) please wait...Done\n";
  struct Row {
    std::string what;
    std::string before;
    std::string after;
  };
  const Row rows[] = {
      {"no file", "", "\n<MT>1234</MT>\n<MT>1234</MT>"},
      {"no final line feed", "<MT>1234</MT>", "<MT>1234</MT>\n<MT>1234</MT>\n<MT>1234</MT>"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.what);
    fs::remove(List());
    if (!row.before.empty()) WriteFile(List(), row.before);
    for (int run = 0; run < 2; ++run) EXPECT_THAT(Run({}).out, ::testing::EndsWith(done));
    EXPECT_EQ(ReadFile(List()), row.after);
  }

  // Without the data folder the type counts as supported for this run only, and no folder is made.
  fs::remove_all(Directory() + "/data");
  EXPECT_EQ(Run({}).out, "WARNING:Unable to get system support information!\n" + done +
                             "WARNING:Unable to Update support list, RUV setting restore default.\n");
  EXPECT_FALSE(fs::exists(Directory() + "/data"));
}
