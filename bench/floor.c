// The floor: the least a launch-mode run must do. Sets the two search paths as the launcher does and runs each of its
// arguments through the shell. Usage: floor COMMAND...
#include <stdio.h>
#include <stdlib.h>

#define LIBRARY_DIRECTORIES "./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia"
#define EXECUTABLE_DIRECTORIES "./mellanox"

static void Extend(const char* variable, const char* directories) {
  static char value[1 << 16];
  const char* old_value = getenv(variable);
  if (old_value != NULL) {
    snprintf(value, sizeof value, "%s:%s", old_value, directories);
    directories = value;
  }
  setenv(variable, directories, 1);
}

int main(int argc, char** argv) {
  Extend("LD_LIBRARY_PATH", LIBRARY_DIRECTORIES);
  Extend("PATH", EXECUTABLE_DIRECTORIES);
  int last_status = 0;
  for (int i = 1; i < argc; ++i) last_status = system(argv[i]);
  return last_status == -1;
}
