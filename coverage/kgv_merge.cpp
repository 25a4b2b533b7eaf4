// Count merge, structural merge and the record-by-record merge of two bodies of data.
#include "coverage/kgv_merge.h"

#include <algorithm>
#include <cstring>
#include <ctime>
#include <new>

#include "coverage/kgv_file.h"
#include "coverage/string_block.h"

namespace {

void mergeTimes(ObjHeader& into, const ObjHeader& a, const ObjHeader& b) {
  into.lastTime = std::max(a.lastTime, b.lastTime);
  if (a.firstTime != 0 && b.firstTime != 0)
    into.firstTime = std::min(a.firstTime, b.firstTime);
  else
    into.firstTime = a.firstTime != 0 ? a.firstTime : b.firstTime;
}

// One record's map read entry by entry for the structural merge. Empty entries are
// stepped over.
struct Cursor {
  const ObjRecord& r;
  size_t p = 0;
  std::uint32_t prevLine = 0;         // line of the entry read before
  std::uint16_t lastBlockCount = 0;   // count of the last TagBlock passed

  struct Entry {
    std::uint32_t tag = 0;
    std::uint32_t stored = 0;  // the tag as stored
    std::uint32_t line = 0;
    std::uint16_t count = 0;
    std::uint32_t name = 0;    // offset of a file or function name in r.strings
  };

  explicit Cursor(const ObjRecord& rec) : r(rec) { skipEmpty(); }
  bool done() const { return p >= r.map.size(); }
  void skipEmpty() {
    while (p < r.map.size() && mapTag(r.map[p]) == TagEmpty) ++p;
  }
  size_t nextNonEmpty(size_t from) const {
    while (from < r.map.size() && mapTag(r.map[from]) == TagEmpty) ++from;
    return from;
  }
  Entry read() const {
    Entry e;
    std::uint32_t m = r.map[p];
    e.stored = e.tag = mapTag(m);
    e.count = r.counts[p];
    switch (e.stored) {
      case TagBlock:
        e.line = mapValue(m);
        break;
      case TagBlockLine:
        e.tag = TagBlock;
        e.line = mapValue(m);
        e.count = lastBlockCount;
        break;
      case TagFunction: {
        e.name = mapValue(m);
        size_t n = nextNonEmpty(p + 1);
        if (n < r.map.size() && (mapTag(r.map[n]) == TagBlock || mapTag(r.map[n]) == TagFuncLine))
          e.line = mapValue(r.map[n]);
        break;
      }
      case TagFile:
        e.name = mapValue(m);
        e.line = prevLine;
        break;
      case TagFuncLine:
        e.line = prevLine;
        break;
      default:
        e.line = mapValue(m);
        break;
    }
    return e;
  }
  void advance() {
    Entry e = read();
    prevLine = e.line;
    if (e.stored == TagBlock) lastBlockCount = e.count;
    ++p;
    skipEmpty();
  }
};

// The map being built by the structural merge.
struct MapWriter {
  ObjRecord& out;
  const StringBlock& names;
  std::uint32_t lastTag = 0;
  std::uint16_t lastCount = 0;  // effective count of the last entry (a block line's is its block's)

  bool afterBlock() const { return lastTag == TagBlock || lastTag == TagBlockLine; }

  void put(std::uint32_t tag, std::uint32_t value, std::uint16_t count) {
    out.map.push_back(makeMapEntry(tag, value));
    out.counts.push_back(count);
    if (tag != TagBlockLine) lastCount = count;
    lastTag = tag;
  }

  std::uint32_t nameOffset(const ObjRecord& r, std::uint32_t off) const {
    std::uint32_t at = 0, pos = 0;
    names.find(r.nameAt(off), at, pos);
    return at;
  }

  void write(const Cursor& c, const Cursor::Entry& e) {
    if (e.stored == TagBlockLine && afterBlock() && e.count == lastCount) {
      put(TagBlockLine, e.line, 0);
      return;
    }
    std::uint32_t value = e.line;
    if (e.tag == TagFile || e.tag == TagFunction) value = nameOffset(c.r, e.name);
    put(e.tag, value, e.count);
  }

  void writeCombined(const Cursor& c, const Cursor::Entry& e, const Cursor::Entry& other,
                     bool hitFlags) {
    std::uint16_t count = combineCounts(e.count, other.count, hitFlags);
    if (e.stored == TagBlockLine && other.stored == TagBlockLine && afterBlock() &&
        count == lastCount) {
      put(TagBlockLine, e.line, 0);
      return;
    }
    std::uint32_t value = e.line;
    if (e.tag == TagFile || e.tag == TagFunction) value = nameOffset(c.r, e.name);
    put(e.tag, value, count);
  }
};

void addNames(StringBlock& block, const ObjRecord& r) {
  if (!r.nameIndex.empty()) {
    for (std::uint32_t off : r.nameIndex) block.addBorrowed(r.nameAt(off));
    return;
  }
  for (std::uint32_t e : r.map) {
    std::uint32_t tag = mapTag(e);
    if (tag == TagFile || tag == TagFunction) block.addBorrowed(r.nameAt(mapValue(e)));
  }
}

}  // namespace

