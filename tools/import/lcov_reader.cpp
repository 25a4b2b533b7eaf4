// lcov tracefiles (lcov 1.x and 2.x, llvm-cov's lcov export and the tools that follow them).
#include <algorithm>
#include <charconv>
#include <cstring>
#include <string_view>
#include <unordered_map>

#include "tools/import/coverage_import.h"

namespace {

struct Parser {
  const std::string& name;
  ImportedData& data;
  ImportError& error;
  std::uint64_t lineNo = 0;
  ImportedFile* current = nullptr;
  // FNL/FNA (lcov 2.2 and later) refer to functions by an index within the record.
  std::unordered_map<std::uint64_t, std::pair<std::uint32_t, std::uint32_t>> ranges;
  // Where relative source paths are taken from, worked out at the first one.
  std::string base;
  bool baseKnown = false;

  // Sizes of the last record's file: the next new file is given room for as many, as the
  // files of one input tend to be alike (up to a bound, so that one large file does not
  // make every small one after it large).
  size_t lastLines = 0, lastOutcomes = 0, lastFunctions = 0;

  // The record read so far is complete: its out-of-order lines go in place.
  void endRecord() {
    if (current) {
      current->settle();
      lastLines = std::min<size_t>(current->lines.size(), 1024);
      lastOutcomes = std::min<size_t>(current->branches.outcomeCount(), 1024);
      lastFunctions = std::min<size_t>(current->functions.size(), 64);
    }
    current = nullptr;
  }

  void startRecord(ImportedFile& file) {
    current = &file;
    if (file.lines.empty()) file.lines.reserve(lastLines);
    if (file.branches.empty()) file.branches.reserve(lastOutcomes);
    if (file.functions.empty()) file.functions.reserve(lastFunctions);
  }

  bool fail(const std::string& message) {
    error.file = name;
    error.line = lineNo;
    error.message = message;
    return false;
  }

  static bool number(std::string_view s, std::uint64_t& v) {
    if (s.empty()) return false;
    if (s[0] == '+') s.remove_prefix(1);
    auto [p, ec] = std::from_chars(s.data(), s.data() + s.size(), v);
    if (ec == std::errc::result_out_of_range) {
      // All digits but too big: the count saturates rather than being refused.
      for (char c : s)
        if (c < '0' || c > '9') return false;
      v = UINT64_MAX;
      return true;
    }
    return ec == std::errc() && p == s.data() + s.size();
  }

  // Counts may be written as floating point by some tools ("1.5e3"); negative counts are
  // written by a few as a sign of "not instrumented": both are taken as their whole value
  // or 0.
  static bool count(std::string_view s, std::uint64_t& v) {
    if (number(s, v)) return true;
    if (!s.empty() && s[0] == '-') {
      std::uint64_t ignored;
      if (number(s.substr(1), ignored)) {
        v = 0;
        return true;
      }
      return false;
    }
    std::string text(s);
    char* end = nullptr;
    double d = strtod(text.c_str(), &end);
    if (text.empty() || *end != '\0' || d != d) return false;
    v = d <= 0 ? 0 : d >= 1.8e19 ? UINT64_MAX : static_cast<std::uint64_t>(d);
    return true;
  }

  bool lineNumber(std::string_view s, std::uint32_t& line) {
    std::uint64_t v;
    if (!number(s, v) || v > 0x0FFFFFFF) return false;
    line = static_cast<std::uint32_t>(v);
    return true;
  }

  // Up to three comma-separated fields, the last taking the rest.
  struct Fields {
    std::string_view part[3];
    size_t count = 0;
    size_t size() const { return count; }
    std::string_view operator[](size_t i) const { return part[i]; }
  };
  static Fields split(std::string_view s, size_t maxParts) {
    Fields parts;
    while (parts.count + 1 < maxParts) {
      size_t comma = s.find(',');
      if (comma == std::string_view::npos) break;
      parts.part[parts.count++] = s.substr(0, comma);
      s.remove_prefix(comma + 1);
    }
    parts.part[parts.count++] = s;
    return parts;
  }

