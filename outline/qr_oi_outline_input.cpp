// The outline's keys and mouse: its toolkit actions, the drag that selects whole subtrees, glyph
// presses and glyph menus, and the availability of actions in the controlled widgets.
#include <Xm/CascadeB.h>
#include <Xm/CascadeBG.h>
#include <Xm/PushB.h>
#include <Xm/PushBG.h>
#include <Xm/ToggleB.h>
#include <Xm/ToggleBG.h>
#include <Xm/Xm.h>

#include <algorithm>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_outline_display.h"
#include "outline/qr_outline_actions.h"
#include "outline/qr_outline_object.h"
#include "outline/qr_outline_root.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_xstring.h"

namespace {

void mousePressAction(Widget w, XEvent* ev, String*, Cardinal*) {
  if (QR_OI_OutlineDisplay* d = QR_OI_OutlineDisplay::forWidget(w)) oiGuard("qr_mouse_press", [&] { d->mousePress(ev); });
}

void selectMotionAction(Widget w, XEvent* ev, String*, Cardinal*) {
  if (QR_OI_OutlineDisplay* d = QR_OI_OutlineDisplay::forWidget(w))
    oiGuard("qr_select_motion", [&] { d->selectMotion(ev); });
}

void selectReleaseAction(Widget w, XEvent* ev, String*, Cardinal*) {
  if (QR_OI_OutlineDisplay* d = QR_OI_OutlineDisplay::forWidget(w))
    oiGuard("qr_select_release", [&] { d->selectRelease(ev); });
}

void qrAction(Widget w, XEvent*, String* params, Cardinal* n) {
  QR_OI_OutlineDisplay* d = QR_OI_OutlineDisplay::forWidget(w);
  if (!d || !params || !n) return;
  std::vector<std::string> actions;
  for (Cardinal i = 0; i < *n; ++i) actions.emplace_back(params[i]);
  oiGuard("qr_action", [&] { d->performActions(actions); });
}

}  // namespace

void QR_OI_OutlineDisplay::registerActions() {
  OI_Application* app = OI_Application::instance();
  if (!app || !app->firstTime("QR_OI_OutlineDisplay actions")) return;
  app->addAction("qr_mouse_press", mousePressAction);
  app->addAction("qr_select_motion", selectMotionAction);
  app->addAction("qr_select_release", selectReleaseAction);
  app->addAction("qr_action", qrAction);
}

namespace {

bool isCellOrButton(Widget w) {
  return XmIsPushButton(w) || XmIsPushButtonGadget(w) || XmIsToggleButton(w) || XmIsToggleButtonGadget(w);
}

void setAvailability(Widget w, QR_OutlineRoot* root) {
  if (isCellOrButton(w)) XtSetSensitive(w, root && root->has_action(XtName(w)));
  if (XtIsComposite(w)) {
    WidgetList kids = nullptr;
    Cardinal n = 0;
    XtVaGetValues(w, XmNchildren, &kids, XmNnumChildren, &n, nullptr);
    for (Cardinal i = 0; i < n; ++i) setAvailability(kids[i], root);
  }
}

}  // namespace

const char* QR_OI_OutlineDisplay::translations() {
  // Modified keys come before plain ones: the first line that matches wins.
  return "#override\n"
         "<Btn1Down>: qr_mouse_press()\n"
         "<Btn1Motion>: qr_select_motion()\n"
         "<Btn1Up>: qr_select_release()\n"
         "<Btn2Down>: drag_copy_start()\n"
         "Ctrl<Key>osfInsert: copy_clipboard()\n"
         "Ctrl<Key>Insert: copy_clipboard()\n"
         "Ctrl<Key>KP_0: copy_clipboard()\n"
         "Ctrl<Key>KP_Insert: copy_clipboard()\n"
         "<Key>F16: copy_clipboard()\n"
         "<Key>F20: cut_clipboard()\n"
         "Ctrl<Key>f: page_down()\n"
         "Ctrl<Key>v: page_down()\n"
         "Ctrl<Key>b: page_up()\n"
         "Mod1<Key>v: page_up()\n"
         "Mod1<Key>n: qr_action(QR_OutlineNextSameLevel)\n"
         "Ctrl<Key>i: qr_action(QR_OutlineNextSameLevel)\n"
         "Mod1<Key>p: qr_action(QR_OutlinePreviousSameLevel)\n"
         "Ctrl<Key>o: qr_action(QR_OutlineExpand,QR_OutlineMakeVisible)\n"
         "Ctrl<Key>k: qr_action(QR_OutlineCollapse)\n"
         "Ctrl<Key>h: qr_action(QR_OutlineCollapse)\n"
         "Ctrl<Key>p: qr_action(QR_OutlinePrevious)\n"
         "Ctrl<Key>n: qr_action(QR_OutlineNext)\n"
         "Ctrl<Key>t: qr_action(QR_OutlineToTop)\n"
         "Mod1<Key>t: qr_action(QR_OutlineMakeVisible)\n"
         "Mod1<Key>greater: qr_action(QR_OutlineLast)\n"
         "Mod1<Key>less: qr_action(QR_OutlineFirst)\n"
         "<Key>Tab: qr_action(QR_OutlineNextSameLevel)\n"
         "Shift<Key>o: qr_action(QR_OutlineExpand,QR_OutlineMakeVisible)\n"
         "<Key>osfRight: qr_action(QR_OutlineExpand,QR_OutlineMakeVisible)\n"
         "<Key>osfDelete: qr_action(QR_OutlineCollapse)\n"
         "<Key>osfBackSpace: qr_action(QR_OutlineCollapse)\n"
         "<Key>osfLeft: qr_action(QR_OutlineCollapse)\n"
         "<Key>Return: qr_action(QR_OutlineExpandCollapse, QR_OutlineMakeVisible)\n"
         "<Key>osfActivate: qr_action(QR_OutlineExpandCollapse, QR_OutlineMakeVisible)\n"
         "<Key>space: qr_action(QR_OutlineExpandCollapse, QR_OutlineMakeVisible)\n"
         "<Key>osfUp: qr_action(QR_OutlinePrevious)\n"
         "<Key>k: qr_action(QR_OutlinePrevious)\n"
         "<Key>osfDown: qr_action(QR_OutlineNext)\n"
         "<Key>j: qr_action(QR_OutlineNext)\n"
         "<Key>osfPageDown: page_down()\n"
         "<Key>osfPageUp: page_up()\n"
         "<Key>: noop()\n";
}

