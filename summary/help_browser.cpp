// The Help menus' topics opened in the user's browser.
#include "summary/help_browser.h"

#include <X11/StringDefs.h>
#include <X11/cursorfont.h>
#include <X11/keysym.h>
#include <Xm/RowColumn.h>
#include <Xm/Xm.h>
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <list>

#include "settings/resource_table.h"
#include "summary/sum_dialogs.h"
#include "support/runtime_options.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_menu.h"

namespace {

std::string gInstallDir;

// A browser command started and not yet ended.
struct Launch {
  pid_t pid = -1;
  std::string command;
  std::string page;
  long long started = 0;
  Widget parent = nullptr;  // null once the window is gone
};

// A command that ends badly this soon is taken to have failed to show the page; a browser that
// runs in the foreground and ends later is the user's business.
constexpr long long kReportMs = 30000;
constexpr unsigned long kPollMs = 100;
constexpr unsigned long kLatePollMs = 1000;

// Kept here rather than in the timers' closures, so that none is lost when the viewer ends first.
std::list<Launch>& launches() {
  static std::list<Launch> all;
  return all;
}

void parentGone(Widget, XtPointer client, XtPointer) { static_cast<Launch*>(client)->parent = nullptr; }

void finish(Launch* l) {
  if (l->parent) XtRemoveCallback(l->parent, XtNdestroyCallback, parentGone, l);
  launches().remove_if([l](const Launch& e) { return &e == l; });
}

void watch(Launch* l) {
  OI_Application* app = OI_Application::instance();
  if (!app) return;
  const bool early = oiNowMs() - l->started <= kReportMs;
  app->addTimeOut(early ? kPollMs : kLatePollMs, [l] {
    int status = 0;
    const pid_t r = waitpid(l->pid, &status, WNOHANG);
    if (r == 0) {
      watch(l);
      return;
    }
    if (r == l->pid && oiNowMs() - l->started <= kReportMs) {
      const std::string text = kgHelpFailureText(l->command, l->page, status);
      if (!text.empty()) show_message(OI_Severity::error, text, l->parent);
    }
    finish(l);
  });
}

// Starts the command; the child's pid, or -1 with errno set.
pid_t start(const std::vector<std::string>& argv) {
  std::vector<char*> args;
  for (const std::string& a : argv) args.push_back(const_cast<char*>(a.c_str()));
  args.push_back(nullptr);
  const pid_t pid = fork();
  if (pid == 0) {
    // Only async-signal-safe calls here: the viewer may have other threads.
    const int null = open("/dev/null", O_RDONLY);
    if (null >= 0 && null != 0) {
      dup2(null, 0);
      close(null);
    }
    // The display connection and the viewer's files stay the viewer's.
    close_range(3, ~0U, 0);
    execv(args[0], args.data());
    _exit(127);
  }
  return pid;
}

}  // namespace

void kgSetHelpInstallDir(const std::string& installDir) { gInstallDir = installDir; }

std::string kgHelpInstallDir() {
  if (!gInstallDir.empty()) return gInstallDir;
  const char* home = getStringOption(KESTREL_HOME);
  return home ? home : "";
}

void kgShowHelpTopic(const std::string& anchor, Widget parent) {
  const std::string page = kgHelpPagePath(kgHelpInstallDir());
  if (access(page.c_str(), R_OK) != 0) {
    show_message(OI_Severity::error, kgHelpPageMissingText(page), parent);
    return;
  }
  const std::string command = kgSettings().helpBrowserCommand.value;
  if (command.find_first_not_of(" \t") == std::string::npos) {
    // No command at all: as if the shell had found none.
    show_message(OI_Severity::error, kgHelpFailureText(command, page, 127 << 8), parent);
    return;
  }
  const pid_t pid = start(kgHelpCommandArgv(command, kgFileUrl(page, anchor)));
  if (pid < 0) {
    show_message(OI_Severity::error, kgHelpFailureText(command, page, -1, errno), parent);
    return;
  }
  Launch* l = &launches().emplace_back(Launch{pid, command, page, oiNowMs(), parent});
  if (parent) XtAddCallback(parent, XtNdestroyCallback, parentGone, l);
  watch(l);
}

