// The watch over the loaded data files: when the user has been idle for a while and is in
// the middle of nothing, files rewritten since they were loaded are reported in the update
// dialog, reloaded, or, as the user chose, no longer watched.
#pragma once

#include <X11/Intrinsic.h>

#include <cstdint>
#include <ctime>
#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_file_ref.h"
#include "summary/data_watcher.h"
#include "toolkit/oi_application.h"

class OI_CustomDialog;
class OI_OneOfMany;
class OI_ScrolledList;

// "Some Kestrelgauge data changed": the changed files and four choices.
class KG_FileUpdateDialog {
 public:
  enum Request { none = 1, reloadChanged = 2, reloadAlways = 3, informLater = 4, stopChecking = 5 };

  explicit KG_FileUpdateDialog(Widget parent);
  ~KG_FileUpdateDialog();
  KG_FileUpdateDialog(const KG_FileUpdateDialog&) = delete;
  KG_FileUpdateDialog& operator=(const KG_FileUpdateDialog&) = delete;

  // Lists the files changed since they were loaded and asks, unless there are none (1) or
  // reloading was made automatic (3).
  int run(const std::vector<KgvFileRef>& files);
  bool automatic() const { return automatic_; }

 private:
  std::unique_ptr<OI_CustomDialog> dialog_;
  OI_ScrolledList* list_ = nullptr;
  OI_OneOfMany* options_ = nullptr;
  int request_ = none;
  bool automatic_ = false;
};

class KG_SumFrame;

class KG_FileMonitor : public KG_DataWatcher {
 public:
  KG_FileMonitor();
  ~KG_FileMonitor() override;
  void start(KG_SumFrame& frame) override;
  void stop() override;

 private:
  void timerOn();
  void timerOff();
  void armIdle();
  void idleFired();
  void check();
  void trace(const char* fmt, ...) __attribute__((format(printf, 2, 3)));

  KG_SumFrame* frame_ = nullptr;
  OI_TimerHandle idle_;
  OI_TimerHandle work_;
  bool on_ = false;
  bool checking_ = false;
  std::time_t lastCheck_ = 0;
  std::unique_ptr<KG_FileUpdateDialog> dialog_;
  long long traceStart_ = -1;
  unsigned long traceLines_ = 0;
};