// ---------------------------------------------------------------- actions

void QR_OI_OutlineDisplay::performActions(const std::vector<std::string>& actionStrings) {
  if (!root_) return;
  // With nothing selected the moving keys have nowhere to move from: they select the first
  // row in view, so that the outline can be used from the keyboard alone.
  if (root_->selection_count() == 0 && actionStrings.size() == 1 &&
      (actionStrings[0] == QR_OutlineNext || actionStrings[0] == QR_OutlinePrevious)) {
    QR_OutlineObject* row = root_->object_at_line(text_->topLine());
    while (row && !row->is_selectable()) row = row->next_row();
    if (row) {
      begin_update();
      root_->select_exclusively(row);
      end_update();
    }
    return;
  }
  for (const std::string& a : actionStrings) {
    begin_update();
    root_->perform_action(a.c_str(), nullptr);
    end_update();
    if (!root_) return;
  }
}

void QR_OI_OutlineDisplay::mousePress(XEvent* ev) {
  text_->takeFocus();
  if (text_->dispatchGlyphPress(ev)) return;
  if (!ev || ev->type != ButtonPress) return;
  clicks_ = text_->countClick(ev);
  // A double click selects the word under the pointer, so that the row under it stays selected.
  text_->startSelection(ev, clicks_);
  pressed_ = true;
  dragged_ = false;
  pressTime_ = ev->xbutton.time;
  pressLine_ = text_->lineAtY(ev->xbutton.y);
  QR_OutlineObject* row = root_ ? root_->object_at_line(pressLine_) : nullptr;
  pressDepth_ = row ? row->depth() : 0;
}

void QR_OI_OutlineDisplay::selectMotion(XEvent* ev) {
  if (!pressed_ || !root_ || !ev || ev->type != MotionNotify || text_->lineCount() == 0) return;
  Dimension h = 0;
  XtVaGetValues(text_->widget(), XmNheight, &h, nullptr);
  if (ev->xmotion.y < 0) text_->scrollLines(-1);
  else if (ev->xmotion.y >= static_cast<int>(h)) text_->scrollLines(1);
  uint32_t q = text_->lineAtY(ev->xmotion.y);
  if (q != pressLine_) dragged_ = true;
  if (!dragged_) return;
  uint32_t lo = std::min(pressLine_, q), hi = std::max(pressLine_, q);
  QR_OutlineObject* firstRow = root_->object_at_line(lo);
  QR_OutlineObject* lastRow = root_->object_at_line(hi);
  if (!firstRow || !lastRow) return;
  // The shallowest row anywhere in the span; the first found wins a tie.
  uint32_t shallowest = UINT32_MAX;
  for (uint32_t line = lo; line <= hi; ++line) {
    QR_OutlineObject* r = root_->object_at_line(line);
    if (r && r->depth() < shallowest) shallowest = r->depth();
  }
  while (firstRow->depth() > shallowest && firstRow->parent_row() && !firstRow->parent_row()->is_root())
    firstRow = firstRow->parent_row();
  while (lastRow->depth() > shallowest && lastRow->parent_row() && !lastRow->parent_row()->is_root())
    lastRow = lastRow->parent_row();
  uint32_t from = firstRow->first_line();
  uint32_t to = lastRow->first_line() + std::max<uint32_t>(1, lastRow->visible_line_count()) - 1;
  if (from == QR_OutlineObject::kNoLine || lastRow->first_line() == QR_OutlineObject::kNoLine) return;
  text_->selectLines(from, to);
}

