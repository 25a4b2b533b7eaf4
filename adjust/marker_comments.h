// Writing and removing adjustment marker comments in source text, line by line.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "coverage/cvg_adjust_set.h"

// The few operations on a text that the marker edits need; lines are numbered from 1.
// The annotated source pane implements it; VectorTextLines serves plain text in memory.
class TextLines {
 public:
  virtual ~TextLines() = default;
  virtual std::size_t lineCount() const = 0;
  virtual std::string line(std::size_t n) const = 0;
  virtual void deleteChars(std::size_t n, std::size_t offset, std::size_t count) = 0;
  virtual void insertChars(std::size_t n, std::size_t offset, const std::string& text) = 0;
  virtual void appendToLine(std::size_t n, const std::string& text) = 0;
};

class VectorTextLines : public TextLines {
 public:
  explicit VectorTextLines(std::vector<std::string>& lines) : lines_(lines) {}
  std::size_t lineCount() const override { return lines_.size(); }
  std::string line(std::size_t n) const override;
  void deleteChars(std::size_t n, std::size_t offset, std::size_t count) override;
  void insertChars(std::size_t n, std::size_t offset, const std::string& text) override;
  void appendToLine(std::size_t n, const std::string& text) override;

 private:
  std::vector<std::string>& lines_;
};

// The comment the viewer writes for a kind: adjustmentCommentFormat filled with
// "kestrel: deadcode", "kestrel: tested" or "kestrel: inspected".
std::string adjustmentCommentText(CvgAdjust kind);

// Removes the viewer's marker comments from the lines (when deleteGUIAdjustments) and
// disables hand-written one-line markers (when invalidateUserAdjustments).
void clearMarkers(TextLines& text, std::size_t first, std::size_t last);

// Appends the comment for the kind to every line of the range.
void addMarker(TextLines& text, CvgAdjust kind, std::size_t first, std::size_t last);

// The user sets one line's adjustment (kind 0 = none): the comments of the line are
// cleared, the new one added, and the set's one-line kinds for the line follow.
void editAdjustmentLine(TextLines& text, std::size_t line, CvgAdjust kind, CvgAdjustSet& set);
