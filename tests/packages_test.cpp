// The package steps: their commands, the directories that they make, the version that they pass on.
#include "installation.h"

TEST(Packages, OnlineCommandsGetTheForwardedArguments) {
  const Installation machine;
  EXPECT_EQ(machine.Run({"--update", "-x", "two words", "--Proxy=1"}).status, 0);
  EXPECT_THAT(machine.TraceLines("[Status:]CheckUpdate:TAVToolCmd = "),
              ElementsAre("\"@/tavtool\" compareweb -l \"@\" -m 1234 -o rhel5 -a 64 --latest -x \"two words\" "
                          "--Proxy=1 2>/dev/null 1>/dev/null 2>&1"));
  EXPECT_THAT(machine.TraceLines("[Status:]AcquireUpdate: "),
              ElementsAre("command = mkdir -p /var/ZEM_Support 1>/dev/null 2>&1",
                          "TAVToolCmd = \"@/tavtool\" acquire -l \"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 --force "
                          "--latest -x \"two words\" --Proxy=1 2>/dev/null 1>/dev/null 2>&1"));
  EXPECT_THAT(machine.CallsOf("tavtool").back(),
              "[comparelocal][-l][/var/ZEM_Support][-s][@][-m][1234][-o][rhel5][-a][64]");
}

TEST(Packages, StepsRecreateMissingDirectories) {
  const Installation machine;
  machine.InstallCopyScript();
  machine.Install("tavtool",
                  "ls -d /var/ZEM_Support /tmp/tav >>../seen\n"
                  "case $1 in acquire) rm -r /var/ZEM_Support ;;\n"
                  "comparelocal) mv /tmp/tav ../expanded; rm -r /var/ZEM_Support; exit 21 ;;\n"
                  "expand) mv ../expanded/* /tmp/tav ;; esac");
  EXPECT_THAT(machine.Run({"--update"}).out, EndsWith("Done\nDone\n"));
  const std::string both = "/tmp/tav\n/var/ZEM_Support\n";
  EXPECT_EQ(ReadFile(machine.Directory() + "/seen"), "/tmp/tav\n" + both + both + both);
  // Only the download's mkdir is traced.
  const std::string trace = machine.Trace();
  EXPECT_EQ(trace.find("mkdir"), trace.rfind("mkdir"));
}

TEST(Packages, TheUserSeesTheStepBeforeItsCommandRuns) {
  const Installation machine;
  machine.InstallCopyScript();
  machine.Install("tavtool", "cp ../stdout ../stdout.$1; [ $1 != comparelocal ] || exit 21");
  machine.Run({"--update"});
  EXPECT_THAT(ReadFile(machine.Directory() + "/stdout.compareweb"), EndsWith("please wait...\n"));
  EXPECT_THAT(ReadFile(machine.Directory() + "/stdout.expand"), EndsWith("Applying update(s) please wait..."));
}

TEST(Packages, PassTheVersionToTheCopyScript) {
  const std::pair<std::string, std::string> rows[] = {
      {"Name=pack\nVersion=2.31a\nVersion=9.99\n", "2.31"},
      {"\nVersion=9\n", "9"},
      {"Version=\nVersion=1.23\n", ""},
      {"PackageVersion=1.05", "1.05"},
      {"VersioVersion=3.00 Version=4", "3.00"},
      {"Version =1\nversion=2\nVersion\n=3", ""},
      {std::string(70000, 'V') + "ersion=1.2\n", "1.2"},
      {"Version=1 23", "1 23"},
      {"", ""},
  };
  const Installation machine;
  machine.CreateRepository();
  machine.InstallCopyScript();
  machine.Install("tavtool", "[ \"$1\" != comparelocal ] || { cat \"$0.output\"; exit 21; }");
  for (const auto& [output, version] : rows) {
    SCOPED_TRACE(output.substr(0, 60));
    WriteFile(machine.Directory() + "/tavtool.output", output);
    machine.Run();
    EXPECT_EQ(machine.LastTraceLine("[Status:]CopyTAVToRUVFoler: command = "),
              "\"/tmp/tav/ruv/data/copy.sh\" \"/tmp/tav\" \"@\" \"/var/ZEM_Support\" " + version +
                  " 1>>/var/log/ZEM_Support/ruvtav.log 2>&1");
  }
}

