// The neutral import model and its names and paths, reading compressed or plain inputs,
// and format detection.
#include "tools/import/coverage_import.h"

#include <cxxabi.h>
#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>
#include <zlib.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <string_view>
#include <system_error>
#include <thread>
#include <type_traits>

static_assert(std::is_nothrow_move_constructible_v<ImportedFile>,
              "the files' vector must move its files as it grows, not copy them");

namespace {
// Functions a file may have before it keeps an index of them.
constexpr size_t kIndexedFunctions = 16;
}  // namespace

ImportedFunction& ImportedFile::function(std::string_view key) {
  if (functionIndex.empty()) {
    for (ImportedFunction& f : functions)
      if (f.key == key) return f;
  } else {
    auto it = functionIndex.find(key);
    if (it != functionIndex.end()) return functions[it->second];
  }
  functions.push_back(ImportedFunction{std::string(key), std::string(key), 0, 0, 0});
  if (!functionIndex.empty()) functionIndex.emplace(functions.back().key, functions.size() - 1);
  else if (functions.size() >= kIndexedFunctions) reindexFunctions();
  namesDue = true;
  return functions.back();
}

void ImportedFile::reindexFunctions() {
  functionIndex.clear();
  if (functions.size() < kIndexedFunctions) return;
  functionIndex.reserve(functions.size());
  for (size_t i = 0; i < functions.size(); ++i) functionIndex.emplace(functions[i].key, i);
}

void ImportedFile::settle() {
  lines.settle();
  branches.settle();
}

namespace {

bool allDigits(std::string_view s) {
  return !s.empty() && std::all_of(s.begin(), s.end(), [](char c) { return c >= '0' && c <= '9'; });
}

// -1, 0 or 1; numbers (of any length) before words, in numeric order.
int compareWords(std::string_view a, std::string_view b) {
  bool na = allDigits(a), nb = allDigits(b);
  if (na != nb) return na ? -1 : 1;
  if (na) {
    size_t za = std::min(a.find_first_not_of('0'), a.size() - 1);
    size_t zb = std::min(b.find_first_not_of('0'), b.size() - 1);
    size_t la = a.size() - za, lb = b.size() - zb;
    if (la != lb) return la < lb ? -1 : 1;
    int c = a.compare(za, la, b, zb, lb);
    if (c != 0) return c < 0 ? -1 : 1;
  }
  int c = a.compare(b);
  return c < 0 ? -1 : c > 0 ? 1 : 0;
}

// What tells two C++ names that demangle alike apart: the constructor or destructor variant
// ("D0" for the deleting destructor, "C1" for the complete-object constructor...) where the
// names differ only in it, else the mangled name itself.
std::string variantOf(const std::string& key, const std::string& other) {
  size_t i = 0;
  while (i < key.size() && i < other.size() && key[i] == other[i]) ++i;
  auto digit = [](const std::string& s, size_t at) { return at < s.size() && s[at] >= '0' && s[at] <= '9'; };
  if (i >= 1 && digit(key, i) && digit(other, i)) {
    if (key[i - 1] == 'C' || key[i - 1] == 'D') return key.substr(i - 1, 2);
    if (i >= 2 && key[i - 1] == 'I' && key[i - 2] == 'C') return key.substr(i - 2, 3);  // inheriting constructors
  }
  return key;
}

// As nameFileFunctions below, by comparing each function with the others: for the few
// functions most files have, quicker than building the maps.
void nameFewFunctions(ImportedFile& file) {
  std::vector<ImportedFunction>& fs = file.functions;
  const size_t n = fs.size();
  std::vector<std::string> base;
  base.reserve(n);
  for (const ImportedFunction& f : fs) base.push_back(demangledName(f.key));
  for (size_t i = 0; i < n; ++i) {
    ImportedFunction& f = fs[i];
    // The first other function of the same shown name, if any.
    size_t other = n;
    for (size_t j = 0; j < n && other == n; ++j)
      if (j != i && base[j] == base[i]) other = j;
    if (other == n || f.key == base[i]) {
      f.name = base[i];
      continue;
    }
    f.name = base[i] + " [" + variantOf(f.key, fs[other].key) + "]";
  }
  auto takenBefore = [&](size_t i, const std::string& name) {
    for (size_t j = 0; j < i; ++j)
      if (fs[j].name == name) return true;
    return false;
  };
  for (size_t i = 0; i < n; ++i) {
    ImportedFunction& f = fs[i];
    if (!takenBefore(i, f.name)) continue;
    std::string candidate = base[i] + " [" + f.key + "]";
    for (unsigned k = 2; takenBefore(i, candidate); ++k) candidate = base[i] + " [" + f.key + "] #" + std::to_string(k);
    f.name = candidate;
  }
  file.namesDue = false;
}

void nameFileFunctions(ImportedFile& file) {
  // No C++ names: each is shown as it is, and keys differ, so names do.
  if (std::none_of(file.functions.begin(), file.functions.end(),
                   [](const ImportedFunction& f) { return f.key.compare(0, 2, "_Z") == 0; })) {
    for (ImportedFunction& f : file.functions) f.name = f.key;
    file.namesDue = false;
    return;
  }
  if (file.functions.size() <= 32) return nameFewFunctions(file);
  std::vector<std::string> base;
  base.reserve(file.functions.size());
  std::unordered_map<std::string, std::vector<size_t>> byBase;
  for (size_t i = 0; i < file.functions.size(); ++i) {
    base.push_back(demangledName(file.functions[i].key));
    byBase[base.back()].push_back(i);
  }
  for (size_t i = 0; i < file.functions.size(); ++i) {
    ImportedFunction& f = file.functions[i];
    const std::vector<size_t>& same = byBase[base[i]];
    // A name that was not mangled keeps its form; the demangled ones beside it say which
    // variant they are.
    if (same.size() == 1 || f.key == base[i]) {
      f.name = base[i];
      continue;
    }
    size_t other = same[0] == i ? same[1] : same[0];
    f.name = base[i] + " [" + variantOf(f.key, file.functions[other].key) + "]";
  }
  // Names that still meet (only crafted ones can) take their key, then a number.
  std::unordered_map<std::string, size_t> taken;
  for (size_t i = 0; i < file.functions.size(); ++i) {
    ImportedFunction& f = file.functions[i];
    if (taken.emplace(f.name, i).second) continue;
    std::string candidate = base[i] + " [" + f.key + "]";
    for (unsigned n = 2; !taken.emplace(candidate, i).second; ++n)
      candidate = base[i] + " [" + f.key + "] #" + std::to_string(n);
    f.name = candidate;
  }
  file.namesDue = false;
}

}  // namespace