void kgAddHelpTopics(OI_Menu* help, const std::vector<KG_HelpTopic>& topics, std::function<Widget()> parent) {
  for (const KG_HelpTopic& t : topics) {
    const std::string anchor = t.anchor;
    help->addCell(t.name, t.label, [anchor, parent] { kgShowHelpTopic(anchor, parent ? parent() : nullptr); });
  }
}

namespace {

// The parts of a window that stop taking input while it is in help mode, and their
// sensitivity before.
struct SavedSensitivity {
  std::vector<std::pair<Widget, bool>> parts;

  // Every part below `w` but the menu bar, whose menus cannot open during the mode anyway,
  // and the source window's search bar, which stays selectable.
  void desensitize(Widget w) {
    if (!XtIsComposite(w)) return;
    WidgetList children = nullptr;
    Cardinal n = 0;
    XtVaGetValues(w, XmNchildren, &children, XmNnumChildren, &n, nullptr);
    const std::vector<Widget> kids(children, children + n);
    for (Widget c : kids) {
      if (XtIsShell(c) || !XtIsManaged(c) || strcmp(XtName(c), "kgDetailSearch") == 0) continue;
      if (XmIsRowColumn(c)) {
        unsigned char type = 0;
        XtVaGetValues(c, XmNrowColumnType, &type, nullptr);
        if (type == XmMENU_BAR) continue;
      }
      if (XtNameToWidget(c, "*kgDetailSearch")) {
        desensitize(c);  // the search bar is inside: only its neighbours go
        continue;
      }
      parts.emplace_back(c, XtIsSensitive(c) != False);
      XtSetSensitive(c, False);
    }
  }
  void restore() {
    for (auto it = parts.rbegin(); it != parts.rend(); ++it) XtSetSensitive(it->first, it->second);
    parts.clear();
  }
};

bool gInHelpMode = false;

void runContextHelp(Widget shell, const std::vector<KG_ContextTopic>& topics, const std::string& fallback) {
  if (gInHelpMode || !shell || !XtIsRealized(shell)) return;
  gInHelpMode = true;
  Display* d = XtDisplay(shell);
  SavedSensitivity saved;
  WidgetList children = nullptr;
  Cardinal n = 0;
  XtVaGetValues(shell, XmNchildren, &children, XmNnumChildren, &n, nullptr);
  for (Cardinal i = 0; i < n; ++i) saved.desensitize(children[i]);
  const Cursor help = XCreateFontCursor(d, XC_question_arrow);
  XEvent ev{};
  Widget hit = XmTrackingEvent(shell, help, False, &ev);
  XFreeCursor(d, help);
  saved.restore();
  gInHelpMode = false;
  // A key leaves the mode without help, as does a click outside the window.
  if (!hit || ev.type != ButtonRelease) return;
  std::vector<std::string> names;
  for (Widget w = hit; w && w != shell; w = XtParent(w)) names.emplace_back(XtName(w));
  bool inside = false;
  for (Widget w = hit; w; w = XtParent(w)) inside = inside || w == shell;
  if (!inside) return;
  kgShowHelpTopic(kgContextAnchor(topics, names, fallback), shell);
}

}  // namespace

void kgAddContextHelp(OI_Menu* help, const std::vector<KG_ContextTopic>& topics, const std::string& fallback,
                      std::function<Widget()> window) {
  help->addCell("kgHelpOnWindow", "On window", [topics, fallback, window] {
    // After the menu has let the pointer go.
    if (OI_Application* app = OI_Application::instance())
      app->addTimeOut(50, [topics, fallback, window] { runContextHelp(window ? window() : nullptr, topics, fallback); });
  });
}
