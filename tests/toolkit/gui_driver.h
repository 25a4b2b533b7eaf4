// Drives a GUI program as a user would: starts it on a private X server, sends keys and clicks
// with xdotool, reads what it shows through its test hook, and takes screenshots.
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "tests/common/test_support.h"

namespace kgtest {

// One widget as the test hook wrote it.
struct WidgetInfo {
  std::string path;
  std::map<std::string, std::string> fields;  // class, managed, viewable, label, lines, top, ...
  std::vector<std::string> lines;             // text lines, for texts
  int x = 0, y = 0, width = 0, height = 0;    // on the screen
  bool flag(const std::string& name) const;
  int number(const std::string& name) const;
  std::string field(const std::string& name) const;
};

class GuiState {
 public:
  void parse(const std::string& text);
  // The widget whose path ends with ".<name>" (or is <name>); null when there is none.
  const WidgetInfo* find(const std::string& name) const;
  // Every widget so named, in the order of the windows (a second window of a kind comes later).
  std::vector<const WidgetInfo*> findAll(const std::string& name) const;
  bool viewable(const std::string& name) const;
  const std::string& raw() const { return raw_; }

 private:
  std::vector<WidgetInfo> widgets_;
  std::string raw_;
};

struct Screenshot {
  int width = 0, height = 0;
  std::vector<uint8_t> rgb;
  bool ok() const { return width > 0; }
  // 0xRRGGBB
  uint32_t at(int x, int y) const;
};

// The environment setting that makes the sanitizer build ignore the X libraries' own caches.
// Writes a one-function program to `source` (older than its data, so no "modified since
// compiled" question comes) and gives the kgv-make description of a run of it.
std::string writeOneFunctionProgram(const std::string& source);
std::string x11LeakSuppressions();

class GuiApp {
 public:
  GuiApp(const XvfbServer& server, const std::vector<std::string>& argv, const std::vector<std::string>& env = {});
  ~GuiApp();
  GuiApp(const GuiApp&) = delete;
  GuiApp& operator=(const GuiApp&) = delete;

  bool running();
  // Asks the program to end (SIGTERM) and waits; its exit status, -1 when it did not end.
  int stop();
  // Waits for the program to end; its exit status (128 + signal when killed), -1 on time-out.
  int waitExit(int timeoutMs);
  std::string errorOutput() const;

  // Asks the program for its state and waits for the answer (empty state after 3 s).
  GuiState state();
  // Asks repeatedly until `ok` holds; false after `timeoutMs`. The last state is kept in `last`.
  bool waitFor(const std::function<bool(const GuiState&)>& ok, GuiState* last = nullptr, int timeoutMs = 5000);
  bool waitViewable(const std::string& name, GuiState* last = nullptr);

  void xdotool(const std::vector<std::string>& args);
  void moveTo(int x, int y);
  void click(int x, int y, int button = 1);
  void key(const std::string& keys);
  Screenshot screenshot();

 private:
  std::string display_;
  TempDir dir_;
  pid_t pid_ = -1;
  int status_ = -1;
  int lastX_ = -1, lastY_ = -1;
};

}  // namespace kgtest
