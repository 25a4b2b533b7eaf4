// The .kgv reader and writer. The reader trusts no size in the file: every part of a
// record must lie inside the bytes the index gives it, and buffers only grow as data arrive.
#include "coverage/kgv_file.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>

#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

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
// Reads n bytes into buf; got says how many arrived. Room grows by at most a chunk
// beyond the data read.
ErrorCode readExact(FILE* f, std::uint64_t n, KgvReadBuffer& buf, const unsigned char*& data,
                    std::uint64_t& got, size_t chunk = kChunk) {
  got = 0;
  unsigned char* p = buf.reserve(0);
  while (got < n) {
    size_t want = static_cast<size_t>(std::min<std::uint64_t>(n - got, chunk));
    p = buf.reserve(static_cast<size_t>(got) + want);
    size_t part = fread(p + got, 1, want, f);
    got += part;
    if (part < want) {
      if (ferror(f)) recordSystemError(errno ? errno : EIO);
      data = p;
      return fileTooShort;
    }
  }
  data = p;
  return allOK;
}

// Turns the bytes of one record into an ObjRecord; codes 28, 34 and 35.
ErrorCode parseRecord(const unsigned char* rec, size_t size, bool swapped, ObjRecord& r) {
  if (size < sizeof(ObjHeader)) return corruptKgvFile;
  std::memcpy(&r.objHeader, rec, sizeof(ObjHeader));
  ObjHeader& h = r.objHeader;
  if (swapped) {
    for (std::uint32_t* w : {&h.signature, &h.buildTime, &h.firstTime, &h.lastTime,
                             &h.stringWords, &h.mapCount})
      *w = bswap32(*w);
  }
  std::uint64_t strBytes = std::uint64_t(h.stringWords) * 4;
  std::uint64_t n = h.mapCount;
  std::uint64_t need = sizeof(ObjHeader) + strBytes + 6 * n;
  if (need > size) return corruptKgvFile;
  const unsigned char* p = rec + sizeof(ObjHeader);
  r.strings.assign(p, p + strBytes);
  p += strBytes;
  // Records start on word boundaries of the read buffer, so map and counts are aligned.
  const auto* map = reinterpret_cast<const std::uint32_t*>(p);
  r.map.assign(map, map + n);
  p += 4 * n;
  const auto* counts = reinterpret_cast<const std::uint16_t*>(p);
  r.counts.assign(counts, counts + n);
  p += 2 * n;
  r.tail.assign(p, rec + size);
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

// Collects the parts of many records and hands them to the system in few calls, straight
// from where they lie in memory.
class GatherWriter {
 public:
  explicit GatherWriter(int fd) : fd_(fd) {}
  bool add(const void* p, size_t n) {
    if (n == 0) return true;
    iov_.push_back({const_cast<void*>(p), n});
    return iov_.size() < kMaxParts || flush();
  }
  bool flush() {
    size_t first = 0;
    while (first < iov_.size()) {
      int count = static_cast<int>(std::min<size_t>(iov_.size() - first, kMaxParts));
      ssize_t done = writev(fd_, iov_.data() + first, count);
      if (done < 0) {
        if (errno == EINTR) continue;
        recordSystemError(errno);
        return false;
      }
      if (done == 0) {
        recordSystemError(EIO);
        return false;
      }
      // Step over what was written; a part written in part is shortened.
      auto left = static_cast<size_t>(done);
      while (left > 0 && left >= iov_[first].iov_len) left -= iov_[first++].iov_len;
      if (left > 0) {
        iov_[first].iov_base = static_cast<char*>(iov_[first].iov_base) + left;
        iov_[first].iov_len -= left;
      }
    }
    iov_.clear();
    return true;
  }

 private:
  static constexpr size_t kMaxParts = 1024;
  int fd_;
  std::vector<iovec> iov_;
};

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

unsigned char* KgvReadBuffer::reserve(std::size_t n) {
  if (n > capacity_ || !data_) {
    // Growing keeps what was read so far.
    std::size_t cap = std::max<std::size_t>(n, 64);
    std::unique_ptr<unsigned char[]> bigger(new unsigned char[cap]);
    if (data_ && capacity_) std::memcpy(bigger.get(), data_.get(), std::min(capacity_, cap));
    data_ = std::move(bigger);
    capacity_ = cap;
  }
  return data_.get();
}

ErrorCode readKgvFile(const std::string& path, std::unique_ptr<KgvData>& out,
                      KgvReadBuffer* buffer) {
  out.reset();
  FilePtr f(fopen(path.c_str(), "rb"));
  if (!f) {
    recordSystemError(errno);
    return openError;
  }
  KgvReadBuffer local;
  KgvReadBuffer& buf = buffer ? *buffer : local;
  auto data = std::make_unique<KgvData>();
  const unsigned char* bytes = nullptr;
  std::uint64_t got = 0;
  ErrorCode rc = readExact(f.get(), sizeof(KgvHeader), buf, bytes, got);
  if (rc != allOK) return rc;
  bool swapped = false;
  rc = checkKgvHeader(bytes, &swapped);
  if (rc != allOK) return rc;
  KgvHeader& h = data->header;
  std::memcpy(&h, bytes, sizeof h);
  if (swapped) {
    // Every numeric word of the header; the reserved bytes are carried as they are.
    for (std::uint32_t* w : {&h.magic, &h.fileKind, &h.formatVersion, &h.oldestReader, &h.magic2,
                             &h.saveTime, &h.recordCount, &h.clockTime, &h.cpuTime, &h.isJava,
                             &h.hitFlagsOnly})
      *w = bswap32(*w);
  }
  if (h.recordCount == 0) return corruptKgvFile;

  // A regular file's size bounds what may be asked for; a pipe's data are read as they come.
  struct stat st;
  bool regular = fstat(fileno(f.get()), &st) == 0 && S_ISREG(st.st_mode);
  std::uint64_t indexEnd = sizeof(KgvHeader) + std::uint64_t(h.recordCount) * 4;
  if (regular && std::uint64_t(st.st_size) < indexEnd) return fileTooShort;
  rc = readExact(f.get(), std::uint64_t(h.recordCount) * 4, buf, bytes, got);
  if (rc != allOK) return rc;
  data->recordSizes.resize(h.recordCount);
  std::memcpy(data->recordSizes.data(), bytes, static_cast<size_t>(got));
  if (swapped)
    for (auto& s : data->recordSizes) s = bswap32(s);

  // All records in one read: the index gives their total size, and for a regular file no
  // more than the file holds is asked for. A record beyond what could be read is short.
  std::uint64_t total = 0;
  for (std::uint32_t words : data->recordSizes) total += std::uint64_t(words) * 4;
  if (regular) total = std::min<std::uint64_t>(total, st.st_size - indexEnd);
  rc = readExact(f.get(), total, buf, bytes, got, regular ? static_cast<size_t>(total) : kChunk);
  if (rc != allOK && ferror(f.get())) return rc;
  clearPendingSystemError();

  data->records.reserve(std::min<std::uint32_t>(h.recordCount, 1u << 16));
  std::uint64_t at = 0;
  for (std::uint32_t i = 0; i < h.recordCount; ++i) {
    std::uint64_t size = std::uint64_t(data->recordSizes[i]) * 4;
    if (size == 0) return corruptKgvFile;
    if (size > got - at) return fileTooShort;
    auto r = std::make_unique<ObjRecord>();
    rc = parseRecord(bytes + at, static_cast<size_t>(size), swapped, *r);
    if (rc != allOK) return rc;
    at += size;
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
  GatherWriter out(fileno(w.stream()));  // nothing goes through the stream's own buffer
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
  if (!out.add(&data.header, sizeof data.header) ||
      !out.add(data.recordSizes.data(), data.recordSizes.size() * 4))
    return fileWriteFailed;

  static const unsigned char zeros[256] = {};
  for (size_t i = 0; i < data.records.size(); ++i) {
    ObjRecord& r = *data.records[i];
    ObjHeader& h = r.objHeader;
    if (h.lastTime == 0) h.lastTime = now;
    if (h.firstTime == 0) h.firstTime = std::min(h.lastTime, now);
    h.stringWords = static_cast<std::uint32_t>(r.strings.size() / 4);
    h.mapCount = static_cast<std::uint32_t>(r.map.size());
    std::uint64_t parts = sizeof h + r.strings.size() + 6 * std::uint64_t(r.map.size());
    std::uint64_t rest = std::uint64_t(data.recordSizes[i]) * 4 - parts;
    if (!out.add(&h, sizeof h) || !out.add(r.strings.data(), r.strings.size()) ||
        !out.add(r.map.data(), r.map.size() * 4) || !out.add(r.counts.data(), r.counts.size() * 2))
      return fileWriteFailed;
    // What follows the parts: the record's own tail as read, else zero padding.
    size_t fromTail = static_cast<size_t>(std::min<std::uint64_t>(rest, r.tail.size()));
    if (!out.add(r.tail.data(), fromTail)) return fileWriteFailed;
    for (std::uint64_t left = rest - fromTail; left > 0;) {
      size_t n = static_cast<size_t>(std::min<std::uint64_t>(left, sizeof zeros));
      if (!out.add(zeros, n)) return fileWriteFailed;
      left -= n;
    }
  }
  if (!out.flush()) return fileWriteFailed;
  return w.commit();
}
