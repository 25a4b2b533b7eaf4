// A box that lays its children out on a grid of cells; chosen rows and columns take the spare room.
#pragma once

#include <string>
#include <vector>

#include "toolkit/oi_widget.h"

class OI_GridBox : public OI_Widget {
 public:
  OI_GridBox(Widget parent, const std::string& name);

  // Puts a child widget (created with this box's widget as parent) into a cell. Children that
  // stretch share the room beyond the preferred sizes of their column or row.
  void place(Widget child, int col, int row, bool stretchX = false, bool stretchY = false);
  void remove(Widget child);
  // Lays the children out in the box's current size.
  virtual void layout();
  // The size the grid wants: the sum of the columns' and rows' preferred sizes.
  virtual void preferredSize(int& width, int& height) const;
  // Sets the box's own size to the preferred one.
  void fitToContents();

  // The preferred size of any widget: the text's rows and columns for texts, else Xt's answer.
  static void preferredSizeOf(Widget w, int& width, int& height);

 protected:
  struct Cell {
    Widget widget;
    int col, row;
    bool stretchX, stretchY;
  };
  const std::vector<Cell>& cells() const { return cells_; }

 private:
  static void resizeCB(Widget, XtPointer, XtPointer);
  void measure(std::vector<int>& colW, std::vector<int>& rowH) const;
  std::vector<Cell> cells_;
  int layoutDepth_ = 0;
};
