#include "run_generator.h"

#include <cctype>
#include <random>

namespace {

using std::string;
using Alternatives = std::vector<const char*>;

// In these, @ stands for a marker, ^ for a word, & for a machine type, and * for noise or, mostly, nothing. Noise is
// what a shell, a format string or a text reader may trip over.
const Alternatives kNoise = {"@",  "@",  "@",  "@",  "@", "@", "'", "\"", "\\", " ",    "\t",
                             "\n", "\r", "$x", "$(", "(", ")", "`", "%",  "%s", "%n",   "#",
                             ";",  "|",  "<",  "=",  "!", "~", "/", "-",  "7",  "\x80", "\xff"};
const Alternatives kWords = {
    "@",          "@",    "@",    "a-@", "@-",        "100%@%s%n", "\xc3\xa9\xff@", "dir/1234_@xml",
    "dir/12@xml", "dir/", "1234", "",    "two words", "-i",        "--gui",         "-h"};
// clang-format off
const Alternatives kArguments = {
    "^", "^", "^", "^", "^", "^", "^", "^", "^", "^", "^", "^", "-^", "-^", "--Proxy-@=^", "--Proxy-@=^", "-i", "-r",
    "-d", "-html", "-b", "-b", "-v", "-?", "--help", "--", "--gui", "--cmd", "--show_stderr", "--ipmi-lan",
    "--vmware-esxi", "--update_m", "--update_os", "--update_arch", "--updat", "--update_x"};
// clang-format on
const Alternatives kUpdateModes = {"--chkupd", "--update", "--update"};
const Alternatives kMachineTypes = {"1234", "1234", "1234", "5678", "12", "12345", "", "<MT>"};
// clang-format off
const Alternatives kSystemInformation = {
    "ZEM_SYSTEM_OS=203\n", "ZEM_SYSTEM_OS= 304 x\n", "ZEM_SYSTEM_OS=+2\n", "ZEM_SYSTEM_OS=105\n", "ZEM_SYSTEM_OS=0\n",
    "ZEM_SYSTEM_OS=\n", "ZEM_SYSTEM_OS=-1\n", "ZEM_SYSTEM_OS=99999999999\n", "ZEM_SYSTEM_OS=203 ZEM_SYSTEM_MT=12\n",
    "zem_system_os=105\n", "ZEM_SYSTEM_ARCH=32\n", "ZEM_SYSTEM_ARCH=64\r\n", "ZEM_SYSTEM_ARCH=*\n", "*\n", "\n",
    "ZEM_SYSTEM_MT=&\n", "x ZEM_SYSTEM_MT=&\n", "ZEM_SYSTEM_MT=&*\n", "ZEM_SYSTEM_MT=&\r\n", "ZEM_SYSTEM_MT=1234"};
// clang-format on
const Alternatives kSupportList = {"<MT>&</MT>\n", "<MT>&</MT>\n", "<MT>&</MT>\r\n", "  <MT>&\n",
                                   "<mt>&</mt>\n", "<MT>\n",       "<MT>&*</MT>*\n", "*\n",
                                   "\n",           "<MT>&</MT>"};
const Alternatives kToolOutput = {"Name=pack\n", "Version=2.31a\n", "PackageVersion=1\n",
                                  "Version=\n",  "Version=9",       "VersionVersion=3.00*\n",
                                  "Version\n=",  "Version=*\n",     "*\n"};
const Alternatives kAnswers = {"y\n", "N\n", "yes\n", "\n", " y\n", "Y", "n", "*\n"};
// "kill -INT 0" signals the whole process group, like Ctrl-C.
const Alternatives kDeaths = {"kill -INT 0", "kill -INT $$", "kill -TERM $$", "kill -KILL $$", "kill -PIPE $$"};
const Alternatives kEnds = {"exit 0", "exit 0", "exit 1", "exit 255"};
const Alternatives kToolEnds = {"exit 0",  "exit 32", "exit 21", "exit 52",  "exit 61",  "exit 1",  "exit 2",
                                "exit 30", "exit 31", "exit 33", "exit 40",  "exit 41",  "exit 42", "exit 45",
                                "exit 51", "exit 60", "exit 77", "exit 126", "exit 254", "exit 255"};

class Generator {
 public:
  explicit Generator(std::uint64_t seed) : random_(seed) { run_.noisy = OneIn(3); }

  GeneratedRun Run() {
    DrawArguments();
    DrawPrograms();
    DrawFiles();
    run_.input = DrawSome(kAnswers, 5);
    run_.portable = OneIn(4);
    return run_;
  }

