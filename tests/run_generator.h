// A random input for one run of the launcher: arguments, files, programs and answers; ordinary, odd or broken.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

struct GeneratedRun {
  std::vector<std::string> arguments;
  // By path, relative to the application's directory. nullopt: a directory. The programs among them append their
  // name, the count of their arguments, and the arguments, each ended by a NUL, to the file that RUV_CALLS names.
  std::map<std::string, std::optional<std::string>> files;
  std::string input;  // standard input, to its end
  bool portable;      // installed in "media" of the application's directory
  bool noisy;         // the shell may find anything in arguments and identity, from a comment to a syntax error
};

// The trace file's contents before the run, if it exists.
constexpr const char* kEarlierTrace = "[TAVRUV]: of an earlier run\n";

// Returns the same run for the same seed. The markers K1., K2. and so on are in command-line order. Arguments and
// identity values reach a shell unescaped, so all that is not a fixed word is made of markers, each used once, the
// digit 7, and punctuation without '>', '&' and braces: no text can name a program, write to a file, stay in the
// background or define what calls itself.
GeneratedRun GenerateRun(std::uint64_t seed);
