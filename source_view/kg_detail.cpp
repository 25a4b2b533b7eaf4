// The annotated source window and the keeper of its windows.
#include "source_view/kg_detail.h"

#include <X11/Xmu/CurUtil.h>
#include <Xm/Xm.h>

#include <malloc.h>

#include <algorithm>
#include <map>

#include "adjust/adjustments_file.h"
#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "outline/qr_oi_scroll_text.h"
#include "settings/resource_table.h"
#include "source_view/kg_navigation.h"
#include "source_view/kg_panes.h"
#include "summary/help_browser.h"
#include "summary/kg_outline_text.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_timing.h"
#include "support/message_sink.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_grid_box.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_scroll_bar.h"
#include "toolkit/oi_window.h"

namespace {

KG_DetailWindows* gKeeper = nullptr;

// The windows by the texts of their panes, for the key action.
std::map<Widget, KG_FileDetail*>& paneOwners() {
  static std::map<Widget, KG_FileDetail*> owners;
  return owners;
}

// The panes' keys. Everything not named here is swallowed, so typing never changes the text.
const char kDetailTranslations[] =
    "#override\n"
    "<Key>R15: kg_detail_action(page_down)\n"
    "<Key>R9: kg_detail_action(page_up)\n"
    "<Key>osfPageDown: kg_detail_action(page_down)\n"
    "<Key>osfPageUp: kg_detail_action(page_up)\n"
    "Ctrl<Key>d: kg_detail_action(page_down)\n"
    "Ctrl<Key>u: kg_detail_action(page_up)\n"
    "Ctrl<Key>f: kg_detail_action(page_down)\n"
    "Ctrl<Key>b: kg_detail_action(page_up)\n"
    "Ctrl<Key>v: kg_detail_action(page_down)\n"
    "Mod1<Key>v: kg_detail_action(page_up)\n"
    "Ctrl<Key>c: copy_clipboard()\n"
    "<Key>osfBeginLine: kg_detail_action(home)\n"
    "<Key>osfDown: kg_detail_action(line_down)\n"
    "<Key>osfUp: kg_detail_action(line_up)\n"
    "<Key>R14: kg_detail_action(line_down)\n"
    "<Key>R8: kg_detail_action(line_up)\n"
    "<Key>j: kg_detail_action(line_down)\n"
    "<Key>k: kg_detail_action(line_up)\n"
    "<Key>n: kg_detail_action(next_unused)\n"
    "<Key>p: kg_detail_action(prev_unused)\n"
    "<Key>d: kg_detail_action(set_adjusts, deadcode)\n"
    "<Key>i: kg_detail_action(set_adjusts, inspected)\n"
    "<Key>t: kg_detail_action(set_adjusts, tested)\n"
    "<Key>space: kg_detail_action(set_adjusts, none)\n"
    "<Key>osfDelete: kg_detail_action(set_adjusts, none)\n"
    "<Key>osfBackSpace: kg_detail_action(set_adjusts, none)\n"
    "<Key>:\t\tkg_detail_action(KEY_UNDEF)\n";

void detailAction(Widget w, XEvent*, String* params, Cardinal* count) {
  auto it = paneOwners().find(w);
  if (it == paneOwners().end() || count == nullptr || *count == 0) return;
  KG_FileDetail* window = it->second;
  const std::string name = params[0];
  const std::string argument = *count > 1 ? params[1] : "";
  oiGuard("kg_detail_action", [&] { window->action(name, argument); });
}

// The go-to field takes digits only.
void digitsOnly(Widget, XtPointer, XtPointer call) {
  auto* cb = static_cast<XmTextVerifyCallbackStruct*>(call);
  if (!cb->text || !cb->text->ptr) return;
  for (int i = 0; i < cb->text->length; ++i) {
    if (cb->text->ptr[i] < '0' || cb->text->ptr[i] > '9') {
      cb->doit = False;
      return;
    }
  }
}

// The questions of the source-file code asked with the viewer's dialogs over the window.
class WindowPrompter : public SourcePrompter {
 public:
  explicit WindowPrompter(Widget parent) : parent_(parent) {}
  bool askFileName(const std::string& prompt, std::string& name) override {
    return oiAskFileName(parent_ ? parent_ : kgDialogHome(), "kgFileDialog", "Kestrelgauge", prompt, "", name) &&
           !name.empty();
  }
  bool askContinue(const std::string& message) override { return ask_continue(message, parent_); }
  void showError(const std::string& context, ErrorCode code) override { show_error(code, context, parent_); }

