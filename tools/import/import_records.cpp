// Building data records from imported coverage.
#include "tools/import/import_records.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <string_view>
#include <unordered_map>

namespace {

// Names laid end to end with their NULs, each once, padded to a multiple of 4 bytes. The
// names must outlive the area.
class StringArea {
 public:
  std::uint32_t add(std::string_view name) {
    // A record names its file and a few functions: a scan finds them sooner than a hash.
    if (offsets_.empty()) {
      for (size_t i = 0; i < fewCount_; ++i)
        if (fewSpace_[i].first == name) return fewSpace_[i].second;
    } else {
      auto it = offsets_.find(name);
      if (it != offsets_.end()) return it->second;
    }
    auto offset = static_cast<std::uint32_t>(bytes_.size());
    bytes_.insert(bytes_.end(), name.begin(), name.end());
    bytes_.push_back('\0');
    if (offsets_.empty() && fewCount_ < std::size(fewSpace_)) {
      fewSpace_[fewCount_++] = {name, offset};
    } else {
      for (size_t i = 0; i < fewCount_; ++i) offsets_.emplace(fewSpace_[i].first, fewSpace_[i].second);
      fewCount_ = 0;
      offsets_.emplace(name, offset);
    }
    return offset;
  }
  void reserve(size_t bytes) { bytes_.reserve(bytes + 4); }
  std::vector<char> take() {
    while (bytes_.size() % 4) bytes_.push_back('\0');
    return std::move(bytes_);
  }

 private:
  std::vector<char> bytes_;
  std::pair<std::string_view, std::uint32_t> fewSpace_[16];
  size_t fewCount_ = 0;
  std::unordered_map<std::string_view, std::uint32_t> offsets_;
};

struct SourceFacts {
  bool exists = false;    // its modification time is known
  bool readable = false;  // its signature is of its content
  std::uint32_t mtime = 0;
  std::uint32_t signature = 0;
};

SourceFacts sourceFacts(const std::string& path) {
  SourceFacts f;
  int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
  struct stat st;
  if (fd < 0) {
    // Where opening found no such file, stat finds none either: a source that is not on
    // this machine costs one call, not two.
    bool absent = errno == ENOENT || errno == ENOTDIR || errno == ENAMETOOLONG || errno == ELOOP;
    if (!absent && stat(path.c_str(), &st) == 0) {
      f.exists = true;
      f.mtime = static_cast<std::uint32_t>(st.st_mtime);
    }
    return f;
  }
  if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
    close(fd);
    return f;
  }
  f.exists = true;
  f.mtime = static_cast<std::uint32_t>(st.st_mtime);
  // FNV-1a over the bytes, 64 bits folded to the record's 32.
  std::uint64_t h = 14695981039346656037ull;
  char buf[1 << 16];
  for (;;) {
    ssize_t n = read(fd, buf, sizeof buf);
    if (n < 0 && errno == EINTR) continue;
    if (n < 0) {
      close(fd);
      return f;
    }
    if (n == 0) break;
    for (ssize_t i = 0; i < n; ++i) h = (h ^ static_cast<unsigned char>(buf[i])) * 1099511628211ull;
  }
  close(fd);
  std::uint32_t folded = static_cast<std::uint32_t>(h ^ (h >> 32));
  f.signature = folded == 0 ? 1 : folded;
  f.readable = true;
  return f;
}

// The string area and the header of a record whose map is complete; both builders end so.
void finishRecord(ObjRecord& r, StringArea& strings, std::uint32_t signature, std::uint32_t buildTime,
                  std::uint32_t importTime) {
  r.strings = strings.take();
  r.objHeader.signature = signature;
  r.objHeader.buildTime = buildTime;
  r.objHeader.firstTime = importTime;
  r.objHeader.lastTime = importTime;
  r.objHeader.stringWords = static_cast<std::uint32_t>(r.strings.size() / 4);
  r.objHeader.mapCount = static_cast<std::uint32_t>(r.map.size());
}

}  // namespace

