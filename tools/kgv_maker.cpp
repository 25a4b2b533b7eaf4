// The data-file maker: parses the text description and encodes the file in either order.
#include "tools/kgv_maker.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <unordered_map>
#include <vector>

#include "support/atomic_write.h"

namespace {

std::uint32_t bswap32(std::uint32_t v) { return __builtin_bswap32(v); }
std::uint16_t bswap16(std::uint16_t v) { return __builtin_bswap16(v); }

void putWord(std::string& out, std::uint32_t v, bool swapped) {
  if (swapped) v = bswap32(v);
  out.append(reinterpret_cast<const char*>(&v), 4);
}

// A record being described: names get their offsets in order of first use.
struct RecordBuilder {
  ObjRecord rec;
  std::unordered_map<std::string, std::uint32_t> offsets;
  std::optional<std::uint32_t> stringWords, mapCount, size;
  std::uint32_t padWords = 0;
  std::optional<std::string> rawStrings;

  std::uint32_t name(const std::string& s) {
    auto it = offsets.find(s);
    if (it != offsets.end()) return it->second;
    auto off = static_cast<std::uint32_t>(rec.strings.size());
    rec.strings.insert(rec.strings.end(), s.begin(), s.end());
    rec.strings.push_back('\0');
    offsets.emplace(s, off);
    return off;
  }
  void entry(std::uint32_t tag, std::uint32_t value, std::uint16_t count) {
    rec.map.push_back(makeMapEntry(tag, value));
    rec.counts.push_back(count);
  }
  // Pads the string area, sets the header words and the tail; returns the index entry.
  std::uint32_t finish() {
    if (rawStrings) rec.strings.assign(rawStrings->begin(), rawStrings->end());
    while (rec.strings.size() % 4) rec.strings.push_back('\0');
    rec.objHeader.stringWords =
        stringWords ? *stringWords : static_cast<std::uint32_t>(rec.strings.size() / 4);
    rec.objHeader.mapCount = mapCount ? *mapCount : static_cast<std::uint32_t>(rec.map.size());
    rec.tail.assign((rec.map.size() % 2 ? 2 : 0) + 4 * size_t(padWords), 0);
    std::uint32_t words = static_cast<std::uint32_t>(
        (64 + rec.strings.size() + 6 * rec.map.size() + rec.tail.size()) / 4);
    return size ? *size : words;
  }
};

struct Description {
  KgvData data;
  bool swapped = false;
  std::optional<std::uint32_t> recordCount;
  std::string headerText;
  bool headerTextGiven = false;
};

bool tokenize(const std::string& line, std::vector<std::string>& words, std::string& error) {
  words.clear();
  size_t i = 0;
  while (i < line.size()) {
    char c = line[i];
    if (c == ' ' || c == '\t' || c == '\r') {
      ++i;
      continue;
    }
    if (c == '#') break;
    std::string w;
    if (c == '"') {
      ++i;
      bool closed = false;
      while (i < line.size()) {
        char d = line[i++];
        if (d == '"') {
          closed = true;
          break;
        }
        if (d == '\\' && i < line.size()) d = line[i++];
        w.push_back(d);
      }
      if (!closed) {
        error = "unterminated quoted word";
        return false;
      }
    } else {
      while (i < line.size() && line[i] != ' ' && line[i] != '\t' && line[i] != '\r') w.push_back(line[i++]);
    }
    words.push_back(w);
  }
  return true;
}

bool number(const std::string& s, std::uint64_t limit, std::uint64_t& out) {
  if (s.empty() || s[0] == '-' || s[0] == '+') return false;
  errno = 0;
  char* end = nullptr;
  unsigned long long v = strtoull(s.c_str(), &end, 0);
  if (errno || *end != '\0' || v > limit) return false;
  out = v;
  return true;
}

// Splits "key=value" words after the fixed ones.
class Options {
 public:
  Options(const std::vector<std::string>& words, size_t from) {
    for (size_t i = from; i < words.size(); ++i) {
      size_t eq = words[i].find('=');
      if (eq == std::string::npos) {
        bad_ = words[i];
        return;
      }
      values_.emplace_back(words[i].substr(0, eq), words[i].substr(eq + 1));
    }
  }
  // Takes a known key; false (with error) when its value is not a number within limit.
  bool take(const char* key, std::uint64_t limit, std::uint64_t& out, std::string& error) {
    for (auto it = values_.begin(); it != values_.end(); ++it) {
      if (it->first != key) continue;
      if (!number(it->second, limit, out)) {
        error = std::string("bad number for ") + key + ": " + it->second;
        return false;
      }
      values_.erase(it);
      return true;
    }
    return true;
  }
  // Anything left over was not understood.
  bool finish(std::string& error) const {
    if (!bad_.empty()) {
      error = "expected key=value, got " + bad_;
      return false;
    }
    if (!values_.empty()) {
      error = "unknown setting " + values_.front().first;
      return false;
    }
    return true;
  }

