// "Extract adjustments from all source files": every source file of the summary is scanned
// for markers, the new sets replace the old ones, the adjustments file is rewritten and the
// summary's adjusted figures recomputed.
#pragma once

#include <string>
#include <vector>

#include "coverage/summary_types.h"
#include "support/errors.h"
#include "support/message_sink.h"

// The question asked before a long extraction. The console goes on without asking.
class ExtractionQuestion {
 public:
  virtual ~ExtractionQuestion() = default;
  // True to go on.
  virtual bool continueWith(const std::string& message) = 0;
};

class AlwaysContinue : public ExtractionQuestion {
 public:
  bool continueWith(const std::string&) override { return true; }
};

struct ExtractionOutcome {
  bool performed = false;           // false when the user declined to go on
  std::vector<std::string> lines;   // the result lines, in order
  ErrorCode writeStatus = allOK;    // writing the adjustments file
  ErrorCode recomputeStatus = allOK;
};

// The "many files" question text: the resource's format filled with the file count and the
// threshold ("%u", "%d" and their kin take the numbers in turn; "%%" a percent sign).
std::string manyFilesMessage(const std::string& format, unsigned long files,
                             unsigned long threshold);

// Runs the extraction over the summary's files in record order, skipping `skipPath` (the
// file of an open annotated source window; empty for none), with the process-wide
// adjustment list and the summary's hits policy. Notices of the recount go to `messages`.
ExtractionOutcome extractAllAdjustments(SumRoot& root, const std::string& skipPath,
                                        ExtractionQuestion& question, MessageSink& messages);
