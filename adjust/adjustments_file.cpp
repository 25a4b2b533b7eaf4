// Adjustments file reading and writing, under the file's lock.
#include "adjust/adjustments_file.h"

#include <fcntl.h>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <utility>

#include "adjust/adjustments_lock.h"
#include "adjust/code_set.h"
#include "adjust/src_file.h"
#include "support/atomic_write.h"
#include "support/string_helpers.h"

const char* const kDefaultAdjustmentsFile = "~/.kestrel.adjust";
const char* const kAdjustmentsWriterName = "Kestrelgauge viewer";

namespace {

constexpr std::string_view kBanner = "Kestrelgauge Adjustments File 1.0\n";
constexpr size_t kRangeLimit = 30;
// A number may not exceed this before another digit is added to it.
constexpr std::uint64_t kNumberGuard = 429496728;

std::string gPath;
bool gWritable = true;
// Why the file on disk could not be read; while set the file is never rewritten, since the
// list in memory lacks what the file holds.
std::string gUnreadable;


std::string homeOf(const char* user) {
  if (!user || !*user) return {};
  struct passwd* pw = getpwnam(user);
  return pw && pw->pw_dir ? pw->pw_dir : std::string();
}

bool isBlank(char c) { return c == ' ' || c == '\t'; }

// Reading state over the text of one file.
class RecordReader {
 public:
  RecordReader(std::string_view text, const std::string& path, AdjustmentList& list,
               std::vector<std::string>& warnings)
      : t_(text), path_(path), list_(list), warnings_(warnings) {}

  void run() {
    pos_ = kBanner.size();
    line_ = 2;
    while (pos_ < t_.size()) {
      if (t_[pos_] == '\n') {
        ++pos_;
      } else if (t_[pos_] == '#') {
        skipLine();
      } else {
        record();
        skipLine();
      }
      ++line_;
    }
  }

 private:
  struct Field {
    std::string_view text;
    bool ok = false;
  };

  void skipLine() {
    size_t nl = t_.find('\n', pos_);
    pos_ = nl == std::string_view::npos ? t_.size() : nl + 1;
  }

  void warn(const std::string& text) { warnings_.push_back(text); }

  // One tab-ended field; on a fault the warning is given and ok stays false.
  Field field(const char* name, size_t limit) {
    Field f;
    size_t end = pos_;
    while (end < t_.size() && t_[end] != '\t' && t_[end] != '\n') ++end;
    f.text = t_.substr(pos_, end - pos_);
    if (f.text.size() > limit) {
      warn(stringPrintf("Line %d of %s:\nthe %s is too long to be valid\n(the limit is %d characters)",
                  line_, path_.c_str(), name, static_cast<int>(limit)));
      return f;
    }
    if (f.text.empty()) {
      warn(stringPrintf("Line %d of %s:\nthe %s is missing from the line", line_, path_.c_str(), name));
      return f;
    }
    if (end >= t_.size() || t_[end] != '\t') {
      warn(stringPrintf("Line %d of %s:\nthe %s is not followed by a tab", line_, path_.c_str(), name));
      return f;
    }
    pos_ = end + 1;
    f.ok = true;
    return f;
  }

