// Summary rows: the cells of each row kind, lazy children, resorting and replacing the data.
#include "summary/kg_outline_text.h"

#include <algorithm>
#include <string_view>

#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "coverage/summary_sort.h"
#include "outline/qr_outline_actions.h"
#include "outline/qr_outline_display.h"
#include "settings/kg_resource.h"
#include "settings/resource_database.h"
#include "settings/resource_table.h"
#include "summary/cell_format.h"

KG_SummaryHooks& kgSummaryHooks() {
  static KG_SummaryHooks hooks;
  return hooks;
}

namespace {
unsigned gChosenNameWidth = 0;
}  // namespace

void kgSetChosenNameColumnWidth(unsigned width) { gChosenNameWidth = clamp_name_column_width(width); }

NameStyle kgNameStyleFromSettings() {
  KG_Settings& s = kgSettings();
  NameStyle n;
  n.directoryNames = s.directoryNames.value == KG_DirectoryStyleResource::rightmost ? rightmostSegment
                                                                                    : wholePathname;
  n.longDirectoryNames = static_cast<std::uint32_t>(s.longDirectoryNames.value);
  n.longFileNames = static_cast<std::uint32_t>(s.longFileNames.value);
  n.longFunctionNames = static_cast<std::uint32_t>(s.longFunctionNames.value);
  unsigned bits = showAllNameParts;
  if (s.suppressCplusplusClassName.value) bits &= ~unsigned(showClassQualifier);
  if (s.suppressCplusplusOperatorPrefix.value) bits &= ~unsigned(showOperatorKeyword);
  if (s.suppressCplusplusArgumentList.value) bits &= ~unsigned(showArgumentList);
  n.showBits = bits;
  n.nameColumnWidth = clamp_name_column_width(s.nameColumnWidth.value);
  n.chosenWidth = gChosenNameWidth != 0 ? gChosenNameWidth : n.nameColumnWidth;
  return n;
}

namespace {

// Puts text into the buffer at position, cut or padded to exactly width characters.
void place(std::string& buffer, std::size_t position, std::uint32_t width, std::string_view text) {
  if (buffer.size() < position + width) buffer.resize(position + width, ' ');
  std::size_t n = std::min<std::size_t>(text.size(), width);
  buffer.replace(position, n, text.data(), n);
  std::fill(buffer.begin() + static_cast<std::ptrdiff_t>(position + n),
            buffer.begin() + static_cast<std::ptrdiff_t>(position + width), ' ');
}

// A right-justified text cut from the left so that its end stays in view.
std::string_view fitRight(const std::string& s, std::uint32_t width) {
  std::string_view v(s);
  if (v.size() <= width) return v;
  return v.substr(v.size() - width);
}

// The tables of the actions that open the annotated source, made once for every row.
QR_CompiledActions* fileSourceActions() {
  static const QR_ActionSpec specs[] = {
      {KG_OpenDetailWindow, &QR_ActionCallWithArgument<KG_SummaryFile, &KG_SummaryFile::open_detail>},
      {KG_ScrollToFunction, &QR_ActionCall<KG_SummaryFile, &KG_SummaryFile::scroll_to_function>},
  };
  static QR_CompiledActions* table = new QR_CompiledActions(specs, 2);
  return table;
}

QR_CompiledActions* functionSourceActions() {
  static const QR_ActionSpec specs[] = {
      {KG_ScrollToFunction, &QR_ActionCall<KG_SummaryFunc, &KG_SummaryFunc::scroll_to_function>},
      // A function row has no children: Return and space open its source instead.
      {QR_OutlineExpandCollapse, &QR_ActionCall<KG_SummaryFunc, &KG_SummaryFunc::scroll_to_function>},
  };
  static QR_CompiledActions* table = new QR_CompiledActions(specs, 2);
  return table;
}

// The glyph in front of a function row: a few indented lines of text, 11 x 11.
const unsigned char* sourceGlyphBits() {
  static const char* const picture[11] = {
      "...........", ".#######...", "...........", "...######..", "...........", "...#######.",
      "...........", ".#####.....", "...........", "...####....", "...........",
  };
  static unsigned char bits[22] = {};
  static const bool made = [] {
    for (int y = 0; y < 11; ++y)
      for (int x = 0; x < 11; ++x)
        if (picture[y][x] == '#') bits[y * 2 + x / 8] |= static_cast<unsigned char>(1u << (x % 8));
    return true;
  }();
  (void)made;
  return bits;
}

void adjustFuncCounts(std::uint32_t& deadFuncs, int deadDelta) {
  if (deadDelta < 0 && deadFuncs < static_cast<std::uint32_t>(-deadDelta)) {
    deadFuncs = 0;
  } else {
    deadFuncs = static_cast<std::uint32_t>(static_cast<int>(deadFuncs) + deadDelta);
  }
}

}  // namespace

