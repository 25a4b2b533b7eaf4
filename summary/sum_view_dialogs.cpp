// The View menu's dialogs: "Column selections" (which columns the summary shows) and "Name
// style settings" (how names are shortened and how wide their column is).
#include <Xm/ToggleB.h>

#include <cstdio>
#include <memory>

#include "outline/qr_oi_scroll_text.h"
#include "settings/kg_resource.h"
#include "settings/resource_table.h"
#include "summary/kg_columns.h"
#include "summary/kg_outline_text.h"
#include "summary/name_style.h"
#include "summary/sum_frame.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_window.h"
#include "toolkit/oi_xstring.h"

namespace {

struct GroupName {
  std::uint32_t group;
  const char* widget;
  const char* title;
};

const GroupName kColumnGroups[] = {
    {kgGroupMisc, "kgMiscellaneous", "Miscellaneous"},
    {kgGroupFunctions, "kgFunctions", "Functions"},
    {kgGroupLines, "kgLines", "Actual line coverage"},
    {kgGroupAdjLines, "kgAdjLines", "Adjusted line coverage"},
    {kgGroupAdjustments, "kgAdj", "Adjustments"},
    {kgGroupBlocks, "kgBlocks", "Basic blocks"},
};

// A labelled group of controls: a frame of the part's name with its title, holding a column.
Widget titledColumn(OI_Widget& owner, Widget parent, const std::string& name, const std::string& title) {
  auto* frame = owner.own(std::make_unique<OI_Frame>(parent, name, title));
  auto* box = owner.own(std::make_unique<OI_Box>(frame->widget(), name + "Box", OI_Box::vertical));
  return box->widget();
}

}  // namespace

// ---- "Column selections"

class KG_ColumnsDialog {
 public:
  KG_ColumnsDialog(Widget parent, std::function<void()> changed)
      : dialog_(parent, "kgColumnsDialog", "Column selections"), changed_(std::move(changed)) {
    dialog_.own(std::make_unique<OI_Label>(dialog_.workArea(), "kgColumns", "Columns to display"));
    auto* row = dialog_.own(std::make_unique<OI_Box>(dialog_.workArea(), "kgColumnGroups", OI_Box::horizontal));
    for (const GroupName& g : kColumnGroups) {
      auto* group = dialog_.own(std::make_unique<OI_Box>(row->widget(), g.widget, OI_Box::vertical));
      dialog_.own(std::make_unique<OI_Label>(group->widget(), "kgColumnsSubtitle", g.title));
      auto* menu = dialog_.own(std::make_unique<OI_Box>(group->widget(), "kgColumnsSubmenu", OI_Box::vertical));
      for (const KG_Column& c : kgColumnTable()) {
        // Restricted columns are shown only by the user's own resources.
        if (c.group != g.group || c.restricted || !c.resource || !*c.resource) continue;
        auto* resource = dynamic_cast<KG_BoolResource*>(findResource(c.resource));
        if (!resource) continue;
        Widget t = XmCreateToggleButton(menu->widget(), oiStr(c.resource), nullptr, 0);
        oiLabelUnlessSet(t, c.label);
        XtManageChild(t);
        toggles_.push_back({t, resource});
        XtAddCallback(t, XmNvalueChangedCallback, toggledCB, this);
      }
    }
    dialog_.addButton({"kgOK", "OK"});
  }

  void run() {
    for (const Toggle& t : toggles_) XmToggleButtonSetState(t.widget, t.resource->value ? True : False, False);
    dialog_.run();
  }

 private:
  struct Toggle {
    Widget widget;
    KG_BoolResource* resource;
  };

  static void toggledCB(Widget w, XtPointer client, XtPointer) {
    auto* self = static_cast<KG_ColumnsDialog*>(client);
    oiGuard("column choice", [&] {
      for (const Toggle& t : self->toggles_)
        if (t.widget == w) *t.resource = XmToggleButtonGetState(w) != False;
      self->changed_();
    });
  }

  OI_CustomDialog dialog_;
  std::function<void()> changed_;
  std::vector<Toggle> toggles_;
};

// ---- "Name style settings"

class KG_NameStyleDialog {
 public:
  KG_NameStyleDialog(Widget parent, bool java, std::function<void()> applied)
      : dialog_(parent, "kgNames", "Name style settings"), applied_(std::move(applied)) {
    Widget area = dialog_.workArea();
    auto* widthRow = dialog_.own(std::make_unique<OI_Box>(area, "kgNameColumnWidthRow", OI_Box::horizontal));
    dialog_.own(std::make_unique<OI_Label>(widthRow->widget(), "kgNameColumnWidth", "Name column width"));
    width_ = dialog_.own(std::make_unique<OI_EntryField>(widthRow->widget(), "kgNameColumnWidthEntry", 3));
    width_->onActivate = [this](const std::string&) { dialog_.finish("kgOK"); };

    directories_ = choice(area, "kgDirectoryNames", "Directory names",
                          {{"kgRightSegment", "Rightmost segment"}, {"kgWholeDirectory", "Whole pathname"}});

    const char* lang = java ? "Java" : "C++";
    Widget names = titledColumn(dialog_, area, "kgC++Names", std::string(lang) + " names");
    const char* const toggles[][2] = {{"kgSuppressC++Class", "class name"},
                                      {"kgSuppressC++ArgumentList", "argument list"},
                                      {"kgSuppressC++OperatorPrefix", "operator prefix"}};
    for (const auto& t : toggles) {
      Widget w = XmCreateToggleButton(names, oiStr(t[0]), nullptr, 0);
      oiLabelUnlessSet(w, std::string("Suppress ") + lang + " " + t[1]);
      XtManageChild(w);
      suppress_.push_back(w);
    }

    const std::vector<std::pair<std::string, std::string>> ends = {{"kgLeftmost", "Leftmost portion"},
                                                                   {"kgRightmost", "Rightmost portion"}};
    longPaths_ = choice(area, "kgLongPathnames", "Long pathnames", ends);
    longFiles_ = choice(area, "kgLongFileNames", "Long file names", ends);
    longFunctions_ = choice(area, "kgLongFunctionNames", "Long function names", ends);
    dialog_.addButton({"kgOK", "OK"});
    dialog_.addButton({"kgCancel", "Cancel"});
  }

