// Building the summary tree from loaded data: directories, files and functions, their
// actual and adjusted counts and per-line states; rebuilding counts after adjustments
// change; carrying row state from an old tree to a new one; finding a file by path.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "coverage/adjustment_list.h"
#include "coverage/kgv_data.h"
#include "coverage/summary_types.h"
#include "support/errors.h"
#include "support/message_sink.h"

// How the hits of several blocks on one line combine into the line's count.
enum HitsPolicy : std::uint32_t { hitsMax = 1, hitsMin = 2, hitsFirst = 3, hitsLast = 4 };

// The combination of the count already there (first) and a new one under the policy.
std::uint16_t combineHits(std::uint32_t policy, std::uint16_t first, std::uint16_t next);

// KESTREL_HITS_POLICY read once ("max", "min", "first", "last" under the option-name rule);
// 1 (max) when unset, empty or unknown. Later calls give the same value.
std::uint32_t getHitsPolicy();
// The same rule over a given value (nullptr: unset); for tests and the first call.
std::uint32_t hitsPolicyFromText(const char* value);

// PROCESS_CORRUPTED_LINES, read once: whether block lines past the last line of a file's
// functions are reported (the first of each file, as a notice) while line states are made.
bool corruptedLinesReported();
// Whether a summary makes every file's line states with its counts: only when damaged line
// numbers are to be reported, which they are as line states are made. Otherwise memory
// holds line states only for the file being shown or written.
inline bool lineStatesUpFront() { return corruptedLinesReported(); }

// Builds the whole tree and sorts it. The data's maps may be reordered in place where a
// function's blocks are out of line order. On failure nothing is handed back. Without line
// states (a report that reads each file once, a window that shows one file at a time) they
// are made per file by LazyLineStates. Notices about damaged line numbers go to `messages`.
ErrorCode buildSummary(KgvData& data, std::uint32_t sortOrder, std::uint32_t hitsPolicy,
                       const AdjustmentList& adjustments, MessageSink& messages,
                       std::unique_ptr<SumRoot>& out, bool withLineStates = true);

// Data with at least this many map entries in all are counted on several threads (the
// default is a few million; tests set 0 to have every summary counted so).
void setSummaryThreadThreshold(std::size_t mapEntries);
std::size_t summaryThreadThreshold();

// Counts again over an existing tree (after the adjustments changed), and line states where
// the tree keeps them; the records, names and order stay.
ErrorCode recomputeSummary(SumRoot& root, std::uint32_t hitsPolicy,
                           const AdjustmentList& adjustments, MessageSink& messages);

void setViewState(SumRoot& root, std::uint32_t value);
// Each row of the new tree takes the state of the old row of the same name (by level);
// rows without a match get the default. An absent old tree gives every row the default.
void carryViewState(SumRoot* newRoot, const SumRoot* oldRoot, std::uint32_t defaultValue);

// The first file whose directory name followed by its base name is the path; nullptr if none.
SumFile* findSumFile(SumRoot& root, const std::string& path);

// The line states of a file: those of the tree when it has them, else made on request
// (into a buffer reused for the next file) from the adjustments and the hits policy. The
// adjustment list must not change while this lives.
class LazyLineStates {
 public:
  // Without classes, states made here carry flags and counts only (a report needs no more).
  LazyLineStates(const AdjustmentList& adjustments, std::uint32_t hitsPolicy,
                 MessageSink& messages, bool withClasses = true);
  ~LazyLineStates();
  LazyLineStates(const LazyLineStates&) = delete;
  LazyLineStates& operator=(const LazyLineStates&) = delete;
  // Valid until the next call.
  const LineStates& of(const SumFile& file);
  // For a report, which needs no classes: the flags and hits of lines 0..lineCount packed
  // one word per line (flags << 16 | hits), made in one pass over the map where the file's
  // line numbers lie close together. Empty where they do not, or where the tree keeps the
  // file's line states: of() serves those. Valid until the next call.
  const std::vector<std::uint32_t>& packed(const SumFile& file);

 private:
  struct Index;
  std::unique_ptr<Index> index_;
  std::uint32_t policy_;
  MessageSink& messages_;
  bool withClasses_;
  LineStates scratch_;
  std::vector<std::uint32_t> packed_;
};
