#include "launcher/search_paths.h"

#include <cstdlib>
#include <string>

namespace NZEMRUVTAV {
namespace {

struct SearchPath {
  const char* variable;
  const char* directories;
};

constexpr SearchPath kLibraryPath = {"LD_LIBRARY_PATH",
                                     "./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia"};
constexpr SearchPath kExecutablePath = {"PATH", "./mellanox"};

// Returns the variable's new value. A variable that is present but empty counts as present: the value begins with a
// colon.
std::string Extended(const SearchPath& path) {
  const char* old_value = std::getenv(path.variable);
  return old_value == nullptr ? path.directories : std::string(old_value) + ":" + path.directories;
}

}  // namespace

void ExtendSearchPaths() {
  const std::string library_path = Extended(kLibraryPath);
  const std::string executable_path = Extended(kExecutablePath);
  setenv(kLibraryPath.variable, library_path.c_str(), 1);
  setenv(kExecutablePath.variable, executable_path.c_str(), 1);
}

}  // namespace NZEMRUVTAV
