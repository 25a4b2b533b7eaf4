// What the source-file code needs from the user: a new file name, a yes/no to go on, an
// error shown. The GUI implements it with its dialogs; tests answer from a script.
#pragma once

#include <string>

#include "support/errors.h"

class SourcePrompter {
 public:
  virtual ~SourcePrompter() = default;
  // The file dialog with the prompt; false when the user cancels.
  virtual bool askFileName(const std::string& prompt, std::string& name) = 0;
  // The continue question with the message; true to go on.
  virtual bool askContinue(const std::string& message) = 0;
  // The error dialog: the context, then the code's message.
  virtual void showError(const std::string& context, ErrorCode code) = 0;
};
