// The .kgv reader and writer. The reader trusts no size in the file: every part of a
// record must lie inside the bytes the index gives it, and buffers only grow as data arrive.
#include "coverage/kgv_file.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>

#include <dirent.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include "coverage/kgv_lock.h"
#include "support/atomic_write.h"

namespace {

constexpr size_t kChunk = size_t(1) << 20;
// How much of a file's records is read at a time.
constexpr size_t kRecordChunk = size_t(8) << 20;

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

// Checks one record where it lies and describes it; codes 28, 34 and 35. Nothing outside
// the record's bytes is ever read.
ErrorCode checkRecord(const unsigned char* rec, size_t size, bool swapped, KgvRecordBytes& r) {
  if (size < sizeof(ObjHeader)) return corruptKgvFile;
  std::memcpy(&r.header, rec, sizeof(ObjHeader));
  ObjHeader& h = r.header;
  if (swapped) {
    for (std::uint32_t* w : {&h.signature, &h.buildTime, &h.firstTime, &h.lastTime,
                             &h.stringWords, &h.mapCount})
      *w = bswap32(*w);
  }
  std::uint64_t strBytes = std::uint64_t(h.stringWords) * 4;
  std::uint64_t n = h.mapCount;
  if (sizeof(ObjHeader) + strBytes + 6 * n > size) return corruptKgvFile;
  r.data = rec;
  r.size = size;
  r.swapped = swapped;
  r.strings = reinterpret_cast<const char*>(rec + sizeof(ObjHeader));
  r.stringBytes = static_cast<size_t>(strBytes);
  // Records start on word boundaries of the read buffer, so map and counts are aligned.
  r.map = reinterpret_cast<const std::uint32_t*>(rec + sizeof(ObjHeader) + strBytes);
  r.counts = reinterpret_cast<const std::uint16_t*>(rec + sizeof(ObjHeader) + strBytes + 4 * n);
  r.mapCount = static_cast<size_t>(n);

  auto entry = [&](size_t i) { return swapped ? bswap32(r.map[i]) : r.map[i]; };
  if (n == 0 || mapTag(entry(0)) != TagFile) return filenameNotFirst;
  // A name must start inside the string area and end there with a NUL.
  std::int64_t lastNul = -1;
  for (std::int64_t i = static_cast<std::int64_t>(strBytes) - 1; i >= 0; --i) {
    if (r.strings[i] == '\0') {
      lastNul = i;
      break;
    }
  }
  std::uint32_t fileOff = mapValue(entry(0));
  if (static_cast<std::int64_t>(fileOff) > lastNul) return corruptKgvFile;
  if (r.strings[fileOff] == '\0') return filenameEmpty;
  r.fileNameOffset = fileOff;
  // The largest name offset of the map decides; a pass without early exit runs fast.
  std::uint32_t largest = 0;
  for (size_t i = 0; i < n; ++i) {
    std::uint32_t e = swapped ? bswap32(r.map[i]) : r.map[i];
    std::uint32_t tag = e >> 28;
    std::uint32_t named = (tag == TagFile || tag == TagFunction) ? mapValue(e) : 0;
    largest = std::max(largest, named);
  }
  if (static_cast<std::int64_t>(largest) > lastNul) return corruptKgvFile;
  return allOK;
}

// Collects the parts of many records in a large buffer and hands it to the system in few
// calls.
class GatherWriter {
 public:
  explicit GatherWriter(int fd) : fd_(fd), buf_(new char[kSize]) {}
  bool add(const void* p, size_t n) {
    const char* c = static_cast<const char*>(p);
    while (n > 0) {
      size_t room = kSize - used_;
      size_t k = std::min(room, n);
      std::memcpy(buf_.get() + used_, c, k);
      used_ += k;
      c += k;
      n -= k;
      if (used_ == kSize && !flush()) return false;
    }
    return true;
  }
  bool flush() {
    size_t done = 0;
    while (done < used_) {
      ssize_t w = write(fd_, buf_.get() + done, used_ - done);
      if (w < 0) {
        if (errno == EINTR) continue;
        recordSystemError(errno);
        return false;
      }
      if (w == 0) {
        recordSystemError(EIO);
        return false;
      }
      done += static_cast<size_t>(w);
    }
    used_ = 0;
    return true;
  }

