// gcov's JSON intermediate format (gcov --json-format, GCC 9 to 14), one or several
// documents per input.
#include <nlohmann/json.hpp>

#include <charconv>
#include <cmath>
#include <cstring>
#include <string_view>

#include "tools/import/coverage_import.h"

namespace {

using nlohmann::json;

std::uint64_t lineOfOffset(const std::string& text, size_t offset) {
  if (offset > text.size()) offset = text.size();
  std::uint64_t line = 1;
  for (size_t i = 0; i < offset; ++i) line += text[i] == '\n';
  return line;
}

// Splits the input into its top-level JSON values (gcov --stdout writes one per line).
bool documents(const std::string& text, std::vector<std::pair<size_t, size_t>>& out) {
  size_t i = 0, n = text.size();
  while (true) {
    while (i < n && strchr(" \t\r\n", text[i])) ++i;
    if (i >= n) return true;
    size_t start = i;
    int depth = 0;
    bool inString = false;
    for (; i < n; ++i) {
      char c = text[i];
      if (inString) {
        if (c == '\\') ++i;
        else if (c == '"') inString = false;
      } else if (c == '"') {
        inString = true;
      } else if (c == '{' || c == '[') {
        ++depth;
      } else if (c == '}' || c == ']') {
        if (--depth == 0) {
          ++i;
          break;
        }
      }
    }
    out.emplace_back(start, i);
    if (depth != 0 || inString) return true;  // the parser reports the truncation
  }
}

bool unsignedField(const json& obj, const char* key, std::uint64_t& value) {
  auto it = obj.find(key);
  if (it == obj.end()) return false;
  if (it->is_number_unsigned()) value = it->get<std::uint64_t>();
  else if (it->is_number_integer()) value = it->get<std::int64_t>() < 0 ? 0 : static_cast<std::uint64_t>(it->get<std::int64_t>());
  else if (it->is_number_float()) {
    double d = it->get<double>();
    value = d <= 0 || d != d ? 0 : d >= 1.8e19 ? UINT64_MAX : static_cast<std::uint64_t>(d);
  } else return false;
  return true;
}

bool lineField(const json& obj, const char* key, std::uint32_t& line) {
  std::uint64_t v;
  if (!unsignedField(obj, key, v) || v > 0x0FFFFFFF) return false;
  line = static_cast<std::uint32_t>(v);
  return true;
}

struct Reader {
  const std::string& name;
  const std::string& text;
  ImportedData& data;
  ImportError& error;

  bool fail(size_t offset, const std::string& message) {
    error.file = name;
    error.line = lineOfOffset(text, offset);
    error.message = message;
    return false;
  }

