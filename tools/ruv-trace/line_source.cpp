#include "line_source.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace ruv_trace {

bool LineSource::Next(std::string_view& line) {
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

// Reads on behind what there is of the current line.
bool LineSource::Fill() {
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

}  // namespace ruv_trace
