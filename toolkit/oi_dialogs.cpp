// Modal dialogs with local event loops.
#include "toolkit/oi_dialogs.h"

#include <Xm/FileSB.h>
#include <Xm/Label.h>
#include <Xm/List.h>
#include <Xm/MessageB.h>
#include <Xm/Protocols.h>
#include <Xm/PushB.h>
#include <Xm/RowColumn.h>

#include <memory>

#include "toolkit/oi_application.h"
#include "toolkit/oi_window.h"
#include "toolkit/oi_xstring.h"

namespace {

// The state of one wait for an answer.
struct Wait {
  std::string answer;
  bool done = false;
};

// What a button's callback needs: the wait it ends and its answer.
struct ButtonTag {
  Wait* wait;
  std::string name;
};

void buttonCB(Widget, XtPointer client, XtPointer) {
  auto* tag = static_cast<ButtonTag*>(client);
  tag->wait->answer = tag->name;
  tag->wait->done = true;
}

void closedCB(Widget, XtPointer client, XtPointer) {
  auto* wait = static_cast<Wait*>(client);
  wait->answer.clear();
  wait->done = true;
}

unsigned char dialogType(OI_Severity s) {
  switch (s) {
    case OI_Severity::error: return XmDIALOG_ERROR;
    case OI_Severity::warning: return XmDIALOG_WARNING;
    case OI_Severity::information: return XmDIALOG_INFORMATION;
    case OI_Severity::question: return XmDIALOG_QUESTION;
    case OI_Severity::plain: break;
  }
  return XmDIALOG_MESSAGE;
}

Widget makeTemplate(Widget parent, const std::string& name, const std::string& title, OI_Severity severity) {
  OI_XmString t(title);
  Arg args[4];
  int n = 0;
  XtSetArg(args[n], XmNdialogStyle, XmDIALOG_FULL_APPLICATION_MODAL), ++n;
  XtSetArg(args[n], XmNautoUnmanage, False), ++n;
  XtSetArg(args[n], XmNdialogTitle, static_cast<XmString>(t)), ++n;
  XtSetArg(args[n], XmNnoResize, False), ++n;
  Widget d = XmCreateTemplateDialog(parent, oiStr(name.c_str()), args, n);
  XtVaSetValues(d, XmNdialogType, dialogType(severity), nullptr);
  return d;
}

// Runs the event loop until the wait ends (or the application quits).
void waitFor(Widget dialog, Wait& wait) {
  Atom del = XmInternAtom(XtDisplay(dialog), oiStr("WM_DELETE_WINDOW"), False);
  XmAddWMProtocolCallback(XtParent(dialog), del, closedCB, &wait);
  XtManageChild(dialog);
  OI_Application* app = OI_Application::instance();
  while (!wait.done && !app->quitting()) app->processOne();
  XtUnmanageChild(dialog);
  XmRemoveWMProtocolCallback(XtParent(dialog), del, closedCB, &wait);
}

Widget parentOrShell(Widget parent) {
  if (parent) return parent;
  OI_Application* app = OI_Application::instance();
  return app->topLevels().empty() ? app->shell() : app->topLevels().front();
}

}  // namespace

std::string oiWrapText(const std::string& text, size_t width) {
  std::string out;
  size_t start = 0;
  while (start <= text.size()) {
    size_t nl = text.find('\n', start);
    std::string para = text.substr(start, nl == std::string::npos ? std::string::npos : nl - start);
    std::string cur;
    size_t i = 0;
    while (i < para.size()) {
      size_t sp = para.find(' ', i);
      std::string word = para.substr(i, sp == std::string::npos ? std::string::npos : sp - i);
      if (!cur.empty() && cur.size() + 1 + word.size() > width) {
        out += cur + "\n";
        cur = word;
      } else {
        cur += (cur.empty() ? "" : " ") + word;
      }
      if (sp == std::string::npos) break;
      i = sp + 1;
    }
    out += cur;
    if (nl == std::string::npos) break;
    out += "\n";
    start = nl + 1;
  }
  return out;
}

// ------------------------------------------------------------------ message dialog

OI_MessageDialog::OI_MessageDialog(Widget parent, const std::string& name, const std::string& title,
                                   OI_Severity severity, const OI_DialogButton& button) {
  Widget d = makeTemplate(parentOrShell(parent), name, title, severity);
  adopt(d, name);
  Widget b = XmCreatePushButton(d, oiStr(button.name.c_str()), nullptr, 0);
  oiLabelUnlessSet(b, button.label);
  XtManageChild(b);
  XtVaSetValues(d, XmNdefaultButton, b, nullptr);
}

