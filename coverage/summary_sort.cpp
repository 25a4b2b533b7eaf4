// Sorting the summary tree: the count, ratio, name and native-index comparisons with the
// common tie-break, applied to every level.
#include "coverage/summary_sort.h"

#include <algorithm>
#include <cstring>
#include <functional>
#include <new>
#include <vector>

#include "support/parallel_runs.h"

namespace {

// Name by bytes, then native index, then place in memory.
int tieBreak(const SortKey& a, const SortKey& b) {
  int c = std::strcmp(a.name, b.name);
  if (c != 0) return c;
  if (a.nativeIndex != b.nativeIndex) return a.nativeIndex < b.nativeIndex ? -1 : 1;
  if (a.address == b.address) return 0;
  return std::less<const void*>()(a.address, b.address) ? -1 : 1;
}

// Larger values first.
int descending(std::uint32_t x, std::uint32_t y) { return x > y ? -1 : (x < y ? 1 : 0); }

// Larger ratio first; a zero denominator goes first (zeroFirst) or last.
int ratioDescending(std::uint32_t an, std::uint32_t ad, std::uint32_t bn, std::uint32_t bd,
                    bool zeroFirst) {
  if (ad == 0 || bd == 0) {
    if (ad == 0 && bd == 0) return 0;
    bool aZero = ad == 0;
    return (aZero == zeroFirst) ? -1 : 1;
  }
  double left = double(an) * double(bd);
  double right = double(bn) * double(ad);
  if (left > right) return -1;
  if (left < right) return 1;
  return 0;
}

template <int (*Primary)(const SumCounts&, const SumCounts&)>
int withTieBreak(const SortKey& a, const SortKey& b) {
  if (a.address == b.address) return 0;
  int c = Primary(*a.counts, *b.counts);
  return c != 0 ? c : tieBreak(a, b);
}

int byNothing(const SumCounts&, const SumCounts&) { return 0; }
int byLines(const SumCounts& a, const SumCounts& b) { return descending(a.lines, b.lines); }
int byLUsed(const SumCounts& a, const SumCounts& b) {
  return descending(a.usedLines(), b.usedLines());
}
int byLUsedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.usedLines(), a.lines, b.usedLines(), b.lines, true);
}
int byLUnused(const SumCounts& a, const SumCounts& b) {
  return descending(a.unusedLines, b.unusedLines);
}
int byLUnusedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.unusedLines, a.lines, b.unusedLines, b.lines, false);
}
int byAdjLines(const SumCounts& a, const SumCounts& b) {
  return descending(a.adjLines, b.adjLines);
}
int byAlUsed(const SumCounts& a, const SumCounts& b) {
  return descending(a.adjUsedLines(), b.adjUsedLines());
}
int byAlUsedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.adjUsedLines(), a.adjLines, b.adjUsedLines(), b.adjLines, true);
}
int byAlUnused(const SumCounts& a, const SumCounts& b) {
  return descending(a.adjUnusedLines, b.adjUnusedLines);
}
int byAlUnusedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.adjUnusedLines, a.adjLines, b.adjUnusedLines, b.adjLines, false);
}
int byBlocks(const SumCounts& a, const SumCounts& b) { return descending(a.blocks, b.blocks); }
int byBUsed(const SumCounts& a, const SumCounts& b) {
  return descending(a.usedBlocks(), b.usedBlocks());
}
int byBUsedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.usedBlocks(), a.blocks, b.usedBlocks(), b.blocks, true);
}
int byBUnused(const SumCounts& a, const SumCounts& b) {
  return descending(a.unusedBlocks, b.unusedBlocks);
}
int byBUnusedPct(const SumCounts& a, const SumCounts& b) {
  return ratioDescending(a.unusedBlocks, a.blocks, b.unusedBlocks, b.blocks, false);
}

int byNative(const SortKey& a, const SortKey& b) {
  if (a.address == b.address) return 0;
  if (a.nativeIndex != b.nativeIndex) return a.nativeIndex < b.nativeIndex ? -1 : 1;
  return tieBreak(a, b);
}

