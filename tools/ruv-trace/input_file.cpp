#include "input_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace ruv_trace {
namespace {

constexpr std::size_t kBufferSize = std::size_t{256} * 1024;
constexpr std::size_t kKeptEnd = 1024;  // more than the launcher's longest line
constexpr std::string_view kGzipMagic = "\x1F\x8B";

}  // namespace

InputFile::InputFile(const std::string& name)
    : name_(name),
      descriptor_(name == "-" ? STDIN_FILENO : open(name.c_str(), O_RDONLY | O_CLOEXEC)),
      buffer_(kBufferSize) {
  if (descriptor_ < 0) {
    error_ = errno;
  } else if (Fill()) {
    compressed_ = std::string_view(buffer_.data(), end_).substr(0, kGzipMagic.size()) == kGzipMagic;
  }
}

InputFile::~InputFile() {
  if (descriptor_ > STDIN_FILENO) close(descriptor_);
}

bool InputFile::Next(std::string_view& line) {
  if (error_ != 0 || compressed_) return false;
  for (;;) {
    const char* const begin = buffer_.data() + begin_;
    const void* const line_feed = std::memchr(begin, '\n', end_ - begin_);
    if (line_feed != nullptr) {
      line = std::string_view(begin, static_cast<std::size_t>(static_cast<const char*>(line_feed) - begin));
      begin_ += line.size() + 1;
      return true;
    }
    if (!Fill()) return false;
  }
}

// Reads more after the current line's beginning. Returns false at the end of the file and at a read error.
bool InputFile::Fill() {
  if (end_ - begin_ == buffer_.size()) begin_ = end_ - kKeptEnd;
  std::memmove(buffer_.data(), buffer_.data() + begin_, end_ - begin_);
  end_ -= begin_;
  begin_ = 0;
  ssize_t length = 0;
  do {
    length = read(descriptor_, buffer_.data() + end_, buffer_.size() - end_);
  } while (length < 0 && errno == EINTR);
  if (length < 0) error_ = errno;
  if (length <= 0) return false;
  end_ += static_cast<std::size_t>(length);
  return true;
}

std::string InputFile::Refusal(bool found_runs) const {
  if (error_ != 0) return "cannot read " + name_ + ": " + std::strerror(error_);
  if (compressed_) return name_ + " is compressed: use zcat -f " + name_ + " | ruv-trace -";
  return found_runs ? "" : "no run of the launcher in " + name_;
}

}  // namespace ruv_trace