  void record() {
    Field name = field("filename", 4095);
    if (!name.ok) return;
    Field timeField = field("time value", 10);
    if (!timeField.ok) return;
    std::uint64_t timeValue = 0;
    for (char c : timeField.text) {
      if (c < '0' || c > '9') {
        warn(stringPrintf("Line %d of %s:\nthe time value '%s'\ncontains non-numeric characters", line_,
                    path_.c_str(), std::string(timeField.text).c_str()));
        return;
      }
      timeValue = timeValue * 10 + static_cast<unsigned>(c - '0');
    }
    // Ten digits can exceed what an entry's time holds; such a date lies centuries ahead.
    const auto t = static_cast<std::uint32_t>(timeValue > UINT32_MAX ? UINT32_MAX : timeValue);
    Field kindField = field("coverage adjustment name", 20);
    if (!kindField.ok) return;
    CvgAdjust kind = 0;
    if (!parseCvgAdjustName(kindField.text, kind)) {
      warn(stringPrintf("Line %d of %s:\n'%s' does not name\na valid kind of coverage adjustment", line_,
                  path_.c_str(), std::string(kindField.text).c_str()));
      return;
    }
    Field style = field("coverage adjustment style", 1);
    if (!style.ok) return;
    if (style.text == "B") {
      kind *= 16;
    } else if (style.text != "L") {
      warn(stringPrintf("Line %d of %s:\n'%s' does not name\na valid coverage adjustment style", line_,
                  path_.c_str(), std::string(style.text).c_str()));
      return;
    }

    KgvFileRef ref = makeKgvFileRef(std::string(name.text));
    int at = list_.position(ref.resolvedName);
    if (at < 0) {
      list_.append(AdjustEntry(std::move(ref)));
      at = static_cast<int>(list_.size()) - 1;
    }
    AdjustEntry& entry = list_.at(static_cast<size_t>(at));
    if (t < entry.loadTime()) return;  // older than what was read already
    if (t > entry.loadTime()) entry.setSet(nullptr);
    entry.setLoadTime(t);
    ranges(entry, kind);
  }

  void ranges(AdjustEntry& entry, CvgAdjust kind) {
    for (;;) {
      while (pos_ < t_.size() && isBlank(t_[pos_])) ++pos_;
      if (pos_ >= t_.size() || t_[pos_] == '\n') return;
      size_t end = pos_;
      while (end < t_.size() && !isBlank(t_[end]) && t_[end] != '\n') ++end;
      std::string_view token = t_.substr(pos_, end - pos_);
      pos_ = end;
      if (token.size() > kRangeLimit) {
        warn(stringPrintf("Line %d of %s:\nthe line range %s...\nis too long to be valid\n(the limit is "
                    "%d characters)",
                    line_, path_.c_str(), std::string(token.substr(0, kRangeLimit)).c_str(),
                    static_cast<int>(kRangeLimit)));
        continue;
      }
      std::uint32_t first = 0, last = 0;
      bool valid = parseRange(token, first, last);
      if (valid) {
        if (!entry.set()) entry.setSet(std::make_unique<CvgAdjustSet>());
        valid = entry.set()->addRange(kind, first, last);
      }
      if (!valid) {
        warn(stringPrintf("Line %d of %s:\nthe text '%s' is\nnot a valid line range -- check that\nit is "
                    "in the proper format and the\nnumbers are not too large",
                    line_, path_.c_str(), std::string(token).c_str()));
      }
    }
  }

  static bool parseNumber(std::string_view s, size_t& i, std::uint32_t& value) {
    std::uint64_t v = 0;
    size_t start = i;
    while (i < s.size() && s[i] >= '0' && s[i] <= '9') {
      if (v > kNumberGuard) return false;
      v = v * 10 + static_cast<unsigned>(s[i] - '0');
      ++i;
    }
    value = static_cast<std::uint32_t>(v);
    return i > start;
  }

  static bool parseRange(std::string_view s, std::uint32_t& first, std::uint32_t& last) {
    size_t i = 0;
    if (!parseNumber(s, i, first)) return false;
    last = first;
    if (i == s.size()) return true;
    if (s[i] != '-') return false;
    ++i;
    return parseNumber(s, i, last) && i == s.size();
  }

  std::string_view t_;
  const std::string& path_;
  AdjustmentList& list_;
  std::vector<std::string>& warnings_;
  size_t pos_ = 0;
  int line_ = 2;
};

std::string notTextWarning(const std::string& path) {
  return stringPrintf("Line 1 of %s:\nthe file is not a plain text file\n(it contains a lot of "
                "non-ASCII bytes),\nso it cannot be processed as a coverage\nadjustments file",
                path.c_str());
}

// Whether the file can be replaced: it is writable, and so is its directory, where the new
// copy is made before it takes the old one's place.
bool canRewrite(const std::string& path) {
  std::string target = writeTargetFor(path);
  size_t slash = target.find_last_of('/');
  std::string dir = slash == std::string::npos ? "." : slash == 0 ? "/" : target.substr(0, slash);
  return access(target.c_str(), W_OK) == 0 && access(dir.c_str(), W_OK | X_OK) == 0;
}

}  // namespace

