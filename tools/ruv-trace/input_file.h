#ifndef RUV_TRACE_INPUT_FILE_H
#define RUV_TRACE_INPUT_FILE_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace ruv_trace {

// The lines of a file of any size and content, in constant memory. "-" is standard input.
class InputFile {
 public:
  explicit InputFile(const std::string& name);
  ~InputFile();
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  // Sets the line, without its line feed, valid until the next call. Of a line longer than the buffer, only the end is
  // kept. What follows the last line feed is not a line. Returns false at the end, and if the file is refused.
  bool Next(std::string_view& line);

  // Returns why the file is refused: it cannot be read, is compressed, or (found_runs is false) holds no run. Returns
  // "" if it is not.
  std::string Refusal(bool found_runs) const;

 private:
  bool Fill();

  std::string name_;
  int descriptor_;
  int error_ = 0;
  bool compressed_ = false;
  std::vector<char> buffer_;
  std::size_t begin_ = 0;  // of what was not handed out yet
  std::size_t end_ = 0;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_INPUT_FILE_H
