// The main window's operations on data and files: adding and reloading data files, writing
// data, export, outline and settings files, extraction.
#include <Xm/Xm.h>

#include <algorithm>
#include <cerrno>

#include "adjust/adjustments_file.h"
#include "adjust/export_report.h"
#include "adjust/extraction.h"
#include "coverage/kgv_file.h"
#include "coverage/kgv_load.h"
#include "coverage/kgv_lock.h"
#include "coverage/kgv_merge.h"
#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_outline_display.h"
#include "settings/resource_database.h"
#include "settings/resource_table.h"
#include "settings/settings_writer.h"
#include "summary/kg_outline_text.h"
#include "summary/name_style.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "support/atomic_write.h"
#include "support/diagnostic.h"
#include "support/message_sink.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_window.h"

namespace {

// The busy box and pointer around one operation, ended on every path.
class BusyScope {
 public:
  BusyScope(KG_SumFrame& f, const char* message) : f_(f) {
    f_.begin_busy(message);
    OI_Application::instance()->beginBusyPointer();
  }
  ~BusyScope() {
    OI_Application::instance()->endBusyPointer();
    f_.end_busy();
  }
  BusyScope(const BusyScope&) = delete;
  BusyScope& operator=(const BusyScope&) = delete;

 private:
  KG_SumFrame& f_;
};

bool askFile(const char* prompt, std::string& chosen) {
  return oiAskFileName(kgDialogHome(), "kgFileDialog", "Kestrelgauge", prompt, "", chosen) && !chosen.empty();
}

class WindowQuestion : public ExtractionQuestion {
 public:
  bool continueWith(const std::string& message) override { return ask_continue(message); }
};

}  // namespace

std::vector<KgvFileRef>& KG_SumFrame::loaded_files() { return input_.loadedFiles; }

const std::string& KG_SumFrame::install_dir() const { return input_.installDir; }

void KG_SumFrame::reload_all() {
  KG_SummaryOverall* all = overall();
  if (all == nullptr || input_.loadedFiles.empty()) return;
  BusyScope busy(*this, kgSettings().loadingKgvDataBusyMsg.c_str());
  std::vector<std::string> ignored;
  std::unique_ptr<KgvData> data;
  std::size_t failed = 0;
  ConsoleMessages console;
  ErrorCode rc = loadAllKgvFiles(input_.loadedFiles, input_.mergeMode, &ignored, console, data, failed);
  if (rc != allOK && rc != mergeIgnored) {
    std::string name = failed < input_.loadedFiles.size() ? input_.loadedFiles[failed].givenName : "";
    show_error(rc, kgMessageText("cannotReloadFiles", "Couldn't reload files due to problem reloading\n") +
                       shorten_path_leftmost(name, 80));
    return;
  }
  std::sort(ignored.begin(), ignored.end());
  ignored.erase(std::unique(ignored.begin(), ignored.end()), ignored.end());
  showLoadResult(rc, ignored);
  all->replace_data(std::move(data), console);
}

void KG_SumFrame::add_data_file(const std::string& path) {
  KG_SummaryOverall* all = overall();
  if (all == nullptr) return;
  BusyScope busy(*this, kgSettings().loadingKgvDataBusyMsg.c_str());
  KgvFileRef ref = makeKgvFileRef(path);
  if (findKgvFileRef(input_.loadedFiles, ref.resolvedName) >= 0) {
    show_message(OI_Severity::error, errorDialogText(duplicateFile, kgMessageText("cannotOpenFile", "Can't open requested file")) +
                                         "\nUse 'Reload all' to reread previously loaded data.");
    return;
  }
  std::unique_ptr<KgvData> added;
  ErrorCode rc = loadKgvFile(ref, added);
  if (rc != allOK) {
    if (rc != lockAborted) show_error(rc, kgMessageText("cannotOpenFile", "Can't load requested file"));
    return;
  }
  std::vector<std::string> ignored;
  std::unique_ptr<KgvData> merged;
  ConsoleMessages console;
  rc = mergeKgvDataCopy(input_.mergeMode, all->data(), *added, &ignored, console, merged);
  if ((rc != allOK && rc != mergeIgnored) || !merged) {
    show_error(rc, kgMessageText("cannotCombineData", "Couldn't combine new data with data already loaded"));
    return;
  }
  showLoadResult(rc, ignored);
  if (all->replace_data(std::move(merged), console) == allOK) input_.loadedFiles.push_back(ref);
}