int compareBranchWords(std::string_view a, std::string_view b) { return compareWords(a, b); }

namespace {

// A number below FileBranches::kWord written as std::to_string writes it: such words are
// kept as their numbers, and compare in BranchOrder's order as numbers do.
bool plainNumber(std::string_view w, std::uint32_t& value) {
  if (w.empty() || w.size() > 10 || (w[0] == '0' && w.size() > 1)) return false;
  std::uint64_t v = 0;
  for (char c : w) {
    if (c < '0' || c > '9') return false;
    v = v * 10 + static_cast<unsigned>(c - '0');
  }
  if (v >= FileBranches::kWord) return false;
  value = static_cast<std::uint32_t>(v);
  return true;
}

}  // namespace

std::uint32_t FileBranches::code(std::string_view w) {
  std::uint32_t v;
  if (plainNumber(w, v)) return v;
  // Words are few; a file lists them once each.
  if (wordIndex_.empty()) {
    for (size_t i = 0; i < words_.size(); ++i)
      if (words_[i] == w) return kWord + static_cast<std::uint32_t>(i);
  } else {
    auto it = wordIndex_.find(std::string(w));
    if (it != wordIndex_.end()) return kWord + it->second;
  }
  words_.emplace_back(w);
  auto at = static_cast<std::uint32_t>(words_.size() - 1);
  if (!wordIndex_.empty()) {
    wordIndex_.emplace(words_.back(), at);
  } else if (words_.size() > 16) {
    for (size_t i = 0; i < words_.size(); ++i) wordIndex_.emplace(words_[i], static_cast<std::uint32_t>(i));
  }
  return kWord + at;
}

