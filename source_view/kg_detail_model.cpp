// The annotated source window's contents: pane texts, highlights, titles and adjustment edits.
#include "source_view/kg_detail_model.h"

#include <algorithm>
#include <cstdio>

#include "adjust/adjustments_file.h"
#include "adjust/annotated_listing.h"
#include "adjust/marker_comments.h"
#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "settings/resource_table.h"

namespace {

bool unusedCode(const LineState& s) { return (s.flags & LineHasCode) && s.count == 0; }

bool unusedMarked(const LineState& s, std::uint32_t mask) { return unusedCode(s) && (s.flags & mask); }

// The dominant kind of the flags, range kinds folded onto the one-line kinds.
CvgAdjust oneLineKind(std::uint32_t flags) {
  CvgAdjust k = dominantAdjust(flags);
  return k >= adjRangeDead ? k >> 4 : k;
}

// Display columns of UTF-8 text with tabs at every eighth column, up to the limit.
std::size_t displayWidth(std::string_view bytes) {
  std::size_t col = 0;
  for (unsigned char c : bytes) {
    if (c == '\t') col = (col / 8 + 1) * 8;
    else if ((c & 0xC0) != 0x80) ++col;
    if (col >= kDisplayLineLimit) return kDisplayLineLimit;
  }
  return col;
}

}  // namespace

KG_LineHighlight kgLineHighlight(const LineState& s, bool adjusted, const KG_HighlightSwitches& on,
                                 bool codelessRegions) {
  const bool dead = on.deadcode && unusedMarked(s, adjDeadMask);
  switch (adjusted ? s.adjustedClass : s.actualClass) {
    case ClassNothing:
      return dead ? KG_LineHighlight::deadcode : KG_LineHighlight::none;
    case ClassUsed:
      if (on.tested && unusedMarked(s, adjTestedMask)) return KG_LineHighlight::tested;
      if (on.inspected && unusedMarked(s, adjInspectedMask)) return KG_LineHighlight::inspected;
      return on.used ? KG_LineHighlight::used : KG_LineHighlight::none;
    case ClassBetweenUsed:
      if (dead) return KG_LineHighlight::deadcode;
      return codelessRegions && on.used ? KG_LineHighlight::used : KG_LineHighlight::none;
    case ClassUnused:
      return on.unused ? KG_LineHighlight::unused : KG_LineHighlight::none;
    case ClassBetweenUnused:
      if (dead) return KG_LineHighlight::deadcode;
      return codelessRegions && on.unused ? KG_LineHighlight::unused : KG_LineHighlight::none;
    default:
      return KG_LineHighlight::none;
  }
}

std::string kgCountCell(const LineState& s, bool adjusted, bool hideDeadcode) {
  std::string text = countText(adjusted, s.flags, s.count);
  if (hideDeadcode && text == "DEAD") text.clear();
  if (text.size() < 4) text.insert(0, 4 - text.size(), ' ');
  return text;
}

std::string kgMarkerText(std::uint32_t flags) {
  std::string t = "     ";
  if (flags & adjRangeDead) t[0] = 'd';
  if (flags & adjLineDead) t[0] = 'D';
  if (flags & adjRangeInspected) t[2] = 'i';
  if (flags & adjLineInspected) t[2] = 'I';
  if (flags & adjRangeTested) t[4] = 't';
  if (flags & adjLineTested) t[4] = 'T';
  return t;
}

bool kgDubiousAdjustment(const LineState& s) { return (s.flags & adjAnyMask) && !unusedCode(s); }

