#include "passwords.h"

#include <algorithm>
#include <cctype>
#include <initializer_list>

namespace ruv_trace {
namespace {

constexpr std::string_view kMask = "***";
constexpr std::string_view kProxyPassword = "--proxy-password=";

std::string Folded(std::string_view text) {
  std::string folded(text);
  std::transform(folded.begin(), folded.end(), folded.begin(), [](unsigned char byte) { return std::tolower(byte); });
  return folded;
}

// Returns where the arguments end: the launcher adds redirections.
std::size_t EndOfArguments(std::string_view command) {
  for (bool found = true; found;) {
    found = false;
    for (const std::string_view redirection : {" 1>/dev/null", " 1>tav.log", " 2>/dev/null", " 2>&1"}) {
      if (command.size() < redirection.size()) continue;
      if (command.substr(command.size() - redirection.size()) != redirection) continue;
      command.remove_suffix(redirection.size());
      found = true;
    }
  }
  return command.size();
}

// Returns the position after the first option that has a login as its value, or npos.
std::size_t FindLogin(const std::string& folded) {
  std::size_t first = std::string::npos;
  for (const std::string_view option : {"-t", "--ipmi-lan", "--vmware-esxi", "--remote-zfld"}) {
    for (std::size_t at = 0; (at = folded.find(option, at)) != std::string::npos; ++at) {
      const std::size_t end = at + option.size();
      const bool begins = at == 0 || std::string_view(" \t\n\"'").find(folded[at - 1]) != std::string_view::npos;
      if (begins && (end == folded.size() || std::isalnum(static_cast<unsigned char>(folded[end])) == 0)) {
        first = std::min(first, end);
      }
    }
  }
  return first;
}

}  // namespace

std::string WithoutPasswords(std::string_view command) {
  const std::string folded = Folded(command);
  const std::size_t end = EndOfArguments(command);
  const std::size_t proxy = std::min(folded.find(kProxyPassword.substr(0, kProxyPassword.size() - 1)), end);
  std::string shown;
  std::size_t done = 0;
  const auto hide = [&](std::size_t from, std::size_t to) {
    shown.append(command.substr(done, from - done)).append(kMask);
    done = to;
  };
  const std::size_t login = FindLogin(folded);
  const std::size_t colon = login < proxy ? command.find(':', login) : std::string_view::npos;
  if (colon < proxy) {
    const std::size_t at = command.rfind('@', proxy);
    hide(colon + 1, at != std::string_view::npos && at > colon ? at : proxy);
  }
  if (proxy < end) hide(std::min(proxy + kProxyPassword.size(), end), end);
  return shown.append(command.substr(done));
}

}  // namespace ruv_trace
