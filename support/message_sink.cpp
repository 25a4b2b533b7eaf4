// The console's message sink.
#include "support/message_sink.h"

#include <cstdio>

void ConsoleMessages::warning(const std::string& text) {
  fflush(stdout);
  fputs(text.c_str(), stderr);
  fflush(stderr);
}

void ConsoleMessages::notice(const std::string& text) {
  FILE* to = noticesToStderr_ ? stderr : stdout;
  fflush(to == stdout ? stderr : stdout);
  fputs(text.c_str(), to);
  fflush(to);
}
