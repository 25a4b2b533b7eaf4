// The main window: its parts in building order, the menus and toolbar, headings and stripes,
// the busy box.
#include "summary/sum_frame.h"

#include <Xm/Xm.h>

#include <cstdio>
#include <algorithm>
#include <cstdlib>

#include "coverage/sort_orders.h"
#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_outline_display.h"
#include "outline/qr_oi_scroll_text.h"
#include "settings/resource_database.h"
#include "settings/resource_table.h"
#include "settings/settings_writer.h"
#include "summary/kg_columns.h"
#include "summary/kg_outline_text.h"
#include "summary/name_style.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_timing.h"
#include "summary/sum_toolbar.h"
#include "support/diagnostic.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_grid_box.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_window.h"

namespace {

// The window's icon ("kgOutlineLogo"): an outline of indented rows with their triangles and
// a column of figures, 50 x 50.
const unsigned char* outlineLogoBits() {
  static unsigned char bits[7 * 50] = {};
  static const bool made = [] {
    auto set = [](int x, int y) { bits[y * 7 + x / 8] |= static_cast<unsigned char>(1u << (x % 8)); };
    for (int x = 2; x < 48; ++x) set(x, 2), set(x, 47);
    for (int y = 2; y < 48; ++y) set(2, y), set(47, y), set(36, y);
    const int indent[] = {0, 1, 2, 2, 1, 2, 2, 0};
    for (int r = 0; r < 8; ++r) {
      const int y = 6 + r * 5, x0 = 5 + indent[r] * 5;
      for (int i = 0; i < 3; ++i)
        for (int k = -i; k <= i; ++k) set(x0 + 2 - i + 2, y + k);  // a small triangle
      for (int x = x0 + 6; x < x0 + 6 + 14 - indent[r] * 3; ++x) set(x, y);
      for (int x = 39 + (r % 3); x < 45; ++x) set(x, y);
    }
    return true;
  }();
  (void)made;
  return bits;
}

// The seven cells of the Actions pulldown and the popup menu.
const char* const kActionCells[][2] = {
    {"QR_OutlineCollapse", "Collapse"},
    {"QR_OutlineCollapseAll", "Collapse all"},
    {"QR_OutlineExpand,QR_OutlineMakeVisible", "Expand"},
    {"QR_OutlineExpandAll", "Expand all"},
    {"QR_OutlineNext", "Next"},
    {"QR_OutlinePrevious", "Previous"},
    {"KG_ScrollToFunction", "Show annotated source"},
};

const char* const kStripeCells[][2] = {
    {"none", "No vertical separators"},
    {"groups", "Between groups of related columns"},
    {"all", "Between all columns"},
};

}  // namespace

KG_SumFrame::KG_SumFrame(MainWindowInput& input) : input_(input) {}

KG_SumFrame::~KG_SumFrame() {
  kgSummaryHooks() = KG_SummaryHooks{};
  if (input_.sourceWindows) {
    input_.sourceWindows->attachOutline(nullptr);
    input_.sourceWindows->exitViewer = nullptr;
  }
  // Rows and their display go before the widgets they draw into.
  root_.reset();
  kgSetDialogHome(nullptr);
  window_.reset();
}

Widget KG_SumFrame::shell() const { return window_ ? XtParent(window_->mainWindow()) : nullptr; }

KG_SummaryOverall* KG_SumFrame::overall() const { return root_ ? root_->overall() : nullptr; }

