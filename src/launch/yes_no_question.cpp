#include "launch/yes_no_question.h"

#include <poll.h>
#include <unistd.h>

#include <cctype>
#include <cerrno>
#include <cstdio>

#include "launcher/console.h"

namespace NZEMRUVTAV {
namespace {

constexpr const char* kQuestion = "Do you want to proceed anyway (function may be limited)? (Y/N)";

enum class Answer { kYes, kNo, kOther };

// Returns the next character of standard input, or EOF. Waits if another program has left it non-blocking.
int NextCharacter() {
  for (;;) {
    errno = 0;
    const int character = std::getchar();
    if (character != EOF || errno != EAGAIN) return character;
    pollfd input = {STDIN_FILENO, POLLIN, 0};
    if (poll(&input, 1, -1) < 0 && errno != EINTR) return EOF;
    std::clearerr(stdin);
  }
}

// Reads one line, byte by byte and unbuffered, so that the rest of the input is left to the application.
Answer ReadAnswer() {
  std::setvbuf(stdin, nullptr, _IONBF, 0);
  std::clearerr(stdin);
  int first = 0;
  std::size_t length = 0;
  int character = 0;
  while ((character = NextCharacter()) != EOF && character != '\n') {
    if (length++ == 0) first = std::tolower(character);
  }
  if (character == EOF && (length == 0 || std::ferror(stdin) != 0)) return Answer::kNo;
  if (length != 1) return Answer::kOther;
  return first == 'y' ? Answer::kYes : first == 'n' ? Answer::kNo : Answer::kOther;
}

}  // namespace

bool UserAgrees() {
  Answer answer = Answer::kOther;
  while (answer == Answer::kOther) {
    Print(kQuestion);
    FlushConsole();
    answer = ReadAnswer();
  }
  return answer == Answer::kYes;
}

}  // namespace NZEMRUVTAV