 private:
  Widget parent_;
};

// The window's icon: a page of source with a count column, 50 x 50.
const unsigned char* detailLogoBits() {
  static unsigned char bits[7 * 50] = {};
  static const bool made = [] {
    auto set = [](int x, int y) { bits[y * 7 + x / 8] |= static_cast<unsigned char>(1u << (x % 8)); };
    for (int x = 4; x < 46; ++x) set(x, 2), set(x, 47);
    for (int y = 2; y < 48; ++y) set(4, y), set(45, y), set(14, y);
    for (int y = 7; y < 44; y += 4) {
      const int len = 8 + (y * 7) % 22;
      for (int x = 7; x < 12; ++x) set(x, y);
      for (int x = 17 + (y % 3) * 3; x < std::min(43, 17 + len); ++x) set(x, y);
    }
    return true;
  }();
  (void)made;
  return bits;
}

// Recounts the summary after the adjustment list changed and redraws the outline.
void recountSummary(KG_OutlineRoot* outline) {
  KG_SummaryOverall* all = outline ? outline->overall() : nullptr;
  if (!all) return;
  ConsoleMessages console;
  ErrorCode rc = recomputeSummary(all->summary(), all->summary().hitsPolicy, adjustmentList(), console);
  if (rc != allOK) show_error(rc, "Couldn't summarize information");
  all->refresh_subtree();
}

// The eight items of the View menu, by the resource-named cells.
const char* const kViewItems[][2] = {
    {"kgAdjustedAnnotations", "Show adjusted annotated source"},
    {"kgShowCounts", "Show line counts"},
    {"kgShowLineNumbers", "Show line numbers"},
    {nullptr, nullptr},
    {"kgHighlightUnusedLines", "Highlight unused lines"},
    {"kgHighlightUsedLines", "Highlight used lines"},
    {nullptr, nullptr},
    {"kgHighlightDeadcodeLines", "Highlight 'kestrel: deadcode' lines"},
    {"kgHighlightInspectedLines", "Highlight 'kestrel: inspected' lines"},
    {"kgHighlightTestedLines", "Highlight 'kestrel: tested' lines"},
};

}  // namespace

// ---- KG_FileDetail

KG_FileDetail::KG_FileDetail(bool snapshot, KG_OutlineRoot* outline)
    : model_(std::make_unique<KG_DetailModel>(snapshot)), outline_(outline) {}

KG_FileDetail::~KG_FileDetail() {
  std::erase_if(paneOwners(), [this](const auto& e) { return e.second == this; });
  // The panes draw from the model: they go first, with the window.
  window_.reset();
}

Widget KG_FileDetail::shell() const { return window_ ? window_->widget() : nullptr; }

ErrorCode KG_FileDetail::create(std::string& error) {
  if (OI_Application::instance() == nullptr) {
    error = "the display is not open";
    return displayNotOpened;
  }
  const KG_Settings& s = kgSettings();
  window_ = std::make_unique<OI_TopLevel>("kgAnnotatedSource", "Kestrelgauge: Annotated Source");
  window_->setIcon(detailLogoBits(), 50, 50);
  window_->onClose = [this] {
    if (onClose) onClose(*this);
  };
  buildMenus();
  workArea_ = window_->own(std::make_unique<OI_GridBox>(window_->mainWindow(), "kgDetailWorkArea"));
  window_->setWorkArea(workArea_->widget());
  gang_ = window_->own(std::make_unique<QR_OI_ScrollTextGang>(workArea_->widget(), "kgDetailGang"));
  workArea_->place(gang_->widget(), 0, 0, true, true);
  busy_ = window_->own(std::make_unique<OI_Label>(workArea_->widget(), "kgDetailBusy", "Performing requested operation."));
  workArea_->place(busy_->widget(), 0, 0, true, true);
  busy_->unmanage();
  buildPanes();
  buildSearchBar();
  message_ = window_->own(std::make_unique<OI_Label>(workArea_->widget(), "kgDetailMessage", " "));
  workArea_->place(message_->widget(), 0, 2, true, false);
  window_->setMinSize(std::clamp(s.annotatedSourceWindowMinWidth.value, 50, 15000),
                      std::clamp(s.annotatedSourceWindowMinHeight.value, 50, 15000));
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, adjust_, counts_, source_})
    p->initColors();
  window_->setFocusHome(source_->text());
  applyView(false);
  return allOK;
}

