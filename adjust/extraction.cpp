// The extraction over all source files: scanning, the result sentence, the merge of the old
// and new adjustment lists, the adjustments file and the recomputed summary.
#include "adjust/extraction.h"

#include <cstdio>
#include <new>

#include "adjust/adjust_settings.h"
#include "adjust/adjustments_file.h"
#include "adjust/code_set.h"
#include "adjust/marker_scanner.h"
#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "support/string_helpers.h"

std::string manyFilesMessage(const std::string& format, unsigned long files,
                             unsigned long threshold) {
  // Only whole-number conversions are filled in; anything else stays as written so that a
  // stray conversion in a user's resource can never read what is not there.
  std::string out;
  unsigned long args[2] = {files, threshold};
  int next = 0;
  for (std::size_t i = 0; i < format.size(); ++i) {
    if (format[i] != '%' || i + 1 >= format.size()) {
      out.push_back(format[i]);
      continue;
    }
    if (format[i + 1] == '%') {
      out.push_back('%');
      ++i;
      continue;
    }
    std::size_t j = i + 1;
    while (j < format.size() && format[j] == 'l') ++j;
    if (j < format.size() && (format[j] == 'u' || format[j] == 'd' || format[j] == 'i') &&
        next < 2) {
      out += std::to_string(args[next++]);
      i = j;
      continue;
    }
    out.push_back('%');
  }
  return out;
}

namespace {

ExtractionOutcome extract(SumRoot& root, const std::string& skipPath, ExtractionQuestion& question,
                          MessageSink& messages) {
  ExtractionOutcome outcome;
  AdjustSettings settings = adjustSettings();
  unsigned long files = root.files;
  unsigned long threshold =
      settings.adjustmentExtractWarnThreshold < 2 ? 1 : settings.adjustmentExtractWarnThreshold;
  if (files >= threshold &&
      !question.continueWith(manyFilesMessage(settings.manySourceFilesToProcess, files, threshold)))
    return outcome;
  outcome.performed = true;

  bool haveSkip = !skipPath.empty();
  std::uint32_t now = adjustmentTimeNow();
  unsigned long processed = 0, missing = 0, binary = 0;
  std::vector<std::string> perFile;
  AdjustmentList fresh;
  for (const SumDir& d : root.dirRecords) {
    for (const SumFile& f : d.fileRecords) {
      std::string path = std::string(d.name) + f.name;
      if (haveSkip && path == skipPath) continue;
      ++processed;
      FILE* in = fopen(path.c_str(), "r");
      if (!in) {
        ++missing;
        perFile.push_back(stringPrintf(" *** %s: Cannot locate", path.c_str()));
        continue;
      }
      if (!isPlainText(fileno(in))) {
        ++binary;
        perFile.push_back(stringPrintf(" *** %s: Not a source file", path.c_str()));
        fclose(in);
        continue;
      }
      std::vector<std::string> warnings;
      CvgAdjustSetPtr set;
      markerScanner().scanFile(in, warnings, set);
      fclose(in);
      AdjustEntry entry(makeKgvFileRef(path, path), std::move(set));
      entry.setLoadTime(now);
      fresh.append(std::move(entry));
      if (!warnings.empty()) {
        perFile.push_back(stringPrintf(" *** %s:", path.c_str()));
        for (std::string& w : warnings) perFile.push_back(std::move(w));
      }
    }
  }

  unsigned long total = processed + (haveSkip ? 1 : 0);
  outcome.lines.push_back(stringPrintf("Of %lu file%s in the Kestrelgauge data, %lu %s missing%s",
                                       total, total == 1 ? "" : "s", missing,
                                       missing == 1 ? "was" : "were", haveSkip ? "," : ""));
  if (haveSkip) {
    outcome.lines.push_back("the file in the annotated source window was skipped because");
    outcome.lines.push_back("the adjustments for it are already accurate,");
  }
  outcome.lines.push_back(stringPrintf("and %lu %s ignored because %s contained binary data.",
                                       binary, binary == 1 ? "was" : "were",
                                       binary == 1 ? "it" : "they"));
  outcome.lines.push_back(" ");
  for (std::string& line : perFile) outcome.lines.push_back(std::move(line));

  AdjustmentList& list = adjustmentList();
  list = AdjustmentList::merge(std::move(list), std::move(fresh));
  outcome.writeStatus = writeAdjustmentsFile();
  outcome.recomputeStatus = recomputeSummary(root, root.hitsPolicy, list, messages);
  return outcome;
}

}  // namespace

ExtractionOutcome extractAllAdjustments(SumRoot& root, const std::string& skipPath,
                                        ExtractionQuestion& question, MessageSink& messages) {
  try {
    return extract(root, skipPath, question, messages);
  } catch (const std::bad_alloc&) {
    ExtractionOutcome failed;
    failed.performed = true;
    failed.recomputeStatus = outOfMemory;
    return failed;
  }
}
