// Top-level windows: a shell with a main window (menu bar and work area), a close callback,
// a resize callback, a minimum size, and the widget that gets the keyboard focus back.
#pragma once

#include <functional>
#include <string>

#include "toolkit/oi_widget.h"
#include "toolkit/oi_x_resources.h"

class OI_MenuBar;

class OI_TopLevel : public OI_Widget {
 public:
  OI_TopLevel(const std::string& name, const std::string& title);
  ~OI_TopLevel() override;

  // The parent for the window's contents (an XmMainWindow named "mainWindow").
  Widget mainWindow() const { return main_; }
  // The menu bar, made on first use.
  OI_MenuBar* menuBar(const std::string& name);
  void setWorkArea(Widget w);

  void setTitle(const std::string& title);
  // The name the window manager shows for the window's icon.
  void setIconName(const std::string& name);
  // The window's icon, from X bitmap bits.
  void setIcon(const unsigned char* bits, int width, int height);
  // In front of the other windows.
  void raise();
  void setMinSize(int width, int height);
  void show();
  void hide();
  bool isShown() const { return shown_; }
  // Asks every window to draw itself again.
  void refresh();

  // The window manager's close button; the window stays open unless the callback closes it.
  std::function<void()> onClose;
  // The window's size changed (width, height).
  std::function<void(int, int)> onResize;

  // The widget that takes the keyboard focus after menus, option menus and buttons are used.
  void setFocusHome(OI_Widget* w);

 protected:
  void widgetDestroyed() override;

 private:
  static void closeCB(Widget, XtPointer, XtPointer);
  static void structureHandler(Widget, XtPointer, XEvent*, Boolean*);
  Widget shell_ = nullptr;  // kept to unregister the window once Xt destroyed it
  Widget main_ = nullptr;
  OI_MenuBar* menuBar_ = nullptr;
  bool shown_ = false;
  OI_Pixmap icon_;
  int lastW_ = 0, lastH_ = 0;
};

// Puts the keyboard focus back on the focus home of the window holding `w`, if it has one.
void oiRestoreFocus(Widget w);