void KG_FileDetail::buildMenus() {
  OI_MenuBar* bar = window_->menuBar("kgTopMenu");
  OI_Menu* file = bar->addPulldown("kgFilePulldown", "File", "kgFile");
  save_ = file->addCell("kgWritePlainSource", "Save", [this] { saveSource(); });
  save_->setSensitive(false);
  file->addCell("kgWriteAnnotatedSource", "Save source and annotations as...", [this] { writeAnnotatedSource(); });
  file->addCell("kgSnapshot", "Snapshot", [this] { snapshot(); });
  file->addSeparator();
  file->addCell("kgClose", "Close", [this] {
    if (onClose) onClose(*this);
  });
  file->addCell("kgExitSubWindow", "Exit Kestrelgauge", [this] {
    if (onExit) onExit();
  });
  OI_Menu* view = bar->addPulldown("kgViewPulldown", "View", "kgView");
  for (const auto& item : kViewItems) {
    if (item[0] == nullptr) {
      view->addSeparator();
      continue;
    }
    const std::string name = item[0];
    view->addCheck(name, item[1], false, [this, name](bool on) {
      if (!settingMenus_) toggleView(name, on);
    });
  }
  OI_Menu* help = bar->addPulldown("kgHelpPulldown", "Help", "kgHelp");
  kgAddContextHelp(help, kgSourceWindowContextTopics(), "the-annotated-source-window", [this] { return shell(); });
  kgAddHelpTopics(help, kgSourceWindowHelpTopics(), [this] { return shell(); });
  help->addSeparator();
  help->addCell("kgProductInfo", "Product information", [this] {
    if (versionText) show_message(OI_Severity::information, versionText(), shell());
  });
  bar->setHelpPulldown(help);
}

void KG_FileDetail::buildPanes() {
  const KG_Settings& s = kgSettings();
  auto title = [this](int col, const std::string& text) {
    OI_Label* l = gang_->own(std::make_unique<OI_Label>(gang_->widget(), "kgTitlePane", text));
    l->setLabel(text);
    gang_->place(l->widget(), 3 * col + 1, 1, col == 3, false);
    return l;
  };
  Widget g = gang_->widget();
  source_ = static_cast<KG_SrcPane*>(gang_->addText(
      std::make_unique<KG_SrcPane>(g, "kgSource", *model_, title(3, s.annotatedSourcePaneTitle.value),
                                   KG_SrcPane::Shows::source),
      3, 1, true, true));
  counts_ = static_cast<KG_SrcPane*>(gang_->addText(
      std::make_unique<KG_SrcPane>(g, "kgCounts", *model_, title(2, s.hitCountsPaneTitle.value),
                                   KG_SrcPane::Shows::counts),
      2, 1, false, true));
  adjust_ = static_cast<KG_AdjustmentsPane*>(gang_->addText(
      std::make_unique<KG_AdjustmentsPane>(g, "kgAdjustPane", *model_, title(1, s.adjustmentEditPaneTitle.value)), 1,
      1, false, true));
  lineNumbers_ = static_cast<KG_LineNumbers*>(gang_->addText(
      std::make_unique<KG_LineNumbers>(g, "kgLineNumbers", *model_, title(0, s.lineNumberPaneTitle.value), *source_),
      0, 1, false, true));
  const std::pair<KG_AnnotationPane*, int> widths[] = {{lineNumbers_, 5}, {adjust_, 5}, {counts_, 4}, {source_, 90}};
  for (const auto& [pane, columns] : widths) {
    pane->text()->setRows(25);
    pane->text()->setColumns(columns);
    pane->text()->setLineSupplier(pane);
  }
  // One bar scrolls the four panes; only the source pane scrolls sideways.
  gang_->addSharedBar(OI_Side::right, 3, 1);
  adjust_->text()->onPress = [this](XEvent* ev) { return pressInAdjustments(ev); };
  // For the test hook: each line's colouring as a letter (u used, n unused, d dead code,
  // t tested, i inspected, - none), and the current line.
  for (KG_SrcPane* p : {source_, counts_}) {
    p->text()->describeMore = [this](std::ostream& out) {
      static const char letters[] = "-undti";
      out << " highlights=";
      for (std::uint32_t i = 0; i < model_->lineCount() && i < 10000; ++i)
        out << letters[static_cast<int>(model_->highlight(i))];
    };
  }
  lineNumbers_->text()->describeMore = [this](std::ostream& out) { out << " current=" << lineNumbers_->currentLine(); };
  adjust_->text()->describeMore = [this](std::ostream& out) {
    out << " dubious=";
    for (std::uint32_t i = 0; i < model_->lineStateCount() && i < 10000; ++i) out << (adjust_->markLine(i) ? 'x' : '-');
  };
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, counts_, source_})
    p->text()->onPress = [this, p](XEvent* ev) { return pressInPane(ev, *p); };
  OI_Application* app = OI_Application::instance();
  if (app->firstTime("kg_detail_action")) app->addAction("kg_detail_action", detailAction);
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, adjust_, counts_, source_}) {
    paneOwners()[p->text()->widget()] = this;
    p->text()->overrideTranslations(kDetailTranslations);
  }
}