std::string kgDisplayLine(std::string_view bytes, std::uint32_t displayCodeSet) {
  std::string shown = sourceDisplayForm(bytes, displayCodeSet);
  if (shown.find('\t') == std::string::npos && shown.size() <= kDisplayLineLimit) return shown;
  std::string out;
  out.reserve(shown.size() + 16);
  std::size_t col = 0;
  for (const char ch : shown) {
    const unsigned char c = static_cast<unsigned char>(ch);
    const bool continuation = (c & 0xC0) == 0x80;
    // Stop at the limit, but never between the bytes of one character.
    if (!continuation && col >= kDisplayLineLimit) break;
    if (c == '\t') {
      const std::size_t next = std::min((col / 8 + 1) * 8, kDisplayLineLimit);
      out.append(next - col, ' ');
      col = next;
      continue;
    }
    if (!continuation) ++col;
    out.push_back(ch);
  }
  return out;
}

// ---- KG_DetailModel

KG_DetailModel::KG_DetailModel(bool snapshot) : snapshot_(snapshot) {
  const KG_Settings& s = kgSettings();
  showAdjusted_ = s.showAdjustedAnnotations.value;
  showCounts_ = s.showCounts.value;
  showLineNumbers_ = s.showLineNumbers.value;
  switches_.deadcode = s.highlightDeadcodeLines.value;
  switches_.inspected = s.highlightInspectedLines.value;
  switches_.tested = s.highlightTestedLines.value;
  switches_.used = s.highlightUsedLines.value;
  switches_.unused = s.highlightUnusedLines.value;
}

bool KG_DetailModel::shows(const std::string& dirName, const std::string& fileName) const {
  return src_ != nullptr && dirName == dirName_ && fileName == fileName_;
}

ErrorCode KG_DetailModel::loadText(const std::string& path, std::uint32_t buildTime, SourcePrompter& prompter) {
  auto src = std::make_unique<SrcFile>();
  ErrorCode rc = src->openForReading(path, kgSettings().fileNotFoundPrompt.value, buildTime, prompter);
  if (rc != allOK) return rc;
  SourceText text;
  rc = text.read(*src);
  src->closeReading();
  if (rc != allOK) return rc;
  src_ = std::move(src);
  text_ = std::move(text);
  modified_ = false;
  savedAdjustments_.reset();
  liveAdjustments_ = nullptr;
  return allOK;
}

LoadedSourceAdjustments KG_DetailModel::rescanMarkers(const std::string& dirName, const std::string& fileName) {
  return applyLoadedSourceMarkers(dirName + fileName, text_, adjustmentList(), adjustmentTimeNow());
}

void KG_DetailModel::takeLineStates(const SumFile& file, std::uint32_t hitsPolicy) {
  // A tree that keeps no line states has them made here for this file. Notices of damaged
  // line numbers are not wanted now: when they are, every file's states were made up front.
  MessageList notices;
  LazyLineStates lazy(adjustmentList(), hitsPolicy, notices);
  const LineStates& lines = lazy.of(file);
  // The text's lines, and those the data has beyond a source that shrank since; but a line
  // number far past the text's end costs no memory here.
  const auto textLines = static_cast<std::uint32_t>(std::min<std::size_t>(text_.lineCount(), 0x0FFFFFFF));
  const std::uint32_t beyond = std::min<std::uint32_t>(lines.size(), textLines + 100000);
  states_ = lines.dense(std::max<std::uint32_t>({1, textLines, beyond}));
  fileName_ = file.name;
  dirName_ = file.dir != nullptr ? file.dir->name : "";
  // The summary's lines carry the adjustments of when it was counted; edits not saved since
  // are in the adjustment list only, and the window shows them.
  const CvgAdjustSet* set = adjustmentList().findSet(summaryPath());
  bool changed = false;
  for (std::uint32_t i = 0; i < states_.size(); ++i) {
    const std::uint32_t flags = (states_[i].flags & ~adjAnyMask) | (set ? set->lineKinds(i + 1) : 0);
    changed = changed || flags != states_[i].flags;
    states_[i].flags = flags;
  }
  if (changed) classifyLines(states_);
}

std::uint32_t KG_DetailModel::lineCount() const {
  return std::max<std::uint32_t>(1, static_cast<std::uint32_t>(text_.lineCount()));
}

