// The list of supported machine types: what counts as an entry, and what an installation appends.
#include "installation.h"

TEST(SupportList, ReadsColumns5To8OfALineWithATag) {
  struct Row {
    std::string text;
    Strings supported;
    Strings unsupported;
  };
  const Row rows[] = {
      {"<?xml?>\r\n\n\n<MT>1234</MT>\r\n<MT>1234</MT>\n<x><MT>\n", {"1234", "MT>"}, {"5678", "123", "12345", "1234\r"}},
      {"<MT>12</MT>", {"12</"}, {"12"}},
      {"<MT>12345</MT>\n<MT>7", {"1234", "7"}, {"12345", "2345"}},
      {"  <MT>1234</MT>\n", {"T>12"}, {"1234"}},
      {"<mt>1234</mt>\n<MT >5678</MT>\n", {}, {"1234", "5678"}},
      {"<MT>aBcD</MT>\n<MT>\xff\xfe..</MT>", {"aBcD", "\xff\xfe.."}, {"abcd", "ABCD"}},
      {"", {}, {"1234", ""}},
      {"<MT>", {""}, {"1234"}},
  };
  const Installation machine;
  const auto warning_for = [&](const std::string& machine_type) {
    WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=" + machine_type + "\n");
    return machine.Run({"-b"}).out;
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.text);
    WriteFile(machine.SupportListFile(), row.text);
    for (const std::string& type : row.supported) EXPECT_EQ(warning_for(type), "") << type;
    for (const std::string& type : row.unsupported) EXPECT_THAT(warning_for(type), StartsWith("You might")) << type;
  }
}

TEST(SupportList, WarnsAboutAMissingListAndSupportsNothing) {
  const Installation machine;
  fs::remove(machine.SupportListFile());
  EXPECT_THAT(machine.Run({"-b"}).out, StartsWith("WARNING:Unable to get system support information!\nYou might"));
}

TEST(SupportList, GetsAnEntryFromEveryInstallation) {
  const Installation machine;
  machine.OfferPackage();
  for (const std::string before : {"", "<MT>1234</MT>"}) {
    WriteFile(machine.SupportListFile(), before);
    for (int run = 0; run < 2; ++run) EXPECT_THAT(machine.Run().out, EndsWith("please wait...Done\n"));
    EXPECT_EQ(ReadFile(machine.SupportListFile()), before + "\n<MT>1234</MT>\n<MT>1234</MT>");
  }
}

TEST(SupportList, IsNotCreatedIfItsDirectoryIsMissing) {
  const Installation machine;
  machine.OfferPackage();
  fs::remove_all(machine.Directory() + "/data");
  // No question: for this run the machine counts as supported.
  EXPECT_THAT(machine.Run().out,
              EndsWith("Done\nWARNING:Unable to Update support list, RUV setting restore default.\n"));
  EXPECT_FALSE(fs::exists(machine.Directory() + "/data"));
}