void KG_FileDetail::buildSearchBar() {
  auto* bar = window_->own(std::make_unique<OI_GridBox>(workArea_->widget(), "kgDetailSearch"));
  searchBar_ = bar;
  workArea_->place(bar->widget(), 0, 1, true, false);
  auto* next = bar->own(std::make_unique<OI_Button>(bar->widget(), "kgNextUnused", "Next unused"));
  auto* prev = bar->own(std::make_unique<OI_Button>(bar->widget(), "kgPrevUnused", "Prev unused"));
  auto* gotoLabel = bar->own(std::make_unique<OI_Label>(bar->widget(), "kgGotoLabel", "Go to line #:"));
  auto* gotoField = bar->own(std::make_unique<OI_EntryField>(bar->widget(), "kgGoto", 8));
  auto* findLabel = bar->own(std::make_unique<OI_Label>(bar->widget(), "kgFindLabel", "Find:"));
  auto* findField = bar->own(std::make_unique<OI_EntryField>(bar->widget(), "kgFind", 40));
  int col = 0;
  for (OI_Widget* w : std::initializer_list<OI_Widget*>{next, prev, gotoLabel, gotoField, findLabel, findField})
    bar->place(w->widget(), col++, 0, w == findField, false);
  search_ = {next, prev, gotoField, findField};
  next->onActivate = [this] { nextUnused(); };
  prev->onActivate = [this] { previousUnused(); };
  gotoField->onActivate = [this](const std::string& text) { goToTypedLine(text); };
  findField->onActivate = [this](const std::string& text) { find(text); };
  XtAddCallback(gotoField->widget(), XmNmodifyVerifyCallback, digitsOnly, nullptr);
}

void KG_FileDetail::show() {
  if (!window_) return;
  if (!window_->isShown()) {
    // The first time: the window takes the size of its parts.
    gang_->fitToContents();
    searchBar_->fitToContents();
    workArea_->fitToContents();
  }
  window_->show();
  window_->raise();
  // The adjustments pane shows where clicks edit.
  Widget t = adjust_->text()->widget();
  if (t && XtIsRealized(t)) {
    const unsigned shape = XmuCursorNameToIndex(kgSettings().adjustEditCursor.value.c_str());
    if (shape != static_cast<unsigned>(-1)) {
      editCursor_ = std::make_unique<OI_Cursor>(XtDisplay(t), shape);
      XDefineCursor(XtDisplay(t), XtWindow(t), editCursor_->get());
    }
  }
}

void KG_FileDetail::recordTiming(const std::string& what, double start) {
  if (!kgTimingsWanted() || !shell()) return;
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, adjust_, counts_, source_})
    p->text()->redisplay();
  XSync(XtDisplay(shell()), False);
  kgRecordTiming(what, kgNowMs() - start);
}

void KG_FileDetail::beginBusy(const char* text) {
  if (text) busy_->setLabel(text);
  gang_->unmanage();
  busy_->manage();
  OI_Application::instance()->beginBusyPointer();
}

void KG_FileDetail::endBusy() {
  OI_Application::instance()->endBusyPointer();
  busy_->unmanage();
  gang_->manage();
}

ErrorCode KG_FileDetail::load(SumFile& file, std::uint32_t line) {
  const std::string dirName = file.dir ? file.dir->name : "";
  const bool newFile = !model_->shows(dirName, file.name);
  if (newFile && model_->modified() && !confirmModified(confirmUpdate)) return oprAborted;
  if (newFile) {
    WindowPrompter prompter(shell());
    const std::uint32_t buildTime = file.record ? file.record->objHeader.buildTime : 0;
    ErrorCode rc = model_->loadText(dirName + file.name, buildTime, prompter);
    if (rc != allOK) return rc;
    setModified(false);
  }
  beginBusy(kgSettings().loadingSourceBusyMsg.c_str());
  if (newFile) {
    // Markers in the text are what the adjustments of the file are.
    LoadedSourceAdjustments found = model_->rescanMarkers(dirName, file.name);
    if (!found.warnings.empty())
      noteList(kgSettings().compileAdjWindowErrorsPrompt.value, found.warnings, false, shell());
    message(adjustTotalsText(found.totals), false);
    if (found.listChanged) {
      writeAdjustmentsFile();
      recountSummary(outline_);
    }
  }
  KG_SummaryOverall* all = outline_ ? outline_->overall() : nullptr;
  model_->takeLineStates(file, all ? all->summary().hitsPolicy : getHitsPolicy());
  refreshTitle();
  source_->measure();
  counts_->measure();
  refreshAllLines();
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, adjust_, counts_, source_})
    p->text()->setLeftColumn(0);
  source_->text()->setTopLine(0);
  lineNumbers_->setCurrentLine(0);
  goToLine(line == 0 ? 1 : line);
  endBusy();
  return allOK;
}

void KG_FileDetail::refreshTitle() {
  window_->setTitle(model_->title());
  window_->setIconName(model_->sourcePath().empty() ? model_->fileName() : model_->sourcePath());
}

