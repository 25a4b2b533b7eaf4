// Lines of text with per-character attributes and a selection.
#include "toolkit/oi_text_model.h"

#include <algorithm>

std::u32string oiDecodeUtf8(const std::string& text) {
  std::u32string out;
  oiDecodeUtf8Append(text, out);
  return out;
}

void oiDecodeUtf8Append(std::string_view text, std::u32string& out) {
  out.reserve(out.size() + text.size());
  const auto* s = reinterpret_cast<const unsigned char*>(text.data());
  size_t n = text.size();
  for (size_t i = 0; i < n;) {
    unsigned char c = s[i];
    size_t len = c < 0x80 ? 1 : (c & 0xE0) == 0xC0 ? 2 : (c & 0xF0) == 0xE0 ? 3 : (c & 0xF8) == 0xF0 ? 4 : 0;
    char32_t cp = 0;
    bool good = len != 0 && i + len <= n;
    if (good) {
      cp = len == 1 ? c : len == 2 ? (c & 0x1F) : len == 3 ? (c & 0x0F) : (c & 0x07);
      for (size_t k = 1; k < len; ++k) {
        if ((s[i + k] & 0xC0) != 0x80) {
          good = false;
          break;
        }
        cp = (cp << 6) | (s[i + k] & 0x3F);
      }
      // Overlong forms, surrogates and values past Unicode are not valid UTF-8.
      static const char32_t least[] = {0, 0, 0x80, 0x800, 0x10000};
      if (good && (cp < least[len] || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF))) good = false;
    }
    if (!good) {
      out.push_back(c);
      ++i;
    } else {
      out.push_back(cp);
      i += len;
    }
  }
}

std::string oiEncodeUtf8(const std::u32string& text) {
  std::string out;
  out.reserve(text.size());
  for (char32_t c : text) {
    if (c < 0x80) {
      out.push_back(static_cast<char>(c));
    } else if (c < 0x800) {
      out.push_back(static_cast<char>(0xC0 | (c >> 6)));
      out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    } else if (c < 0x10000) {
      out.push_back(static_cast<char>(0xE0 | (c >> 12)));
      out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
      out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    } else {
      out.push_back(static_cast<char>(0xF0 | (c >> 18)));
      out.push_back(static_cast<char>(0x80 | ((c >> 12) & 0x3F)));
      out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
      out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    }
  }
  return out;
}

void OI_TextModel::setSupplier(const OI_LineSupplier* supplier) {
  clear();
  supplier_ = supplier;
  cachedLine_ = kNoCache;
}

std::string OI_TextModel::lineText(uint32_t line) const { return oiEncodeUtf8(lineChars(line)); }

const std::u32string& OI_TextModel::lineChars(uint32_t line) const {
  static const std::u32string empty;
  if (supplier_) {
    if (line >= supplier_->lineCount()) return empty;
    if (cachedLine_ != line) {
      cache_.clear();
      supplier_->supplyLine(line, cache_);
      cachedLine_ = line;
    }
    return cache_;
  }
  return line < lines_.size() ? lines_[line].text : empty;
}

uint32_t OI_TextModel::lineLength(uint32_t line) const {
  if (supplier_) return static_cast<uint32_t>(lineChars(line).size());
  return line < lines_.size() ? static_cast<uint32_t>(lines_[line].text.size()) : 0;
}

uint32_t OI_TextModel::maxLineLength() const {
  if (supplier_) return supplier_->maxLineLength();
  if (maxLenStale_) {
    maxLen_ = 0;
    for (const auto& l : lines_) maxLen_ = std::max(maxLen_, static_cast<uint32_t>(l.text.size()));
    maxLenStale_ = false;
  }
  return maxLen_;
}

void OI_TextModel::noteLength(uint32_t len) {
  if (!maxLenStale_ && len > maxLen_) maxLen_ = len;
}

void OI_TextModel::lengthMayShrink(uint32_t len) {
  if (len >= maxLen_) maxLenStale_ = true;
}