std::string kgMessageText(const char* resource, const char* fallback) {
  std::string value;
  if (XrmDatabase db = resourceDatabase(); db != nullptr && lookupResourceString(db, resource, value)) {
    return value;
  }
  return fallback;
}

// ---- KG_OutlineText

KG_OutlineText* KG_OutlineText::parent_text() const {
  QR_OutlineObject* p = parent_row();
  if (p == nullptr || p->is_root()) return nullptr;
  return static_cast<KG_OutlineText*>(p);
}

std::string KG_OutlineText::build_line() {
  const std::vector<KG_ShownColumn>& shown = kgShownColumnsCached();
  std::string line;
  line.reserve(kgShownWidth(shown));
  QR_OutlineDisplay* d = display();
  const std::uint32_t indent = d != nullptr ? d->text_column(level()) : 3 * level() + 3;
  for (const KG_ShownColumn& s : shown) {
    std::uint32_t width = s.width;
    if (s.column->id == kNameColumnId) width = width > indent ? width - indent : 0;
    const std::size_t at = line.size();
    cell_text(s.column->id, line, at, width);
    line.resize(at + width, ' ');
    line += s.column->separator;
  }
  return line;
}

void KG_OutlineText::give_first_line() {
  if (text_count() == 0) append_line(build_line().c_str());
}

void KG_OutlineText::refresh() {
  if (text_count() == 0) {
    append_line(build_line().c_str());
  } else {
    replace_line(build_line().c_str(), 0);
  }
  if (KG_OutlineText* p = parent_text()) p->refresh();
}

void KG_OutlineText::refresh_subtree() {
  for (std::uint32_t i = 0; i < child_count(); ++i) {
    if (auto* c = dynamic_cast<KG_OutlineText*>(child(i))) c->refresh_subtree();
  }
  if (text_count() == 0) {
    append_line(build_line().c_str());
  } else {
    replace_line(build_line().c_str(), 0);
  }
}

void KG_OutlineText::expand() {
  create_children();
  QR_OutlineText::expand();
}

void KG_OutlineText::expand_all() {
  QR_OutlineRoot* r = root();
  if (r == nullptr || !is_expandable_or_collapsible()) return;
  const bool was = r->hold_updates();
  const bool shown = is_displayed();
  if (shown && is_expanded()) collapse();
  create_children();
  // While this row is closed its descendants are out of sight: opening them draws nothing.
  for (std::uint32_t i = 0; i < child_count(); ++i) {
    QR_OutlineObject* c = child_row(i);
    if (c->is_expandable_or_collapsible()) c->expand_all();
  }
  expand();
  r->release_updates(was);
}

