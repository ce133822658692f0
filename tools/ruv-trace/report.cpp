#include "report.h"

#include <optional>

namespace ruv_trace {
namespace {

constexpr char kHexDigits[] = "0123456789abcdef";
constexpr std::string_view kReplacementCharacter = "\xEF\xBF\xBD";

unsigned ByteAt(std::string_view text, std::size_t at) { return static_cast<unsigned char>(text[at]); }

std::string Hex(unsigned byte) { return {kHexDigits[byte >> 4U & 0xFU], kHexDigits[byte & 0xFU]}; }

struct LeadByte {
  unsigned first;
  unsigned last;
  std::size_t length;
  unsigned second_first;  // of the bytes that may follow it
  unsigned second_last;
};

// The well-formed sequences of UTF-8.
constexpr LeadByte kLeadBytes[] = {
    {0x00, 0x7F, 1, 0, 0},       {0xC2, 0xDF, 2, 0x80, 0xBF}, {0xE0, 0xE0, 3, 0xA0, 0xBF},
    {0xE1, 0xEC, 3, 0x80, 0xBF}, {0xED, 0xED, 3, 0x80, 0x9F}, {0xEE, 0xEF, 3, 0x80, 0xBF},
    {0xF0, 0xF0, 4, 0x90, 0xBF}, {0xF1, 0xF3, 4, 0x80, 0xBF}, {0xF4, 0xF4, 4, 0x80, 0x8F},
};

// The length of the character at the beginning of a text that is not empty; 0 when it is none.
std::size_t CharacterLength(std::string_view text) {
  const unsigned first = ByteAt(text, 0);
  for (const LeadByte& lead : kLeadBytes) {
    if (first < lead.first || first > lead.last) continue;
    if (lead.length > text.size()) return 0;
    for (std::size_t i = 1; i < lead.length; ++i) {
      const unsigned from = i == 1 ? lead.second_first : 0x80;
      const unsigned to = i == 1 ? lead.second_last : 0xBF;
      if (ByteAt(text, i) < from || ByteAt(text, i) > to) return 0;
    }
    return lead.length;
  }
  return 0;
}

// C0, DEL, and C1 in its two-byte form.
bool IsControl(std::string_view character) {
  const unsigned first = ByteAt(character, 0);
  return first < 0x20 || first == 0x7F || (first == 0xC2 && ByteAt(character, 1) < 0xA0);
}

std::string JsonString(std::string_view text) {
  std::string json = "\"";
  while (!text.empty()) {
    const std::size_t length = CharacterLength(text);
    const std::string_view character = text.substr(0, length == 0 ? 1 : length);
    if (length == 0) {
      json += kReplacementCharacter;
    } else if (ByteAt(text, 0) < 0x20) {
      json += "\\u00" + Hex(ByteAt(text, 0));
    } else {
      if (character == "\"" || character == "\\") json += '\\';
      json += character;
    }
    text.remove_prefix(character.size());
  }
  return json + "\"";
}

std::string JsonOrNull(const std::optional<std::string>& text) { return text ? JsonString(*text) : "null"; }
std::string JsonUnlessEmpty(std::string_view text) { return text.empty() ? "null" : JsonString(text); }
std::string JsonBool(bool value) { return value ? "true" : "false"; }

// The used values where the trace shows them, otherwise the discovered ones.
Identity IdentityOf(const Run& run) {
  const auto either = [](const auto& used, const auto& discovered) { return used ? used : discovered; };
  return {either(run.used.machine_type, run.discovered.machine_type), either(run.used.system, run.discovered.system),
          either(run.used.architecture, run.discovered.architecture)};
}

std::string JsonIdentity(const Identity& identity) {
  return "{\"type\":" + JsonOrNull(identity.machine_type) + ",\"system\":" + JsonOrNull(identity.system) +
         ",\"architecture\":" + JsonOrNull(identity.architecture) + "}";
}

std::string JsonCalls(const Run& run) {
  std::string json;
  for (const ToolCall& call : run.calls) {
    json += json.empty() ? "" : ",";
    json += "{\"verb\":" + JsonString(call.verb) +
            ",\"exit_code\":" + (call.exit_code ? std::to_string(*call.exit_code) : "null") +
            ",\"meaning\":" + JsonString(call.Meaning()) + "}";
  }
  return "[" + json + "]";
}

std::string HumanIdentity(const Run& run) {
  const Identity identity = IdentityOf(run);
  return "MT " + identity.machine_type.value_or("?") + " " + identity.system.value_or("?") + "/" +
         identity.architecture.value_or("?");
}

std::string HumanCalls(const Run& run) {
  std::string text;
  for (const ToolCall& call : run.calls) {
    text += text.empty() ? "" : ", ";
    text += call.verb + "=" + (call.exit_code ? std::to_string(*call.exit_code) : "?");
    text.append(" (").append(call.Meaning()).append(")");
  }
  return text;
}

std::string HumanPackage(const Run& run) {
  if (run.package.empty()) return "";
  return "package" + (run.package_version.empty() ? "" : " " + run.package_version) + ": " + std::string(run.package);
}

std::string HumanApplication(const Run& run) {
  const std::string text = "ruv " + std::string(run.Application());
  return run.command.empty() ? text : text + ": " + run.command + (run.command_cut ? "..." : "");
}

}  // namespace

std::string Printable(std::string_view text) {
  std::string printable;
  while (!text.empty()) {
    const std::size_t length = CharacterLength(text);
    const std::string_view character = text.substr(0, length == 0 ? 1 : length);
    if (length == 0 || IsControl(character)) {
      for (const char byte : character) printable += "\\x" + Hex(static_cast<unsigned char>(byte));
    } else {
      printable += character;
    }
    text.remove_prefix(character.size());
  }
  return printable;
}

std::string HumanLine(const Run& run) {
  std::string line = "run " + std::to_string(run.number) + ", line " + std::to_string(run.line);
  const auto add = [&line](std::string_view column) {
    if (!column.empty()) line.append("  ").append(column);
  };
  add(HumanIdentity(run));
  add(run.Mode());
  add(HumanCalls(run));
  add(HumanPackage(run));
  add(run.Ended());
  add(run.mixed ? "mixed with another run" : "");
  add(run.lines_missing ? "lines missing" : "");
  add(HumanApplication(run));
  return Printable(line) + "\n";
}

std::string JsonLine(const Run& run, std::string_view file) {
  return "{\"file\":" + JsonString(file) + ",\"run\":" + std::to_string(run.number) +
         ",\"line\":" + std::to_string(run.line) + ",\"machine\":" + JsonIdentity(IdentityOf(run)) +
         ",\"discovered\":" + JsonIdentity(run.discovered) + ",\"mode\":" + JsonUnlessEmpty(run.Mode()) +
         ",\"tool_calls\":" + JsonCalls(run) + ",\"package\":" + JsonUnlessEmpty(run.package) +
         ",\"package_version\":" + JsonUnlessEmpty(run.package_version) +
         ",\"application\":" + JsonString(run.Application()) + ",\"command\":" + JsonUnlessEmpty(run.command) +
         ",\"command_cut\":" + JsonBool(run.command_cut) + ",\"ended\":" + JsonString(run.Ended()) +
         ",\"mixed\":" + JsonBool(run.mixed) + ",\"lines_missing\":" + JsonBool(run.lines_missing) + "}\n";
}

}  // namespace ruv_trace
