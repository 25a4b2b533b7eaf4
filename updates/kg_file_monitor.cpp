// The idle check over the loaded data files and the update dialog.
#include "updates/kg_file_monitor.h"

#include <cstdarg>
#include <cstdio>

#include "settings/resource_table.h"
#include "summary/sum_frame.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_dialogs.h"
#include "updates/change_check.h"

namespace {

struct Choice {
  const char* name;
  const char* label;
  int request;
};

const Choice kChoices[] = {
    {"kgReloadChangedKgvs", "Reload changed .kgv files", KG_FileUpdateDialog::reloadChanged},
    {"kgReloadAutomatically", "Reload now; automatically reload in the future", KG_FileUpdateDialog::reloadAlways},
    {"kgCheckKgvsLater", "Don't reload, but inform me of future changes", KG_FileUpdateDialog::informLater},
    {"kgDontCheckKgvs", "Don't reload and don't inform me of future changes", KG_FileUpdateDialog::stopChecking},
};

// A frame holding a banner over its contents.
Widget bannerFrame(Widget parent, const std::string& frameName, const std::string& bannerName,
                   const std::string& banner, OI_Widget& owner) {
  auto* frame = owner.own(std::make_unique<OI_Frame>(parent, frameName));
  auto* box = owner.own(std::make_unique<OI_Box>(frame->widget(), frameName + "Box", OI_Box::vertical));
  owner.own(std::make_unique<OI_Label>(box->widget(), bannerName, banner));
  return box->widget();
}

}  // namespace

// ---- the dialog

KG_FileUpdateDialog::KG_FileUpdateDialog(Widget parent)
    : dialog_(std::make_unique<OI_CustomDialog>(parent, "kgUpdatedFiles", "Some Kestrelgauge data changed")) {
  OI_CustomDialog& d = *dialog_;
  Widget files = bannerFrame(d.workArea(), "kgFilesUpdatedFrame", "kgFilesChangedBanner",
                             "Files which have changed since being loaded (and when):", d);
  list_ = d.own(std::make_unique<OI_ScrolledList>(files, "kgFilesChangedList", 7, 55));
  Widget options = bannerFrame(d.workArea(), "kgFileUpdateOptionsFrame", "kgFileUpdateOptionsBanner",
                               "Please choose one of these options:", d);
  options_ = d.own(std::make_unique<OI_OneOfMany>(options, "kgFileUpdateOptions"));
  for (const Choice& c : kChoices) options_->addChoice(c.name, c.label);
  options_->select(0);
  d.addButton({"kgOK", "OK"});
}

KG_FileUpdateDialog::~KG_FileUpdateDialog() = default;

int KG_FileUpdateDialog::run(const std::vector<KgvFileRef>& files) {
  if (request_ == stopChecking) return stopChecking;
  request_ = none;
  const std::vector<std::string> changed = changedFileLines(files);
  list_->setItems(changed);
  if (changed.empty()) return request_;
  if (automatic_) return request_ = reloadAlways;
  if (dialog_->run().empty()) return request_ = none;  // closed by the window manager
  const int chosen = options_->selected();
  if (chosen < 0) return request_ = none;
  request_ = kChoices[chosen].request;
  if (request_ == reloadAlways) automatic_ = true;
  return request_;
}

// ---- the watch

KG_FileMonitor::KG_FileMonitor() = default;

KG_FileMonitor::~KG_FileMonitor() { stop(); }

void KG_FileMonitor::start(KG_SumFrame& frame) {
  frame_ = &frame;
  timerOn();
}

void KG_FileMonitor::stop() {
  idle_.cancel();
  work_.cancel();
  on_ = false;
  dialog_.reset();
  frame_ = nullptr;
}

void KG_FileMonitor::trace(const char* fmt, ...) {
  if (!kgSettings().debugRevealIdlerActivity) return;
  const long long now = oiNowMs();
  if (traceStart_ < 0) traceStart_ = now;
  char text[1024];
  va_list ap;
  va_start(ap, fmt);
  vsnprintf(text, sizeof text, fmt, ap);
  va_end(ap);
  fprintf(stderr, "%s: timer(%lu): %s", idleTraceStamp(static_cast<std::uint64_t>(now - traceStart_) / 100).c_str(),
          traceLines_++, text);
  fflush(stderr);
}

void KG_FileMonitor::timerOn() {
  trace("Turning timer ON.\n");
  on_ = true;
  armIdle();
}

void KG_FileMonitor::timerOff() {
  trace("Turning timer OFF.\n");
  on_ = false;
  idle_.cancel();
  work_.cancel();
}

void KG_FileMonitor::armIdle() {
  OI_Application* app = OI_Application::instance();
  if (!app || !on_) return;
  const unsigned long ms = static_cast<unsigned long>(kgSettings().filePollPauseInterval.value) * 1000UL;
  idle_ = app->addIdleTimeOut(ms, [this] { idleFired(); });
}

// The user has been idle for the pause: the check runs once the event queue is empty.
void KG_FileMonitor::idleFired() {
  armIdle();
  if (checking_) return;  // a check is asking the user or reloading right now
  work_.cancel();
  work_ = OI_Application::instance()->addWorkProc([this] {
    check();
    return true;
  });
}

void KG_FileMonitor::check() {
  if (!frame_ || !on_) return;
  trace("OI says we are idle after enough time.  Perform idle actions?\n");
  const std::time_t now = std::time(nullptr);
  if (static_cast<unsigned long>(now - lastCheck_) < static_cast<unsigned long>(kgSettings().filePollRetryInterval.value)) {
    trace("==> No.  Insufficient delay since last success.\n");
    return;
  }
  OI_Application* app = OI_Application::instance();
  if (!app->anyWindowOpen()) {
    trace("==> No.  None of my windows are open.\n");
    return;
  }
  if (Widget busy = app->guiActionInProgress()) {
    trace("==> No.  A GUI action is in progress.\n");
    trace("    Found a busy child: %s\n", XtName(busy));
    trace("      (child of %s)\n", XtParent(busy) ? XtName(XtParent(busy)) : "(none)");
    return;
  }
  trace("==> Yes.  Performing idle actions.\n");
  lastCheck_ = now;
  KG_FileUpdateResource& option = kgSettings().coverageChangesOption;
  if (option.value == KG_FileUpdateResource::ignore) {
    timerOff();
    return;
  }
  checking_ = true;
  if (!dialog_) {
    trace("Need to create the update dialog\n");
    dialog_ = std::make_unique<KG_FileUpdateDialog>(frame_->shell());
  }
  trace("Running update dialog API\n");
  const int request = dialog_->run(frame_->loaded_files());
  trace("Request is %d\n", request);
  switch (request) {
    case KG_FileUpdateDialog::reloadChanged:
    case KG_FileUpdateDialog::reloadAlways:
      trace("Firing reload buttons\n");
      frame_->reload_all();
      option.setValue(request);
      break;
    case KG_FileUpdateDialog::informLater:
      trace("Resetting load times\n");
      resetLoadTimes(frame_->loaded_files(), static_cast<std::uint32_t>(std::time(nullptr)));
      break;
    case KG_FileUpdateDialog::stopChecking:
      option.setValue(KG_FileUpdateResource::ignore);
      checking_ = false;
      timerOff();
      return;
    default:
      break;
  }
  checking_ = false;
}