 private:
  std::vector<std::pair<std::string, std::string>> values_;
  std::string bad_;
};

std::uint64_t mix(std::uint64_t x) {
  x += 0x9E3779B97F4A7C15ull;
  x = (x ^ (x >> 30)) * 0xBF58476D1CE4E5B9ull;
  x = (x ^ (x >> 27)) * 0x94D049BB133111EBull;
  return x ^ (x >> 31);
}

void generate(Description& d, std::vector<RecordBuilder>& records, std::uint64_t count,
              std::uint64_t first, std::uint64_t functions, std::uint64_t blocks, std::uint64_t seed,
              std::uint64_t build, bool flags) {
  for (std::uint64_t k = first; k < first + count; ++k) {
    RecordBuilder& b = records.emplace_back();
    char path[96];
    snprintf(path, sizeof path, "gen/dir%llu/file%llu.c", static_cast<unsigned long long>(k / 100),
             static_cast<unsigned long long>(k));
    ObjHeader& h = b.rec.objHeader;
    h.signature = static_cast<std::uint32_t>(0x10000 + k);
    h.buildTime = static_cast<std::uint32_t>(build);
    h.firstTime = static_cast<std::uint32_t>(1700000000 + mix(seed * 7 + k) % 1000);
    h.lastTime = h.firstTime + 100;
    b.entry(TagFile, b.name(path), 1);
    std::uint32_t line = 10;
    for (std::uint64_t f = 0; f < functions; ++f) {
      char fn[64];
      snprintf(fn, sizeof fn, "function_%llu_%llu", static_cast<unsigned long long>(k),
               static_cast<unsigned long long>(f));
      std::uint64_t r = mix(seed * 1000003 + k * 7919 + f);
      auto counted = [&](std::uint64_t v) {
        std::uint16_t c = static_cast<std::uint16_t>(v % 4 == 0 ? 0 : v % 50);
        return flags ? static_cast<std::uint16_t>(c != 0) : c;
      };
      b.entry(TagFunction, b.name(fn), counted(r));
      b.entry(TagFuncLine, line, 0);
      for (std::uint64_t j = 0; j < blocks; ++j) {
        if (j % 4 == 3)
          b.entry(TagBlockLine, line + 1 + static_cast<std::uint32_t>(j), 0);
        else
          b.entry(TagBlock, line + 1 + static_cast<std::uint32_t>(j), counted(mix(r + j)));
      }
      line += static_cast<std::uint32_t>(blocks) + 5;
    }
    d.data.recordSizes.push_back(b.finish());
  }
}

bool parse(const std::string& text, Description& d, std::string& error) {
  std::vector<RecordBuilder> records;
  std::vector<std::string> w;
  size_t lineNo = 0, pos = 0;
  KgvHeader& h = d.data.header;
  auto fail = [&](const std::string& what) {
    error = "line " + std::to_string(lineNo) + ": " + what;
    return false;
  };
  while (pos <= text.size()) {
    size_t nl = text.find('\n', pos);
    if (nl == std::string::npos) nl = text.size();
    std::string line = text.substr(pos, nl - pos);
    pos = nl + 1;
    ++lineNo;
    std::string err;
    if (!tokenize(line, w, err)) return fail(err);
    if (w.empty()) continue;
    const std::string& op = w[0];
    std::uint64_t v = 0;
    auto arg = [&](size_t i, std::uint64_t limit) {
      if (i >= w.size()) {
        err = "missing value";
        return false;
      }
      if (!number(w[i], limit, v)) {
        err = "bad number " + w[i];
        return false;
      }
      return true;
    };
    RecordBuilder* cur = records.empty() ? nullptr : &records.back();
    auto needRecord = [&]() {
      if (!cur) err = op + " before the first record";
      return cur != nullptr;
    };
    struct HeaderWord {
      const char* name;
      std::uint32_t* field;
    } headerWords[] = {{"magic", &h.magic},         {"magic2", &h.magic2},
                       {"kind", &h.fileKind},       {"version", &h.formatVersion},
                       {"oldest", &h.oldestReader}, {"saveTime", &h.saveTime},
                       {"clockTime", &h.clockTime}, {"cpuTime", &h.cpuTime},
                       {"java", &h.isJava},         {"hitFlags", &h.hitFlagsOnly}};
    bool done = false;
    for (auto& hw : headerWords) {
      if (op != hw.name) continue;
      if (!arg(1, 0xFFFFFFFF)) return fail(err);
      *hw.field = static_cast<std::uint32_t>(v);
      done = true;
    }
    if (done) continue;
    if (op == "order") {
      if (w.size() < 2 || (w[1] != "native" && w[1] != "swapped"))
        return fail("order must be native or swapped");
      d.swapped = w[1] == "swapped";
    } else if (op == "recordCount") {
      if (!arg(1, 0xFFFFFFFF)) return fail(err);
      d.recordCount = static_cast<std::uint32_t>(v);
    } else if (op == "text") {
      if (w.size() < 2 || w[1].size() > sizeof(KgvHeader)) return fail("text needs up to 88 bytes");
      d.headerText = w[1];
      d.headerTextGiven = true;
    } else if (op == "record") {
      if (w.size() < 2) return fail("record needs a path");
      RecordBuilder& b = records.emplace_back();
      Options o(w, 2);
      std::uint64_t sig = 1, build = 0, first = 0, last = 0, sessions = 1, nofile = 0;
      if (!o.take("signature", 0xFFFFFFFF, sig, err) || !o.take("nofile", 1, nofile, err) || !o.take("build", 0xFFFFFFFF, build, err) ||
          !o.take("first", 0xFFFFFFFF, first, err) || !o.take("last", 0xFFFFFFFF, last, err) ||
          !o.take("sessions", 0xFFFF, sessions, err) || !o.finish(err))
        return fail(err);
      b.rec.objHeader.signature = static_cast<std::uint32_t>(sig);
      b.rec.objHeader.buildTime = static_cast<std::uint32_t>(build);
      b.rec.objHeader.firstTime = static_cast<std::uint32_t>(first);
      b.rec.objHeader.lastTime = static_cast<std::uint32_t>(last);
      std::uint32_t at = b.name(w[1]);
      if (!nofile) b.entry(TagFile, at, static_cast<std::uint16_t>(sessions));
    } else if (op == "function") {
      if (!needRecord()) return fail(err);
      if (w.size() < 2) return fail("function needs a name");
      Options o(w, 2);
      std::uint64_t line = 0, calls = 0;
      bool hasLine = false;
      for (size_t i = 2; i < w.size(); ++i) hasLine |= w[i].rfind("line=", 0) == 0;
      if (!o.take("line", kMapValueMask, line, err) || !o.take("calls", 0xFFFF, calls, err) ||
          !o.finish(err))
        return fail(err);
      cur->entry(TagFunction, cur->name(w[1]), static_cast<std::uint16_t>(calls));
      if (hasLine) cur->entry(TagFuncLine, static_cast<std::uint32_t>(line), 0);
    } else if (op == "block" || op == "blockline") {
      if (!needRecord()) return fail(err);
      if (!arg(1, kMapValueMask)) return fail(err);
      std::uint32_t line = static_cast<std::uint32_t>(v);
      Options o(w, 2);
      std::uint64_t count = 0;
      if (!o.take(op == "block" ? "hits" : "count", 0xFFFF, count, err) || !o.finish(err))
        return fail(err);
      cur->entry(op == "block" ? TagBlock : TagBlockLine, line, static_cast<std::uint16_t>(count));
    } else if (op == "empty") {
      if (!needRecord()) return fail(err);
      cur->entry(TagEmpty, 0, 0);
    } else if (op == "entry") {
      if (!needRecord()) return fail(err);
      std::uint64_t tag = 0, value = 0, count = 0;
      if (!arg(1, 15)) return fail(err);
      tag = v;
      if (!arg(2, kMapValueMask)) return fail(err);
      value = v;
      if (w.size() > 3) {
        if (!arg(3, 0xFFFF)) return fail(err);
        count = v;
      }
      cur->entry(static_cast<std::uint32_t>(tag), static_cast<std::uint32_t>(value),
                 static_cast<std::uint16_t>(count));
    } else if (op == "strings") {
      if (!needRecord()) return fail(err);
      if (w.size() < 2) return fail("strings needs a string");
      cur->rawStrings = w[1];
    } else if (op == "name") {
      if (!needRecord()) return fail(err);
      if (w.size() < 2) return fail("name needs a string");
      cur->name(w[1]);
    } else if (op == "pad" || op == "stringWords" || op == "mapCount" || op == "size") {
      if (!needRecord()) return fail(err);
      if (!arg(1, 0xFFFFFFFF)) return fail(err);
      auto n = static_cast<std::uint32_t>(v);
      if (op == "pad") {
        if (v > (1u << 20)) return fail("pad is limited to 1048576 words");
        cur->padWords = n;
      } else if (op == "stringWords") {
        cur->stringWords = n;
      } else if (op == "mapCount") {
        cur->mapCount = n;
      } else {
        cur->size = n;
      }
    } else if (op == "generate") {
      Options o(w, 1);
      std::uint64_t count = 0, first = 0, functions = 10, blocks = 10, seed = 1, build = 1000,
                    flags = 0;
      if (!o.take("records", 10000000, count, err) || !o.take("first", 100000000, first, err) ||
          !o.take("functions", 100000, functions, err) || !o.take("blocks", 100000, blocks, err) ||
          !o.take("seed", 0xFFFFFFFF, seed, err) || !o.take("build", 0xFFFFFFFF, build, err) ||
          !o.take("hits", 1, flags, err) || !o.finish(err))
        return fail(err);
      // Generated records are complete at once; records described before stay first.
      for (auto& r : records) d.data.recordSizes.push_back(r.finish());
      for (auto& r : records) d.data.records.push_back(std::make_unique<ObjRecord>(std::move(r.rec)));
      records.clear();
      std::vector<RecordBuilder> made;
      generate(d, made, count, first, functions, blocks, seed, build, flags != 0);
      for (auto& r : made) d.data.records.push_back(std::make_unique<ObjRecord>(std::move(r.rec)));
    } else {
      return fail("unknown directive " + op);
    }
  }
  for (auto& r : records) d.data.recordSizes.push_back(r.finish());
  for (auto& r : records) d.data.records.push_back(std::make_unique<ObjRecord>(std::move(r.rec)));
  h.recordCount = d.recordCount ? *d.recordCount : static_cast<std::uint32_t>(d.data.records.size());
  return true;
}

}  // namespace