void countMergeArrays(ObjRecord& x, const ObjHeader& rh, const std::uint32_t* rmap,
                      const std::uint16_t* rcounts, size_t n, bool hitFlagsOnly) {
  ObjHeader& xh = x.objHeader;
  mergeTimes(xh, xh, rh);
  xh.buildTime = std::max(xh.buildTime, rh.buildTime);

  n = std::min(n, x.map.size());
  if (n && std::memcmp(x.map.data(), rmap, n * 4) == 0) {
    // The usual case, identical maps: a plain pass that the compiler can vectorise.
    const std::uint32_t* map = x.map.data();
    std::uint16_t* xc = x.counts.data();
    for (size_t i = 0; i < n; ++i) {
      std::uint32_t tag = map[i] >> 28;
      bool counted = tag == TagFile || tag == TagFunction || tag == TagBlock;
      std::uint32_t sum = std::uint32_t(xc[i]) + rcounts[i];
      std::uint32_t combined = hitFlagsOnly ? std::uint32_t(sum != 0)
                                            : std::min<std::uint32_t>(sum, kCountLimit);
      xc[i] = static_cast<std::uint16_t>(counted ? combined : xc[i]);
    }
    return;
  }
  // Where one side splits a block that the other records as a further line of the block
  // before, both sides count the block's hits there so the sums line up. The nearest
  // preceding block counts are taken before any sum is formed.
  std::uint16_t lastX = 0, lastR = 0;
  for (size_t i = 0; i < n; ++i) {
    std::uint32_t tx = mapTag(x.map[i]), tr = mapTag(rmap[i]);
    std::uint16_t rc = rcounts[i];
    if (i > 0) {
      if (tr == TagBlockLine && tx == TagBlock) {
        rc = lastR;
      } else if (tx == TagBlockLine && tr == TagBlock) {
        x.counts[i] = lastX;
        x.map[i] = makeMapEntry(TagBlock, mapValue(rmap[i]));
        tx = TagBlock;
      }
      if (tx == TagBlock) lastX = x.counts[i];
      if (tr == TagBlock) lastR = rcounts[i];
    }
    if (tx == TagFile || tx == TagFunction || tx == TagBlock)
      x.counts[i] = combineCounts(x.counts[i], rc, hitFlagsOnly);
  }
}

void countMergeRecords(ObjRecord& x, const ObjRecord& r, bool hitFlagsOnly) {
  countMergeArrays(x, r.objHeader, r.map.data(), r.counts.data(), r.map.size(), hitFlagsOnly);
}

std::unique_ptr<ObjRecord> structuralMergeRecords(const ObjRecord& x, const ObjRecord& r,
                                                  bool hitFlagsOnly) {
  auto out = std::make_unique<ObjRecord>();
  ObjHeader& h = out->objHeader;
  h = x.objHeader;
  h.signature = 0;
  h.buildTime = static_cast<std::uint32_t>(time(nullptr));
  mergeTimes(h, x.objHeader, r.objHeader);

  StringBlock names;
  addNames(names, x);
  addNames(names, r);
  std::uint32_t count = 0, words = 0;
  if (names.freeze(out->strings, count, words) != allOK) {
    out->strings.assign(4, '\0');  // no names at all: cannot happen for records as read
  }
  out->nameIndex = names.sortedOffsets();
  std::uint32_t pos = 0;
  names.find(x.fileName(), out->fileNameOffset, pos);

  out->map.reserve(x.map.size() + r.map.size());
  out->counts.reserve(x.map.size() + r.map.size());
  bool rFirst = isNewer(r, x);
  Cursor a(rFirst ? r : x), b(rFirst ? x : r);
  MapWriter w{*out, names};

  auto writeFunction = [&](Cursor& c) {
    w.write(c, c.read());
    c.advance();
    if (!c.done() && mapTag(c.r.map[c.p]) == TagFuncLine) {
      w.write(c, c.read());
      c.advance();
    }
  };

  while (!a.done() && !b.done()) {
    Cursor::Entry ea = a.read(), eb = b.read();
    if (ea.line != eb.line) {
      Cursor& c = ea.line < eb.line ? a : b;
      w.write(c, ea.line < eb.line ? ea : eb);
      c.advance();
      continue;
    }
    bool sameTag = ea.tag == eb.tag;
    if (sameTag && ea.tag == TagFunction && ea.line == 0)
      sameTag = std::string_view(a.r.nameAt(ea.name)) == std::string_view(b.r.nameAt(eb.name));
    if (sameTag) {
      w.writeCombined(a, ea, eb, hitFlagsOnly);
      a.advance();
      b.advance();
      continue;
    }
    bool fa = ea.tag == TagFunction, fb = eb.tag == TagFunction;
    if (!fa && !fb) {
      w.write(a, ea);
      a.advance();
      b.advance();
    } else if (fa && !fb) {
      writeFunction(a);
    } else if (fb && !fa) {
      writeFunction(b);
    } else if (std::string_view(a.r.nameAt(ea.name)) <= std::string_view(b.r.nameAt(eb.name))) {
      writeFunction(a);
    } else {
      writeFunction(b);
    }
  }
  for (Cursor* c : {&a, &b}) {
    while (!c->done()) {
      w.write(*c, c->read());
      c->advance();
    }
  }
  h.stringWords = static_cast<std::uint32_t>(out->strings.size() / 4);
  h.mapCount = static_cast<std::uint32_t>(out->map.size());
  return out;
}