void KG_SumFrame::askAndAddDataFile() {
  std::string path;
  if (askFile(kgSettings().openKgvFilePrompt.c_str(), path)) add_data_file(path);
}

void KG_SumFrame::writeKgvTo() {
  std::string path;
  KG_SummaryOverall* all = overall();
  if (all == nullptr || !askFile(kgSettings().saveKgvFilePrompt.c_str(), path)) return;
  // Instrumented programs and other viewers use the same file: written under its lock.
  ErrorCode rc = refuseNonRegularDataFile(path);
  if (rc == allOK) rc = lockKgvFile(path);
  if (rc == lockAborted) return;  // the user chose not to wait
  if (rc == allOK) {
    rc = writeKgvFile(path, all->data());
    ErrorCode unlocked = unlockKgvFile(path);
    if (rc == allOK) rc = unlocked;
  }
  if (rc != allOK) show_error(rc, "Couldn't write the file");
}

void KG_SumFrame::writeExportTo() {
  std::string path;
  KG_SummaryOverall* all = overall();
  if (all == nullptr || !askFile(kgSettings().exportKgvFilePrompt.c_str(), path)) return;
  ConsoleMessages console;
  ErrorCode rc = exportToFile(all->summary(), path, console);
  if (rc != allOK) show_error(rc, "Couldn't export");
}

ErrorCode KG_SumFrame::save_outline(const std::string& path) {
  AtomicFileWriter out;
  ErrorCode rc = out.open(path);
  if (rc != allOK) return rc;
  // The summary as shown: the heading lines, then every line of the outline with its indentation.
  for (const std::string& l : heading_lines()) fprintf(out.stream(), "%s\n", l.c_str());
  for (std::uint32_t i = 0; i < root_->total_lines(); ++i) {
    QR_OutlineObject* row = root_->object_at_line(i);
    if (row == nullptr) continue;
    const char* text = row->line_text(i - row->first_line());
    const std::string indent(display_->text_column(row->depth()), ' ');
    fprintf(out.stream(), "%s%s\n", indent.c_str(), text ? text : "");
  }
  return out.commit();
}

void KG_SumFrame::askAndSaveOutline() {
  std::string path;
  if (!askFile(kgSettings().saveOutlinePrompt.c_str(), path)) return;
  ErrorCode rc = save_outline(path);
  if (rc != allOK) show_error(rc, "File: " + path);
}

void KG_SumFrame::updateUserDefaultsFile() {
  SettingsOutcome o;
  {
    BusyScope busy(*this, nullptr);
    o = updateUserDefaults(input_.installDir);
  }
  for (const std::string& w : o.consoleWarnings) kgWarning("%s", w.c_str());
  if (o.code != allOK) show_error(o.code, o.context);
  else if (!o.notice.empty()) show_message(OI_Severity::information, o.notice);
}

void KG_SumFrame::writeViewSettingsTo() {
  std::string path;
  // The per-user defaults file is proposed: it is where the settings take effect.
  if (!oiAskFileName(kgDialogHome(), "kgFileDialog", "Kestrelgauge",
                     kgMessageText("writeXdefaultsPrompt", "Write viewer settings to file:").c_str(), userDefaultsPath(),
                     path) ||
      path.empty())
    return;
  SettingsOutcome o = writeViewSettings(path);
  for (const std::string& w : o.consoleWarnings) kgWarning("%s", w.c_str());
  if (o.code != allOK) show_error(o.code, "File: " + path + "\n" + o.context);
}

void KG_SumFrame::extract_adjustments() {
  KG_SummaryOverall* all = overall();
  if (all == nullptr) return;
  WindowQuestion question;
  ExtractionOutcome o;
  {
    BusyScope busy(*this, nullptr);
    ConsoleMessages console;
    const std::string shown = input_.sourceWindows ? input_.sourceWindows->shownPath() : std::string();
    o = extractAllAdjustments(all->summary(), shown, question, console);
  }
  if (!o.performed) return;
  all->refresh_subtree();
  if (!o.lines.empty()) noteList("Results from extraction:", o.lines);
  if (o.writeStatus != allOK) show_error(o.writeStatus, "Couldn't write the adjustments file " + adjustmentsFilePath());
  if (o.recomputeStatus != allOK) show_error(o.recomputeStatus, "Couldn't summarize information");
}
