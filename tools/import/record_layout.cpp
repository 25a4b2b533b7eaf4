// Assigning instrumented lines to functions and hashing the record's line set.
#include "tools/import/record_layout.h"

#include <algorithm>
#include <limits>

const char* const kFileScopeName = "(file scope)";

namespace {

using Range = LayoutPlan::Range;

std::uint32_t fnv1a(std::uint32_t h, const void* data, size_t n) {
  const unsigned char* p = static_cast<const unsigned char*>(data);
  for (size_t i = 0; i < n; ++i) h = (h ^ p[i]) * 16777619u;
  return h;
}

}  // namespace

LaidOutRecord layOutRecord(const ImportedFile& file) {
  LayoutPlan plan;
  planLayout(file, plan);
  LaidOutRecord rec;
  rec.path = file.path;
  rec.sessions = saturatedCount(file.runs == 0 ? 1 : file.runs);
  for (const ImportedFunction* f : plan.functions)
    rec.functions.push_back({f->name, f->startLine, saturatedCount(f->calls), {}});

  std::vector<LaidOutLine> fileScope;
  // Branches are kept by line in order too: walked alongside the lines.
  auto b = file.branches.outcomes().begin();
  const auto branchesEnd = file.branches.outcomes().end();
  size_t i = 0;
  for (const auto& [line, hits] : file.lines) {
    LaidOutLine l{line, saturatedCount(hits), {}};
    while (b != branchesEnd && b->line < line) ++b;
    // A branch taken more often than its line ran (possible only in odd or merged data)
    // would raise the line's count; nor can a line that never ran have taken a branch.
    for (; b != branchesEnd && b->line == line; ++b) l.branches.push_back(std::min(saturatedCount(b->taken), l.hits));
    std::uint32_t owner = plan.owner[i++];
    if (owner < plan.functions.size()) rec.functions[owner].lines.push_back(std::move(l));
    else fileScope.push_back(std::move(l));
  }
  if (!fileScope.empty()) {
    // Not a real function: it counts as called when any of its lines ran.
    rec.functions.push_back({kFileScopeName, plan.fileScopeFirst, static_cast<std::uint16_t>(plan.fileScopeRan ? 1 : 0),
                             std::move(fileScope)});
  }
  rec.signature = lineSetSignature(file);
  return rec;
}

void planLayout(const ImportedFile& file, LayoutPlan& plan) {
  // Functions of one line in the order of their names, as the merge orders them.
  std::vector<const ImportedFunction*>& funcs = plan.functions;
  funcs.clear();
  for (const auto& f : file.functions) funcs.push_back(&f);
  auto before = [](const ImportedFunction* a, const ImportedFunction* b) {
    if (a->startLine != b->startLine) return a->startLine < b->startLine;
    return a->name < b->name;
  };
  // Most files list their functions in line order already, and most have a few: stable_sort
  // would take a buffer from the heap for each file.
  if (!std::is_sorted(funcs.begin(), funcs.end(), before)) {
    if (funcs.size() > 32) {
      std::stable_sort(funcs.begin(), funcs.end(), before);
    } else {
      for (size_t i = 1; i < funcs.size(); ++i)
        for (size_t j = i; j > 0 && before(funcs[j], funcs[j - 1]); --j) std::swap(funcs[j], funcs[j - 1]);
    }
  }

  // One range per group of functions starting on one line. Known ends are used as they
  // are; otherwise the group reaches to the line before the next function that starts
  // later (or to the end of the file).
  std::vector<Range>& ranges = plan.ranges;
  ranges.clear();
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
  plan.owner.clear();
  plan.owner.reserve(file.lines.size());
  plan.fileScopeLines = 0;
  plan.fileScopeFirst = 0;
  plan.fileScopeRan = false;
  const auto outside = static_cast<std::uint32_t>(funcs.size());
  std::vector<const Range*>& open = plan.open;
  open.clear();
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
    if (best) {
      plan.owner.push_back(static_cast<std::uint32_t>(best->function));
      continue;
    }
    plan.owner.push_back(outside);
    if (plan.fileScopeLines++ == 0) plan.fileScopeFirst = line;
    plan.fileScopeRan = plan.fileScopeRan || saturatedCount(hits) != 0;
  }
}

std::uint32_t lineSetSignature(const ImportedFile& file) {
  // Stands in for the source's content when that cannot be read: two captures of a file
  // then merge as one version only when they hold the same lines.
  std::uint32_t h = 2166136261u;
  h = fnv1a(h, file.path.data(), file.path.size() + 1);
  for (const auto& [line, hits] : file.lines) h = fnv1a(h, &line, sizeof line);
  return h == 0 ? 1 : h;
}
