#include "report.h"

#include <algorithm>
#include <nlohmann/json.hpp>
#include <optional>

#include "passwords.h"

namespace ruv_trace {
namespace {

using Json = nlohmann::ordered_json;

constexpr std::size_t kLineWidth = 80;

std::string JsonText(const Json& json) { return json.dump(-1, ' ', false, Json::error_handler_t::replace); }

template <typename Text>
Json OrNull(const std::optional<Text>& text) {
  return text ? Json(*text) : Json();
}

Json UnlessEmpty(const std::string& text) { return text.empty() ? Json() : Json(text); }

std::string Shown(const Command& command, bool show_passwords) {
  return show_passwords ? command.text : WithoutPasswords(command.text);
}

Json JsonCalls(const Run& run, bool show_passwords) {
  Json calls = Json::array();
  for (const ToolCall& call : run.Known().calls) {
    calls.push_back({{"verb", call.verb},
                     {"exit_code", OrNull(call.exit_code)},
                     {"result", !call.exit_code ? kUnknown
                                : call.Failed() ? kProblem
                                                : kOk},
                     {"meaning", call.Meaning()},
                     {"command", Shown(call.command, show_passwords)},
                     {"command_cut", call.command.MayBeCut()}});
  }
  return calls;
}

// True if the character moves or hides text: DEL, C1, zero-width, text-direction and line-separator characters.
bool IsControl(std::string_view character) {
  return character == "\x7F" || (character >= "\xC2\x80" && character < "\xC2\xA0") || character == "\xD8\x9C" ||
         (character >= "\xE2\x80\x8B" && character <= "\xE2\x80\x8F") ||
         (character >= "\xE2\x80\xA8" && character < "\xE2\x80\xAF") ||
         (character > "\xE2\x81\xA5" && character < "\xE2\x81\xAA");
}

bool StartsCharacter(char byte) { return (static_cast<unsigned char>(byte) & 0xC0U) != 0x80U; }

// Returns the length of the character at the beginning of valid UTF-8.
std::size_t CharacterLength(std::string_view text) {
  std::size_t length = 1;
  while (length < text.size() && !StartsCharacter(text[length])) ++length;
  return length;
}

std::size_t Width(std::string_view text) {
  return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), StartsCharacter));
}

// Returns the text cut or padded to the width.
std::string Cell(std::string text, std::size_t width) {
  if (Width(text) > width) {
    while (Width(text) > width - 3) text.pop_back();
    return text + "...";
  }
  return text + std::string(width - Width(text), ' ');
}

std::string InWords(std::string_view value) {
  std::string words(value);
  std::replace(words.begin(), words.end(), '_', ' ');
  return words;
}

// Returns the reason or, without one, the package; and then, if it is certain, whether ruv was started.
std::string Outcome(const Run& run, std::size_t width) {
  const Facts& known = run.Known();
  std::string text = Judge(run).reason;
  if (text.empty()) {
    text = (known.package_version.empty() ? "package" : known.package_version) + ": " + InWords(known.package);
  }
  text = Printable(text);
  std::string ruv = known.application == kUnknown ? "" : "; ruv " + InWords(known.application);
  // Only launch mode starts ruv: in the other modes this part may be dropped to save space.
  if (known.mode != kLaunchMode && Width(text) + ruv.size() > width) ruv.clear();
  if (Width(text) + ruv.size() > width) text = Cell(text, width - ruv.size());
  return text + ruv;
}

}  // namespace

Verdict Judge(const Run& run) {
  const std::string problem = run.Problem();
  if (!problem.empty()) return {kProblem, problem};
  const std::string unclear = run.Unclear();
  if (!unclear.empty()) return {kUnknown, unclear};
  return {kOk, ""};
}

std::string TableHeader() { return "RUN VERDICT MACHINE DID    PACKAGE AND RUV, OR WHAT IS WRONG\n"; }

std::string TableLine(const Run& run) {
  const std::string number = std::to_string(run.number);
  const std::string machine = Printable(run.Machine().machine_type.value_or("?"));
  const std::string mode = run.Known().mode == kUnknown ? "?" : std::string(run.Known().mode);
  const std::string columns = std::string(number.size() < 3 ? 3 - number.size() : 0, ' ') + number + " " +
                              Cell(std::string(Judge(run).word), 7) + " " + Cell(machine, 7) + " " + Cell(mode, 6) +
                              " ";
  return columns + Outcome(run, kLineWidth - Width(columns)) + "\n";
}

std::string Details(const Run& run, bool show_passwords) {
  const Facts& known = run.Known();
  const Identity machine = run.Machine();
  std::string text;
  const auto add = [&text](const std::string& line) { text += "      " + Printable(line) + "\n"; };
  add("line " + std::to_string(run.line) + " of " + run.file + ", machine " + machine.machine_type.value_or("?") + " " +
      machine.system.value_or("?") + "/" + machine.architecture.value_or("?"));
  if (const std::string reason = Judge(run).reason; !reason.empty()) add("reason: " + reason);
  for (const ToolCall& call : known.calls) {
    add(call.verb + (call.exit_code ? " " + std::to_string(*call.exit_code) : "") + ": " + std::string(call.Meaning()));
    add("  " + Shown(call.command, show_passwords) + (call.command.MayBeCut() ? "..." : ""));
  }
  if (!known.command.text.empty()) {
    add("command: " + Shown(known.command, show_passwords) + (known.command.MayBeCut() ? "..." : ""));
  }
  return text;
}

std::string CheckLine(const Run& run) {
  return std::string(Judge(run).word) + ": " + Outcome(run, std::string::npos) + " (run " + std::to_string(run.number) +
         ")\n";
}

std::string JsonLine(const Run& run, bool show_passwords) {
  const Facts& known = run.Known();
  const Identity machine = run.Machine();
  const Verdict verdict = Judge(run);
  const Json json = {{"file", run.file},
                     {"line", run.line},
                     {"run", run.number},
                     {"verdict", verdict.word},
                     {"reason", UnlessEmpty(verdict.reason)},
                     {"machine_type", OrNull(machine.machine_type)},
                     {"operating_system", OrNull(machine.system)},
                     {"architecture", OrNull(machine.architecture)},
                     {"mode", known.mode},
                     {"package", known.package},
                     {"package_version", UnlessEmpty(known.package_version)},
                     {"ruv", known.application},
                     {"command", UnlessEmpty(Shown(known.command, show_passwords))},
                     {"command_cut", !known.command.text.empty() && known.command.MayBeCut()},
                     {"tool_calls", JsonCalls(run, show_passwords)}};
  return json.dump(-1, ' ', true, Json::error_handler_t::replace) + "\n";
}

std::string Printable(std::string_view text) {
  // The JSON library escapes control characters and replaces invalid UTF-8. Undoes two of its escapes and escapes a few
  // more characters.
  const std::string quoted = JsonText(std::string(text));
  std::string_view rest = std::string_view(quoted).substr(1, quoted.size() - 2);
  std::string printable;
  while (!rest.empty()) {
    if (rest[0] == '\\' && (rest[1] == '\\' || rest[1] == '"')) rest.remove_prefix(1);
    const std::string_view character = rest.substr(0, CharacterLength(rest));
    if (IsControl(character)) {
      const std::string escaped = Json(std::string(character)).dump(-1, ' ', true);
      printable.append(escaped, 1, escaped.size() - 2);
    } else {
      printable += character;
    }
    rest.remove_prefix(character.size());
  }
  return printable;
}

}  // namespace ruv_trace
