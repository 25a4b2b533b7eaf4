// The hand-over from start-up to the main window: what start-up gives it, and the call that
// runs the window until the user exits.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "coverage/kgv_file_ref.h"
#include "coverage/kgv_merge.h"
#include "coverage/summary_types.h"
#include "summary/data_watcher.h"
#include "summary/script_runner.h"
#include "summary/source_windows.h"
#include "support/errors.h"

// Everything the window needs from start-up; it owns the data from here on.
struct MainWindowInput {
  std::string installDir;
  std::string versionText;                // shown by Help > Product information
  std::vector<KgvFileRef> loadedFiles;    // one per distinct data file, in command-line order
  std::uint32_t mergeMode = kMergeNewestWins;
  std::optional<std::string> userPath;    // -userpath, when given
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> summary;       // refers into data
  ErrorCode loadStatus = allOK;           // 1, or 36 when data were set aside
  std::vector<std::string> ignored;       // source files whose older data were set aside
  std::vector<std::string> adjustmentProblems;
  KG_SourceWindows* sourceWindows = nullptr;  // the annotated source windows; not owned
  KG_DataWatcher* dataWatcher = nullptr;      // the watch over the data files; not owned
  KG_ScriptRunner* scripts = nullptr;         // the scripts menu and output windows; not owned
};

// The toolkit opens the display (unless start-up opened it already) with the settings'
// resource database, the window is built and shown with the data, the load notes and
// adjustment problems are shown, and the event loop runs until exit. Returns 1 on a normal
// exit; otherwise the code of what failed, with the console text of the failure in `failure`.
ErrorCode runMainWindow(MainWindowInput& input, std::string& failure);
