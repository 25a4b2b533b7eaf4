// Start-up: identity, installation directory, language, options, file list, then the mode.
#include "startup/startup.h"

#include <sys/utsname.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <deque>

#include "adjust/adjustments_file.h"
#include "coverage/adjustment_list.h"
#include "coverage/sort_orders.h"
#include "coverage/summary_build.h"
#include "settings/settings_startup.h"
#include "startup/console_report.h"
#include "startup/export_mode.h"
#include "startup/extract_mode.h"
#include "startup/load_files.h"
#include "startup/merge_mode.h"
#include "startup/settings_wiring.h"
#include "support/diagnostic.h"
#include "support/message_sink.h"
#include "support/runtime_options.h"

StartupState& startupState() {
  static StartupState s;
  return s;
}

const char* const kUsageText =
    "Example:\n        kestrel -view a.out.kgv\n \nUse this interactive program to view coverage "
    "data collected by\nKestrelgauge.\n \nSyntax:\n        kestrel -view [-force-merge] FILE "
    "[FILE...]\n \nEach FILE should be a Kestrelgauge binary file.  The data for the\nset of files "
    "will be combined together prior to presentation in the\nGUI.  If some of the coverage data "
    "are from different versions of the\nprogram(s), then the most recent data will be used and "
    "older data\nwill be ignored.  To change this behavior, use the -force-merge flag which\nwill "
    "cause the files to be combined regardless of their versions.\n \n";

std::string versionBanner(const StartupState& s) {
  struct utsname u {};
  std::string platform = "Linux";
  if (uname(&u) == 0) platform = std::string(u.sysname) + " " + u.machine;
  char line[512];
  snprintf(line, sizeof line, "Kestrelgauge viewer %s (built %s) for %s\n", KG_VERSION, __DATE__,
           platform.c_str());
  std::string out = line;
  out += "   Installed in:         " + s.installDir + "\n";
  out += "   Scripts installed in: " + s.scriptsDir + "\n";
  return out;
}

namespace {

// The mode is the first argument after the program name; the product's command puts it there.
bool takeMode(int& argc, char** argv, StartupState& s) {
  if (argc < 2 || !argv[1]) return true;
  const char* m = argv[1];
  if (strcmp(m, "-view") == 0) {
    s.mode = RunMode::view;
  } else if (strcmp(m, "-export") == 0) {
    s.mode = RunMode::exportReport;
  } else if (strcmp(m, "-extract") == 0) {
    s.mode = RunMode::extract;
  } else if (strncmp(m, "-merge=", 7) == 0) {
    s.mode = RunMode::merge;
    s.mergeTarget = m + 7;
    if (s.mergeTarget.empty()) return false;
  } else if (strcmp(m, "-merge") == 0) {
    return false;
  } else {
    return true;  // no mode word: the viewer
  }
  for (int i = 1; i + 1 < argc; ++i) argv[i] = argv[i + 1];
  argv[--argc] = nullptr;
  return true;
}

const char* modeProgramName(RunMode mode) {
  switch (mode) {
    case RunMode::exportReport: return "kestrel -export";
    case RunMode::merge: return "kestrel -merge";
    case RunMode::extract: return "kestrel -extract";
    case RunMode::view: break;
  }
  return "kestrel -view";
}

// Step 5: "-language VALUE" or "-language=VALUE".
const char* languageArgument(int argc, char** argv) {
  for (int i = 1; i < argc; ++i) {
    const char* a = argv[i];
    if (!a || strncmp(a, "-language", 9) != 0) continue;
    if (a[9] == '\0' && i + 1 < argc) return argv[i + 1];
    if (a[9] == '=') return a + 10;
  }
  return nullptr;
}

// "-language xx" becomes "-language=xx", so that the value is the option's and not taken
// for a data file by the option parser.
void joinLanguageValue(int& argc, char** argv) {
  static std::deque<std::string> joined;  // the texts argv points at, kept for the run
  for (int i = 1; i < argc; ++i) {
    const char* a = argv[i];
    if (!a || strncmp(a, "-language", 9) != 0) continue;
    if (a[9] != '\0') return;  // "-language=xx" or another option: settled
    if (i + 1 >= argc) return;
    joined.push_back(std::string("-language=") + argv[i + 1]);
    argv[i] = joined.back().data();
    for (int j = i + 1; j + 1 < argc; ++j) argv[j] = argv[j + 1];
    argv[--argc] = nullptr;
    return;
  }
}

}  // namespace

