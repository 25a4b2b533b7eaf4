// The .kgv reader and writer. The reader trusts no size in the file: every part of a
// record must lie inside the bytes the index gives it, and buffers only grow as data arrive.
#include "coverage/kgv_file.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>

#include "startup/atomic_write.h"

namespace {

constexpr size_t kChunk = size_t(1) << 20;

std::uint32_t bswap32(std::uint32_t v) { return __builtin_bswap32(v); }
std::uint16_t bswap16(std::uint16_t v) { return __builtin_bswap16(v); }

std::uint32_t wordAt(const unsigned char* p, size_t off) {
  std::uint32_t v;
  std::memcpy(&v, p + off, 4);
  return v;
}

struct FileCloser {
  void operator()(FILE* f) const { fclose(f); }
};
using FilePtr = std::unique_ptr<FILE, FileCloser>;

// Reads exactly n bytes into buf (resized); grows the buffer only as data arrive, so a
// hostile size cannot make it allocate more than the file holds.
ErrorCode readExact(FILE* f, std::uint64_t n, std::vector<unsigned char>& buf) {
  buf.clear();
  std::uint64_t done = 0;
  while (done < n) {
    size_t want = static_cast<size_t>(std::min<std::uint64_t>(n - done, kChunk));
    buf.resize(static_cast<size_t>(done) + want);
    size_t got = fread(buf.data() + done, 1, want, f);
    done += got;
    if (got < want) {
      if (ferror(f)) recordSystemError(errno ? errno : EIO);
      buf.resize(static_cast<size_t>(done));
      return fileTooShort;
    }
  }
  return allOK;
}

// Turns the bytes of one record into an ObjRecord; codes 28, 34 and 35.
ErrorCode parseRecord(std::vector<unsigned char>& buf, bool swapped, ObjRecord& r) {
  if (buf.size() < sizeof(ObjHeader)) return corruptKgvFile;
  std::memcpy(&r.objHeader, buf.data(), sizeof(ObjHeader));
  ObjHeader& h = r.objHeader;
  if (swapped) {
    for (std::uint32_t* w : {&h.signature, &h.buildTime, &h.firstTime, &h.lastTime,
                             &h.stringWords, &h.mapCount})
      *w = bswap32(*w);
  }
  std::uint64_t strBytes = std::uint64_t(h.stringWords) * 4;
  std::uint64_t n = h.mapCount;
  std::uint64_t need = sizeof(ObjHeader) + strBytes + 6 * n;
  if (need > buf.size()) return corruptKgvFile;
  const unsigned char* p = buf.data() + sizeof(ObjHeader);
  r.strings.assign(p, p + strBytes);
  p += strBytes;
  r.map.resize(static_cast<size_t>(n));
  if (n) std::memcpy(r.map.data(), p, static_cast<size_t>(4 * n));
  p += 4 * n;
  r.counts.resize(static_cast<size_t>(n));
  if (n) std::memcpy(r.counts.data(), p, static_cast<size_t>(2 * n));
  p += 2 * n;
  const unsigned char* end = buf.data() + buf.size();
  r.tail.assign(p, end);
  if (swapped) {
    for (auto& e : r.map) e = bswap32(e);
    for (auto& c : r.counts) c = bswap16(c);
  }
  r.fromFile = true;

  if (n == 0 || mapTag(r.map[0]) != TagFile) return filenameNotFirst;
  // A name must start inside the string area and end there with a NUL.
  std::int64_t lastNul = -1;
  for (std::int64_t i = static_cast<std::int64_t>(r.strings.size()) - 1; i >= 0; --i) {
    if (r.strings[static_cast<size_t>(i)] == '\0') {
      lastNul = i;
      break;
    }
  }
  std::uint32_t fileOff = mapValue(r.map[0]);
  if (static_cast<std::int64_t>(fileOff) > lastNul) return corruptKgvFile;
  if (r.strings[fileOff] == '\0') return filenameEmpty;
  r.fileNameOffset = fileOff;
  for (std::uint32_t e : r.map) {
    std::uint32_t tag = mapTag(e);
    if ((tag == TagFile || tag == TagFunction) &&
        static_cast<std::int64_t>(mapValue(e)) > lastNul)
      return corruptKgvFile;
  }
  return allOK;
}

bool writeAll(FILE* f, const void* p, size_t n) {
  if (n == 0) return true;
  if (fwrite(p, 1, n, f) == n) return true;
  recordSystemError(errno ? errno : EIO);
  return false;
}

}  // namespace

ErrorCode checkKgvHeader(const unsigned char* raw, bool* swapped) {
  bool sw = wordAt(raw, 0) != kKgvMagic;
  auto word = [&](size_t off) { return sw ? bswap32(wordAt(raw, off)) : wordAt(raw, off); };
  if (swapped) *swapped = sw;
  if (word(0) == kKgvMagic && word(16) == kKgvMagic2 && word(4) == kKgvFileKind) {
    std::uint32_t version = word(8);
    if (word(12) <= kKgvReaderVersion && version >= 4) return allOK;
    recordSystemError(0, "Got a disk format version %u file, wanted a version %u file.", version,
                      kKgvReaderVersion);
    return incompatibleVersion;
  }
  if (std::memcmp(raw + 1, "Visual Kestrelgauge", 19) == 0) return cfyFile;
  return notOurFile;
}

