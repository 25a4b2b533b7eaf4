// A source file's text kept as its own bytes, so that writing it back changes only what the
// user edited: every other line, each line end (LF or CRLF) and the last line's missing newline
// come back byte for byte.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "adjust/marker_comments.h"
#include "adjust/src_file.h"
#include "support/errors.h"

class SourceText : public TextLines {
 public:
  // Reads every remaining line of a source opened for reading. A read error leaves the text
  // empty and gives readFileFail.
  ErrorCode read(SrcFile& src);
  // The lines of a text given whole (tests, snapshots).
  void assign(std::string_view bytes);
  void clear();

  // TextLines, lines numbered from 1; the bytes without their line end.
  std::size_t lineCount() const override { return ends_.size(); }
  std::string line(std::size_t n) const override { return std::string(view(n)); }
  void deleteChars(std::size_t n, std::size_t offset, std::size_t count) override;
  void insertChars(std::size_t n, std::size_t offset, const std::string& text) override;
  void appendToLine(std::size_t n, const std::string& text) override;

  std::string_view view(std::size_t n) const;
  bool edited(std::size_t n) const { return edits_.count(n) != 0; }
  // The longest line in bytes (what the display shows at most: its horizontal extent).
  std::size_t longestLine() const { return longest_; }

  // Writes every line with its own line end through a source opened for writing.
  ErrorCode write(SrcFile& src) const;
  // The whole text as it would be written.
  std::string bytes() const;

 private:
  enum : std::uint8_t { endNone = 0, endLf = 1, endCrLf = 2 };
  void append(std::string_view line, std::uint8_t end);
  std::string& editable(std::size_t n);

  std::string bytes_;                  // the lines as read, one after the other, without ends
  std::vector<std::size_t> starts_;    // where each line begins in bytes_
  std::vector<std::uint8_t> ends_;     // each line's end
  std::unordered_map<std::size_t, std::string> edits_;  // lines the user changed, by number
  std::size_t longest_ = 0;
};
