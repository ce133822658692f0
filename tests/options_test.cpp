// Command-line parsing: what is forwarded and how, the identity options, rejected combinations and the help text.
#include "installation.h"

TEST(Options, ForwardsWhatIsNotItsOwn) {
  const std::pair<Strings, std::string> rows[] = {
      {{}, " 2>/dev/null"},
      {{"-v", "abc", "a-b", "-B", "-I", "-H"}, " -v \"abc\" a-b -B -I -H 2>/dev/null"},
      {{"", "two words", "%s%n"}, " \"\" \"two words\" \"%s%n\" 2>/dev/null"},
      {{"--IPMI-LAN", "u:p@10.0.0.1"}, " --ipmi-lan \"u:p@10.0.0.1\" 2>/dev/null"},
      {{"--vmware-ESXI"}, " --vmware-esxi 2>/dev/null"},
      {{"--GUI", "--cmd", "--Show_StdErr", "-x"}, " -x"},
      {{"--help", "--", "--Proxy=80"}, " --help -- --Proxy=80 2>/dev/null"},
      {{"--updat", "--update_x", "-update", "--\xc3\x84"}, " --updat --update_x -update --\xc3\x84 2>/dev/null"},
  };
  const Installation machine;
  for (const auto& [arguments, command] : rows) {
    EXPECT_EQ(machine.Run(arguments).out, "");
    EXPECT_EQ(machine.LastTraceLine("[Status:]InvokeRUV: command = "), "\"@/ruv\"" + command);
  }
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(std::size(rows)));
  Strings warnings;
  for (const char* option : {"--help", "--", "--proxy=80", "--updat", "--update_x", "--\xc3\x84"}) {
    warnings.push_back(std::string(option) + "\" to RUV TAV, and it will be transfered to tavtool or RUV application.");
  }
  EXPECT_EQ(machine.TraceLines("[Status:]Warning: Unknown Parameter \""), warnings);
}

TEST(Options, OverrideTheIdentity) {
  // After "--chkupd"; the identity in the call of the tool, and what is forwarded to it.
  const std::tuple<Strings, std::string, std::string> rows[] = {
      {{"--update_m", "5678", "--update_os", "sles11", "--Update_Arch", "32"}, "[-m][5678][-o][sles11][-a][32]", ""},
      {{"--update_m", "-h"}, "[-m][-h][-o][rhel5][-a][64]", ""},
      {{"--update_os"}, "[-m][1234][-o][rhel5][-a][64]", ""},
      {{"--update_os", "a b"}, "[-m][1234][-o][a][b][-a][64]", ""},
      {{"-i", "/a-b/9876xyz.xml", "proxy"}, "[-m][9876][-o][rhel5][-a][64]", "[-i][/a-b/9876xyz.xml][proxy]"},
      {{"-i", "dir/ab"}, "[-m][ab][-o][rhel5][-a][64]", "[-i][dir/ab]"},
      {{"-i", "-555.xml"}, "[-m][-555][-o][rhel5][-a][64]", "[-i][-555.xml]"},
      {{"-i", "dir/"}, "[-m][-o][rhel5][-a][64]", "[-i][dir/]"},
      {{"-i"}, "[-m][1234][-o][rhel5][-a][64]", "[-i]"},
      {{"--update_m", "5678", "-i", "4321"}, "[-m][4321][-o][rhel5][-a][64]", "[-i][4321]"},
      {{"-i", "4321", "--update_m", "5678"}, "[-m][5678][-o][rhel5][-a][64]", "[-i][4321]"},
  };
  const Installation machine;
  for (auto [arguments, identity, forwarded] : rows) {
    arguments.insert(arguments.begin(), "--chkupd");
    EXPECT_EQ(machine.Run(arguments).status, 0);
    EXPECT_EQ(machine.CallsOf("tavtool").back(), "[compareweb][-l][@]" + identity + "[--latest]" + forwarded);
  }
  EXPECT_THAT(machine.CallsOf("tavtool"), SizeIs(std::size(rows)));
}

TEST(Options, RejectCombinations) {
  const std::string together = "ERROR: You can not specify --chkupd and --update together\n";
  const std::string target =
      "Error: You should specify [--update_m]/[--update_os]/[--update_arch] with [--chkupd] or [--update]\n";
  const std::pair<Strings, std::string> rows[] = {
      {{"--chkupd", "--unknown", "--UPDATE"}, together},
      {{"--update_m", "1", "--update", "--chkupd"}, together},
      {{"--update_m", "--update"}, target},
      {{"-v", "--update_os"}, target},
      {{"--update_arch", "32", "-b"}, target},
  };
  const Installation machine;
  for (const auto& [arguments, message] : rows) {
    SCOPED_TRACE(PrintToString(arguments));
    const RunResult run = machine.Run(arguments);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, message);
    EXPECT_THAT(machine.Trace(), EndsWith("[Debug:] Exiting TAVMaster::ParseParameters()\n"));
  }
  EXPECT_THAT(machine.CallsOf("tavtool"), IsEmpty());
  EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
}

TEST(Options, HelpPrintsTheUsageText) {
  const Installation machine;
  const RunResult run = machine.Run({"-h"});
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(machine.Trace(), EndsWith("[Debug:] Entering TAVMaster::ParseParameters()\n"));
  // The download page is set when the launcher is built.
  const std::string checksum = "launcher -h | sed 's,http.*,URL,' | cksum";
  EXPECT_EQ(machine.Run({}, "cd ..; ./" + checksum + "; exit").out, "3727442611 3169\n")
      << "The text has changed. If that is meant, change the number to what this prints: build/" << checksum;

  for (const Strings& arguments : {Strings{"-?"}, Strings{"--chkupd", "--update", "-?"},
                                   Strings{"--update_m", "1", "-h"}, Strings{"-html", "-h"}}) {
    EXPECT_EQ(machine.Run(arguments).out, run.out) << PrintToString(arguments);
  }
  EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
}
