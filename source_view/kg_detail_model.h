// What the annotated source window shows and edits, apart from its widgets: the source text,
// the file's line states, the view settings, the pane texts and highlights derived from them,
// and the adjustment edits with the copy that undoes them.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "adjust/loaded_source_adjustments.h"
#include "adjust/source_prompter.h"
#include "adjust/source_text.h"
#include "adjust/src_file.h"
#include "coverage/cvg_adjust_set.h"
#include "coverage/line_state.h"
#include "coverage/summary_types.h"
#include "support/errors.h"

// How a line of the source and counts panes is coloured.
enum class KG_LineHighlight : std::uint8_t { none, used, unused, deadcode, tested, inspected };

// The five highlight switches of the source and counts panes.
struct KG_HighlightSwitches {
  bool deadcode = false;
  bool inspected = false;
  bool tested = false;
  bool used = false;
  bool unused = true;
  bool operator==(const KG_HighlightSwitches&) const = default;
};

// The highlight of a line by its class (adjusted or actual) and the switches; lines between
// two code lines of one class follow the class when `codelessRegions` is on.
KG_LineHighlight kgLineHighlight(const LineState& s, bool adjusted, const KG_HighlightSwitches& on,
                                 bool codelessRegions);
// The counts pane's text: the count text of the mode, "DEAD" left out when `hideDeadcode`,
// right-justified in four columns (a longer text is kept whole).
std::string kgCountCell(const LineState& s, bool adjusted, bool hideDeadcode);
// The adjustments pane's five characters: D/d, I/i, T/t in columns 0, 2 and 4 for the one-line
// and range kinds of the flags (the one-line letter wins).
std::string kgMarkerText(std::uint32_t flags);
// An adjustment on a line that is not an unused code line: it changes nothing and may be stale.
bool kgDubiousAdjustment(const LineState& s);

// The source as shown: tabs at every eighth column, the display form of the bytes, at most
// this many characters.
constexpr std::size_t kDisplayLineLimit = 5000;
std::string kgDisplayLine(std::string_view bytes, std::uint32_t displayCodeSet);

class KG_DetailModel {
 public:
  enum class EditRefusal { none, readOnly, actualShown, noCode };
  // What an edit of one line changed, for the rows of its functions.
  struct LineEdit {
    std::uint32_t line = 0;  // 1-based
    CvgAdjust oldKind = 0;   // dominant kind folded to the one-line kinds; 0: none
    CvgAdjust newKind = 0;
    bool oldDubious = false;
    bool newDubious = false;
  };
  struct SaveResult {
    ErrorCode source = allOK;       // writing the source text
    ErrorCode adjustments = allOK;  // rewriting the adjustments file after it
  };

  // The view settings come from the resources (showAdjustedAnnotations and the others).
  explicit KG_DetailModel(bool snapshot);
  KG_DetailModel(const KG_DetailModel&) = delete;
  KG_DetailModel& operator=(const KG_DetailModel&) = delete;

  // ---- loading
  // Whether the file of the summary (directory name with its "/", base name) is the one shown.
  bool shows(const std::string& dirName, const std::string& fileName) const;
  // Finds and reads the source text of a file not shown yet (the prompter asks for a new name
  // or whether to go on with a newer source). On failure the shown text stays.
  ErrorCode loadText(const std::string& path, std::uint32_t buildTime, SourcePrompter& prompter);
  // The markers of the text just loaded, brought into the adjustment list under the file's
  // summary path; the caller writes the file and recomputes when the list changed.
  LoadedSourceAdjustments rescanMarkers(const std::string& dirName, const std::string& fileName);
  // Takes a copy of the file's line states and its names.
  void takeLineStates(const SumFile& file, std::uint32_t hitsPolicy);

  // ---- what the panes show (indices are 0-based lines)
  // Text lines: at least one, an empty text shows one blank line.
  std::uint32_t lineCount() const;
  std::uint32_t lineStateCount() const { return static_cast<std::uint32_t>(states_.size()); }
  const std::vector<LineState>& lineStates() const { return states_; }
  const LineState* lineState(std::uint32_t index) const;
  std::string displayLine(std::uint32_t index) const;
  std::size_t longestDisplayLine() const;
  // Empty beyond the line states.
  std::string countCell(std::uint32_t index) const;
  std::string markerText(std::uint32_t index) const;
  bool dubious(std::uint32_t index) const;
  KG_LineHighlight highlight(std::uint32_t index) const;

  // ---- view
  bool isSnapshot() const { return snapshot_; }
  bool showAdjusted() const { return showAdjusted_; }
  bool showCounts() const { return showCounts_; }
  bool showLineNumbers() const { return showLineNumbers_; }
  const KG_HighlightSwitches& switches() const { return switches_; }
  void setView(bool adjusted, bool counts, bool lineNumbers, const KG_HighlightSwitches& switches);
  // Writes the eight view values into their resources (the current window only).
  void storeViewInResources() const;
  bool readOnly() const;
  // "%s%s %s%s": snapshot prefix, file name, coverage prompt, read-only suffix.
  std::string title() const;
  // The whole path of the file shown (the window's icon name).
  const std::string& sourcePath() const;
  const std::string& dirName() const { return dirName_; }
  const std::string& fileName() const { return fileName_; }
  std::string summaryPath() const { return dirName_ + fileName_; }

  // ---- editing
  bool modified() const { return modified_; }
  EditRefusal canEdit(std::uint32_t index) const;
  // Sets line index+1 to the kind (0 none, or a one-line kind): marker comment in the text,
  // flags in the line state, the line in the file's set of the adjustment list.
  LineEdit editAdjustment(CvgAdjust kind, std::uint32_t index);
  // The kind a click in column `col` of the adjustments pane asks for on the line: 0 for none
  // (the marker is taken off), the kind, or -1 for a column that does nothing.
  long clickKind(std::uint32_t index, std::uint32_t col) const;
  // Writes the text back to the source; on success the adjustments file is rewritten.
  SaveResult save(SourcePrompter& prompter);
  // Gives up the edits: the adjustment list takes back the set of before the first edit.
  // True when that changed the list (the caller recomputes the summary).
  bool discardEdits();
  // The annotated listing ("Save source and annotations as...").
  ErrorCode writeAnnotated(const std::string& prompt, SourcePrompter& prompter);

  // A read-only copy of everything shown, for a snapshot window.
  std::unique_ptr<KG_DetailModel> snapshot() const;

 private:
  std::unique_ptr<SrcFile> src_;
  SourceText text_;
  std::vector<LineState> states_;
  std::string dirName_, fileName_;
  bool snapshot_;
  bool showAdjusted_ = true, showCounts_ = true, showLineNumbers_ = true;
  KG_HighlightSwitches switches_;
  bool modified_ = false;
  CvgAdjustSetPtr savedAdjustments_;
  CvgAdjustSet* liveAdjustments_ = nullptr;  // in the adjustment list
};