std::unique_ptr<ObjRecord> makeImportedRecord(const LaidOutRecord& rec, std::uint32_t buildTime,
                                              std::uint32_t importTime) {
  auto r = std::make_unique<ObjRecord>();
  StringArea strings;
  r->fileNameOffset = strings.add(rec.path);
  auto push = [&](std::uint32_t tag, std::uint32_t value, std::uint16_t count) {
    r->map.push_back(makeMapEntry(tag, value));
    r->counts.push_back(count);
  };
  push(TagFile, r->fileNameOffset, rec.sessions);
  for (const auto& f : rec.functions) {
    push(TagFunction, strings.add(f.name), f.calls);
    if (f.firstLine != 0) push(TagFuncLine, f.firstLine, 0);
    for (const auto& l : f.lines) {
      push(TagBlock, l.line, l.hits);
      for (std::uint16_t taken : l.branches) push(TagBlock, l.line, taken);
    }
  }
  finishRecord(*r, strings, rec.signature, buildTime, importTime);
  return r;
}

namespace {

// The record of one file as makeImportedRecord(layOutRecord(file)) makes it, straight from
// the layout plan.
std::unique_ptr<ObjRecord> makeFileRecord(const ImportedFile& file, const LayoutPlan& plan,
                                          std::uint32_t signature, std::uint32_t buildTime,
                                          std::uint32_t importTime) {
  const auto& lines = file.lines;
  const auto& outcomes = file.branches.outcomes();
  const size_t nLines = lines.size();
  const size_t nFuncs = plan.functions.size();
  const auto lineAt = lines.begin();

  // The lines of each function in order: a counting sort by owner keeps them ascending.
  std::vector<std::uint32_t> first(nFuncs + 2, 0);
  for (std::uint32_t o : plan.owner) ++first[o + 1];
  for (size_t k = 1; k < first.size(); ++k) first[k] += first[k - 1];
  std::vector<std::uint32_t> order(nLines);
  {
    std::vector<std::uint32_t> at(first.begin(), first.end() - 1);
    for (size_t i = 0; i < nLines; ++i) order[at[plan.owner[i]]++] = static_cast<std::uint32_t>(i);
  }
  // Each line's branch outcomes: [branchFrom[i], branchFrom[i] + branchCount[i]).
  std::vector<std::uint32_t> branchFrom, branchCount;
  size_t blocks = nLines;
  if (!outcomes.empty()) {
    branchFrom.assign(nLines, 0);
    branchCount.assign(nLines, 0);
    auto b = outcomes.begin();
    const auto bEnd = outcomes.end();
    for (size_t i = 0; i < nLines; ++i) {
      std::uint32_t line = lineAt[i].first;
      while (b != bEnd && b->line < line) ++b;
      branchFrom[i] = static_cast<std::uint32_t>(b - outcomes.begin());
      while (b != bEnd && b->line == line) ++b, ++branchCount[i];
      blocks += branchCount[i];
    }
  }

  auto r = std::make_unique<ObjRecord>();
  size_t entries = 1 + 2 * (nFuncs + 1) + blocks;
  r->map.reserve(entries);
  r->counts.reserve(entries);
  StringArea strings;
  size_t nameBytes = file.path.size() + 1;
  for (const ImportedFunction* f : plan.functions) nameBytes += f->name.size() + 1;
  strings.reserve(nameBytes + (plan.fileScopeLines ? std::string_view(kFileScopeName).size() + 1 : 0));
  r->fileNameOffset = strings.add(file.path);
  auto push = [&](std::uint32_t tag, std::uint32_t value, std::uint16_t count) {
    r->map.push_back(makeMapEntry(tag, value));
    r->counts.push_back(count);
  };
  push(TagFile, r->fileNameOffset, saturatedCount(file.runs == 0 ? 1 : file.runs));
  auto pushLines = [&](size_t k) {
    for (std::uint32_t p = first[k]; p < first[k + 1]; ++p) {
      std::uint32_t i = order[p];
      std::uint32_t line = lineAt[i].first;
      std::uint16_t hits = saturatedCount(lineAt[i].second);
      push(TagBlock, line, hits);
      if (branchCount.empty()) continue;
      auto b = outcomes.begin() + branchFrom[i];
      // A branch taken more often than its line ran (possible only in odd or merged data)
      // would raise the line's count; nor can a line that never ran have taken a branch.
      for (std::uint32_t n = 0; n < branchCount[i]; ++n, ++b) push(TagBlock, line, std::min(saturatedCount(b->taken), hits));
    }
  };
  for (size_t k = 0; k < nFuncs; ++k) {
    const ImportedFunction& f = *plan.functions[k];
    push(TagFunction, strings.add(f.name), saturatedCount(f.calls));
    if (f.startLine != 0) push(TagFuncLine, f.startLine, 0);
    pushLines(k);
  }
  if (plan.fileScopeLines != 0) {
    // Not a real function: it counts as called when any of its lines ran.
    push(TagFunction, strings.add(kFileScopeName), plan.fileScopeRan ? 1 : 0);
    if (plan.fileScopeFirst != 0) push(TagFuncLine, plan.fileScopeFirst, 0);
    pushLines(nFuncs);
  }
  finishRecord(*r, strings, signature, buildTime, importTime);
  return r;
}

}  // namespace

