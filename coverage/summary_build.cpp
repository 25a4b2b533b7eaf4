// Building and recomputing the summary tree: grouping records into directories and files,
// counting lines, blocks and functions with and without adjustments, and the line states.
#include "coverage/summary_build.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <new>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>

#include "coverage/kgv_file_ref.h"
#include "coverage/string_block.h"
#include "coverage/summary_sort.h"
#include "support/parallel_runs.h"
#include "support/string_helpers.h"

namespace {

// Adjustment sets by path, first entry of a path winning as in the list's own lookup.
class AdjustIndex {
 public:
  explicit AdjustIndex(const AdjustmentList& list) {
    sets_.reserve(list.size());
    for (const AdjustEntry& e : list.entries()) {
      sets_.emplace(e.resolvedName(), e.set());
      names_.insert(std::string(baseName(e.resolvedName())));
    }
  }
  // By the data's path, else by the file it resolves to: data may name a source relatively
  // or through a symbolic link, while entries carry resolved paths. Only a file whose name
  // some entry has is resolved, so that data of many files costs no system call per file.
  const CvgAdjustSet* find(const SumDir& dir, const SumFile& file) const {
    if (sets_.empty()) return nullptr;
    std::string path = std::string(dir.name) + file.name;
    auto it = sets_.find(path);
    if (it == sets_.end() && names_.count(std::string(baseName(path))) != 0) {
      const std::string resolved = resolveFilePath(path);
      if (resolved != path) it = sets_.find(resolved);
    }
    return it == sets_.end() ? nullptr : it->second;
  }

 private:
  static std::string_view baseName(std::string_view path) {
    const std::size_t slash = path.rfind('/');
    return slash == std::string_view::npos ? path : path.substr(slash + 1);
  }

  std::unordered_map<std::string, const CvgAdjustSet*> sets_;
  std::unordered_set<std::string> names_;
};

std::uint32_t adjustBits(const CvgAdjustSet* set, std::uint32_t line) {
  return set ? set->lineKinds(line) : 0;
}

std::string_view dirPart(std::string_view path) {
  std::size_t slash = path.rfind('/');
  if (slash == std::string_view::npos) return kNoDirectoryName;
  return path.substr(0, slash + 1);
}

std::string_view basePart(std::string_view path) {
  std::size_t slash = path.rfind('/');
  return slash == std::string_view::npos ? path : path.substr(slash + 1);
}

// The statistics of one file and its functions.
class FileCounter {
 public:
  FileCounter(SumFile& file, std::uint32_t policy, const CvgAdjustSet* set)
      : f_(file), policy_(policy), set_(set), map_(file.record->map),
        counts_(file.record->counts) {
    countUnusedLine(plainUnused_, 0);
  }

  ErrorCode run();

 private:
  std::size_t nextUsed(std::size_t i, std::size_t end) const {
    while (i < end && mapTag(map_[i]) == TagEmpty) ++i;
    return i;
  }
  std::uint32_t line(std::size_t i) const { return mapValue(map_[i]); }
  std::uint16_t count(std::size_t i) const { return i < counts_.size() ? counts_[i] : 0; }
  ErrorCode scanBlocks(SumFunc& fn, std::size_t start, std::size_t end, bool orderCheck);
  void accountLines(SumFunc& fn, std::size_t start, std::size_t end);
  ErrorCode countInOnePass(SumFunc& fn, std::size_t start, std::size_t& end, bool& inOrder);
  void account(SumCounts& c, std::uint32_t lineNo, std::uint16_t hits) const;

