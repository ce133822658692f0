// Whole runs: which steps follow which, and how a run reacts to signals, limits and closed streams.
#include "installation.h"

// The whole trace of one run.
TEST(RunSequence, InstallsAPackageFromTheRepositoryAndStartsTheApplication) {
  const Installation machine;
  machine.OfferPackage("Name=pack\nVersion=2.31a\n");
  machine.MakeUnsupported();
  machine.InstallCopyScript("echo copied; echo oops >&2");
  machine.Install("ruv", "echo application; echo hidden >&2; exit 9");

  const RunResult run = machine.Run({"-v"});

  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "Discovered RUV update(s) in local drive for this system.\n"
            "Applying update(s) please wait...Done\n"
            "application\n");
  EXPECT_THAT(machine.ToolVerbs(), ElementsAre("comparelocal", "expand"));
  EXPECT_THAT(machine.CallsOf("copy.sh"), ElementsAre("[/tmp/tav][@][/var/ZEM_Support][2.31]"));
  EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre("[-v]"));
  EXPECT_EQ(ReadFile(machine.SupportListFile()), "<MT>9999</MT>\n\n<MT>1234</MT>");
  EXPECT_EQ(fs::status("/tmp/tav/ruv/data/copy.sh").permissions(), fs::perms::all);
  EXPECT_EQ(machine.Trace(), R"trace([TAVRUV]: [Debug:] Enter: TAVMaster::TAVMaster()
[TAVRUV]: [Debug:] Entering TAVMaster::GetTAVBinaryPath()
[TAVRUV]: [Debug:] Exiting TAVMaster::GetTAVBinaryPath()
[TAVRUV]: [Status:]TAVMaster: command = @/guihelper.sh 1>/dev/null 2>&1
[TAVRUV]: [Debug:] Entering TAVMaster::OSMapping(), code = 203
[TAVRUV]: [Debug:] Exiting TAVMaster::OSMapping()
[TAVRUV]: [Debug:] Entering TAVMaster::TAVMasterGetSupportList()
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMasterGetSupportList()
[TAVRUV]: [Status:]OS = rhel5
[TAVRUV]: [Status:]MT = 1234
[TAVRUV]: [Status:]ARCH = 64
[TAVRUV]: [Status:]Working Path = @
[TAVRUV]: [Status:]Repository Path = /var/ZEM_Support
[TAVRUV]: [Status:]TAV Uncompressed Path = /tmp/tav
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMaster()
[TAVRUV]: [Debug:] Entering TAVMaster::TAVMasterMain()
[TAVRUV]: [Debug:] Entering TAVMaster::ParseParameters()
[TAVRUV]: [Debug:] Exiting TAVMaster::ParseParameters()
[TAVRUV]: [Status:]This is not portable version of RUV
[TAVRUV]: [Debug:] Entering TAVMaster::CompareTAVPackage()
[TAVRUV]: [Status:]CompareTAVPackage: TAVToolCmd = "@/tavtool" comparelocal -l "/var/ZEM_Support" -s "@" -m 1234 -o rhel5 -a 64 1>tav.log 2>&1
[TAVRUV]: [Status:]Return Code from tavtool = 21
[TAVRUV]: [Debug:] Exiting TAVMaster::CompareTAVPackage()
[TAVRUV]: [Debug:] Entering TAVMaster::DecompressTAV()
[TAVRUV]: [Status:]DecompressTAV: TAVToolCmd = @/tavtool expand -l "/var/ZEM_Support" -t "/tmp/tav" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
[TAVRUV]: [Status:]Return Code from tavtool = 0
[TAVRUV]: [Debug:] Entering TAVMaster::CopyTAVToRUVFoler()
[TAVRUV]: [Status:]CopyTAVToRUVFoler: command = "/tmp/tav/ruv/data/copy.sh" "/tmp/tav" "@" "/var/ZEM_Support" 2.31 1>>/var/log/ZEM_Support/ruvtav.log 2>&1
copied
oops
[TAVRUV]: [Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()
[TAVRUV]: [Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!
[TAVRUV]: [Debug:] Exiting TAVMaster::DecompressTAV()
[TAVRUV]: [Debug:] Entering TAVMaster::InvokeRUV()
[TAVRUV]: [Status:]InvokeRUV: command = "@/ruv" -v 2>/dev/null
[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV()
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMasterMain()
[TAVRUV]: [Debug:] Entering TAVMaster::~TAVMaster()
[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()
)trace");
}

TEST(RunSequence, UpdateModeStopsAtAFailedStepAndNeverStartsTheApplication) {
  const std::string detected = "RUV update(s) detected, start downloading...";
  const std::string applying = detected + "Applying update(s) please wait...";
  const std::string there = "There's new update for this system, use --update to download\n";
  const std::string latest = "You already have the latest version RUV.\n";
  const std::string no_kro = detected + "Couldn't ping KRO, maybe the KRO is down.\nFailed\n";
  const std::string invalid = applying + "Invalid command parameter specified.\nDone\n";
  using Codes = std::map<std::string, int>;
  // The tool's exit codes, how many of its steps are run, and the output after the first line.
  const std::tuple<std::string, Codes, int, std::string> rows[] = {
      {"--chkupd", {}, 1, there},
      {"--chkupd", {{"compareweb", 30}}, 1, latest},
      {"--CHKUPD", {{"compareweb", 21}}, 1, ""},
      {"--update", {{"compareweb", 2}}, 1, ""},
      {"--update", {{"acquire", 77}}, 2, detected + "Failed\n"},
      {"--update", {{"acquire", 21}}, 2, detected + "Failed\n"},
      {"--update", {{"acquire", 52}}, 2, detected + "Failed\n"},
      {"--update", {{"acquire", 45}}, 2, no_kro},
      {"--update", {{"compareweb", 32}, {"acquire", 32}}, 3, detected + "Done\n"},
      {"--update", {{"comparelocal", 30}}, 3, detected + latest + "Done\n"},
      {"--update", {{"comparelocal", 52}}, 3, detected + "Done\n"},
      {"--Update", {{"comparelocal", 21}}, 4, applying + "Done\nDone\n"},
      {"--update", {{"comparelocal", 21}, {"expand", 1}}, 4, invalid},
  };
  const Strings steps = {"compareweb", "acquire", "comparelocal", "expand"};
  for (const auto& [option, exit_codes, count, out] : rows) {
    SCOPED_TRACE(option + " " + PrintToString(exit_codes));
    const Installation machine;
    machine.InstallTool(exit_codes);
    machine.InstallCopyScript();
    const RunResult run = machine.Run({option});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, "Detecting available update on internet, please wait...\n" + out);
    EXPECT_EQ(machine.ToolVerbs(), Strings(steps.begin(), steps.begin() + count));
    const bool installed = count == 4 && exit_codes.count("expand") == 0;
    EXPECT_EQ(ReadFile(machine.SupportListFile()), installed ? "<MT>1234</MT>\n\n<MT>1234</MT>" : "<MT>1234</MT>\n");
    EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
    EXPECT_THAT(machine.Trace(), EndsWith("[Debug:] Exiting TAVMaster::TAVMasterMain()\n"
                                          "[TAVRUV]: [Debug:] Entering TAVMaster::~TAVMaster()\n"
                                          "[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()\n"));
  }
}

TEST(RunSequence, LaunchModeComparesIfThereIsARepository) {
  const Installation machine;
  EXPECT_EQ(machine.Run().out, "");
  EXPECT_THAT(machine.ToolVerbs(), IsEmpty());
  EXPECT_FALSE(fs::exists(kRepository));
  machine.CreateRepository();
  machine.InstallTool({{"comparelocal", 52}});  // no payload: nothing to install
  EXPECT_EQ(machine.Run({"--VMware-ESXi", "host"}).out, "");
  EXPECT_EQ(machine.Run({"--ipmi-lan"}).out, "");
  EXPECT_THAT(machine.ToolVerbs(), IsEmpty());
  EXPECT_EQ(machine.Run().out, "");
  EXPECT_THAT(machine.ToolVerbs(), ElementsAre("comparelocal"));
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(4));
}

TEST(RunSequence, ExtendsTheSearchPathsForEveryProgram) {
  if (IsInstrumented()) GTEST_SKIP() << "valgrind and sanitizers change it";
  const std::string libraries = "./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia";
  const std::pair<std::string, std::string> rows[] = {
      {"unset LD_LIBRARY_PATH; PATH=/usr/bin:/bin", libraries + "|/usr/bin:/bin:./mellanox\n"},
      {"export LD_LIBRARY_PATH=; PATH=/bin:./mellanox", ":" + libraries + "|/bin:./mellanox:./mellanox\n"},
      {"export LD_LIBRARY_PATH=/usr/lib; PATH=/bin", "/usr/lib:" + libraries + "|/bin:./mellanox\n"},
  };
  const Installation machine;
  for (const char* program : {"ruv", "guihelper.sh"})
    machine.Install(program, "echo \"$LD_LIBRARY_PATH|$PATH\" >>../seen");
  const std::string seen = machine.Directory() + "/seen";
  for (const auto& [prelude, environment] : rows) {
    machine.Run({}, prelude);
    EXPECT_EQ(ReadFile(seen), environment + environment);
    fs::remove(seen);
  }
  // Shells have a PATH of their own if there is none: the application reads its environment as the kernel shows it.
  machine.Install("ruv", "/bin/cat /proc/self/environ >\"$0.environment\"");
  machine.Run({}, "unset PATH");
  EXPECT_THAT(ReadFile(machine.Directory() + "/ruv.environment"), HasSubstr(std::string("\0PATH=./mellanox\0", 17)));
}

TEST(RunSequence, GivesTheApplicationTheNewSupportListAndNoOpenFiles) {
  const Installation machine;
  machine.OfferPackage();
  machine.Install("guihelper.sh", "cd /proc/$$/fd; echo * >\"$0.files\"");
  machine.Install("ruv", "cat ../data/supportlist.xml; cd /proc/$$/fd; echo * >\"$0.files\"");
  EXPECT_THAT(machine.Run().out, EndsWith("Done\n<MT>1234</MT>\n\n<MT>1234</MT>"));
  EXPECT_EQ(ReadFile(machine.Directory() + "/ruv.files"), ReadFile(machine.Directory() + "/guihelper.sh.files"));
}

TEST(RunSequence, EndsAtOnceIfTheToolIsInterrupted) {
  for (const char* option : {"--update", "-v"}) {
    SCOPED_TRACE(option);
    const Installation machine;
    machine.CreateRepository();
    // Like Ctrl-C: signals the whole foreground process group, here one of the launcher's own.
    machine.Install("tavtool", "kill -INT 0; sleep 1");
    const RunResult run = machine.Run({option}, "with='setsid --wait'");
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.out, EndsWith("RUV application is determined by the user!\n"));
    EXPECT_THAT(machine.Trace(), EndsWith(" 2>&1\n"));
    EXPECT_THAT(machine.CallsOf("tavtool"), SizeIs(1));
    EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
  }
}