bool KG_OutlineText::common_cell(std::uint32_t column, std::string& out, std::uint32_t width) {
  const SumCounts& c = counts();
  switch (column) {
    case 18: out = format_count(width, c.unusedLines); return true;
    case 19: out = format_percent(width, c.unusedLines, c.lines); return true;
    case 20: out = format_count(width, c.usedLines()); return true;
    case 21: out = format_percent(width, c.usedLines(), c.lines); return true;
    case 22: out = format_count(width, c.lines); return true;
    case 23: out = format_count(width, c.adjUnusedLines); return true;
    case 24: out = format_percent(width, c.adjUnusedLines, c.adjLines); return true;
    case 25: out = format_count(width, c.adjUsedLines()); return true;
    case 26: out = format_percent(width, c.adjUsedLines(), c.adjLines); return true;
    case 27: out = format_count(width, c.adjLines); return true;
    case 28: out = format_count(width, c.deadLines); return true;
    case 29: out = format_count(width, c.inspectedLines); return true;
    case 30: out = format_count(width, c.testedLines); return true;
    case 31:
      out = format_count(width, c.deadLines + c.testedLines + c.inspectedLines);
      return true;
    case 32: out = format_count(width, c.unusedBlocks); return true;
    case 33: out = format_percent(width, c.unusedBlocks, c.blocks); return true;
    case 34: out = format_count(width, c.usedBlocks()); return true;
    case 35: out = format_percent(width, c.usedBlocks(), c.blocks); return true;
    case 36: out = format_count(width, c.blocks); return true;
    default: return false;
  }
}

void KG_OutlineText::function_count_cell(std::uint32_t column, std::string& out, std::uint32_t width,
                                         std::uint32_t funcs, std::uint32_t unused, std::uint32_t dead) {
  switch (column) {
    case 11: out = format_count(width, unused); break;
    case 12: out = format_percent(width, unused, funcs); break;
    case 13: out = format_count(width, funcs - std::min(unused, funcs)); break;
    case 14: out = format_percent(width, funcs - std::min(unused, funcs), funcs); break;
    case 15: out = format_count(width, funcs); break;
    case 16: out = format_count(width, dead); break;
    case 17: out = format_percent(width, dead, funcs); break;
    default: break;
  }
}

void KG_OutlineText::cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                               std::uint32_t width) {
  std::string out;
  common_cell(column, out, width);
  place(buffer, position, width, fitRight(out, width));
}

// ---- KG_SummaryOverall

KG_SummaryOverall::KG_SummaryOverall(std::unique_ptr<KgvData> data, std::unique_ptr<SumRoot> summary)
    : data_(std::move(data)), summary_(std::move(summary)) {
  if (!summary_) summary_ = std::make_unique<SumRoot>();
  if (!data_) data_ = std::make_unique<KgvData>();
  give_first_line();
  if (!summary_->dirOrder.empty()) make_expandable();
}

KG_SummaryOverall::~KG_SummaryOverall() {
  // The rows refer into the summary: they go first.
  destroy_children();
}

void KG_SummaryOverall::cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                                  std::uint32_t width) {
  const SumRoot& r = *summary_;
  std::string out;
  if (!common_cell(column, out, width)) {
    switch (column) {
      case 1: out = justify_left(name(), width); break;
      case 2: out = format_count(width, r.dirs); break;
      case 3: out = format_count(width, r.files); break;
      case 7: out = format_date(width, r.firstTime); break;
      case 8: out = format_date(width, r.lastTime); break;
      case 9: out = format_elapsed(width, data_->header.cpuTime); break;
      case 10: out = format_elapsed(width, data_->header.clockTime); break;
      default: function_count_cell(column, out, width, r.funcs, r.unusedFuncs, r.deadFuncs); break;
    }
  }
  place(buffer, position, width, column == 1 ? out : fitRight(out, width));
}

void KG_SummaryOverall::create_children() {
  if (child_count() != 0) return;
  QR_OutlineRoot* r = root();
  const bool was = r != nullptr ? r->hold_updates() : false;
  for (SumDir* d : summary_->dirOrder) {
    auto* row = new KG_SummaryDir(d);
    row->give_first_line();
    if (!d->fileOrder.empty()) row->make_expandable();
    add_child(row);
  }
  if (r != nullptr) r->release_updates(was);
}

void KG_SummaryOverall::expand() {
  KG_OutlineText::expand();
  if (is_expanded()) to_top();
}

void KG_SummaryOverall::refresh() {
  if (text_count() == 0) {
    append_line(build_line().c_str());
  } else {
    replace_line(build_line().c_str(), 0);
  }
}

