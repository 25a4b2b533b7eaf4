// The main window's Help menu.
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_window.h"

void KG_SumFrame::buildHelpMenu() {
  OI_MenuBar* bar = window_->menuBar("kgTopMenu");
  OI_Menu* help = bar->addPulldown("kgHelpPulldown", "Help", "kgHelp");
  help->addCell("kgProductInfo", "Product information", [this] { showVersion(); });
  bar->setHelpPulldown(help);
}

void KG_SumFrame::showVersion() { show_message(OI_Severity::information, input_.versionText); }