  bool document(size_t start, size_t end) {
    json doc;
    try {
      doc = json::parse(text.begin() + static_cast<std::ptrdiff_t>(start),
                        text.begin() + static_cast<std::ptrdiff_t>(end));
    } catch (const json::parse_error& e) {
      size_t at = e.byte == 0 ? start : start + e.byte - 1;
      std::string what = std::string("not valid JSON: ") + (strchr(e.what(), ':') ? strchr(e.what(), ':') + 2 : e.what());
      // Stopped by the end of the whole input: the file was most likely cut short.
      if (at + 1 >= text.size() && text.find_first_not_of(" \t\r\n", end) == std::string::npos)
        return fail(at, "the gcov JSON looks truncated (" + what + ")");
      return fail(at, what);
    }
    if (!doc.is_object()) return fail(start, "a gcov JSON document must be an object");
    auto files = doc.find("files");
    if (files == doc.end() || !files->is_array())
      return fail(start, "not gcov JSON: no \"files\" array");
    std::string cwd;
    auto c = doc.find("current_working_directory");
    if (c != doc.end() && c->is_string()) cwd = c->get<std::string>();

    for (const json& f : *files) {
      if (!f.is_object()) return fail(start, "an entry of \"files\" is not an object");
      auto path = f.find("file");
      if (path == f.end() || !path->is_string() || path->get<std::string>().empty())
        return fail(start, "a file entry has no \"file\" name");
      // JSON may spell a NUL ("\u0000"), but the data file ends names there: a name cut
      // short would stand for another file, or for none.
      std::string full = normalisedSourcePath(path->get<std::string>(), cwd.empty() ? data.baseDirectory : cwd);
      if (full.find('\0') != std::string::npos) return fail(start, "a file name holds a NUL character");
      ImportedFile& file = data.file(full);
      file.fromGcov = true;

      auto funcs = f.find("functions");
      if (funcs != f.end()) {
        if (!funcs->is_array()) return fail(start, "\"functions\" of " + file.path + " is not an array");
        for (const json& fn : *funcs) {
          if (!fn.is_object()) return fail(start, "a function entry of " + file.path + " is not an object");
          // The mangled name is the identity: C++ variants (a deleting and a base destructor,
          // say) demangle alike but are functions of their own, as lcov counts them.
          std::string fname;
          for (const char* key : {"name", "demangled_name"}) {
            auto it = fn.find(key);
            if (fname.empty() && it != fn.end() && it->is_string()) fname = it->get<std::string>();
          }
          std::uint32_t startLine = 0, endLine = 0;
          std::uint64_t calls = 0;
          if (fname.empty() || !lineField(fn, "start_line", startLine))
            return fail(start, "a function of " + file.path + " has no name or start line");
          if (fname.find('\0') != std::string::npos)
            return fail(start, "a function name of " + file.path + " holds a NUL character");
          lineField(fn, "end_line", endLine);
          unsignedField(fn, "execution_count", calls);
          ImportedFunction& func = file.function(fname);
          if (func.startLine == 0) func.startLine = startLine;
          if (func.endLine == 0) func.endLine = endLine;
          func.calls = addCounts(func.calls, calls);
        }
      }
      auto lines = f.find("lines");
      if (lines != f.end()) {
        if (!lines->is_array()) return fail(start, "\"lines\" of " + file.path + " is not an array");
        for (const json& ln : *lines) {
          std::uint32_t number = 0;
          std::uint64_t hits = 0;
          if (!ln.is_object() || !lineField(ln, "line_number", number) || number == 0 ||
              !unsignedField(ln, "count", hits))
            return fail(start, "a line entry of " + file.path + " has no line number or count");
          file.addLine(number, hits);
          // Each outcome as lcov numbers it: block 0, its place in the line's list.
          auto branches = ln.find("branches");
          if (branches == ln.end()) continue;
          if (!branches->is_array()) return fail(start, "\"branches\" of a line of " + file.path + " is not an array");
          size_t place = 0;
          for (const json& br : *branches) {
            std::uint64_t taken = 0;
            if (!br.is_object()) return fail(start, "a branch of line " + std::to_string(number) + " of " + file.path + " is not an object");
            unsignedField(br, "count", taken);
            file.branches.add(number, "0", std::to_string(place++), taken);
          }
        }
      }
    }
    return true;
  }
};

// gcov's JSON in the form gcov writes it, read straight from the text: no strings with
// escapes, numbers that fit, valid UTF-8, no key of ours given twice, and everything as
// the reader above wants it. Whatever else a document holds (bad JSON included), this
// reader declines it, having changed nothing, and the document goes through the JSON
// library above, with its checks and messages: what this reader takes, the library takes
// alike.
class FastReader {
 public:
  explicit FastReader(ImportedData& data) : data_(data) {}

  bool document(const char* begin, const char* end) {
    p_ = begin;
    end_ = end;
    files_.clear();
    functions_.clear();
    lines_.clear();
    takens_.clear();
    cwd_ = std::string_view();
    if (!topObject() || skipSpace()) return false;  // something after the document
    apply();
    return true;
  }

 private:
  enum class Kind { number, string, other };
  struct Scalar {
    Kind kind = Kind::other;
    std::uint64_t number = 0;  // as unsignedField reads it
    std::string_view text;
  };
  struct StagedFunction {
    std::string_view name;
    std::uint32_t start, end;
    std::uint64_t calls;
  };
  struct StagedLine {
    std::uint32_t number;
    std::uint64_t hits;
    size_t firstTaken, takens;
  };
  struct StagedFile {
    std::string_view path;
    size_t firstFunction, functions, firstLine, lines;
  };
  static constexpr int kMaxDepth = 64;

