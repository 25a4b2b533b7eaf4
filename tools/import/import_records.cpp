// Building data records from imported coverage.
#include "tools/import/import_records.h"

#include <sys/stat.h>

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
    for (const auto& l : f.lines) push(TagBlock, l.line, l.hits);
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
    // The compiled version is the source as it was last written: a second later than that is
    // the build, so that only a source changed since then counts as newer than its data.
    struct stat st;
    std::uint32_t build = stat(file.path.c_str(), &st) == 0 ? static_cast<std::uint32_t>(st.st_mtime) + 1
                                                             : importTime;
    d->records.push_back(makeImportedRecord(rec, build, importTime));
  }
  d->header.recordCount = static_cast<std::uint32_t>(d->records.size());
  rebuildRecordSizes(*d);
  return d;
}
