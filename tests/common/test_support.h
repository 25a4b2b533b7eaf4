// Helpers shared by the tests: scratch directories, files, and running real processes.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace kgtest {

// A fresh directory under the temporary directory, removed with everything in it.
class TempDir {
 public:
  TempDir();
  ~TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;
  const std::string& path() const { return path_; }
  std::string file(const std::string& name) const { return path_ + "/" + name; }

 private:
  std::string path_;
};

void writeFile(const std::string& path, const std::string& content);
std::string readFile(const std::string& path);
bool fileExists(const std::string& path);

struct ProcessResult {
  int status = -1;      // exit status, or 128 + signal when killed
  std::string out;      // standard output
  std::string err;      // standard error
};

// Runs argv[0] (a path) with the given arguments and environment changes ("NAME=value"
// sets, "NAME" alone unsets), optional standard input text and working directory.
ProcessResult runProcess(const std::vector<std::string>& argv,
                         const std::vector<std::string>& env = {}, const std::string& input = {},
                         const std::string& cwd = {});

// A process left running while the test acts on it (signals, files), its output gathered
// into files; the destructor kills it if it is still there.
class BackgroundProcess {
 public:
  BackgroundProcess(const std::vector<std::string>& argv, const std::vector<std::string>& env = {},
                    const std::string& cwd = {});
  ~BackgroundProcess();
  BackgroundProcess(const BackgroundProcess&) = delete;
  BackgroundProcess& operator=(const BackgroundProcess&) = delete;
  int pid() const { return pid_; }
  void signal(int sig) const;
  // Waits for the end; status as in ProcessResult.
  ProcessResult wait();
  // What it has written to standard error so far.
  std::string errorsSoFar() const;

 private:
  TempDir outputs_;
  int pid_ = -1;
};

// Polls until the condition holds or the seconds pass; the condition's last value.
bool waitUntil(double seconds, const std::function<bool()>& condition);

// A private X server on a free display, for tests that need one; never the user's display.
class XvfbServer {
 public:
  XvfbServer();   // starts Xvfb -displayfd; display() is empty when it could not start
  ~XvfbServer();  // stops it
  XvfbServer(const XvfbServer&) = delete;
  XvfbServer& operator=(const XvfbServer&) = delete;
  const std::string& display() const { return display_; }

 private:
  int pid_ = -1;
  std::string display_;
};

// Paths in the build tree.
std::string buildDir();
std::string sourceDir();
std::string binPath(const std::string& program);  // build/bin/<program>

}  // namespace kgtest