  // True if anything but white space is left.
  bool skipSpace() {
    while (p_ < end_ && (*p_ == ' ' || *p_ == '\n' || *p_ == '\r' || *p_ == '\t')) ++p_;
    return p_ < end_;
  }
  bool expect(char c) {
    if (!skipSpace() || *p_ != c) return false;
    ++p_;
    return true;
  }

  // A string without escapes, its bytes valid UTF-8 as the JSON library checks them.
  bool string(std::string_view& out) {
    if (!skipSpace() || *p_ != '"') return false;
    const char* start = ++p_;
    for (;;) {
      const char* q = p_;
      while (q < end_ && static_cast<unsigned char>(*q) >= 0x20 && *q != '"' && *q != '\\' &&
             static_cast<unsigned char>(*q) < 0x80)
        ++q;
      p_ = q;
      if (p_ >= end_) return false;
      unsigned char c = static_cast<unsigned char>(*p_);
      if (c == '"') break;
      if (c < 0x80) return false;  // a control character or an escape
      if (!utf8()) return false;
    }
    out = std::string_view(start, static_cast<size_t>(p_ - start));
    ++p_;
    return true;
  }
  bool utf8() {
    auto byte = [&](size_t i) { return static_cast<unsigned char>(p_[i]); };
    auto in = [&](size_t i, unsigned lo, unsigned hi) {
      return p_ + i < end_ && byte(i) >= lo && byte(i) <= hi;
    };
    unsigned c = byte(0);
    size_t n;
    if (c >= 0xC2 && c <= 0xDF) n = in(1, 0x80, 0xBF) ? 2 : 0;
    else if (c == 0xE0) n = in(1, 0xA0, 0xBF) && in(2, 0x80, 0xBF) ? 3 : 0;
    else if ((c >= 0xE1 && c <= 0xEC) || c == 0xEE || c == 0xEF) n = in(1, 0x80, 0xBF) && in(2, 0x80, 0xBF) ? 3 : 0;
    else if (c == 0xED) n = in(1, 0x80, 0x9F) && in(2, 0x80, 0xBF) ? 3 : 0;
    else if (c == 0xF0) n = in(1, 0x90, 0xBF) && in(2, 0x80, 0xBF) && in(3, 0x80, 0xBF) ? 4 : 0;
    else if (c >= 0xF1 && c <= 0xF3) n = in(1, 0x80, 0xBF) && in(2, 0x80, 0xBF) && in(3, 0x80, 0xBF) ? 4 : 0;
    else if (c == 0xF4) n = in(1, 0x80, 0x8F) && in(2, 0x80, 0xBF) && in(3, 0x80, 0xBF) ? 4 : 0;
    else n = 0;
    p_ += n;
    return n != 0;
  }

  static bool digit(char c) { return c >= '0' && c <= '9'; }

  // A number as the JSON grammar has it, valued as unsignedField values it; false also for
  // numbers the library would read otherwise than exactly (too large, or not finite).
  bool number(Scalar& s) {
    const char* start = p_;
    bool negative = *p_ == '-';
    if (negative) ++p_;
    if (p_ >= end_) return false;
    if (*p_ == '0') {
      ++p_;
    } else if (*p_ >= '1' && *p_ <= '9') {
      while (p_ < end_ && digit(*p_)) ++p_;
    } else {
      return false;
    }
    const char* intEnd = p_;
    bool fraction = false;
    if (p_ < end_ && *p_ == '.') {
      ++p_;
      if (p_ >= end_ || !digit(*p_)) return false;
      while (p_ < end_ && digit(*p_)) ++p_;
      fraction = true;
    }
    if (p_ < end_ && (*p_ == 'e' || *p_ == 'E')) {
      ++p_;
      if (p_ < end_ && (*p_ == '+' || *p_ == '-')) ++p_;
      if (p_ >= end_ || !digit(*p_)) return false;
      while (p_ < end_ && digit(*p_)) ++p_;
      fraction = true;
    }
    s.kind = Kind::number;
    if (!fraction) {
      const char* digits = start + (negative ? 1 : 0);
      std::uint64_t v = 0;
      auto [q, ec] = std::from_chars(digits, intEnd, v);
      if (ec != std::errc() || q != intEnd) return false;  // beyond 64 bits: read as a double there
      if (negative && v > (std::uint64_t{1} << 63)) return false;
      s.number = negative ? 0 : v;
      return true;
    }
    double d = 0;
    auto [q, ec] = std::from_chars(start, p_, d);
    if (ec != std::errc() || q != p_ || !std::isfinite(d)) return false;
    s.number = d <= 0 || d != d ? 0 : d >= 1.8e19 ? UINT64_MAX : static_cast<std::uint64_t>(d);
    return true;
  }

