// Writing the export report through one buffered, guarded writer: after the first failed
// write nothing more is written, and a closed pipe counts as success.
#include "adjust/export_report.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <vector>

#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "support/atomic_write.h"
#include "support/message_sink.h"

namespace {

constexpr std::uint32_t kSaturation = 10000;

const char* const kKeyLines[] = {
    "",
    " Summary of keys and field meanings:",
    "",
    " to unused-blocks blocks unused-lines lines unused-funcs funcs files dirs",
    " di name unused-blocks blocks unused-lines lines unused-funcs funcs files",
    " fi name unused-blocks blocks unused-lines lines unused-funcs funcs sessions",
    " fu name unused-blocks blocks unused-lines lines calls",
    " li line_no hits",
    " bl line_no hits",
    " efu name",
    " efi name",
    " edi name",
    "",
    " In all of these entries, the character separating the values is a TAB, not",
    " a space.",
    "",
    " Values for hits, calls, and sessions stop accumulating once they reach",
    nullptr,  // the line with the three limits
    "",
    " 'to'  -- Total coverage summary.",
    " 'di'  -- Coverage summary for one directory, followed by the files in the",
    "          directory.  Repeated for each directory.",
    " 'edi' -- End of information for named directory.",
    " 'fi'  -- Coverage summary for one file, followed by the functions in the",
    "          file.  Repeated for each file within a directory.",
    " 'efi' -- End of information for named file.",
    " 'fu'  -- Coverage summary for one function, followed by line and block",
    "          coverage information for the function.  Repeated for each function",
    "          within the file.",
    " 'efu' -- End of information for named function.",
    " 'li'  -- Use count for the indicated line.  Repeated for each line in the",
    "          function.  If coverage adjustments are NOT applied, then the",
    "          hits figure is the true hits figure for the line.  If coverage",
    "          adjustments ARE applied, then inspected and tested lines will",
    "          indicate INSP or TEST as appropriate, while other used and unused",
    "          lines will indicate their counts.  Deadcode lines do not appear",
    "          in export format when adjustments are applied.",
    " 'bl'  -- Use count for the basic block.  Repeated for each block in the",
    "          function.  Note that a single line may contain multiple blocks,",
    "          and that a single block may span multiple lines.",
};

const char kDigitPairs[] =
    "00010203040506070809101112131415161718192021222324252627282930313233343536373839"
    "40414243444546474849505152535455565758596061626364656667686970717273747576777879"
    "8081828384858687888990919293949596979899";

std::uint32_t saturate(std::uint32_t v) { return v > kSaturation ? kSaturation : v; }

// The longest block or line record: key, a line number of ten digits, a count of five.
constexpr std::ptrdiff_t kMaxRecordLine = 32;

// Text formatted in memory, kept from use to use so that its storage is reused.
struct TextPart {
  std::unique_ptr<char[]> data;
  std::size_t capacity = 0;
  std::size_t size = 0;
  std::string_view view() const { return std::string_view(data.get(), size); }
};

// Collects output in a buffer and hands it to the stream in large writes. The first failed
// write sets the flag; everything after it is dropped. Into memory, the buffer is the part
// itself and grows instead.
class GuardedWriter {
 public:
  explicit GuardedWriter(FILE* stream) : stream_(stream), own_(new char[kSize]), buf_(own_.get()), cap_(kSize) {
    errno = 0;
  }
  explicit GuardedWriter(TextPart& part) : stream_(nullptr), part_(&part) {
    part.size = 0;
    if (part.capacity < kSize) {
      part.data.reset(new char[kSize]);
      part.capacity = kSize;
    }
    buf_ = part.data.get();
    cap_ = part.capacity;
  }