ErrorCode readKgvFile(const std::string& path, std::unique_ptr<KgvData>& out) {
  out.reset();
  FilePtr f(fopen(path.c_str(), "rb"));
  if (!f) {
    recordSystemError(errno);
    return openError;
  }
  auto data = std::make_unique<KgvData>();
  std::vector<unsigned char> buf;
  ErrorCode rc = readExact(f.get(), sizeof(KgvHeader), buf);
  if (rc != allOK) return rc;
  bool swapped = false;
  rc = checkKgvHeader(buf.data(), &swapped);
  if (rc != allOK) return rc;
  KgvHeader& h = data->header;
  std::memcpy(&h, buf.data(), sizeof h);
  if (swapped) {
    // Every numeric word of the header; the reserved bytes are carried as they are.
    for (std::uint32_t* w : {&h.magic, &h.fileKind, &h.formatVersion, &h.oldestReader, &h.magic2,
                             &h.saveTime, &h.recordCount, &h.clockTime, &h.cpuTime, &h.isJava,
                             &h.hitFlagsOnly})
      *w = bswap32(*w);
  }
  if (h.recordCount == 0) return corruptKgvFile;

  rc = readExact(f.get(), std::uint64_t(h.recordCount) * 4, buf);
  if (rc != allOK) return rc;
  data->recordSizes.resize(h.recordCount);
  std::memcpy(data->recordSizes.data(), buf.data(), buf.size());
  if (swapped)
    for (auto& s : data->recordSizes) s = bswap32(s);

  data->records.reserve(std::min<std::uint32_t>(h.recordCount, 1u << 16));
  for (std::uint32_t i = 0; i < h.recordCount; ++i) {
    std::uint32_t words = data->recordSizes[i];
    if (words == 0) return corruptKgvFile;
    rc = readExact(f.get(), std::uint64_t(words) * 4, buf);
    if (rc != allOK) return rc;
    auto r = std::make_unique<ObjRecord>();
    rc = parseRecord(buf, swapped, *r);
    if (rc != allOK) return rc;
    data->records.push_back(std::move(r));
  }
  data->mergeMode = 1;
  out = std::move(data);
  return allOK;
}

ErrorCode writeKgvFile(const std::string& path, KgvData& data) {
  AtomicFileWriter w;
  ErrorCode rc = w.open(path);
  if (rc != allOK) return rc;
  FILE* f = w.stream();
  std::uint32_t now = static_cast<std::uint32_t>(time(nullptr));

  // The index comes first in the file, so every record's size is settled before writing.
  data.recordSizes.resize(data.records.size(), 0);
  for (size_t i = 0; i < data.records.size(); ++i) {
    const ObjRecord& r = *data.records[i];
    std::uint32_t built = recordWords(r);
    if (!r.fromFile || data.recordSizes[i] < built) data.recordSizes[i] = built;
  }
  data.header.saveTime = now;
  data.header.recordCount = static_cast<std::uint32_t>(data.records.size());
  if (!writeAll(f, &data.header, sizeof data.header) ||
      !writeAll(f, data.recordSizes.data(), data.recordSizes.size() * 4))
    return fileWriteFailed;

  static const unsigned char zeros[64] = {};
  for (size_t i = 0; i < data.records.size(); ++i) {
    ObjRecord& r = *data.records[i];
    ObjHeader& h = r.objHeader;
    if (h.lastTime == 0) h.lastTime = now;
    if (h.firstTime == 0) h.firstTime = std::min(h.lastTime, now);
    h.stringWords = static_cast<std::uint32_t>(r.strings.size() / 4);
    h.mapCount = static_cast<std::uint32_t>(r.map.size());
    std::uint64_t parts = sizeof h + r.strings.size() + 6 * std::uint64_t(r.map.size());
    std::uint64_t rest = std::uint64_t(data.recordSizes[i]) * 4 - parts;
    if (!writeAll(f, &h, sizeof h) || !writeAll(f, r.strings.data(), r.strings.size()) ||
        !writeAll(f, r.map.data(), r.map.size() * 4) ||
        !writeAll(f, r.counts.data(), r.counts.size() * 2))
      return fileWriteFailed;
    // What follows the parts: the record's own tail as read, else zero padding.
    size_t fromTail = static_cast<size_t>(std::min<std::uint64_t>(rest, r.tail.size()));
    if (!writeAll(f, r.tail.data(), fromTail)) return fileWriteFailed;
    for (std::uint64_t left = rest - fromTail; left > 0;) {
      size_t n = static_cast<size_t>(std::min<std::uint64_t>(left, sizeof zeros));
      if (!writeAll(f, zeros, n)) return fileWriteFailed;
      left -= n;
    }
  }
  return w.commit();
}