std::string OI_MessageDialog::show(const std::string& text) {
  Widget d = widget();
  if (!d) return {};
  OI_XmString s(text);
  XtVaSetValues(d, XmNmessageString, static_cast<XmString>(s), nullptr);
  Wait wait;
  std::vector<std::unique_ptr<ButtonTag>> tags;
  WidgetList kids = nullptr;
  Cardinal n = 0;
  XtVaGetValues(d, XmNchildren, &kids, XmNnumChildren, &n, nullptr);
  std::vector<Widget> buttons;
  for (Cardinal i = 0; i < n; ++i)
    if (XmIsPushButton(kids[i])) buttons.push_back(kids[i]);
  for (Widget b : buttons) {
    tags.push_back(std::make_unique<ButtonTag>(ButtonTag{&wait, XtName(b)}));
    XtAddCallback(b, XmNactivateCallback, buttonCB, tags.back().get());
  }
  waitFor(d, wait);
  for (size_t i = 0; i < buttons.size(); ++i) XtRemoveCallback(buttons[i], XmNactivateCallback, buttonCB, tags[i].get());
  oiRestoreFocus(XtParent(d));
  return wait.answer;
}

void OI_MessageDialog::describe(std::ostream& out) const {
  XmString s = nullptr;
  if (widget()) XtVaGetValues(widget(), XmNmessageString, &s, nullptr);
  std::string text = oiXmStringText(s);
  if (s) XmStringFree(s);
  for (char& c : text)
    if (c == '\n') c = '|';
  out << " message=\"" << text << "\"\n";
}

// ------------------------------------------------------------------ custom dialog

struct OI_CustomDialog::Wait : ::Wait {};

OI_CustomDialog::OI_CustomDialog(Widget parent, const std::string& name, const std::string& title) {
  Widget d = makeTemplate(parentOrShell(parent), name, title, OI_Severity::plain);
  adopt(d, name);
  Arg args[1];
  XtSetArg(args[0], XmNorientation, XmVERTICAL);
  work_ = XmCreateRowColumn(d, oiStr((name + "Work").c_str()), args, 1);
  XtManageChild(work_);
}

void OI_CustomDialog::addButton(const OI_DialogButton& button) {
  if (!widget()) return;
  Widget b = XmCreatePushButton(widget(), oiStr(button.name.c_str()), nullptr, 0);
  oiLabelUnlessSet(b, button.label);
  XtManageChild(b);
  if (buttons_.empty()) XtVaSetValues(widget(), XmNdefaultButton, b, nullptr);
  buttons_.push_back(b);
}

std::string OI_CustomDialog::run() {
  Widget d = widget();
  if (!d) return {};
  Wait wait;
  running_ = &wait;
  std::vector<std::unique_ptr<ButtonTag>> tags;
  for (Widget b : buttons_) {
    tags.push_back(std::make_unique<ButtonTag>(ButtonTag{&wait, XtName(b)}));
    XtAddCallback(b, XmNactivateCallback, buttonCB, tags.back().get());
  }
  waitFor(d, wait);
  running_ = nullptr;
  for (size_t i = 0; i < buttons_.size(); ++i) XtRemoveCallback(buttons_[i], XmNactivateCallback, buttonCB, tags[i].get());
  oiRestoreFocus(XtParent(d));
  return wait.answer;
}

void OI_CustomDialog::finish(const std::string& answer) {
  if (!running_) return;
  running_->answer = answer;
  running_->done = true;
}

// ------------------------------------------------------------------ questions

std::string oiAsk(Widget parent, const std::string& dialogName, const std::string& title, const std::string& text,
                  const std::vector<OI_DialogButton>& buttons, OI_Severity severity) {
  Widget d = makeTemplate(parentOrShell(parent), dialogName, title, severity);
  {
    OI_XmString s(text);
    XtVaSetValues(d, XmNmessageString, static_cast<XmString>(s), nullptr);
  }
  Wait wait;
  std::vector<std::unique_ptr<ButtonTag>> tags;
  for (const auto& b : buttons) {
    Widget w = XmCreatePushButton(d, oiStr(b.name.c_str()), nullptr, 0);
    oiLabelUnlessSet(w, b.label);
    tags.push_back(std::make_unique<ButtonTag>(ButtonTag{&wait, b.name}));
    XtAddCallback(w, XmNactivateCallback, buttonCB, tags.back().get());
    XtManageChild(w);
    if (tags.size() == 1) XtVaSetValues(d, XmNdefaultButton, w, nullptr);
  }
  waitFor(d, wait);
  Widget shell = XtParent(d);
  oiRestoreFocus(XtParent(shell));
  XtDestroyWidget(shell);
  return wait.answer;
}

