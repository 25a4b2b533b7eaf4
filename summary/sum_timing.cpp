// Self-timing for tests: lines appended to the file KG_TIMINGS names.
#include "summary/sum_timing.h"

#include <time.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>

bool kgTimingsWanted() {
  const char* p = getenv("KG_TIMINGS");
  return p != nullptr && *p != '\0';
}

double kgNowMs() {
  timespec t{};
  clock_gettime(CLOCK_MONOTONIC, &t);
  return static_cast<double>(t.tv_sec) * 1000.0 + static_cast<double>(t.tv_nsec) / 1e6;
}

double kgMsSinceProcessStart() {
  std::ifstream in("/proc/self/stat");
  std::string all((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  // The command name may hold blanks: fields are counted after its closing parenthesis.
  const std::size_t close = all.rfind(')');
  if (close == std::string::npos) return -1;
  std::istringstream fields(all.substr(close + 2));
  std::string f;
  unsigned long long start = 0;
  for (int i = 3; i <= 22 && fields >> f; ++i) {
    if (i == 22) start = std::strtoull(f.c_str(), nullptr, 10);
  }
  timespec now{};
  clock_gettime(CLOCK_BOOTTIME, &now);
  const double ticks = static_cast<double>(sysconf(_SC_CLK_TCK));
  return (static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9 - start / ticks) * 1000.0;
}

void kgRecordTiming(const std::string& name, double ms) {
  const char* path = getenv("KG_TIMINGS");
  if (path == nullptr || *path == '\0') return;
  if (FILE* f = fopen(path, "a")) {
    fprintf(f, "%s %.2f\n", name.c_str(), ms);
    fclose(f);
  }
}