void KG_FileDetail::refreshAllLines() {
  for (KG_AnnotationPane* p : std::initializer_list<KG_AnnotationPane*>{lineNumbers_, adjust_, counts_, source_})
    p->text()->allLinesChanged();
  for (OI_ScrollBar* b : source_->text()->scrollBars()) b->update();
}

void KG_FileDetail::setModified(bool on) {
  if (save_) save_->setSensitive(on);
}

void KG_FileDetail::applyView(bool recount) {
  settingMenus_ = true;
  if (OI_Menu* view = window_->menuBar("kgTopMenu")->pulldown("kgViewPulldown")) {
    const KG_HighlightSwitches& sw = model_->switches();
    const std::pair<const char*, bool> states[] = {
        {"kgAdjustedAnnotations", model_->showAdjusted()}, {"kgShowCounts", model_->showCounts()},
        {"kgShowLineNumbers", model_->showLineNumbers()},  {"kgHighlightUnusedLines", sw.unused},
        {"kgHighlightUsedLines", sw.used},                 {"kgHighlightDeadcodeLines", sw.deadcode},
        {"kgHighlightInspectedLines", sw.inspected},       {"kgHighlightTestedLines", sw.tested},
    };
    for (const auto& [name, on] : states)
      if (OI_MenuCell* c = view->cell(name)) c->setState(on);
  }
  settingMenus_ = false;
  const std::uint32_t top = source_->text()->topLine();
  auto showPane = [top](KG_AnnotationPane* p, bool on) {
    const bool was = p->shown();
    p->setShown(on);
    if (on && !was) p->text()->setTopLine(top);  // back where the source pane is
  };
  showPane(lineNumbers_, model_->showLineNumbers());
  showPane(counts_, model_->showCounts());
  showPane(adjust_, model_->showAdjusted());
  if (recount) counts_->text()->allLinesChanged();
  source_->text()->allLinesChanged();
  counts_->text()->allLinesChanged();
  adjust_->text()->allLinesChanged();
  gang_->layout();
  if (!model_->fileName().empty()) refreshTitle();
}

void KG_FileDetail::toggleView(const std::string& item, bool on) {
  bool adjusted = model_->showAdjusted(), counts = model_->showCounts(), numbers = model_->showLineNumbers();
  KG_HighlightSwitches sw = model_->switches();
  if (item == "kgHighlightUsedLines") sw.used = on;
  else if (item == "kgHighlightUnusedLines") sw.unused = on;
  else if (item == "kgHighlightDeadcodeLines") sw.deadcode = on;
  else if (item == "kgHighlightInspectedLines") sw.inspected = on;
  else if (item == "kgHighlightTestedLines") sw.tested = on;
  else if (item == "kgAdjustedAnnotations") adjusted = on;
  else if (item == "kgShowCounts") counts = on;
  else if (item == "kgShowLineNumbers") numbers = on;
  else return;
  const bool recount = adjusted != model_->showAdjusted();
  const double start = kgNowMs();
  beginBusy(nullptr);
  model_->setView(adjusted, counts, numbers, sw);
  applyView(recount);
  endBusy();
  recordTiming("source toggle " + item, start);
  // New windows and the per-user defaults take the choice of the ordinary window only.
  if (!isSnapshot()) model_->storeViewInResources();
}

KG_SummaryFile* KG_FileDetail::fileRow() const {
  KG_SummaryOverall* all = outline_ ? outline_->overall() : nullptr;
  if (!all) return nullptr;
  all->create_children();
  for (std::uint32_t i = 0; i < all->child_count(); ++i) {
    auto* dir = dynamic_cast<KG_SummaryDir*>(all->child(i));
    if (!dir || model_->dirName() != dir->name()) continue;
    dir->create_children();
    for (std::uint32_t k = 0; k < dir->child_count(); ++k) {
      auto* row = dynamic_cast<KG_SummaryFile*>(dir->child(k));
      if (row && model_->fileName() == row->name()) return row;
    }
  }
  return nullptr;
}

void KG_FileDetail::editLine(CvgAdjust kind, std::uint32_t index) {
  const KG_DetailModel::LineEdit e = model_->editAdjustment(kind, index);
  if (e.line == 0) return;
  setModified(true);
  // The counts of every function holding the line follow, up to the overall row.
  if (KG_SummaryFile* row = fileRow(); row && e.oldKind != e.newKind) {
    for (KG_SummaryFunc* f : row->functions_at_line(e.line)) {
      if (e.oldKind != 0 && !e.oldDubious) f->adjustment_removed(e.oldKind);
      if (e.newKind != 0 && !e.newDubious) f->adjustment_added(e.newKind);
    }
  }
  source_->measure();
  // Classes of the function may have changed around the line: every pane is redrawn.
  source_->text()->allLinesChanged();
  counts_->text()->allLinesChanged();
  adjust_->text()->linesChanged(index, index);
}

