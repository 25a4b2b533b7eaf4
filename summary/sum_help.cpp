// The main window's Help menu: the manual's topics in the user's browser, and the version.
#include "summary/help_browser.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_window.h"

void KG_SumFrame::buildHelpMenu() {
  kgSetHelpInstallDir(input_.installDir);
  OI_MenuBar* bar = window_->menuBar("kgTopMenu");
  OI_Menu* help = bar->addPulldown("kgHelpPulldown", "Help", "kgHelp");
  kgAddContextHelp(help, kgMainWindowContextTopics(), "the-main-window", [this] { return shell(); });
  kgAddHelpTopics(help, kgMainWindowHelpTopics(), [this] { return shell(); });
  help->addSeparator();
  help->addCell("kgProductInfo", "Product information", [this] { showVersion(); });
  bar->setHelpPulldown(help);
}

void KG_SumFrame::showVersion() { show_message(OI_Severity::information, input_.versionText); }