namespace {

// `consume`: each file's data are let go once its record is made, so that the records
// reuse their memory.
std::unique_ptr<KgvData> makeRecords(const ImportedData& data, std::uint32_t importTime, ImportedData* consume) {
  auto d = std::make_unique<KgvData>();
  d->records.reserve(data.files.size());
  LayoutPlan plan;
  // Folders found missing: none of their files need looking for (inputs from another
  // machine name thousands of sources in a few hundred folders that are not here).
  std::unordered_map<std::string_view, bool> folderMissing;
  struct stat folderStat;
  for (const auto& file : data.files) {
    planLayout(file, plan);
    // The signature says which source the data are of: its content, so that captures of an
    // unchanged source merge as one version whatever lines each holds.
    SourceFacts src;
    size_t slash = file.path.rfind('/');
    bool missing = false;
    if (slash != std::string::npos && slash > 0) {
      std::string_view folder(file.path.data(), slash);
      auto [it, added] = folderMissing.emplace(folder, false);
      // Where the folder cannot be reached, neither can anything in it.
      if (added) it->second = stat(std::string(folder).c_str(), &folderStat) != 0;
      missing = it->second;
    }
    if (!missing) src = sourceFacts(file.path);
    std::uint32_t signature = src.readable ? src.signature : lineSetSignature(file);
    // The build is taken to be a second after the source was last written: the source
    // window counts a source whose time is at or after the build's as changed since.
    std::uint32_t build = src.exists ? src.mtime + 1 : importTime;
    d->records.push_back(makeFileRecord(file, plan, signature, build, importTime));
    if (consume) {
      // The folder names seen point into the paths: those stay.
      ImportedFile& done = consume->files[d->records.size() - 1];
      done.functions = {};
      done.lines = {};
      done.branches = {};
      done.functionIndex = {};
    }
  }
  d->header.recordCount = static_cast<std::uint32_t>(d->records.size());
  rebuildRecordSizes(*d);
  return d;
}

}  // namespace

std::unique_ptr<KgvData> makeImportedData(const ImportedData& data, std::uint32_t importTime) {
  return makeRecords(data, importTime, nullptr);
}

std::unique_ptr<KgvData> makeImportedDataReleasing(ImportedData& data, std::uint32_t importTime) {
  auto d = makeRecords(data, importTime, &data);
  data = ImportedData();
  return d;
}
