// An outline window for the GUI tests: a coverage-like tree of rows on a QR_OI_OutlineDisplay
// with a heading pane, an Actions menu and a toolbar whose cells follow the selection.
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_outline_display.h"
#include "outline/qr_oi_scroll_text.h"
#include "outline/qr_outline_root.h"
#include "outline/qr_outline_text.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_window.h"

namespace {

QR_OutlineText* addRow(QR_OutlineObject* parent, const std::string& text, bool expandable) {
  auto* row = new QR_OutlineText(text.c_str());
  if (expandable) row->make_expandable();
  else row->make_selectable();
  parent->add_child(row);
  return row;
}

}  // namespace

int main(int argc, char** argv) {
  std::string error;
  if (!OI_Application::open(argc, argv, error)) {
    fprintf(stderr, "%s\n", error.c_str());
    return 3;
  }
  // Without QR_OI_Init the outline cannot find its kind of text.
  if (!getenv("PROBE_WITHOUT_INIT")) QR_OI_Init();
  OI_Application* app = OI_Application::instance();
  static XtSignalId termSignal = XtAppAddSignal(
      app->context(), [](XtPointer, XtSignalId*) { OI_Application::instance()->quit(); }, nullptr);
  struct sigaction sa {};
  sa.sa_handler = [](int) { XtNoticeSignal(termSignal); };
  sigemptyset(&sa.sa_mask);
  sigaction(SIGTERM, &sa, nullptr);
  {
    OI_TopLevel win("kestrel", "Kestrelgauge");
    OI_MenuBar* bar = win.menuBar("kgTopMenu");
    OI_Menu* actions = bar->addPulldown("kgActions", "Actions", "kgExpandCollapseMenu");
    OI_GridBox box(win.mainWindow(), "kgBox");
    win.setWorkArea(box.widget());
    OI_Box toolbar(box.widget(), "toolbar", OI_Box::horizontal);
    box.place(toolbar.widget(), 0, 0, true, false);
    QR_OI_ScrollTextGang gang(box.widget(), "kgOutlineGang");
    box.place(gang.widget(), 0, 1, true, true);
    QR_OI_ScrollText* title = gang.addText("kgTitle", 0, 0, true, false);
    QR_OI_ScrollText* outline = gang.addText("kgOutline", 0, 1, true, true);
    gang.addSharedBar(OI_Side::bottom, 0, 1);
    title->text()->setRows(2);
    outline->text()->setRows(16);
    title->text()->insertLines(0, {"   Name                 Lines", "                        count"});

    QR_OutlineRoot* root = nullptr;
    auto* display = new QR_OI_OutlineDisplay(outline);
    root = new QR_OutlineRoot(display);
    display->add_column_mark(23);
    display->add_column_mark(31);
    bool ok = false;
    unsigned long red = outline->text()->namedColor("red", &ok);
    unsigned long yellow = outline->text()->namedColor("yellow", &ok);
    display->add_enhancement("unused", red, yellow);
    display->onActivate = [title](QR_OutlineObject* row) {
      const char* t = row->line_text(0);
      title->text()->setLine(1, std::string("activated ") + (t ? t : ""));
    };

    const char* cells[][2] = {{"QR_OutlineCollapse", "Collapse"},
                              {"QR_OutlineCollapseAll", "Collapse all"},
                              {"QR_OutlineExpand,QR_OutlineMakeVisible", "Expand"},
                              {"QR_OutlineExpandAll", "Expand all"},
                              {"QR_OutlineNext", "Next"},
                              {"QR_OutlinePrevious", "Previous"}};
    for (auto& c : cells) {
      std::string name = c[0];
      actions->addCell(name, c[1], [root, name] { root->perform_action(name.c_str(), nullptr); });
    }
    OI_Button next(toolbar.widget(), "QR_OutlineNext", "Next", [root] { root->perform_action("QR_OutlineNext", nullptr); });
    OI_Button prev(toolbar.widget(), "QR_OutlinePrevious", "Previous",
                   [root] { root->perform_action("QR_OutlinePrevious", nullptr); });
    display->add_controlled_widget(actions->widget());
    display->add_controlled_widget(toolbar.widget());

    QR_OutlineText* total = addRow(root, "Total Coverage\t12", true);
    QR_OutlineText* src = addRow(total, "src/\t4", true);
    QR_OutlineText* a = addRow(src, "a.c\t3", true);
    addRow(a, "main\t1", false);
    QR_OutlineText* helper = addRow(a, "helper\tunused", false);
    helper->put_annotation("QR_OutlineHere", 0, 0);
    addRow(src, "b.c\t1", true);
    QR_OutlineText* lib = addRow(total, "lib/\t8", true);
    QR_OutlineText* util = addRow(lib, "util.c\t8", true);
    for (int i = 1; i <= 30; ++i) addRow(util, "f" + std::to_string(i) + "\t" + std::to_string(i), false);
    total->expand();

    win.setFocusHome(outline->text());
    box.fitToContents();
    win.onClose = [app] { app->quit(); };
    win.show();
    outline->text()->takeFocus();
    app->run();
    delete root;
  }
  OI_Application::close();
  return 0;
}