TEST(Packages, InstallIfExpansionSucceedsAndThereIsACopyScript) {
  const std::string done = "Done\n";
  const std::string missing = "[Status:]CopyTAVToRUVFoler: script file \"/tmp/tav/ruv/data/copy.sh\" does not exist!";
  const std::string failed = "[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!";
  const std::string success = "[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!";
  // The exit code of the expansion, the copy script, the output, the script's calls, and the trace.
  const std::tuple<int, std::string, std::string, Strings, Strings> rows[] = {
      {52, "exit 0", done, {"[/tmp/tav][@][NO_TAV_PAYLOAD]"}, {success}},
      {32, "exit 3", done, {"[/tmp/tav][@][/var/ZEM_Support]"}, {success}},
      {0, "a directory", "Failed\n", {}, {missing, failed}},
      {21, "exit 0", "", {}, {}},
  };
  for (const auto& [exit_code, script, out, copy_calls, messages] : rows) {
    SCOPED_TRACE(exit_code);
    const Installation machine;
    machine.OfferPackage();
    machine.InstallTool({{"comparelocal", 21}, {"expand", exit_code}});
    machine.InstallCopyScript(script);
    if (script == "a directory") fs::remove("/tmp/tav/ruv/data/copy.sh");
    if (script == "a directory") fs::create_directory("/tmp/tav/ruv/data/copy.sh");
    EXPECT_EQ(machine.Run().out,
              "Discovered RUV update(s) in local drive for this system.\nApplying update(s) please wait..." + out);
    EXPECT_EQ(machine.CallsOf("copy.sh"), copy_calls);
    Strings traced;
    for (const std::string& line : {missing, failed, success}) {
      if (!machine.TraceLines(line).empty()) traced.push_back(line);
    }
    EXPECT_EQ(traced, messages);
    EXPECT_EQ(ReadFile(machine.SupportListFile()), out == done ? "<MT>1234</MT>\n\n<MT>1234</MT>" : "<MT>1234</MT>\n");
    EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre(""));
  }
}

TEST(Packages, AreImportedFromPortableMedia) {
  const Installation machine;
  const std::string media = machine.Directory() + "/portable media";
  const std::string member = "[Status:]CopyPortableTAVToRepository: ";
  const std::string command =
      "TAVToolCmd = \"@/tavtool\" copy -l \"@/portable media/update\" -t \"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 "
      "1>/dev/null 2>&1";
  const auto run = [&] {
    fs::remove(kTraceFile);
    return machine.Run({"-v"}, Environment("ZEM_PORTABLE_EXEC_DIR", media)).out;
  };
  run();
  EXPECT_THAT(machine.TraceLines(member), ElementsAre("The directory <Portable>/update does not Exist!"));
  EXPECT_THAT(machine.ToolVerbs(), IsEmpty());
  EXPECT_FALSE(fs::exists(kRepository));

  fs::create_directories(media + "/update");
  machine.InstallTool({{"copy", 51}});
  EXPECT_THAT(run(), HasSubstr("package corrupted"));
  EXPECT_THAT(machine.TraceLines(member), ElementsAre("command = mkdir -p /var/ZEM_Support 1>/dev/null 2>&1", command));
  EXPECT_THAT(machine.TraceLines("[Status:]This is a portable RUV,portablePath = "), ElementsAre("@/portable media"));
  EXPECT_THAT(machine.ToolVerbs(), ElementsAre("copy", "comparelocal"));
  run();
  EXPECT_THAT(machine.TraceLines(member), ElementsAre(command)) << "the repository exists now";
}

TEST(Packages, AreOnlyDownloadedToPortableMedia) {
  const Installation machine;
  const RunResult run =
      machine.Run({"--update"}, Environment("ZEM_PORTABLE_EXEC_DIR", machine.Directory() + "/usb stick"));
  EXPECT_THAT(run.out, EndsWith("RUV update(s) detected, start downloading...Done\n"));
  EXPECT_THAT(machine.TraceLines("[Status:]AcquireUpdate: command = "),
              ElementsAre("mkdir -p @/usb stick/update 1>/dev/null 2>&1"));  // a bare path, blank or not
  EXPECT_EQ(machine.CallsOf("tavtool").back(),
            "[acquire][-l][@/usb stick/update][-m][1234][-o][rhel5][-a][64][--force][--latest]");
}
