// Message, question and note-list dialogs of the viewer, built on the toolkit's dialogs.
#include "summary/sum_dialogs.h"

#include <Xm/Xm.h>
#include <Xm/Frame.h>
#include <Xm/Label.h>
#include <Xm/List.h>
#include <Xm/MessageB.h>
#include <Xm/PushB.h>
#include <Xm/RowColumn.h>

#include <map>
#include <memory>

#include "coverage/kgv_lock.h"
#include "settings/resource_table.h"
#include "summary/kg_outline_text.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_xstring.h"

namespace {

Widget gHome = nullptr;

Widget parentOr(Widget parent) {
  if (parent != nullptr) return parent;
  if (gHome != nullptr) return gHome;
  OI_Application* app = OI_Application::instance();
  return app != nullptr ? app->shell() : nullptr;
}

struct DialogSpec {
  const char* name;
  const char* title;
};

DialogSpec specFor(OI_Severity s) {
  switch (s) {
    case OI_Severity::error: return {"kgErrorDialog", "Error"};
    case OI_Severity::warning: return {"kgWarningDialog", "Warning"};
    default: return {"kgInformationDialog", "Information"};
  }
}

// Made once per severity and parent; the toolkit object lives as long as its widget.
std::map<std::pair<int, Widget>, OI_MessageDialog*>& dialogs() {
  static std::map<std::pair<int, Widget>, OI_MessageDialog*> d;
  return d;
}

void dialogGone(Widget, XtPointer client, XtPointer) {
  std::unique_ptr<std::pair<int, Widget>> key(static_cast<std::pair<int, Widget>*>(client));
  dialogs().erase(*key);
}

}  // namespace

void kgSetDialogHome(Widget shell) {
  gHome = shell;
  if (shell == nullptr) dialogs().clear();
}
Widget kgDialogHome() { return parentOr(nullptr); }

void show_message(OI_Severity severity, const std::string& text, Widget parent) {
  Widget p = parentOr(parent);
  if (p == nullptr) return;
  if (severity != OI_Severity::error && severity != OI_Severity::warning) severity = OI_Severity::information;
  auto key = std::make_pair(static_cast<int>(severity), p);
  OI_MessageDialog*& d = dialogs()[key];
  if (d == nullptr) {
    DialogSpec s = specFor(severity);
    d = new OI_MessageDialog(p, s.name, s.title, severity);
    // The toolkit object is freed with its widget; the table forgets it then.
    // The callback's copy of the key is its own, freed when it runs.
    auto gone = std::make_unique<std::pair<int, Widget>>(key);
    XtAddCallback(d->widget(), XmNdestroyCallback, dialogGone, gone.release());
    OI_Widget* owner = OI_Widget::enclosing(p);
    if (owner != nullptr) {
      owner->own(std::unique_ptr<OI_MessageDialog>(d));
    }
  }
  d->show(text);
}

std::string errorDialogText(ErrorCode code, const std::string& text) {
  return text + ":\n " + oiWrapText(errorMessage(code), 60);
}

void show_error(ErrorCode code, const std::string& text, Widget parent) {
  show_message(OI_Severity::error, errorDialogText(code, text), parent);
}

std::string ask(const std::string& text, Widget parent, const std::string& title,
                const std::vector<OI_DialogButton>& buttons) {
  Widget p = parentOr(parent);
  if (p == nullptr) return buttons.empty() ? std::string() : buttons.back().name;
  return oiAsk(p, "kgQuestionDialog", title, text, buttons);
}

int ask_save(const std::string& text, AskSaveKind kind, Widget parent) {
  std::string question;
  std::vector<OI_DialogButton> buttons;
  switch (kind) {
    case AskSaveKind::exiting:
      question = kgMessageText("saveBeforeExiting", "Save before exiting?");
      buttons = {{"kgSaveAndExit", "Save and exit..."}, {"kgExitOnly", "Exit"}, {"kgCancel", "Cancel"}};
      break;
    case AskSaveKind::closing:
      question = kgMessageText("saveBeforeClosing", "Save before closing windown?");
      buttons = {{"kgSaveAndClose", "Save and close window"}, {"kgCloseOnly", "Close window"},
                 {"kgCancel", "Cancel"}};
      break;
    case AskSaveKind::updating:
      question = kgMessageText("saveBeforeUpdating", "Save before updating windown?");
      buttons = {{"kgSaveAndReload", "Save before updating window..."}, {"kgReloadOnly", "Update window"},
                 {"kgCancel", "Cancel"}};
      break;
  }
  const std::string answer = ask(text + "\n" + question, parent, "Save modifications?", buttons);
  if (answer == buttons[0].name) return 3;
  if (answer == buttons[1].name) return 2;
  return 0;
}

std::string continueQuestionText(const std::string& text) {
  return text + "\n" + kgMessageText("continueAnyWay", "Continue anyway?");
}

