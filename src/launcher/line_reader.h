#pragma once

#include <cstdio>
#include <string>
#include <string_view>

namespace NZEMRUVTAV {

// Reads a text file line by line. Lines end at a line feed; the last one needs none.
class LineReader {
 public:
  explicit LineReader(const std::string& path);
  ~LineReader();
  LineReader(const LineReader&) = delete;
  LineReader& operator=(const LineReader&) = delete;

  // False if the file could not be opened. A directory can be opened, but reading it fails at once.
  bool IsOpen() const { return file_ != nullptr; }

  // The file must be open. Sets the line, without its line feed; it is valid until the next call. Returns false at the
  // end of the file and after a read error, also if the error came in the middle of a line. Throws std::bad_alloc if
  // the line does not fit into memory.
  bool Next(std::string_view& line);

 private:
  std::FILE* file_;
  char* buffer_ = nullptr;  // owned by getline(3)
  std::size_t capacity_ = 0;
};

}  // namespace NZEMRUVTAV
