// The main window's Debug menu: the resource dumps and the data-collection interface calls,
// which in the viewer (not itself a program under collection) do nothing and return 0.
#include <cstdio>
#include <string>

#include "settings/settings_writer.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "support/diagnostic.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_menu.h"

namespace {

// The calls of the collection interface as a program under collection would make them.
int kestrel_is_running() { return 0; }
int kestrel_save_data() { return 0; }
int kestrel_clear_data() { return 0; }
int kestrel_set_filename(const char* /*name, absent when the user cancelled*/) { return 0; }
int kestrel_disable_save() { return 0; }
int kestrel_enable_save() { return 0; }

void showApiResult(const char* call, int value) {
  char text[256];
  snprintf(text, sizeof text, "The api call\n    %s\nreturned %d (0x%x)", call, value, static_cast<unsigned>(value));
  show_message(OI_Severity::information, text);
}

// One call under the busy indicator, then its result.
template <class Call>
void callApi(KG_SumFrame& frame, const char* text, Call call) {
  frame.begin_busy(nullptr);
  OI_Application::instance()->beginBusyPointer();
  const int value = call();
  OI_Application::instance()->endBusyPointer();
  frame.end_busy();
  showApiResult(text, value);
}

void dump(bool includeAll) {
  std::string path;
  const char* prompt = includeAll ? kDumpAllResourcesPrompt : kDumpEditableResourcesPrompt;
  if (!oiAskFileName(kgDialogHome(), "kgFileDialog", "Kestrelgauge", prompt, "", path) || path.empty()) return;
  SettingsOutcome o = dumpResources(path, includeAll);
  for (const std::string& w : o.consoleWarnings) kgWarning("%s", w.c_str());
  if (o.code != allOK) show_error(o.code, o.context);
}

}  // namespace

void KG_SumFrame::buildDebugMenu(OI_Menu* debug) {
  OI_Menu* dumps = debug->addSubmenu("kgDumpResources", "Dump resources", "kgDumpResourcesMenu");
  dumps->addCell("kgDumpAllResources", "Dump all resources as...", [] { dump(true); });
  dumps->addCell("kgDumpGuiResources", "Dump GUI-editable resources as...", [] { dump(false); });

  OI_Menu* api = debug->addSubmenu("kgAPI", "API", "kgAPIMenu");
  api->addCell("kgAPIIsRunning", "kestrel_is_running()",
               [this] { callApi(*this, "kestrel_is_running()", kestrel_is_running); });
  api->addCell("kgAPISaveData", "kestrel_save_data()",
               [this] { callApi(*this, "kestrel_save_data()", kestrel_save_data); });
  api->addCell("kgAPIClearData", "kestrel_clear_data()",
               [this] { callApi(*this, "kestrel_clear_data()", kestrel_clear_data); });
  api->addSeparator();
  api->addCell("kgAPISetFilename", "kestrel_set_filename()...", [this] {
    std::string name;
    const bool given = oiAskFileName(kgDialogHome(), "kgFileDialog", "Kestrelgauge", "Name of .kgv file?", "", name);
    callApi(*this, "kestrel_set_filename()", [&] { return kestrel_set_filename(given ? name.c_str() : nullptr); });
  });
  api->addCell("kgAPIDisableSave", "kestrel_disable_save()",
               [this] { callApi(*this, "kestrel_disable_save()", kestrel_disable_save); });
  api->addCell("kgAPIEnableSave", "kestrel_enable_save()",
               [this] { callApi(*this, "kestrel_enable_save()", kestrel_enable_save); });
}