std::string FileBranches::word(std::uint32_t code) const {
  return code < kWord ? std::to_string(code) : words_[code - kWord];
}

bool FileBranches::less(const Outcome& a, const Outcome& b) const {
  if (a.line != b.line) return a.line < b.line;
  if (a.block != b.block) {
    if (a.block < kWord && b.block < kWord) return a.block < b.block;
    return compareWords(word(a.block), word(b.block)) < 0;
  }
  if (a.branch != b.branch) {
    if (a.branch < kWord && b.branch < kWord) return a.branch < b.branch;
    return compareWords(word(a.branch), word(b.branch)) < 0;
  }
  return false;
}

void FileBranches::add(std::uint32_t line, std::string_view block, std::string_view branch, std::uint64_t taken) {
  Outcome o{line, code(block), code(branch), taken};
  if (sorted_ == items_.size()) {
    if (items_.empty() || less(items_.back(), o)) {
      items_.push_back(o);
      ++sorted_;
      return;
    }
    if (same(items_.back(), o)) {
      items_.back().taken = addCounts(items_.back().taken, taken);
      return;
    }
  }
  auto end = items_.begin() + static_cast<std::ptrdiff_t>(sorted_);
  auto it = std::lower_bound(items_.begin(), end, o, [this](const Outcome& x, const Outcome& y) { return less(x, y); });
  if (it != end && same(*it, o)) {
    it->taken = addCounts(it->taken, taken);
    return;
  }
  items_.push_back(o);
}

void FileBranches::settle() const {
  if (sorted_ == items_.size()) return;
  auto order = [this](const Outcome& x, const Outcome& y) { return less(x, y); };
  auto mid = items_.begin() + static_cast<std::ptrdiff_t>(sorted_);
  std::sort(mid, items_.end(), order);
  std::inplace_merge(items_.begin(), mid, items_.end(), order);
  auto out = items_.begin();
  for (auto it = items_.begin() + 1; it != items_.end(); ++it) {
    if (same(*out, *it)) out->taken = addCounts(out->taken, it->taken);
    else *++out = *it;
  }
  items_.erase(out + 1, items_.end());
  sorted_ = items_.size();
}

size_t FileBranches::size() const {
  size_t n = 0;
  for (auto it = begin(); it != end(); ++it) ++n;
  return n;
}

FileBranches::Line FileBranches::at(std::uint32_t line) const {
  settle();
  auto first = std::lower_bound(items_.begin(), items_.end(), line,
                                [](const Outcome& o, std::uint32_t l) { return o.line < l; });
  auto last = first;
  while (last != items_.end() && last->line == line) ++last;
  if (first == last) throw std::out_of_range("FileBranches::at");
  return Line(this, first, last);
}

bool BranchOrder::operator()(const BranchKey& a, const BranchKey& b) const {
  int c = compareWords(a.block, b.block);
  if (c != 0) return c < 0;
  return compareWords(a.branch, b.branch) < 0;
}

std::string demangledName(const std::string& key) {
  // Only names of the C++ ABI: the demangler reads "f" as the type "float".
  if (key.compare(0, 2, "_Z") != 0) return key;
  int status = 0;
  char* text = abi::__cxa_demangle(key.c_str(), nullptr, nullptr, &status);
  if (status != 0 || !text) {
    free(text);
    return key;
  }
  std::string shown(text);
  free(text);
  return shown;
}

size_t PathIndex::slotOf(std::string_view name, std::uint64_t hash) const {
  size_t mask = slots_.size() - 1;
  for (size_t i = hash & mask;; i = (i + 1) & mask) {
    const Slot& s = slots_[i];
    if (s.value == kEmpty) return i;
    if (s.hash == hash && s.length == name.size() && std::string_view(bytes_.data() + s.offset, s.length) == name)
      return i;
  }
}

void PathIndex::grow(size_t slots) {
  std::vector<Slot> old(slots, Slot());
  old.swap(slots_);
  for (const Slot& s : old) {
    if (s.value == kEmpty) continue;
    size_t mask = slots_.size() - 1;
    size_t i = s.hash & mask;
    while (slots_[i].value != kEmpty) i = (i + 1) & mask;
    slots_[i] = s;
  }
}

