// Finds "kestrel:" adjustment markers in source text and turns them into an adjustment set,
// collecting warnings about doubtful markers on the way.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "coverage/cvg_adjust_set.h"

class MarkerScanner {
 public:
  // Starts a new scan: outputs absent, line count and open ranges reset.
  void beginScan(std::vector<std::string>& warnings, CvgAdjustSetPtr& set);
  // One line of text without its newline.
  void scanLine(std::string_view text, std::vector<std::string>& warnings, CvgAdjustSetPtr& set);
  // Closes the ranges still open at the last line.
  void endScan(std::vector<std::string>& warnings, CvgAdjustSetPtr& set);
  // The whole scan over a stream: every line up to a newline or end of file.
  void scanFile(FILE* stream, std::vector<std::string>& warnings, CvgAdjustSetPtr& set);

  std::uint32_t lineNumber() const { return lineNumber_; }

 private:
  // Index 0 dead code, 1 tested, 2 inspected.
  void oneLineMarker(int meaning, std::vector<std::string>& warnings, CvgAdjustSetPtr& set);
  void beginMarker(int meaning, std::vector<std::string>& warnings);
  void endMarker(bool implicit, std::vector<std::string>& warnings, CvgAdjustSetPtr& set);

  std::uint32_t lineNumber_ = 0;
  std::uint32_t open_[3] = {0, 0, 0};
  std::uint32_t lineStart_[3] = {0, 0, 0};
  bool saw_[3] = {false, false, false};
};

// The process-wide scanner; scans must not interleave.
MarkerScanner& markerScanner();

// Convenience for whole texts held in memory: begin, every line, end.
void scanLines(const std::vector<std::string>& lines, std::vector<std::string>& warnings,
               CvgAdjustSetPtr& set);
