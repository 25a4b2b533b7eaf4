// The scripts dialog, running a script over the data shown, and the output windows.
#include "updates/kg_scripts.h"

#include <cstdio>

#include "settings/resource_table.h"
#include "summary/kg_outline_text.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "support/atomic_write.h"
#include "support/message_sink.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_scroll_text.h"
#include "toolkit/oi_window.h"
#include "updates/script_run.h"

namespace {

// Emacs-like keys in the argument field, as in the source window's search field.
const char* const kArgumentKeys =
    "Ctrl<Key>K:  delete-to-end-of-line() \n"
    "Ctrl<Key>D:  delete-next-character() \n"
    "Ctrl<Key>A:  beginning-of-line() \n"
    "Ctrl<Key>E:  end-of-line() \n"
    "<Key>Up:     beginning-of-line() \n"
    "<Key>Down:   end-of-line() \n";

// The output window's icon: a terminal page with a prompt and lines of output, 50 x 50.
const unsigned char* scriptLogoBits() {
  static unsigned char bits[7 * 50] = {};
  static const bool made = [] {
    auto set = [](int x, int y) { bits[y * 7 + x / 8] |= static_cast<unsigned char>(1u << (x % 8)); };
    for (int x = 3; x < 47; ++x) set(x, 4), set(x, 45), set(x, 9);
    for (int y = 4; y < 46; ++y) set(3, y), set(46, y);
    for (int i = 0; i < 4; ++i) set(7 + i, 13 + i), set(7 + i, 19 - i);  // ">"
    for (int x = 14; x < 30; ++x) set(x, 16);
    for (int y = 23; y < 42; y += 4)
      for (int x = 7; x < 12 + (y * 11) % 30; ++x) set(x, y);
    return true;
  }();
  (void)made;
  return bits;
}

}  // namespace

// ---- the output window

KG_FileViewer::KG_FileViewer(const std::string& title, const std::string& text) : contents_(text) {
  window_ = std::make_unique<OI_TopLevel>("kgScriptOutput", "Kestrelgauge: Script Output");
  window_->setIcon(scriptLogoBits(), 50, 50);
  window_->setIconName(title);
  window_->onClose = [this] {
    if (onClose) onClose(*this);
  };
  OI_Menu* file = window_->menuBar("kgTopMenu")->addPulldown("kgFilePulldown", "File", "kgFile");
  file->addCell("kgSaveScriptOutput", "Save as...", [this] { saveAs(); });
  file->addSeparator();
  file->addCell("kgClose", "Close", [this] {
    if (onClose) onClose(*this);
  });
  auto* scroll = window_->own(std::make_unique<OI_ScrollText>(window_->mainWindow(), "kgScriptOutput"));
  window_->setWorkArea(scroll->widget());
  text_ = scroll->text();
  text_->setRows(24);
  text_->setColumns(80);
  size_t start = 0;
  while (start < text.size()) {
    size_t nl = text.find('\n', start);
    if (nl == std::string::npos) nl = text.size();
    text_->appendLine(text.substr(start, nl - start));
    start = nl + 1;
  }
  window_->setTitle(title);
  KG_Settings& s = kgSettings();
  window_->setMinSize(s.scriptOutputWindowMinWidth.value, s.scriptOutputWindowMinHeight.value);
}

KG_FileViewer::~KG_FileViewer() = default;

void KG_FileViewer::show() { window_->show(); }

void KG_FileViewer::saveAs() {
  for (;;) {
    std::string path;
    if (!oiAskFileName(window_->widget(), "kgFileDialog", "Kestrelgauge", kgSettings().saveScriptOutputPrompt.c_str(),
                       "", path) ||
        path.empty())
      return;
    AtomicFileWriter out;
    if (out.open(writeTargetFor(path)) != allOK) continue;  // another name, then
    if (fwrite(contents_.data(), 1, contents_.size(), out.stream()) != contents_.size() || out.commit() != allOK) {
      out.abandon();
      show_error(errorOccured,
                 kgMessageText("noWriteOutputFile", "Can't write output to file, perhaps\n the filesystem is full."),
                 window_->widget());
    }
    return;
  }
}