void OI_TextModel::insertLines(uint32_t before, const std::vector<std::string>& texts) {
  if (texts.empty() || supplier_) return;
  before = std::min(before, lineCount());
  std::vector<Line> fresh(texts.size());
  for (size_t i = 0; i < texts.size(); ++i) {
    fresh[i].text = oiDecodeUtf8(texts[i]);
    noteLength(static_cast<uint32_t>(fresh[i].text.size()));
  }
  lines_.insert(lines_.begin() + before, std::make_move_iterator(fresh.begin()),
                std::make_move_iterator(fresh.end()));
  adjustSelectionForInsert(before, static_cast<uint32_t>(texts.size()));
}

uint32_t OI_TextModel::deleteLines(uint32_t first, uint32_t count) {
  if (supplier_ || first >= lineCount()) return 0;
  count = std::min(count, lineCount() - first);
  for (uint32_t i = first; i < first + count; ++i) lengthMayShrink(lineLength(i));
  lines_.erase(lines_.begin() + first, lines_.begin() + first + count);
  adjustSelectionForDelete(first, count);
  return count;
}

void OI_TextModel::setLine(uint32_t line, const std::string& text) {
  if (line >= lines_.size()) return;
  lengthMayShrink(lineLength(line));
  lines_[line].text = oiDecodeUtf8(text);
  lines_[line].attrs.clear();
  noteLength(lineLength(line));
}

void OI_TextModel::replaceTail(uint32_t line, uint32_t col, std::u32string_view text) {
  if (line >= lines_.size()) return;
  Line& l = lines_[line];
  lengthMayShrink(static_cast<uint32_t>(l.text.size()));
  col = std::min<uint32_t>(col, static_cast<uint32_t>(l.text.size()));
  l.text.resize(col);
  l.text += text;
  cutAttrs(l, col, UINT32_MAX);  // the new tail starts plain
  noteLength(static_cast<uint32_t>(l.text.size()));
}

void OI_TextModel::overwrite(uint32_t line, uint32_t col, const std::u32string& text) {
  if (line >= lines_.size()) return;
  Line& l = lines_[line];
  if (l.text.size() < col + text.size()) l.text.resize(col + text.size(), U' ');
  l.text.replace(col, text.size(), text);
  noteLength(static_cast<uint32_t>(l.text.size()));
}

void OI_TextModel::clear() {
  lines_.clear();
  maxLen_ = 0;
  maxLenStale_ = false;
  clearSelection();
}

OI_CharAttr OI_TextModel::attrAt(uint32_t line, uint32_t col) const {
  if (supplier_) {
    std::vector<OI_CharAttr> attrs;
    lineAttrs(line, attrs);
    return col < attrs.size() ? attrs[col] : OI_CharAttr{};
  }
  if (line >= lines_.size()) return {};
  for (const AttrRun& r : lines_[line].attrs) {
    if (col < r.col) break;
    if (col - r.col < r.count) return r.attr;
  }
  return {};
}

void OI_TextModel::cutAttrs(Line& l, uint32_t from, uint32_t to) {
  std::vector<AttrRun>& runs = l.attrs;
  for (size_t i = 0; i < runs.size();) {
    AttrRun& r = runs[i];
    const uint64_t end = uint64_t(r.col) + r.count;
    if (end <= from || r.col >= to) {
      ++i;
    } else if (r.col < from && end > to) {
      // The cut lies inside the run: it splits in two.
      AttrRun tail{to, static_cast<uint32_t>(end - to), r.attr};
      r.count = from - r.col;
      runs.insert(runs.begin() + static_cast<std::ptrdiff_t>(i) + 1, tail);
      return;
    } else if (r.col < from) {
      r.count = from - r.col;
      ++i;
    } else if (end > to) {
      r.count = static_cast<uint32_t>(end - to);
      r.col = to;
      ++i;
    } else {
      runs.erase(runs.begin() + static_cast<std::ptrdiff_t>(i));
    }
  }
  if (runs.empty()) std::vector<AttrRun>().swap(runs);
}