  // Up to 19 digits at `p` (no overflow), moving past them; false if there are none or more.
  static bool digits(const char*& p, const char* end, std::uint64_t& v) {
    const char* start = p;
    v = 0;
    while (p < end && static_cast<unsigned char>(*p - '0') < 10 && p - start < 19) v = v * 10 + static_cast<unsigned>(*p++ - '0');
    return p != start && !(p < end && static_cast<unsigned char>(*p - '0') < 10);
  }

  // The busiest records in their plain form (DA:n,n  BRDA:n,n,n,n|-  FN:n,name  FNDA:n,name,
  // inside a record, with plain numbers and a whole line; end_of_record; test names and
  // summaries), read without splitting the line into views first. False, having changed nothing, for anything else: line() then reads
  // it, with its checks and messages.
  bool quick(const char* s, const char* end, size_t firstNul, const char* base, const char*& next) {
    if (end - s < 6) return false;
    // Test names and summaries carry nothing we keep.
    size_t keyLength = s[0] == 'T' && s[1] == 'N' ? 2
                       : s[0] == 'L' && (s[1] == 'F' || s[1] == 'H') ? 2
                       : (s[0] == 'F' && s[1] == 'N' && (s[2] == 'F' || s[2] == 'H')) ||
                                 (s[0] == 'B' && s[1] == 'R' && (s[2] == 'F' || s[2] == 'H'))
                           ? 3
                           : 0;
    if (keyLength != 0 && s[keyLength] == ':') {
      const char* lineEnd = static_cast<const char*>(memchr(s, '\n', static_cast<size_t>(end - s)));
      if (!lineEnd || (firstNul != std::string::npos && firstNul < static_cast<size_t>(lineEnd - base))) return false;
      next = lineEnd + 1;
      return true;
    }
    if (!current) return false;
    if (end - s >= 14 && memcmp(s, "end_of_record\n", 14) == 0) {
      endRecord();
      ranges.clear();
      next = s + 14;
      return true;
    }
    const char* p;
    std::uint64_t a, b;
    if (s[0] == 'D' && s[1] == 'A' && s[2] == ':') {
      p = s + 3;
      if (!digits(p, end, a) || a == 0 || a > 0x0FFFFFFF || p == end || *p++ != ',' || !digits(p, end, b) ||
          p == end || *p != '\n')
        return false;
      current->addLine(static_cast<std::uint32_t>(a), b);
      next = p + 1;
      return true;
    }
    if (s[0] == 'B' && s[1] == 'R' && s[2] == 'D' && s[3] == 'A' && s[4] == ':') {
      p = s + 5;
      std::uint64_t ignored, taken = 0;
      if (!digits(p, end, a) || a == 0 || a > 0x0FFFFFFF || p == end || *p++ != ',') return false;
      const char* block = p;
      if (!digits(p, end, ignored) || p == end || *p != ',') return false;
      const char* blockEnd = p++;
      const char* branch = p;
      if (!digits(p, end, ignored) || p == end || *p != ',') return false;
      const char* branchEnd = p++;
      if (p < end && *p == '-') ++p;
      else if (!digits(p, end, taken)) return false;
      if (p == end || *p != '\n') return false;
      current->branches.add(static_cast<std::uint32_t>(a), std::string_view(block, static_cast<size_t>(blockEnd - block)),
                            std::string_view(branch, static_cast<size_t>(branchEnd - branch)), taken);
      next = p + 1;
      return true;
    }
    bool fnda = s[0] == 'F' && s[1] == 'N' && s[2] == 'D' && s[3] == 'A' && s[4] == ':';
    if (fnda || (s[0] == 'F' && s[1] == 'N' && s[2] == ':')) {
      p = s + (fnda ? 5 : 3);
      if (!digits(p, end, a) || (!fnda && a > 0x0FFFFFFF) || p == end || *p++ != ',') return false;
      const char* nameEnd = static_cast<const char*>(memchr(p, '\n', static_cast<size_t>(end - p)));
      // A name with a comma may be FN's three-field form; a NUL or a CR at its end needs the
      // general reading too.
      if (!nameEnd || nameEnd == p || nameEnd[-1] == '\r' ||
          (firstNul != std::string::npos && firstNul < static_cast<size_t>(nameEnd - base)) ||
          (!fnda && memchr(p, ',', static_cast<size_t>(nameEnd - p))))
        return false;
      ImportedFunction& f = current->function(std::string_view(p, static_cast<size_t>(nameEnd - p)));
      if (fnda) {
        f.calls = addCounts(f.calls, a);
      } else {
        if (f.startLine == 0) f.startLine = static_cast<std::uint32_t>(a);
        // (endLine stays as it was: this form gives none.)
      }
      next = nameEnd + 1;
      return true;
    }
    return false;
  }