std::string expandHomePath(const std::string& path) {
  if (path.empty() || path[0] != '~') return path;
  size_t slash = path.find('/');
  std::string user = path.substr(1, slash == std::string::npos ? std::string::npos : slash - 1);
  std::string rest = slash == std::string::npos ? std::string() : path.substr(slash);
  std::string home;
  if (user.empty()) {
    const char* env = getenv("HOME");
    if (env && *env) {
      home = env;
    } else {
      home = homeOf(getenv("USER"));
      if (home.empty()) {
        struct passwd* pw = getpwuid(getuid());
        if (pw && pw->pw_dir) home = pw->pw_dir;
      }
    }
  } else {
    home = homeOf(user.c_str());
  }
  return home.empty() ? path : home + rest;
}

bool parseAdjustments(std::string_view text, const std::string& path, AdjustmentList& list,
                      std::vector<std::string>& warnings) {
  // Files edited on other systems end their lines with CR LF; the CR is no part of a field.
  std::string unixText;
  if (text.find('\r') != std::string_view::npos) {
    unixText.reserve(text.size());
    for (size_t i = 0; i < text.size(); ++i) {
      if (text[i] == '\r' && (i + 1 == text.size() || text[i + 1] == '\n')) continue;
      unixText.push_back(text[i]);
    }
    text = unixText;
  }
  // Text that begins with the banner is a file this program wrote; its paths may hold any
  // bytes but NUL (a Latin-1 folder name is not UTF-8, and Linux allows control bytes), so
  // only a NUL makes it binary.
  std::string_view head = text.substr(0, 512);
  bool ours = head.substr(0, kBanner.size()) == kBanner && head.find('\0') == std::string_view::npos;
  if (!ours && !isPlainTextOrUtf8Bytes(head, text.size() > 512)) {
    warnings.push_back(notTextWarning(path));
    return false;
  }
  if (text.substr(0, kBanner.size()) != kBanner) {
    warnings.push_back(stringPrintf("Line 1 of %s:\nthe file does not begin with the\nadjustments file "
                              "banner:\n   Kestrelgauge Adjustments File 1.0\nso it is not a "
                              "valid Kestrelgauge\nadjustments file.\n",
                              path.c_str()));
    return false;
  }
  RecordReader(text, path, list, warnings).run();
  return true;
}

std::vector<std::string> readAdjustmentsFile(const std::string& givenPath) {
  std::vector<std::string> warnings;
  gPath = expandHomePath(givenPath);
  gWritable = true;
  gUnreadable.clear();
  const std::string& path = gPath;
  struct stat st;
  if (stat(path.c_str(), &st) != 0) return warnings;  // no file yet: nothing to read
  gWritable = canRewrite(path);
  ErrorCode rc = lockAdjustmentsFile(path);
  FILE* f = nullptr;
  if (rc == allOK) {
    // Non-blocking open, so that a FIFO in the file's place cannot hang start-up.
    int fd = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (fd >= 0) {
      int flags = fcntl(fd, F_GETFL);
      if (flags >= 0) fcntl(fd, F_SETFL, flags & ~O_NONBLOCK);
      f = fdopen(fd, "r");
      if (!f) close(fd);
    }
    if (!f) {
      recordSystemError(errno);
      unlockAdjustmentsFile(path);
      rc = openError;
    }
  }
  if (rc != allOK) {
    warnings.push_back(stringPrintf("%s:\nCould not open: %s", path.c_str(), errorMessage(rc).c_str()));
    gUnreadable = "it could not be opened";
    gWritable = false;
    return warnings;
  }
  struct stat opened;
  if (fstat(fileno(f), &opened) != 0 || !S_ISREG(opened.st_mode)) {
    warnings.push_back(notTextWarning(path));
    gUnreadable = "it is not a plain text file";
  } else {
    std::string text;
    char buf[65536];
    size_t n;
    while ((n = fread(buf, 1, sizeof buf, f)) > 0) text.append(buf, n);
    // A read error ends the records where it happened; what was read so far stays.
    if (ferror(f)) gUnreadable = "reading it failed part way";
    if (!parseAdjustments(text, path, adjustmentList(), warnings) && gUnreadable.empty())
      gUnreadable = "it is not an adjustments file this program can read";
  }
  fclose(f);
  unlockAdjustmentsFile(path);
  if (!gUnreadable.empty()) gWritable = false;
  return warnings;
}

