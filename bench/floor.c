// The floor: the least a launch-mode run must do. Sets the two search paths as the launcher does and runs each of its
// arguments through the shell. Usage: floor COMMAND...
#include <stdio.h>
#include <stdlib.h>

int main(int argc, char** argv) {
  static char path[1 << 16];
  snprintf(path, sizeof path, "%s:./mellanox", getenv("PATH"));
  setenv("LD_LIBRARY_PATH", "./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia", 1);
  setenv("PATH", path, 1);
  for (int i = 1; i < argc; ++i) {
    if (system(argv[i]) == -1) return 1;
  }
}
