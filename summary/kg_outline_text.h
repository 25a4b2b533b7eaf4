// The rows of the summary outline: overall, directory, file and function rows built from the
// summary tree, their cells, lazy children, resorting and replacing the data.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "coverage/summary_types.h"
#include "outline/qr_outline_root.h"
#include "outline/qr_outline_text.h"
#include "summary/kg_columns.h"
#include "summary/name_style.h"
#include "support/errors.h"
#include "support/message_sink.h"

// What the rows ask of the window around them; each may be left empty (tests, no window).
struct KG_SummaryHooks {
  std::function<void(const char* message)> beginBusy;  // busy box and busy pointer
  std::function<void()> endBusy;
  // An error dialog: the message, then the error code's text.
  std::function<void(const std::string& message, ErrorCode code)> showError;
  // Opens the annotated source window on a file at a line (0: its first line).
  std::function<void(SumFile& file, std::uint32_t line)> openSource;
  // The data were summarised anew: an annotated source window follows the new summary.
  std::function<void(SumRoot& summary)> summaryReplaced;
};

// The actions by which rows open the annotated source window.
inline constexpr const char* KG_OpenDetailWindow = "KG_OpenDetailWindow";
inline constexpr const char* KG_ScrollToFunction = "KG_ScrollToFunction";
KG_SummaryHooks& kgSummaryHooks();

// A message text: the resource's value when the settings' database has one, else the default.
std::string kgMessageText(const char* resource, const char* fallback);

// The name style the settings describe (directory names, truncation, C++ name parts, width).
NameStyle kgNameStyleFromSettings();
// The name column width the user chose last (at start-up or in the name style dialog): a
// narrower window shrinks the column back to it, never below.
void kgSetChosenNameColumnWidth(unsigned width);

class KG_OutlineText : public QR_OutlineText {
 public:
  virtual std::uint32_t level() const = 0;
  virtual const char* name() const = 0;
  // The name in full, as no column width cuts it: a file's whole path, a function's name
  // with the file that holds it.
  virtual std::string full_name() const { return name(); }
  // Every child's subtree, then this row's own line.
  virtual void refresh_subtree();
  // Writes exactly `width` characters of a cell into buffer at position.
  virtual void cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                         std::uint32_t width);
  // Makes the child rows on first expansion.
  virtual void create_children() {}
  // Rebuilds this row's line and every ancestor's up to the overall row.
  virtual void refresh();

  void expand() override;
  // The whole subtree opened out of sight, then shown with one insertion: a display makes
  // room for the lines once instead of once per row.
  void expand_all() override;
  // The row's line from the shown columns.
  std::string build_line();
  // Builds the line for a row that has none yet (before it joins the outline).
  void give_first_line();

  virtual SumCounts& counts() = 0;
  virtual std::uint32_t& view_state() = 0;

 protected:
  // Cells 18 to 36, from the counts.
  bool common_cell(std::uint32_t column, std::string& out, std::uint32_t width);
  // The funcs, unusedFuncs and deadFuncs columns 11 to 17 shared by overall, directory and file.
  void function_count_cell(std::uint32_t column, std::string& out, std::uint32_t width,
                           std::uint32_t funcs, std::uint32_t unused, std::uint32_t dead);
  KG_OutlineText* parent_text() const;
};

class KG_SummaryFunc;

class KG_SummaryOverall : public KG_OutlineText {
 public:
  // Takes the data and the summary built from them.
  KG_SummaryOverall(std::unique_ptr<KgvData> data, std::unique_ptr<SumRoot> summary);
  ~KG_SummaryOverall() override;