  bool literal(std::string_view word) {
    if (static_cast<size_t>(end_ - p_) < word.size() || std::string_view(p_, word.size()) != word) return false;
    p_ += word.size();
    return true;
  }

  // Any value: numbers and strings kept, the rest checked and passed over.
  bool value(Scalar& s, int depth) {
    if (!skipSpace()) return false;
    s = Scalar();
    switch (*p_) {
      case '"':
        s.kind = Kind::string;
        return string(s.text);
      case '{':
        if (depth >= kMaxDepth) return false;
        return object([&](std::string_view) {
          Scalar inner;
          return value(inner, depth + 1);
        });
      case '[':
        if (depth >= kMaxDepth) return false;
        return array([&] {
          Scalar inner;
          return value(inner, depth + 1);
        });
      case 't': return literal("true");
      case 'f': return literal("false");
      case 'n': return literal("null");
      default: return number(s);
    }
  }

  // The items of an object or array in turn, between `open` and `close`, comma-separated.
  template <class Item>
  bool sequence(char open, char close, Item item) {
    if (!expect(open) || !skipSpace()) return false;
    if (*p_ == close) {
      ++p_;
      return true;
    }
    for (;;) {
      if (!item() || !skipSpace()) return false;
      if (*p_ == close) {
        ++p_;
        return true;
      }
      if (*p_++ != ',') return false;
    }
  }
  // An object's members in turn: `member(key)` reads each value, true when all is well.
  template <class Member>
  bool object(Member member) {
    return sequence('{', '}', [&] {
      std::string_view key;
      return string(key) && expect(':') && member(key);
    });
  }
  // An array's elements in turn.
  template <class Element>
  bool array(Element element) {
    return sequence('[', ']', element);
  }
  bool next(char c) { return skipSpace() && *p_ == c; }
  // Each key of ours once: the library keeps the last of a repeated key.
  static bool once(unsigned& seen, unsigned bit) {
    if (seen & bit) return false;
    seen |= bit;
    return true;
  }
  static bool line(const Scalar& s, std::uint32_t& out) {
    if (s.kind != Kind::number || s.number > 0x0FFFFFFF) return false;
    out = static_cast<std::uint32_t>(s.number);
    return true;
  }

  bool topObject() {
    unsigned seen = 0;
    bool files = false;
    bool ok = object([&](std::string_view key) {
      Scalar s;
      if (key == "files") {
        files = true;
        return once(seen, 1) && next('[') && array([&] { return fileEntry(); });
      }
      if (key == "current_working_directory") {
        if (!once(seen, 2) || !value(s, 1)) return false;
        if (s.kind == Kind::string) cwd_ = s.text;
        return true;
      }
      return value(s, 1);
    });
    return ok && files;
  }

  bool fileEntry() {
    StagedFile f{{}, functions_.size(), 0, lines_.size(), 0};
    unsigned seen = 0;
    bool named = false;
    if (!next('{')) return false;
    bool ok = object([&](std::string_view key) {
      Scalar s;
      if (key == "file") {
        if (!once(seen, 1) || !value(s, 2) || s.kind != Kind::string || s.text.empty()) return false;
        f.path = s.text;
        named = true;
        return true;
      }
      if (key == "functions") return once(seen, 2) && next('[') && array([&] { return functionEntry(); });
      if (key == "lines") return once(seen, 4) && next('[') && array([&] { return lineEntry(); });
      return value(s, 2);
    });
    if (!ok || !named) return false;
    f.functions = functions_.size() - f.firstFunction;
    f.lines = lines_.size() - f.firstLine;
    files_.push_back(f);
    return true;
  }

