// The viewer's message and question dialogs, the "Take Note" list and the lock reporter.
#pragma once

#include <X11/Intrinsic.h>

#include <string>
#include <vector>

#include "support/errors.h"
#include "toolkit/oi_dialogs.h"

// The window dialogs go over when the caller names none (the main window once it exists).
void kgSetDialogHome(Widget shell);
Widget kgDialogHome();

// The error, warning and information dialogs, each made once and reused.
void show_message(OI_Severity severity, const std::string& text, Widget parent = nullptr);
// "%s:\n %s": the text and the error code's message wrapped at 60 columns.
void show_error(ErrorCode code, const std::string& text, Widget parent = nullptr);
std::string errorDialogText(ErrorCode code, const std::string& text);

// The name of the button pressed.
std::string ask(const std::string& text, Widget parent, const std::string& title,
                const std::vector<OI_DialogButton>& buttons);

enum class AskSaveKind { exiting, closing, updating };
// 3 save, 2 the other action, 0 cancel.
int ask_save(const std::string& text, AskSaveKind kind, Widget parent = nullptr);
// True for Continue.
bool ask_continue(const std::string& text, Widget parent = nullptr);
// The question text: the caller's text, then "Continue anyway?" (or its resource) on its own line.
std::string continueQuestionText(const std::string& text);

// The shared "Take Note" list: the banner, then the messages (an empty line between them when
// `separate`), over the parent. It stays up until its OK is pressed; it does not block.
void noteList(const std::string& banner, const std::vector<std::string>& messages, bool separate = false,
              Widget parent = nullptr);

// Out-of-date notes and other load results, as after start-up and after a reload: nothing
// for 1 or when merge warnings are not wanted; the list of source files when details are
// wanted and known, else the code's message.
void showLoadResult(ErrorCode status, const std::vector<std::string>& ignored);

// Lock waits and breaks asked through the continue question (at most every 20 s for waits).
bool windowLockReporter(int event, const std::string& path, const std::string& lockName);
