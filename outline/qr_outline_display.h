// The abstract display of an outline: the calls by which the object layer has its rows drawn.
#pragma once

#include <cstdint>

#include "outline/qr_object.h"

class QR_OutlineObject;
class QR_OutlineRoot;
class QR_OutlineAnnotation;

class QR_OutlineDisplay : public QR_Object {
 public:
  ~QR_OutlineDisplay() override;

  // Highlights every occurrence of a string in the given colours.
  virtual void add_enhancement(const char* text, unsigned long foreground, unsigned long background);
  // A column at which every line gets the separator attribute.
  virtual void add_column_mark(std::uint32_t column);
  virtual void clear_column_marks();
  virtual std::uint32_t column_mark_count();
  virtual std::uint32_t column_mark(std::uint32_t index);
  virtual bool is_line_visible(std::uint32_t line);
  virtual void insert_lines(std::uint32_t first, std::uint32_t count) = 0;
  virtual void delete_lines(std::uint32_t first, std::uint32_t count) = 0;
  // Opens an update bracket over the whole text; brackets nest.
  virtual void begin_update();
  virtual std::uint32_t glyph_column(std::uint32_t depth);
  virtual void show_line(std::uint32_t line);
  virtual void make_visible(QR_OutlineObject* row);
  virtual void to_top(QR_OutlineObject* row);
  virtual void before_row_action(QR_OutlineObject* row, const char* name);
  virtual void after_row_action(QR_OutlineObject* row, const char* name);
  virtual void annotation_removed(QR_OutlineObject* row, QR_OutlineAnnotation* annotation);
  virtual void row_selected(QR_OutlineObject* row);
  virtual void row_deselected(QR_OutlineObject* row);
  // The first line or the annotations of the row changed.
  virtual void row_changed(QR_OutlineObject* row);
  virtual void begin_action(const char* name);
  virtual void end_action(const char* name);
  virtual void set_line(std::uint32_t depth, std::uint32_t line, const char* text, QR_OutlineObject* row) = 0;
  virtual void set_tab_stops(std::uint32_t width);
  virtual std::uint32_t text_column(std::uint32_t depth);
  virtual void end_update();
  // The actions the selection offers may have changed.
  virtual void actions_changed();
  virtual void set_root(QR_OutlineRoot* root);

  QR_OutlineRoot* root() const { return root_; }

 protected:
  QR_OutlineRoot* root_ = nullptr;
};