  std::uint32_t level() const override { return 0; }
  const char* name() const override { return "Total Coverage"; }
  void cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                 std::uint32_t width) override;
  void create_children() override;
  void refresh() override;
  void expand() override;
  SumCounts& counts() override { return summary_->counts; }
  std::uint32_t& view_state() override { return summary_->viewState; }

  // Rebuilds the outline in another order; nothing when it is the current one unless forced.
  void resort(std::uint32_t order, bool force);
  // Summarises new data and shows them in place of the old, keeping expansion and selection
  // by name. On failure the old data stay and the failure is reported; the code is returned.
  // Notices about damaged line numbers go to `messages`.
  ErrorCode replace_data(std::unique_ptr<KgvData> data, MessageSink& messages);

  void count_adjustment_added(std::uint32_t kind, int deadFunctionDelta);
  void count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta);

  KgvData& data() { return *data_; }
  SumRoot& summary() { return *summary_; }
  std::uint32_t sort_order() const { return summary_->sortOrder; }

 private:
  // Steps of a rebuild: record the outline's state, take the rows down, put them back.
  void record_view_state();
  void take_down();
  void put_back();
  void restore_view_state();

  std::unique_ptr<KgvData> data_;
  std::unique_ptr<SumRoot> summary_;
};

class KG_SummaryDir : public KG_OutlineText {
 public:
  explicit KG_SummaryDir(SumDir* dir) : dir_(dir) {}
  std::uint32_t level() const override { return 1; }
  const char* name() const override { return dir_->name; }
  void cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                 std::uint32_t width) override;
  void create_children() override;
  SumCounts& counts() override { return dir_->counts; }
  std::uint32_t& view_state() override { return dir_->viewState; }
  void count_adjustment_added(std::uint32_t kind, int deadFunctionDelta);
  void count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta);
  SumDir* record() const { return dir_; }

 private:
  SumDir* dir_;
};

class KG_SummaryFile : public KG_OutlineText {
 public:
  explicit KG_SummaryFile(SumFile* file) : file_(file) {}
  std::uint32_t level() const override { return 2; }
  const char* name() const override { return file_->name; }
  std::string full_name() const override { return std::string(file_->dir ? file_->dir->name : "") + file_->name; }
  void cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                 std::uint32_t width) override;
  void create_children() override;
  SumCounts& counts() override { return file_->counts; }
  std::uint32_t& view_state() override { return file_->viewState; }
  // The function rows whose line range holds the line (children are made when needed).
  std::vector<KG_SummaryFunc*> functions_at_line(std::uint32_t line);
  // "KG_OpenDetailWindow" with the line (a std::uint32_t, or null for the first line), and
  // "KG_ScrollToFunction" (the first line).
  void open_detail(void* line);
  void scroll_to_function();
  void count_adjustment_added(std::uint32_t kind, int deadFunctionDelta);
  void count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta);
  SumFile* record() const { return file_; }

 private:
  SumFile* file_;
};

class KG_SummaryFunc : public KG_OutlineText {
 public:
  KG_SummaryFunc(SumFunc* func, SumFile* file) : func_(func), file_(file) {}
  std::uint32_t level() const override { return 3; }
  const char* name() const override { return func_->name; }
  std::string full_name() const override {
    return std::string(func_->name) + "  (" + (file_->dir ? file_->dir->name : "") + file_->name + ")";
  }
  void cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                 std::uint32_t width) override;
  SumCounts& counts() override { return func_->counts; }
  std::uint32_t& view_state() override { return func_->viewState; }
  // "KG_ScrollToFunction" (and Return or space on the row): the file's source at the
  // function's first line.
  void scroll_to_function();
  // One adjustment on an unused line of the function: its counts, its all-dead state, then the
  // same change in every ancestor with the dead-function change, and the lines redrawn.
  void adjustment_added(std::uint32_t kind);
  void adjustment_removed(std::uint32_t kind);
  SumFunc* record() const { return func_; }
  SumFile* file() const { return file_; }

 private:
  SumFunc* func_;
  SumFile* file_;
};

// The outline's root; its only child is the overall row.
class KG_OutlineRoot : public QR_OutlineRoot {
 public:
  explicit KG_OutlineRoot(QR_OutlineDisplay* display) : QR_OutlineRoot(display) {}
  KG_SummaryOverall* overall() const;
};
