// What the main window needs of the scripts, which are built above it: the scripts menu made
// while the window is built, "Run script...", and the output windows going with the viewer.
#pragma once

#include <string>

#include "support/errors.h"

class KG_SumFrame;

class KG_ScriptRunner {
 public:
  virtual ~KG_ScriptRunner() = default;
  // Reads the scripts directory and makes the dialog. A code other than 1 stops the window's
  // construction; `error` then holds the code's message with its detail.
  virtual ErrorCode build(KG_SumFrame& frame, std::string& error) = 0;
  // "Run script...": the dialog, then the chosen script over the data shown.
  virtual void run() = 0;
  // Every output window goes, before the main window.
  virtual void closeAll() = 0;
};
