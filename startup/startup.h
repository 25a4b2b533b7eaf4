// The program's start-up sequence and its modes (-view, -export, -merge=FILE, -extract).
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "coverage/kgv_file_ref.h"
#include "coverage/summary_types.h"
#include "startup/viewer_options.h"
#include "support/errors.h"

enum class RunMode { view, exportReport, merge, extract };

// Process-wide start-up state, read by later parts of the program.
struct StartupState {
  RunMode mode = RunMode::view;
  std::string mergeTarget;  // -merge=FILE
  std::string programName = "kestrel -view";
  std::string installDir = "(unknown)";
  std::string scriptsDir = "(unknown)";
  int language = 0;  // 0 English, 1 Japanese
  bool lockingEnabled = true;
  std::uint32_t mergeMode = 1;
  std::vector<ViewerOption> options;
  std::vector<std::string> fileArgs;  // FILE arguments in command-line order
  std::vector<KgvFileRef> loadedFiles;  // one per distinct data file, in command-line order
  bool isJava = false;
};

// Load step 8: one reference per distinct file; a second name for the same file is
// reported with the duplicate notice and dropped.
std::vector<KgvFileRef> buildFileList(const std::vector<std::string>& fileArgs);

StartupState& startupState();

// What the loading and summary steps hand to the mode that follows.
struct StartupSummary {
  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;  // source files whose older data were set aside
  ErrorCode loadStatus = allOK;      // 1, or 36 when data were set aside
  std::uint32_t sortOrder = 0;
  std::uint32_t hitsPolicy = 1;
  std::vector<std::string> adjustmentProblems;
  std::unique_ptr<SumRoot> summary;  // refers into data
};

// After the file list is built: loads and merges the files, then the sort order, the help
// wait, the adjustments file, the hits policy and the summary. Fatal problems are reported
// on the console and their code returned; on success the result is 1 or 36.
ErrorCode prepareStartupSummary(StartupState& s, StartupSummary& out);

// The sort order of the option `sort` when given, else the settings' default. An unknown
// name is reported ("Couldn't interpret %s as a sorting order.") and gives 42.
ErrorCode startupSortOrder(const std::vector<ViewerOption>& options, std::uint32_t& order);

// A value given for QUOR_HELP_MAX_WAIT goes to the runtime option when it is a number;
// otherwise the value is reported (code 6) and start-up goes on. Returns the code.
ErrorCode applyHelpMaxWait(const std::vector<ViewerOption>& options);

// The version banner: product, version, build date and platform, then the two directories.
std::string versionBanner(const StartupState& s);
extern const char* const kUsageText;

// What the display gives the resource settings: the server's resources (as xrdb loaded
// them) and the resource lines of the toolkit's own command-line options (-xrm and the like).
struct DisplayResources {
  std::string display;
  std::vector<std::string> commandLine;
};

// Opens the display (the program supplies it), taking the toolkit's options out of the
// arguments; returns allOK or 8.
using DisplayCheck = ErrorCode (*)(int& argc, char** argv, DisplayResources& resources);

// Start-up steps, the load steps, then a console mode run to its end. For the window mode
// it stops once the summary is built: `showWindow` is set and `prepared` holds what the
// window is to show (start-up step 16 is the program's). Returns the code so far, which the
// process exits with (mapped by exitWithCode) unless the window runs.
ErrorCode runProgram(int argc, char** argv, DisplayCheck displayCheck, StartupSummary& prepared,
                     bool& showWindow);