template <typename Record>
SortKey keyOf(const Record* r) {
  return SortKey{r->name, r->nativeIndex, &r->counts, r};
}

// The comparison is a template argument, so it is inlined into the sort: a large summary
// sorts millions of functions.
template <SortComparison Cmp, typename Record>
void sortLevel(std::vector<Record*>& order) {
  if (order.size() < 2) return;
  std::sort(order.begin(), order.end(), [](const Record* a, const Record* b) { return Cmp(keyOf(a), keyOf(b)) < 0; });
}

std::size_t gFunctionsForThreads = std::size_t(256) << 10;

template <SortComparison Cmp>
void sortTree(SumRoot& root, bool functionsToo) {
  sortLevel<Cmp>(root.dirOrder);
  for (SumDir* d : root.dirOrder) sortLevel<Cmp>(d->fileOrder);
  if (!functionsToo) return;
  // Each file's functions are sorted apart from the others': many files, on a few threads.
  try {
    std::vector<SumFile*> files;
    for (SumDir* d : root.dirOrder) files.insert(files.end(), d->fileOrder.begin(), d->fileOrder.end());
    runInParallel(
        files.size(), [&](std::size_t k) { return files[k]->funcOrder.size(); }, gFunctionsForThreads,
        [&](std::size_t from, std::size_t to) {
          for (std::size_t k = from; k < to; ++k) sortLevel<Cmp>(files[k]->funcOrder);
        });
  } catch (const std::bad_alloc&) {
    // No room for the list of files: one file after the other.
    for (SumDir* d : root.dirOrder)
      for (SumFile* f : d->fileOrder) sortLevel<Cmp>(f->funcOrder);
  }
}

// Calls fn.template operator()<Cmp>() with the comparison of the order; false for an id
// outside 1..17.
template <typename Fn>
bool withComparison(std::uint32_t sortOrder, Fn fn) {
  switch (sortOrder) {
    case 1: fn.template operator()<withTieBreak<byNothing>>(); break;
    case 2: fn.template operator()<byNative>(); break;
    case 3: fn.template operator()<withTieBreak<byLines>>(); break;
    case 4: fn.template operator()<withTieBreak<byLUsed>>(); break;
    case 5: fn.template operator()<withTieBreak<byLUsedPct>>(); break;
    case 6: fn.template operator()<withTieBreak<byLUnused>>(); break;
    case 7: fn.template operator()<withTieBreak<byLUnusedPct>>(); break;
    case 8: fn.template operator()<withTieBreak<byAdjLines>>(); break;
    case 9: fn.template operator()<withTieBreak<byAlUsed>>(); break;
    case 10: fn.template operator()<withTieBreak<byAlUsedPct>>(); break;
    case 11: fn.template operator()<withTieBreak<byAlUnused>>(); break;
    case 12: fn.template operator()<withTieBreak<byAlUnusedPct>>(); break;
    case 13: fn.template operator()<withTieBreak<byBlocks>>(); break;
    case 14: fn.template operator()<withTieBreak<byBUsed>>(); break;
    case 15: fn.template operator()<withTieBreak<byBUsedPct>>(); break;
    case 16: fn.template operator()<withTieBreak<byBUnused>>(); break;
    case 17: fn.template operator()<withTieBreak<byBUnusedPct>>(); break;
    default: return false;
  }
  return true;
}

}  // namespace

void setSortThreadThreshold(std::size_t functions) { gFunctionsForThreads = functions; }

ErrorCode sortSummary(SumRoot& root, std::uint32_t sortOrder, bool functionsToo) {
  // Any other id leaves the tree as it is.
  if (withComparison(sortOrder, [&]<SortComparison Cmp>() { sortTree<Cmp>(root, functionsToo); }))
    root.sortOrder = sortOrder;
  return allOK;
}

void sortFunctions(SumFile& file, std::uint32_t sortOrder) {
  withComparison(sortOrder, [&]<SortComparison Cmp>() { sortLevel<Cmp>(file.funcOrder); });
}