  GuardedWriter& text(std::string_view s) {
    if (s.size() > cap_ - used_) {
      if (!part_ && s.size() > kSize) {
        flush();
        writeOut(s.data(), s.size());
        return *this;
      }
      makeRoom(s.size());
    }
    std::memcpy(buf_ + used_, s.data(), s.size());
    used_ += s.size();
    return *this;
  }
  GuardedWriter& text(const char* s) { return text(std::string_view(s)); }
  // A literal's length is known at compile time: no strlen for the keys of every line.
  template <std::size_t N>
  GuardedWriter& lit(const char (&s)[N]) {
    return text(std::string_view(s, N - 1));
  }
  // A name from a data file: a tab or newline in it would split its record and forge
  // others for the scripts that read the report, so every control character becomes "?".
  GuardedWriter& name(std::string_view s) {
    std::size_t from = 0;
    for (std::size_t i = 0; i < s.size(); ++i) {
      unsigned char c = static_cast<unsigned char>(s[i]);
      if (c >= 0x20 && c != 0x7F) continue;
      text(s.substr(from, i - from));
      ch('?');
      from = i + 1;
    }
    return text(s.substr(from));
  }
  GuardedWriter& tab() { return ch('\t'); }
  GuardedWriter& number(std::uint32_t v) {
    used_ = static_cast<std::size_t>(put(room(16), v) - buf_);
    return *this;
  }
  // Most numbers of a report are line numbers and counts of at most 10000: those take a
  // branch or two and whole digit pairs.
  [[gnu::always_inline]] static char* put(char* q, std::uint32_t v) {
    if (v < 100) {
      if (v < 10) {
        *q = static_cast<char>('0' + v);
        return q + 1;
      }
      std::memcpy(q, kDigitPairs + 2 * v, 2);
      return q + 2;
    }
    if (v < 10000) {
      if (v < 1000) {
        *q = static_cast<char>('0' + v / 100);
        std::memcpy(q + 1, kDigitPairs + 2 * (v % 100), 2);
        return q + 3;
      }
      std::memcpy(q, kDigitPairs + 2 * (v / 100), 2);
      std::memcpy(q + 2, kDigitPairs + 2 * (v % 100), 2);
      return q + 4;
    }
    return std::to_chars(q, q + 10, v).ptr;
  }
  // The lines of blocks and source lines, most of a report, are written straight into the
  // buffer: room() gives space for a line of at most n bytes, lineSpace() all the space left
  // (at least kSlack bytes), took() ends what was written at `end`.
  char* room(std::size_t n) {
    if (cap_ - used_ < n) makeRoom(n);
    return buf_ + used_;
  }
  struct Space {
    char* begin;
    const char* end;
  };
  Space lineSpace() {
    if (cap_ - used_ < kSlack) makeRoom(kSlack);
    return Space{buf_ + used_, buf_ + cap_};
  }
  void took(char* end) {
    used_ = static_cast<std::size_t>(end - buf_);
    if (cap_ - used_ < kSlack) makeRoom(kSlack);
  }
  // Ends a line; the buffer goes out once it is nearly full.
  void endLine() {
    ch('\n');
    if (cap_ - used_ < kSlack) makeRoom(kSlack);
  }

  ErrorCode finish() {
    if (part_) {
      part_->size = used_;
      return allOK;
    }
    flush();
    if (!failed_ && std::fflush(stream_) != 0) fail();
    if (!failed_) return allOK;
    if (savedErrno_ == EPIPE) {
      clearPendingSystemError();
      return allOK;
    }
    return fileWriteFailed;
  }

  bool failed() const { return failed_; }

 private:
  static constexpr std::size_t kSize = 1 << 17;
  static constexpr std::size_t kSlack = 4096;

  GuardedWriter& ch(char c) {
    if (used_ == cap_) makeRoom(1);
    buf_[used_++] = c;
    return *this;
  }
  void flush() {
    writeOut(buf_, used_);
    used_ = 0;
  }
  // Room for n more bytes: the stream's buffer is written out, a part grows.
  void makeRoom(std::size_t n) {
    if (!part_) {
      flush();
      return;
    }
    const std::size_t wanted = std::max(2 * cap_, used_ + n + kSlack);
    std::unique_ptr<char[]> bigger(new char[wanted]);
    std::memcpy(bigger.get(), buf_, used_);
    part_->data = std::move(bigger);
    part_->capacity = wanted;
    buf_ = part_->data.get();
    cap_ = wanted;
  }
  void writeOut(const char* data, std::size_t n) {
    if (failed_ || n == 0) return;
    if (std::fwrite(data, 1, n, stream_) != n) fail();
  }
  void fail() {
    failed_ = true;
    savedErrno_ = errno != 0 ? errno : EIO;
    recordSystemError(savedErrno_);
  }

