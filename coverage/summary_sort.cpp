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

// What a comparison sees of a directory, file or function record.
struct SortKey {
  const char* name;
  std::uint32_t nativeIndex;
  const SumCounts* counts;
  const void* address;  // last tie-break: position in memory
};

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

template <typename Record>
SortKey keyOf(const Record* r) {
  return SortKey{r->name, r->nativeIndex, &r->counts, r};
}

using Primary = int (*)(const SumCounts&, const SumCounts&);

// A function with the eight bytes of its name after the part all names of its file share,
// as a big-endian number (zeros past its end): most ties between functions are decided by
// it, without reading the names.
struct KeyedFunction {
  SumFunc* fn;
  std::uint64_t prefix;
  const char* rest;  // the name after the shared part
};

std::uint64_t namePrefix(const char* name) {
  std::uint64_t p = 0;
  int i = 0;
  for (; i < 8 && name[i] != '\0'; ++i) p = p << 8 | static_cast<unsigned char>(name[i]);
  return i == 0 ? 0 : p << (8 * (8 - i));
}

// An order: by native index first (NativeFirst) or by the counts' comparison, then by the
// common tie-break. Both comparisons are template arguments, so that they are inlined into
// the sorts: a large summary sorts millions of functions.
template <Primary ByCounts, bool NativeFirst>
struct Order {
  static int compare(const SortKey& a, const SortKey& b) {
    if (a.address == b.address) return 0;
    if constexpr (NativeFirst) {
      if (a.nativeIndex != b.nativeIndex) return a.nativeIndex < b.nativeIndex ? -1 : 1;
    } else {
      if (int c = ByCounts(*a.counts, *b.counts); c != 0) return c;
    }
    return tieBreak(a, b);
  }

  // The same order as compare() gives the functions' keys.
  static bool functionBefore(const KeyedFunction& a, const KeyedFunction& b) {
    if (a.fn == b.fn) return false;
    if constexpr (NativeFirst) {
      if (a.fn->nativeIndex != b.fn->nativeIndex) return a.fn->nativeIndex < b.fn->nativeIndex;
    } else {
      if (int c = ByCounts(a.fn->counts, b.fn->counts); c != 0) return c < 0;
    }
    if (a.prefix != b.prefix) return a.prefix < b.prefix;
    // Equal first bytes: names of eight bytes or more go on, shorter ones are equal.
    if ((a.prefix & 0xFF) != 0) {
      if (int c = std::strcmp(a.rest + 8, b.rest + 8); c != 0) return c < 0;
    }
    if (a.fn->nativeIndex != b.fn->nativeIndex) return a.fn->nativeIndex < b.fn->nativeIndex;
    return std::less<const void*>()(a.fn, b.fn);
  }
};

template <class O, typename Record>
void sortLevel(std::vector<Record*>& order) {
  if (order.size() < 2) return;
  std::sort(order.begin(), order.end(),
            [](const Record* a, const Record* b) { return O::compare(keyOf(a), keyOf(b)) < 0; });
}

template <class O>
void sortFunctionsBy(std::vector<SumFunc*>& order) {
  if (order.size() < 2) return;
  // Kept from file to file on each thread.
  thread_local std::vector<KeyedFunction> keyed;
  keyed.clear();
  // Names of one file often begin alike (a namespace, a prefix): the part all share decides
  // nothing between them.
  const char* first = order[0]->name;
  std::size_t shared = std::strlen(first);
  for (const SumFunc* fn : order) {
    std::size_t i = 0;
    while (i < shared && fn->name[i] == first[i]) ++i;
    shared = i;
  }
  for (SumFunc* fn : order) keyed.push_back(KeyedFunction{fn, namePrefix(fn->name + shared), fn->name + shared});
  std::sort(keyed.begin(), keyed.end(), O::functionBefore);
  for (std::size_t k = 0; k < keyed.size(); ++k) order[k] = keyed[k].fn;
}

std::size_t gFunctionsForThreads = std::size_t(256) << 10;

template <class O>
void sortTree(SumRoot& root, bool functionsToo) {
  sortLevel<O>(root.dirOrder);
  for (SumDir* d : root.dirOrder) sortLevel<O>(d->fileOrder);
  if (!functionsToo) return;
  // Each file's functions are sorted apart from the others': many files, on a few threads.
  try {
    std::vector<SumFile*> files;
    for (SumDir* d : root.dirOrder) files.insert(files.end(), d->fileOrder.begin(), d->fileOrder.end());
    runInParallel(
        files.size(), [&](std::size_t k) { return files[k]->funcOrder.size(); }, gFunctionsForThreads,
        [&](std::size_t from, std::size_t to) {
          for (std::size_t k = from; k < to; ++k) sortFunctionsBy<O>(files[k]->funcOrder);
        });
  } catch (const std::bad_alloc&) {
    // No room for the list of files: one file after the other, without keys.
    for (SumDir* d : root.dirOrder)
      for (SumFile* f : d->fileOrder) sortLevel<O>(f->funcOrder);
  }
}

// Calls fn.template operator()<O>() with the Order of the id; false for an id outside 1..17.
template <typename Fn>
bool withComparison(std::uint32_t sortOrder, Fn fn) {
  switch (sortOrder) {
    case 1: fn.template operator()<Order<byNothing, false>>(); break;
    case 2: fn.template operator()<Order<byNothing, true>>(); break;
    case 3: fn.template operator()<Order<byLines, false>>(); break;
    case 4: fn.template operator()<Order<byLUsed, false>>(); break;
    case 5: fn.template operator()<Order<byLUsedPct, false>>(); break;
    case 6: fn.template operator()<Order<byLUnused, false>>(); break;
    case 7: fn.template operator()<Order<byLUnusedPct, false>>(); break;
    case 8: fn.template operator()<Order<byAdjLines, false>>(); break;
    case 9: fn.template operator()<Order<byAlUsed, false>>(); break;
    case 10: fn.template operator()<Order<byAlUsedPct, false>>(); break;
    case 11: fn.template operator()<Order<byAlUnused, false>>(); break;
    case 12: fn.template operator()<Order<byAlUnusedPct, false>>(); break;
    case 13: fn.template operator()<Order<byBlocks, false>>(); break;
    case 14: fn.template operator()<Order<byBUsed, false>>(); break;
    case 15: fn.template operator()<Order<byBUsedPct, false>>(); break;
    case 16: fn.template operator()<Order<byBUnused, false>>(); break;
    case 17: fn.template operator()<Order<byBUnusedPct, false>>(); break;
    default: return false;
  }
  return true;
}

}  // namespace

void setSortThreadThreshold(std::size_t functions) { gFunctionsForThreads = functions; }

ErrorCode sortSummary(SumRoot& root, std::uint32_t sortOrder, bool functionsToo) {
  // Any other id leaves the tree as it is.
  if (withComparison(sortOrder, [&]<class O>() { sortTree<O>(root, functionsToo); }))
    root.sortOrder = sortOrder;
  return allOK;
}

void sortFunctions(SumFile& file, std::uint32_t sortOrder) {
  try {
    withComparison(sortOrder, [&]<class O>() { sortFunctionsBy<O>(file.funcOrder); });
  } catch (const std::bad_alloc&) {
    withComparison(sortOrder, [&]<class O>() { sortLevel<O>(file.funcOrder); });  // without keys
  }
}
