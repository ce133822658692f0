#include <algorithm>
#include <nlohmann/json.hpp>
#include <regex>

#include "run.h"

namespace ruv_trace {
namespace {
using Json = nlohmann::ordered_json;

// Returns JSON in printable ASCII.
std::string JsonText(const Json& json) { return json.dump(-1, ' ', true, Json::error_handler_t::replace); }

// Hides everything after the first option whose value contains a password, up to the redirections: the trace does not
// show where the value ends.
std::string Shown(const Command& command, bool show_passwords) {
  static const std::regex kPassword(
      R"(((?:|[\s\S]*?[\s"'])(?:-t|--ipmi-lan|--vmware-esxi|--remote-zfld|--proxy-password|--proxy-user(?=[\s\S]*:)|)"
      R"(--proxy-address(?=[\s\S]*@)))(?![a-z0-9])[\s\S]*?((?: 2>/dev/null| 1>/dev/null| 1>tav\.log| 2>&1)*))",
      std::regex::icase);
  std::smatch parts;
  std::string arguments = command.text.substr(std::min(command.arguments, command.text.size()));
  if (command.cut) arguments += ":@";  // what is missing may contain them, and the password
  if (show_passwords || !std::regex_match(arguments, parts, kPassword)) return command.text;
  return command.text.substr(0, command.arguments) + parts.str(1) + " ***" + parts.str(2);
}

std::string Cell(const std::string& text, std::size_t width) {
  if (text.size() > width) return text.substr(0, width - 3) + "...";
  return text + std::string(width - text.size(), ' ');
}

// Returns the reason or, without one, the package; and then, if it is certain, whether ruv was started.
std::string Outcome(const Run& run, std::size_t width) {
  const std::string version = run.package_version.empty() ? "package" : run.package_version;
  std::string package = version + ": " + run.package, ruv = run.ruv == "unknown" ? "" : "; ruv " + run.ruv;
  for (std::string* words : {&package, &ruv}) std::replace(words->begin(), words->end(), '_', ' ');
  std::string text = Printable(run.Reason().empty() ? package : run.Reason());
  // Only launch mode starts ruv: in the other modes this part may be dropped to save space.
  if (run.mode != "launch" && text.size() + ruv.size() > width) ruv.clear();
  if (text.size() + ruv.size() > width) text = Cell(text, width - ruv.size());
  return text + ruv;
}

std::string OrUnknown(const std::string& text) { return text.empty() ? "?" : text; }
Json OrNull(const std::string& text) { return text.empty() ? Json() : Json(text); }
}  // namespace

std::string TableLine(const Run& run) {
  const std::string number = std::to_string(run.number);
  const std::string columns = std::string(number.size() < 3 ? 3 - number.size() : 0, ' ') + number + " " +
                              Cell(run.Verdict(), 7) + " " + Cell(Printable(OrUnknown(run.machine_type)), 7) + " " +
                              Cell(run.mode == "unknown" ? "?" : run.mode, 6) + " ";
  return columns + Outcome(run, 80 - columns.size()) + "\n";
}

std::string Details(const Run& run, bool show_passwords) {
  std::string text;
  const auto add = [&text](const std::string& line) { text += "      " + Printable(line) + "\n"; };
  add("line " + std::to_string(run.line) + " of " + run.file + ", machine " + OrUnknown(run.machine_type) + " " +
      OrUnknown(run.system) + "/" + OrUnknown(run.architecture));
  if (!run.Reason().empty()) add("reason: " + run.Reason());
  const auto add_command = [&](const std::string& name, const Command& command) {
    add(name + Shown(command, show_passwords) + (command.cut ? "..." : ""));
  };
  for (const ToolCall& call : run.calls) {
    add(call.verb + (call.exit_code ? " " + std::to_string(*call.exit_code) : "") + ": " + call.meaning);
    add_command("  ", call.command);
  }
  if (!run.command.text.empty()) add_command("command: ", run.command);
  return text;
}

std::string CheckLine(const Run& run) {
  const std::string number = run.number == 0 ? "" : " (run " + std::to_string(run.number) + ")";
  return run.Verdict() + ": " + Outcome(run, std::string::npos) + number + "\n";
}

std::string JsonLine(const Run& run, bool show_passwords) {
  // clang-format off
  Json calls = Json::array();
  for (const ToolCall& call : run.calls) {
    calls.push_back({
        {"verb", call.verb}, {"exit_code", call.exit_code ? Json(*call.exit_code) : Json()}, {"result", call.result},
        {"meaning", call.meaning}, {"command", Shown(call.command, show_passwords)}, {"command_cut", call.command.cut}});
  }
  return JsonText({
      {"file", OrNull(run.file)}, {"line", run.line}, {"run", run.number}, {"verdict", run.Verdict()},
      {"reason", OrNull(run.Reason())}, {"machine_type", OrNull(run.machine_type)},
      {"operating_system", OrNull(run.system)}, {"architecture", OrNull(run.architecture)}, {"mode", run.mode},
      {"package", run.package}, {"package_version", OrNull(run.package_version)}, {"ruv", run.ruv},
      {"command", OrNull(Shown(run.command, show_passwords))}, {"command_cut", run.command.cut},
      {"tool_calls", calls}}) + "\n";
  // clang-format on
}

std::string Printable(const std::string& text) {
  const std::string quoted = JsonText(text);
  std::string printable;
  for (std::size_t i = 1; i + 1 < quoted.size(); ++i) {
    if (quoted[i] == '\\' && (quoted[i + 1] == '\\' || quoted[i + 1] == '"')) ++i;
    printable += quoted[i];
  }
  return printable;
}
}  // namespace ruv_trace
