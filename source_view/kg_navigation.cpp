// Unused lines and their runs, the find pattern, and the targets of the moving keys.
#include "source_view/kg_navigation.h"

#include <algorithm>
#include <string>

#include "coverage/cvg_adjust.h"

bool kgUnusedLine(const LineState& s) {
  return (s.flags & LineHasCode) && s.count == 0 && (s.flags & adjAnyMask) == 0;
}

bool kgRunContinues(const LineState& s, std::uint32_t mask, bool stopAfterCodeless) {
  if ((s.flags & (LineHasCode | LineFuncStart | LineFuncEnd)) == 0) return !stopAfterCodeless;
  if ((s.flags & LineHasCode) && s.count == 0 && (s.flags & adjDeadMask)) return !stopAfterCodeless;
  if (s.flags & mask) return false;
  return kgUnusedLine(s);
}

std::uint32_t kgNextUnused(const std::vector<LineState>& states, std::uint32_t reference, std::uint32_t textLines,
                           bool stopAfterCodeless) {
  const auto n = static_cast<std::uint32_t>(states.size());
  const std::uint32_t limit = std::min(n, textLines);
  auto at = [&](std::uint32_t line) -> const LineState& { return states[line - 1]; };
  std::uint32_t start = 1;
  if (reference != 0) {
    if (reference > limit) return 0;
    start = reference;
    if (kgUnusedLine(at(reference))) {
      // Past the run the reference line belongs to.
      start = reference + 1;
      while (start <= limit && kgRunContinues(at(start), LineFuncStart, stopAfterCodeless)) ++start;
      if (start > limit) return 0;
    }
  }
  for (std::uint32_t l = start; l <= limit; ++l)
    if (kgUnusedLine(at(l))) return l;
  return 0;
}

std::uint32_t kgPreviousUnused(const std::vector<LineState>& states, std::uint32_t reference,
                               bool stopAfterCodeless) {
  const auto n = static_cast<std::uint32_t>(states.size());
  auto at = [&](std::uint32_t line) -> const LineState& { return states[line - 1]; };
  std::uint32_t start;
  if (reference > n) {
    start = n;
  } else {
    if (reference == 0) return 0;
    start = reference;
    if (kgUnusedLine(at(reference))) {
      // Above the run the reference line belongs to.
      for (;;) {
        if (start == 1) return 0;
        if (!kgRunContinues(at(start - 1), LineFuncEnd, stopAfterCodeless)) break;
        --start;
      }
      --start;
    }
  }
  for (std::uint32_t l = start; l >= 1; --l)
    if (kgUnusedLine(at(l))) return l;
  return 0;
}

bool kgFindMatches(std::string_view text, std::string_view line) {
  // "*text*" without its blanks and tabs, up to a ";".
  std::string p = "*";
  for (char c : text) {
    if (c == ';') break;
    if (c != ' ' && c != '\t') p.push_back(c);
  }
  p.push_back('*');
  const auto blank = [](char c) { return c == ' ' || c == '\t'; };
  std::size_t i = 0, j = 0, star = std::string::npos, mark = 0;
  while (i < line.size()) {
    if (j < p.size() && p[j] != '*' && (p[j] == '?' || p[j] == line[i])) {
      ++i;
      ++j;
    } else if (j < p.size() && p[j] == '*') {
      star = j++;
      mark = i;
    } else if (blank(line[i])) {
      ++i;  // a blank the text does not ask for here
    } else if (star != std::string::npos) {
      j = star + 1;
      i = ++mark;
    } else {
      return false;
    }
  }
  while (j < p.size() && p[j] == '*') ++j;
  return j == p.size();
}

std::uint32_t kgPageUpTarget(const KG_View& v) {
  return v.first > v.visible ? std::max<std::uint32_t>(v.first - v.visible, 1) : 1;
}

std::uint32_t kgPageDownTarget(const KG_View& v) { return v.first + v.visible + 1; }

std::uint32_t kgLineUpTarget(std::uint32_t below) { return below < 2 ? below : below - 1; }

std::uint32_t kgLineDownTarget(std::uint32_t above) { return above + 1; }
