// A small window built on the toolkit for the GUI tests: a menu bar, a toolbar row, two text panes
// sharing a vertical scroll bar, a glyph and a popup menu. What the user does shows in the status
// line (line 0 of the counts pane) and in the test hook's dump.
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_scroll_text.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_scroll_bar.h"
#include "toolkit/oi_window.h"

namespace {

const unsigned char squareBits[] = {0xff, 0x07, 0x01, 0x04, 0x01, 0x04, 0x01, 0x04, 0x01, 0x04, 0x01, 0x04,
                                    0x01, 0x04, 0x01, 0x04, 0x01, 0x04, 0x01, 0x04, 0xff, 0x07};

unsigned char iconBits[32 * 32 / 8];

}  // namespace

int main(int argc, char** argv) {
  std::string error;
  if (!OI_Application::open(argc, argv, error)) {
    fprintf(stderr, "%s\n", error.c_str());
    return 3;
  }
  if (argc > 1) {
    // Every X option was taken out by the toolkit; anything left is not ours.
    fprintf(stderr, "unknown argument: %s\n", argv[1]);
    return 2;
  }
  OI_Application* app = OI_Application::instance();
  QR_OI_Init();
  // A database of the program's own, as the settings build it, replaces the one Xt made.
  if (const char* lines = getenv("PROBE_RESOURCES")) {
    XrmDatabase db = XrmGetStringDatabase(lines);
    app->installDatabase(db, true);
  }
  // SIGTERM ends the event loop, so that every window is taken down in order.
  static XtSignalId termSignal = XtAppAddSignal(
      app->context(), [](XtPointer, XtSignalId*) { OI_Application::instance()->quit(); }, nullptr);
  struct sigaction sa {};
  sa.sa_handler = [](int) { XtNoticeSignal(termSignal); };
  sigemptyset(&sa.sa_mask);
  sigaction(SIGTERM, &sa, nullptr);  // no SA_RESTART: the event wait must see the signal
  {
    OI_TopLevel win("probe", "Toolkit probe");
    win.setMinSize(200, 150);
    OI_MenuBar* bar = win.menuBar("probeMenu");
    OI_Menu* file = bar->addPulldown("probeFile", "File", "probeFilePane");

    OI_GridBox box(win.mainWindow(), "probeBox");
    win.setWorkArea(box.widget());
    OI_Box tools(box.widget(), "toolbar", OI_Box::horizontal);
    box.place(tools.widget(), 0, 0, true, false);
    QR_OI_ScrollTextGang gang(box.widget(), "probeGang");
    box.place(gang.widget(), 0, 1, true, true);
    QR_OI_ScrollText* counts = gang.addText("probeCounts", 0, 0, false, true);
    QR_OI_ScrollText* main = gang.addText("probeText", 1, 0, true, true);
    gang.addSharedBar(OI_Side::right, 1, 0);
    counts->text()->setColumns(16);
    OI_MultiText* status = counts->text();
    OI_MultiText* text = main->text();
    auto say = [status](const std::string& s) {
      if (status->lineCount() == 0) status->appendLine(s);
      else status->setLine(0, s);
    };

    // Toolbar: an icon button, an entry field and an option menu.
    for (int i = 0; i < 32; ++i) {
      iconBits[i * 4] = 0xFF;
      iconBits[i * 4 + 3] = 0x80;
    }
    OI_Button icon(tools.widget(), "probeIcon", "Icon", [&] { say("icon pressed"); });
    icon.setIcon(iconBits, 32, 32);
    OI_EntryField entry(tools.widget(), "probeEntry", 12);
    entry.onActivate = [&](const std::string& v) { say("entry: " + v); };
    OI_OptionMenu option(tools.widget(), "probeOption", "Mode");
    option.addChoice("probeModeA", "Alpha");
    option.addChoice("probeModeB", "Beta");
    option.onChange = [&](const std::string& c) { say("option: " + c); };

    // The text: numbered lines, a heading line, a separator column and coloured words.
    std::vector<std::string> lines, numbers;
    lines.push_back("Heading   |group");
    numbers.push_back("status");
    for (int i = 1; i < 200; ++i) {
      lines.push_back("Line " + std::to_string(i) + (i < 10 ? " " : "") + (i < 100 ? " " : "") +
                      "  value " + std::to_string(i * 7));
      numbers.push_back(std::to_string(i));
    }
    text->insertLines(0, lines);
    status->insertLines(0, numbers);
    text->setAttributes(0, 10, 5, OI_attrHeading);
    for (uint32_t i = 1; i < 200; ++i) text->setAttributes(i, 9, 1, OI_attrSeparator);
    bool ok = false;
    unsigned long red = text->namedColor("red", &ok);
    text->setAttributes(3, 11, 5, OI_attrForeground, red);
    OI_Glyph* glyph = text->addGlyph("probeGlyph", 2, 20, squareBits, 11, 11);
    glyph->onPress = [&](OI_Glyph& g, XEvent* ev) {
      say("glyph " + g.name() + " button " + std::to_string(ev->xbutton.button));
    };

    OI_Menu popup(text->widget(), "probePopup", OI_Menu::popup);
    popup.addTitle("probePopupTitle", "Actions");
    popup.addCell("probePopupHello", "Hello", [&] { say("popup hello"); });
    text->onPopup = [&](XEvent* ev) { popup.popupAt(ev); };

    static OI_MessageDialog* info = nullptr;
    file->addCell("probeAsk", "Ask...", [&] {
      std::string a = oiAsk(win.widget(), "probeQuestion", "OK to continue?", "Lock busy\nContinue anyway?",
                            {{"probeContinue", "Continue"}, {"probeCancel", "Cancel"}});
      say("answer: " + (a.empty() ? std::string("(closed)") : a));
    });
    file->addCell("probeInfo", "Information...", [&] {
      if (!info) info = win.own(std::make_unique<OI_MessageDialog>(win.widget(), "probeInformation", "Information",
                                                                    OI_Severity::information));
      std::string a = info->show("Nothing to report.");
      say("message closed: " + a);
    });
    file->addCell("probeOpen", "Open...", [&] {
      std::string chosen;
      bool got = oiAskFileName(win.widget(), "probeFileDialog", "Open", "Data file to open:", "", chosen);
      say(got ? "file: " + chosen : "file: cancelled");
    });
    file->addCell("probeNotes", "Notes...", [&] {
      oiShowNoteList(win.widget(), "probeNote", "Note", "Some coverage for these files was out of date:",
                     {"a.kgv", "b.kgv"});
      say("notes closed");
    });
    file->addCheck("probeWrap", "Wrap", false, [&](bool on) { say(std::string("wrap ") + (on ? "on" : "off")); });
    OI_MenuCell* busy = file->addCell("probeBusy", "Busy", nullptr);
    busy->onActivate = [&] {
      app->beginBusyPointer();
      app->addTimeOut(200, [&] {
        app->endBusyPointer();
        say("busy over");
      });
      say("busy");
    };
    file->addSeparator();
    file->addCell("probeQuit", "Quit", [&] { app->quit(); });
    file->cell("probeQuit")->setAccelerator("Ctrl<Key>q", "Ctrl+Q");
    win.onClose = [&] { app->quit(); };
    win.setFocusHome(text);

    box.fitToContents();
    win.show();
    text->takeFocus();
    app->run();
  }
  OI_Application::close();
  return 0;
}
