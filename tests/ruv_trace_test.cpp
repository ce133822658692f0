// ruv-trace's reports of real runs.
#include <cstdio>
#include <cstdlib>
#include <nlohmann/json.hpp>
#include <sstream>

#include "installation.h"

using nlohmann::json;
using ::testing::HasSubstr;

namespace {

// Runs ruv-trace. Returns both of its outputs and, unless it is 0, its exit status.
std::string Report(const Installation& machine, const std::string& arguments = "") {
  std::string text;
  setenv("RUV_TRACE", RUV_TRACE_EXE, 1);
  std::FILE* pipe = popen(("\"$RUV_TRACE\" 2>&1 " + arguments).c_str(), "r");
  for (int byte = 0; (byte = std::getc(pipe)) != EOF;) text.push_back(static_cast<char>(byte));
  const int status = pclose(pipe);
  return machine.WithPlainDirectory(text) + (status == 0 ? "" : "status " + std::to_string(status >> 8));
}

}  // namespace

TEST(RuvTrace, ReportsWhatARunDid) {
  struct Row {
    Strings arguments;
    std::map<std::string, int> tool;  // its exit codes
    std::string line;
    std::string ruv;
  };
  const Row rows[] = {
      {{"-b"}, {}, "ok      1234    launch package: nothing newer; ruv started", "started"},
      {{}, {{"comparelocal", 21}}, "ok      1234    launch 2.31: copy script ran; ruv started", "started"},
      {{"--chkupd"},
       {{"compareweb", 42}},
       "problem 1234    check  compareweb 42: Unable to connect to update website",
       "not_started"},
  };
  for (const Row& row : rows) {
    const Installation machine;
    machine.CreateRepository();
    machine.InstallTool(row.tool, "Version=2.31\n");
    machine.InstallCopyScript("echo copied");
    machine.Run(row.arguments);
    EXPECT_THAT(Report(machine), HasSubstr("\n  1 " + row.line + "\n1 run: "));
    EXPECT_EQ(json::parse(Report(machine, "--json")).at("ruv"), row.ruv);
  }
}
