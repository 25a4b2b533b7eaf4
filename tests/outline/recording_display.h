// A display for tests that keeps the outline's text lines and glyphs the way the real display
// keeps them, from the calls it receives alone, and notes every call a test may look for.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "outline/qr_outline_display.h"
#include "outline/qr_outline_object.h"

class RecordingDisplay : public QR_OutlineDisplay {
 public:
  struct Glyph {
    QR_OutlineObject* row;
    std::uint32_t line;
    std::uint32_t column;
    std::string name;
  };

  explicit RecordingDisplay(bool* destroyed = nullptr, std::uint32_t window_height = 1000)
      : height(window_height), destroyed_(destroyed) {}
  ~RecordingDisplay() override {
    if (destroyed_ != nullptr) *destroyed_ = true;
  }

  // What the user sees: each text line with the glyphs drawn over it ('>' collapsed,
  // 'v' expanded, '?' any other).
  std::vector<std::string> screen() const {
    std::vector<std::string> out = lines;
    for (const Glyph& g : glyphs) {
      if (g.line >= out.size()) continue;
      std::string& s = out[g.line];
      if (s.size() <= g.column) s.resize(g.column + 1, ' ');
      s[g.column] = glyphChar(g.name);
    }
    return out;
  }

  // The calls noted since the last look, then forgotten.
  std::vector<std::string> take_log() {
    std::vector<std::string> out;
    out.swap(log);
    return out;
  }

  void insert_lines(std::uint32_t first, std::uint32_t count) override {
    log.push_back("insert " + std::to_string(first) + " " + std::to_string(count));
    if (first > lines.size()) {
      faults.push_back("insert past the end at " + std::to_string(first));
      first = static_cast<std::uint32_t>(lines.size());
    }
    lines.insert(lines.begin() + first, count, std::string());
    for (Glyph& g : glyphs) {
      if (g.line >= first) g.line += count;
    }
  }

  void delete_lines(std::uint32_t first, std::uint32_t count) override {
    log.push_back("delete " + std::to_string(first) + " " + std::to_string(count));
    if (std::uint64_t(first) + count > lines.size()) {
      faults.push_back("delete past the end at " + std::to_string(first));
      return;
    }
    lines.erase(lines.begin() + first, lines.begin() + first + count);
    std::erase_if(glyphs, [&](const Glyph& g) { return g.line >= first && g.line < first + count; });
    for (Glyph& g : glyphs) {
      if (g.line >= first + count) g.line -= count;
    }
  }

  void set_line(std::uint32_t depth, std::uint32_t line, const char* text, QR_OutlineObject*) override {
    ++set_line_calls;
    if (line >= lines.size()) {
      faults.push_back("drawing line " + std::to_string(line) + " that was never opened");
      return;
    }
    std::string composed(text_column(depth), ' ');
    std::string body;
    for (const char* p = text; *p != '\0'; ++p) {
      if (*p == '\t') {
        do body += ' '; while (body.size() % tab_width != 0);
      } else {
        body += *p;
      }
    }
    lines[line] = composed + body;
  }

  std::uint32_t glyph_column(std::uint32_t depth) override { return 3 * depth; }
  std::uint32_t text_column(std::uint32_t depth) override { return 3 * depth + 3; }
  void set_tab_stops(std::uint32_t width) override { tab_width = width == 0 ? 8 : width; }

  void row_changed(QR_OutlineObject* row) override {
    ++row_changed_calls;
    std::erase_if(glyphs, [&](const Glyph& g) { return g.row == row; });
    const std::uint32_t first = row->first_line();
    if (first == QR_OutlineObject::kNoLine || row->line_count() == 0 || !row->annotations()) return;
    const std::uint32_t depth = row->depth();
    for (QR_OutlineAnnotation* a : *row->annotations()) {
      if (a->line() >= row->line_count()) continue;
      if (a->line() > 0 && !row->is_expanded()) continue;
      std::uint32_t column = a->column();
      if (column == 0) column = glyph_column(a->line() == 0 ? depth : depth + 1);
      glyphs.push_back(Glyph{row, first + a->line(), column, a->name_text()});
    }
  }

  void annotation_removed(QR_OutlineObject* row, QR_OutlineAnnotation* a) override {
    log.push_back(std::string("annotation removed ") + a->name_text());
    std::erase_if(glyphs, [&](const Glyph& g) {
      return g.row == row && g.name == a->name_text() &&
             (a->column() == 0 || g.column == a->column());
    });
  }

  bool is_line_visible(std::uint32_t line) override { return line >= top && line < top + height; }
  void show_line(std::uint32_t line) override {
    log.push_back("show_line " + std::to_string(line));
    if (line < top) top = line;
    if (line >= top + height) top = line - height + 1;
  }
  void make_visible(QR_OutlineObject* row) override { log.push_back("make_visible " + name(row)); }
  void to_top(QR_OutlineObject* row) override {
    log.push_back("to_top " + name(row));
    top = row->first_line();
  }
  void row_selected(QR_OutlineObject* row) override { log.push_back("selected " + name(row)); }
  void row_deselected(QR_OutlineObject* row) override { log.push_back("deselected " + name(row)); }
  void begin_action(const char* n) override { log.push_back(std::string("begin_action ") + n); }
  void end_action(const char* n) override { log.push_back(std::string("end_action ") + n); }
  void before_row_action(QR_OutlineObject* row, const char* n) override {
    log.push_back("before " + name(row) + " " + n);
  }
  void after_row_action(QR_OutlineObject* row, const char* n) override {
    log.push_back("after " + name(row) + " " + n);
  }
  void begin_update() override { ++update_depth; }
  void end_update() override { --update_depth; }
  void actions_changed() override { ++actions_changed_calls; }

  static std::string name(QR_OutlineObject* row) {
    if (row == nullptr) return "(none)";
    const char* t = row->line_text(0);
    return t ? t : "(root)";
  }

  std::vector<std::string> lines;
  std::vector<Glyph> glyphs;
  std::vector<std::string> log;
  std::vector<std::string> faults;
  std::uint32_t top = 0;
  std::uint32_t height;
  std::uint32_t tab_width = 8;
  int update_depth = 0;
  int actions_changed_calls = 0;
  int row_changed_calls = 0;
  int set_line_calls = 0;

 private:
  static char glyphChar(const std::string& n) {
    if (n.rfind("QR_OutlineExpand", 0) == 0) return '>';
    if (n.rfind("QR_OutlineCollapse", 0) == 0) return 'v';
    return '?';
  }

  bool* destroyed_;
};
