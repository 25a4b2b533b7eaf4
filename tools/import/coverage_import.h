// Coverage from other tools (lcov tracefiles, gcov JSON) in a neutral form: per source
// file its functions with their lines and calls, the hit count of every instrumented line
// and the taken count of every branch outcome.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

struct ImportedFunction {
  std::string name;  // as shown: demangled, with its variant when two demangle alike
  std::string key;   // identity: the name as the input gives it (mangled for C++)
  std::uint32_t startLine = 0;
  std::uint32_t endLine = 0;  // 0 when the input does not say
  std::uint64_t calls = 0;
};

// A branch outcome within its line: lcov's block and branch numbers (gcov JSON's are 0 and
// the outcome's place in the line's list, as lcov makes them).
struct BranchKey {
  std::string block;
  std::string branch;
};

// Numbers in numeric order, then other words in byte order.
struct BranchOrder {
  bool operator()(const BranchKey& a, const BranchKey& b) const;
};

// Saturating addition for counts kept in 64 bits.
inline std::uint64_t addCounts(std::uint64_t a, std::uint64_t b) {
  return a > UINT64_MAX - b ? UINT64_MAX : a + b;
}

// A map kept as one vector in key order: inputs list their lines mostly in ascending order,
// which appends, and a tree's node per line cost more than the reading. A key that comes
// out of order and is not there yet waits at the end until the next read of the map (or
// settle()); waiting entries of one key are then combined by Combine, in any order.
template <class K, class V, class Less, class Combine>
class SortedMap {
 public:
  using value_type = std::pair<K, V>;
  using iterator = typename std::vector<value_type>::iterator;
  using const_iterator = typename std::vector<value_type>::const_iterator;

  SortedMap() = default;
  SortedMap(const SortedMap&) = default;
  SortedMap& operator=(const SortedMap&) = default;
  // What is moved from is left empty, its count of entries in order with it.
  SortedMap(SortedMap&& o) noexcept : items_(std::move(o.items_)), sorted_(o.sorted_) { o.clear(); }
  SortedMap& operator=(SortedMap&& o) noexcept {
    if (this == &o) return *this;
    items_ = std::move(o.items_);
    sorted_ = o.sorted_;
    o.clear();
    return *this;
  }

  // The value of `key`, value-initialised when it is new.
  V& slot(K key) {
    if (sorted_ == items_.size()) {
      if (items_.empty() || Less()(items_.back().first, key)) {
        items_.emplace_back(std::move(key), V());
        ++sorted_;
        return items_.back().second;
      }
      if (!Less()(key, items_.back().first)) return items_.back().second;
    }
    auto end = items_.begin() + static_cast<std::ptrdiff_t>(sorted_);
    auto it = std::lower_bound(items_.begin(), end, key, KeyLess());
    if (it != end && !Less()(key, it->first)) return it->second;
    items_.emplace_back(std::move(key), V());
    return items_.back().second;
  }

  // Puts the waiting entries in place; reads do it themselves.
  void settle() const {
    if (sorted_ == items_.size()) return;
    auto mid = items_.begin() + static_cast<std::ptrdiff_t>(sorted_);
    std::sort(mid, items_.end(), KeyLess());
    std::inplace_merge(items_.begin(), mid, items_.end(), KeyLess());
    auto out = items_.begin();
    for (auto it = items_.begin() + 1; it != items_.end(); ++it) {
      if (Less()(out->first, it->first)) {
        if (++out != it) *out = std::move(*it);  // strings moved onto themselves empty
      } else Combine()(out->second, std::move(it->second));
    }
    items_.erase(out + 1, items_.end());
    sorted_ = items_.size();
  }

  iterator begin() { settle(); return items_.begin(); }
  iterator end() { settle(); return items_.end(); }
  const_iterator begin() const { settle(); return items_.begin(); }
  const_iterator end() const { settle(); return items_.end(); }
  size_t size() const { settle(); return items_.size(); }
  bool empty() const { return items_.empty(); }
  void clear() { items_.clear(); sorted_ = 0; }
  void reserve(size_t n) { items_.reserve(n); }