void KG_FileDetail::editAdjustments(CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
  if (first == 0 || last < first) return;
  for (std::uint32_t l = first; l <= last; ++l) editLine(kind, l - 1);
  goToLine(last + 1);
}

bool KG_FileDetail::pressInPane(XEvent* ev, OI_Widget& pane) {
  auto* p = dynamic_cast<KG_AnnotationPane*>(&pane);
  if (!p || !ev || ev->type != ButtonPress) return false;
  const std::uint32_t line = p->text()->lineAtY(ev->xbutton.y);
  if (line < model_->lineCount()) lineNumbers_->setCurrentLine(line + 1);
  return false;  // the text is still selected as usual
}

bool KG_FileDetail::pressInAdjustments(XEvent* ev) {
  if (!ev || ev->type != ButtonPress) return true;
  // The character cell under the pointer (a selection rounds to the nearest gap instead).
  OI_MultiText* t = adjust_->text();
  const std::uint32_t col =
      t->leftColumn() + static_cast<std::uint32_t>(std::max(0, ev->xbutton.x - OI_MultiText::margin) / t->cellWidth());
  const std::uint32_t line = adjust_->text()->lineAtY(ev->xbutton.y);
  if (line < model_->lineCount()) lineNumbers_->setCurrentLine(line + 1);
  const KG_Settings& s = kgSettings();
  switch (model_->canEdit(line)) {
    case KG_DetailModel::EditRefusal::readOnly: message(s.readOnlyWarningPrompt.value); return true;
    case KG_DetailModel::EditRefusal::actualShown: message(s.actualCoverageShown.value); return true;
    case KG_DetailModel::EditRefusal::noCode: message(s.noCodeTherePrompt.value); return true;
    case KG_DetailModel::EditRefusal::none: break;
  }
  const long kind = model_->clickKind(line, col);
  if (kind >= 0) editLine(static_cast<CvgAdjust>(kind), line);
  return true;
}

void KG_FileDetail::message(const std::string& text, bool bell) {
  if (!message_) return;
  message_->setLabel(text.empty() ? " " : text);
  if (bell && shell()) XBell(XtDisplay(shell()), 0);
}

bool KG_FileDetail::saveSource() {
  WindowPrompter prompter(shell());
  const KG_DetailModel::SaveResult r = model_->save(prompter);
  if (r.source != allOK) {
    show_error(r.source, kgMessageText("writeSourceToFile", "Unable to write source to file"), shell());
    return false;
  }
  setModified(false);
  if (r.adjustments != allOK)
    show_error(r.adjustments, "Couldn't write the adjustments file " + adjustmentsFilePath(), shell());
  return true;
}

void KG_FileDetail::writeAnnotatedSource() {
  WindowPrompter prompter(shell());
  const ErrorCode rc = model_->writeAnnotated(kgSettings().writeAnnotatedPrompt.value, prompter);
  if (rc != allOK && rc != noFileName)
    show_error(rc, kgMessageText("writeAnnotatedSrcFile", "Unable to write annotated source to file"), shell());
}

bool KG_FileDetail::confirmModified(ConfirmMode mode) {
  if (!model_->modified()) return true;
  const AskSaveKind kind = mode == confirmExit    ? AskSaveKind::exiting
                           : mode == confirmClose ? AskSaveKind::closing
                                                  : AskSaveKind::updating;
  switch (ask_save(kgSettings().sourceNeedsSavePrompt.value, kind, shell())) {
    case 3: return saveSource();
    case 2:
      // Going on without saving: the adjustments go back to what they were before the edits.
      if (mode != confirmExit && model_->discardEdits()) recountSummary(outline_);
      setModified(false);
      return true;
    default: return false;
  }
}

void KG_FileDetail::snapshot() {
  KG_DetailWindows* keeper = KG_DetailWindows::instance();
  if (!keeper) return;
  auto copy = std::make_unique<KG_FileDetail>(true, outline_);
  copy->model_ = model_->snapshot();
  std::string error;
  if (copy->create(error) != allOK) {
    show_error(errorOccured, kgMessageText("noSnapshotWndw", "Can't make the snapshot window"), shell());
    return;
  }
  beginBusy(nullptr);
  KG_FileDetail* snap = keeper->adoptSnapshot(std::move(copy));
  snap->refreshTitle();
  snap->source_->measure();
  snap->counts_->measure();
  snap->refreshAllLines();
  snap->show();
  snap->source_->text()->setLeftColumn(source_->text()->leftColumn());
  snap->goToLine(referenceLine(2));
  endBusy();
}