  FILE* stream_;
  TextPart* part_ = nullptr;
  std::unique_ptr<char[]> own_;
  char* buf_ = nullptr;
  std::size_t cap_ = 0;
  std::size_t used_ = 0;
  bool failed_ = false;
  int savedErrno_ = 0;
};

void writeHeader(GuardedWriter& w, std::time_t when) {
  std::string hashes(79, '#');
  w.text(hashes).endLine();
  char date[64] = "";
  struct tm local {};
  if (localtime_r(&when, &local)) strftime(date, sizeof date, "%d-%h-%Y %r", &local);
  char line[160];
  snprintf(line, sizeof line, "# This is a Kestrelgauge export file, created %-31s #", date);
  w.text(line).endLine();
  snprintf(line, sizeof line, "# Coverage data type: %-55s #", "adjusted.");
  w.text(line).endLine();
  for (const char* key : kKeyLines) {
    char limits[96];
    if (!key) {
      snprintf(limits, sizeof limits, " %5d, so a value of %5d should be taken as %5d or greater.",
               int(kSaturation), int(kSaturation), int(kSaturation));
      key = limits;
    }
    snprintf(line, sizeof line, "#%-77s#", key);
    w.text(line).endLine();
  }
  w.text(hashes).endLine();
}

// A file's lines for the report: packed words where the file has them, else its line states.
struct ReportLines {
  const std::vector<std::uint32_t>& packed;
  const LineStates* states;  // when packed is empty
};

// The records of blocks and lines are most of a report. They are written through a local
// cursor (no stores through the writer in between) with room for one record checked once.
[[gnu::always_inline]] inline char* putBlockRecord(char* q, std::uint32_t line, std::uint32_t hits) {
  std::memcpy(q, "bl\t", 3);
  q = GuardedWriter::put(q + 3, line);
  *q++ = '\t';
  q = GuardedWriter::put(q, saturate(hits));
  *q++ = '\n';
  return q;
}

// Dead code under adjustments has no record: q comes back as it was.
[[gnu::always_inline]] inline char* putLineRecord(char* q, std::uint32_t line, std::uint32_t flags, std::uint16_t count) {
  const bool adjusted = (flags & adjAnyMask) != 0;
  if (adjusted && lineUnusedDead(flags, count)) return q;
  std::memcpy(q, "li\t", 3);
  q = GuardedWriter::put(q + 3, line);
  *q++ = '\t';
  if (count != 0 || !adjusted) {
    q = GuardedWriter::put(q, saturate(count));
  } else {
    const char* t = exportCountText(true, flags, count);
    const std::size_t n = std::strlen(t);  // "0", "TEST" or "INSP"
    std::memcpy(q, t, n);
    q += n;
  }
  *q++ = '\n';
  return q;
}

void writeFunction(GuardedWriter& w, const SumFile& file, const ReportLines& lines, const SumFunc& fn) {
  w.lit("fu\t").name(fn.name).tab().number(fn.counts.unusedBlocks).tab().number(fn.counts.blocks);
  w.tab().number(fn.counts.adjUnusedLines).tab().number(fn.counts.adjLines);
  w.tab().number(saturate(fn.calls));
  w.endLine();
  GuardedWriter::Space room = w.lineSpace();
  char* q = room.begin;
  const char* end = room.end;
  auto ensure = [&w, &q, &end] {
    if (end - q >= kMaxRecordLine) return;
    w.took(q);
    const GuardedWriter::Space more = w.lineSpace();
    q = more.begin;
    end = more.end;
  };
  const ObjRecord* rec = file.record;
  if (rec && !rec->map.empty()) {
    const std::uint32_t* map = rec->map.data();
    const std::uint16_t* counts = rec->counts.data();
    const std::size_t countsSize = rec->counts.size();
    const std::size_t last = std::min<std::size_t>(fn.lastMapIndex, rec->map.size() - 1);
    for (std::size_t i = fn.firstMapIndex; i <= last; ++i) {
      if (mapTag(map[i]) != TagBlock) continue;
      ensure();
      q = putBlockRecord(q, mapValue(map[i]), i < countsSize ? counts[i] : 0);
    }
  }
  if (fn.firstLine != 0 && lines.states) {
    const std::uint32_t last = std::min<std::uint32_t>(fn.lastLine, lines.states->size());
    lines.states->forEachCodeLine(fn.firstLine, last, [&](std::uint32_t l, const LineState& s) {
      ensure();
      q = putLineRecord(q, l, s.flags, s.count);
    });
  } else if (fn.firstLine != 0 && !lines.packed.empty()) {
    const std::uint32_t lineCount = static_cast<std::uint32_t>(lines.packed.size() - 1);
    const std::uint32_t last = std::min(fn.lastLine, lineCount);
    // As with line states, a first line past the file's last one (only a damaged map has
    // such a function) starts at the last one.
    const std::uint32_t first = std::min(fn.firstLine, lineCount);
    const std::uint32_t* packed = lines.packed.data();
    for (std::uint32_t l = first; l <= last; ++l) {
      const std::uint32_t word = packed[l];
      if (!(word & (LineHasCode << 16))) continue;
      ensure();
      q = putLineRecord(q, l, word >> 16, static_cast<std::uint16_t>(word));
    }
  }
  w.took(q);
  w.lit("efu\t").name(fn.name).endLine();
}

}  // namespace

