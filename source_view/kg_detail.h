// The annotated source window: one source file beside its line numbers, adjustment letters and
// counts, coloured by coverage; edits of adjustments, saving, snapshots; and the windows' keeper
// that the main window opens them through.
#pragma once

#include <X11/Intrinsic.h>

#include <cstdint>
#include <functional>
#include <list>
#include <memory>
#include <string>

#include "source_view/kg_detail_model.h"
#include "summary/source_windows.h"
#include "toolkit/oi_application.h"

class KG_AdjustmentsPane;
class KG_SummaryFile;
class OI_Button;
class OI_Widget;
class OI_Cursor;
class OI_EntryField;
class KG_LineNumbers;
class KG_OutlineRoot;
class KG_SrcPane;
class OI_GridBox;
class OI_Label;
class OI_MenuCell;
class OI_TopLevel;
class QR_OI_ScrollTextGang;

class KG_FileDetail {
 public:
  enum ConfirmMode { confirmExit = 1, confirmClose = 2, confirmUpdate = 3 };

  KG_FileDetail(bool snapshot, KG_OutlineRoot* outline);
  ~KG_FileDetail();
  KG_FileDetail(const KG_FileDetail&) = delete;
  KG_FileDetail& operator=(const KG_FileDetail&) = delete;

  // Builds the window (not yet shown); on failure the reason is in `error`.
  ErrorCode create(std::string& error);
  // Shows the file of the summary at the line (0: line 1). 2 when the user kept unsaved edits
  // of another file; the open error otherwise.
  ErrorCode load(SumFile& file, std::uint32_t line);
  void show();

  // The View menu's items, by name ("kgHighlightUsedLines", "kgAdjustedAnnotations", ...).
  void toggleView(const std::string& item, bool on);
  // Sets the adjustment of lines first..last (1-based) and then goes to the line after them.
  void editAdjustments(CvgAdjust kind, std::uint32_t first, std::uint32_t last);
  // "Save": true when the source was written.
  bool saveSource();
  // "Save source and annotations as...".
  void writeAnnotatedSource();
  // Unsaved edits asked about in the mode; true to go on.
  bool confirmModified(ConfirmMode mode);
  // "Snapshot": a read-only copy in a window of its own.
  void snapshot();

  // The current line made visible (the window scrolls only when it was out of view).
  void goToLine(std::uint32_t line);
  // 1 "above", 2 "middle", 3 "below": the current line when it is in view, else a line of the view.
  std::uint32_t referenceLine(int mode) const;
  // A message in the window's message line, with a short bell unless told otherwise.
  void message(const std::string& text, bool bell = true);

  // The keys of the panes ("page_down", "set_adjusts" with "deadcode", ...), the buttons and
  // fields of the search bar.
  void action(const std::string& name, const std::string& argument);
  void nextUnused();
  void previousUnused();
  void goToTypedLine(const std::string& text);
  void find(const std::string& text);
  // The selected lines of the source pane, or the current line when it is in view.
  void setAdjustments(const std::string& kindWord);

  // For benchmarks (KG_TIMINGS): the time from `start` until what changed is drawn.
  void recordTiming(const std::string& what, double start);

  const KG_DetailModel& model() const { return *model_; }
  bool isSnapshot() const { return model_->isSnapshot(); }
  OI_TopLevel* window() const { return window_.get(); }
  Widget shell() const;

  // Set by the keeper: the window asks to be closed (Close, the window manager) or to exit.
  std::function<void(KG_FileDetail&)> onClose;
  std::function<void()> onExit;
  std::function<std::string()> versionText;

 private:
  void buildMenus();
  void buildPanes();
  void buildSearchBar();
  void applyView(bool recount);
  void refreshTitle();
  void refreshAllLines();
  void setModified(bool on);
  void actionWithoutTiming(const std::string& name, const std::string& argument);
  void beginBusy(const char* text);
  void endBusy();
  bool pressInAdjustments(XEvent* ev);
  bool pressInPane(XEvent* ev, OI_Widget& pane);
  void editLine(CvgAdjust kind, std::uint32_t index);
  // The summary's row of the file shown, made when needed; null without an outline.
  KG_SummaryFile* fileRow() const;

  std::unique_ptr<KG_DetailModel> model_;
  KG_OutlineRoot* outline_;  // the main window's outline, for the rows of the file's functions
  std::unique_ptr<OI_TopLevel> window_;
  OI_GridBox* workArea_ = nullptr;
  OI_GridBox* searchBar_ = nullptr;
  QR_OI_ScrollTextGang* gang_ = nullptr;
  KG_SrcPane* source_ = nullptr;
  KG_SrcPane* counts_ = nullptr;
  KG_LineNumbers* lineNumbers_ = nullptr;
  KG_AdjustmentsPane* adjust_ = nullptr;
  OI_Label* busy_ = nullptr;
  OI_Label* message_ = nullptr;
  OI_MenuCell* save_ = nullptr;
  struct SearchBar {
    OI_Button* next = nullptr;
    OI_Button* previous = nullptr;
    OI_EntryField* gotoLine = nullptr;
    OI_EntryField* find = nullptr;
  } search_;
  std::unique_ptr<OI_Cursor> editCursor_;
  bool settingMenus_ = false;
};

// Keeps the one current window, the snapshots and the closed windows that wait to be destroyed.
class KG_DetailWindows : public KG_SourceWindows {
 public:
  KG_DetailWindows();
  ~KG_DetailWindows() override;

  void attachOutline(KG_OutlineRoot* outline) override { outline_ = outline; }

  void open(SumFile& file, std::uint32_t line) override;
  void summaryReplaced(SumRoot& summary) override;
  std::string shownPath() const override;
  bool confirmExit() override;
  void closeAll() override;

  KG_FileDetail* current() const { return current_; }
  // Close: the current window asks about unsaved edits first; then the window is hidden and
  // destroyed once the event that closed it is over.
  void close(KG_FileDetail& window);
  // Snapshots are made by the windows and kept here.
  KG_FileDetail* adoptSnapshot(std::unique_ptr<KG_FileDetail> window);
  // The keeper of the process (the program sets it up); null before.
  static KG_DetailWindows* instance();

 private:
  void destroyClosed();
  std::unique_ptr<KG_FileDetail> makeWindow(bool snapshot, std::string& error);

  KG_OutlineRoot* outline_ = nullptr;
  KG_FileDetail* current_ = nullptr;
  std::list<std::unique_ptr<KG_FileDetail>> open_;
  std::list<std::unique_ptr<KG_FileDetail>> closed_;
  OI_TimerHandle destroyJob_;
};