void KG_FileDetail::goToLine(std::uint32_t line) {
  OI_MultiText* t = source_->text();
  const std::uint32_t first = source_->firstVisibleLine();
  const std::uint32_t visible = source_->visibleLineCount();
  const std::uint32_t count = source_->lineCount();
  const bool wasVisible = line >= first && line + 1 <= first + visible;
  line = std::min(line, count);
  std::int64_t top = 0;
  if (visible < count) {
    top = std::max<std::int64_t>(
        std::min<std::int64_t>(static_cast<std::int64_t>(line) - 1 - visible / 2, count - visible), 0);
  }
  if (line != 0) lineNumbers_->setCurrentLine(line);
  if (!wasVisible) t->setTopLine(static_cast<std::uint32_t>(top));
  if (window_) window_->raise();
}

std::uint32_t KG_FileDetail::referenceLine(int mode) const {
  const std::uint32_t first = source_->firstVisibleLine();
  const std::uint32_t visible = source_->visibleLineCount();
  const std::uint32_t current = lineNumbers_->currentLine();
  if (current != 0 && current >= first && current + 1 <= first + visible) return current;
  const std::int64_t end = static_cast<std::int64_t>(first) + visible;
  if (mode == 1) return first - 1;
  if (mode == 3) return static_cast<std::uint32_t>(end);
  return static_cast<std::uint32_t>((end - 1 + first) / 2);
}

void KG_FileDetail::action(const std::string& name, const std::string& argument) {
  const double start = kgNowMs();
  actionWithoutTiming(name, argument);
  recordTiming("source key " + name, start);
}

void KG_FileDetail::actionWithoutTiming(const std::string& name, const std::string& argument) {
  const KG_View view{source_->firstVisibleLine(), source_->visibleLineCount()};
  if (name == "set_adjusts") setAdjustments(argument);
  else if (name == "next_unused") nextUnused();
  else if (name == "prev_unused") previousUnused();
  else if (name == "page_up") goToLine(kgPageUpTarget(view));
  else if (name == "page_down") goToLine(kgPageDownTarget(view));
  else if (name == "line_up") goToLine(kgLineUpTarget(referenceLine(3)));
  else if (name == "line_down") goToLine(kgLineDownTarget(referenceLine(1)));
  else if (name == "home") goToLine(1);
}

void KG_FileDetail::nextUnused() {
  const std::uint32_t line = kgNextUnused(model_->lineStates(), referenceLine(1), model_->lineCount(),
                                          kgSettings().stopAfterCodelessRegions.value);
  if (line == 0) message("No unused lines below");
  else goToLine(line);
}

void KG_FileDetail::previousUnused() {
  const std::uint32_t line =
      kgPreviousUnused(model_->lineStates(), referenceLine(3), kgSettings().stopAfterCodelessRegions.value);
  if (line == 0) message("No unused lines above");
  else goToLine(line);
}

void KG_FileDetail::goToTypedLine(const std::string& text) {
  if (text.empty()) return;
  // Digits only, but possibly very many of them.
  std::uint64_t value = 0;
  for (char c : text) {
    if (c < '0' || c > '9') continue;
    value = std::min<std::uint64_t>(value * 10 + static_cast<std::uint64_t>(c - '0'), 0xFFFFFFFFu);
  }
  const std::uint32_t line =
      std::clamp<std::uint32_t>(static_cast<std::uint32_t>(value), 1, std::max<std::uint32_t>(1, model_->lineCount()));
  goToLine(line);
  search_.gotoLine->setText("");
}

void KG_FileDetail::find(const std::string& text) {
  if (text.empty()) {
    message("Enter pattern and hit <return>");
    return;
  }
  for (std::uint32_t line = referenceLine(1) + 1; line <= model_->lineCount(); ++line) {
    if (kgFindMatches(text, model_->displayLine(line - 1))) {
      goToLine(line);
      return;
    }
  }
  message("Pattern not found before end-of-file");
}

void KG_FileDetail::setAdjustments(const std::string& kindWord) {
  const KG_Settings& s = kgSettings();
  if (model_->readOnly()) {
    message(s.readOnlyWarningPrompt.value);
    return;
  }
  if (!model_->showAdjusted()) {
    message(s.actualCoverageShown.value);
    return;
  }
  std::uint32_t first = 0, last = 0;
  OI_MultiText* t = source_->text();
  if (t->hasSelection()) {
    first = t->selectionStart().line + 1;
    last = t->selectionEnd().line + 1;
    // A selection that ends before a line's first character does not take that line.
    if (t->selectionEnd().col == 0 && last > first) --last;
  } else if (const std::uint32_t current = lineNumbers_->currentLine();
             current != 0 && current >= source_->firstVisibleLine() &&
             current < source_->firstVisibleLine() + source_->visibleLineCount()) {
    first = last = current;
  } else {
    message(s.noLinesSelectedPrompt.value);
    return;
  }
  if (first > model_->lineStateCount()) {
    message(s.noCodeTherePrompt.value);
    return;
  }
  last = std::min(last, model_->lineStateCount());
  CvgAdjust kind = 0;  // "none" and any other word
  if (kindWord == "deadcode") kind = adjLineDead;
  else if (kindWord == "tested") kind = adjLineTested;
  else if (kindWord == "inspected") kind = adjLineInspected;
  editAdjustments(kind, first, last);
}