void PathIndex::reserve(size_t n) {
  size_t want = 16;
  while (want < 2 * n) want *= 2;
  if (want > slots_.size()) grow(want);
}

PathIndex::iterator PathIndex::find(std::string_view name) const {
  if (slots_.empty()) return end();
  const Slot& s = slots_[slotOf(name, std::hash<std::string_view>()(name))];
  if (s.value == kEmpty) return end();
  return iterator(Entry{std::string_view(bytes_.data() + s.offset, s.length), s.value});
}

size_t PathIndex::findOrAdd(std::string_view name, size_t value) {
  if (2 * (size_ + 1) > slots_.size()) grow(slots_.empty() ? 16 : 2 * slots_.size());
  std::uint64_t hash = std::hash<std::string_view>()(name);
  Slot& s = slots_[slotOf(name, hash)];
  if (s.value != kEmpty) return s.value;
  s.hash = hash;
  s.offset = bytes_.size();
  s.length = static_cast<std::uint32_t>(name.size());
  s.value = static_cast<std::uint32_t>(value);
  bytes_.append(name);
  ++size_;
  return value;
}

ImportedFile& ImportedData::file(std::string path) {
  const size_t at = fileIndex.findOrAdd(path, files.size());
  if (at != files.size()) return files[at];
  files.emplace_back();
  files.back().path = std::move(path);
  return files.back();
}

void ImportedData::nameFunctions() {
  for (ImportedFile& f : files)
    if (f.namesDue) nameFileFunctions(f);
}

namespace {

void addImportedFile(ImportedFile& dst, const ImportedFile& src) {
  for (const ImportedFunction& f : src.functions) {
    ImportedFunction& g = dst.function(f.key);
    if (g.startLine == 0) g.startLine = f.startLine;
    if (g.endLine == 0) g.endLine = f.endLine;
    g.calls = addCounts(g.calls, f.calls);
  }
  for (const auto& [line, hits] : src.lines) dst.addLine(line, hits);
  for (const auto& [line, outcomes] : src.branches)
    for (const auto& [key, taken] : outcomes) dst.addBranch(line, key, taken);
  dst.settle();
  dst.runs = addCounts(dst.runs, src.runs);
  dst.fromGcov = dst.fromGcov || src.fromGcov;
}

}  // namespace

void addImportedData(ImportedData& into, const ImportedData& from) {
  for (const ImportedFile& src : from.files) addImportedFile(into.file(src.path), src);
  into.nameFunctions();
}

void addImportedData(ImportedData& into, ImportedData&& from) {
  for (ImportedFile& src : from.files) {
    // A file new to `into` is taken over whole: adding its parts to an empty file would
    // give the same.
    const size_t at = into.fileIndex.findOrAdd(src.path, into.files.size());
    if (at == into.files.size()) {
      src.settle();
      into.files.push_back(std::move(src));
    } else {
      addImportedFile(into.files[at], src);
    }
  }
  from = ImportedData();
  into.nameFunctions();
}

namespace {

// An absolute path that normalising leaves as it is: no empty, "." or ".." part.
bool alreadyNormal(std::string_view p) {
  if (p.empty() || p[0] != '/') return false;
  if (p.size() == 1) return true;
  for (size_t i = 1; i <= p.size();) {
    size_t slash = p.find('/', i);
    if (slash == std::string_view::npos) slash = p.size();
    size_t len = slash - i;
    if (len == 0 || (p[i] == '.' && (len == 1 || (len == 2 && p[i + 1] == '.')))) return false;
    i = slash + 1;
  }
  return true;
}

}  // namespace

std::string sourceBaseDirectory(const std::string& base) {
  std::string dir = base;
  if (dir.empty() || dir[0] != '/') {
    char cwd[PATH_MAX];
    if (getcwd(cwd, sizeof cwd) && cwd[0] == '/')
      dir = dir.empty() ? std::string(cwd) : std::string(cwd) + "/" + dir;
  }
  return dir;
}

