// The main window: menus, toolbar, headings over the summary outline, the busy box and the
// data operations of its File menu.
#pragma once

#include <X11/Intrinsic.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "coverage/kgv_file_ref.h"
#include "coverage/summary_types.h"
#include "summary/main_window.h"
#include "support/errors.h"

class KG_ColumnsDialog;
class KG_NameStyleDialog;
class KG_OutlineRoot;
class KG_SummaryOverall;
class KG_Toolbar;
class OI_Button;
class OI_GridBox;
class OI_Label;
class OI_Menu;
class OI_MenuCell;
class OI_TopLevel;
class QR_OI_OutlineDisplay;
class QR_OI_ScrollText;
class QR_OI_ScrollTextGang;

class KG_SumFrame {
 public:
  // The installation, file list and merge mode of the input stay the caller's; the frame
  // adds to the file list as the user opens more data files.
  explicit KG_SumFrame(MainWindowInput& input);
  ~KG_SumFrame();
  KG_SumFrame(const KG_SumFrame&) = delete;
  KG_SumFrame& operator=(const KG_SumFrame&) = delete;

  // Builds the window in its order; on failure the error's text is in `error`.
  ErrorCode build(std::string& error);
  // The overall row for the data, added to the root and expanded.
  void showData(std::unique_ptr<KgvData> data, std::unique_ptr<SumRoot> summary);
  void show();

  // The busy box in place of the outline, with the toolkit's busy state.
  void begin_busy(const char* message);
  void end_busy();
  bool busy() const { return busy_; }

  // Rows, headings, stripes and widths again (columns, widths or separators changed).
  void rebuild_rows_and_headings();
  void set_sort_order(std::uint32_t order);
  void set_stripes(int setting);
  void set_toolbar_visible(bool on);
  // The View menu's dialogs.
  void openColumnsDialog();
  void openNameStyleDialog();
  const std::string& install_dir() const;
  // The data files shown, with the times they were loaded.
  std::vector<KgvFileRef>& loaded_files();
  // The File menu's data operations.
  void reload_all();
  void add_data_file(const std::string& path);
  ErrorCode save_outline(const std::string& path);
  void extract_adjustments();
  // Ends the viewer: the per-user defaults file from its template, then the event loop.
  void exit_viewer();

  // Lines of the outline and of the headings as the user sees them.
  std::vector<std::string> heading_lines() const;
  KG_OutlineRoot* root() const { return root_.get(); }
  KG_SummaryOverall* overall() const;
  OI_TopLevel* window() const { return window_.get(); }
  Widget shell() const;
  QR_OI_OutlineDisplay* outline_display() const { return display_; }

 private:
  void buildMenus();
  void buildFileMenu(OI_Menu* file);
  void buildViewMenu(OI_Menu* view);
  void buildActions(OI_Menu* actions);
  void buildHelpMenu();
  void buildDebugMenu(OI_Menu* debug);
  void columnsChanged();
  void showRowNameAt(int y);
  void buildPopup();
  void perform(const std::string& actionString);
  void placeHeadings();
  void updateToolbarToggleLabel();
  void startChangeRequest();
  void refreshAllWindows();
  void updateUserDefaultsFile();
  void writeViewSettingsTo();
  void writeKgvTo();
  void writeExportTo();
  void askAndAddDataFile();
  void askAndSaveOutline();
  void showVersion();
  void startTimings();

  MainWindowInput& input_;
  std::unique_ptr<OI_TopLevel> window_;
  OI_GridBox* workArea_ = nullptr;
  KG_Toolbar* toolbar_ = nullptr;
  OI_GridBox* gangContainer_ = nullptr;
  QR_OI_ScrollTextGang* gang_ = nullptr;
  QR_OI_ScrollText* title_ = nullptr;
  QR_OI_ScrollText* outline_ = nullptr;
  OI_GridBox* busyBox_ = nullptr;
  OI_Label* busyLabel_ = nullptr;
  OI_Label* rowName_ = nullptr;  // the full name of the row under the pointer
  const void* rowNameOf_ = nullptr;
  OI_Menu* popup_ = nullptr;
  OI_Menu* sortMenu_ = nullptr;
  OI_Menu* stripeMenu_ = nullptr;
  OI_MenuCell* toolbarToggle_ = nullptr;
  QR_OI_OutlineDisplay* display_ = nullptr;  // owned by the root
  std::unique_ptr<KG_OutlineRoot> root_;
  std::shared_ptr<KG_ColumnsDialog> columnsDialog_;
  std::shared_ptr<KG_NameStyleDialog> nameStyleDialog_;
  bool busy_ = false;
  bool settingMenus_ = false;  // the program sets a menu: its callback does nothing
};
