// Assigning instrumented lines to functions and hashing the record's structure.
#include "tools/import/record_layout.h"

#include <algorithm>
#include <limits>

const char* const kFileScopeName = "(file scope)";

namespace {

struct Range {
  std::uint32_t start, end;  // end inclusive
  size_t function;           // index into the laid-out functions
};

std::uint32_t fnv1a(std::uint32_t h, const void* data, size_t n) {
  const unsigned char* p = static_cast<const unsigned char*>(data);
  for (size_t i = 0; i < n; ++i) h = (h ^ p[i]) * 16777619u;
  return h;
}

}  // namespace

LaidOutRecord layOutRecord(const ImportedFile& file) {
  LaidOutRecord rec;
  rec.path = file.path;
  rec.sessions = saturatedCount(file.runs == 0 ? 1 : file.runs);

  std::vector<const ImportedFunction*> funcs;
  for (const auto& f : file.functions) funcs.push_back(&f);
  std::stable_sort(funcs.begin(), funcs.end(), [](const ImportedFunction* a, const ImportedFunction* b) {
    if (a->startLine != b->startLine) return a->startLine < b->startLine;
    return a->name < b->name;
  });
  for (const ImportedFunction* f : funcs)
    rec.functions.push_back({f->name, f->startLine, saturatedCount(f->calls), {}});

  // Ranges: a known end is used as it is; an unknown one reaches to the line before the next
  // function that starts later (or to the end of the file).
  std::vector<Range> ranges;
  for (size_t i = 0; i < funcs.size(); ++i) {
    const ImportedFunction* f = funcs[i];
    if (f->startLine == 0) continue;
    std::uint32_t end = f->endLine;
    if (end == 0 || end < f->startLine) {
      end = std::numeric_limits<std::uint32_t>::max();
      for (size_t j = i + 1; j < funcs.size(); ++j) {
        if (funcs[j]->startLine > f->startLine) {
          end = funcs[j]->startLine - 1;
          break;
        }
      }
    }
    ranges.push_back({f->startLine, end, i});
  }

  // Sweep the lines in order with the ranges that have started; the innermost holding
  // range is the one that started last (ties: the one that ends first).
  std::vector<LaidOutLine> fileScope;
  std::vector<const Range*> open;
  size_t next = 0;
  for (const auto& [line, hits] : file.lines) {
    while (next < ranges.size() && ranges[next].start <= line) open.push_back(&ranges[next++]);
    const Range* best = nullptr;
    for (auto it = open.begin(); it != open.end();) {
      if ((*it)->end < line) {
        it = open.erase(it);  // ranges never reopen, as lines only grow
        continue;
      }
      if (!best || (*it)->start > best->start || ((*it)->start == best->start && (*it)->end < best->end))
        best = *it;
      ++it;
    }
    LaidOutLine l{line, saturatedCount(hits)};
    if (best) rec.functions[best->function].lines.push_back(l);
    else fileScope.push_back(l);
  }
  if (!fileScope.empty()) {
    // Not a real function: it counts as called when any of its lines ran.
    bool ran = std::any_of(fileScope.begin(), fileScope.end(),
                           [](const LaidOutLine& l) { return l.hits != 0; });
    std::uint32_t first = fileScope.front().line;
    rec.functions.push_back(
        {kFileScopeName, first, static_cast<std::uint16_t>(ran ? 1 : 0), std::move(fileScope)});
  }

  std::uint32_t h = 2166136261u;
  h = fnv1a(h, rec.path.data(), rec.path.size() + 0);
  for (const auto& f : rec.functions) {
    h = fnv1a(h, f.name.c_str(), f.name.size() + 1);
    h = fnv1a(h, &f.firstLine, sizeof f.firstLine);
    for (const auto& l : f.lines) h = fnv1a(h, &l.line, sizeof l.line);
  }
  rec.signature = h == 0 ? 1 : h;
  return rec;
}