std::vector<KgvFileRef> buildFileList(const std::vector<std::string>& fileArgs) {
  std::vector<KgvFileRef> list;
  std::vector<int> positions;  // 1-based position among the FILE arguments of each entry
  for (size_t i = 0; i < fileArgs.size(); ++i) {
    KgvFileRef ref = makeKgvFileRef(fileArgs[i]);
    int found = findKgvFileRef(list, ref.resolvedName);
    if (found < 0) {
      list.push_back(std::move(ref));
      positions.push_back(static_cast<int>(i) + 1);
      continue;
    }
    const KgvFileRef& earlier = list[static_cast<size_t>(found)];
    bool showResolved = earlier.givenName != earlier.resolvedName &&
                        ref.givenName != ref.resolvedName && earlier.givenName != ref.givenName;
    reportError(duplicateFile,
                "The filename arguments %s\n(#%d among the names) and %s\n(#%d among the names) "
                "both refer to the same file%s%s%s.\nIt will be loaded only once.\n",
                earlier.givenName.c_str(), positions[static_cast<size_t>(found)],
                ref.givenName.c_str(), static_cast<int>(i) + 1, showResolved ? "\n(" : "",
                showResolved ? ref.resolvedName.c_str() : "", showResolved ? ")" : "");
  }
  return list;
}

ErrorCode runProgram(int argc, char** argv, DisplayCheck displayCheck, StartupSummary& prepared,
                     bool& showWindow) {
  showWindow = false;
  StartupState& s = startupState();

  // 1. Identity for all messages.
  diag::setIdentity("Kestrelgauge viewer", "Kestrelgauge", "kestrel");

  // 2. Enclosing double quotes come off every argument.
  stripArgumentQuotes(argc, argv);

  if (!takeMode(argc, argv, s)) usageError();
  s.programName = modeProgramName(s.mode);

  // 3. The installation directory is required.
  std::string home;
  if (!findRawOptionValue(argc, argv, "kestrelhome", home) || home.empty()) usageError();

  // 4. Runtime options the runtime library reads.
  setOption(KESTREL, 1);
  setStringOption(KESTREL_HOME, home.c_str());

  // 5. Language.
  s.language = kgChooseLanguage(languageArgument(argc, argv));
  joinLanguageValue(argc, argv);

  // 6. The display, for the window only.
  DisplayResources displayResources;
  if (s.mode == RunMode::view && displayCheck) {
    ErrorCode rc = displayCheck(argc, argv, displayResources);
    if (rc != allOK) return rc;
  }

  // 7. The user's resource settings, before the options.
  ResourceSettingsInput settingsInput;
  settingsInput.installDir = home;
  settingsInput.language = s.language;
  settingsInput.displayResources = std::move(displayResources.display);
  settingsInput.commandLineResources = std::move(displayResources.commandLine);
  for (const auto& w : loadResourceSettings(settingsInput)) kgWarning("%s", w.c_str());
  wireSettingsIntoEngine();

  // 9. Load step 1: options.
  s.options = makeViewerOptionTable();
  parseViewerOptions(s.programName.c_str(), s.options, argc, argv);

  // Load step 2: kestrelhome again, now from the parsed table.
  const ViewerOption* kh = findGivenOption("kestrelhome", s.options);
  if (!kh || kh->value.empty()) usageError();
  s.installDir = kh->value;
  s.scriptsDir = s.installDir + "/scripts";

  // Load step 3: help and version.
  bool help = findGivenOption("help", s.options) != nullptr;
  bool version = findGivenOption("version", s.options) != nullptr;
  if (help) {
    fflush(stdout);
    fputs(kUsageText, stderr);
  }
  if (version) {
    fflush(stdout);
    fputs(versionBanner(s).c_str(), stderr);
  }
  if (help || version) {
    fflush(stderr);
    return allOK;
  }

  // Load step 4: locking.
  s.lockingEnabled = getBoolViewerOption("locking", s.options, true, true);

  // Load step 5: files. argv[0] is the program name; the rest are FILE arguments.
  for (int i = 1; i < argc; ++i) s.fileArgs.emplace_back(argv[i]);
  if (s.fileArgs.empty()) {
    reportError(noFileName,
                "No files were specified on the command line.\n"
                "Please specify a list of one or more .kgv files.\n");
    return noFileName;
  }

  // Load step 7: merge mode.
  s.mergeMode = getBoolViewerOption("forcemerge", s.options, false, true) ? 2 : 1;

  // Load step 8: the list of distinct files.
  s.loadedFiles = buildFileList(s.fileArgs);

  if (s.mode == RunMode::merge) return runMergeMode(s);

  ErrorCode rc = prepareStartupSummary(s, prepared);
  if (rc != allOK && rc != mergeIgnored) return rc;

  if (s.mode == RunMode::exportReport) return runExportMode(prepared);
  if (s.mode == RunMode::extract) return runExtractMode(prepared);

  // 16. The main window takes over.
  showWindow = true;
  return rc;
}

