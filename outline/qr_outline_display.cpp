// Defaults of the abstract outline display: a display overrides what it draws.
#include "outline/qr_outline_display.h"

QR_OutlineDisplay::~QR_OutlineDisplay() = default;

void QR_OutlineDisplay::add_enhancement(const char*, unsigned long, unsigned long) {}
void QR_OutlineDisplay::add_column_mark(std::uint32_t) {}
void QR_OutlineDisplay::clear_column_marks() {}
std::uint32_t QR_OutlineDisplay::column_mark_count() { return 0; }
std::uint32_t QR_OutlineDisplay::column_mark(std::uint32_t) { return 0; }
bool QR_OutlineDisplay::is_line_visible(std::uint32_t) { return false; }
void QR_OutlineDisplay::begin_update() {}
std::uint32_t QR_OutlineDisplay::glyph_column(std::uint32_t depth) { return depth; }
void QR_OutlineDisplay::show_line(std::uint32_t) {}
void QR_OutlineDisplay::make_visible(QR_OutlineObject*) {}
void QR_OutlineDisplay::to_top(QR_OutlineObject*) {}
void QR_OutlineDisplay::before_row_action(QR_OutlineObject*, const char*) {}
void QR_OutlineDisplay::after_row_action(QR_OutlineObject*, const char*) {}
void QR_OutlineDisplay::annotation_removed(QR_OutlineObject*, QR_OutlineAnnotation*) {}
void QR_OutlineDisplay::row_selected(QR_OutlineObject*) {}
void QR_OutlineDisplay::row_deselected(QR_OutlineObject*) {}
void QR_OutlineDisplay::row_changed(QR_OutlineObject*) {}
void QR_OutlineDisplay::begin_action(const char*) {}
void QR_OutlineDisplay::end_action(const char*) {}
void QR_OutlineDisplay::set_tab_stops(std::uint32_t) {}
std::uint32_t QR_OutlineDisplay::text_column(std::uint32_t depth) { return depth; }
void QR_OutlineDisplay::end_update() {}
void QR_OutlineDisplay::actions_changed() {}
void QR_OutlineDisplay::set_root(QR_OutlineRoot* root) { root_ = root; }