std::string normalisedSourcePath(const std::string& path, const std::string& base) {
  // Most inputs name their sources this way already.
  if (alreadyNormal(path)) return path;
  std::string full = path;
  if (full.empty() || full[0] != '/') {
    std::string dir = sourceBaseDirectory(base);
    // Without a usable working directory a relative path stays relative.
    if (!dir.empty() && dir[0] == '/') full = dir + "/" + full;
  }
  const bool absolute = !full.empty() && full[0] == '/';
  std::vector<std::string_view> parts;
  std::string_view rest(full);
  while (!rest.empty()) {
    size_t slash = rest.find('/');
    std::string_view part = rest.substr(0, slash);
    rest = slash == std::string_view::npos ? std::string_view() : rest.substr(slash + 1);
    if (part.empty() || part == ".") continue;
    if (part == ".." && !parts.empty() && parts.back() != "..") {
      parts.pop_back();
      continue;
    }
    if (part == ".." && absolute) continue;  // above the root is the root
    parts.push_back(part);
  }
  std::string out;
  for (std::string_view p : parts) {
    if (absolute || !out.empty()) out += '/';
    out += p;
  }
  if (out.empty()) return absolute ? "/" : ".";
  return out;
}

std::string ImportError::text() const {
  if (line == 0) return file + ": " + message;
  return file + ":" + std::to_string(line) + ": " + message;
}

namespace {

constexpr std::uint64_t kInflationRatio = 64;
constexpr std::uint64_t kInflationFloor = std::uint64_t{64} << 20;
constexpr std::uint64_t kMaxInflated = std::uint64_t{4} << 30;

enum class PlainRead { notPlain, failed, read };

// Reads a regular file that does not start as gzip data does; notPlain, with `text` and
// `error` untouched, where gzread is to read it instead.
PlainRead readPlainFile(const std::string& path, std::string& text, ImportError& error) {
  int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) return PlainRead::notPlain;
  struct stat st;
  unsigned char magic[2];
  if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode) || pread(fd, magic, 2, 0) != 2 ||
      (magic[0] == 0x1f && magic[1] == 0x8b)) {
    close(fd);
    return PlainRead::notPlain;
  }
  text.clear();
  // Room for one byte more than the size, so that reaching the end needs no second buffer.
  text.resize(static_cast<size_t>(st.st_size) + 1);
  size_t have = 0;
  int failure = 0;
  for (;;) {
    if (have == text.size()) text.resize(2 * text.size());  // it grew while it was read
    ssize_t got = read(fd, text.data() + have, text.size() - have);
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) {
      failure = got < 0 ? errno : 0;
      break;
    }
    have += static_cast<size_t>(got);
  }
  text.resize(have);
  close(fd);
  if (failure != 0) {
    error.message = std::string("cannot read: ") + strerror(failure);
    text.clear();
    return PlainRead::failed;
  }
  return PlainRead::read;
}

}  // namespace

bool readInputText(const std::string& path, std::string& text, ImportError& error) {
  error.file = path;
  error.line = 0;
  // A plain file is read in one go into its full size; gzread, which passes plain files
  // through unchanged, would copy it piece by piece into a growing string.
  switch (readPlainFile(path, text, error)) {
    case PlainRead::read: return true;
    case PlainRead::failed: return false;
    case PlainRead::notPlain: break;
  }
  // A compressed input may inflate to no more than this: real coverage reports compress
  // perhaps thirty-fold, a crafted one a thousand-fold and more, to fill the memory.
  struct stat st;
  std::uint64_t ceiling = kMaxInflated;
  if (stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode))
    ceiling = std::clamp<std::uint64_t>(std::uint64_t(st.st_size) * kInflationRatio,
                                        kInflationFloor, kMaxInflated);
  // gzread passes plain files through unchanged, so one reader serves both.
  gzFile f = gzopen(path.c_str(), "rb");
  if (!f) {
    error.message = std::string("cannot open: ") + strerror(errno ? errno : ENOENT);
    return false;
  }
  text.clear();
  char buf[1 << 16];
  for (;;) {
    int n = gzread(f, buf, sizeof buf);
    if (n < 0) {
      int code = 0;
      const char* msg = gzerror(f, &code);
      error.message = std::string("cannot read: ") +
                      (code == Z_ERRNO ? strerror(errno) : (msg ? msg : "corrupt compressed data"));
      gzclose(f);
      return false;
    }
    if (n == 0) break;
    text.append(buf, static_cast<size_t>(n));
    if (text.size() > ceiling && !gzdirect(f)) {
      error.message = "cannot read: it inflates to more than " + std::to_string(ceiling) +
                      " bytes (" + std::to_string(kInflationRatio) +
                      " times its compressed size); refused as a likely gzip bomb";
      gzclose(f);
      text.clear();
      text.shrink_to_fit();
      return false;
    }
  }
  int rc = gzclose(f);
  if (rc != Z_OK && rc != Z_BUF_ERROR) {
    error.message = "cannot read: the compressed data are truncated or corrupt";
    return false;
  }
  if (rc == Z_BUF_ERROR) {
    error.message = "cannot read: the compressed data are truncated";
    return false;
  }
  return true;
}

