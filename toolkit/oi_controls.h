// Plain controls: row/column boxes, labels, buttons (text or 32x32 icon), entry fields, frames,
// scrolled lists and separators.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "toolkit/oi_widget.h"
#include "toolkit/oi_x_resources.h"

// Children in one row or one column.
class OI_Box : public OI_Widget {
 public:
  enum Direction { horizontal, vertical };
  OI_Box(Widget parent, const std::string& name, Direction dir);
  void setSpacing(int pixels);
};

class OI_Label : public OI_Widget {
 public:
  // `text` is the built-in label; a "labelString" resource for the name wins.
  OI_Label(Widget parent, const std::string& name, const std::string& text);
};

class OI_Separator : public OI_Widget {
 public:
  OI_Separator(Widget parent, const std::string& name, bool vertical = false);
};

class OI_Button : public OI_Widget {
 public:
  OI_Button(Widget parent, const std::string& name, const std::string& label, std::function<void()> fn = {});
  // Shows an icon made from X bitmap bits (for example 32x32) in the button's colours.
  void setIcon(const unsigned char* bits, int width, int height);
  void setBevelWidth(int pixels);
  // The tip shown when the pointer rests on the button, unless a "toolTipString" resource
  // names one.
  void setToolTip(const std::string& text);
  // As if the user had pressed it (insensitive buttons do nothing).
  void press();
  std::function<void()> onActivate;

 private:
  static void activateCB(Widget, XtPointer, XtPointer);
  OI_Pixmap icon_;
};

class OI_EntryField : public OI_Widget {
 public:
  OI_EntryField(Widget parent, const std::string& name, int columns = 20);
  std::string text() const;
  void setText(const std::string& text);
  // Return pressed in the field.
  std::function<void(const std::string&)> onActivate;
  void describe(std::ostream& out) const override;

 private:
  static void activateCB(Widget, XtPointer, XtPointer);
};

class OI_Frame : public OI_Widget {
 public:
  // With a title label when `title` is not empty.
  OI_Frame(Widget parent, const std::string& name, const std::string& title = {});
};

// One of several choices, as toggle buttons of which exactly one is set.
class OI_OneOfMany : public OI_Widget {
 public:
  OI_OneOfMany(Widget parent, const std::string& name);
  // A choice (a toggle button of that name); `label` unless a "labelString" resource says.
  void addChoice(const std::string& name, const std::string& label);
  // The set choice's index, -1 when none is.
  int selected() const;
  void select(int index);

 private:
  std::vector<Widget> choices_;
};

class OI_ScrolledList : public OI_Widget {
 public:
  // With `columns`, the list keeps the width of that many characters of its font whatever
  // its items; otherwise it follows its widest item.
  OI_ScrolledList(Widget parent, const std::string& name, int visibleItems = 8, int columns = 0);
  void setItems(const std::vector<std::string>& items);
  std::vector<std::string> items() const;
  // -1 when nothing is selected.
  int selectedIndex() const;
  void select(int index);  // does not call the callbacks
  std::function<void(int)> onSelect;         // single click
  std::function<void(int)> onDefaultAction;  // double click or Return
  void describe(std::ostream& out) const override;

 private:
  static void selectCB(Widget, XtPointer, XtPointer);
  static void defaultCB(Widget, XtPointer, XtPointer);
};
