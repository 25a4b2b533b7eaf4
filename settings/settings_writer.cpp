// Writing the settings back to files and through the update command.
#include "settings/settings_writer.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>

#include "settings/kg_resource.h"
#include "settings/resource_database.h"
#include "settings/resource_table.h"
#include "support/atomic_write.h"

namespace {

SettingsOutcome failure(ErrorCode code, const char* name, const char* def) {
  SettingsOutcome o;
  o.code = code;
  o.messageName = name;
  o.context = namedText(name, def);
  return o;
}

// The safe writer records its own context; the dialog names the file the user chose.
void renamePendingContext(const std::string& context) {
  std::string pending = pendingSystemError();
  size_t at = pending.find("System error code:");
  std::string tail = at == std::string::npos ? std::string() : pending.substr(at);
  if (tail.empty())
    recordSystemError(0, "%s", context.c_str());
  else
    recordSystemError(0, "%s\n%s", context.c_str(), tail.c_str());
}

// A user's settings file is often a link into a directory of dot files: write through it.
std::string throughLinks(const std::string& path) {
  struct stat st;
  if (lstat(path.c_str(), &st) != 0 || !S_ISLNK(st.st_mode)) return path;
  char resolved[PATH_MAX];
  return realpath(path.c_str(), resolved) ? std::string(resolved) : path;
}

// Writes resources through the safe writer; 19 when the file cannot be made, 21 when the
// writing fails, with the pending system error naming the path.
ErrorCode writeResourceFile(const std::string& path, bool includeAll) {
  std::string context = "File: " + path;
  struct stat st;
  if (stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode)) {
    recordSystemError(EISDIR, "%s", context.c_str());
    return writeError;
  }
  AtomicFileWriter w;
  if (w.open(throughLinks(path)) != allOK) {
    renamePendingContext(context);
    return writeError;
  }
  errno = 0;
  if (!writeAllResources(w.stream(), includeAll)) {
    int err = errno ? errno : EIO;
    w.abandon();
    recordSystemError(err, "%s", context.c_str());
    return fileWriteFailed;
  }
  if (w.commit() != allOK) {
    renamePendingContext(context);
    return fileWriteFailed;
  }
  return allOK;
}

std::string shellQuoted(const std::string& s) {
  std::string out = "'";
  for (char c : s) {
    if (c == '\'')
      out += "'\\''";
    else
      out += c;
  }
  return out + "'";
}

bool executable(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode) && access(path.c_str(), X_OK) == 0;
}

// Finds the command's first word along the search path; the full path, or empty.
std::string findCommand(const std::string& word, const std::string& searchPath) {
  if (word.find('/') != std::string::npos) return executable(word) ? word : std::string();
  size_t start = 0;
  while (start <= searchPath.size()) {
    size_t colon = searchPath.find(':', start);
    if (colon == std::string::npos) colon = searchPath.size();
    std::string dir = searchPath.substr(start, colon - start);
    if (dir.empty()) dir = ".";
    std::string candidate = dir + "/" + word;
    if (executable(candidate)) return candidate;
    start = colon + 1;
  }
  return {};
}

// Creates "kgXdf" + a unique suffix in the temporary directory; up to five tries.
int createTempFile(std::string& name) {
  const char* dir = getenv("TMPDIR");
  std::string base = dir && *dir ? dir : P_tmpdir;
  std::random_device rd;
  int fd = -1;
  for (int attempt = 0; attempt < 5 && fd < 0; ++attempt) {
    char suffix[16];
    snprintf(suffix, sizeof suffix, "%06x", static_cast<unsigned>(rd()) & 0xffffff);
    name = base + "/kgXdf" + suffix;
    fd = open(name.c_str(), O_WRONLY | O_CREAT | O_EXCL, 0600);
    if (fd < 0 && errno != EEXIST) break;
  }
  return fd;
}

// Runs the line through the shell with every descriptor above 2 closed; the exit status,
// or -1 when the shell could not be started.
int runShell(const std::string& line, std::vector<std::string>& warnings) {
  struct rlimit rl;
  long limit = 2000;
  if (getrlimit(RLIMIT_NOFILE, &rl) == 0) {
    if (rl.rlim_cur == RLIM_INFINITY) {
      char buf[128];
      snprintf(buf, sizeof buf,
               "Soft limit of RLIMIT_NOFILE is set to RLIM_INFINITY. Using a value of %d \n", 2000);
      warnings.emplace_back(buf);
    } else {
      limit = static_cast<long>(rl.rlim_cur);
    }
  }
  fflush(nullptr);
  pid_t pid = fork();
  if (pid < 0) {
    recordSystemError(errno, "Command: %s", line.c_str());
    return -1;
  }
  if (pid == 0) {
    if (close_range(3, ~0U, 0) != 0)
      for (long fd = 3; fd < limit; ++fd) close(static_cast<int>(fd));
    execl("/bin/sh", "sh", "-c", line.c_str(), static_cast<char*>(nullptr));
    _exit(127);
  }
  int status = 0;
  while (waitpid(pid, &status, 0) < 0) {
    if (errno != EINTR) {
      recordSystemError(errno, "Command: %s", line.c_str());
      return -1;
    }
  }
  if (WIFEXITED(status)) return WEXITSTATUS(status);
  return 128 + (WIFSIGNALED(status) ? WTERMSIG(status) : 0);
}

const char* const kNoUpdate = "Unable to update your resource file";

}  // namespace