 private:
  std::size_t Below(std::size_t limit) { return static_cast<std::size_t>(random_() % limit); }
  bool OneIn(std::size_t count) { return Below(count) == 0; }
  const char* Pick(const Alternatives& alternatives) { return alternatives[Below(alternatives.size())]; }

  string Draw(const Alternatives& alternatives) { return Expanded(Pick(alternatives)); }

  string Expanded(const string& pattern) {
    string text;
    for (const char c : pattern) {
      switch (c) {
        case '@':
          text += "K" + std::to_string(++markers_) + ".";
          break;
        case '^':
          text += run_.noisy && OneIn(3) ? DrawSome(kNoise, 6) : Draw(kWords);
          break;
        case '&':
          text += Draw(kMachineTypes);
          break;
        case '*':
          text += run_.noisy && OneIn(3) ? DrawSome(kNoise, 6) : "";
          break;
        default:
          text += c;
      }
    }
    return text;
  }

  // Up to limit - 1 of them in a row.
  string DrawSome(const Alternatives& alternatives, std::size_t limit) {
    string text;
    for (std::size_t count = Below(limit); count > 0; --count) text += Draw(alternatives);
    return text;
  }

  string InAnyCase(string text) {
    const bool mixed = OneIn(3);
    for (char& letter : text) {
      if (mixed && OneIn(2)) letter = static_cast<char>(std::toupper(static_cast<unsigned char>(letter)));
    }
    return text;
  }

  void DrawArguments() {
    std::vector<string>& arguments = run_.arguments;
    const std::size_t count = OneIn(80) ? 300 : Below(7);
    while (arguments.size() < count) arguments.push_back(Expanded(InAnyCase(Pick(kArguments))));
    if (OneIn(30)) arguments.push_back(Expanded("--@") + string(600, '7'));
    if (OneIn(3)) {
      const auto place = arguments.begin() + static_cast<std::ptrdiff_t>(Below(arguments.size() + 1));
      arguments.insert(place, InAnyCase(Pick(kUpdateModes)));
    }
  }

  // A file now and then is missing, or a directory.
  void Put(const string& path, const string& text) {
    if (OneIn(12)) return;
    run_.files[path] = OneIn(25) ? std::nullopt : std::optional<string>(text);
  }

  void PutProgram(const string& path, const string& then) {
    Put(path, "#!/bin/sh\nprintf '%s\\0' \"${0##*/}\" \"$#\" \"$@\" >>\"$RUV_CALLS\"\n" + then + "\n");
  }

  string ToolEnd(const string& usual) {
    if (OneIn(2)) return usual;
    return Pick(OneIn(4) ? kDeaths : kToolEnds);
  }

  void DrawPrograms() {
    PutProgram("guihelper.sh", Pick(OneIn(6) ? kDeaths : kEnds));
    PutProgram("ruv", Pick(OneIn(3) ? kDeaths : kEnds));
    string tool = "case $1 in\ncomparelocal) cat \"$0.output\"; " + ToolEnd("exit 21") + " ;;\n";
    for (const char* verb : {"compareweb", "acquire", "copy", "expand"}) {
      tool += string(verb) + ") " + ToolEnd("exit 0") + " ;;\n";
    }
    PutProgram("tavtool", tool + "esac");
    if (OneIn(20)) {
      run_.files["/tmp/tav"] = "";
    } else {
      PutProgram("/tmp/tav/ruv/data/copy.sh", string("echo copied\n") + Pick(OneIn(4) ? kDeaths : kEnds));
    }
  }

  void DrawFiles() {
    run_.files["tavtool.output"] = DrawSome(kToolOutput, 5);
    if (OneIn(8)) Put("cwd/tav.log", "Version=0.99\n");
    Put("/var/log/TAV_Support/guihelp.dat", DrawSome(kSystemInformation, 7) + (OneIn(30) ? string(1, '\0') : ""));
    if (OneIn(20)) {
      run_.files["data"] = "";
    } else {
      Put("data/supportlist.xml", DrawSome(kSupportList, 7));
    }
    if (OneIn(30)) {
      run_.files["/var/log/ZEM_Support"] = "";
    } else if (OneIn(2)) {
      Put("/var/log/ZEM_Support/ruvtav.log", kEarlierTrace);
    }
    if (!OneIn(4)) run_.files["/var/ZEM_Support"] = OneIn(20) ? std::optional<string>("") : std::nullopt;
    if (OneIn(2)) run_.files["media/update"] = std::nullopt;
  }

  std::mt19937_64 random_;
  int markers_ = 0;
  GeneratedRun run_;
};

}  // namespace

GeneratedRun GenerateRun(std::uint64_t seed) { return Generator(seed).Run(); }
