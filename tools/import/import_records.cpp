// Building data records from imported coverage.
#include "tools/import/import_records.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <unordered_map>

namespace {

// Names laid end to end with their NULs, each once, padded to a multiple of 4 bytes.
class StringArea {
 public:
  std::uint32_t add(const std::string& name) {
    auto it = offsets_.find(name);
    if (it != offsets_.end()) return it->second;
    auto offset = static_cast<std::uint32_t>(bytes_.size());
    bytes_.insert(bytes_.end(), name.begin(), name.end());
    bytes_.push_back('\0');
    offsets_.emplace(name, offset);
    return offset;
  }
  std::vector<char> take() {
    while (bytes_.size() % 4) bytes_.push_back('\0');
    return std::move(bytes_);
  }

 private:
  std::vector<char> bytes_;
  std::unordered_map<std::string, std::uint32_t> offsets_;
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
    if (stat(path.c_str(), &st) == 0) {
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
  r->strings = strings.take();
  r->objHeader.signature = rec.signature;
  r->objHeader.buildTime = buildTime;
  r->objHeader.firstTime = importTime;
  r->objHeader.lastTime = importTime;
  r->objHeader.stringWords = static_cast<std::uint32_t>(r->strings.size() / 4);
  r->objHeader.mapCount = static_cast<std::uint32_t>(r->map.size());
  return r;
}

std::unique_ptr<KgvData> makeImportedData(const ImportedData& data, std::uint32_t importTime) {
  auto d = std::make_unique<KgvData>();
  for (const auto& file : data.files) {
    LaidOutRecord rec = layOutRecord(file);
    // The signature says which source the data are of: its content, so that captures of an
    // unchanged source merge as one version whatever lines each holds.
    SourceFacts src = sourceFacts(file.path);
    if (src.readable) rec.signature = src.signature;
    // The build is taken to be a second after the source was last written: the source
    // window counts a source whose time is at or after the build's as changed since.
    std::uint32_t build = src.exists ? src.mtime + 1 : importTime;
    d->records.push_back(makeImportedRecord(rec, build, importTime));
  }
  d->header.recordCount = static_cast<std::uint32_t>(d->records.size());
  rebuildRecordSizes(*d);
  return d;
}