void KG_SummaryOverall::record_view_state() {
  setViewState(*summary_, 0);
  std::vector<QR_OutlineObject*> stack{this};
  while (!stack.empty()) {
    QR_OutlineObject* row = stack.back();
    stack.pop_back();
    auto* t = static_cast<KG_OutlineText*>(row);
    t->view_state() = (row->is_expanded() ? 2u : 0u) | (row->is_selected() ? 4u : 0u);
    for (std::uint32_t i = 0; i < row->child_count(); ++i) stack.push_back(row->child_row(i));
  }
}

void KG_SummaryOverall::take_down() {
  to_top();
  QR_FamilyObject* r = parent();
  if (r != nullptr) r->remove_child(this);
  destroy_children();
  if (is_expanded() || is_expandable_or_collapsible()) make_leaf();
}

void KG_SummaryOverall::put_back() {
  refresh();
  if (!summary_->dirOrder.empty()) make_expandable();
}

void KG_SummaryOverall::restore_view_state() {
  QR_OutlineRoot* r = root();
  const bool was = r != nullptr ? r->hold_updates() : false;
  // Expanded rows again, depth first.
  std::vector<QR_OutlineObject*> stack;
  for (std::uint32_t i = child_count(); i-- > 0;) stack.push_back(child_row(i));
  while (!stack.empty()) {
    QR_OutlineObject* row = stack.back();
    stack.pop_back();
    if ((static_cast<KG_OutlineText*>(row)->view_state() & 2u) == 0) continue;
    row->expand();
    for (std::uint32_t i = row->child_count(); i-- > 0;) stack.push_back(row->child_row(i));
  }
  // Then the first selected row in display order.
  QR_OutlineObject* chosen = nullptr;
  for (QR_OutlineObject* row = next_row(); row != nullptr && is_ancestor_of(row); row = row->next_row()) {
    if ((static_cast<KG_OutlineText*>(row)->view_state() & 4u) != 0) {
      chosen = row;
      break;
    }
  }
  if ((summary_->viewState & 4u) != 0 && chosen == nullptr) chosen = this;
  if (r != nullptr) r->release_updates(was);
  if (chosen != nullptr) {
    chosen->select();
    chosen->make_visible();
  }
}

void KG_SummaryOverall::resort(std::uint32_t order, bool force) {
  if (order == summary_->sortOrder && !force) return;
  KG_SummaryHooks& hooks = kgSummaryHooks();
  if (hooks.beginBusy) hooks.beginBusy(kgSettings().outlineSortBusyMsg.c_str());
  QR_OutlineRoot* r = root();
  record_view_state();
  take_down();
  sortSummary(*summary_, order);
  put_back();
  if (r != nullptr) r->add_child(this);
  expand();
  restore_view_state();
  if (hooks.endBusy) hooks.endBusy();
}

ErrorCode KG_SummaryOverall::replace_data(std::unique_ptr<KgvData> data, MessageSink& messages) {
  KG_SummaryHooks& hooks = kgSummaryHooks();
  if (!data) return allOK;
  std::unique_ptr<SumRoot> fresh;
  ErrorCode rc =
      buildSummary(*data, summary_->sortOrder, summary_->hitsPolicy, adjustmentList(), messages, fresh,
                   summary_->lineStatesKept);
  if (rc != allOK || !fresh) {
    if (hooks.showError) hooks.showError(kgMessageText("sortCombinedData", "Unable to sort combined data"), rc);
    return rc == allOK ? corruptKgvFile : rc;
  }
  record_view_state();
  carryViewState(fresh.get(), summary_.get(), 0);
  fresh->viewState = summary_->viewState;
  QR_OutlineRoot* r = root();
  take_down();
  summary_ = std::move(fresh);
  data_ = std::move(data);
  put_back();
  if (r != nullptr) r->add_child(this);
  expand();
  restore_view_state();
  if (hooks.summaryReplaced) hooks.summaryReplaced(*summary_);
  return allOK;
}

void KG_SummaryOverall::count_adjustment_added(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(summary_->counts, 0, kind);
  adjustFuncCounts(summary_->deadFuncs, deadFunctionDelta);
}

