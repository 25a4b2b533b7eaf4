// A program that installs the fatal-signal report and then faults, so the report can be
// checked as a user would see it.
#include <unistd.h>

#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "support/diagnostic.h"

namespace {
void cleanup(void*) { write(2, "cleanup ran\n", 12); }
}  // namespace

int main(int argc, char** argv) {
  diag::setIdentity("Kestrelgauge viewer", "Kestrelgauge", "kestrel");
  kgInstallSignalHandlers();
  diag::addPriorInformation("loading /data/a.kgv");
  diag::addCleanup(cleanup, nullptr);
  if (argc > 1 && strcmp(argv[1], "abort") == 0) abort();
  // An address far from anything mapped: the memory dump shows it as unreadable.
  // (The address comes through a volatile so the compiler cannot see it is bogus.)
  volatile std::uintptr_t where = 0x40;
  *reinterpret_cast<volatile int*>(where) = 1;
  return 0;
}
