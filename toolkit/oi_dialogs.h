// Modal dialogs that return the user's answer: messages, questions with named buttons, the file
// dialog and the note list. Each runs a local event loop until a button is pressed.
#pragma once

#include <string>
#include <vector>

#include "toolkit/oi_widget.h"

enum class OI_Severity { error, warning, information, question, plain };

struct OI_DialogButton {
  std::string name;   // widget name, which is also the answer
  std::string label;  // built-in label; a "labelString" resource for the name wins
};

// A message dialog made once and shown again and again (for example "kgErrorDialog").
class OI_MessageDialog : public OI_Widget {
 public:
  OI_MessageDialog(Widget parent, const std::string& name, const std::string& title, OI_Severity severity,
                   const OI_DialogButton& button = {"kgOK", "OK"});
  // Shows `text` and waits for the button; returns its name ("" when the window was closed).
  std::string show(const std::string& text);
  // The answer of the last show, or "" while it waits.
  void describe(std::ostream& out) const override;
};

// A dialog of the caller's own contents, made once and shown modally again and again.
class OI_CustomDialog : public OI_Widget {
 public:
  OI_CustomDialog(Widget parent, const std::string& name, const std::string& title);
  // A vertical box for the caller's children.
  Widget workArea() const { return work_; }
  // Buttons along the bottom, in order; the first is the default.
  void addButton(const OI_DialogButton& button);
  // Shows the dialog over its parent until a button is pressed: its name, or "" when the
  // window was closed.
  std::string run();
  // Ends a run as if the button of that name had been pressed (Return in a field, say).
  void finish(const std::string& answer);

 private:
  struct Wait;
  Widget work_ = nullptr;
  std::vector<Widget> buttons_;
  Wait* running_ = nullptr;
};

// A question with the given buttons; returns the pressed button's name, "" when the window was
// closed. The dialog is made for the question and destroyed after it.
std::string oiAsk(Widget parent, const std::string& dialogName, const std::string& title, const std::string& text,
                  const std::vector<OI_DialogButton>& buttons, OI_Severity severity = OI_Severity::question);

// The file dialog: true with the chosen path in `chosen` on OK, false on Cancel or close.
bool oiAskFileName(Widget parent, const std::string& dialogName, const std::string& title, const std::string& prompt,
                   const std::string& initial, std::string& chosen);

// A list of notes or warnings under a heading, shown until the user presses the button.
void oiShowNoteList(Widget parent, const std::string& dialogName, const std::string& title, const std::string& heading,
                    const std::vector<std::string>& items, const OI_DialogButton& button = {"kgOK", "OK"});

// Wraps text at `width` columns on blanks (words longer than the width stand alone).
std::string oiWrapText(const std::string& text, size_t width);
