// Running the installation's scripts over the coverage data: which scripts the menu offers,
// and one run with the export report on the script's standard input and everything it
// prints (through the installation's "kgmx" filter) collected.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "coverage/summary_types.h"
#include "support/errors.h"
#include "support/message_sink.h"

constexpr std::size_t kScriptMenuLimit = 250;
constexpr std::size_t kScriptArgumentLimit = 4095;

// The executable regular files of the directory, at most kScriptMenuLimit of them (in
// directory order), sorted by name. 23 when the directory cannot be opened, 24 when it holds
// none; the detail is recorded for the message either way. `overLimit`: reading stopped at
// the limit.
ErrorCode listScripts(const std::string& directory, std::vector<std::string>& names, bool& overLimit);

// The shell line of one run: the script's path quoted (an installation folder may hold
// blanks), its arguments as the user wrote them (shell text), standard output and error
// through the filter into the output file, the script's status kept in the status file.
std::string scriptShellLine(const std::string& scriptPath, const std::string& arguments,
                            const std::string& filterPath, const std::string& outputPath,
                            const std::string& statusPath);

// What one run left for the output window.
struct ScriptOutput {
  std::string text;   // everything the script printed
  std::string title;  // the script's file name, without the arguments
  bool shown = false; // whether there is output to show (the run got that far)
};

// Runs the script with the summary's export report on its standard input. 1; 33 when the
// script's status is not 0 and the report was written; the export's failure; 12 when the
// temporary files cannot be made; 31 when the shell cannot be started; 6 for arguments over
// kScriptArgumentLimit characters (with the detail recorded). Broken pipes are no failure.
ErrorCode runScript(const SumRoot& summary, const std::string& installDir, const std::string& scriptPath,
                    const std::string& arguments, MessageSink& messages, ScriptOutput& output);
