// Menus: the menu bar, pulldown and popup menus with push, check and cascade cells, separators,
// accelerators, and option menus.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "toolkit/oi_widget.h"

class OI_Menu;

// One cell of a menu: a push button, or a check item when made with addCheck.
class OI_MenuCell : public OI_Widget {
 public:
  OI_MenuCell(Widget menu, const std::string& name, const std::string& label, bool check);
  bool isCheck() const { return check_; }
  bool state() const;
  void setState(bool on);  // does not call the callback
  // As if the user had chosen the cell (insensitive cells do nothing).
  void fire();
  // Accelerator in translation syntax ("Ctrl<Key>O") and the text shown beside the label.
  void setAccelerator(const std::string& accelerator, const std::string& text);

  std::function<void()> onActivate;        // push cells
  std::function<void(bool)> onToggle;      // check cells

 private:
  static void activateCB(Widget, XtPointer, XtPointer);
  void readAcceleratorResource();
  bool check_;
};

// A pulldown or popup menu pane.
class OI_Menu : public OI_Widget {
 public:
  enum Kind { pulldown, popup };
  OI_Menu(Widget parent, const std::string& name, Kind kind);

  // `label` is the built-in text; a "labelString" resource for the cell's name wins.
  OI_MenuCell* addCell(const std::string& name, const std::string& label, std::function<void()> fn = {});
  OI_MenuCell* addCheck(const std::string& name, const std::string& label, bool set,
                        std::function<void(bool)> fn = {});
  void addSeparator(const std::string& name = "separator");
  // A cascade cell named `name` opening a submenu pane named `paneName`.
  OI_Menu* addSubmenu(const std::string& name, const std::string& label, const std::string& paneName);
  // A title line (popup menus).
  void addTitle(const std::string& name, const std::string& label);
  // Check cells behave as one choice among several.
  void setRadio(bool on);

  OI_MenuCell* cell(const std::string& name) const;
  const std::vector<OI_MenuCell*>& cells() const { return cells_; }
  // The cascade that opens this pane (null for popups).
  Widget cascade() const { return cascade_; }

  // Pops a popup menu up at the pointer of a button event.
  void popupAt(XEvent* ev);

 private:
  friend class OI_MenuBar;
  Kind kind_;
  Widget cascade_ = nullptr;
  std::vector<OI_MenuCell*> cells_;
};

class OI_MenuBar : public OI_Widget {
 public:
  OI_MenuBar(Widget parent, const std::string& name);
  // A cascade `name` with `label` on the bar and its pane `paneName`.
  OI_Menu* addPulldown(const std::string& name, const std::string& label, const std::string& paneName);
  // The pulldown that sits at the right end (Help).
  void setHelpPulldown(OI_Menu* menu);
  OI_Menu* pulldown(const std::string& name) const;

 private:
  std::vector<OI_Menu*> menus_;
};

// An option menu: a labelled button showing one choice of several.
class OI_OptionMenu : public OI_Widget {
 public:
  OI_OptionMenu(Widget parent, const std::string& name, const std::string& label);
  void addChoice(const std::string& name, const std::string& label);
  void setChoice(const std::string& name);  // does not call the callback
  std::string choice() const;
  // Long lists of choices in columns of that many.
  void setColumnLength(int length);
  std::function<void(const std::string&)> onChange;
  void describe(std::ostream& out) const override;

 private:
  static void chosenCB(Widget, XtPointer, XtPointer);
  Widget pane_ = nullptr;
  std::vector<std::pair<std::string, Widget>> choices_;
};

// Splits "Ctrl<Key>O: fire()" into the accelerator "Ctrl<Key>O" and the text "Ctrl+O".
bool oiParseAccelerator(const std::string& binding, std::string& accelerator, std::string& text);
