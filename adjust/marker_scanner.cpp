// Marker grammar, range bookkeeping and the scanner's warnings.
#include "adjust/marker_scanner.h"

#include "support/string_helpers.h"

namespace {

constexpr std::string_view kPrefix = "kestrel:";
constexpr const char* kMeaningName[3] = {"deadcode", "tested", "inspected"};
constexpr CvgAdjust kLineKind[3] = {adjLineDead, adjLineTested, adjLineInspected};
constexpr CvgAdjust kRangeKind[3] = {adjRangeDead, adjRangeTested, adjRangeInspected};
// Ranges are closed, and overlaps reported, in the order dead code, inspected, tested.
constexpr int kCloseOrder[3] = {0, 2, 1};

enum Meaning { mDead = 0, mTested = 1, mInspected = 2 };


size_t skipBlanks(std::string_view s, size_t i) {
  while (i < s.size() && (s[i] == ' ' || s[i] == '\t')) ++i;
  return i;
}

bool startsWith(std::string_view s, size_t i, std::string_view word) {
  return s.size() - i >= word.size() && s.compare(i, word.size(), word) == 0;
}

// The meaning named at position i, or -1.
int meaningAt(std::string_view s, size_t i) {
  for (int m = 0; m < 3; ++m) {
    if (startsWith(s, i, kMeaningName[m])) return m;
  }
  return -1;
}

void addToSet(CvgAdjustSetPtr& set, CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
  if (!set) set = std::make_unique<CvgAdjustSet>();
  set->addRange(kind, first, last);
}

}  // namespace

MarkerScanner& markerScanner() {
  static MarkerScanner scanner;
  return scanner;
}

void MarkerScanner::beginScan(std::vector<std::string>& warnings, CvgAdjustSetPtr& set) {
  warnings.clear();
  set.reset();
  lineNumber_ = 0;
  for (int m = 0; m < 3; ++m) {
    open_[m] = 0;
    lineStart_[m] = 0;
    saw_[m] = false;
  }
}

void MarkerScanner::scanLine(std::string_view text, std::vector<std::string>& warnings,
                             CvgAdjustSetPtr& set) {
  ++lineNumber_;
  if (text.empty()) return;
  for (int m = 0; m < 3; ++m) {
    lineStart_[m] = open_[m];
    saw_[m] = false;
  }
  size_t pos = 0;
  while ((pos = text.find(kPrefix, pos)) != std::string_view::npos) {
    pos += kPrefix.size();
    size_t i = skipBlanks(text, pos);
    int m = meaningAt(text, i);
    if (m >= 0) {
      oneLineMarker(m, warnings, set);
    } else if (startsWith(text, i, "begin")) {
      int rm = meaningAt(text, skipBlanks(text, i + 5));
      if (rm >= 0) beginMarker(rm, warnings);
    } else if (startsWith(text, i, "end")) {
      endMarker(false, warnings, set);
    }
  }
}

void MarkerScanner::oneLineMarker(int meaning, std::vector<std::string>& warnings,
                                  CvgAdjustSetPtr& set) {
  const int n = static_cast<int>(lineNumber_);
  if (saw_[mDead] || saw_[mTested] || saw_[mInspected]) {
    warnings.push_back(stringPrintf("Warning: line %d: 'kestrel: %s' is on\n     the same line as "
                              "another adjustment directive",
                              n, kMeaningName[meaning]));
  }
  addToSet(set, kLineKind[meaning], lineNumber_, lineNumber_);
  saw_[meaning] = true;
}

void MarkerScanner::beginMarker(int meaning, std::vector<std::string>& warnings) {
  const int n = static_cast<int>(lineNumber_);
  for (int other : kCloseOrder) {
    if (lineStart_[other] != 0) {
      warnings.push_back(stringPrintf("Warning: line %d: 'kestrel: begin %s' overlaps\n     with "
                                "'kestrel: begin %s' from line %d",
                                n, kMeaningName[meaning], kMeaningName[other],
                                static_cast<int>(lineStart_[other])));
    }
  }
  if (open_[meaning] == 0) {
    open_[meaning] = lineNumber_;
    lineStart_[meaning] = lineNumber_;
  }
}

void MarkerScanner::endMarker(bool implicit, std::vector<std::string>& warnings,
                              CvgAdjustSetPtr& set) {
  const int n = static_cast<int>(lineNumber_);
  int closed = 0;
  for (int m : kCloseOrder) {
    if (open_[m] == 0) continue;
    if (implicit) {
      warnings.push_back(stringPrintf("Warning: line %d: 'kestrel: begin %s' at line %d\n     has no "
                                "matching 'kestrel: end' -- treating line %d as the end",
                                n, kMeaningName[m], static_cast<int>(open_[m]), n));
    }
    addToSet(set, kRangeKind[m], open_[m], lineNumber_);
    ++closed;
  }
  const char* prefix = implicit ? "implicit " : "";
  const int d = static_cast<int>(open_[mDead]);
  const int t = static_cast<int>(open_[mTested]);
  const int in = static_cast<int>(open_[mInspected]);
  if ((implicit && closed >= 2) || (!implicit && closed != 1)) {
    if (closed == 3) {
      warnings.push_back(stringPrintf("Warning: line %d: %s'kestrel: end' terminates \n"
                                "         'kestrel: begin deadcode' from line %d,\n"
                                "         'kestrel: begin inspected' from line %d,\n"
                                "     and 'kestrel: begin tested' from line %d",
                                n, prefix, d, in, t));
    } else if (closed == 2) {
      const char* a;
      const char* b;
      int la, lb;
      if (d && in) {
        a = "deadcode", b = "inspected", la = d, lb = in;
      } else if (d && t) {
        a = "deadcode", b = "tested", la = d, lb = t;
      } else {
        a = "inspected", b = "tested", la = in, lb = t;
      }
      warnings.push_back(stringPrintf("Warning: line %d: %s'kestrel: end' terminates \n"
                                "         'kestrel: begin %s' from line %d\n"
                                "     and 'kestrel: begin %s' from line %d",
                                n, prefix, a, la, b, lb));
    } else if (closed == 0) {
      warnings.push_back(
          stringPrintf("Warning: line %d: 'kestrel: end' with no matching 'kestrel: begin'", n));
    }
  }
  for (int m = 0; m < 3; ++m) open_[m] = 0;
}

void MarkerScanner::endScan(std::vector<std::string>& warnings, CvgAdjustSetPtr& set) {
  endMarker(true, warnings, set);
}

void MarkerScanner::scanFile(FILE* stream, std::vector<std::string>& warnings,
                             CvgAdjustSetPtr& set) {
  beginScan(warnings, set);
  char* buf = nullptr;
  size_t cap = 0;
  ssize_t len;
  while ((len = getline(&buf, &cap, stream)) >= 0) {
    std::string_view line(buf, static_cast<size_t>(len));
    if (!line.empty() && line.back() == '\n') line.remove_suffix(1);
    scanLine(line, warnings, set);
  }
  free(buf);
  endScan(warnings, set);
}

void scanLines(const std::vector<std::string>& lines, std::vector<std::string>& warnings,
               CvgAdjustSetPtr& set) {
  MarkerScanner& s = markerScanner();
  s.beginScan(warnings, set);
  for (const std::string& l : lines) s.scanLine(l, warnings, set);
  s.endScan(warnings, set);
}