ErrorCode writeExport(FILE* stream, const SumRoot& root, MessageSink& messages) {
  return writeExport(stream, root, std::time(nullptr), messages);
}

namespace {

void writeDirStart(GuardedWriter& w, const SumDir& d) {
  const SumCounts& c = d.counts;
  w.lit("di\t").name(d.name).tab().number(c.unusedBlocks).tab().number(c.blocks);
  w.tab().number(c.adjUnusedLines).tab().number(c.adjLines).tab().number(d.unusedFuncs);
  w.tab().number(d.funcs).tab().number(d.files);
  w.endLine();
}

void writeFile(GuardedWriter& w, const SumFile& f, LazyLineStates& lineStates) {
  const SumCounts& fc = f.counts;
  w.lit("fi\t").name(f.name).tab().number(fc.unusedBlocks).tab().number(fc.blocks);
  w.tab().number(fc.adjUnusedLines).tab().number(fc.adjLines).tab().number(f.unusedFuncs);
  w.tab().number(f.funcs).tab().number(saturate(f.sessions));
  w.endLine();
  const std::vector<std::uint32_t>& packed = lineStates.packed(f);
  const ReportLines lines{packed, packed.empty() ? &lineStates.of(f) : nullptr};
  for (const SumFunc* fn : f.funcOrder) writeFunction(w, f, lines, *fn);
  w.lit("efi\t").name(f.name).endLine();
}

// One step of the report: a directory's first line, a file, or a directory's last line.
struct ReportStep {
  const SumDir* dir;
  const SumFile* file;  // null: the directory's "di" line (start) or "edi" line
  bool start;
};

void writeStep(GuardedWriter& w, const ReportStep& s, LazyLineStates& lineStates) {
  if (s.file) {
    writeFile(w, *s.file, lineStates);
  } else if (s.start) {
    writeDirStart(w, *s.dir);
  } else {
    w.lit("edi\t").name(s.dir->name).endLine();
  }
}

std::size_t stepWeight(const ReportStep& s) {
  return s.file && s.file->record ? s.file->record->map.size() + 1 : 1;
}

// Line states for the report need no classes: only flags and counts are written.

// The report's steps after the total are formatted on a few threads, a stretch of about
// this many map entries at a time, each thread's part in memory, and written in order.
constexpr std::size_t kEntriesPerStretch = std::size_t(1) << 20;

// Joins a thread, if one runs, when it goes out of scope (also when formatting fails).
class JoinedThread {
 public:
  JoinedThread() = default;
  JoinedThread(const JoinedThread&) = delete;
  JoinedThread& operator=(const JoinedThread&) = delete;
  ~JoinedThread() { join(); }
  void join() {
    if (thread_.joinable()) thread_.join();
  }
  // Runs fn on a thread of its own, or here when no thread can be had.
  template <class Fn>
  void run(Fn fn) {
    join();
    try {
      thread_ = std::thread(fn);
    } catch (const std::system_error&) {
      fn();
    }
  }