  SumFile& f_;
  std::uint32_t policy_;
  const CvgAdjustSet* set_;
  std::vector<std::uint32_t>& map_;
  std::vector<std::uint16_t>& counts_;
  SumCounts plainUnused_;  // what an unused line without adjustments adds
};

ErrorCode FileCounter::scanBlocks(SumFunc& fn, std::size_t start, std::size_t end,
                                  bool orderCheck) {
  if (mapTag(map_[start]) != TagBlock) return corruptKgvFile;
  bool outOfOrder = false;
  std::uint32_t previous = line(start);
  for (std::size_t i = start; i < end; i = nextUsed(i + 1, end)) {
    std::uint32_t tag = mapTag(map_[i]);
    if (tag == TagBlock) {
      ++fn.counts.blocks;
      if (count(i) == 0) ++fn.counts.unusedBlocks;
    } else if (tag != TagBlockLine) {
      return corruptKgvFile;
    }
    if (line(i) < previous) outOfOrder = true;
    previous = line(i);
  }
  if (orderCheck && outOfOrder) {
    // A stable sort by line of the used entries among themselves: each entry out of order
    // moves back behind the nearest earlier one whose line is not greater.
    std::vector<std::size_t> places;
    std::vector<std::pair<std::uint32_t, std::uint16_t>> entries;
    for (std::size_t i = start; i < end; i = nextUsed(i + 1, end)) {
      places.push_back(i);
      entries.emplace_back(map_[i], count(i));
    }
    std::stable_sort(entries.begin(), entries.end(), [](const auto& a, const auto& b) {
      return mapValue(a.first) < mapValue(b.first);
    });
    // Block lines below every block line number would now lead the run, and the next build
    // would reject the map it just wrote: the first block leads instead, those lines after it.
    auto firstBlock = std::find_if(entries.begin(), entries.end(),
                                   [](const auto& e) { return mapTag(e.first) == TagBlock; });
    std::rotate(entries.begin(), firstBlock, firstBlock + 1);
    for (std::size_t k = 0; k < places.size(); ++k) {
      map_[places[k]] = entries[k].first;
      if (places[k] < counts_.size()) counts_[places[k]] = entries[k].second;
    }
  }
  return allOK;
}

// The lines of a function's blocks from start to end, which are in line order.
void FileCounter::accountLines(SumFunc& fn, std::size_t s, std::size_t end) {
  std::uint32_t l = line(s);
  std::uint16_t c = count(s);
  std::uint16_t b = c;
  fn.firstLine = l;
  for (std::size_t k = nextUsed(s + 1, end); k < end; k = nextUsed(k + 1, end)) {
    if (mapTag(map_[k]) == TagBlock) b = count(k);
    if (line(k) != l) {
      account(fn.counts, l, c);
      c = b;
      l = line(k);
    } else {
      c = combineHits(policy_, c, b);
    }
  }
  account(fn.counts, l, c);
  fn.lastLine = l;
}

inline void FileCounter::account(SumCounts& c, std::uint32_t lineNo, std::uint16_t hits) const {
  ++c.lines;
  if (hits != 0) {
    ++c.adjLines;
    return;
  }
  ++c.unusedLines;
  if (!set_) {
    // Most files have no adjustments: no lookup for each of their lines.
    c.adjLines += plainUnused_.adjLines;
    c.adjUnusedLines += plainUnused_.adjUnusedLines;
    c.deadLines += plainUnused_.deadLines;
    c.testedLines += plainUnused_.testedLines;
    c.inspectedLines += plainUnused_.inspectedLines;
    return;
  }
  countUnusedLine(c, dominantAdjust(adjustBits(set_, lineNo)));
}

// scanBlocks and accountLines at once, for blocks in line order (inOrder false: the counts
// are to be thrown away).
ErrorCode FileCounter::countInOnePass(SumFunc& fn, std::size_t s, std::size_t& end, bool& inOrder) {
  if (mapTag(map_[s]) != TagBlock) return corruptKgvFile;
  // Everything the loop touches is local, so that it stays in registers.
  const std::uint32_t* map = map_.data();
  const std::uint16_t* counts = counts_.data();
  const std::size_t stop = end, countsSize = counts_.size();
  SumCounts sum = fn.counts;
  bool ordered = true;
  std::uint32_t l = line(s);
  std::uint16_t c = count(s);
  std::uint16_t b = c;
  fn.firstLine = l;
  ++sum.blocks;
  if (c == 0) ++sum.unusedBlocks;
  for (std::size_t k = s + 1; k < stop; ++k) {
    const std::uint32_t e = map[k];
    const std::uint32_t tag = mapTag(e);
    if (tag == TagEmpty) continue;
    const std::uint32_t at = mapValue(e);
    if (tag == TagBlock) {
      b = k < countsSize ? counts[k] : 0;
      ++sum.blocks;
      sum.unusedBlocks += b == 0;
    } else if (tag != TagBlockLine) {
      return corruptKgvFile;
    }
    if (at < l) ordered = false;
    if (at != l) {
      account(sum, l, c);
      c = b;
      l = at;
    } else {
      c = combineHits(policy_, c, b);
    }
  }
  account(sum, l, c);
  fn.counts = sum;
  fn.lastLine = l;
  if (!ordered) inOrder = false;
  return allOK;
}

ErrorCode FileCounter::run() {
  f_.counts = SumCounts{};
  f_.unusedFuncs = 0;
  f_.deadFuncs = 0;
  f_.lineCount = 0;
  const std::size_t n = map_.size();
  if (n == 0) return allOK;
  if (mapTag(map_[0]) != TagFile) return corruptKgvFile;
  f_.sessions = count(0);

  std::size_t funcNo = 0;
  std::size_t i = nextUsed(1, n);
  while (i < n) {
    if (mapTag(map_[i]) != TagFunction || funcNo >= f_.functions.size()) return corruptKgvFile;
    SumFunc& fn = f_.functions[funcNo++];
    std::size_t end = i + 1;
    while (end < n && mapTag(map_[end]) != TagFunction) ++end;

    fn.counts = SumCounts{};
    fn.allDead = false;
    fn.firstLine = fn.lastLine = 0;
    std::size_t next = nextUsed(i + 1, end);
    if (next < end) {
      if (mapTag(map_[next]) != TagFuncLine) {
        ErrorCode rc = scanBlocks(fn, next, end, false);
        if (rc != allOK) return rc;
      } else {
        fn.firstLine = fn.lastLine = line(next);
        std::size_t s = nextUsed(next + 1, end);
        if (s < end) {
          // Blocks and lines in one pass over the entries; blocks out of line order (rare)
          // are put in order first and counted again.
          std::size_t stop = end;
          bool inOrder = true;
          ErrorCode rc = countInOnePass(fn, s, stop, inOrder);
          if (rc != allOK) return rc;
          if (!inOrder) {
            fn.counts = SumCounts{};
            rc = scanBlocks(fn, s, end, true);
            if (rc != allOK) return rc;
            accountLines(fn, s, end);
          }
        }
        f_.lineCount = std::max(f_.lineCount, fn.lastLine);
      }
    }
    fn.firstMapIndex = static_cast<std::uint32_t>(i);
    fn.lastMapIndex = static_cast<std::uint32_t>(end - 1);
    fn.calls = count(i);
    if (fn.calls == 0) ++f_.unusedFuncs;
    if (fn.counts.lines != 0 && fn.counts.adjLines == 0) {
      fn.allDead = true;
      ++f_.deadFuncs;
    }
    f_.counts += fn.counts;
    i = end;
  }
  return allOK;
}

// Lines past the end of the file's lines are never stored; when asked for, the first one of
// a file is reported.
class DamagedLines {
 public:
  DamagedLines(const SumFile& file, MessageSink& messages) : file_(file), messages_(messages) {}
  // True for a line past the end, which is then left out.
  bool pastEnd(std::uint32_t line) {
    if (line <= file_.lineCount) return false;
    if (!reported_ && corruptedLinesReported()) {
      reported_ = true;
      messages_.notice(stringPrintf("The line number information of file %s is corrupted.\n"
                                    "Kestrel will not process this information\n",
                                    file_.record->fileName()));
    }
    return true;
  }