ErrorCode KG_SumFrame::build(std::string& error) {
  OI_Application* app = OI_Application::instance();
  if (app == nullptr) {
    error = "the display is not open";
    return displayNotOpened;
  }
  KG_Settings& s = kgSettings();
  // The application window with its resize and close callbacks.
  window_ = std::make_unique<OI_TopLevel>("kestrel", "Kestrelgauge");
  window_->setIcon(outlineLogoBits(), 50, 50);
  kgSetDialogHome(shell());
  window_->onClose = [this] { exit_viewer(); };
  window_->onResize = [this](int, int) {
    if (!outline_ || !overall()) return;
    static long lastWidth = 0;
    const long w = static_cast<long>(outline_->text()->visibleColumns());
    if (w == lastWidth || w == 0) return;
    const bool wider = w > lastWidth;
    lastWidth = w;
    NameStyle style = kgNameStyleFromSettings();
    const unsigned n = resized_name_column_width(style, w, kgShownWidth(kgShownColumns()), wider);
    kgSettings().summaryLines.value = static_cast<int>(outline_->text()->visibleLines());
    if (n != style.nameColumnWidth) {
      kgSettings().nameColumnWidth.value = static_cast<int>(n);
      rebuild_rows_and_headings();
    }
  };
  buildMenus();

  // The toolbar, shown or hidden by its preference.
  workArea_ = window_->own(std::make_unique<OI_GridBox>(window_->mainWindow(), "kgWorkArea"));
  window_->setWorkArea(workArea_->widget());
  toolbar_ = window_->own(std::make_unique<KG_Toolbar>(workArea_->widget(),
                                                       [this](const std::string& a) { perform(a); }));
  workArea_->place(toolbar_->widget(), 0, 0, true, false);
  if (!s.showToolbar.value) toolbar_->unmanage();

  // The gang container, the gang and the busy box in the same place.
  gangContainer_ = window_->own(std::make_unique<OI_GridBox>(workArea_->widget(), "kgGangContainer"));
  workArea_->place(gangContainer_->widget(), 0, 1, true, true);
  gang_ = window_->own(std::make_unique<QR_OI_ScrollTextGang>(gangContainer_->widget(), "kgOutlineGang"));
  gangContainer_->place(gang_->widget(), 0, 0, true, true);
  busyBox_ = window_->own(std::make_unique<OI_GridBox>(workArea_->widget(), "kgGangHider"));
  busyLabel_ = window_->own(
      std::make_unique<OI_Label>(busyBox_->widget(), "kgBusy", "Performing requested operation."));
  auto* wait = window_->own(
      std::make_unique<OI_Label>(busyBox_->widget(), "kgPleaseWait", "Thank you for your patience."));
  busyBox_->place(busyLabel_->widget(), 0, 0, true, true);
  busyBox_->place(wait->widget(), 0, 1, true, true);
  workArea_->place(busyBox_->widget(), 0, 1, true, true);
  busyBox_->unmanage();
  // Shortened names can look alike: the line under the outline names the row under the
  // pointer in full.
  rowName_ = window_->own(std::make_unique<OI_Label>(workArea_->widget(), "kgRowName", " "));
  XtVaSetValues(rowName_->widget(), XmNalignment, XmALIGNMENT_BEGINNING, nullptr);
  workArea_->place(rowName_->widget(), 0, 2, true, false);

  // The name column width, the heading pane and the outline.
  s.nameColumnWidth.value = static_cast<int>(clamp_name_column_width(s.nameColumnWidth.value));
  kgSetChosenNameColumnWidth(static_cast<unsigned>(s.nameColumnWidth.value));
  const std::uint32_t width = kgShownWidth(kgShownColumns());
  title_ = gang_->addText("kgTitle", 0, 0, true, false);
  outline_ = gang_->addText("kgOutline", 0, 1, true, true);
  gang_->addSharedBar(OI_Side::bottom, 0, 1);
  title_->text()->setRows(2);
  title_->text()->setColumns(static_cast<int>(width));
  outline_->text()->setRows(std::clamp(s.summaryLines.value, 10, 100));
  outline_->text()->setColumns(static_cast<int>(width));

  buildPopup();
  auto display = std::make_unique<QR_OI_OutlineDisplay>(outline_);
  display_ = display.get();
  // The summary's vertical bar keeps its own room beside the text, so that it never hides
  // the last column when many rows make it appear (the window does not grow for it).
  outline_->setDynamicScrollBars(false);
  XtAddEventHandler(
      outline_->text()->widget(), PointerMotionMask | LeaveWindowMask, False,
      [](Widget, XtPointer client, XEvent* ev, Boolean*) {
        auto* self = static_cast<KG_SumFrame*>(client);
        oiGuard("row name", [&] { self->showRowNameAt(ev->type == MotionNotify ? ev->xmotion.y : -1); });
      },
      this);
  if (OI_Menu* actions = window_->menuBar("kgTopMenu")->pulldown("kgActions")) {
    display_->add_controlled_widget(actions->widget());
  }
  display_->add_controlled_widget(popup_->widget());
  for (OI_Button* b : toolbar_->buttons()) {
    if (b->name() != "kgStartCRMS") display_->add_controlled_widget(b->widget());
  }
  if (OI_Button* crms = toolbar_->button("kgStartCRMS")) crms->setSensitive(!s.crmsCommandString.value.empty());
  root_ = std::make_unique<KG_OutlineRoot>(display.release());  // the root owns the display
  placeHeadings();
  buildHelpMenu();

  window_->setFocusHome(outline_->text());
  window_->setMinSize(std::clamp(s.viewerWindowMinWidth.value, 50, 15000),
                      std::clamp(s.viewerWindowMinHeight.value, 50, 15000));

  KG_SummaryHooks& hooks = kgSummaryHooks();
  hooks.beginBusy = [this](const char* m) {
    begin_busy(m);
    OI_Application::instance()->beginBusyPointer();
  };
  hooks.endBusy = [this] {
    OI_Application::instance()->endBusyPointer();
    end_busy();
  };
  hooks.showError = [](const std::string& m, ErrorCode code) { show_error(code, m); };
  hooks.openSource = [this](SumFile& file, std::uint32_t line) {
    if (input_.sourceWindows) input_.sourceWindows->open(file, line);
  };
  hooks.summaryReplaced = [this](SumRoot& summary) {
    if (input_.sourceWindows) input_.sourceWindows->summaryReplaced(summary);
  };
  if (input_.sourceWindows) {
    input_.sourceWindows->attachOutline(root_.get());
    input_.sourceWindows->exitViewer = [this] { exit_viewer(); };
    input_.sourceWindows->versionText = input_.versionText;
  }
  // A missing or empty scripts directory means a broken installation: the window is not made.
  if (input_.scripts) {
    ErrorCode rc = input_.scripts->build(*this, error);
    if (rc != allOK) return rc;
  }
  return allOK;
}

