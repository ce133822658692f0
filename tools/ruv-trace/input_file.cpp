#include "input_file.h"

#include <cerrno>
#include <cstring>

namespace ruv_trace {
namespace {

constexpr std::size_t kLongestLine = 65536;
constexpr std::size_t kKeptEnd = 1024;  // more than the launcher's longest line
constexpr int kGzipMagic = 0x1F;

}  // namespace

InputFile::InputFile(const std::string& name)
    : name_(name), file_(name == "-" ? stdin : std::fopen(name.c_str(), "re")), error_(file_ == nullptr ? errno : 0) {
  if (file_ == nullptr) return;
  const int first = std::ungetc(std::getc(file_), file_);
  empty_ = first == EOF;
  compressed_ = first == kGzipMagic;
}

InputFile::~InputFile() {
  if (file_ != nullptr && file_ != stdin) std::fclose(file_);
}

bool InputFile::Next(std::string& line) {
  line.clear();
  if (file_ == nullptr || compressed_) return false;
  for (int byte = 0; (byte = getc_unlocked(file_)) != EOF;) {
    if (byte == '\n') return true;
    if (line.size() == kLongestLine) line.erase(0, kLongestLine - kKeptEnd);
    line.push_back(static_cast<char>(byte));
  }
  if (std::ferror(file_) != 0) error_ = errno;
  return false;
}

std::string InputFile::Refusal(bool holds_runs) const {
  if (error_ != 0) return "cannot read " + name_ + ": " + std::strerror(error_);
  if (compressed_) return name_ + " is compressed: use zcat -f " + name_ + " | ruv-trace -";
  return holds_runs || empty_ ? "" : "no run of the launcher in " + name_;
}

}  // namespace ruv_trace