 private:
  const SumFile& file_;
  MessageSink& messages_;
  bool reported_ = false;
};

void buildLineStates(const SumFile& f, std::uint32_t policy, const CvgAdjustSet* set,
                     MessageSink& messages, LineStates& states, bool withClasses = true) {
  if (f.lineCount == 0 || !f.record) {
    states.clear();
    return;
  }
  const std::vector<std::uint32_t>& map = f.record->map;
  const std::vector<std::uint16_t>& counts = f.record->counts;
  // Every line the map names stands alone; the adjustments' ranges split the rest, so that
  // each segment has one set of adjustment bits.
  // Kept from file to file: most files need no new memory for them.
  thread_local std::vector<std::uint32_t> singles, boundaries;
  singles.clear();
  boundaries.clear();
  for (std::uint32_t e : map) {
    const std::uint32_t tag = mapTag(e);
    if (tag == TagFuncLine || tag == TagBlock || tag == TagBlockLine) singles.push_back(mapValue(e));
  }
  if (set) {
    set->iterateRanges([&](CvgAdjust, std::uint32_t first, std::uint32_t last) {
      boundaries.push_back(first);
      if (last < UINT32_MAX) boundaries.push_back(last + 1);
      return true;
    });
  }
  states.reset(f.lineCount, singles, boundaries);
  auto mark = [&](std::uint32_t line, std::uint32_t flag) {
    if (LineState* s = states.single(line)) s->flags |= flag;
  };
  std::uint32_t last = 0;
  std::uint16_t blockCount = 0;
  DamagedLines damaged(f, messages);
  for (std::size_t i = 0; i < map.size(); ++i) {
    std::uint32_t tag = mapTag(map[i]);
    std::uint32_t v = mapValue(map[i]);
    if (tag == TagFuncLine) {
      mark(last, LineFuncEnd);
      mark(v, LineFuncStart);
      last = v;
    } else if (tag == TagBlock || tag == TagBlockLine) {
      if (tag == TagBlock) blockCount = i < counts.size() ? counts[i] : 0;
      if (damaged.pastEnd(v)) continue;
      if (LineState* s = states.single(v)) {
        if (s->flags & LineHasCode) {
          s->count = combineHits(policy, s->count, blockCount);
        } else {
          s->count = blockCount;
          s->flags |= LineHasCode | adjustBits(set, v);
        }
      }
      last = v;
    }
  }
  mark(last, LineFuncEnd);
  // Lines without code keep their adjustment bits too; a segment's lines share theirs.
  if (set) states.forEachSegment([&](std::uint32_t first, std::uint32_t, LineState& s) { s.flags |= set->lineKinds(first); });
  if (withClasses) states.classify();
}

void addTimes(std::uint32_t& first, std::uint32_t& last, std::uint32_t f, std::uint32_t l) {
  first = std::min(first, f);
  last = std::max(last, l);
}

std::size_t gEntriesForThreads = std::size_t(4) << 20;

void listFunctions(SumFile& f);

// What a first build does for a file besides counting it.
struct FirstBuild {
  std::uint32_t sortOrder;  // the file's functions are sorted by it once counted
};

// Counts every file; files are independent of each other, so large data are counted on
// several threads. Each file's code is kept for the caller to take in order. On a first
// build each file's functions are listed before and sorted after, while its data are at hand.
std::vector<ErrorCode> countFiles(SumRoot& root, std::uint32_t policy, const AdjustIndex& index,
                                  const FirstBuild* first) {
  std::vector<std::pair<SumDir*, SumFile*>> files;
  for (SumDir& d : root.dirRecords)
    for (SumFile& f : d.fileRecords) files.emplace_back(&d, &f);
  std::vector<ErrorCode> codes(files.size(), allOK);
  auto count = [&](std::size_t from, std::size_t to) {
    for (std::size_t k = from; k < to; ++k) {
      SumFile& f = *files[k].second;
      try {
        if (first) listFunctions(f);
        codes[k] = FileCounter(f, policy, index.find(*files[k].first, f)).run();
        if (first && codes[k] == allOK) sortFunctions(f, first->sortOrder);
      } catch (const std::bad_alloc&) {
        codes[k] = outOfMemory;
      }
    }
  };
  runInParallel(
      files.size(), [&](std::size_t k) { return files[k].second->record ? files[k].second->record->map.size() : 0; },
      gEntriesForThreads, count);
  return codes;
}

ErrorCode computeStatistics(SumRoot& root, std::uint32_t policy, const AdjustIndex& index,
                            MessageSink& messages, bool withLineStates, const FirstBuild* first = nullptr) {
  const std::vector<ErrorCode> codes = countFiles(root, policy, index, first);
  std::size_t fileNo = 0;
  root.counts = SumCounts{};
  root.funcs = root.unusedFuncs = root.deadFuncs = root.files = 0;
  root.firstTime = 0x7FFFFFFF;
  root.lastTime = 0;
  for (SumDir& d : root.dirRecords) {
    d.counts = SumCounts{};
    d.funcs = d.unusedFuncs = d.deadFuncs = 0;
    d.firstTime = 0x7FFFFFFF;
    d.lastTime = 0;
    for (SumFile& f : d.fileRecords) {
      if (ErrorCode rc = codes[fileNo++]; rc != allOK) return rc;
      d.counts += f.counts;
      d.funcs += f.funcs;
      d.unusedFuncs += f.unusedFuncs;
      d.deadFuncs += f.deadFuncs;
      addTimes(d.firstTime, d.lastTime, f.firstTime, f.lastTime);
    }
    root.counts += d.counts;
    root.funcs += d.funcs;
    root.unusedFuncs += d.unusedFuncs;
    root.deadFuncs += d.deadFuncs;
    root.files += d.files;
    addTimes(root.firstTime, root.lastTime, d.firstTime, d.lastTime);
  }
  for (SumDir& d : root.dirRecords) {
    for (SumFile& f : d.fileRecords) {
      if (withLineStates) {
        buildLineStates(f, policy, index.find(d, f), messages, f.lineStates);
      } else {
        f.lineStates.clear();
      }
    }
  }
  return allOK;
}

// The old records of one level by name, for matching in order with wrap-around.
template <typename Record>
class NameMatcher {
 public:
  explicit NameMatcher(const std::vector<Record*>& order) : order_(order) {
    for (std::size_t i = 0; i < order.size(); ++i)
      places_[std::string_view(order[i]->name)].push_back(i);
  }
  // The first record of that name at or after `start`, else the first one before it.
  const Record* find(const char* name, std::size_t& start) const {
    auto it = places_.find(std::string_view(name));
    if (it == places_.end()) return nullptr;
    const std::vector<std::size_t>& p = it->second;
    auto at = std::lower_bound(p.begin(), p.end(), start);
    std::size_t pos = at != p.end() ? *at : p.front();
    start = pos + 1;
    return order_[pos];
  }

