// The scripts directory and one script run.
#include "updates/script_run.h"

#include <dirent.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <fstream>
#include <sstream>

#include "adjust/export_report.h"
#include "support/temp_file.h"

namespace {

// One word for the shell, whatever it holds.
std::string shellQuote(const std::string& s) {
  std::string out = "'";
  for (char c : s) {
    if (c == '\'') out += "'\\''";
    else out += c;
  }
  return out + "'";
}

// SIGPIPE ignored for as long as the report goes into the pipe: a script that stops reading
// makes the write fail instead of ending the viewer.
class BrokenPipesIgnored {
 public:
  BrokenPipesIgnored() {
    struct sigaction ignore {};
    ignore.sa_handler = SIG_IGN;
    sigemptyset(&ignore.sa_mask);
    sigaction(SIGPIPE, &ignore, &previous_);
  }
  ~BrokenPipesIgnored() { sigaction(SIGPIPE, &previous_, nullptr); }
  BrokenPipesIgnored(const BrokenPipesIgnored&) = delete;
  BrokenPipesIgnored& operator=(const BrokenPipesIgnored&) = delete;

 private:
  struct sigaction previous_ {};
};

}  // namespace

ErrorCode listScripts(const std::string& directory, std::vector<std::string>& names, bool& overLimit) {
  names.clear();
  overLimit = false;
  DIR* d = opendir(directory.c_str());
  if (!d) {
    recordSystemError(errno, "Directory %s can't be opened.\nYour Kestrelgauge installation is corrupted\n"
                      "or installed with incorrect permissions.", directory.c_str());
    return dirNotRead;
  }
  while (struct dirent* e = readdir(d)) {
    const std::string path = directory + "/" + e->d_name;
    struct stat st;
    if (stat(path.c_str(), &st) != 0 || !S_ISREG(st.st_mode) || access(path.c_str(), X_OK) != 0) continue;
    names.push_back(e->d_name);
    if (names.size() == kScriptMenuLimit) {
      overLimit = true;
      break;
    }
  }
  closedir(d);
  if (names.empty()) {
    recordSystemError(0, "Your Kestrelgauge installation is corrupted.\nThe scripts are missing from %s.",
                      directory.c_str());
    return dirEmpty;
  }
  std::sort(names.begin(), names.end());
  return allOK;
}

std::string scriptShellLine(const std::string& scriptPath, const std::string& arguments,
                            const std::string& filterPath, const std::string& outputPath,
                            const std::string& statusPath) {
  const std::string command = shellQuote(scriptPath) + (arguments.empty() ? "" : " " + arguments);
  const std::string status = shellQuote(statusPath);
  return "((" + command + "); echo $? > " + status + ") 2>&1 | " + shellQuote(filterPath) + " > " +
         shellQuote(outputPath) + "; exit `/bin/cat " + status + "; /bin/rm -f " + status + "`";
}

ErrorCode runScript(const SumRoot& summary, const std::string& installDir, const std::string& scriptPath,
                    const std::string& arguments, MessageSink& messages, ScriptOutput& output) {
  output = ScriptOutput{};
  if (arguments.size() > kScriptArgumentLimit) {
    recordSystemError(0, "The script's arguments are %zu characters long; the limit is %zu.", arguments.size(),
                      kScriptArgumentLimit);
    return argError;
  }
  TemporaryFile out, status;
  if (!out.create("kgShO") || !status.create("kgShS")) {
    recordSystemError(errno, "Temporary file name: %s", (out ? status : out).path().c_str());
    return outOfMemory;
  }
  const std::string line =
      scriptShellLine(scriptPath, arguments, installDir + "/bin/kgmx", out.path(), status.path());
  ErrorCode rc;
  int shellStatus = 0;
  {
    BrokenPipesIgnored ignored;
    fflush(nullptr);
    FILE* pipe = popen(line.c_str(), "w");
    if (!pipe) {
      recordSystemError(errno, "Starting: %s", line.c_str());
      return noSubshell;
    }
    rc = writeExport(pipe, summary, messages);
    shellStatus = pclose(pipe);
  }
  if (shellStatus == -1) {
    recordSystemError(errno, "Waiting for: %s", line.c_str());
    if (rc == allOK) rc = noSubshell;
  } else if (rc == allOK && (!WIFEXITED(shellStatus) || WEXITSTATUS(shellStatus) != 0)) {
    rc = cmdErrStatus;
  }
  std::ifstream in(out.path(), std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  output.text = text.str();
  // The script's file name, also when the installation's folder holds blanks.
  const std::size_t slash = scriptPath.find_last_of('/');
  output.title = slash == std::string::npos ? scriptPath : scriptPath.substr(slash + 1);
  output.shown = true;
  return rc;
}