std::string encodeKgvData(const KgvData& data, bool swapped) {
  std::string out;
  const KgvHeader& h = data.header;
  for (std::uint32_t word : {h.magic, h.fileKind, h.formatVersion, h.oldestReader, h.magic2,
                             h.saveTime, h.recordCount, h.clockTime, h.cpuTime, h.isJava,
                             h.hitFlagsOnly})
    putWord(out, word, swapped);
  out.append(reinterpret_cast<const char*>(h.reserved), sizeof h.reserved);
  for (size_t i = 0; i < data.records.size(); ++i)
    putWord(out, i < data.recordSizes.size() ? data.recordSizes[i] : recordWords(*data.records[i]),
            swapped);
  for (const auto& rp : data.records) {
    const ObjRecord& r = *rp;
    const ObjHeader& o = r.objHeader;
    for (std::uint32_t word :
         {o.signature, o.buildTime, o.firstTime, o.lastTime, o.stringWords, o.mapCount})
      putWord(out, word, swapped);
    out.append(reinterpret_cast<const char*>(o.reserved), sizeof o.reserved);
    out.append(r.strings.data(), r.strings.size());
    for (std::uint32_t e : r.map) putWord(out, e, swapped);
    for (std::uint16_t c : r.counts) {
      if (swapped) c = bswap16(c);
      out.append(reinterpret_cast<const char*>(&c), 2);
    }
    out.append(reinterpret_cast<const char*>(r.tail.data()), r.tail.size());
  }
  return out;
}

bool makeKgvImage(const std::string& description, std::string& bytes, std::string& error) {
  Description d;
  error.clear();
  if (!parse(description, d, error)) return false;
  bytes = encodeKgvData(d.data, d.swapped);
  if (d.headerTextGiven) bytes.replace(0, d.headerText.size(), d.headerText);
  return true;
}

bool makeKgvFile(const std::string& description, const std::string& path, std::string& error) {
  std::string bytes;
  if (!makeKgvImage(description, bytes, error)) return false;
  AtomicFileWriter w;
  if (w.open(path) != allOK || fwrite(bytes.data(), 1, bytes.size(), w.stream()) != bytes.size() ||
      w.commit() != allOK) {
    error = "cannot write " + path + ": " + errorMessage(fileWriteFailed);
    return false;
  }
  return true;
}