void KG_SumFrame::buildMenus() {
  OI_MenuBar* bar = window_->menuBar("kgTopMenu");
  buildFileMenu(bar->addPulldown("kgFilePulldown", "File", "kgFile"));
  buildViewMenu(bar->addPulldown("kgViewPulldown", "View", "kgView"));
  buildActions(bar->addPulldown("kgActions", "Actions", "kgExpandCollapseMenu"));
  OI_Menu* adj = bar->addPulldown("kgAdjustmentsPulldown", "Adjustments", "kgAdjustments");
  adj->addCell("kgCompileAdjustments", "Extract adjustments from all source files", [this] { extract_adjustments(); });
  buildDebugMenu(bar->addPulldown("kgDebugPulldown", "Debug", "kgDebug"));
}

void KG_SumFrame::buildFileMenu(OI_Menu* file) {
  file->addCell("kgOpen", "Open...", [this] { askAndAddDataFile(); });
  file->addCell("kgReloadAll", "Reload all", [this] { reload_all(); });
  file->addCell("kgWriteKgv", "Write .kgv file...", [this] { writeKgvTo(); });
  file->addCell("kgWriteExport", "Write export file...", [this] { writeExportTo(); });
  file->addCell("kgWriteOutline", "Save as...", [this] { askAndSaveOutline(); });
  file->addCell("kgRunScript", "Run script...", [this] {
    if (input_.scripts) input_.scripts->run();
  });
  OI_MenuCell* crms = file->addCell("kgStartCRMS", "File a Change Request", [this] { startChangeRequest(); });
  crms->setSensitive(!kgSettings().crmsCommandString.value.empty());
  file->addSeparator();
  file->addCell("kgExit", "Exit", [this] { exit_viewer(); });
}