const LineState* KG_DetailModel::lineState(std::uint32_t index) const {
  return index < states_.size() ? &states_[index] : nullptr;
}

std::string KG_DetailModel::displayLine(std::uint32_t index) const {
  if (index >= text_.lineCount()) return index == 0 ? " " : "";
  return kgDisplayLine(text_.view(index + 1), src_ ? src_->displayCodeSet() : 1);
}

std::size_t KG_DetailModel::longestDisplayLine() const {
  // The bytes are an upper bound but for tabs; a look at each line settles it once per text.
  std::size_t longest = 1;
  for (std::size_t n = 1; n <= text_.lineCount(); ++n) longest = std::max(longest, displayWidth(text_.view(n)));
  return longest;
}

std::string KG_DetailModel::countCell(std::uint32_t index) const {
  const LineState* s = lineState(index);
  return s ? kgCountCell(*s, showAdjusted_, kgSettings().hideDeadcodeCounts.value) : std::string();
}

std::string KG_DetailModel::markerText(std::uint32_t index) const {
  const LineState* s = lineState(index);
  return s ? kgMarkerText(s->flags) : std::string();
}

bool KG_DetailModel::dubious(std::uint32_t index) const {
  const LineState* s = lineState(index);
  return s && kgDubiousAdjustment(*s);
}

KG_LineHighlight KG_DetailModel::highlight(std::uint32_t index) const {
  const LineState* s = lineState(index);
  if (!s) return KG_LineHighlight::none;
  return kgLineHighlight(*s, showAdjusted_, switches_, kgSettings().highlightCodelessRegions.value);
}

void KG_DetailModel::setView(bool adjusted, bool counts, bool lineNumbers, const KG_HighlightSwitches& switches) {
  showAdjusted_ = adjusted;
  showCounts_ = counts;
  showLineNumbers_ = lineNumbers;
  switches_ = switches;
}

void KG_DetailModel::storeViewInResources() const {
  KG_Settings& s = kgSettings();
  s.showAdjustedAnnotations = showAdjusted_;
  s.showCounts = showCounts_;
  s.showLineNumbers = showLineNumbers_;
  s.highlightDeadcodeLines = switches_.deadcode;
  s.highlightInspectedLines = switches_.inspected;
  s.highlightTestedLines = switches_.tested;
  s.highlightUsedLines = switches_.used;
  s.highlightUnusedLines = switches_.unused;
}

bool KG_DetailModel::readOnly() const {
  return snapshot_ || !src_ || !src_->writable() || !adjustmentsWritable();
}

std::string KG_DetailModel::title() const {
  const KG_Settings& s = kgSettings();
  // A snapshot stays marked read only whatever its view: it never writes.
  std::string suffix;
  if (snapshot_ || !src_ || !src_->writable()) suffix = s.readOnlySourcePrompt.value;
  else if (!adjustmentsWritable()) suffix = s.readOnlyAdjustmentsPrompt.value;
  const std::string& prompt = showAdjusted_ ? s.coverageAdjustedPrompt.value : s.coverageActualPrompt.value;
  return std::string(snapshot_ ? "Snapshot of " : "") + fileName_ + " " + prompt + suffix;
}

const std::string& KG_DetailModel::sourcePath() const {
  static const std::string none;
  return src_ ? src_->foundName() : none;
}

KG_DetailModel::EditRefusal KG_DetailModel::canEdit(std::uint32_t index) const {
  if (readOnly()) return EditRefusal::readOnly;
  if (!showAdjusted_) return EditRefusal::actualShown;
  if (index >= states_.size()) return EditRefusal::noCode;
  return EditRefusal::none;
}