void QR_OI_OutlineDisplay::selectRelease(XEvent* ev) {
  if (!pressed_) return;
  pressed_ = false;
  text_->endSelection(ev);
  if (!root_) return;
  Time release = ev && ev->type == ButtonRelease ? ev->xbutton.time : pressTime_;
  unsigned long clickTime = static_cast<unsigned long>(XtGetMultiClickTime(XtDisplay(text_->widget())));
  if (!dragged_ && clicks_ == 1 && release >= pressTime_ && release - pressTime_ <= clickTime) {
    QR_OutlineObject* row = root_->object_at_line(pressLine_);
    if (row && row->first_line() == pressLine_) {
      begin_update();
      row->perform_action("QR_OutlineSelect", nullptr);
      end_update();
    }
  }
  rebuildRowsFromText();
  if (!dragged_ && clicks_ == 2 && onActivate) {
    QR_OutlineObject* row = root_->object_at_line(pressLine_);
    if (row && row->first_line() != QR_OutlineObject::kNoLine) onActivate(row);
  }
}

// ---------------------------------------------------------------- glyphs

void QR_OI_OutlineDisplay::glyphPressed(OI_Glyph& glyph, XEvent* ev) {
  auto* row = static_cast<QR_OutlineObject*>(glyph.userData);
  if (!row || !root_ || !ev) return;
  std::string name = glyph.name();
  if (ev->xbutton.button == Button1) {
    root_->select_exclusively(row);
    performActions({name});
  } else if (ev->xbutton.button == Button3) {
    popupGlyphMenu(row, name, ev);
  }
}

void QR_OI_OutlineDisplay::popupGlyphMenu(QR_OutlineObject* row, const std::string& glyphName, XEvent* ev) {
  std::string menuName = glyphName.substr(0, glyphName.find(','));
  OI_Menu* menu = nullptr;
  auto it = glyphMenus_.find(menuName);
  if (it != glyphMenus_.end()) {
    menu = it->second;
  } else {
    auto m = std::make_unique<OI_Menu>(text_->widget(), menuName, OI_Menu::popup);
    // The cells are named by the menu's "cells" resource, colon-separated; each is labelled by
    // its own "label" resource. No "cells", no menu.
    std::string cells = m->resourceString("cells", "Path");
    size_t start = 0;
    while (start <= cells.size()) {
      size_t colon = cells.find(':', start);
      std::string cell = cells.substr(start, colon == std::string::npos ? std::string::npos : colon - start);
      while (!cell.empty() && (cell.front() == ' ' || cell.front() == '\t')) cell.erase(0, 1);
      while (!cell.empty() && (cell.back() == ' ' || cell.back() == '\t')) cell.pop_back();
      if (!cell.empty()) {
        OI_MenuCell* c = m->addCell(cell, cell);
        std::string label = c->resourceString("label");
        c->setLabel(label.empty() ? cell : label);
        c->onActivate = [this, cell] {
          if (!menuRow_ || !root_) return;
          begin_update();
          menuRow_->perform_action(cell.c_str(), nullptr);
          end_update();
        };
      }
      if (colon == std::string::npos) break;
      start = colon + 1;
    }
    if (m->cells().empty()) {
      glyphMenus_[menuName] = nullptr;
      ownedMenus_.push_back(std::move(m));
      return;
    }
    menu = m.get();
    glyphMenus_[menuName] = menu;
    ownedMenus_.push_back(std::move(m));
  }
  if (!menu) return;
  menuRow_ = row;
  menuRowKey_ = row;
  if (!is_linked(row)) link(row);  // to hear of the row's end while its menu may be up
  for (OI_MenuCell* c : menu->cells()) c->setSensitive(row->has_action(c->name().c_str()));
  menu->popupAt(ev);
}

// ---------------------------------------------------------------- controlled widgets

void QR_OI_OutlineDisplay::add_controlled_widget(Widget w) {
  if (w && std::find(controlled_.begin(), controlled_.end(), w) == controlled_.end()) controlled_.push_back(w);
  actions_changed();
}

void QR_OI_OutlineDisplay::remove_controlled_widget(Widget w) { std::erase(controlled_, w); }

void QR_OI_OutlineDisplay::actions_changed() {
  if (actionsTimer_.pending()) return;
  OI_Application* app = OI_Application::instance();
  if (!app) return;
  actionsTimer_ = app->addTimeOut(10, [this] { update_controlled_widgets(); });
}

void QR_OI_OutlineDisplay::update_controlled_widgets() {
  actionsTimer_.cancel();
  for (Widget w : controlled_) setAvailability(w, root_);
}