namespace {

// The cells of the sort menu "kgSort" in order; an empty name stands for a separator.
const char* const kSortMenuCells[] = {
    "alpha",    "native",     "",       "al_unused", "al_unused%", "al_used", "al_used%",
    "adj_lines", "",          "l_unused", "l_unused%", "l_used",   "l_used%", "lines",
    "",         "b_unused",   "b_unused%", "b_used",   "b_used%",  "blocks"};

}  // namespace

void KG_SumFrame::buildViewMenu(OI_Menu* view) {
  KG_Settings& s = kgSettings();
  view->addCell("kgColumns", "Select columns", [this] { openColumnsDialog(); });
  sortMenu_ = view->addSubmenu("kgSortBy", "Select sorting order", "kgSort");
  sortMenu_->setRadio(true);
  for (const char* name : kSortMenuCells) {
    if (*name == '\0') {
      sortMenu_->addSeparator();
      continue;
    }
    std::uint32_t id = 0;
    sort_order_by_name(name, id);
    sortMenu_->addCheck(name, sort_order_label(id), false, [this, id](bool on) {
      if (on && !settingMenus_) set_sort_order(id);
    });
  }
  view->addCell("kgNames", "Set display style for names", [this] { openNameStyleDialog(); });
  view->addSeparator();
  stripeMenu_ = view->addSubmenu("kgColSeparators", "Vertical column separators", "kgStripes");
  stripeMenu_->setRadio(true);
  for (int i = 0; i < 3; ++i) {
    const int setting = i + 1;
    stripeMenu_->addCheck(kStripeCells[i][0], kStripeCells[i][1], s.outlineDataColumnSeparators.value == setting,
                          [this, setting](bool on) {
                            if (on && !settingMenus_) set_stripes(setting);
                          });
  }
  toolbarToggle_ = view->addCell("kgToolbarToggle", s.turnToolbarOffPrompt.value, [this] {
    set_toolbar_visible(!kgSettings().showToolbar.value);
  });
  updateToolbarToggleLabel();
  view->addCell("kgRefreshGui", "Refresh display", [this] { refreshAllWindows(); });
  view->addSeparator();
  view->addCell("kgUpdateXdefaults", "Update ~/.kestrel.Xdefaults", [this] { updateUserDefaultsFile(); });
  view->addCell("kgSaveXdefaults", "Write view settings to...", [this] { writeViewSettingsTo(); });
}

void KG_SumFrame::buildActions(OI_Menu* actions) {
  for (const auto& c : kActionCells) {
    std::string name = c[0];
    actions->addCell(name, c[1], [this, name] { perform(name); });
  }
}

void KG_SumFrame::buildPopup() {
  popup_ = window_->own(std::make_unique<OI_Menu>(outline_->text()->widget(), "kgOutlinePopup", OI_Menu::popup));
  popup_->addTitle("kgOutlinePopupTitle", "Actions");
  for (const auto& c : kActionCells) {
    std::string name = c[0];
    popup_->addCell(name, c[1], [this, name] { perform(name); });
  }
  // Button 3 over the text pops the menu up; over a row's glyph the glyph's own menu comes
  // instead (two popups at once would fight over the pointer grab).
  XtAddEventHandler(
      outline_->text()->widget(), ButtonPressMask, False,
      [](Widget, XtPointer client, XEvent* ev, Boolean*) {
        auto* self = static_cast<KG_SumFrame*>(client);
        if (ev->xbutton.button != Button3) return;
        if (self->outline_->text()->glyphAt(ev->xbutton.x, ev->xbutton.y)) return;
        self->popup_->popupAt(ev);
      },
      this);
}