  bool functionEntry() {
    std::string_view name, demangled;
    Scalar start, end, calls;
    unsigned seen = 0;
    if (!next('{')) return false;
    bool ok = object([&](std::string_view key) {
      Scalar s;
      if (key == "name" || key == "demangled_name") {
        bool mangled = key == "name";
        if (!once(seen, mangled ? 1 : 2) || !value(s, 3)) return false;
        if (s.kind == Kind::string) (mangled ? name : demangled) = s.text;
        return true;
      }
      if (key == "start_line") return once(seen, 4) && value(start, 3);
      if (key == "end_line") return once(seen, 8) && value(end, 3);
      if (key == "execution_count") return once(seen, 16) && value(calls, 3);
      return value(s, 3);
    });
    StagedFunction fn{name.empty() ? demangled : name, 0, 0, 0};
    if (!ok || fn.name.empty() || !line(start, fn.start)) return false;
    line(end, fn.end);
    if (calls.kind == Kind::number) fn.calls = calls.number;
    functions_.push_back(fn);
    return true;
  }

  bool lineEntry() {
    StagedLine l{0, 0, takens_.size(), 0};
    Scalar number, count;
    unsigned seen = 0;
    if (!next('{')) return false;
    bool ok = object([&](std::string_view key) {
      Scalar s;
      if (key == "line_number") return once(seen, 1) && value(number, 3);
      if (key == "count") return once(seen, 2) && value(count, 3);
      if (key == "branches") {
        // Each outcome's count, 0 where it has none.
        return once(seen, 4) && next('[') && array([&] {
                 Scalar taken;
                 unsigned seenCount = 0;
                 bool branchOk = next('{') && object([&](std::string_view k) {
                   Scalar b;
                   if (k == "count") return once(seenCount, 1) && value(taken, 4);
                   return value(b, 4);
                 });
                 takens_.push_back(taken.kind == Kind::number ? taken.number : 0);
                 return branchOk;
               });
      }
      return value(s, 3);
    });
    if (!ok || !line(number, l.number) || l.number == 0 || count.kind != Kind::number) return false;
    l.hits = count.number;
    l.takens = takens_.size() - l.firstTaken;
    lines_.push_back(l);
    return true;
  }

  // What the document holds, added as the reader above adds it.
  void apply() {
    std::string cwd(cwd_);
    const std::string& base = cwd.empty() ? data_.baseDirectory : cwd;
    std::string place;
    for (const StagedFile& sf : files_) {
      ImportedFile& file = data_.file(normalisedSourcePath(std::string(sf.path), base));
      file.fromGcov = true;
      for (size_t i = sf.firstFunction; i < sf.firstFunction + sf.functions; ++i) {
        const StagedFunction& fn = functions_[i];
        ImportedFunction& func = file.function(fn.name);
        if (func.startLine == 0) func.startLine = fn.start;
        if (func.endLine == 0) func.endLine = fn.end;
        func.calls = addCounts(func.calls, fn.calls);
      }
      for (size_t i = sf.firstLine; i < sf.firstLine + sf.lines; ++i) {
        const StagedLine& l = lines_[i];
        file.addLine(l.number, l.hits);
        // Each outcome as lcov numbers it: block 0, its place in the line's list.
        for (size_t k = 0; k < l.takens; ++k) {
          place = std::to_string(k);
          file.branches.add(l.number, "0", place, takens_[l.firstTaken + k]);
        }
      }
      file.settle();
    }
  }

  ImportedData& data_;
  const char* p_ = nullptr;
  const char* end_ = nullptr;
  std::string_view cwd_;
  std::vector<StagedFile> files_;
  std::vector<StagedFunction> functions_;
  std::vector<StagedLine> lines_;
  std::vector<std::uint64_t> takens_;
};

}  // namespace

bool readGcovJson(const std::string& name, const std::string& text, ImportedData& data,
                  ImportError& error) {
  try {
    std::vector<std::pair<size_t, size_t>> docs;
    documents(text, docs);
    if (docs.empty()) {
      error = {name, 0, "empty input"};
      return false;
    }
    Reader r{name, text, data, error};
    FastReader fast(data);
    bool ok = true;
    for (auto [start, end] : docs) {
      if (fast.document(text.data() + start, text.data() + end)) continue;
      if (!(ok = r.document(start, end))) break;
    }
    data.nameFunctions();
    return ok;
  } catch (const std::exception& e) {
    // Anything the JSON library throws on odd input ends here, never further up.
    error = {name, 0, std::string("cannot read gcov JSON: ") + e.what()};
    return false;
  }
}