KgvMerger::KgvMerger(KgvData& into, MessageSink& messages) : a_(into), messages_(messages) {
  index_.reserve(into.records.size() * 2);
  for (size_t i = 0; i < into.records.size(); ++i)
    index_.emplace(into.records[i]->fileNameView(), i);  // the first of a name stays
}

void KgvMerger::replace(size_t at, std::unique_ptr<ObjRecord> record) {
  auto it = index_.find(a_.records[at]->fileNameView());
  a_.records[at] = std::move(record);
  if (it != index_.end() && it->second == at) {
    auto node = index_.extract(it);
    node.key() = a_.records[at]->fileNameView();
    index_.insert(std::move(node));
  }
}

namespace {

// A record of the data merged from, held in memory; moved when the data are spent.
struct RecordSource {
  std::unique_ptr<ObjRecord>& slot;
  bool consume;
  const ObjHeader& header() const { return slot->objHeader; }
  std::string_view name() const { return slot->fileNameView(); }
  size_t mapSize() const { return slot->map.size(); }
  size_t stringBytes() const { return slot->strings.size(); }
  const char* strings() const { return slot->strings.data(); }
  const std::uint32_t* map() const { return slot->map.data(); }
  const std::uint16_t* counts() const { return slot->counts.data(); }
  const ObjRecord& record() { return *slot; }
  std::unique_ptr<ObjRecord> take() { return consume ? std::move(slot) : copyObjRecord(*slot); }
};

// A record where it lies in a file being read (this machine's byte order); copied out
// only when it joins the merged data.
struct BytesSource {
  const KgvRecordBytes& b;
  std::unique_ptr<ObjRecord> made;
  const ObjHeader& header() const { return b.header; }
  std::string_view name() const { return b.fileName(); }
  size_t mapSize() const { return b.mapCount; }
  size_t stringBytes() const { return b.stringBytes; }
  const char* strings() const { return b.strings; }
  const std::uint32_t* map() const { return b.map; }
  const std::uint16_t* counts() const { return b.counts; }
  const ObjRecord& record() {
    if (!made) made = makeObjRecord(b);
    return *made;
  }
  std::unique_ptr<ObjRecord> take() { return made ? std::move(made) : makeObjRecord(b); }
};

// The name at an offset of a string area, ending at its NUL or at the area's end.
std::string_view nameIn(const char* strings, size_t bytes, std::uint32_t offset) {
  if (offset >= bytes) return {};
  const char* p = strings + offset;
  return std::string_view(p, strnlen(p, bytes - offset));
}

// Whether two records of one version lay out the same map: the same entries in the same
// places (a block may be a further line of the block before on one side), the same lines,
// the same names. Only then can counts be added position by position.
template <class Source>
bool sameLayout(const ObjRecord& x, const Source& src) {
  const size_t n = src.mapSize();
  if (n != x.map.size()) return false;
  if (std::memcmp(x.map.data(), src.map(), n * 4) == 0 && src.stringBytes() == x.strings.size() &&
      std::memcmp(x.strings.data(), src.strings(), x.strings.size()) == 0)
    return true;
  for (size_t i = 0; i < n; ++i) {
    std::uint32_t a = x.map[i], b = src.map()[i];
    std::uint32_t ta = mapTag(a), tb = mapTag(b);
    auto blockish = [](std::uint32_t t) { return t == TagBlock || t == TagBlockLine; };
    if (ta != tb && !(blockish(ta) && blockish(tb))) return false;
    if (ta == TagFile || ta == TagFunction) {
      if (nameIn(x.strings.data(), x.strings.size(), mapValue(a)) !=
          nameIn(src.strings(), src.stringBytes(), mapValue(b)))
        return false;
    } else if (ta != TagEmpty && mapValue(a) != mapValue(b)) {
      return false;
    }
  }
  return true;
}

}  // namespace

