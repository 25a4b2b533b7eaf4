// The Help menus' topics: the installed manual opened at a topic by the user's browser
// command (the resource helpBrowserCommand), failures told in an error dialog.
#pragma once

#include <X11/Intrinsic.h>

#include <functional>
#include <string>
#include <vector>

#include "summary/help_page.h"

class OI_Menu;

// The installation directory whose help/manual.html the topics open; the main window sets
// it. Until then the runtime option of the installation directory is used.
void kgSetHelpInstallDir(const std::string& installDir);
std::string kgHelpInstallDir();

// Runs the browser command on the manual at `anchor` (empty: its top). A missing page, a
// command that cannot be started and one that fails soon after are shown in an error dialog
// over `parent` (the main window when the parent is gone by then).
void kgShowHelpTopic(const std::string& anchor, Widget parent);

// One cell per topic in `help`, each opening its topic over the window `parent` gives.
void kgAddHelpTopics(OI_Menu* help, const std::vector<KG_HelpTopic>& topics, std::function<Widget()> parent);

// The Help menu's first entry, "On window": context help. The pointer becomes a question mark
// and the window's parts stop taking input until the next click or key; the part clicked
// opens its place in the manual (`topics`, else `fallback`), a key or a click elsewhere
// just leaves the mode. `window` gives the window's shell.
void kgAddContextHelp(OI_Menu* help, const std::vector<KG_ContextTopic>& topics, const std::string& fallback,
                      std::function<Widget()> window);
