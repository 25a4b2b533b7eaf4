// What the annotated source window does with the markers of a source file it loads: scan
// the text, and bring the file's entry in the adjustment list in line with it.
#pragma once

#include <string>
#include <vector>

#include "adjust/marker_comments.h"
#include "coverage/adjustment_list.h"

struct LoadedSourceAdjustments {
  std::vector<std::string> warnings;  // shown under compileAdjWindowErrorsPrompt
  AdjustLineTotals totals;            // shown as "%lu deadcode, %lu tested, %lu inspected"
  bool listChanged = false;           // the caller then writes the file and recomputes
};

// Scans every line of the text. When it marks any line the set is stored for the path;
// otherwise the path's entry, if any, is removed.
LoadedSourceAdjustments applyLoadedSourceMarkers(const std::string& path, const TextLines& text,
                                                 AdjustmentList& list, std::uint32_t now);

// "%lu deadcode, %lu tested, %lu inspected"
std::string adjustTotalsText(const AdjustLineTotals& totals);