namespace {

// Pieces of a tracefile read at a time; a line longer than this grows the buffer.
constexpr std::size_t kTracefilePiece = std::size_t(4) << 20;
// Tracefiles of this size and more are read as two halves on two threads.
constexpr std::uint64_t kTracefileHalves = std::uint64_t(8) << 20;

// Reads bytes from..to of the file (to: UINT64_MAX for its end) and feeds their whole lines
// to the reader, the rest of the last line at the end. False on a bad line (the reader's
// error) or a failed read (readErrno set).
bool feedRange(int fd, std::uint64_t from, std::uint64_t to, LcovTracefileReader& reader, int& readErrno) {
  std::string buf(kTracefilePiece, '\0');
  std::size_t have = 0;  // bytes in buf not yet fed
  std::uint64_t at = from;
  for (;;) {
    if (have == buf.size()) buf.resize(2 * buf.size());  // a line longer than the buffer
    std::size_t want = buf.size() - have;
    if (to != UINT64_MAX) want = static_cast<std::size_t>(std::min<std::uint64_t>(want, to - at));
    if (want == 0) break;
    ssize_t got = pread(fd, buf.data() + have, want, static_cast<off_t>(at));
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) {
      readErrno = errno;
      return false;
    }
    if (got == 0) break;
    at += static_cast<std::uint64_t>(got);
    have += static_cast<std::size_t>(got);
    // Whole lines are read now; the rest waits for the next piece.
    const void* lastNewline = memrchr(buf.data(), '\n', have);
    if (!lastNewline) continue;
    const std::size_t whole = static_cast<std::size_t>(static_cast<const char*>(lastNewline) - buf.data()) + 1;
    if (!reader.feed(std::string_view(buf.data(), whole))) return false;
    std::memmove(buf.data(), buf.data() + whole, have - whole);
    have -= whole;
  }
  // The last line, which may lack its newline.
  return reader.feed(std::string_view(buf.data(), have));
}

// Bytes from..to of the file as a whole input (ended with finish()): false with the error.
// fileSize (as the file was opened) gives the data room for their files; linesRead: how
// many lines were read.
bool readRange(int fd, std::uint64_t from, std::uint64_t to, std::uint64_t fileSize, const std::string& path,
               ImportedData& data, ImportError& error, std::uint64_t& linesRead) {
  const std::uint64_t end = std::min(to, fileSize);
  LcovTracefileReader reader(path, data, error, static_cast<std::size_t>(end > from ? end - from : 0));
  int readErrno = 0;
  const bool fed = feedRange(fd, from, to, reader, readErrno);
  const bool finished = reader.finish();
  linesRead = reader.linesRead();
  if (readErrno != 0) {
    // A read that failed is the reason, not the record it cut short.
    error.file = path;
    error.line = 0;
    error.message = std::string("cannot read: ") + strerror(readErrno);
    return false;
  }
  return fed && finished;
}

// Where the second half of a tracefile may begin: just after an "end_of_record" line at or
// past the middle, where a reader of the whole file holds no record; 0 where none is near.
std::uint64_t secondHalf(int fd, std::uint64_t size) {
  static const char kEnd[] = "\nend_of_record\n";
  std::string window(std::size_t(1) << 20, '\0');
  const std::uint64_t from = size / 2;
  ssize_t got;
  do got = pread(fd, window.data(), window.size(), static_cast<off_t>(from));
  while (got < 0 && errno == EINTR);
  if (got <= 0) return 0;
  const std::size_t found = std::string_view(window.data(), static_cast<std::size_t>(got)).find(kEnd);
  if (found == std::string_view::npos) return 0;
  const std::uint64_t split = from + found + sizeof kEnd - 1;
  return split < size ? split : 0;
}