  bool needRecord(std::string_view key) {
    if (current) return true;
    return fail(std::string(key) + " before any SF record");
  }

  bool line(std::string_view text) {
    if (!text.empty() && text.back() == '\r') text.remove_suffix(1);
    if (text.empty()) return true;
    if (text == "end_of_record") {
      if (!current) return fail("end_of_record without a record");
      endRecord();
      ranges.clear();
      return true;
    }
    size_t colon = text.find(':');
    if (colon == std::string_view::npos) return fail("not a tracefile line: '" + std::string(text.substr(0, 80)) + "'");
    std::string_view key = text.substr(0, colon);
    std::string_view value = text.substr(colon + 1);

    if (key == "SF") {
      if (value.empty()) return fail("SF without a file name");
      endRecord();
      std::string path(value);
      if (path[0] != '/' && !baseKnown) {
        base = sourceBaseDirectory(data.baseDirectory);
        baseKnown = true;
      }
      startRecord(data.file(normalisedSourcePath(path, path[0] == '/' ? data.baseDirectory : base)));
      ranges.clear();
      return true;
    }
    if (key == "DA") {
      if (!needRecord(key)) return false;
      // line,count[,checksum]
      size_t c1 = value.find(',');
      std::uint32_t ln;
      std::uint64_t hits;
      if (c1 == std::string_view::npos || !lineNumber(value.substr(0, c1), ln) || ln == 0 ||
          !count(value.substr(c1 + 1, value.find(',', c1 + 1) - (c1 + 1)), hits))
        return fail("malformed DA record '" + std::string(value) + "'");
      current->addLine(ln, hits);
      return true;
    }
    if (key == "FN") {
      if (!needRecord(key)) return false;
      // FN:line,name (lcov 1.x) or FN:line,endline,name (lcov 2.x). Names may hold commas,
      // so the three-field form is taken only when the middle field is a number.
      auto p = split(value, 3);
      std::uint32_t start = 0, end = 0;
      if (p.size() < 2 || !lineNumber(p[0], start)) return fail("malformed FN record '" + std::string(value) + "'");
      std::string_view fname;
      if (p.size() == 3 && lineNumber(p[1], end)) {
        fname = p[2];
      } else {
        end = 0;
        fname = value.substr(p[0].size() + 1);
      }
      if (fname.empty()) return fail("FN record without a function name");
      ImportedFunction& f = current->function(fname);
      if (f.startLine == 0) f.startLine = start;
      if (f.endLine == 0) f.endLine = end;
      return true;
    }
    if (key == "FNDA") {
      if (!needRecord(key)) return false;
      size_t comma = value.find(',');
      std::uint64_t calls;
      if (comma == std::string_view::npos || !count(value.substr(0, comma), calls) || comma + 1 == value.size())
        return fail("malformed FNDA record '" + std::string(value) + "'");
      ImportedFunction& f = current->function(value.substr(comma + 1));
      f.calls = addCounts(f.calls, calls);
      return true;
    }
    if (key == "FNL") {
      if (!needRecord(key)) return false;
      auto p = split(value, 3);  // index,line[,endline]
      std::uint64_t index;
      std::uint32_t start, end = 0;
      if (p.size() < 2 || !number(p[0], index) || !lineNumber(p[1], start) ||
          (p.size() == 3 && !lineNumber(p[2], end)))
        return fail("malformed FNL record '" + std::string(value) + "'");
      ranges[index] = {start, end};
      return true;
    }
    if (key == "FNA") {
      if (!needRecord(key)) return false;
      auto p = split(value, 3);  // index,count,name
      std::uint64_t index, calls;
      if (p.size() < 3 || !number(p[0], index) || !count(p[1], calls) || p[2].empty())
        return fail("malformed FNA record '" + std::string(value) + "'");
      auto r = ranges.find(index);
      if (r == ranges.end()) return fail("FNA record for function index " + std::to_string(index) + " without FNL");
      ImportedFunction& f = current->function(p[2]);
      if (f.startLine == 0) f.startLine = r->second.first;
      if (f.endLine == 0) f.endLine = r->second.second;
      f.calls = addCounts(f.calls, calls);
      return true;
    }
    if (key == "BRDA") {
      if (!needRecord(key)) return false;
      // BRDA:line,block,branch,taken; lcov 2 may write an expression as the branch, so the
      // branch is all between the block and the last field. "-": the block never ran.
      size_t c1 = value.find(','), c2 = c1 == std::string_view::npos ? c1 : value.find(',', c1 + 1);
      size_t c3 = value.rfind(',');
      std::uint32_t ln;
      std::uint64_t taken = 0;
      if (c2 == std::string_view::npos || c3 <= c2 || !lineNumber(value.substr(0, c1), ln) || ln == 0 ||
          (value.substr(c3 + 1) != "-" && !count(value.substr(c3 + 1), taken)))
        return fail("malformed BRDA record '" + std::string(value) + "'");
      current->branches.add(ln, value.substr(c1 + 1, c2 - c1 - 1), value.substr(c2 + 1, c3 - c2 - 1), taken);
      return true;
    }
    // Test names, summaries, version and other records (and the records newer tools add)
    // carry nothing we keep; anything that is not a record name is bad input.
    bool recordName = !key.empty();
    for (char c : key) recordName = recordName && ((c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_');
    if (recordName) return true;
    return fail("not a tracefile line: '" + std::string(text.substr(0, 80)) + "'");
  }
};

}  // namespace

struct LcovTracefileReader::State {
  State(const std::string& name, ImportedData& data, ImportError& error)
      : name(name), p{this->name, data, error, 0, nullptr, {}, {}, false} {}
  std::string name;
  Parser p;
  bool ok = true;
};

LcovTracefileReader::LcovTracefileReader(const std::string& name, ImportedData& data, ImportError& error,
                                         std::size_t sizeHint)
    : s_(std::make_unique<State>(name, data, error)) {
  // Room for as many files as a tracefile of this size may well hold (a record takes a few
  // hundred bytes at least): moving the files as the list grows costs more than room that
  // is never touched.
  data.files.reserve(data.files.size() + sizeHint / 256);
}

LcovTracefileReader::~LcovTracefileReader() = default;

bool LcovTracefileReader::feed(std::string_view text) {
  Parser& p = s_->p;
  size_t pos = 0;
  // Lines before the first NUL need no look for one.
  const size_t firstNul = text.find('\0');
  const char* const base = text.data();
  const char* const textEnd = base + text.size();
  while (s_->ok && pos < text.size()) {
    const char* next;
    if (p.quick(base + pos, textEnd, firstNul, base, next)) {
      ++p.lineNo;
      pos = static_cast<size_t>(next - base);
      continue;
    }
    size_t nl = text.find('\n', pos);
    size_t end = nl == std::string_view::npos ? text.size() : nl;
    ++p.lineNo;
    std::string_view line(text.data() + pos, end - pos);
    if (firstNul != std::string_view::npos && firstNul < end) {
      s_->ok = p.fail("binary data in a tracefile");
    } else if (!p.line(line)) {
      // A last line without its newline that does not read is most likely cut short.
      if (nl == std::string_view::npos)
        p.error.message = "the tracefile looks truncated: its last line '" + std::string(line.substr(0, 80)) +
                          "' is incomplete (" + p.error.message + ")";
      s_->ok = false;
    }
    pos = end + 1;
  }
  return s_->ok;
}

std::uint64_t LcovTracefileReader::linesRead() const { return s_->p.lineNo; }

bool LcovTracefileReader::finish() {
  Parser& p = s_->p;
  if (p.current) p.current->settle();
  if (s_->ok && p.current) {
    ++p.lineNo;
    s_->ok = p.fail("the tracefile looks truncated: its last record has no end_of_record");
  }
  // What was read before a failure stays named as well.
  p.data.nameFunctions();
  return s_->ok;
}

bool readLcovTracefile(const std::string& name, const std::string& text, ImportedData& data,
                       ImportError& error) {
  LcovTracefileReader reader(name, data, error, text.size());
  reader.feed(text);
  return reader.finish();
}
