// What the main window needs of the annotated source windows, which are built above it: the
// program hands an implementation to the window with its input.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "coverage/summary_types.h"

class KG_OutlineRoot;

class KG_SourceWindows {
 public:
  virtual ~KG_SourceWindows() = default;
  // The main window's outline, whose function rows follow the edits of adjustments (null when
  // the main window goes).
  virtual void attachOutline(KG_OutlineRoot* outline) = 0;
  // Shows the file at the line (0: its first) in the one current window, made when needed.
  virtual void open(SumFile& file, std::uint32_t line) = 0;
  // The data were summarised anew: the current window shows its file in the new summary, or
  // closes when the file is no longer there.
  virtual void summaryReplaced(SumRoot& summary) = 0;
  // The path of the file in the current window (extraction leaves it alone); empty for none.
  virtual std::string shownPath() const = 0;
  // The viewer is about to exit: unsaved edits are asked about; false cancels the exit.
  virtual bool confirmExit() = 0;
  // Every source window goes, before the main window.
  virtual void closeAll() = 0;

  // "Exit Kestrelgauge" in a source window: the main window's exit, which the main window sets.
  std::function<void()> exitViewer;
  // What Help > Product information shows in a source window, as in the main window.
  std::string versionText;
};
