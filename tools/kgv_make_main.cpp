// kgv-make: writes a .kgv data file from a text description (see tools/kgv_maker.h).
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "tools/kgv_maker.h"

int main(int argc, char** argv) {
  if (argc != 3 || std::strcmp(argv[1], "-h") == 0 || std::strcmp(argv[1], "--help") == 0) {
    std::fprintf(stderr,
                 "Usage: kgv-make DESCRIPTION OUTPUT.kgv\n"
                 "Writes a coverage data file from a text description (\"-\" reads standard "
                 "input).\nThe format is described in docs/kgv-make.md.\n");
    return 2;
  }
  std::stringstream text;
  if (std::strcmp(argv[1], "-") == 0) {
    text << std::cin.rdbuf();
  } else {
    std::ifstream in(argv[1], std::ios::binary);
    if (!in) {
      std::fprintf(stderr, "kgv-make: cannot read %s\n", argv[1]);
      return 1;
    }
    text << in.rdbuf();
  }
  std::string error;
  if (!makeKgvFile(text.str(), argv[2], error)) {
    std::fprintf(stderr, "kgv-make: %s: %s\n", argv[1], error.c_str());
    return 1;
  }
  return 0;
}
