// Marker comment edits: the viewer's own comments go, hand-written markers are disabled.
#include "adjust/marker_comments.h"

#include "adjust/adjust_settings.h"

std::string VectorTextLines::line(std::size_t n) const {
  return n >= 1 && n <= lines_.size() ? lines_[n - 1] : std::string();
}

void VectorTextLines::deleteChars(std::size_t n, std::size_t offset, std::size_t count) {
  if (n < 1 || n > lines_.size()) return;
  std::string& l = lines_[n - 1];
  if (offset < l.size()) l.erase(offset, count);
}

void VectorTextLines::insertChars(std::size_t n, std::size_t offset, const std::string& text) {
  if (n < 1 || n > lines_.size()) return;
  std::string& l = lines_[n - 1];
  l.insert(offset < l.size() ? offset : l.size(), text);
}

void VectorTextLines::appendToLine(std::size_t n, const std::string& text) {
  if (n >= 1 && n <= lines_.size()) lines_[n - 1] += text;
}

namespace {
std::string commentFor(const AdjustSettings& s, CvgAdjust kind) {
  const char* marker = (kind & adjDeadMask)     ? "kestrel: deadcode"
                       : (kind & adjTestedMask) ? "kestrel: tested"
                                                : "kestrel: inspected";
  return formatWithString(s.adjustmentCommentFormat, marker);
}
}  // namespace

std::string adjustmentCommentText(CvgAdjust kind) { return commentFor(adjustSettings(), kind); }

void clearMarkers(TextLines& text, std::size_t first, std::size_t last) {
  const AdjustSettings s = adjustSettings();
  const std::string comments[3] = {commentFor(s, adjLineDead), commentFor(s, adjLineTested),
                                   commentFor(s, adjLineInspected)};
  const std::string prefix = "kestrel:";
  for (std::size_t n = first; n <= last && n <= text.lineCount(); ++n) {
    if (n == 0) continue;
    if (s.deleteGUIAdjustments) {
      bool removed = true;
      while (removed) {
        removed = false;
        for (const std::string& c : comments) {
          if (c.empty()) continue;
          std::size_t at = text.line(n).find(c);
          if (at != std::string::npos) {
            text.deleteChars(n, at, c.size());
            removed = true;
          }
        }
      }
    }
    if (s.invalidateUserAdjustments && !s.adjustmentDisableString.empty()) {
      std::size_t pos = 0;
      for (;;) {
        std::string l = text.line(n);
        std::size_t at = l.find(prefix, pos);
        if (at == std::string::npos) break;
        std::size_t after = at + prefix.size();
        std::string_view rest = std::string_view(l).substr(after);
        pos = after;
        if (rest.empty() || rest.starts_with(s.adjustmentDisableString) ||
            rest.starts_with(" begin") || rest.starts_with(" end")) {
          continue;
        }
        text.insertChars(n, after, s.adjustmentDisableString);
        pos = after + s.adjustmentDisableString.size();
      }
    }
  }
}

void addMarker(TextLines& text, CvgAdjust kind, std::size_t first, std::size_t last) {
  const std::string comment = adjustmentCommentText(kind);
  for (std::size_t n = first; n <= last && n <= text.lineCount(); ++n) {
    if (n != 0) text.appendToLine(n, comment);
  }
}

void editAdjustmentLine(TextLines& text, std::size_t line, CvgAdjust kind, CvgAdjustSet& set) {
  clearMarkers(text, line, line);
  if (kind) addMarker(text, kind, line, line);
  const auto l = static_cast<std::uint32_t>(line);
  set.removeRange(adjLineTested, l, l);
  set.removeRange(adjLineInspected, l, l);
  set.removeRange(adjLineDead, l, l);
  if (kind) set.addRange(kind, l, l);
}
