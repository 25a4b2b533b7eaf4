// Building small outlines over a recording display, and checking that what the display shows
// agrees with the rows' numbering and the line map.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "outline/qr_outline_actions.h"
#include "outline/qr_outline_root.h"
#include "outline/qr_outline_text.h"
#include "tests/outline/recording_display.h"

struct Outline {
  explicit Outline(std::uint32_t window_height = 1000)
      : display(new RecordingDisplay(&display_destroyed, window_height)),
        root(std::make_unique<QR_OutlineRoot>(display)) {}

  // A one-line row under the parent: expandable rows are selectable as well.
  QR_OutlineText* add(QR_OutlineObject* parent, const char* text, bool expandable = false) {
    auto* row = new QR_OutlineText(text);
    if (expandable) {
      row->make_expandable();
    } else {
      row->make_selectable();
    }
    parent->add_child(row);
    return row;
  }
  // A collapsed row with n one-line leaf children named prefix1..prefixN.
  QR_OutlineText* add_with_children(QR_OutlineObject* parent, const char* text, const char* prefix, int n) {
    QR_OutlineText* row = add(parent, text, true);
    for (int i = 1; i <= n; ++i) add(row, (std::string(prefix) + std::to_string(i)).c_str());
    return row;
  }

  bool act(const char* names) { return root->perform_action(names, nullptr); }
  std::vector<std::string> screen() const { return display->screen(); }
  std::vector<std::string> selection() const {
    std::vector<std::string> out;
    for (std::uint32_t i = 0; i < root->selection_count(); ++i) out.push_back(RecordingDisplay::name(root->selected(i)));
    return out;
  }

  bool display_destroyed = false;
  RecordingDisplay* display;  // owned by the root
  std::unique_ptr<QR_OutlineRoot> root;
};

// Every display line belongs to the row the line map names, shows that row's text at its depth,
// and carries the row's glyph; nothing is mapped past the last line.
inline void expectConsistent(Outline& o) {
  RecordingDisplay& d = *o.display;
  for (const std::string& f : d.faults) ADD_FAILURE() << "display fault: " << f;
  const std::uint32_t total = o.root->total_lines();
  ASSERT_EQ(total, d.lines.size());
  for (std::uint32_t line = 0; line < total; ++line) {
    QR_OutlineObject* row = o.root->object_at_line(line);
    ASSERT_NE(row, nullptr) << "line " << line;
    const std::uint32_t first = row->first_line();
    ASSERT_LE(first, line);
    ASSERT_LT(line, first + row->line_count());
    std::string text;
    for (const char* p = row->line_text(line - first); p && *p; ++p) {
      if (*p != '\t') {
        text += *p;
      } else {
        do text += ' '; while (text.size() % d.tab_width != 0);
      }
    }
    EXPECT_EQ(d.lines[line], std::string(3 * row->depth() + 3, ' ') + text) << "line " << line;
  }
  EXPECT_EQ(o.root->object_at_line(total), nullptr);
  EXPECT_EQ(o.root->last_mapped_line(), total == 0 ? QR_OutlineObject::kNoLine : total - 1);
  for (const RecordingDisplay::Glyph& g : d.glyphs) {
    EXPECT_EQ(g.line, g.row->first_line()) << "glyph " << g.name << " of " << RecordingDisplay::name(g.row);
  }
}