void KG_SummaryOverall::count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(summary_->counts, kind, 0);
  adjustFuncCounts(summary_->deadFuncs, deadFunctionDelta);
}

// ---- KG_SummaryDir

void KG_SummaryDir::cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                              std::uint32_t width) {
  std::string out;
  if (!common_cell(column, out, width)) {
    switch (column) {
      case 1: out = directory_name_cell(dir_->name, width, kgNameStyleFromSettings()); break;
      case 3: out = format_count(width, dir_->files); break;
      case 7: out = format_date(width, dir_->firstTime); break;
      case 8: out = format_date(width, dir_->lastTime); break;
      default:
        function_count_cell(column, out, width, dir_->funcs, dir_->unusedFuncs, dir_->deadFuncs);
        break;
    }
  }
  place(buffer, position, width, column == 1 ? out : fitRight(out, width));
}

void KG_SummaryDir::create_children() {
  if (child_count() != 0) return;
  QR_OutlineRoot* r = root();
  const bool was = r != nullptr ? r->hold_updates() : false;
  for (SumFile* f : dir_->fileOrder) {
    auto* row = new KG_SummaryFile(f);
    row->give_first_line();
    if (!f->funcOrder.empty()) row->make_expandable();
    if (f->lineCount != 0) row->attach_actions(fileSourceActions());
    add_child(row);
  }
  if (r != nullptr) r->release_updates(was);
}

void KG_SummaryDir::count_adjustment_added(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(dir_->counts, 0, kind);
  adjustFuncCounts(dir_->deadFuncs, deadFunctionDelta);
}

void KG_SummaryDir::count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(dir_->counts, kind, 0);
  adjustFuncCounts(dir_->deadFuncs, deadFunctionDelta);
}

// ---- KG_SummaryFile

void KG_SummaryFile::cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                               std::uint32_t width) {
  std::string out;
  if (!common_cell(column, out, width)) {
    switch (column) {
      case 1: out = file_name_cell(file_->name, width, kgNameStyleFromSettings()); break;
      case 4: out = format_small_count(width, file_->sessions); break;
      case 6:
        if (file_->record != nullptr) out = format_date(width, file_->record->objHeader.buildTime);
        break;
      case 7: out = format_date(width, file_->firstTime); break;
      case 8: out = format_date(width, file_->lastTime); break;
      default:
        function_count_cell(column, out, width, file_->funcs, file_->unusedFuncs, file_->deadFuncs);
        break;
    }
  }
  place(buffer, position, width, column == 1 ? out : fitRight(out, width));
}

void KG_SummaryFile::create_children() {
  if (child_count() != 0) return;
  QR_OutlineRoot* r = root();
  const bool was = r != nullptr ? r->hold_updates() : false;
  for (SumFunc* f : file_->funcOrder) {
    auto* row = new KG_SummaryFunc(f, file_);
    row->give_first_line();
    if (f->firstLine != 0) {
      row->make_selectable();
      row->attach_actions(functionSourceActions());
      row->put_annotation(KG_ScrollToFunction, 0, 0, sourceGlyphBits(), 11, 11);
    }
    add_child(row);
  }
  if (r != nullptr) r->release_updates(was);
}

std::vector<KG_SummaryFunc*> KG_SummaryFile::functions_at_line(std::uint32_t line) {
  create_children();
  std::vector<KG_SummaryFunc*> out;
  for (std::uint32_t i = 0; i < child_count(); ++i) {
    auto* f = dynamic_cast<KG_SummaryFunc*>(child(i));
    if (f == nullptr) continue;
    const SumFunc* r = f->record();
    if (r->firstLine != 0 && line >= r->firstLine && line <= r->lastLine) out.push_back(f);
  }
  return out;
}

void KG_SummaryFile::open_detail(void* line) {
  KG_SummaryHooks& hooks = kgSummaryHooks();
  if (hooks.openSource) hooks.openSource(*file_, line != nullptr ? *static_cast<std::uint32_t*>(line) : 0);
}

void KG_SummaryFile::scroll_to_function() { open_detail(nullptr); }