  iterator find(const K& key) {
    settle();
    auto it = std::lower_bound(items_.begin(), items_.end(), key, KeyLess());
    return it != items_.end() && !Less()(key, it->first) ? it : items_.end();
  }
  const_iterator find(const K& key) const {
    settle();
    auto it = std::lower_bound(items_.cbegin(), items_.cend(), key, KeyLess());
    return it != items_.cend() && !Less()(key, it->first) ? it : items_.cend();
  }
  size_t count(const K& key) const { return find(key) != end() ? 1 : 0; }
  V& at(const K& key) {
    auto it = find(key);
    if (it == items_.end()) throw std::out_of_range("SortedMap::at");
    return it->second;
  }
  const V& at(const K& key) const {
    auto it = find(key);
    if (it == items_.cend()) throw std::out_of_range("SortedMap::at");
    return it->second;
  }
  V& operator[](const K& key) {
    settle();
    auto it = std::lower_bound(items_.begin(), items_.end(), key, KeyLess());
    if (it == items_.end() || Less()(key, it->first)) it = items_.emplace(it, key, V());
    sorted_ = items_.size();
    return it->second;
  }
  size_t erase(const K& key) {
    auto it = find(key);
    if (it == items_.end()) return 0;
    items_.erase(it);
    sorted_ = items_.size();
    return 1;
  }
  // Drops every entry whose key `pred` holds, in one pass.
  template <class Pred>
  void eraseKeys(Pred pred) {
    settle();
    items_.erase(std::remove_if(items_.begin(), items_.end(), [&](const value_type& e) { return pred(e.first); }),
                 items_.end());
    sorted_ = items_.size();
  }

 private:
  struct KeyLess {
    bool operator()(const value_type& a, const value_type& b) const { return Less()(a.first, b.first); }
    bool operator()(const value_type& a, const K& b) const { return Less()(a.first, b); }
  };
  // Reads settle the waiting entries, so these change under const.
  mutable std::vector<value_type> items_;
  mutable size_t sorted_ = 0;  // entries in order, each key once; the rest wait
};

struct AddCountsInto {
  void operator()(std::uint64_t& into, std::uint64_t from) const { into = addCounts(into, from); }
};

// -1, 0 or 1 in BranchOrder's order of words.
int compareBranchWords(std::string_view a, std::string_view b);

// The branch outcomes of a file, all in one vector by line and outcome; read as a map of
// line -> outcome (a BranchKey) -> times taken. Outcomes are numbered by small numbers
// (lcov's block and branch numbers), kept as numbers, so an outcome takes 24 bytes; other
// words are kept once each in a list of the file's. Outcomes that come out of order wait
// at the end until the next read, as in SortedMap.
class FileBranches {
 public:
  struct Outcome {
    std::uint32_t line;
    std::uint32_t block;   // a number below kWord, or kWord + its place in words_
    std::uint32_t branch;  // likewise
    std::uint64_t taken;
  };
  static constexpr std::uint32_t kWord = 0x80000000u;
  using OutcomeIterator = std::vector<Outcome>::const_iterator;

  // The outcomes of one line, each read as (BranchKey, times taken).
  class Line {
   public:
    class iterator {
     public:
      iterator(const FileBranches* owner, OutcomeIterator at) : owner_(owner), at_(at) {}
      std::pair<BranchKey, std::uint64_t> operator*() const { return {owner_->key(*at_), at_->taken}; }
      iterator& operator++() {
        ++at_;
        return *this;
      }
      bool operator==(const iterator& o) const { return at_ == o.at_; }
      bool operator!=(const iterator& o) const { return at_ != o.at_; }

     private:
      const FileBranches* owner_;
      OutcomeIterator at_;
    };
    Line(const FileBranches* owner, OutcomeIterator begin, OutcomeIterator end) : owner_(owner), begin_(begin), end_(end) {}
    iterator begin() const { return iterator(owner_, begin_); }
    iterator end() const { return iterator(owner_, end_); }
    size_t size() const { return static_cast<size_t>(end_ - begin_); }

   private:
    const FileBranches* owner_;
    OutcomeIterator begin_, end_;
  };

  // Lines in order, each read as (line, Line).
  class iterator {
   public:
    iterator(const FileBranches* owner, OutcomeIterator at, OutcomeIterator end) : owner_(owner), at_(at), end_(end) {}
    std::pair<std::uint32_t, Line> operator*() const { return {at_->line, Line(owner_, at_, lineEnd())}; }
    iterator& operator++() {
      at_ = lineEnd();
      return *this;
    }
    bool operator==(const iterator& o) const { return at_ == o.at_; }
    bool operator!=(const iterator& o) const { return at_ != o.at_; }

   private:
    OutcomeIterator lineEnd() const {
      OutcomeIterator e = at_;
      while (e != end_ && e->line == at_->line) ++e;
      return e;
    }
    const FileBranches* owner_;
    OutcomeIterator at_, end_;
  };

