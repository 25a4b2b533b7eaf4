// The summary's column table, the heading lines and the stripe positions.
#include "summary/kg_columns.h"

#include "settings/resource_table.h"
#include "summary/cell_format.h"

const std::vector<KG_Column>& kgColumnTable() {
  static const std::vector<KG_Column> table = {
      {1, 1, 0, ' ', false, "", "", nullptr, true},
      {2, 2, 4, ' ', true, "Dirs", "Number of directories", "showNumberOfDirectories", false},
      {3, 2, 5, ' ', false, "Files", "Number of files", "showNumberOfFiles", false},
      {6, 2, 11, ' ', true, "Compiled", "Time of instrumentation", "showCompilationDate", false},
      {4, 2, 6, ' ', false, "Runs", "Number of sessions", "showNumberOfRuns", true},
      {7, 2, 11, ' ', false, "Oldest Run", "Oldest session", "showOldestSessionDate", false},
      {8, 2, 11, ' ', false, "Newest Run", "Newest session", "showNewestSessionDate", false},
      {10, 2, 13, ' ', true, "Clock time", "Data collection clock time", "showRealTime", false},
      {9, 2, 13, ' ', true, "CPU time", "Data collection cpu time", "showCpuTime", false},
      {5, 2, 5, ' ', false, "Calls", "Function calls", "showNumberOfCalls", true},
      {11, 3, 7, ' ', false, "unused", "Unused", "showFunctionsUnused", true},
      {12, 3, 7, ' ', false, "unused%", "Percent unused", "showFunctionsPercentUnused", false},
      {13, 3, 7, ' ', false, "used", "Used", "showFunctionsUsed", true},
      {14, 3, 5, ' ', false, "used%", "Percent used", "showFunctionsPercentUsed", true},
      {15, 3, 7, ' ', false, "total", "Total", "showFunctionsTotal", false},
      {16, 3, 7, ' ', false, "dead", "Deadcode", "showFunctionsDeadcode", false},
      {17, 3, 5, ' ', false, "dead%", "Percent deadcode", "showFunctionsPercentDeadcode", false},
      {23, 5, 7, ' ', false, "unused", "Unused", "showAdjustedLinesUnused", true},
      {24, 5, 7, ' ', false, "unused%", "Percent unused", "showAdjustedLinesPercentUnused", false},
      {25, 5, 7, ' ', false, "used", "Used", "showAdjustedLinesUsed", true},
      {26, 5, 5, ' ', false, "used%", "Percent used", "showAdjustedLinesPercentUsed", true},
      {27, 5, 7, ' ', false, "total", "Total", "showAdjustedLinesTotal", false},
      {18, 4, 7, ' ', false, "unused", "Unused", "showLinesUnused", false},
      {19, 4, 7, ' ', false, "unused%", "Percent unused", "showLinesPercentUnused", false},
      {20, 4, 7, ' ', false, "used", "Used", "showLinesUsed", false},
      {21, 4, 5, ' ', false, "used%", "Percent used", "showLinesPercentUsed", false},
      {22, 4, 7, ' ', false, "total", "Total", "showLinesTotal", false},
      {28, 6, 8, ' ', false, "deadcode", "Number of deadcode lines", "showDeadcodeAdjustments", false},
      {29, 6, 9, ' ', false, "inspected", "Number of inspected lines", "showInspectedAdjustments", false},
      {30, 6, 7, ' ', false, "tested", "Number of tested lines", "showTestedAdjustments", false},
      {31, 6, 7, ' ', false, "total", "Total", "showTotalAdjustments", true},
      {32, 7, 7, ' ', false, "unused", "Unused", "showBlocksUnused", false},
      {33, 7, 7, ' ', false, "unused%", "Percent unused", "showBlocksPercentUnused", false},
      {34, 7, 7, ' ', false, "used", "Used", "showBlocksUsed", false},
      {35, 7, 5, ' ', false, "used%", "Percent used", "showBlocksPercentUsed", false},
      {36, 7, 7, ' ', false, "total", "Total", "showBlocksTotal", false},
      {37, 8, 0, ' ', false, "", "", "", false},
  };
  return table;
}

const std::vector<KG_GroupTitle>& kgGroupTitles() {
  static const std::vector<KG_GroupTitle> titles = {
      {1, "Sorting order:", nullptr, false},   {7, "BASIC BLOCKS", "BLOCKS", true},
      {4, "ACTUAL LINES", "LINES", true},      {6, "ADJUSTMENTS", "ADJS", true},
      {5, "ADJUSTED LINES", "ADJ LINES", true}, {3, "FUNCTIONS", "FUNCS", true},
  };
  return titles;
}