void KG_SummaryFile::count_adjustment_added(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(file_->counts, 0, kind);
  adjustFuncCounts(file_->deadFuncs, deadFunctionDelta);
}

void KG_SummaryFile::count_adjustment_removed(std::uint32_t kind, int deadFunctionDelta) {
  moveUnusedLine(file_->counts, kind, 0);
  adjustFuncCounts(file_->deadFuncs, deadFunctionDelta);
}

// ---- KG_SummaryFunc

void KG_SummaryFunc::cell_text(std::uint32_t column, std::string& buffer, std::size_t position,
                               std::uint32_t width) {
  std::string out;
  if (!common_cell(column, out, width)) {
    KG_Settings& s = kgSettings();
    switch (column) {
      case 1: out = function_name_cell(func_->name, width, kgNameStyleFromSettings()); break;
      case 5: out = format_small_count(width, func_->calls); break;
      case 11:
        if (func_->allDead) out = justify_right(s.deadcodeFunctionText.c_str(), width);
        else if (func_->calls == 0) out = justify_right(s.unusedFunctionText.c_str(), width);
        break;
      case 13:
        if (func_->allDead) out = justify_right(s.deadcodeFunctionText.c_str(), width);
        else if (func_->calls != 0) out = justify_right(s.usedFunctionText.c_str(), width);
        break;
      case 16:
        if (func_->allDead) out = justify_right(s.deadcodeFunctionText.c_str(), width);
        break;
      default: break;
    }
  }
  place(buffer, position, width, column == 1 ? out : fitRight(out, width));
}

void KG_SummaryFunc::scroll_to_function() {
  std::uint32_t line = func_->firstLine;
  if (QR_OutlineObject* fileRow = parent_row()) {
    fileRow->perform_action(KG_OpenDetailWindow, &line);
  } else if (kgSummaryHooks().openSource) {
    kgSummaryHooks().openSource(*file_, line);
  }
}

void KG_SummaryFunc::adjustment_added(std::uint32_t kind) {
  moveUnusedLine(func_->counts, 0, kind);
  const bool was = func_->allDead;
  func_->allDead = func_->counts.lines > 0 && func_->counts.adjLines == 0;
  const int dead = (!was && func_->allDead) ? 1 : 0;
  auto* fileRow = dynamic_cast<KG_SummaryFile*>(parent_text());
  if (fileRow != nullptr) fileRow->count_adjustment_added(kind, dead);
  auto* dirRow = fileRow != nullptr ? dynamic_cast<KG_SummaryDir*>(fileRow->parent_row()) : nullptr;
  if (dirRow != nullptr) dirRow->count_adjustment_added(kind, dead);
  auto* all = dirRow != nullptr ? dynamic_cast<KG_SummaryOverall*>(dirRow->parent_row()) : nullptr;
  if (all != nullptr) all->count_adjustment_added(kind, dead);
  refresh();
}

void KG_SummaryFunc::adjustment_removed(std::uint32_t kind) {
  moveUnusedLine(func_->counts, kind, 0);
  const bool was = func_->allDead;
  func_->allDead = func_->counts.lines > 0 && func_->counts.adjLines == 0;
  const int dead = (was && !func_->allDead) ? -1 : 0;
  auto* fileRow = dynamic_cast<KG_SummaryFile*>(parent_text());
  if (fileRow != nullptr) fileRow->count_adjustment_removed(kind, dead);
  auto* dirRow = fileRow != nullptr ? dynamic_cast<KG_SummaryDir*>(fileRow->parent_row()) : nullptr;
  if (dirRow != nullptr) dirRow->count_adjustment_removed(kind, dead);
  auto* all = dirRow != nullptr ? dynamic_cast<KG_SummaryOverall*>(dirRow->parent_row()) : nullptr;
  if (all != nullptr) all->count_adjustment_removed(kind, dead);
  refresh();
}

// ---- KG_OutlineRoot

KG_SummaryOverall* KG_OutlineRoot::overall() const {
  return child_count() == 0 ? nullptr : dynamic_cast<KG_SummaryOverall*>(child(0));
}