  FileBranches() = default;
  FileBranches(const FileBranches&) = default;
  FileBranches& operator=(const FileBranches&) = default;
  FileBranches(FileBranches&& o) noexcept
      : items_(std::move(o.items_)), sorted_(o.sorted_), words_(std::move(o.words_)), wordIndex_(std::move(o.wordIndex_)) {
    o.items_.clear();
    o.sorted_ = 0;
  }
  FileBranches& operator=(FileBranches&& o) noexcept {
    if (this == &o) return *this;
    items_ = std::move(o.items_);
    sorted_ = o.sorted_;
    words_ = std::move(o.words_);
    wordIndex_ = std::move(o.wordIndex_);
    o.items_.clear();
    o.sorted_ = 0;
    return *this;
  }

  void add(std::uint32_t line, std::string_view block, std::string_view branch, std::uint64_t taken);
  // Puts the outcomes that came out of order in place; reads do it themselves.
  void settle() const;
  void reserve(size_t n) { items_.reserve(n); }

  // Every outcome, by line then outcome.
  const std::vector<Outcome>& outcomes() const {
    settle();
    return items_;
  }
  BranchKey key(const Outcome& o) const { return BranchKey{word(o.block), word(o.branch)}; }

  iterator begin() const {
    settle();
    return iterator(this, items_.begin(), items_.end());
  }
  iterator end() const {
    settle();
    return iterator(this, items_.end(), items_.end());
  }
  bool empty() const { return items_.empty(); }
  // Outcomes, all lines together.
  size_t outcomeCount() const {
    settle();
    return items_.size();
  }
  // Lines with outcomes.
  size_t size() const;
  Line at(std::uint32_t line) const;
  // Drops the outcomes of every line `pred` holds.
  template <class Pred>
  void eraseLines(Pred pred) {
    settle();
    items_.erase(std::remove_if(items_.begin(), items_.end(), [&](const Outcome& o) { return pred(o.line); }),
                 items_.end());
    sorted_ = items_.size();
  }

 private:
  std::uint32_t code(std::string_view word);
  std::string word(std::uint32_t code) const;
  bool less(const Outcome& a, const Outcome& b) const;
  static bool same(const Outcome& a, const Outcome& b) {
    return a.line == b.line && a.block == b.block && a.branch == b.branch;
  }

  // Reads settle the waiting outcomes, so these change under const.
  mutable std::vector<Outcome> items_;
  mutable size_t sorted_ = 0;  // outcomes in order, each once; the rest wait
  std::vector<std::string> words_;
  std::unordered_map<std::string, std::uint32_t> wordIndex_;
};

// Hash of std::string that also takes a string_view, so that lookups build no string.
struct StringViewHash {
  using is_transparent = void;
  size_t operator()(std::string_view s) const { return std::hash<std::string_view>()(s); }
};

using NameIndex = std::unordered_map<std::string, size_t, StringViewHash, std::equal_to<>>;

// Names to numbers (source paths to their place in ImportedData::files): an open-addressed
// table over one string of the names end to end, so that a name added costs no allocation
// of its own. Read as a map: find() gives an iterator to (name, number), valid until the
// next name is added.
class PathIndex {
 public:
  struct Entry {
    std::string_view first;
    size_t second;
  };
  class iterator {
   public:
    iterator() = default;
    explicit iterator(Entry e) : entry_(e), valid_(true) {}
    const Entry& operator*() const { return entry_; }
    const Entry* operator->() const { return &entry_; }
    bool operator==(const iterator& o) const {
      return valid_ == o.valid_ && (!valid_ || entry_.second == o.entry_.second);
    }
    bool operator!=(const iterator& o) const { return !(*this == o); }

   private:
    Entry entry_{};
    bool valid_ = false;
  };

  iterator find(std::string_view name) const;
  iterator end() const { return iterator(); }
  size_t size() const { return size_; }
  bool empty() const { return size_ == 0; }
  // The value of the name, which is added with `value` when it is not there (one look-up).
  size_t findOrAdd(std::string_view name, size_t value);
  void reserve(size_t n);

 private:
  struct Slot {
    std::uint64_t hash = 0;
    size_t offset = 0;  // of the name in bytes_
    std::uint32_t length = 0;
    std::uint32_t value = kEmpty;
  };
  static constexpr std::uint32_t kEmpty = UINT32_MAX;
  size_t slotOf(std::string_view name, std::uint64_t hash) const;
  void grow(size_t slots);

  std::vector<Slot> slots_;  // a power of two of them, at most half in use
  std::string bytes_;
  size_t size_ = 0;
};

struct ImportedFile {
  std::string path;
  std::vector<ImportedFunction> functions;  // in order of first appearance
  // By key; kept only once a file has many functions, as a scan is quicker for a few.
  NameIndex functionIndex;
  SortedMap<std::uint32_t, std::uint64_t, std::less<std::uint32_t>, AddCountsInto> lines;  // line -> hits
  FileBranches branches;   // line -> outcome -> times taken
  std::uint64_t runs = 0;  // 0 when the input does not say
  bool namesDue = false;   // functions added since naming
  // Read from gcov, whose data lcov filters by the exclusion markers in the source; lcov's
  // tracefiles come filtered.
  bool fromGcov = false;