TEST(RunSequence, ProgramsDieOfSigpipeUnlessTheParentIgnoresIt) {
  const Installation machine;
  machine.Install("ruv", "kill -PIPE $$; echo survived");
  EXPECT_EQ(machine.Run().out, "");
  EXPECT_EQ(machine.Run({}, "trap '' PIPE").out, "survived\n");
}

TEST(RunSequence, GoesOnWhateverItsParentLeftToIt) {
  const std::string preludes[] = {
      "with='env --ignore-signal=CHLD'",
      "mkfifo pipe; sleep 0.2 <pipe & exec >pipe; wait",  // a console that nobody reads
      "exec >&-",                                         // a file that is opened gets its descriptor
      "exec <&- >&- 2>&-",
  };
  for (const std::string& prelude : preludes) {
    SCOPED_TRACE(prelude);
    const Installation machine;
    machine.CreateRepository();
    machine.InstallTool({{"comparelocal", 30}});
    EXPECT_EQ(machine.Run({"-x"}, prelude).status, 0);
    EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre("[-x]"));
    EXPECT_THAT(machine.TraceLines("You already"), SizeIs(1)) << "no exit code, or console text in the trace";
  }
}

TEST(RunSequence, SurvivesAFileSizeLimitAndAFullDisk) {
  if (IsInstrumented()) GTEST_SKIP() << "valgrind writes files of its own";
  const Installation machine;
  EXPECT_EQ(machine.Run({}, "ulimit -f 0").status, 0);
  EXPECT_EQ(machine.Run({}, "ln -sf /dev/full " + std::string(kTraceFile)).out, "");
  EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre(""));
}