ErrorCode startupSortOrder(const std::vector<ViewerOption>& options, std::uint32_t& order) {
  order = 0;
  if (const ViewerOption* o = findGivenOption("sort", options)) {
    ErrorCode rc = sort_order_by_name(o->value.c_str(), order);
    if (rc != allOK) {
      reportError(invalidSortingOrder, "Couldn't interpret %s as a sorting order.\n",
                  o->value.c_str());
      return invalidSortingOrder;
    }
  }
  if (order < 1 || order > 17) order = static_cast<std::uint32_t>(defaultSortOrder());
  if (order < 1 || order > 17) order = 11;
  return allOK;
}

ErrorCode applyHelpMaxWait(const std::vector<ViewerOption>& options) {
  const ViewerOption* o = findGivenOption("QUOR_HELP_MAX_WAIT", options);
  if (!o || o->value.empty()) return allOK;
  const char* text = o->value.c_str();
  char* end = nullptr;
  errno = 0;
  long value = strtol(text, &end, 0);
  if (end == text || *end != '\0') {
    reportError(argError, "Option %s=%s must have a numeric value.", o->name.c_str(), text);
    return argError;
  }
  setOption(QUOR_HELP_MAX_WAIT, static_cast<std::intptr_t>(value));
  return allOK;
}

ErrorCode prepareStartupSummary(StartupState& s, StartupSummary& out) {
  // Load steps 6, 7, 9 and 10: lock, load and merge every file.
  out.loadStatus = loadStartupFiles(s, out.data, out.ignored);
  if (out.loadStatus != allOK && out.loadStatus != mergeIgnored) return out.loadStatus;

  // 10. Java texts.
  if (s.isJava) mergeJavaResourceFiles(s.installDir);

  // 11. Sort order.
  ErrorCode rc = startupSortOrder(s.options, out.sortOrder);
  if (rc != allOK) return rc;

  // 12. How long help may take to come up.
  applyHelpMaxWait(s.options);

  // 13. The adjustments file; its problems are shown later, not fatal.
  const ViewerOption* adj = findGivenOption("adjustmentfilename", s.options);
  out.adjustmentProblems = readStartupAdjustments(adj ? adj->value.c_str() : nullptr);

  // 14. Hits policy.
  out.hitsPolicy = getHitsPolicy();

  // 15. The summary.
  // The report reads each file's line states once and the window shows one file at a time:
  // they are made when needed, except when damaged line numbers are to be reported first.
  bool lineStatesLater = (s.mode == RunMode::exportReport || s.mode == RunMode::view) && !lineStatesUpFront();
  ConsoleMessages console(s.mode != RunMode::view);
  rc = buildSummary(*out.data, out.sortOrder, out.hitsPolicy, adjustmentList(), console, out.summary,
                    !lineStatesLater);
  if (rc != allOK) {
    reportError(rc, "Couldn't summarize information:\n%s\n", errorMessage(rc).c_str());
    return rc;
  }
  return out.loadStatus;
}