 private:
  const std::vector<Record*>& order_;
  std::unordered_map<std::string_view, std::vector<std::size_t>> places_;
};

}  // namespace

std::uint16_t combineHits(std::uint32_t policy, std::uint16_t first, std::uint16_t next) {
  switch (policy) {
    case hitsMin: return std::min(first, next);
    case hitsFirst: return first;
    case hitsLast: return next;
    default: return std::max(first, next);
  }
}

std::uint32_t hitsPolicyFromText(const char* value) {
  if (!value || !*value) return hitsMax;
  static const char* const names[] = {"max", "min", "first", "last"};
  for (std::uint32_t i = 0; i < 4; ++i) {
    if (optionNamesMatch(value, names[i])) return i + 1;
  }
  return hitsMax;
}

bool corruptedLinesReported() {
  static const bool reported = std::getenv("PROCESS_CORRUPTED_LINES") != nullptr;
  return reported;
}

std::uint32_t getHitsPolicy() {
  static const std::uint32_t policy = hitsPolicyFromText(std::getenv("KESTREL_HITS_POLICY"));
  return policy;
}

namespace {

void listFunctions(SumFile& f) {
  const std::vector<std::uint32_t>& map = f.record->map;
  std::uint32_t n = 0;
  for (std::uint32_t e : map) n += mapTag(e) == TagFunction;
  f.funcs = n;
  f.functions.resize(n);
  std::uint32_t k = 0;
  for (std::size_t i = 0; i < map.size(); ++i) {
    if (mapTag(map[i]) != TagFunction) continue;
    SumFunc& fn = f.functions[k++];
    fn.nativeIndex = static_cast<std::uint32_t>(i);
    fn.name = f.record->nameAt(mapValue(map[i]));
  }
  f.funcOrder.reserve(n);
  for (SumFunc& fn : f.functions) f.funcOrder.push_back(&fn);
}

ErrorCode buildTree(KgvData& data, std::uint32_t sortOrder, std::uint32_t hitsPolicy,
                    const AdjustmentList& adjustments, MessageSink& messages,
                    std::unique_ptr<SumRoot>& out, bool withLineStates) {
  auto root = std::make_unique<SumRoot>();
  root->hitsPolicy = hitsPolicy;

  // Directories: the distinct directory parts in sorted order.
  StringBlock dirBlock;
  for (const auto& rec : data.records) {
    ErrorCode rc = dirBlock.addBorrowed(dirPart(rec->fileNameView()));
    if (rc != allOK) return rc;
  }
  std::uint32_t dirCount = 0, words = 0;
  ErrorCode rc = dirBlock.freeze(root->dirNames, dirCount, words);
  if (rc != allOK) return rc;
  root->dirs = dirCount;
  root->dirRecords.resize(dirCount);
  const std::vector<std::uint32_t>& dirOffsets = dirBlock.sortedOffsets();
  for (std::uint32_t i = 0; i < dirCount; ++i) {
    root->dirRecords[i].name = root->dirNames.data() + dirOffsets[i];
    root->dirOrder.push_back(&root->dirRecords[i]);
  }

  // Files: each record's base name in its directory's own table.
  std::vector<StringBlock> fileBlocks(dirCount);
  std::vector<std::uint32_t> recordDir(data.records.size());
  for (std::size_t r = 0; r < data.records.size(); ++r) {
    std::string_view path = data.records[r]->fileNameView();
    std::uint32_t offset = 0, position = 0;
    rc = dirBlock.find(dirPart(path), offset, position);
    if (rc != allOK) return rc;
    recordDir[r] = position;
    SumDir& d = root->dirRecords[position];
    if (d.nativeIndex == 0) d.nativeIndex = static_cast<std::uint32_t>(r + 1);
    rc = fileBlocks[position].addBorrowed(basePart(path));
    if (rc != allOK) return rc;
  }
  for (std::uint32_t i = 0; i < dirCount; ++i) {
    SumDir& d = root->dirRecords[i];
    std::uint32_t fileCount = 0;
    rc = fileBlocks[i].freeze(d.fileNames, fileCount, words);
    if (rc != allOK) return rc;
    d.files = fileCount;
    d.fileRecords.resize(fileCount);
    const std::vector<std::uint32_t>& offsets = fileBlocks[i].sortedOffsets();
    for (std::uint32_t k = 0; k < fileCount; ++k) {
      d.fileRecords[k].name = d.fileNames.data() + offsets[k];
      d.fileRecords[k].dir = &d;
      d.fileOrder.push_back(&d.fileRecords[k]);
    }
  }
  for (std::size_t r = 0; r < data.records.size(); ++r) {
    ObjRecord& rec = *data.records[r];
    SumDir& d = root->dirRecords[recordDir[r]];
    std::uint32_t offset = 0, position = 0;
    rc = fileBlocks[recordDir[r]].find(basePart(rec.fileNameView()), offset, position);
    if (rc != allOK) return rc;
    SumFile& f = d.fileRecords[position];
    f.firstTime = rec.objHeader.firstTime;
    f.lastTime = rec.objHeader.lastTime;
    f.nativeIndex = static_cast<std::uint32_t>(r + 1);
    f.record = &rec;
  }

  // Functions: one per TagFunction entry, in map order, listed, counted and sorted file by file.
  root->lineStatesKept = withLineStates;
  const FirstBuild first{sortOrder};
  rc = computeStatistics(*root, hitsPolicy, AdjustIndex(adjustments), messages, withLineStates, &first);
  if (rc != allOK) return rc;
  sortSummary(*root, sortOrder, false);
  out = std::move(root);
  return allOK;
}

}  // namespace