void OI_TextModel::setAttributes(uint32_t line, uint32_t col, uint32_t count, OI_CharAttr attr) {
  if (line >= lines_.size()) return;
  Line& l = lines_[line];
  if (col >= l.text.size() || count == 0) return;
  count = std::min<uint32_t>(count, static_cast<uint32_t>(l.text.size()) - col);
  cutAttrs(l, col, col + count);
  if (attr == OI_CharAttr{}) return;
  auto at = std::find_if(l.attrs.begin(), l.attrs.end(), [col](const AttrRun& r) { return r.col > col; });
  l.attrs.insert(at, AttrRun{col, count, attr});
}

void OI_TextModel::clearAttributes(uint32_t line) {
  if (line < lines_.size()) lines_[line].attrs.clear();
}

bool OI_TextModel::hasAttributes(uint32_t line) const {
  if (supplier_) {
    std::vector<OI_CharAttr> attrs;
    lineAttrs(line, attrs);
    return !attrs.empty();
  }
  return line < lines_.size() && !lines_[line].attrs.empty();
}

void OI_TextModel::lineAttrs(uint32_t line, std::vector<OI_CharAttr>& out) const {
  out.clear();
  if (supplier_) {
    if (line < supplier_->lineCount()) supplier_->supplyAttrs(line, out);
    return;
  }
  if (line >= lines_.size() || lines_[line].attrs.empty()) return;
  const Line& l = lines_[line];
  out.resize(l.text.size());
  for (const AttrRun& r : l.attrs) {
    const uint32_t end = std::min<uint32_t>(r.col + r.count, static_cast<uint32_t>(out.size()));
    for (uint32_t c = r.col; c < end; ++c) out[c] = r.attr;
  }
}

void OI_TextModel::setSelection(OI_TextPos start, OI_TextPos end) {
  if (end < start) std::swap(start, end);
  selStart_ = start;
  selEnd_ = end;
}

bool OI_TextModel::isSelected(uint32_t line, uint32_t col) const {
  OI_TextPos p{line, col};
  return hasSelection() && selStart_ <= p && p < selEnd_;
}

std::string OI_TextModel::selectedText() const {
  if (!hasSelection()) return {};
  std::u32string out;
  for (uint32_t line = selStart_.line; line <= selEnd_.line && line < lineCount(); ++line) {
    const std::u32string& t = lineChars(line);
    uint32_t from = line == selStart_.line ? selStart_.col : 0;
    uint32_t to = line == selEnd_.line ? selEnd_.col : UINT32_MAX;
    from = std::min<uint32_t>(from, static_cast<uint32_t>(t.size()));
    to = std::min<uint32_t>(to, static_cast<uint32_t>(t.size()));
    if (line != selStart_.line) out.push_back(U'\n');
    out.append(t, from, to - from);
  }
  return oiEncodeUtf8(out);
}

void OI_TextModel::wordAround(OI_TextPos pos, OI_TextPos& start, OI_TextPos& end) const {
  start = end = pos;
  const std::u32string& t = lineChars(pos.line);
  auto isWord = [](char32_t c) {
    return c == U'_' || (c >= U'0' && c <= U'9') || (c >= U'a' && c <= U'z') || (c >= U'A' && c <= U'Z') ||
           c > 0x7F;
  };
  if (pos.col >= t.size()) return;
  if (!isWord(t[pos.col])) {
    end.col = pos.col + 1;
    return;
  }
  while (start.col > 0 && isWord(t[start.col - 1])) --start.col;
  while (end.col < t.size() && isWord(t[end.col])) ++end.col;
}

void OI_TextModel::adjustSelectionForInsert(uint32_t before, uint32_t count) {
  if (!hasSelection()) return;
  if (selStart_.line >= before) selStart_.line += count;
  if (selEnd_.line >= before && !(selEnd_.line == before && selEnd_.col == 0 && selStart_.line < before))
    selEnd_.line += count;
}

void OI_TextModel::adjustSelectionForDelete(uint32_t first, uint32_t count) {
  if (!hasSelection()) return;
  auto move = [&](OI_TextPos& p) {
    if (p.line >= first + count) {
      p.line -= count;
    } else if (p.line >= first) {
      p.line = first;
      p.col = 0;
    }
  };
  move(selStart_);
  move(selEnd_);
}
