// Drives a GUI program through xdotool, its test hook and screenshots.
#include "tests/toolkit/gui_driver.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cctype>
#include <chrono>
#include <cstdlib>
#include <ctime>
#include <sstream>
#include <thread>

namespace kgtest {

namespace {
void sleepMs(int ms) { std::this_thread::sleep_for(std::chrono::milliseconds(ms)); }
}  // namespace

std::string writeOneFunctionProgram(const std::string& source) {
  writeFile(source, "int helper(int x) {\n  return x * 2;\n}\n");
  struct timeval old[2] = {{time(nullptr) - 60, 0}, {time(nullptr) - 60, 0}};
  utimes(source.c_str(), old);
  return "record " + source + " build=" + std::to_string(time(nullptr)) +
         "\nfunction helper line=1 calls=1\nblock 2 hits=3\n";
}

std::string x11LeakSuppressions() {
  return "LSAN_OPTIONS=suppressions=" + sourceDir() + "/tests/lsan_x11.supp:print_suppressions=0";
}

bool WidgetInfo::flag(const std::string& name) const { return field(name) == "1"; }

int WidgetInfo::number(const std::string& name) const {
  std::string v = field(name);
  return v.empty() ? -1 : atoi(v.c_str());
}

std::string WidgetInfo::field(const std::string& name) const {
  auto it = fields.find(name);
  return it == fields.end() ? std::string() : it->second;
}

void GuiState::parse(const std::string& text) {
  raw_ = text;
  widgets_.clear();
  std::istringstream in(text);
  std::string line;
  while (std::getline(in, line)) {
    // Text lines, and the items of lists.
    if (line.rfind("  line ", 0) == 0 || line.rfind("  item: ", 0) == 0) {
      if (widgets_.empty()) continue;
      size_t colon = line.find(": ");
      widgets_.back().lines.push_back(colon == std::string::npos ? "" : line.substr(colon + 2));
      continue;
    }
    if (line.empty() || line[0] == ' ' || line.rfind("focus ", 0) == 0 || line == "end" || line.find(' ') == std::string::npos)
      continue;
    WidgetInfo w;
    w.path = line.substr(0, line.find(' '));
    size_t i = w.path.size();
    while (i < line.size()) {
      while (i < line.size() && line[i] == ' ') ++i;
      size_t eq = line.find('=', i);
      if (eq == std::string::npos) break;
      std::string key = line.substr(i, eq - i);
      std::string value;
      size_t j = eq + 1;
      if (j < line.size() && line[j] == '"') {
        size_t close = line.find('"', j + 1);
        // Labels may hold quotes: the value runs to the last quote before the next " key=".
        size_t next = line.find("\" ", j + 1);
        if (next != std::string::npos && line.find('=', next) != std::string::npos) close = next;
        else close = line.rfind('"');
        value = line.substr(j + 1, close - j - 1);
        i = close + 1;
      } else {
        size_t sp = line.find(' ', j);
        value = line.substr(j, sp == std::string::npos ? std::string::npos : sp - j);
        i = sp == std::string::npos ? line.size() : sp;
      }
      w.fields[key] = value;
    }
    std::string g = w.field("geom");
    if (!g.empty()) sscanf(g.c_str(), "%d,%d,%dx%d", &w.x, &w.y, &w.width, &w.height);
    widgets_.push_back(std::move(w));
  }
}

const WidgetInfo* GuiState::find(const std::string& name) const {
  std::vector<const WidgetInfo*> all = findAll(name);
  return all.empty() ? nullptr : all.front();
}

std::vector<const WidgetInfo*> GuiState::findAll(const std::string& name) const {
  std::vector<const WidgetInfo*> out;
  for (const auto& w : widgets_) {
    if (w.path == name ||
        (w.path.size() > name.size() && w.path.compare(w.path.size() - name.size(), name.size(), name) == 0 &&
         w.path[w.path.size() - name.size() - 1] == '.'))
      out.push_back(&w);
  }
  return out;
}

bool GuiState::viewable(const std::string& name) const {
  const WidgetInfo* w = find(name);
  return w && w->flag("viewable");
}

uint32_t Screenshot::at(int x, int y) const {
  if (x < 0 || y < 0 || x >= width || y >= height) return 0xFFFFFFFF;
  size_t i = (static_cast<size_t>(y) * static_cast<size_t>(width) + static_cast<size_t>(x)) * 3;
  return (uint32_t(rgb[i]) << 16) | (uint32_t(rgb[i + 1]) << 8) | rgb[i + 2];
}

GuiApp::GuiApp(const XvfbServer& server, const std::vector<std::string>& argv, const std::vector<std::string>& env)
    : display_(server.display()) {
  std::string hook = dir_.file("state");
  std::string err = dir_.file("stderr");
  pid_ = fork();
  if (pid_ == 0) {
    int fd = open(err.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
    if (fd >= 0) {
      dup2(fd, 1);
      dup2(fd, 2);
    }
    setenv("DISPLAY", display_.c_str(), 1);
    setenv("KG_TEST_HOOK", hook.c_str(), 1);
    std::string lsan = x11LeakSuppressions();
    setenv("LSAN_OPTIONS", lsan.substr(lsan.find('=') + 1).c_str(), 1);
    for (const auto& e : env) {
      size_t eq = e.find('=');
      if (eq == std::string::npos) unsetenv(e.c_str());
      else setenv(e.substr(0, eq).c_str(), e.substr(eq + 1).c_str(), 1);
    }
    std::vector<char*> args;
    for (const auto& a : argv) args.push_back(const_cast<char*>(a.c_str()));
    args.push_back(nullptr);
    execv(args[0], args.data());
    _exit(127);
  }
  // The program writes a first state once it can take the signal that asks for more.
  for (int waited = 0; waited < 10000 && running() && !fileExists(hook); waited += 10) sleepMs(10);
}

GuiApp::~GuiApp() {
  if (running()) {
    kill(pid_, SIGTERM);
    if (waitExit(3000) == -1) {
      kill(pid_, SIGKILL);
      waitExit(3000);
    }
  }
}

int GuiApp::stop() {
  if (running()) kill(pid_, SIGTERM);
  return waitExit(5000);
}

bool GuiApp::running() {
  if (pid_ <= 0 || status_ != -1) return false;
  int st = 0;
  pid_t r = waitpid(pid_, &st, WNOHANG);
  if (r == pid_) {
    status_ = WIFEXITED(st) ? WEXITSTATUS(st) : 128 + WTERMSIG(st);
    return false;
  }
  return r == 0;
}

int GuiApp::waitExit(int timeoutMs) {
  for (int waited = 0; waited <= timeoutMs; waited += 20) {
    if (!running()) return status_;
    sleepMs(20);
  }
  return -1;
}

std::string GuiApp::errorOutput() const {
  try {
    return readFile(dir_.file("stderr"));
  } catch (...) {
    return {};
  }
}

GuiState GuiApp::state() {
  GuiState s;
  std::string hook = dir_.file("state");
  unlink(hook.c_str());
  if (!running()) return s;
  kill(pid_, SIGUSR1);
  for (int waited = 0; waited < 3000; waited += 10) {
    if (fileExists(hook)) {
      s.parse(readFile(hook));
      return s;
    }
    sleepMs(10);
  }
  return s;
}

bool GuiApp::waitFor(const std::function<bool(const GuiState&)>& ok, GuiState* last, int timeoutMs) {
  auto start = std::chrono::steady_clock::now();
  while (true) {
    GuiState s = state();
    bool good = ok(s);
    if (last) *last = s;
    if (good) return true;
    if (!running()) return false;
    if (std::chrono::steady_clock::now() - start > std::chrono::milliseconds(timeoutMs)) return false;
    sleepMs(30);
  }
}

bool GuiApp::waitViewable(const std::string& name, GuiState* last) {
  return waitFor([&](const GuiState& s) { return s.viewable(name); }, last);
}

void GuiApp::xdotool(const std::vector<std::string>& args) {
  std::vector<std::string> argv{"/usr/bin/xdotool"};
  argv.insert(argv.end(), args.begin(), args.end());
  runProcess(argv, {"DISPLAY=" + display_});
}

void GuiApp::moveTo(int x, int y) {
  // Moving to where the pointer already is can stall xdotool; nudge first.
  if (x == lastX_ && y == lastY_) return;
  xdotool({"mousemove", std::to_string(x), std::to_string(y)});
  lastX_ = x;
  lastY_ = y;
}

void GuiApp::click(int x, int y, int button) {
  moveTo(x, y);
  xdotool({"click", std::to_string(button)});
}

void GuiApp::key(const std::string& keys) { xdotool({"key", keys}); }

Screenshot GuiApp::screenshot() {
  Screenshot shot;
  ProcessResult r = runProcess({"/bin/sh", "-c", "xwd -root -display " + display_ + " | convert xwd:- ppm:-"});
  const std::string& p = r.out;
  // P6 <w> <h> <max>\n<data>, with "#" comment lines allowed between the fields.
  size_t pos = 0;
  auto field = [&]() -> std::string {
    while (pos < p.size()) {
      if (p[pos] == '#') {
        while (pos < p.size() && p[pos] != '\n') ++pos;
      } else if (isspace(static_cast<unsigned char>(p[pos]))) {
        ++pos;
      } else {
        break;
      }
    }
    size_t start = pos;
    while (pos < p.size() && !isspace(static_cast<unsigned char>(p[pos]))) ++pos;
    return p.substr(start, pos - start);
  };
  std::string magic = field();
  int w = atoi(field().c_str()), h = atoi(field().c_str()), maxv = atoi(field().c_str());
  if (magic != "P6" || w <= 0 || h <= 0 || maxv != 255) return shot;
  size_t offset = pos + 1;
  size_t need = static_cast<size_t>(w) * static_cast<size_t>(h) * 3;
  if (p.size() < offset + need) return shot;
  shot.width = w;
  shot.height = h;
  shot.rgb.assign(p.begin() + static_cast<long>(offset), p.begin() + static_cast<long>(offset + need));
  return shot;
}

}  // namespace kgtest
