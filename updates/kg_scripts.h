// The scripts menu and the "Run script..." dialog, and the windows that show what a script
// printed.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "summary/script_runner.h"
#include "toolkit/oi_application.h"

class OI_CustomDialog;
class OI_EntryField;
class OI_MultiText;
class OI_OptionMenu;
class OI_TopLevel;

// One script's output: "kgScriptOutput", its text, "Save as..." and "Close".
class KG_FileViewer {
 public:
  KG_FileViewer(const std::string& title, const std::string& text);
  ~KG_FileViewer();
  KG_FileViewer(const KG_FileViewer&) = delete;
  KG_FileViewer& operator=(const KG_FileViewer&) = delete;

  void show();
  // Asks for a file until one can be written or the user cancels, and writes the text.
  void saveAs();
  // Set by the owner: the window asks to go (Close, or the window manager).
  std::function<void(KG_FileViewer&)> onClose;

 private:
  std::unique_ptr<OI_TopLevel> window_;
  OI_MultiText* text_ = nullptr;
  std::string contents_;
};

// "kgRunScript": the script and its arguments.
class KG_ScriptDialogBox {
 public:
  KG_ScriptDialogBox(Widget parent, const std::vector<std::string>& scripts);
  ~KG_ScriptDialogBox();
  KG_ScriptDialogBox(const KG_ScriptDialogBox&) = delete;
  KG_ScriptDialogBox& operator=(const KG_ScriptDialogBox&) = delete;

  // Shows the dialog modally; true when confirmed (OK or Return in the field).
  bool run();
  std::string script() const;
  std::string arguments() const;

 private:
  std::unique_ptr<OI_CustomDialog> dialog_;
  OI_OptionMenu* menu_ = nullptr;
  OI_EntryField* args_ = nullptr;
};

class KG_Scripts : public KG_ScriptRunner {
 public:
  KG_Scripts();
  ~KG_Scripts() override;
  ErrorCode build(KG_SumFrame& frame, std::string& error) override;
  void run() override;
  void closeAll() override;

 private:
  void close(KG_FileViewer& viewer);

  KG_SumFrame* frame_ = nullptr;
  std::string scriptsDir_;
  std::unique_ptr<KG_ScriptDialogBox> dialog_;
  std::vector<std::unique_ptr<KG_FileViewer>> viewers_;
  std::vector<std::unique_ptr<KG_FileViewer>> closed_;
  OI_TimerHandle later_;
};
