// Names in the name column: shortening long names, directory segments, C++/Java function
// names with their parts hidden, and the width of the name column.
#pragma once

#include <cstdint>
#include <string>

std::string shorten_leftmost(const std::string& text, unsigned width);
std::string shorten_rightmost(const std::string& text, unsigned width);
// '/usr/src/lib/' gives 'lib/'; a path without enough slashes is returned whole.
std::string directory_segment(const std::string& path);
std::string shorten_path_leftmost(const std::string& path, unsigned width);
std::string shorten_path_rightmost(const std::string& path, unsigned width);

// Show bits: 1 class qualifier, 2 the "operator" keyword, 4 the argument list.
enum : unsigned { showClassQualifier = 1, showOperatorKeyword = 2, showArgumentList = 4, showAllNameParts = 7 };
std::string function_display_name(const std::string& name, unsigned showBits);

enum : std::uint32_t { wholePathname = 1, rightmostSegment = 2 };  // directory names
enum : std::uint32_t { keepLeftmost = 1, keepRightmost = 2 };      // long names

struct NameStyle {
  std::uint32_t directoryNames = wholePathname;
  std::uint32_t longDirectoryNames = keepRightmost;
  std::uint32_t longFileNames = keepLeftmost;
  std::uint32_t longFunctionNames = keepLeftmost;
  unsigned showBits = showAllNameParts;
  unsigned nameColumnWidth = 32;
  unsigned chosenWidth = 32;  // the width last chosen by the user
};

constexpr unsigned kMinNameColumnWidth = 32;
constexpr unsigned kMaxNameColumnWidth = 200;
unsigned clamp_name_column_width(long width);

// The name column after the window was resized: it absorbs the change in width.
// windowWidth: the outline's width in characters; shownWidth: the total width of the
// shown columns (each column's width + 1).
unsigned resized_name_column_width(const NameStyle& style, long windowWidth, long shownWidth,
                                   bool wider);

// Name cells, padded with blanks to the cell width (name column width less indentation).
std::string directory_name_cell(const std::string& dirName, unsigned cellWidth, const NameStyle& s);
std::string file_name_cell(const std::string& baseName, unsigned cellWidth, const NameStyle& s);
std::string function_name_cell(const std::string& funcName, unsigned cellWidth, const NameStyle& s);
