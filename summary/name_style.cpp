// Name shortening and function display names for the name column.
#include "summary/name_style.h"

#include <algorithm>

#include "summary/cell_format.h"

namespace {

std::string dots(unsigned width) { return std::string("...").substr(0, width); }

}  // namespace

std::string shorten_leftmost(const std::string& text, unsigned width) {
  if (text.size() <= width) return text;
  if (width < 4) return dots(width);
  return text.substr(0, width - 3) + "...";
}

std::string shorten_rightmost(const std::string& text, unsigned width) {
  if (text.size() <= width) return text;
  if (width <= 3) return dots(width);
  return "..." + text.substr(text.size() - (width - 3));
}

std::string directory_segment(const std::string& path) {
  bool trailing = !path.empty() && path.back() == '/';
  size_t end = trailing ? path.size() - 1 : path.size();
  if (end == 0) return path;
  size_t slash = path.rfind('/', end - 1);
  if (slash == std::string::npos) return path;
  return path.substr(slash + 1);
}

std::string shorten_path_leftmost(const std::string& path, unsigned width) {
  if (path.size() <= width) return path;
  if (width <= 3) return dots(width);
  std::string head = path.substr(0, width - 3);
  size_t slash = head.rfind('/');
  if (slash != std::string::npos && slash != 0) head.resize(slash + 1);
  return head + "...";
}

std::string shorten_path_rightmost(const std::string& path, unsigned width) {
  if (path.size() <= width) return path;
  if (width <= 3) return dots(width);
  std::string tail = path.substr(path.size() - (width - 3));
  size_t slash = tail.find('/');
  if (slash != std::string::npos && slash + 1 != tail.size()) tail = tail.substr(slash);
  return "..." + tail;
}

std::string function_display_name(const std::string& name, unsigned showBits) {
  if ((showBits & showAllNameParts) == showAllNameParts) return name;
  std::string out;
  size_t pos = 0;
  size_t paren = name.find('(');
  size_t colons = name.find("::");
  if (colons != std::string::npos && colons < paren) {
    if (showBits & showClassQualifier) out += name.substr(0, colons + 2);
    pos = colons + 2;
  }
  static const std::string kOperator = "operator";
  if (name.compare(pos, kOperator.size(), kOperator) == 0 && name.size() > pos + kOperator.size() &&
      std::string(" +-*/%^&|~!=<>,([").find(name[pos + kOperator.size()]) != std::string::npos) {
    if (showBits & showOperatorKeyword) {
      out += kOperator;
      pos += kOperator.size();
    } else {
      pos += kOperator.size();
      if (pos < name.size() && name[pos] == ' ') ++pos;
    }
    if (name.compare(pos, 3, "()(") == 0) {
      out += "()";
      pos += 2;
    }
  }
  size_t args = name.find('(', pos);
  out += name.substr(pos, args == std::string::npos ? std::string::npos : args - pos);
  if (args == std::string::npos) return out;
  if (showBits & showArgumentList) {
    out += name.substr(args);
  } else {
    size_t bracket = name.find('[', args);
    if (bracket != std::string::npos) {
      size_t from = (bracket > args && name[bracket - 1] == ' ') ? bracket - 1 : bracket;
      out += name.substr(from);
    }
  }
  return out;
}

unsigned clamp_name_column_width(long width) {
  return static_cast<unsigned>(std::clamp<long>(width, kMinNameColumnWidth, kMaxNameColumnWidth));
}

unsigned resized_name_column_width(const NameStyle& style, long windowWidth, long shownWidth,
                                   bool wider) {
  long n = style.nameColumnWidth;
  long proposed = n + windowWidth - shownWidth;
  long floor = wider ? n : static_cast<long>(style.chosenWidth);
  return clamp_name_column_width(std::max(floor, proposed));
}

std::string directory_name_cell(const std::string& dirName, unsigned cellWidth, const NameStyle& s) {
  std::string shown;
  if (s.directoryNames == rightmostSegment) {
    std::string seg = directory_segment(dirName);
    shown = s.longDirectoryNames == keepRightmost ? shorten_rightmost(seg, cellWidth)
                                                  : shorten_leftmost(seg, cellWidth);
  } else {
    shown = s.longDirectoryNames == keepRightmost ? shorten_path_rightmost(dirName, cellWidth)
                                                  : shorten_path_leftmost(dirName, cellWidth);
  }
  return justify_left(shown.c_str(), cellWidth);
}

std::string file_name_cell(const std::string& baseName, unsigned cellWidth, const NameStyle& s) {
  std::string shown = s.longFileNames == keepRightmost ? shorten_rightmost(baseName, cellWidth)
                                                       : shorten_leftmost(baseName, cellWidth);
  return justify_left(shown.c_str(), cellWidth);
}

std::string function_name_cell(const std::string& funcName, unsigned cellWidth, const NameStyle& s) {
  std::string name = function_display_name(funcName.substr(0, 3072), s.showBits);
  std::string shown = s.longFunctionNames == keepRightmost ? shorten_rightmost(name, cellWidth)
                                                           : shorten_leftmost(name, cellWidth);
  return justify_left(shown.c_str(), cellWidth);
}
