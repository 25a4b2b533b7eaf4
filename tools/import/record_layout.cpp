// Assigning instrumented lines to functions and hashing the record's line set.
#include "tools/import/record_layout.h"

#include <algorithm>
#include <limits>

const char* const kFileScopeName = "(file scope)";

namespace {

struct Range {
  std::uint32_t start, end;  // end inclusive
  size_t function;           // index into the laid-out functions: the group's owner
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

  // Functions of one line in the order of their names, as the merge orders them.
  std::vector<const ImportedFunction*> funcs;
  for (const auto& f : file.functions) funcs.push_back(&f);
  std::stable_sort(funcs.begin(), funcs.end(), [](const ImportedFunction* a, const ImportedFunction* b) {
    if (a->startLine != b->startLine) return a->startLine < b->startLine;
    return a->name < b->name;
  });
  for (const ImportedFunction* f : funcs)
    rec.functions.push_back({f->name, f->startLine, saturatedCount(f->calls), {}});

  // One range per group of functions starting on one line. Known ends are used as they
  // are; otherwise the group reaches to the line before the next function that starts
  // later (or to the end of the file).
  std::vector<Range> ranges;
  for (size_t i = 0; i < funcs.size();) {
    std::uint32_t start = funcs[i]->startLine;
    size_t j = i;
    while (j < funcs.size() && funcs[j]->startLine == start) ++j;
    if (start == 0) {
      i = j;
      continue;
    }
    std::uint32_t end = 0;
    bool ends = true;
    for (size_t k = i; k < j; ++k) {
      if (funcs[k]->endLine < start) ends = false;
      end = std::max(end, funcs[k]->endLine);
    }
    // The last of the group holds its lines, whatever was called: data files merged later
    // keep a line's blocks after the functions of its line, so the same function holds
    // them after any merge of captures that called other functions of the group.
    size_t owner = j - 1;
    if (!ends) end = j < funcs.size() ? funcs[j]->startLine - 1 : std::numeric_limits<std::uint32_t>::max();
    ranges.push_back({start, end, owner});
    i = j;
  }

  // Sweep the lines in order with the ranges that have started; the innermost holding
  // range is the one that started last (ties: the one that ends first).
  std::vector<LaidOutLine> fileScope;
  std::vector<const Range*> open;
  size_t next = 0;
  // Branches are kept by line in order too: walked alongside the lines.
  auto b = file.branches.begin();
  const auto branchesEnd = file.branches.end();
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
    LaidOutLine l{line, saturatedCount(hits), {}};
    while (b != branchesEnd && b->first < line) ++b;
    if (b != branchesEnd && b->first == line) {
      // A branch taken more often than its line ran (possible only in odd or merged data)
      // would raise the line's count; nor can a line that never ran have taken a branch.
      for (const auto& [key, taken] : b->second)
        l.branches.push_back(std::min(saturatedCount(taken), l.hits));
    }
    if (best) rec.functions[best->function].lines.push_back(std::move(l));
    else fileScope.push_back(std::move(l));
  }
  if (!fileScope.empty()) {
    // Not a real function: it counts as called when any of its lines ran.
    bool ran = std::any_of(fileScope.begin(), fileScope.end(),
                           [](const LaidOutLine& l) { return l.hits != 0; });
    std::uint32_t first = fileScope.front().line;
    rec.functions.push_back(
        {kFileScopeName, first, static_cast<std::uint16_t>(ran ? 1 : 0), std::move(fileScope)});
  }

  // Stands in for the source's content when that cannot be read: two captures of a file
  // then merge as one version only when they hold the same lines.
  std::uint32_t h = 2166136261u;
  h = fnv1a(h, rec.path.data(), rec.path.size() + 1);
  for (const auto& [line, hits] : file.lines) h = fnv1a(h, &line, sizeof line);
  rec.signature = h == 0 ? 1 : h;
  return rec;
}