// Runs the launcher with less and less memory until the dynamic loader cannot start it. Counts the runs that ended with
// status 1 for lack of memory, by the last lines of their traces.
std::map<std::string, int> RunsOutOfMemory(const Strings& arguments, int bytes, int steps) {
  const Installation machine;
  std::map<std::string, int> runs;
  RunResult run = {0, ""};
  machine.Install("ruv", "echo started");
  for (; run.status <= 1; bytes -= bytes / (run.out == "started\n" ? 16 : steps)) {
    fs::remove(kTraceFile);
    run = machine.Run(arguments, "with='prlimit --as=" + std::to_string(bytes) + "'");
    if (run.status != 1) continue;
    EXPECT_THAT(run.out, EndsWith("ERROR: Not enough memory, RUV launcher ends.\n"));
    const Strings lines = machine.TraceLines("");
    ++runs[lines.empty() ? "" : lines.back()];
  }
  EXPECT_EQ(run.status, 127) << run.out;
  return runs;
}

TEST(RunSequence, EndsWithOneLineIfMemoryRunsOut) {
  if (IsInstrumented()) GTEST_SKIP() << "needs more memory than the launcher";
  EXPECT_GT(RunsOutOfMemory({}, 5 << 20, 128)[""], 0) << "before main";
  const Strings arguments(12, "-" + std::string(100'000, 'x'));
  EXPECT_GT(RunsOutOfMemory(arguments, 12 << 20, 16)["[Debug:] Exiting TAVMaster::~TAVMaster()"], 0);
}
