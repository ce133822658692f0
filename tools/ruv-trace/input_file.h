#ifndef RUV_TRACE_INPUT_FILE_H
#define RUV_TRACE_INPUT_FILE_H

#include <cstdio>
#include <string>

namespace ruv_trace {

// The lines of a file of any size and content, in constant memory.
class InputFile {
 public:
  // "-" is standard input.
  explicit InputFile(const std::string& name);
  ~InputFile();
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  // Sets the line, without its line feed; of a very long line, only its end. What follows the last line feed is not a
  // line. Returns false at the end, and if the file is refused.
  bool Next(std::string& line);

  // Returns why the file is refused: it cannot be read, is compressed, or holds something but (holds_runs is
  // false) no run. Returns "" if it is not.
  std::string Refusal(bool holds_runs) const;

 private:
  std::string name_;
  std::FILE* file_;
  int error_ = 0;
  bool empty_ = false;
  bool compressed_ = false;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_INPUT_FILE_H