// ---- KG_DetailWindows

KG_DetailWindows::KG_DetailWindows() { gKeeper = this; }

KG_DetailWindows::~KG_DetailWindows() {
  closeAll();
  if (gKeeper == this) gKeeper = nullptr;
}

KG_DetailWindows* KG_DetailWindows::instance() { return gKeeper; }

std::unique_ptr<KG_FileDetail> KG_DetailWindows::makeWindow(bool snapshot, std::string& error) {
  auto w = std::make_unique<KG_FileDetail>(snapshot, outline_);
  if (w->create(error) != allOK) return nullptr;
  w->onClose = [this](KG_FileDetail& d) { close(d); };
  w->onExit = [this] {
    if (exitViewer) exitViewer();
  };
  w->versionText = [this] { return versionText; };
  return w;
}

void KG_DetailWindows::open(SumFile& file, std::uint32_t line) {
  const double start = kgNowMs();
  // In use: small blocks of the arena and the large ones malloc maps on their own.
  const auto heapInUse = [] {
    const struct mallinfo2 m = mallinfo2();
    return m.uordblks + m.hblkhd;
  };
  const std::size_t heapBefore = heapInUse();
  const bool made = current_ == nullptr;
  if (made) {
    std::string error;
    std::unique_ptr<KG_FileDetail> w = makeWindow(false, error);
    if (!w) {
      show_error(errorOccured, kgMessageText("setAnnotationWindow", "Couldn't set annotation window") + "\n" + error);
      return;
    }
    current_ = w.get();
    open_.push_back(std::move(w));
  }
  KG_FileDetail& w = *current_;
  const ErrorCode rc = w.load(file, line);
  if (rc == oprAborted) return;  // the user kept the unsaved edits of the file shown
  if (rc != allOK) {
    show_error(rc, kgMessageText("setAnnotationWindow", "Couldn't set annotation window"));
    current_ = nullptr;  // nothing to ask about: the window goes as it is
    close(w);
    return;
  }
  w.show();
  if (kgTimingsWanted()) {
    w.recordTiming("source open", start);
    const std::size_t heapAfter = heapInUse();
    kgRecordTiming("source open heap KB", heapAfter > heapBefore ? (heapAfter - heapBefore) / 1024.0 : 0.0);
  }
}

void KG_DetailWindows::summaryReplaced(SumRoot& summary) {
  if (!current_) return;
  KG_FileDetail& w = *current_;
  SumFile* file = findSumFile(summary, w.model().summaryPath());
  if (!file) {
    const std::string name = w.model().summaryPath();
    // Unsaved edits are asked about first; kept, the window stays until the user closes it.
    close(w);
    show_message(OI_Severity::information,
                 kgMessageText("fileNotKGVData", "This file is no longer part of the .kgv data") + ":\n" + name);
    return;
  }
  const ErrorCode rc = w.load(*file, w.referenceLine(2));
  if (rc != allOK && rc != oprAborted)
    show_error(rc, kgMessageText("setAnnotationWindow", "Couldn't set annotation window"));
}

std::string KG_DetailWindows::shownPath() const { return current_ ? current_->model().summaryPath() : std::string(); }

bool KG_DetailWindows::confirmExit() {
  return current_ == nullptr || current_->confirmModified(KG_FileDetail::confirmExit);
}

void KG_DetailWindows::close(KG_FileDetail& window) {
  if (&window == current_) {
    if (!window.confirmModified(KG_FileDetail::confirmClose)) return;
    current_ = nullptr;
  }
  if (window.window()) window.window()->hide();
  for (auto it = open_.begin(); it != open_.end(); ++it) {
    if (it->get() != &window) continue;
    closed_.push_back(std::move(*it));
    open_.erase(it);
    break;
  }
  // The window may be in the middle of its own callback: it goes once that is over.
  if (!destroyJob_.pending() && OI_Application::instance())
    destroyJob_ = OI_Application::instance()->addTimeOut(0, [this] { destroyClosed(); });
}

KG_FileDetail* KG_DetailWindows::adoptSnapshot(std::unique_ptr<KG_FileDetail> window) {
  window->onClose = [this](KG_FileDetail& d) { close(d); };
  window->onExit = [this] {
    if (exitViewer) exitViewer();
  };
  window->versionText = [this] { return versionText; };
  open_.push_back(std::move(window));
  return open_.back().get();
}

void KG_DetailWindows::destroyClosed() { closed_.clear(); }

void KG_DetailWindows::closeAll() {
  destroyJob_.cancel();
  current_ = nullptr;
  closed_.clear();
  open_.clear();
}
