// gcov's JSON intermediate format (gcov --json-format, GCC 9 to 14), one or several
// documents per input.
#include <nlohmann/json.hpp>

#include <cstring>

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
    bool ok = true;
    for (auto [start, end] : docs)
      if (!(ok = r.document(start, end))) break;
    data.nameFunctions();
    return ok;
  } catch (const std::exception& e) {
    // Anything the JSON library throws on odd input ends here, never further up.
    error = {name, 0, std::string("cannot read gcov JSON: ") + e.what()};
    return false;
  }
}
