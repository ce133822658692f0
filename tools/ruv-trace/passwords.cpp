#include "passwords.h"

#include <algorithm>
#include <cctype>
#include <initializer_list>

namespace ruv_trace {
namespace {

constexpr std::string_view kBlanks = " \t\n";
constexpr std::string_view kBlanksAndQuotes = " \t\n\"'";
constexpr std::string_view kMask = "***";
constexpr std::string_view kProxyPassword = "--proxy-password=";

std::string Folded(std::string_view text) {
  std::string folded(text);
  std::transform(folded.begin(), folded.end(), folded.begin(), [](unsigned char byte) { return std::tolower(byte); });
  return folded;
}

// Returns the length of the argument at the beginning of the text. Blanks in quotes belong to it. So do the
// following words, unless they are quoted or look like an option or a redirection: such bare words can only come from
// one argument with a dash, which the launcher does not quote.
std::size_t ArgumentLength(std::string_view text) {
  char quote = 0;
  std::size_t length = 0;
  for (; length < text.size(); ++length) {
    const char byte = text[length];
    if (quote != 0) {
      if (byte == quote) quote = 0;
    } else if (byte == '"' || byte == '\'') {
      quote = byte;
    } else if (kBlanks.find(byte) != std::string_view::npos) {
      const std::string_view next = text.substr(length + 1);
      const bool redirection = next.substr(0, 2) == "1>" || next.substr(0, 2) == "2>";
      if (next.empty() || redirection || next[0] == '-' || next[0] == '"') break;
    }
  }
  return length;
}

// Returns where the value of the option at the position begins, or npos if no option with a password is there.
std::size_t ValueOfOption(const std::string& folded, std::size_t position) {
  if (position > 0 && kBlanksAndQuotes.find(folded[position - 1]) == std::string_view::npos) return std::string::npos;
  for (const std::string_view option : {"-t", "--ipmi-lan", "--vmware-esxi", "--remote-zfld"}) {
    if (folded.compare(position, option.size(), option) != 0) continue;
    const std::size_t blank = folded.find_first_of(kBlanks, position);
    const std::size_t end = folded.find_first_not_of("\"'", position + option.size());
    if (blank == end) return folded.find_first_not_of(kBlanks, blank);
  }
  return std::string::npos;
}

}  // namespace

std::string WithoutPasswords(std::string_view command) {
  const std::string folded = Folded(command);
  std::string shown;
  std::size_t done = 0;
  const auto hide = [&](std::size_t from, std::size_t to) {
    shown.append(command.substr(done, from - done)).append(kMask);
    done = to;
  };
  for (std::size_t position = 0; position < folded.size(); position = std::max(position + 1, done)) {
    if (folded.compare(position, kProxyPassword.size(), kProxyPassword) == 0) {
      const std::size_t secret = position + kProxyPassword.size();
      hide(secret, secret + ArgumentLength(command.substr(secret)));
      continue;
    }
    const std::size_t value = ValueOfOption(folded, position);
    if (value == std::string::npos) continue;
    const std::string_view argument = command.substr(value, ArgumentLength(command.substr(value)));
    const std::size_t colon = argument.find(':');
    if (colon == std::string_view::npos) continue;
    const std::size_t at = argument.rfind('@');
    hide(value + colon + 1, value + (at == std::string_view::npos || at < colon ? argument.size() : at));
  }
  return shown.append(command.substr(done));
}

}  // namespace ruv_trace
