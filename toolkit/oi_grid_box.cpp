// A box that lays its children out on a grid of cells.
#include "toolkit/oi_grid_box.h"

#include <X11/IntrinsicP.h>
#include <Xm/DrawingA.h>

#include <algorithm>

#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_xstring.h"

OI_GridBox::OI_GridBox(Widget parent, const std::string& name) {
  Arg args[3];
  XtSetArg(args[0], XmNresizePolicy, XmRESIZE_NONE);
  XtSetArg(args[1], XmNmarginWidth, 0);
  XtSetArg(args[2], XmNmarginHeight, 0);
  Widget w = XmCreateDrawingArea(parent, oiStr(name.c_str()), args, 3);
  adopt(w, name);
  XtAddCallback(w, XmNresizeCallback, resizeCB, this);
  XtManageChild(w);
}

void OI_GridBox::place(Widget child, int col, int row, bool stretchX, bool stretchY) {
  remove(child);
  cells_.push_back(Cell{child, col, row, stretchX, stretchY});
}

void OI_GridBox::remove(Widget child) {
  std::erase_if(cells_, [child](const Cell& c) { return c.widget == child; });
}

void OI_GridBox::preferredSizeOf(Widget w, int& width, int& height) {
  OI_Widget* o = OI_Widget::fromWidget(w);
  if (auto* t = dynamic_cast<OI_MultiText*>(o)) {
    t->preferredSize(width, height);
    return;
  }
  if (auto* g = dynamic_cast<OI_GridBox*>(o)) {
    g->preferredSize(width, height);
    return;
  }
  XtWidgetGeometry reply{};
  XtQueryGeometry(w, nullptr, &reply);
  width = reply.width;
  height = reply.height;
}

void OI_GridBox::measure(std::vector<int>& colW, std::vector<int>& rowH) const {
  int cols = 0, rows = 0;
  for (const Cell& c : cells_) {
    cols = std::max(cols, c.col + 1);
    rows = std::max(rows, c.row + 1);
  }
  colW.assign(static_cast<size_t>(cols), 0);
  rowH.assign(static_cast<size_t>(rows), 0);
  for (const Cell& c : cells_) {
    if (!XtIsManaged(c.widget)) continue;
    int w = 0, h = 0;
    preferredSizeOf(c.widget, w, h);
    colW[static_cast<size_t>(c.col)] = std::max(colW[static_cast<size_t>(c.col)], w);
    rowH[static_cast<size_t>(c.row)] = std::max(rowH[static_cast<size_t>(c.row)], h);
  }
}

void OI_GridBox::preferredSize(int& width, int& height) const {
  std::vector<int> colW, rowH;
  measure(colW, rowH);
  width = 0;
  height = 0;
  for (int w : colW) width += w;
  for (int h : rowH) height += h;
  width = std::max(width, 1);
  height = std::max(height, 1);
}

void OI_GridBox::fitToContents() {
  int w, h;
  preferredSize(w, h);
  if (widget()) XtVaSetValues(widget(), XmNwidth, w, XmNheight, h, nullptr);
  layout();
}

namespace {
// Gives the difference between the room and the wanted sizes to the stretching entries, evenly;
// shrinking stops at 1 pixel.
void distribute(std::vector<int>& sizes, const std::vector<bool>& stretch, int room) {
  int total = 0;
  for (int s : sizes) total += s;
  int extra = room - total;
  std::vector<size_t> idx;
  for (size_t i = 0; i < sizes.size(); ++i)
    if (stretch[i] && sizes[i] >= 0) idx.push_back(i);
  if (idx.empty() && !sizes.empty()) idx.push_back(sizes.size() - 1);
  if (idx.empty()) return;
  int each = extra / static_cast<int>(idx.size());
  int rest = extra - each * static_cast<int>(idx.size());
  for (size_t k = 0; k < idx.size(); ++k) {
    int add = each + (k + 1 == idx.size() ? rest : 0);
    sizes[idx[k]] = std::max(1, sizes[idx[k]] + add);
  }
}
}  // namespace

void OI_GridBox::layout() {
  Widget w = widget();
  if (!w || layoutDepth_ > 3) return;
  ++layoutDepth_;
  Dimension width = 0, height = 0;
  XtVaGetValues(w, XmNwidth, &width, XmNheight, &height, nullptr);
  std::vector<int> colW, rowH;
  measure(colW, rowH);
  std::vector<bool> sx(colW.size(), false), sy(rowH.size(), false);
  for (const Cell& c : cells_) {
    if (!XtIsManaged(c.widget)) continue;
    if (c.stretchX) sx[static_cast<size_t>(c.col)] = true;
    if (c.stretchY) sy[static_cast<size_t>(c.row)] = true;
  }
  distribute(colW, sx, width);
  distribute(rowH, sy, height);
  std::vector<int> colX(colW.size() + 1, 0), rowY(rowH.size() + 1, 0);
  for (size_t i = 0; i < colW.size(); ++i) colX[i + 1] = colX[i] + colW[i];
  for (size_t i = 0; i < rowH.size(); ++i) rowY[i + 1] = rowY[i] + rowH[i];
  for (const Cell& c : cells_) {
    if (!XtIsManaged(c.widget)) continue;
    auto ci = static_cast<size_t>(c.col), ri = static_cast<size_t>(c.row);
    XtConfigureWidget(c.widget, static_cast<Position>(colX[ci]), static_cast<Position>(rowY[ri]),
                      static_cast<Dimension>(std::max(1, colW[ci])), static_cast<Dimension>(std::max(1, rowH[ri])), 0);
  }
  --layoutDepth_;
}

void OI_GridBox::resizeCB(Widget, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_GridBox*>(client);
  oiGuard("layout", [self] { self->layout(); });
}
