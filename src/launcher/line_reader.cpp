#include "launcher/line_reader.h"

#include <cerrno>
#include <cstdlib>
#include <new>

namespace NZEMRUVTAV {

LineReader::LineReader(const std::string& path) : file_(std::fopen(path.c_str(), "r")) {}

LineReader::~LineReader() {
  if (file_ != nullptr) std::fclose(file_);
  std::free(buffer_);
}

bool LineReader::Next(std::string_view& line) {
  errno = 0;
  const ssize_t length = getline(&buffer_, &capacity_, file_);
  if (length < 0) {
    // The end of the file leaves errno alone, unless stdio found no memory for its own buffer and did without.
    if (errno == ENOMEM && std::feof(file_) == 0) throw std::bad_alloc();
    return false;
  }
  line = std::string_view(buffer_, static_cast<std::size_t>(length));
  if (line.back() == '\n') {
    line.remove_suffix(1);
    return true;
  }
  return std::ferror(file_) == 0;
}

}  // namespace NZEMRUVTAV
