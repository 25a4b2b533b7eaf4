// Stand-in for "kestrel -merge=OUT [-locking=BOOL] [-force-merge] FILE..." for the merge
// benchmark while the program's merge mode is not reachable: the same start-up state, the
// same merge.
#include <cstdio>
#include <cstring>
#include <string>

#include "startup/console_report.h"
#include "startup/merge_mode.h"
#include "startup/startup.h"

int main(int argc, char** argv) {
  StartupState s;
  s.mode = RunMode::merge;
  s.programName = "kestrel -merge";
  for (int i = 1; i < argc; ++i) {
    const char* a = argv[i];
    if (std::strncmp(a, "-merge=", 7) == 0)
      s.mergeTarget = a + 7;
    else if (std::strcmp(a, "-force-merge") == 0)
      s.mergeMode = 2;
    else if (std::strcmp(a, "-locking=no") == 0)
      s.lockingEnabled = false;
    else
      s.fileArgs.emplace_back(a);
  }
  if (s.mergeTarget.empty() || s.fileArgs.empty()) {
    std::fprintf(stderr, "Usage: %s -merge=OUT [-force-merge] [-locking=no] FILE...\n", argv[0]);
    return 9;
  }
  s.loadedFiles = buildFileList(s.fileArgs);
  return exitStatusFor(runMergeMode(s));
}
