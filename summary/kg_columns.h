// The summary's column table, which columns are shown, the two heading lines and the stripes.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

enum : std::uint32_t {
  kgGroupName = 1,
  kgGroupMisc = 2,
  kgGroupFunctions = 3,
  kgGroupLines = 4,
  kgGroupAdjLines = 5,
  kgGroupAdjustments = 6,
  kgGroupBlocks = 7,
  kgGroupEnd = 8,
};

struct KG_Column {
  std::uint32_t id;
  std::uint32_t group;
  std::uint32_t width;  // 0 for the name column: its width is a preference
  char separator;
  bool restricted;      // no toggle in the Columns dialog
  const char* heading;  // second heading line
  const char* label;    // Columns dialog
  const char* resource; // the preference deciding whether it is shown; null: always
  bool defaultShown;
};

constexpr std::uint32_t kNameColumnId = 1;
constexpr std::size_t kColumnCount = 37;

// The 37 entries in display order; the last (id 37) is never shown.
const std::vector<KG_Column>& kgColumnTable();

struct KG_GroupTitle {
  std::uint32_t group;
  const char* title;
  const char* shortTitle;  // null when the group has none
  bool centred;            // and marked with the heading attribute
};
const std::vector<KG_GroupTitle>& kgGroupTitles();

// One shown column: where it starts on the line and how wide it is (without its separator).
struct KG_ShownColumn {
  const KG_Column* column;
  std::uint32_t start;
  std::uint32_t width;
};

// The shown columns from the settings (column switches and the name column width).
std::vector<KG_ShownColumn> kgShownColumns();
// The same, kept between calls while the settings choose the same columns.
const std::vector<KG_ShownColumn>& kgShownColumnsCached();
// The same from an explicit choice: shown(id) says whether a column is shown.
std::vector<KG_ShownColumn> kgShownColumns(unsigned nameWidth, bool (*shown)(const KG_Column&));
// Whether the settings show a column.
bool kgColumnShownBySettings(const KG_Column& c);
// Total width of the shown columns, separators included.
std::uint32_t kgShownWidth(const std::vector<KG_ShownColumn>& shown);

// The separator positions that carry a stripe under a setting (1 none, 2 groups, 3 all).
std::vector<std::uint32_t> kgStripePositions(const std::vector<KG_ShownColumn>& shown, int setting);

// A stretch of the first heading line drawn with the heading attribute.
struct KG_Span {
  std::uint32_t start;
  std::uint32_t length;
};

struct KG_Headings {
  std::string first;
  std::string second;
  std::vector<KG_Span> marked;         // on the first line
  std::vector<std::uint32_t> stripes;  // on the second line
};

// The heading lines; the name column's second-line heading is the sort order's label.
KG_Headings kgBuildHeadings(const std::vector<KG_ShownColumn>& shown, const char* sortLabel,
                            int headerSeparators);