namespace {

// The switch of each column of the table, found once per settings table.
const std::vector<const KG_BoolResource*>& columnSwitches() {
  static const KG_Settings* forTable = nullptr;
  static std::vector<const KG_BoolResource*> switches;
  KG_Settings& s = kgSettings();
  if (forTable == &s) return switches;
  const KG_BoolResource* all[] = {
      &s.showNumberOfDirectories, &s.showNumberOfFiles, &s.showCompilationDate,
      &s.showNumberOfRuns, &s.showOldestSessionDate, &s.showNewestSessionDate,
      &s.showRealTime, &s.showCpuTime, &s.showNumberOfCalls, &s.showFunctionsUnused,
      &s.showFunctionsPercentUnused, &s.showFunctionsUsed, &s.showFunctionsPercentUsed,
      &s.showFunctionsTotal, &s.showFunctionsDeadcode, &s.showFunctionsPercentDeadcode,
      &s.showAdjustedLinesUnused, &s.showAdjustedLinesPercentUnused, &s.showAdjustedLinesUsed,
      &s.showAdjustedLinesPercentUsed, &s.showAdjustedLinesTotal, &s.showLinesUnused,
      &s.showLinesPercentUnused, &s.showLinesUsed, &s.showLinesPercentUsed, &s.showLinesTotal,
      &s.showDeadcodeAdjustments, &s.showInspectedAdjustments, &s.showTestedAdjustments,
      &s.showTotalAdjustments, &s.showBlocksUnused, &s.showBlocksPercentUnused,
      &s.showBlocksUsed, &s.showBlocksPercentUsed, &s.showBlocksTotal,
  };
  switches.clear();
  for (const KG_Column& c : kgColumnTable()) {
    const KG_BoolResource* found = nullptr;
    if (c.resource != nullptr) {
      for (const KG_BoolResource* r : all) {
        if (std::string(r->name()) == c.resource) found = r;
      }
    }
    switches.push_back(found);
  }
  forTable = &s;
  return switches;
}

}  // namespace

bool kgColumnShownBySettings(const KG_Column& c) {
  if (c.resource == nullptr) return true;
  const std::size_t index = static_cast<std::size_t>(&c - kgColumnTable().data());
  const auto& switches = columnSwitches();
  if (index >= switches.size() || switches[index] == nullptr) return false;
  return switches[index]->value;
}

std::vector<KG_ShownColumn> kgShownColumns(unsigned nameWidth, bool (*shown)(const KG_Column&)) {
  std::vector<KG_ShownColumn> out;
  std::uint32_t at = 0;
  for (const KG_Column& c : kgColumnTable()) {
    if (c.group == kgGroupEnd || !shown(c)) continue;
    std::uint32_t w = c.id == kNameColumnId ? nameWidth : c.width;
    out.push_back({&c, at, w});
    at += w + 1;
  }
  return out;
}

std::vector<KG_ShownColumn> kgShownColumns() {
  return kgShownColumns(static_cast<unsigned>(kgSettings().nameColumnWidth.value),
                        &kgColumnShownBySettings);
}

const std::vector<KG_ShownColumn>& kgShownColumnsCached() {
  // Rows ask for every line they build: the answer is kept while the choice is the same, and
  // the check is one look at each switch.
  static std::vector<KG_ShownColumn> cached;
  static bool cachedShown[kColumnCount] = {};
  static unsigned cachedWidth = 0;
  static bool valid = false;
  const unsigned width = static_cast<unsigned>(kgSettings().nameColumnWidth.value);
  const auto& switches = columnSwitches();
  bool same = valid && width == cachedWidth && switches.size() == kColumnCount;
  for (std::size_t i = 0; same && i < kColumnCount; ++i) {
    same = cachedShown[i] == (switches[i] != nullptr && switches[i]->value);
  }
  if (!same) {
    cached = kgShownColumns(width, &kgColumnShownBySettings);
    for (std::size_t i = 0; i < kColumnCount && i < switches.size(); ++i) {
      cachedShown[i] = switches[i] != nullptr && switches[i]->value;
    }
    cachedWidth = width;
    valid = true;
  }
  return cached;
}

std::uint32_t kgShownWidth(const std::vector<KG_ShownColumn>& shown) {
  return shown.empty() ? 0 : shown.back().start + shown.back().width + 1;
}

std::vector<std::uint32_t> kgStripePositions(const std::vector<KG_ShownColumn>& shown, int setting) {
  std::vector<std::uint32_t> out;
  if (setting != 2 && setting != 3) return out;
  for (std::size_t i = 0; i + 1 < shown.size(); ++i) {
    if (setting == 3 || shown[i].column->group != shown[i + 1].column->group) {
      out.push_back(shown[i].start + shown[i].width);
    }
  }
  return out;
}

static const KG_GroupTitle* titleOf(std::uint32_t group) {
  for (const KG_GroupTitle& t : kgGroupTitles()) {
    if (t.group == group) return &t;
  }
  return nullptr;
}

KG_Headings kgBuildHeadings(const std::vector<KG_ShownColumn>& shown, const char* sortLabel,
                            int headerSeparators) {
  KG_Headings h;
  for (std::size_t i = 0; i < shown.size();) {
    std::size_t j = i;
    while (j + 1 < shown.size() && shown[j + 1].column->group == shown[i].column->group) ++j;
    const std::uint32_t start = shown[i].start;
    const std::uint32_t span = shown[j].start + shown[j].width - start;
    const KG_GroupTitle* t = titleOf(shown[i].column->group);
    std::string text;
    if (t == nullptr) {
      text = std::string(span, ' ');
    } else {
      const char* title = t->title;
      if (std::string(title).size() > span && t->shortTitle != nullptr) title = t->shortTitle;
      text = t->centred ? justify_centre(title, span) : justify_left(title, span);
      text.resize(span, ' ');
      if (t->centred) h.marked.push_back({start, span});
    }
    h.first += text;
    h.first += ' ';
    i = j + 1;
  }
  for (const KG_ShownColumn& s : shown) {
    if (s.column->id == kNameColumnId) {
      h.second += justify_left(sortLabel ? sortLabel : "", s.width);
    } else {
      h.second += justify_right(s.column->heading, s.width);
    }
    h.second += s.column->separator;
  }
  h.stripes = kgStripePositions(shown, headerSeparators);
  return h;
}
