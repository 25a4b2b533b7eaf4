// Writing the settings back: to a chosen file, through the update command into the per-user
// defaults file, as a dump, and the per-user file made from its template at exit.
#pragma once

#include <string>
#include <vector>

#include "support/errors.h"

// What an operation leaves for the GUI. On failure the error dialog shows
// errorDialogText(context, code): context is the user's text for messageName, or its default.
struct SettingsOutcome {
  ErrorCode code = allOK;
  std::string messageName;  // "noOverWriteFile", "noWriteFile", ...
  std::string context;
  std::string notice;  // for the main window's message area (nothing was attempted)
  std::vector<std::string> consoleWarnings;  // for standard error, one text each
};

// "Write view settings to...": the GUI-editable resources, replacing the file's contents.
// Failures: 19 (noOverWriteFile) when it cannot be created, 21 (noWriteFile) when writing fails;
// the pending system error names the file.
SettingsOutcome writeViewSettings(const std::string& path);

// "Dump all resources as..." and "Dump GUI-editable resources as...": error 3 on failure.
// The file prompts of the two menu entries:
extern const char* const kDumpAllResourcesPrompt;       // "File for all non-OI resources?"
extern const char* const kDumpEditableResourcesPrompt;  // "File for resources related to GUI controls?"
SettingsOutcome dumpResources(const std::string& path, bool includeAll);

// "Update ~/.kestrel.Xdefaults": writes the GUI-editable resources to a temporary file and
// runs the command of xdefaultsUpdateCommandString with the application class, the
// installation directory, the per-user defaults file and the temporary file. The command is
// found along PATH, then in the installation directory and its bin/. The GUI shows its busy
// indicator around the call.
SettingsOutcome updateUserDefaults(const std::string& installDir);
// The same with the per-user defaults file given (tests, other users' files).
SettingsOutcome updateUserDefaultsFile(const std::string& installDir, const std::string& userFile);

// At exit: when the per-user defaults file does not exist, makes it from the template
// "Kestrelgauge.Xdefaults" of the application defaults. Returns the text of the information
// dialog the GUI shows, or an empty text when nothing was created.
std::string createUserDefaultsFromTemplate(const std::string& installDir);
std::string createUserDefaultsFileFromTemplate(const std::string& installDir,
                                               const std::string& userFile);

// The command line the update runs (exposed for tests): "COMMAND Kestrelgauge 'DIR' 'FILE' 'NEW'",
// each path quoted for the shell.
std::string updateCommandLine(const std::string& command, const std::string& installDir,
                              const std::string& userFile, const std::string& newSettings);
