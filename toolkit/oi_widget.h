// The base of the toolkit's C++ objects: one Xt widget, named by its caller, with shared helpers.
#pragma once

#include <X11/Intrinsic.h>

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

class OI_Widget {
 public:
  virtual ~OI_Widget();
  OI_Widget(const OI_Widget&) = delete;
  OI_Widget& operator=(const OI_Widget&) = delete;

  // Null once Xt has destroyed the widget (for example with its parent).
  Widget widget() const { return widget_; }
  const std::string& name() const { return name_; }
  Display* display() const;

  void manage();
  void unmanage();
  bool isManaged() const;
  void setSensitive(bool on);
  bool isSensitive() const;
  // Whether the widget's window is on screen.
  bool isViewable() const;

  // The label string of Motif labels, buttons and cascades.
  void setLabel(const std::string& text);
  std::string label() const;

  // Merges a translation table ("#override" is implied) over the widget's own.
  void overrideTranslations(const std::string& table);
  // Gives the keyboard focus to this widget within its window.
  void takeFocus();

  // A string resource of this widget's full name that is no widget resource ("cells",
  // "label", ...); empty when the database has none.
  std::string resourceString(const char* name, const char* cls = nullptr) const;

  // Takes ownership of a child object, which then lives as long as this one.
  template <class T>
  T* own(std::unique_ptr<T> child) {
    T* raw = child.get();
    owned_.push_back(std::move(child));
    return raw;
  }

  // The object that wraps a widget, or null.
  static OI_Widget* fromWidget(Widget w);
  // The nearest wrapped ancestor (or the widget itself).
  static OI_Widget* enclosing(Widget w);

  // For the test hook: a line of state beyond the common one (label, value, lines...).
  virtual void describe(std::ostream& out) const;

 protected:
  OI_Widget() = default;
  // Makes `w` this object's widget and notices when Xt destroys it.
  void adopt(Widget w, const std::string& name);
  // Called when Xt destroys the widget; widget() is null afterwards.
  virtual void widgetDestroyed() {}

 private:
  static void destroyedCB(Widget w, XtPointer client, XtPointer call);
  Widget widget_ = nullptr;
  std::string name_;
  std::vector<std::unique_ptr<OI_Widget>> owned_;
};

// Gives a Motif label or button the built-in text unless a "labelString" resource names one.
void oiLabelUnlessSet(Widget w, const std::string& label);

// Runs a callback body so that no C++ exception unwinds through Xt: a throw is reported on
// standard error and the event is dropped.
void oiGuard(const char* where, const std::function<void()>& body);