// ------------------------------------------------------------------ file dialog

namespace {
struct FileWait {
  Wait wait;
  std::string value;
};

void fileOkCB(Widget, XtPointer client, XtPointer call) {
  auto* fw = static_cast<FileWait*>(client);
  auto* cb = static_cast<XmFileSelectionBoxCallbackStruct*>(call);
  fw->value = oiXmStringText(cb->value);
  fw->wait.answer = "ok";
  fw->wait.done = true;
}

void fileCancelCB(Widget, XtPointer client, XtPointer) {
  auto* fw = static_cast<FileWait*>(client);
  fw->wait.answer = "cancel";
  fw->wait.done = true;
}
}  // namespace

bool oiAskFileName(Widget parent, const std::string& dialogName, const std::string& title, const std::string& prompt,
                   const std::string& initial, std::string& chosen) {
  OI_XmString t(title), p(prompt);
  Arg args[4];
  int n = 0;
  XtSetArg(args[n], XmNdialogStyle, XmDIALOG_FULL_APPLICATION_MODAL), ++n;
  XtSetArg(args[n], XmNautoUnmanage, False), ++n;
  XtSetArg(args[n], XmNdialogTitle, static_cast<XmString>(t)), ++n;
  XtSetArg(args[n], XmNselectionLabelString, static_cast<XmString>(p)), ++n;
  Widget d = XmCreateFileSelectionDialog(parentOrShell(parent), oiStr(dialogName.c_str()), args, n);
  XtUnmanageChild(XmFileSelectionBoxGetChild(d, XmDIALOG_HELP_BUTTON));
  // In the name field Home and End move in the typed text instead of replacing it with a
  // name from the list.
  if (Widget field = XmFileSelectionBoxGetChild(d, XmDIALOG_TEXT)) {
    XtTranslations t = XtParseTranslationTable(
        "#override\n<Key>osfBeginLine: beginning-of-line()\n<Key>osfEndLine: end-of-line()\n");
    if (t) XtOverrideTranslations(field, t);
  }
  if (!initial.empty()) {
    OI_XmString v(initial);
    XtVaSetValues(d, XmNdirSpec, static_cast<XmString>(v), nullptr);
  }
  FileWait fw;
  XtAddCallback(d, XmNokCallback, fileOkCB, &fw);
  XtAddCallback(d, XmNcancelCallback, fileCancelCB, &fw);
  waitFor(d, fw.wait);
  Widget shell = XtParent(d);
  oiRestoreFocus(XtParent(shell));
  XtDestroyWidget(shell);
  if (fw.wait.answer != "ok" || fw.value.empty()) return false;
  chosen = fw.value;
  return true;
}

// ------------------------------------------------------------------ note list

void oiShowNoteList(Widget parent, const std::string& dialogName, const std::string& title, const std::string& heading,
                    const std::vector<std::string>& items, const OI_DialogButton& button) {
  Widget d = makeTemplate(parentOrShell(parent), dialogName, title, OI_Severity::information);
  Widget box = XmCreateRowColumn(d, oiStr("noteBox"), nullptr, 0);
  Widget label = XmCreateLabel(box, oiStr("noteHeading"), nullptr, 0);
  {
    OI_XmString h(heading);
    XtVaSetValues(label, XmNlabelString, static_cast<XmString>(h), XmNalignment, XmALIGNMENT_BEGINNING, nullptr);
  }
  XtManageChild(label);
  Arg args[2];
  XtSetArg(args[0], XmNvisibleItemCount, std::min<int>(std::max<int>(static_cast<int>(items.size()), 3), 12));
  XtSetArg(args[1], XmNscrollBarDisplayPolicy, XmAS_NEEDED);
  Widget list = XmCreateScrolledList(box, oiStr("noteList"), args, 2);
  for (const auto& i : items) {
    OI_XmString s(i);
    XmListAddItemUnselected(list, s, 0);
  }
  XtManageChild(list);
  XtManageChild(box);
  Wait wait;
  ButtonTag tag{&wait, button.name};
  Widget b = XmCreatePushButton(d, oiStr(button.name.c_str()), nullptr, 0);
  oiLabelUnlessSet(b, button.label);
  XtAddCallback(b, XmNactivateCallback, buttonCB, &tag);
  XtManageChild(b);
  XtVaSetValues(d, XmNdefaultButton, b, nullptr);
  waitFor(d, wait);
  Widget shell = XtParent(d);
  oiRestoreFocus(XtParent(shell));
  XtDestroyWidget(shell);
}