long KG_DetailModel::clickKind(std::uint32_t index, std::uint32_t col) const {
  CvgAdjust kind;
  if (col == 0) kind = adjLineDead;
  else if (col == 2) kind = adjLineInspected;
  else if (col == 4 || col == 5) kind = adjLineTested;
  else return -1;
  const LineState* s = lineState(index);
  return s && (s->flags & kind) ? 0 : static_cast<long>(kind);
}

KG_DetailModel::LineEdit KG_DetailModel::editAdjustment(CvgAdjust kind, std::uint32_t index) {
  LineEdit e;
  if (index >= states_.size() || (kind != 0 && kind != adjLineDead && kind != adjLineTested &&
                                  kind != adjLineInspected))
    return e;
  LineState& s = states_[index];
  e.line = index + 1;
  e.oldKind = oneLineKind(s.flags);
  e.oldDubious = kgDubiousAdjustment(s);
  s.flags = (s.flags & ~adjLineMask) | kind;
  e.newKind = oneLineKind(s.flags);
  e.newDubious = kgDubiousAdjustment(s);
  // The lines around it may change class with it (a stretch of unused lines broken by a line
  // now counted as used): the classes are worked out again.
  classifyLines(states_);
  if (!liveAdjustments_) {
    // The first edit since the text was loaded or saved: keep what to go back to.
    AdjustmentList& list = adjustmentList();
    const std::string path = summaryPath();
    CvgAdjustSet* live = list.findSet(path);
    savedAdjustments_ = copyAdjustSet(live);
    liveAdjustments_ = live ? live : list.setForPath(path, nullptr, adjustmentTimeNow());
  }
  editAdjustmentLine(text_, e.line, kind, *liveAdjustments_);
  modified_ = true;
  return e;
}

KG_DetailModel::SaveResult KG_DetailModel::save(SourcePrompter& prompter) {
  SaveResult r;
  if (!src_) {
    r.source = errorOccured;
    return r;
  }
  r.source = src_->openForWriting(src_->foundName(), kgSettings().writeSourcePrompt.value, true, prompter);
  if (r.source != allOK) return r;
  r.source = text_.write(*src_);
  if (r.source == allOK) {
    r.source = src_->finishWriting();
  } else {
    src_->finishWriting();  // the failure stands; the source is left as it was
  }
  if (r.source != allOK) return r;
  modified_ = false;
  r.adjustments = writeAdjustmentsFile();
  savedAdjustments_.reset();
  liveAdjustments_ = nullptr;
  return r;
}

bool KG_DetailModel::discardEdits() {
  if (!liveAdjustments_) return false;
  AdjustmentList& list = adjustmentList();
  const std::string path = summaryPath();
  bool changed;
  if (savedAdjustments_) {
    changed = list.storeSet(std::move(savedAdjustments_), path, adjustmentTimeNow());
  } else {
    // There was no set before the edits: the entry made for them goes.
    int at = list.position(path);
    changed = at >= 0;
    list.removeEntry(at);
  }
  savedAdjustments_.reset();
  liveAdjustments_ = nullptr;
  modified_ = false;
  return changed;
}

ErrorCode KG_DetailModel::writeAnnotated(const std::string& prompt, SourcePrompter& prompter) {
  if (!src_) return errorOccured;
  std::vector<AnnotatedLine> lines;
  lines.reserve(lineCount());
  for (std::uint32_t i = 0; i < lineCount(); ++i) lines.push_back({countCell(i), displayLine(i)});
  return writeAnnotatedListing(*src_, lines, prompt, "", prompter);
}

std::unique_ptr<KG_DetailModel> KG_DetailModel::snapshot() const {
  auto copy = std::make_unique<KG_DetailModel>(true);
  if (src_) copy->src_ = src_->closedCopy();
  copy->text_.assign(text_.bytes());
  copy->states_ = states_;
  copy->dirName_ = dirName_;
  copy->fileName_ = fileName_;
  copy->setView(showAdjusted_, showCounts_, showLineNumbers_, switches_);
  return copy;
}