std::vector<std::string> readStartupAdjustments(const char* optionValue) {
  return readAdjustmentsFile(optionValue && *optionValue ? optionValue : kDefaultAdjustmentsFile);
}

bool writeAdjustments(FILE* stream, const char* writerName, const AdjustmentList& list) {
  if (!stream) return true;
  char when[50] = "";
  time_t now = time(nullptr);
  struct tm tmNow;
  if (localtime_r(&now, &tmNow)) strftime(when, sizeof when, "%d-%h-%Y %r", &tmNow);
  bool ok = fputs(kBanner.data(), stream) >= 0 && fputs("######\n", stream) >= 0 &&
            fprintf(stream, "# Kestrelgauge coverage adjustments written %s\n", when) >= 0 &&
            (!writerName || !*writerName || fprintf(stream, "#   by %s\n", writerName) >= 0) &&
            fputs("######\n", stream) >= 0;
  for (const AdjustEntry& e : list.entries()) {
    if (!ok) break;
    if (!e.set()) continue;
    // A name holding a tab or newline cannot be written as one field; written anyway it
    // would split the record or forge others.
    if (e.resolvedName().empty() || e.resolvedName().find_first_of("\t\n") != std::string::npos) {
      continue;
    }
    CvgAdjust lastKind = 0;
    ok = e.set()->iterateRanges([&](CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
      if (kind != lastKind) {
        if (lastKind != 0 && fputc('\n', stream) == EOF) return false;
        lastKind = kind;
        if (fprintf(stream, "%s\t%lu\t%s\t%c\t", e.resolvedName().c_str(),
                    static_cast<unsigned long>(e.loadTime()), cvgAdjustName(kind),
                    adjustStyleLetter(kind)) < 0) {
          return false;
        }
      }
      int n = first == last ? fprintf(stream, " %lu", static_cast<unsigned long>(first))
                            : fprintf(stream, " %lu-%lu", static_cast<unsigned long>(first),
                                      static_cast<unsigned long>(last));
      return n >= 0;
    });
    if (ok && lastKind != 0) ok = fputc('\n', stream) != EOF;
  }
  return ok && !ferror(stream);
}

ErrorCode writeAdjustmentsFile() {
  const std::string& path = adjustmentsFilePath();
  if (!gUnreadable.empty()) {
    recordSystemError(0, "%s was not rewritten: %s, and rewriting it would lose the "
                      "adjustments it holds.  Mend or move it, then try again.",
                      path.c_str(), gUnreadable.c_str());
    return fileWriteFailed;
  }
  ErrorCode rc = lockAdjustmentsFile(path);
  if (rc != allOK) return rc;
  AtomicFileWriter writer;
  rc = writer.open(writeTargetFor(path));
  if (rc == allOK) {
    if (writeAdjustments(writer.stream(), kAdjustmentsWriterName, adjustmentList())) {
      rc = writer.commit();
    } else {
      recordSystemError(errno ? errno : EIO, "while writing into %s", path.c_str());
      writer.abandon();
      rc = fileWriteFailed;
    }
  }
  unlockAdjustmentsFile(path);
  if (rc == allOK) gWritable = true;
  return rc;
}

bool adjustmentsWritable() { return gWritable; }

const std::string& adjustmentsFilePath() {
  if (gPath.empty()) gPath = expandHomePath(kDefaultAdjustmentsFile);
  return gPath;
}
