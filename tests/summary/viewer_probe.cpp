// The viewer's window started the way start-up starts it: settings, options, the data files
// loaded and summarised, then the hand-over to the main window.
#include <cstdio>
#include <cstdlib>

#include "settings/settings_startup.h"
#include "startup/settings_wiring.h"
#include "startup/startup.h"
#include "startup/viewer_options.h"
#include "summary/sum_frame.h"

int main(int argc, char** argv) {
  StartupState& s = startupState();
  const char* home = getenv("KESTREL_HOME");
  s.installDir = home ? home : ".";
  ResourceSettingsInput in;
  in.installDir = s.installDir;
  for (const auto& w : loadResourceSettings(in)) fprintf(stderr, "%s\n", w.c_str());
  wireSettingsIntoEngine();
  s.options = makeViewerOptionTable();
  if (parseViewerOptions("kestrel -view", s.options, argc, argv) != allOK) return 2;
  for (int i = 1; i < argc; ++i) s.fileArgs.emplace_back(argv[i]);
  s.loadedFiles = buildFileList(s.fileArgs);
  StartupSummary prepared;
  ErrorCode rc = prepareStartupSummary(s, prepared);
  if (rc != allOK && rc != mergeIgnored) return static_cast<int>(rc);
  rc = runMainWindow(s, prepared);
  return rc == allOK ? 0 : static_cast<int>(rc);
}