std::size_t summaryThreadThreshold() { return gEntriesForThreads; }

void setSummaryThreadThreshold(std::size_t mapEntries) {
  gEntriesForThreads = mapEntries;
  // A function's sort costs about what counting sixteen of its entries does.
  setSortThreadThreshold(mapEntries / 16);
}

ErrorCode buildSummary(KgvData& data, std::uint32_t sortOrder, std::uint32_t hitsPolicy,
                       const AdjustmentList& adjustments, MessageSink& messages,
                       std::unique_ptr<SumRoot>& out, bool withLineStates) {
  out.reset();
  try {
    return buildTree(data, sortOrder, hitsPolicy, adjustments, messages, out, withLineStates);
  } catch (const std::bad_alloc&) {
    out.reset();
    return outOfMemory;
  } catch (...) {
    out.reset();
    return fatalInternalError;
  }
}

ErrorCode recomputeSummary(SumRoot& root, std::uint32_t hitsPolicy,
                           const AdjustmentList& adjustments, MessageSink& messages) {
  root.hitsPolicy = hitsPolicy;
  try {
    return computeStatistics(root, hitsPolicy, AdjustIndex(adjustments), messages, root.lineStatesKept);
  } catch (const std::bad_alloc&) {
    return outOfMemory;
  } catch (...) {
    return fatalInternalError;
  }
}