// A bad line of the second half is at its place in the whole file.
void inWholeFile(ImportError& error, std::uint64_t linesBefore) {
  if (error.line != 0) error.line += linesBefore;
}

}  // namespace

std::uint64_t tracefileSecondHalf(const std::string& path) {
  int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) return 0;
  struct stat st;
  std::uint64_t split = 0;
  if (fstat(fd, &st) == 0 && S_ISREG(st.st_mode) && std::uint64_t(st.st_size) >= kTracefileHalves)
    split = secondHalf(fd, static_cast<std::uint64_t>(st.st_size));
  close(fd);
  return split;
}

bool readPlainTracefile(const std::string& path, ImportedData& data, ImportError& error, bool& handled) {
  handled = false;
  int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) return false;
  struct stat st;
  char head[4096];
  ssize_t got = -1;
  if (fstat(fd, &st) == 0 && S_ISREG(st.st_mode)) {
    do got = pread(fd, head, sizeof head, 0);
    while (got < 0 && errno == EINTR);
  }
  // The start says what the input is; gzip data and anything not a tracefile go the way of
  // readInputText, which reads them whole (and says why one cannot be read).
  const bool gzip = got >= 2 && static_cast<unsigned char>(head[0]) == 0x1f && static_cast<unsigned char>(head[1]) == 0x8b;
  if (got <= 0 || gzip || detectFormat(std::string(head, static_cast<std::size_t>(got))) != InputFormat::lcov) {
    close(fd);
    return false;
  }
  handled = true;
  error.file = path;
  error.line = 0;
  const std::uint64_t size = static_cast<std::uint64_t>(st.st_size);
  const std::uint64_t split = size >= kTracefileHalves ? secondHalf(fd, size) : 0;
  std::uint64_t lines = 0;
  if (split == 0) {
    const bool ok = readRange(fd, 0, UINT64_MAX, size, path, data, error, lines);
    close(fd);
    return ok;
  }
  // Two halves at once, the second into data of its own, added to the first's when both
  // are read: as one reader of the whole file, which holds no record where the second
  // half begins, would have read them.
  ImportedData second;
  second.baseDirectory = data.baseDirectory;
  ImportError secondError{path, 0, {}};
  bool secondOk = false;
  std::uint64_t secondLines = 0;
  std::exception_ptr secondFailure;
  auto readSecond = [&] {
    try {
      secondOk = readRange(fd, split, UINT64_MAX, size, path, second, secondError, secondLines);
    } catch (...) {
      secondFailure = std::current_exception();
    }
  };
  std::thread worker;
  try {
    worker = std::thread(readSecond);
  } catch (const std::system_error&) {
    readSecond();  // no thread to be had: one half after the other
  }
  bool firstOk = false;
  std::exception_ptr firstFailure;
  try {
    firstOk = readRange(fd, 0, split, size, path, data, error, lines);
  } catch (...) {
    firstFailure = std::current_exception();
  }
  if (worker.joinable()) worker.join();
  close(fd);
  if (firstFailure) std::rethrow_exception(firstFailure);
  if (!firstOk) return false;
  if (secondFailure) std::rethrow_exception(secondFailure);
  if (!secondOk) {
    error = secondError;
    inWholeFile(error, lines);
    return false;
  }
  addImportedData(data, std::move(second));
  return true;
}

InputFormat detectFormat(const std::string& text) {
  size_t i = text.find_first_not_of(" \t\r\n");
  if (i == std::string::npos) return InputFormat::unknown;
  if (text[i] == '{') return InputFormat::gcovJson;
  static const char* const kKeys[] = {"TN:", "SF:", "VER:", "#"};
  for (const char* k : kKeys)
    if (text.compare(i, strlen(k), k) == 0) return InputFormat::lcov;
  return InputFormat::unknown;
}