 private:
  std::thread thread_;
};

ErrorCode writeStepsInParallel(GuardedWriter& w, const std::vector<ReportStep>& steps, const SumRoot& root,
                               MessageSink& messages) {
  const unsigned threads = std::max(1u, std::min(4u, std::thread::hardware_concurrency()));
  // Two sets of parts: one stretch is written out from one set while the next is formatted
  // into the other, so that a report going to a file or a pipe waits little on the writes.
  std::vector<TextPart> parts[2] = {std::vector<TextPart>(threads), std::vector<TextPart>(threads)};
  std::vector<MessageList> notices(threads);
  std::vector<std::unique_ptr<LazyLineStates>> lineStates;
  for (unsigned t = 0; t < threads; ++t)
    lineStates.push_back(std::make_unique<LazyLineStates>(adjustmentList(), root.hitsPolicy, notices[t], false));
  std::vector<char> failed(threads, 0);
  JoinedThread writer;  // the writes of the last stretch formatted; only it uses `w` meanwhile
  bool writeFailed = false;
  int set = 0;
  std::size_t from = 0;
  while (from < steps.size() && !writeFailed) {
    // The stretch, cut into one contiguous part per thread of about equal weight.
    std::size_t to = from, weight = 0;
    while (to < steps.size() && weight < kEntriesPerStretch) weight += stepWeight(steps[to++]);
    std::vector<std::size_t> cuts{from};
    std::size_t seen = 0;
    for (std::size_t k = from; k < to && cuts.size() < threads; ++k) {
      seen += stepWeight(steps[k]);
      if (seen >= weight / threads * cuts.size()) cuts.push_back(k + 1);
    }
    while (cuts.size() <= threads) cuts.push_back(to);
    cuts.back() = to;
    std::vector<TextPart>& into = parts[set];
    auto format = [&](unsigned t) {
      try {
        GuardedWriter part(into[t]);
        for (std::size_t k = cuts[t]; k < cuts[t + 1]; ++k) writeStep(part, steps[k], *lineStates[t]);
        part.finish();
      } catch (...) {
        failed[t] = 1;
      }
    };
    {
      std::vector<JoinedThread> workers(threads);
      for (unsigned t = 1; t < threads; ++t) workers[t].run([&format, t] { format(t); });
      format(0);
    }
    // The previous stretch is out (or failed) before this one goes.
    writer.join();
    writeFailed = w.failed();
    for (unsigned t = 0; t < threads; ++t) {
      if (failed[t]) throw std::bad_alloc();
      for (const MessageList::Message& m : notices[t].messages) {
        if (m.warning) {
          messages.warning(m.text);
        } else {
          messages.notice(m.text);
        }
      }
      notices[t].messages.clear();
    }
    if (!writeFailed) writer.run([&w, &into] {
      for (const TextPart& part : into) w.text(part.view());
    });
    set = 1 - set;
    from = to;
  }
  return allOK;
}

ErrorCode writeReport(FILE* stream, const SumRoot& root, std::time_t when, MessageSink& messages) {
  GuardedWriter w(stream);
  writeHeader(w, when);
  const SumCounts& t = root.counts;
  w.lit("to\t").number(t.unusedBlocks).tab().number(t.blocks).tab().number(t.adjUnusedLines);
  w.tab().number(t.adjLines).tab().number(root.unusedFuncs).tab().number(root.funcs);
  w.tab().number(root.files).tab().number(root.dirs);
  w.endLine();
  std::vector<ReportStep> steps;
  std::size_t entries = 0;
  for (const SumDir* d : root.dirOrder) {
    steps.push_back(ReportStep{d, nullptr, true});
    for (const SumFile* f : d->fileOrder) {
      steps.push_back(ReportStep{d, f, false});
      entries += stepWeight(steps.back());
    }
    steps.push_back(ReportStep{d, nullptr, false});
  }
  if (entries >= summaryThreadThreshold() && std::thread::hardware_concurrency() > 1) {
    writeStepsInParallel(w, steps, root, messages);
  } else {
    LazyLineStates lineStates(adjustmentList(), root.hitsPolicy, messages, false);
    for (const ReportStep& s : steps) {
      if (w.failed()) break;
      writeStep(w, s, lineStates);
    }
  }
  return w.finish();
}

}  // namespace

ErrorCode writeExport(FILE* stream, const SumRoot& root, std::time_t when, MessageSink& messages) {
  clearPendingSystemError();
  try {
    return writeReport(stream, root, when, messages);
  } catch (const std::bad_alloc&) {
    return outOfMemory;
  } catch (...) {
    return fatalInternalError;
  }
}

ErrorCode exportToFile(const SumRoot& root, const std::string& path, MessageSink& messages) {
  AtomicFileWriter out;
  ErrorCode rc = out.open(path);
  if (rc != allOK) return writeError;
  rc = writeExport(out.stream(), root, messages);
  if (rc != allOK) {
    out.abandon();
    return rc;
  }
  return out.commit();
}