void setViewState(SumRoot& root, std::uint32_t value) {
  root.viewState = value;
  for (SumDir& d : root.dirRecords) {
    d.viewState = value;
    for (SumFile& f : d.fileRecords) {
      f.viewState = value;
      for (SumFunc& fn : f.functions) fn.viewState = value;
    }
  }
}

void carryViewState(SumRoot* newRoot, const SumRoot* oldRoot, std::uint32_t defaultValue) {
  if (!newRoot) return;
  if (!oldRoot) {
    setViewState(*newRoot, defaultValue);
    return;
  }
  newRoot->viewState = oldRoot->viewState;
  NameMatcher<SumDir> dirs(oldRoot->dirOrder);
  std::size_t dirStart = 0;
  for (SumDir* d : newRoot->dirOrder) {
    const SumDir* od = dirs.find(d->name, dirStart);
    if (!od) {
      d->viewState = defaultValue;
      continue;
    }
    d->viewState = od->viewState;
    NameMatcher<SumFile> files(od->fileOrder);
    std::size_t fileStart = 0;
    for (SumFile* f : d->fileOrder) {
      const SumFile* of = files.find(f->name, fileStart);
      if (!of) {
        f->viewState = defaultValue;
        continue;
      }
      f->viewState = of->viewState;
      NameMatcher<SumFunc> funcs(of->funcOrder);
      std::size_t funcStart = 0;
      for (SumFunc* fn : f->funcOrder) {
        const SumFunc* ofn = funcs.find(fn->name, funcStart);
        fn->viewState = ofn ? ofn->viewState : defaultValue;
      }
    }
  }
}

