#ifndef RUV_TRACE_LINE_SOURCE_H
#define RUV_TRACE_LINE_SOURCE_H

#include <cstddef>
#include <string_view>
#include <vector>

namespace ruv_trace {

// The lines of a file of any size and content, in constant memory. Of a line that is too long for the buffer, far
// longer than the launcher's, only the end is kept: there a line of the launcher may stand behind something that lacked
// a line feed. What follows the last line feed is no line: its end is missing.
class LineSource {
 public:
  // The descriptor stays the caller's.
  explicit LineSource(int descriptor) : descriptor_(descriptor), buffer_(kBufferSize) {}

  // Sets the line, without its line feed, valid until the next call. Returns false at the end and at a read error.
  bool Next(std::string_view& line);

  // The errno of the read error that ended the lines, or 0.
  int Error() const { return error_; }

 private:
  static constexpr std::size_t kBufferSize = std::size_t{256} * 1024;
  static constexpr std::size_t kKeptEnd = 1024;

  bool Fill();

  int descriptor_;
  int error_ = 0;
  std::vector<char> buffer_;
  std::size_t begin_ = 0;  // of what was not handed out yet
  std::size_t end_ = 0;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_LINE_SOURCE_H
