// The program's start-up sequence and its modes (-view, -export, -merge=FILE, -extract).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "adjust/errors.h"
#include "coverage/kgv_file_ref.h"
#include "startup/viewer_options.h"

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

// The version banner: product, version, build date and platform, then the two directories.
std::string versionBanner(const StartupState& s);
extern const char* const kUsageText;

// Checks that a display can be reached (the GUI program supplies it); returns allOK or 8.
using DisplayCheck = ErrorCode (*)(int& argc, char** argv);

// The whole program: start-up steps, the load steps, then the mode. Returns the code the
// process exits with (mapped by exitWithCode).
ErrorCode runProgram(int argc, char** argv, DisplayCheck displayCheck);