SumFile* findSumFile(SumRoot& root, const std::string& path) {
  std::string_view p(path);
  for (SumDir& d : root.dirRecords) {
    std::string_view dn(d.name);
    if (p.size() < dn.size() || p.compare(0, dn.size(), dn) != 0) continue;
    std::string_view base = p.substr(dn.size());
    // Files are in sorted name order within their directory.
    auto it = std::lower_bound(d.fileRecords.begin(), d.fileRecords.end(), base,
                               [](const SumFile& f, std::string_view b) {
                                 return std::string_view(f.name) < b;
                               });
    if (it != d.fileRecords.end() && std::string_view(it->name) == base) return &*it;
  }
  return nullptr;
}

struct LazyLineStates::Index {
  explicit Index(const AdjustmentList& list) : sets(list) {}
  AdjustIndex sets;
};

LazyLineStates::LazyLineStates(const AdjustmentList& adjustments, std::uint32_t hitsPolicy,
                               MessageSink& messages, bool withClasses)
    : index_(std::make_unique<Index>(adjustments)), policy_(hitsPolicy), messages_(messages),
      withClasses_(withClasses) {}

LazyLineStates::~LazyLineStates() = default;

const LineStates& LazyLineStates::of(const SumFile& file) {
  if (file.lineCount == 0 || !file.lineStates.empty() || !file.dir || !file.record)
    return file.lineStates;
  buildLineStates(file, policy_, index_->sets.find(*file.dir, file), messages_, scratch_, withClasses_);
  return scratch_;
}

const std::vector<std::uint32_t>& LazyLineStates::packed(const SumFile& file) {
  packed_.clear();
  if (file.lineCount == 0 || !file.lineStates.empty() || !file.dir || !file.record) return packed_;
  const std::vector<std::uint32_t>& map = file.record->map;
  const std::vector<std::uint16_t>& counts = file.record->counts;
  // Far-apart line numbers would make the array mostly empty: segments serve those.
  if (file.lineCount > 8 * map.size() + 1024) return packed_;
  const CvgAdjustSet* set = index_->sets.find(*file.dir, file);
  packed_.assign(std::size_t(file.lineCount) + 1, 0);
  std::uint32_t* lines = packed_.data();
  std::uint16_t blockCount = 0;
  DamagedLines damaged(file, messages_);
  // As buildLineStates does for the lines with code.
  for (std::size_t i = 0; i < map.size(); ++i) {
    const std::uint32_t tag = mapTag(map[i]);
    if (tag != TagBlock && tag != TagBlockLine) continue;
    const std::uint32_t v = mapValue(map[i]);
    if (tag == TagBlock) blockCount = i < counts.size() ? counts[i] : 0;
    if (damaged.pastEnd(v)) continue;
    if (v == 0) continue;
    std::uint32_t& w = lines[v];
    if (w & (LineHasCode << 16)) {
      w = (w & 0xFFFF0000u) | combineHits(policy_, static_cast<std::uint16_t>(w), blockCount);
    } else {
      w = (LineHasCode | adjustBits(set, v)) << 16 | blockCount;
    }
  }
  return packed_;
}
