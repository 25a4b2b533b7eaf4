// The manual's installed page, the Help menus' topics and how a topic is handed to the user's
// browser command; the window side (running it, the error dialog) is in help_browser.
#pragma once

#include <string>
#include <vector>

// One cell of a Help menu: its widget name, its English label and the anchor it opens in the
// manual (empty: the top of the page).
struct KG_HelpTopic {
  const char* name;
  const char* label;
  const char* anchor;
};

const std::vector<KG_HelpTopic>& kgMainWindowHelpTopics();
const std::vector<KG_HelpTopic>& kgSourceWindowHelpTopics();

// Context help: the place in the manual for a part of a window, by the part's widget name.
struct KG_ContextTopic {
  const char* widget;
  const char* anchor;
};
const std::vector<KG_ContextTopic>& kgMainWindowContextTopics();
const std::vector<KG_ContextTopic>& kgSourceWindowContextTopics();

// The anchor for a click on a widget whose names, from itself up to its window, are `names`:
// that of the first name with a place in `topics`, else `fallback`.
std::string kgContextAnchor(const std::vector<KG_ContextTopic>& topics, const std::vector<std::string>& names,
                            const std::string& fallback);

// "<installDir>/help/manual.html".
std::string kgHelpPagePath(const std::string& installDir);

// A file URL of an absolute path, bytes outside the unreserved set and "/" percent-encoded,
// with "#anchor" when the anchor is not empty.
std::string kgFileUrl(const std::string& path, const std::string& anchor);

// The program and arguments that run the user's command with the URL as its last argument:
// the command is shell text (it may hold options), the URL is passed apart from it, never
// re-read by the shell.
std::vector<std::string> kgHelpCommandArgv(const std::string& command, const std::string& url);

// The dialog text when the command could not be run or failed: `status` is the command's
// wait status, or -1 with `error` the errno of a failed start. Empty when the status says
// that the command succeeded.
std::string kgHelpFailureText(const std::string& command, const std::string& page, int status, int error = 0);
// The dialog text when the page is not there to be shown.
std::string kgHelpPageMissingText(const std::string& page);

// `text` with each "%s" replaced by the next of `args` in order (a text from the user's
// resources is never given to printf).
std::string kgFillIn(const std::string& text, const std::vector<std::string>& args);