  // The function of that key, added when new.
  ImportedFunction& function(std::string_view key);
  void addLine(std::uint32_t line, std::uint64_t hits) {
    std::uint64_t& h = lines.slot(line);
    h = addCounts(h, hits);
  }
  void addBranch(std::uint32_t line, const BranchKey& key, std::uint64_t taken) {
    branches.add(line, key.block, key.branch, taken);
  }
  // Puts lines and branches that came out of order in place; the readers call it when a
  // record is complete, so that later reads change nothing.
  void settle();
  // After functions were taken out.
  void reindexFunctions();
};

struct ImportedData {
  std::vector<ImportedFile> files;  // in order of first appearance
  PathIndex fileIndex;
  // Where relative source paths of tracefiles (and of gcov JSON that names no working
  // directory) are taken from; empty: the current directory.
  std::string baseDirectory;

  ImportedFile& file(std::string path);
  // Gives the functions added since the last call their shown names; the readers call it
  // when they have read an input.
  void nameFunctions();
};

// Adds everything `from` holds to `into`, as reading its inputs after `into`'s would have.
void addImportedData(ImportedData& into, const ImportedData& from);
// The same, taking over the files `into` does not have yet; `from` is left empty.
void addImportedData(ImportedData& into, ImportedData&& from);

// Leaves out of the files read from gcov what lcov 1.16 (Debian 12) leaves out by the
// markers in their sources: lines marked LCOV_EXCL_LINE or between LCOV_EXCL_START and
// LCOV_EXCL_STOP (with their branches, and the functions that start there), and all
// branches of lines marked LCOV_EXCL_BR_LINE or LCOV_EXCL_EXCEPTION_BR_LINE or between the
// _START and _STOP of either. Sources that cannot be read are left as they are. A section
// left open is reported in `warnings`.
void applyExclusionMarkers(ImportedData& data, std::vector<std::string>& warnings);

// The name shown for a function: C++ names demangled, others as they are.
std::string demangledName(const std::string& key);

// The absolute, lexically normalised form of a source path ("." and ".." resolved, no
// doubled "/"); a relative path is taken from `base` (itself made absolute first).
std::string normalisedSourcePath(const std::string& path, const std::string& base);
// The directory normalisedSourcePath takes relative paths from, for `base`: readers work it
// out once for all the paths of an input.
std::string sourceBaseDirectory(const std::string& base);

// Where and why an input could not be read.
struct ImportError {
  std::string file;
  std::uint64_t line = 0;  // 0 when the problem is not at one line
  std::string message;
  std::string text() const;
};

// Reads a whole input, gzip-compressed or not. False with the error on failure.
bool readInputText(const std::string& path, std::string& text, ImportError& error);

enum class InputFormat { lcov, gcovJson, unknown };
InputFormat detectFormat(const std::string& text);

// Each adds what the input holds to `data` (several inputs add up). Relative source paths
// are taken from gcov's working directory when the input names one, else from
// data.baseDirectory.
bool readLcovTracefile(const std::string& name, const std::string& text, ImportedData& data,
                       ImportError& error);
bool readGcovJson(const std::string& name, const std::string& text, ImportedData& data,
                  ImportError& error);

// A tracefile read piece by piece: each piece ends where a line does, except the last one
// of the input, whose final line may lack its newline. After a failure (false, with the
// error) the rest is not read; finish() ends the input, as readLcovTracefile does.
class LcovTracefileReader {
 public:
  // sizeHint: about how many bytes the input holds.
  LcovTracefileReader(const std::string& name, ImportedData& data, ImportError& error, std::size_t sizeHint);
  ~LcovTracefileReader();
  LcovTracefileReader(const LcovTracefileReader&) = delete;
  LcovTracefileReader& operator=(const LcovTracefileReader&) = delete;
  bool feed(std::string_view wholeLines);
  bool finish();
  // Lines read so far (after finish(), all of them).
  std::uint64_t linesRead() const;

 private:
  struct State;
  std::unique_ptr<State> s_;
};

// A plain (not compressed) lcov tracefile is parsed as it is read, a few megabytes at a
// time, so that its text is never held whole. handled false: the input is no such file (or
// its format cannot be told from its start), and nothing was read into `data`.
// Large ones are read as two halves on two threads.
bool readPlainTracefile(const std::string& path, ImportedData& data, ImportError& error, bool& handled);
// Where readPlainTracefile begins the second half of that file; 0 when it reads it in one.
std::uint64_t tracefileSecondHalf(const std::string& path);