bool ask_continue(const std::string& text, Widget parent) {
  return ask(continueQuestionText(text), parent, "OK to continue?",
             {{"kgContinue", "Continue"}, {"kgCancel", "Cancel"}}) == "kgContinue";
}

// ---- the note list

namespace {

struct NoteList {
  Widget dialog = nullptr;
  Widget banner = nullptr;
  Widget list = nullptr;
};

NoteList gNotes;

void noteOkCB(Widget, XtPointer, XtPointer) {
  if (gNotes.dialog != nullptr) XtUnmanageChild(gNotes.dialog);
}

void noteGoneCB(Widget, XtPointer, XtPointer) { gNotes = NoteList{}; }

}  // namespace

void noteList(const std::string& banner, const std::vector<std::string>& messages, bool separate, Widget parent) {
  Widget p = parentOr(parent);
  if (p == nullptr) return;
  if (gNotes.dialog == nullptr) {
    OI_XmString title("Take Note");
    Arg args[3];
    int n = 0;
    XtSetArg(args[n], XmNdialogTitle, static_cast<XmString>(title)), ++n;
    XtSetArg(args[n], XmNautoUnmanage, False), ++n;
    XtSetArg(args[n], XmNnoResize, False), ++n;
    gNotes.dialog = XmCreateTemplateDialog(parentOr(nullptr), oiStr("Note"), args, n);
    XtAddCallback(gNotes.dialog, XmNdestroyCallback, noteGoneCB, nullptr);
    Widget frame = XmCreateFrame(gNotes.dialog, oiStr("kgErrorListFrame"), nullptr, 0);
    Widget box = XmCreateRowColumn(frame, oiStr("kgErrorListBox"), nullptr, 0);
    gNotes.banner = XmCreateLabel(box, oiStr("kgErrorBanner"), nullptr, 0);
    oiLabelUnlessSet(gNotes.banner, "Error messages produced:");
    XtVaSetValues(gNotes.banner, XmNalignment, XmALIGNMENT_BEGINNING, nullptr);
    XtManageChild(gNotes.banner);
    Arg la[3];
    n = 0;
    XtSetArg(la[n], XmNvisibleItemCount, 10), ++n;
    XtSetArg(la[n], XmNscrollBarDisplayPolicy, XmSTATIC), ++n;
    XtSetArg(la[n], XmNlistSizePolicy, XmCONSTANT), ++n;
    gNotes.list = XmCreateScrolledList(box, oiStr("kgErrorList"), la, n);
    // 70 columns of the list's own font.
    XmRenderTable fonts = nullptr;
    XtVaGetValues(gNotes.list, XmNrenderTable, &fonts, nullptr);
    if (fonts) {
      OI_XmString sample(std::string(70, '0'));
      XtVaSetValues(gNotes.list, XmNwidth, XmStringWidth(fonts, sample), nullptr);
    }
    XtManageChild(gNotes.list);
    XtManageChild(box);
    XtManageChild(frame);
    Widget ok = XmCreatePushButton(gNotes.dialog, oiStr("kgOK"), nullptr, 0);
    oiLabelUnlessSet(ok, "OK");
    XtAddCallback(ok, XmNactivateCallback, noteOkCB, nullptr);
    XtManageChild(ok);
    XtVaSetValues(gNotes.dialog, XmNdefaultButton, ok, nullptr);
  }
  {
    OI_XmString b(banner);
    XtVaSetValues(gNotes.banner, XmNlabelString, static_cast<XmString>(b), nullptr);
  }
  XmListDeleteAllItems(gNotes.list);
  bool first = true;
  for (const std::string& m : messages) {
    if (separate && !first) {
      OI_XmString empty(std::string(""));
      XmListAddItemUnselected(gNotes.list, empty, 0);
    }
    first = false;
    OI_XmString s(m);
    XmListAddItemUnselected(gNotes.list, s, 0);
  }
  XtManageChild(gNotes.dialog);
}

bool windowLockReporter(int event, const std::string& path, const std::string&) {
  static long long lastAsked = 0;
  if (event == LockEventBreak) {
    return ask_continue("About to break the lock on the file\n" + path + "\nThis may conflict with another user.");
  }
  const long long now = oiNowMs();
  if (lastAsked != 0 && now - lastAsked < 20000) return true;
  lastAsked = now;
  return ask_continue("Lock on " + path + "\nbusy; waiting for the lock.");
}

void showLoadResult(ErrorCode status, const std::vector<std::string>& ignored) {
  KG_Settings& s = kgSettings();
  if (status == allOK || !s.showMergeWarnings.value) return;
  if (!ignored.empty() && s.showMergeWarningDetails.value) {
    noteList(ignored.size() == 1 ? "Some coverage for this file was out of date:"
                                 : "Some coverage for these files was out of date:",
             ignored);
  } else {
    show_message(OI_Severity::warning, errorMessage(status));
  }
}