  void run() {
    setFromSettings();
    if (dialog_.run() == "kgOK") apply();
    else setFromSettings();
  }

 private:
  OI_OneOfMany* choice(Widget area, const std::string& name, const std::string& title,
                       const std::vector<std::pair<std::string, std::string>>& entries) {
    Widget box = titledColumn(dialog_, area, name, title);
    auto* c = dialog_.own(std::make_unique<OI_OneOfMany>(box, name + "Choice"));
    for (const auto& [n, label] : entries) c->addChoice(n, label);
    return c;
  }

  void setFromSettings() {
    KG_Settings& s = kgSettings();
    width_->setText(std::to_string(s.nameColumnWidth.value));
    directories_->select(s.directoryNames.value == KG_DirectoryStyleResource::rightmost ? 0 : 1);
    const bool suppressed[] = {s.suppressCplusplusClassName.value, s.suppressCplusplusArgumentList.value,
                               s.suppressCplusplusOperatorPrefix.value};
    for (size_t i = 0; i < suppress_.size(); ++i) XmToggleButtonSetState(suppress_[i], suppressed[i], False);
    longPaths_->select(s.longDirectoryNames.value == KG_NameTruncationResource::rightmost ? 1 : 0);
    longFiles_->select(s.longFileNames.value == KG_NameTruncationResource::rightmost ? 1 : 0);
    longFunctions_->select(s.longFunctionNames.value == KG_NameTruncationResource::rightmost ? 1 : 0);
  }

  void apply() {
    KG_Settings& s = kgSettings();
    s.directoryNames.set(directories_->selected() == 0 ? KG_DirectoryStyleResource::rightmost
                                                       : KG_DirectoryStyleResource::whole);
    s.suppressCplusplusClassName = XmToggleButtonGetState(suppress_[0]) != False;
    s.suppressCplusplusArgumentList = XmToggleButtonGetState(suppress_[1]) != False;
    s.suppressCplusplusOperatorPrefix = XmToggleButtonGetState(suppress_[2]) != False;
    auto end = [](OI_OneOfMany* c) {
      return c->selected() == 1 ? KG_NameTruncationResource::rightmost : KG_NameTruncationResource::leftmost;
    };
    s.longDirectoryNames.set(end(longPaths_));
    s.longFileNames.set(end(longFiles_));
    s.longFunctionNames.set(end(longFunctions_));
    unsigned width = 0;
    if (sscanf(width_->text().c_str(), "%u", &width) != 1) width = static_cast<unsigned>(s.nameColumnWidth.value);
    width = clamp_name_column_width(static_cast<long>(std::min(width, 100000u)));
    s.nameColumnWidth.value = static_cast<int>(width);
    kgSetChosenNameColumnWidth(width);
    width_->setText(std::to_string(width));
    applied_();
  }

  OI_CustomDialog dialog_;
  std::function<void()> applied_;
  OI_EntryField* width_ = nullptr;
  OI_OneOfMany* directories_ = nullptr;
  std::vector<Widget> suppress_;
  OI_OneOfMany* longPaths_ = nullptr;
  OI_OneOfMany* longFiles_ = nullptr;
  OI_OneOfMany* longFunctions_ = nullptr;
};

// ---- the frame's side

void KG_SumFrame::openColumnsDialog() {
  if (!columnsDialog_) {
    columnsDialog_ = std::make_shared<KG_ColumnsDialog>(shell(), [this] { columnsChanged(); });
  }
  columnsDialog_->run();
}

void KG_SumFrame::openNameStyleDialog() {
  if (!nameStyleDialog_) {
    const bool java = overall() && overall()->data().header.isJava != 0;
    nameStyleDialog_ = std::make_shared<KG_NameStyleDialog>(shell(), java, [this] { rebuild_rows_and_headings(); });
  }
  nameStyleDialog_->run();
}

void KG_SumFrame::columnsChanged() {
  const std::uint32_t width = kgShownWidth(kgShownColumns());
  title_->text()->setColumns(static_cast<int>(width));
  outline_->text()->setColumns(static_cast<int>(width));
  rebuild_rows_and_headings();
}