template <class Source>
void KgvMerger::mergeOne(std::uint32_t mode, Source& src, std::vector<std::string>* ignored) {
  auto found = index_.find(src.name());
  if (found == index_.end()) {
    a_.records.push_back(src.take());
    index_.emplace(a_.records.back()->fileNameView(), a_.records.size() - 1);
    ++a_.header.recordCount;
    return;
  }
  size_t at = found->second;
  ObjRecord& x = *a_.records[at];
  const ObjHeader& rh = src.header();
  bool sameVersion = rh.signature != 0 && rh.signature == x.objHeader.signature &&
                     src.mapSize() == x.map.size() && src.stringBytes() == x.strings.size();
  if (sameVersion && sameLayout(x, src)) {
    countMergeArrays(x, rh, src.map(), src.counts(), src.mapSize(), hitFlags_);
  } else if (rh.signature != 0 && rh.signature == x.objHeader.signature) {
    // One unchanged source captured with different line sets (a header inlined
    // differently by two programs): both hold true data, so they are combined line by line,
    // and the result still stands for that source.
    std::unique_ptr<ObjRecord> merged = structuralMergeRecords(x, src.record(), hitFlags_);
    merged->objHeader.signature = rh.signature;
    merged->objHeader.buildTime = std::max(rh.buildTime, x.objHeader.buildTime);
    replace(at, std::move(merged));
  } else if (mode != kMergeForce) {
    ignoredNow_ = true;
    if (ignored) ignored->emplace_back(src.name());
    if (isNewerHeader(rh, x.objHeader)) replace(at, src.take());
  } else {
    replace(at, structuralMergeRecords(x, src.record(), hitFlags_));
  }
}

void KgvMerger::warnMixedLanguages() {
  messages_.warning(a_.header.isJava != 0
                        ? "Warn: Found C/C++ .kgv files when processing Java .kgv files.\n"
                        : "Warn: Found Java .kgv files when processing C/C++ .kgv files.\n");
}

bool KgvMerger::begin(const KgvHeader& b) {
  if ((a_.header.isJava != 0) != (b.isJava != 0)) return false;
  hitFlags_ = a_.header.hitFlagsOnly != 0;
  setHitFlagsMode(hitFlags_);
  ignoredNow_ = false;
  return true;
}

ErrorCode KgvMerger::add(std::uint32_t mode, const KgvRecordBytes& r,
                         std::vector<std::string>* ignored) {
  try {
    if (r.swapped) {
      std::unique_ptr<ObjRecord> made = makeObjRecord(r);
      RecordSource src{made, true};
      mergeOne(mode, src, ignored);
    } else {
      BytesSource src{r, nullptr};
      mergeOne(mode, src, ignored);
    }
  } catch (const std::bad_alloc&) {
    return outOfMemory;
  }
  return allOK;
}

ErrorCode KgvMerger::finish(std::uint32_t mode, const KgvHeader& b, bool rebuildSizes) {
  a_.mergeMode = mode;
  a_.header.clockTime += b.clockTime;
  a_.header.cpuTime += b.cpuTime;
  mergedAny_ = true;
  if (rebuildSizes) rebuildRecordSizes(a_);
  return ignoredNow_ ? mergeIgnored : allOK;
}

ErrorCode KgvMerger::merge(std::uint32_t mode, KgvData& b, std::vector<std::string>* ignored,
                           bool consume, bool rebuildSizes) {
  if (!begin(b.header)) {
    warnMixedLanguages();
    return mergeIgnored;
  }
  ErrorCode rc = allOK;
  try {
    for (auto& slot : b.records) {
      RecordSource src{slot, consume};
      mergeOne(mode, src, ignored);
    }
  } catch (const std::bad_alloc&) {
    rc = outOfMemory;
  }
  ErrorCode done = finish(mode, b.header, rebuildSizes);
  return rc != allOK ? rc : done;
}

ErrorCode mergeKgvData(std::uint32_t mode, KgvData& a, KgvData& b,
                       std::vector<std::string>* ignored, MessageSink& messages) {
  try {
    KgvMerger merger(a, messages);
    return merger.merge(mode, b, ignored, false, true);
  } catch (const std::bad_alloc&) {
    return outOfMemory;
  }
}

ErrorCode mergeKgvDataCopy(std::uint32_t mode, const KgvData& a, KgvData& b,
                           std::vector<std::string>* ignored, MessageSink& messages,
                           std::unique_ptr<KgvData>& out) {
  out.reset();
  try {
    std::unique_ptr<KgvData> copy = copyKgvData(a);
    ErrorCode rc = mergeKgvData(mode, *copy, b, ignored, messages);
    if (rc == allOK || rc == mergeIgnored) out = std::move(copy);
    return rc;
  } catch (const std::bad_alloc&) {
    return outOfMemory;
  }
}