void KG_SumFrame::showRowNameAt(int y) {
  const QR_OutlineObject* row = nullptr;
  if (y >= 0 && root_) {
    const std::uint32_t line = outline_->text()->lineAtY(y);
    if (line < root_->total_lines()) row = root_->object_at_line(line);
  }
  if (row == rowNameOf_) return;
  rowNameOf_ = row;
  const auto* text = dynamic_cast<const KG_OutlineText*>(row);
  rowName_->setLabel(text ? text->full_name() : " ");
}

void KG_SumFrame::perform(const std::string& actionString) {
  if (root_ == nullptr) return;
  if (actionString == "kgStartCRMS") {
    startChangeRequest();
    return;
  }
  const double start = kgNowMs();
  root_->perform_action(actionString.c_str(), nullptr);
  if (kgTimingsWanted()) {
    // The change as drawn: pending drawing is done and the server has it.
    outline_->text()->redisplay();
    XSync(XtDisplay(outline_->text()->widget()), False);
    kgRecordTiming("action " + actionString, kgNowMs() - start);
  }
  // Keys go back to the outline after a menu or button was used.
  outline_->text()->takeFocus();
}

void KG_SumFrame::showData(std::unique_ptr<KgvData> data, std::unique_ptr<SumRoot> summary) {
  const std::uint32_t order = summary ? summary->sortOrder : kDefaultSortOrder;
  auto* all = new KG_SummaryOverall(std::move(data), std::move(summary));
  root_->add_child(all);
  settingMenus_ = true;
  if (OI_MenuCell* c = sortMenu_->cell(sort_order_name(order))) c->setState(true);
  settingMenus_ = false;
  kgSettings().sortCriterion.set(static_cast<int>(order));
  placeHeadings();
}

void KG_SumFrame::show() {
  gangContainer_->fitToContents();
  workArea_->fitToContents();
  window_->show();
  if (KG_SummaryOverall* all = overall()) all->expand();
  outline_->text()->takeFocus();
  if (kgTimingsWanted()) startTimings();
}

namespace {

double gKeyStart = 0;

void keyStarts(Widget, XtPointer, XEvent*, Boolean*) { gKeyStart = kgNowMs(); }

void keyEnds(Widget w, XtPointer client, XEvent* ev, Boolean*) {
  if (gKeyStart == 0) return;
  char name[64] = "";
  KeySym sym = NoSymbol;
  XLookupString(&ev->xkey, name, sizeof name, &sym, nullptr);
  const char* symName = XKeysymToString(sym);
  const std::string what = std::string("key ") + (symName ? symName : "?");
  auto* text = static_cast<OI_MultiText*>(client);
  Display* d = XtDisplay(w);
  // Right after the key's own handling is over: what it changed, drawn and at the server.
  OI_Application::instance()->addTimeOut(0, [text, d, what] {
    text->redisplay();
    XSync(d, False);
    kgRecordTiming(what, kgNowMs() - gKeyStart);
    gKeyStart = 0;
  });
}

}  // namespace

void KG_SumFrame::startTimings() {
  // Once the loop has handled the first drawing, the window is up.
  OI_Application::instance()->addWorkProc([] {
    kgRecordTiming("window-up", kgMsSinceProcessStart());
    return true;
  });
  // Keys on the outline: from before its translations to after the change is drawn.
  Widget w = outline_->text()->widget();
  XtInsertEventHandler(w, KeyPressMask, False, keyStarts, nullptr, XtListHead);
  XtInsertEventHandler(w, KeyPressMask, False, keyEnds, outline_->text(), XtListTail);
}

void KG_SumFrame::placeHeadings() {
  KG_Settings& s = kgSettings();
  const auto shown = kgShownColumns();
  const std::uint32_t order = overall() ? overall()->sort_order() : static_cast<std::uint32_t>(s.sortCriterion.value);
  const KG_Headings h = kgBuildHeadings(shown, sort_order_label(order), s.outlineHeaderColumnSeparators.value);
  OI_MultiText* t = title_->text();
  t->clear();
  t->insertLines(0, std::vector<std::string>{h.first, h.second});
  for (const KG_Span& m : h.marked) t->setAttributes(0, m.start, m.length, OI_attrHeading);
  for (std::uint32_t p : h.stripes) t->setAttributes(1, p, 1, OI_attrSeparator);
  display_->clear_column_marks();
  for (std::uint32_t p : kgStripePositions(shown, s.outlineDataColumnSeparators.value)) display_->add_column_mark(p);
}