 private:
  static constexpr size_t kSize = size_t(4) << 20;
  int fd_;
  std::unique_ptr<char[]> buf_;
  size_t used_ = 0;
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

std::unique_ptr<ObjRecord> makeObjRecord(const KgvRecordBytes& b) {
  auto r = std::make_unique<ObjRecord>();
  r->objHeader = b.header;
  r->strings.assign(b.strings, b.strings + b.stringBytes);
  r->map.assign(b.map, b.map + b.mapCount);
  r->counts.assign(b.counts, b.counts + b.mapCount);
  if (b.swapped) {
    for (auto& e : r->map) e = bswap32(e);
    for (auto& c : r->counts) c = bswap16(c);
  }
  const unsigned char* end = b.data + b.size;
  r->tail.assign(reinterpret_cast<const unsigned char*>(b.counts + b.mapCount), end);
  r->fileNameOffset = b.fileNameOffset;
  r->fromFile = true;
  return r;
}

ErrorCode readKgvRecords(const std::string& path, KgvReadBuffer* buffer,
                         KgvRecordVisitor& visitor) {
  FilePtr f(fopen(path.c_str(), "rb"));
  if (!f) {
    recordSystemError(errno);
    return openError;
  }
  KgvReadBuffer local;
  KgvReadBuffer& buf = buffer ? *buffer : local;
  const unsigned char* bytes = nullptr;
  std::uint64_t got = 0;
  ErrorCode rc = readExact(f.get(), sizeof(KgvHeader), buf, bytes, got);
  if (rc != allOK) return rc;
  bool swapped = false;
  rc = checkKgvHeader(bytes, &swapped);
  if (rc != allOK) return rc;
  KgvHeader h;
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
  std::vector<std::uint32_t> sizes(h.recordCount);
  std::memcpy(sizes.data(), bytes, static_cast<size_t>(got));
  if (swapped)
    for (auto& s : sizes) s = bswap32(s);
  rc = visitor.header(h, sizes);
  if (rc != allOK) return rc;

  // The records are read a few megabytes at a time and handed over where they lie, so that
  // memory holds one stretch of the file, never the whole of it beside what is made of it.
  // For a regular file no more than it holds is asked for; a pipe's data are read as they
  // come, room growing only with the data.
  std::uint64_t remaining = 0;
  for (std::uint32_t words : sizes) remaining += std::uint64_t(words) * 4;
  if (regular) remaining = std::min<std::uint64_t>(remaining, st.st_size - indexEnd);
  unsigned char* p = buf.reserve(kRecordChunk);
  std::size_t capacity = kRecordChunk, start = 0, end = 0;  // unvisited bytes: [start, end)
  for (std::uint32_t i = 0; i < h.recordCount; ++i) {
    const std::uint64_t size = std::uint64_t(sizes[i]) * 4;
    if (size == 0) return corruptKgvFile;
    while (end - start < size) {
      if (remaining == 0) return fileTooShort;
      if (start > 0) {
        // Records are whole words, so a record moved to the front stays aligned.
        std::memmove(p, p + start, end - start);
        end -= start;
        start = 0;
      }
      const std::uint64_t missing = size - (end - start);
      const std::uint64_t ask = std::min<std::uint64_t>(
          remaining, regular ? std::max<std::uint64_t>(missing, kRecordChunk) : kRecordChunk);
      if (end + ask > capacity) {
        capacity = static_cast<std::size_t>(end + ask);
        p = buf.reserve(capacity);
      }
      const std::size_t got = fread(p + end, 1, static_cast<std::size_t>(ask), f.get());
      end += got;
      remaining -= got;
      if (got < ask) {
        if (ferror(f.get())) {
          recordSystemError(errno ? errno : EIO);
          return fileTooShort;
        }
        remaining = 0;  // the file ended before its index said
      }
    }
    KgvRecordBytes record;
    rc = checkRecord(p + start, static_cast<std::size_t>(size), swapped, record);
    if (rc != allOK) return rc;
    rc = visitor.record(record);
    if (rc != allOK) return rc;
    start += static_cast<std::size_t>(size);
  }
  return allOK;
}

ErrorCode readKgvFile(const std::string& path, std::unique_ptr<KgvData>& out,
                      KgvReadBuffer* buffer) {
  out.reset();
  // Every record copied out as it is.
  struct Collect : KgvRecordVisitor {
    std::unique_ptr<KgvData> data = std::make_unique<KgvData>();
    ErrorCode header(const KgvHeader& h, const std::vector<std::uint32_t>& sizes) override {
      data->header = h;
      data->recordSizes = sizes;
      data->records.reserve(std::min<size_t>(sizes.size(), 1u << 16));
      return allOK;
    }
    ErrorCode record(const KgvRecordBytes& b) override {
      data->records.push_back(makeObjRecord(b));
      return allOK;
    }
  } collect;
  ErrorCode rc = readKgvRecords(path, buffer, collect);
  if (rc != allOK) return rc;
  collect.data->mergeMode = 1;
  out = std::move(collect.data);
  return allOK;
}

namespace {

// New copies that a writer killed before its rename left beside the target: their names are
// the target's with a dot before and ".new." and six characters after.
void removeAbandonedCopies(const std::string& target) {
  size_t slash = target.find_last_of('/');
  std::string dir = slash == std::string::npos ? "." : slash == 0 ? "/" : target.substr(0, slash);
  std::string prefix = "." + (slash == std::string::npos ? target : target.substr(slash + 1)) + ".new.";
  DIR* d = opendir(dir.c_str());
  if (!d) return;
  while (struct dirent* e = readdir(d)) {
    std::string_view name = e->d_name;
    if (name.size() != prefix.size() + 6 || name.substr(0, prefix.size()) != prefix) continue;
    std::string full = dir + "/" + std::string(name);
    struct stat st;
    if (lstat(full.c_str(), &st) == 0 && S_ISREG(st.st_mode)) unlink(full.c_str());
  }
  closedir(d);
}

}  // namespace

ErrorCode writeKgvFile(const std::string& path, KgvData& data) {
  // Through a symbolic link the linked file is updated; the link stays.
  const std::string target = writeTargetFor(path);
  // Only the lock's holder can know that no other writer is at work.
  if (kgvLockHeldHere(path)) removeAbandonedCopies(target);
  AtomicFileWriter w;
  ErrorCode rc = w.open(target);
  if (rc != allOK) return rc;
  GatherWriter out(fileno(w.stream()));  // nothing goes through the stream's own buffer
  std::uint32_t now = static_cast<std::uint32_t>(time(nullptr));

  // The index comes first in the file, so every record's size is settled before writing.
  data.recordSizes.resize(data.records.size(), 0);
  for (size_t i = 0; i < data.records.size(); ++i) {
    ObjRecord& r = *data.records[i];
    while (r.strings.size() % 4) r.strings.push_back('\0');  // the area is whole words
    if (r.counts.size() != r.map.size()) r.counts.resize(r.map.size(), 0);
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
  // A writer whose lock was broken (it was paused past the break age) must not replace
  // what the breaker wrote meanwhile.
  return w.commit([&] { return checkKgvLockHeld(path); });
}