// ---- the dialog

KG_ScriptDialogBox::KG_ScriptDialogBox(Widget parent, const std::vector<std::string>& scripts)
    : dialog_(std::make_unique<OI_CustomDialog>(parent, "kgRunScript", "Run script")) {
  OI_CustomDialog& d = *dialog_;
  auto* frame = d.own(std::make_unique<OI_Frame>(d.workArea(), "kgRunScript"));
  auto* row = d.own(std::make_unique<OI_Box>(frame->widget(), "kgRunScriptRow", OI_Box::horizontal));
  d.own(std::make_unique<OI_Label>(row->widget(), "kgRunScriptLabel", "kestrel -export |"));
  menu_ = d.own(std::make_unique<OI_OptionMenu>(row->widget(), "kgScriptMenu", ""));
  for (const std::string& s : scripts) menu_->addChoice(s, s);
  menu_->setColumnLength(25);
  if (!scripts.empty()) menu_->setChoice(scripts.front());
  args_ = d.own(std::make_unique<OI_EntryField>(row->widget(), "kgScriptArgs", 50));
  args_->overrideTranslations(kArgumentKeys);
  args_->onActivate = [this](const std::string&) { dialog_->finish("OK"); };
  d.addButton({"OK", "OK"});
  d.addButton({"Cancel", "Cancel"});
}

KG_ScriptDialogBox::~KG_ScriptDialogBox() = default;

bool KG_ScriptDialogBox::run() { return dialog_->run() == "OK"; }

std::string KG_ScriptDialogBox::script() const { return menu_->choice(); }

std::string KG_ScriptDialogBox::arguments() const { return args_->text(); }

// ---- the runner

KG_Scripts::KG_Scripts() = default;

KG_Scripts::~KG_Scripts() { closeAll(); }

ErrorCode KG_Scripts::build(KG_SumFrame& frame, std::string& error) {
  frame_ = &frame;
  scriptsDir_ = frame.install_dir() + "/scripts";
  std::vector<std::string> names;
  bool overLimit = false;
  const ErrorCode rc = listScripts(scriptsDir_, names, overLimit);
  if (rc != allOK) {
    error = errorMessage(rc);
    return rc;
  }
  if (overLimit) {
    // Once the window is up: it is the dialog's parent.
    later_ = OI_Application::instance()->addTimeOut(0, [] {
      show_message(OI_Severity::warning,
                   "Some scripts were not added to the scripts menu because\nthere were more than the limit of " +
                       std::to_string(kScriptMenuLimit) + ".");
    });
  }
  dialog_ = std::make_unique<KG_ScriptDialogBox>(frame.shell(), names);
  return allOK;
}

void KG_Scripts::run() {
  KG_SummaryOverall* all = frame_ ? frame_->overall() : nullptr;
  if (!dialog_ || !all || !dialog_->run() || dialog_->script().empty()) return;
  ScriptOutput output;
  ErrorCode rc;
  {
    OI_Application::instance()->beginBusyPointer();
    ConsoleMessages console;
    rc = runScript(all->summary(), frame_->install_dir(), scriptsDir_ + "/" + dialog_->script(),
                   dialog_->arguments(), console, output);
    OI_Application::instance()->endBusyPointer();
  }
  if (output.shown) {
    viewers_.push_back(std::make_unique<KG_FileViewer>(output.title, output.text));
    viewers_.back()->onClose = [this](KG_FileViewer& v) { close(v); };
    viewers_.back()->show();
  }
  if (rc != allOK) show_error(rc, kgMessageText("requestScriptFailed", "Requested script failed"));
}

void KG_Scripts::close(KG_FileViewer& viewer) {
  for (auto it = viewers_.begin(); it != viewers_.end(); ++it) {
    if (it->get() != &viewer) continue;
    closed_.push_back(std::move(*it));
    viewers_.erase(it);
    break;
  }
  // The window may be in the middle of its own callback: it goes once that is over.
  later_ = OI_Application::instance()->addTimeOut(0, [this] { closed_.clear(); });
}

void KG_Scripts::closeAll() {
  later_.cancel();
  viewers_.clear();
  closed_.clear();
  dialog_.reset();
}