std::vector<std::string> KG_SumFrame::heading_lines() const {
  std::vector<std::string> out;
  for (std::uint32_t i = 0; i < title_->text()->lineCount(); ++i) out.push_back(title_->text()->model().lineText(i));
  return out;
}

void KG_SumFrame::rebuild_rows_and_headings() {
  placeHeadings();
  if (KG_SummaryOverall* all = overall()) {
    begin_busy(nullptr);
    all->refresh_subtree();
    end_busy();
  }
}

void KG_SumFrame::set_sort_order(std::uint32_t order) {
  KG_SummaryOverall* all = overall();
  if (all == nullptr) return;
  all->resort(order, false);
  kgSettings().sortCriterion.set(static_cast<int>(order));
  placeHeadings();
  outline_->text()->takeFocus();
}

void KG_SumFrame::set_stripes(int setting) {
  if (kgSettings().outlineDataColumnSeparators.value == setting) return;
  kgSettings().outlineDataColumnSeparators.setValue(setting);
  rebuild_rows_and_headings();
}

void KG_SumFrame::set_toolbar_visible(bool on) {
  kgSettings().showToolbar.value = on;
  if (on) toolbar_->manage();
  else toolbar_->unmanage();
  // The outline takes the toolbar's room at once (or gives it back), not at the next resize.
  workArea_->layout();
  updateToolbarToggleLabel();
}

void KG_SumFrame::updateToolbarToggleLabel() {
  KG_Settings& s = kgSettings();
  toolbarToggle_->setLabel(s.showToolbar.value ? s.turnToolbarOffPrompt.value : s.turnToolbarOnPrompt.value);
}

void KG_SumFrame::begin_busy(const char* message) {
  if (busy_) return;
  busy_ = true;
  if (message != nullptr && *message != '\0') busyLabel_->setLabel(message);
  Dimension w = 0, h = 0;
  XtVaGetValues(gangContainer_->widget(), XmNwidth, &w, XmNheight, &h, nullptr);
  gangContainer_->unmanage();
  if (w > 0 && h > 0) XtVaSetValues(busyBox_->widget(), XmNwidth, w, XmNheight, h, nullptr);
  busyBox_->manage();
  XmUpdateDisplay(shell());
}

void KG_SumFrame::end_busy() {
  if (!busy_) return;
  busy_ = false;
  busyBox_->unmanage();
  gangContainer_->manage();
  busyLabel_->setLabel("Performing requested operation.");
}

void KG_SumFrame::refreshAllWindows() {
  OI_Application* app = OI_Application::instance();
  for (Widget w : app->topLevels()) {
    if (XtIsRealized(w)) XClearArea(XtDisplay(w), XtWindow(w), 0, 0, 0, 0, True);
  }
  window_->refresh();
}

void KG_SumFrame::startChangeRequest() {
  const std::string& command = kgSettings().crmsCommandString.value;
  if (command.empty()) return;
  // The command runs beside the viewer: the shell puts it in the background.
  const std::string line = "(" + command + ") &";
  if (std::system(line.c_str()) != 0) {
    show_message(OI_Severity::warning, "Couldn't run the command:\n" + command);
  }
}

void KG_SumFrame::exit_viewer() {
  // An annotated source window with unsaved edits asks first, and may keep the viewer open.
  if (input_.sourceWindows && kgSettings().saveSourceAtExit.value && !input_.sourceWindows->confirmExit()) return;
  if (input_.sourceWindows) input_.sourceWindows->closeAll();
  if (input_.scripts) input_.scripts->closeAll();
  const std::string note = createUserDefaultsFromTemplate(input_.installDir);
  if (!note.empty()) show_message(OI_Severity::information, note);
  OI_Application::instance()->quit();
}
