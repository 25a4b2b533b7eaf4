// Conversions from the strings of resource files to typed values.
#include "settings/resource_converters.h"

#include <climits>
#include <cstring>
#include <strings.h>

#include "settings/kg_resource.h"

namespace {

NameCheck gColourCheck = nullptr;
NameCheck gCursorCheck = nullptr;

// Resource files often carry stray blanks after a value; they never belong to a word.
std::string trimmed(const std::string& s) {
  size_t b = s.find_first_not_of(" \t\r\n");
  if (b == std::string::npos) return {};
  size_t e = s.find_last_not_of(" \t\r\n");
  return s.substr(b, e - b + 1);
}

const char* const kSortWords[kSortCriterionCount] = {
    "alpha",   "native",     "lines",   "l_used",   "l_used%",   "l_unused",
    "l_unused%", "adj_lines", "al_used", "al_used%", "al_unused", "al_unused%",
    "blocks",  "b_used",     "b_used%", "b_unused", "b_unused%",
};

}  // namespace

const EnumWord kFileUpdateWords[3] = {{"prompt", 4}, {"reload", 3}, {"ignore", 5}};
const EnumWord kColStripeWords[3] = {{"none", 1}, {"groups", 2}, {"all", 3}};
const EnumWord kDirectoryStyleWords[2] = {{"whole", 1}, {"rightmost", 2}};
const EnumWord kNameTruncationWords[2] = {{"leftmost", 1}, {"rightmost", 2}};

const char* const kConvertedTypeNames[7] = {"ColStripe", "DirectoryStyle", "FileUpdate",
                                            "GfxSortOrder", "Highlight", "CursorName",
                                            "NameTruncation"};

bool convertBoolean(const std::string& raw, bool& out) {
  std::string s = trimmed(raw);
  static const char* const yes[] = {"true", "yes", "on", "1"};
  static const char* const no[] = {"false", "no", "off", "0"};
  for (const char* w : yes)
    if (strcasecmp(s.c_str(), w) == 0) return out = true, true;
  for (const char* w : no)
    if (strcasecmp(s.c_str(), w) == 0) return out = false, true;
  return false;
}

bool convertInteger(const std::string& raw, int& out) {
  std::string s = trimmed(raw);
  size_t i = 0;
  bool negative = false;
  if (i < s.size() && (s[i] == '+' || s[i] == '-')) negative = s[i++] == '-';
  if (i == s.size()) return false;
  long long v = 0;
  for (; i < s.size(); ++i) {
    if (s[i] < '0' || s[i] > '9') return false;
    if (v <= static_cast<long long>(INT_MAX) + 1) v = v * 10 + (s[i] - '0');
  }
  if (negative) v = -v;
  out = v > INT_MAX ? INT_MAX : v < INT_MIN ? INT_MIN : static_cast<int>(v);
  return true;
}

bool convertEnumWord(const EnumWord* words, size_t count, const std::string& raw, int& out) {
  std::string s = trimmed(raw);
  for (size_t i = 0; i < count; ++i) {
    if (strcasecmp(s.c_str(), words[i].word) == 0) {
      out = words[i].value;
      return true;
    }
  }
  return false;
}

const char* sortCriterionWord(int id) {
  if (id < 1 || id > kSortCriterionCount) return nullptr;
  return kSortWords[id - 1];
}

ErrorCode sortCriterionFromWord(const std::string& word, int& id) {
  std::string s = trimmed(word);
  for (int i = 0; i < kSortCriterionCount; ++i) {
    if (strcasecmp(s.c_str(), kSortWords[i]) == 0) {
      id = i + 1;
      return allOK;
    }
  }
  id = kDefaultSortCriterion;
  return invalidSortingOrder;
}

void setHighlightColourCheck(NameCheck check) { gColourCheck = check; }
void setCursorNameCheck(NameCheck check) { gCursorCheck = check; }

bool convertHighlight(const std::string& raw, std::string& out) {
  std::string s = trimmed(raw);
  std::string folded;
  for (char c : s) {
    if (c == '-' || c == '_') continue;
    folded += static_cast<char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
  }
  if (folded == "default" || folded == "reverse") {
    out = folded;
    return true;
  }
  if (!s.empty() && (!gColourCheck || gColourCheck(s))) {
    out = s;
    return true;
  }
  out = "default";
  return false;
}

bool convertCursorName(const std::string& raw, std::string& out) {
  std::string s = trimmed(raw);
  if (s.empty()) return false;
  if (gCursorCheck && !gCursorCheck(s)) return false;
  out = s;
  return true;
}
