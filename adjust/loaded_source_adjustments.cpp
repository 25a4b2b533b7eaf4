// Loading a source file brings its stored adjustments up to date with its markers.
#include "adjust/loaded_source_adjustments.h"

#include <cstdio>

#include "adjust/marker_scanner.h"

LoadedSourceAdjustments applyLoadedSourceMarkers(const std::string& path, const TextLines& text,
                                                 AdjustmentList& list, std::uint32_t now) {
  LoadedSourceAdjustments result;
  CvgAdjustSetPtr set;
  MarkerScanner& scanner = markerScanner();
  scanner.beginScan(result.warnings, set);
  for (std::size_t n = 1; n <= text.lineCount(); ++n) {
    scanner.scanLine(text.line(n), result.warnings, set);
  }
  scanner.endScan(result.warnings, set);
  result.totals = countAdjustLines(set.get());
  if (result.totals.dead || result.totals.tested || result.totals.inspected) {
    result.listChanged = list.storeSet(std::move(set), path, now);
  } else {
    int pos = list.position(path);
    if (pos >= 0) {
      list.removeEntry(pos);
      result.listChanged = true;
    }
  }
  return result;
}

std::string adjustTotalsText(const AdjustLineTotals& t) {
  char buf[96];
  snprintf(buf, sizeof buf, "%lu deadcode, %lu tested, %lu inspected", t.dead, t.tested,
           t.inspected);
  return buf;
}