SettingsOutcome writeViewSettings(const std::string& path) {
  ErrorCode rc = writeResourceFile(path, false);
  if (rc == writeError) return failure(rc, "noOverWriteFile", "Unable to overwrite the file");
  if (rc != allOK) return failure(rc, "noWriteFile", "An error occurred while writing the file");
  return {};
}

const char* const kDumpAllResourcesPrompt = "File for all non-OI resources?";
const char* const kDumpEditableResourcesPrompt = "File for resources related to GUI controls?";

SettingsOutcome dumpResources(const std::string& path, bool includeAll) {
  if (writeResourceFile(path, includeAll) != allOK)
    return failure(errorOccured, "dumpResourcesFailed", "Operation failed");
  return {};
}

std::string updateCommandLine(const std::string& command, const std::string& installDir,
                              const std::string& userFile, const std::string& newSettings) {
  return command + " " + kResourceAppName + " " + shellQuoted(installDir) + " " +
         shellQuoted(userFile) + " " + shellQuoted(newSettings);
}

SettingsOutcome updateUserDefaults(const std::string& installDir) {
  return updateUserDefaultsFile(installDir, userDefaultsPath());
}

SettingsOutcome updateUserDefaultsFile(const std::string& installDir,
                                       const std::string& userFile) {
  KG_StrResource& cmd = kgSettings().xdefaultsUpdateCommandString;
  size_t first = cmd.value.find_first_not_of(" \t");
  if (first == std::string::npos) {
    SettingsOutcome o;
    o.notice = cmd.fullName + " is unset";
    return o;
  }

  std::string temp;
  int fd = createTempFile(temp);
  if (fd < 0) {
    recordSystemError(errno, "Temp file name: %s", temp.c_str());
    return failure(writeError, "noCreateTempFile", "Unable to create temporary file");
  }
  errno = 0;
  FILE* f = fdopen(fd, "w");
  bool written = f && writeAllResources(f, false);
  int err = errno ? errno : EIO;
  if (f) {
    if (fclose(f) != 0 && written) {
      written = false;
      err = errno;
    }
  } else {
    close(fd);
  }
  if (!written) {
    unlink(temp.c_str());
    recordSystemError(err, "File: %s", temp.c_str());
    return failure(fileWriteFailed, "noWriteFile", "An error occurred while writing the file");
  }

  // The first word is looked for along PATH, then in the installation.
  std::string command = cmd.value.substr(first);
  size_t wordEnd = command.find_first_of(" \t");
  std::string word = command.substr(0, wordEnd);
  const char* path = getenv("PATH");
  std::string searchPath = path && *path ? std::string(path) + ":" : std::string();
  searchPath += installDir + ":" + installDir + "/bin";
  std::string found = findCommand(word, searchPath);
  SettingsOutcome o;
  if (found.empty()) {
    char head[512];
    snprintf(head, sizeof head, "\n\nWarning: Command '%s' not found in PATH:\n\n", word.c_str());
    o.consoleWarnings.push_back(head + searchPath + "\n");
    recordSystemError(0, "Command: %s", word.c_str());
    o.code = cmdErrStatus;
  } else {
    // The shell runs the command that was found, even where PATH would not find it.
    std::string rest = wordEnd == std::string::npos ? std::string() : command.substr(wordEnd);
    std::string line = updateCommandLine(shellQuoted(found) + rest, installDir, userFile, temp);
    int status = runShell(line, o.consoleWarnings);
    if (status != 0) {
      if (status > 0) recordSystemError(0, "Command: %s\nExit status: %d", line.c_str(), status);
      o.code = cmdErrStatus;
    }
  }
  unlink(temp.c_str());
  if (o.code != allOK) {
    SettingsOutcome f2 = failure(o.code, "noUpdateResourceFile", kNoUpdate);
    f2.consoleWarnings = std::move(o.consoleWarnings);
    return f2;
  }
  return o;
}

std::string createUserDefaultsFromTemplate(const std::string& installDir) {
  return createUserDefaultsFileFromTemplate(installDir, userDefaultsPath());
}

std::string createUserDefaultsFileFromTemplate(const std::string& installDir,
                                               const std::string& userFile) {
  // Only a file that is not there is made: one the user cannot read is still theirs.
  FILE* existing = fopen(userFile.c_str(), "r");
  if (existing) {
    fclose(existing);
    return {};
  }
  struct stat st;
  if (errno != ENOENT || lstat(userFile.c_str(), &st) == 0) return {};

  std::string templ = appDefaultsDir(installDir) + "/" + kResourceAppName + ".Xdefaults";
  FILE* in = fopen(templ.c_str(), "r");
  if (!in) return {};
  AtomicFileWriter w;
  if (w.open(userFile) != allOK) {
    fclose(in);
    clearPendingSystemError();
    return {};
  }
  char block[1024];
  size_t n;
  bool ok = true;
  while (ok && (n = fread(block, 1, sizeof block, in)) > 0) ok = fwrite(block, 1, n, w.stream()) == n;
  ok = ok && !ferror(in);
  fclose(in);
  if (!ok) {
    w.abandon();
    return {};
  }
  if (w.commit() != allOK) {
    clearPendingSystemError();
    return {};
  }
  const std::string app = kResourceAppName;
  return "The file " + userFile + " has been created for you.\n" +
         "This file allows you to customize the look-and-feel of the " + app + " Viewer.\n\n" +
         "You may edit the X resource definitions in this file to change the setting\n" +
         "of many of the " + app + " Viewer's initial display options.  Any changed\n" +
         "options will apply the next time you run the " + app + " Viewer.\n\n" +
         "Please refer to the " + app + " User's Guide for more information.\n";
}
