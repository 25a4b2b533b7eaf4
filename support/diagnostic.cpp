// Console diagnostics: message layout, limits, clean-up actions, checked allocation.
#include "support/diagnostic.h"

#include <cxxabi.h>
#include <execinfo.h>
#include <sys/resource.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "support/cleanup_paths.h"

namespace {

struct State {
  std::string label;
  std::string product = "Kestrelgauge";
  std::string command = "kestrel";
  std::string version;
  int level = 0;
  bool quiet = false;
  unsigned warningLimit = 0, errorLimit = 0;
  unsigned warnings = 0, errors = 0, suppressed = 0, limitedErrorsPrinted = 0;
  unsigned warningsPrinted = 0;
  bool ignoreInternal = false, continueInternal = false;
  bool noticePrinted = false;
  std::string currentFile;
  bool hasCurrentFile = false;
  std::string lastPrintedFile;
  std::vector<std::string> prior;
  std::vector<std::pair<diag::CleanupFn, void*>> cleanups;
  std::vector<std::string> verbose;
};

State& st() {
  static State* s = new State;  // never destroyed: messages may come from exit paths
  return *s;
}

std::string vformat(const char* fmt, va_list ap) {
  char* text = nullptr;
  int n = vasprintf(&text, fmt, ap);
  if (n < 0 || !text) return std::string();
  std::string out(text, static_cast<size_t>(n));
  free(text);
  return out;
}

void emit(const char* tag, const std::string& text) {
  State& s = st();
  fflush(stdout);
  if (s.hasCurrentFile && s.currentFile != s.lastPrintedFile) {
    fprintf(stderr, "While processing file %s:\n", s.currentFile.c_str());
    s.lastPrintedFile = s.currentFile;
  }
  fprintf(stderr, "%s: %s: %s", s.label.c_str(), tag, text.c_str());
  if (text.empty() || text.back() != '\n') fputc('\n', stderr);
  fflush(stderr);
}

void systemErrorLine(int err) {
  if (err > 0) {
    fprintf(stderr, "%s: %s\n", "System error code", strerror(err));
    fflush(stderr);
  }
}

void supportNotice() {
  State& s = st();
  if (s.noticePrinted) return;
  s.noticePrinted = true;
  fprintf(stderr,
          "This may be a problem in %s%s%s.  If it persists, please report it to your\n"
          "%s support contact, with the messages above and the data files involved.\n",
          s.product.c_str(), s.version.empty() ? "" : " ", s.version.c_str(), s.product.c_str());
  fflush(stderr);
}

bool whereAmIRequested() { return getenv("QUOR_WHERE_AM_I") != nullptr; }

[[noreturn]] void fatalExit() {
  diag::runCleanups();
  fflush(stdout);
  fflush(stderr);
  exit(1);
}

}  // namespace

namespace diag {

void setIdentity(const char* lbl, const char* product, const char* command) {
  st().label = lbl ? lbl : "";
  if (product) st().product = product;
  if (command) st().command = command;
}
void setVersionText(const char* version) { st().version = version ? version : ""; }
const std::string& label() { return st().label; }
void setLevel(int l) { st().level = l; }
int level() { return st().level; }
void setQuiet(bool q) { st().quiet = q; }
void setWarningLimit(unsigned limit) { st().warningLimit = limit; }
void setErrorLimit(unsigned limit) { st().errorLimit = limit; }
unsigned warningCount() { return st().warnings; }
unsigned errorCount() { return st().errors; }
unsigned suppressedCount() { return st().suppressed; }
void setIgnoreInternalErrors(bool ignore) { st().ignoreInternal = ignore; }
void setContinueAfterInternalErrors(bool cont) { st().continueInternal = cont; }

void setCurrentFile(const char* name) {
  st().hasCurrentFile = name != nullptr;
  st().currentFile = name ? name : "";
}

void addPriorInformation(const char* text) { st().prior.emplace_back(text ? text : ""); }
const std::vector<std::string>& priorInformation();
const std::vector<std::string>& priorInformation() { return st().prior; }

void addCleanup(CleanupFn fn, void* arg) { st().cleanups.emplace_back(fn, arg); }

void removeCleanup(CleanupFn fn, void* arg) {
  auto& c = st().cleanups;
  for (auto it = c.begin(); it != c.end(); ++it) {
    if (it->first == fn && it->second == arg) {
      c.erase(it);
      return;
    }
  }
  kgDiag("RemoveCleanup: Could not find cleanup.");
}

void runCleanups() {
  // Each action runs once, latest first, even if one of them ends in another fatal error.
  auto& c = st().cleanups;
  while (!c.empty()) {
    auto action = c.back();
    c.pop_back();
    action.first(action.second);
  }
  // Held locks and unfinished files go with the process.
  removeCleanupPaths();
}

void enableVerbose(const char* category, bool on) {
  auto& v = st().verbose;
  for (auto it = v.begin(); it != v.end(); ++it) {
    if (*it == category) {
      if (!on) v.erase(it);
      return;
    }
  }
  if (on) v.emplace_back(category);
}

}  // namespace diag

#define KG_FORMAT_ARGS(var)  \
  va_list ap;                \
  va_start(ap, fmt);         \
  std::string var = vformat(fmt, ap); \
  va_end(ap)

void kgNote(const char* fmt, ...) {
  if (st().level < 1) return;
  KG_FORMAT_ARGS(text);
  emit("Note", text);
}

void kgVerify(const char* fmt, ...) {
  if (st().level < 2) return;
  KG_FORMAT_ARGS(text);
  emit("Verify", text);
}

void kgDiag(const char* fmt, ...) {
  if (st().level < 3) return;
  KG_FORMAT_ARGS(text);
  emit("Diag", text);
}

void kgDebug(const char* fmt, ...) {
  if (st().level < 4) return;
  KG_FORMAT_ARGS(text);
  emit("Debug", text);
}

void kgTracedNote(const char* fmt, ...) {
  if (st().quiet) return;
  KG_FORMAT_ARGS(text);
  emit("Note", text);
  kgWhereAmI();
}

void kgWarning(const char* fmt, ...) {
  State& s = st();
  if (s.quiet) return;
  if (s.warningLimit != 0 && s.warningsPrinted >= s.warningLimit) {
    ++s.warnings;
    ++s.suppressed;
    return;
  }
  KG_FORMAT_ARGS(text);
  emit("Warning", text);
  ++s.warningsPrinted;
  kgWhereAmI();
  ++s.warnings;
}

void kgError(const char* fmt, ...) {
  State& s = st();
  if (s.quiet) return;
  KG_FORMAT_ARGS(text);
  emit("Error", text);
  ++s.errors;
  kgWhereAmI();
  supportNotice();
}

void kgLimitedError(const char* fmt, ...) {
  State& s = st();
  if (s.quiet) return;
  if (s.errorLimit != 0 && s.limitedErrorsPrinted >= s.errorLimit) {
    ++s.errors;
    ++s.suppressed;
    return;
  }
  KG_FORMAT_ARGS(text);
  emit("Error", text);
  ++s.limitedErrorsPrinted;
  kgWhereAmI();
  ++s.errors;
}

void kgInternalError(const char* fmt, ...) {
  int err = errno;
  KG_FORMAT_ARGS(text);
  emit("Internal error", text);
  systemErrorLine(err);
  kgWhereAmI();
  State& s = st();
  if (s.ignoreInternal) return;
  supportNotice();
  if (!s.continueInternal) fatalExit();
}

void kgFatal(const char* fmt, ...) {
  int err = errno;
  KG_FORMAT_ARGS(text);
  emit("Error", text);
  systemErrorLine(err);
  kgWhereAmI();
  fatalExit();
}

void kgFatalWithNotice(const char* fmt, ...) {
  int err = errno;
  KG_FORMAT_ARGS(text);
  supportNotice();
  emit("Error", text);
  systemErrorLine(err);
  kgWhereAmI();
  fatalExit();
}

void kgVerbose(const char* category, const char* fmt, ...) {
  bool enabled = false;
  for (const auto& c : st().verbose) enabled = enabled || c == category;
  if (!enabled) return;
  KG_FORMAT_ARGS(text);
  emit(category, text);
}

void kgFileWriteWarning(unsigned reason, const char* what, const char* name) {
  int err = errno;
  if (reason & 1) {
    kgWarning("Could not open %s %s for writing.  Cancelling.", what, name);
    systemErrorLine(err);
  } else if (reason & 2) {
    kgWarning("Write to %s %s: close failed; probably the file system is full.", what, name);
    systemErrorLine(err);
  } else if (reason & 4) {
    kgWarning("Write to %s %s failed.  Cancelling.", what, name);
    systemErrorLine(err);
  } else if (reason & (8 | 16)) {
    kgWarning("Bad %s filename option; write cancelled.", what);
  } else if (reason & 32) {
    kgWarning("File %s already exists; write cancelled.", name);
  }
}

void kgWhereAmI() {
  if (!whereAmIRequested()) return;
  void* frames[101];
  int n = backtrace(frames, 101);
  fprintf(stderr, "This is happening in %s:\n", st().label.c_str());
  for (int i = 0; i < n; ++i) fprintf(stderr, "%d: %p\n", i, frames[i]);
  fflush(stderr);
}

// ---- checked allocation ----

namespace {

[[noreturn]] void allocationFailed(int err, size_t request, const char* call) {
  if (err == ENOMEM) {
    struct rlimit rl;
    if (getrlimit(RLIMIT_DATA, &rl) == 0 && rl.rlim_cur != RLIM_INFINITY &&
        rl.rlim_cur != rl.rlim_max) {
      // The space left below the soft limit is unknown without sbrk accounting; the
      // heap end relative to the data start is the closest measure malloc offers.
      unsigned long used = 0;
      if (FILE* f = fopen("/proc/self/statm", "r")) {
        unsigned long size = 0, res = 0, shared = 0, text = 0, lib = 0, data = 0;
        if (fscanf(f, "%lu %lu %lu %lu %lu %lu", &size, &res, &shared, &text, &lib, &data) == 6)
          used = data * 4096UL;
        fclose(f);
      }
      unsigned long left = rl.rlim_cur > used ? rl.rlim_cur - used : 0;
      if (left <= request) {
        errno = 0;
        kgFatal(
            "Memory allocation failed during a request for %lu bytes.\n"
            "This is usually caused by exhausting the available swap space.\n"
            "This failure can also be caused by exceeding the data segment size limit.\n"
            "Space left in the data segment is %lu bytes.\n%s\n",
            static_cast<unsigned long>(request), left, call);
      }
    }
    errno = 0;
    kgFatal(
        "Memory allocation failed during a request for %lu bytes.\n"
        "This is usually caused by exhausting the available swap space.\n"
        "This failure can also be caused by exceeding the data segment size limit.\n%s\n",
        static_cast<unsigned long>(request), call);
  }
  errno = 0;
  kgFatal("Memory allocation failed with unknown error code %d during a request for %lu bytes.\n%s\n",
          err, static_cast<unsigned long>(request), call);
}

}  // namespace

void* kgMalloc(size_t size) {
  if (size == 0) size = 1;
  errno = 0;
  void* p = malloc(size);
  if (!p) allocationFailed(errno ? errno : ENOMEM, size, "Call to malloc failed.");
  return p;
}

void* kgRealloc(void* old, size_t size) {
  if (size == 0) size = 1;
  errno = 0;
  void* p = realloc(old, size);
  if (!p) allocationFailed(errno ? errno : ENOMEM, size, "Call to realloc failed.");
  return p;
}

char* kgStrdup(const char* s) {
  if (!s) {
    errno = 0;
    kgInternalError("NULL passed to strdup.");
    return nullptr;
  }
  errno = 0;
  char* p = strdup(s);
  if (!p) allocationFailed(errno ? errno : ENOMEM, strlen(s) + 1, "Call to strdup failed.");
  return p;
}

void kgFree(void* p) { free(p); }

// ---- checked strings ----

void Strcpyn(char* dst, const char* src, int capacity) {
  if (!dst || !src || capacity <= 0 || strlen(src) >= static_cast<size_t>(capacity))
    kgFatalWithNotice("Strcpyn: bad argument: %#lx %#lx %d", reinterpret_cast<unsigned long>(dst),
                      reinterpret_cast<unsigned long>(src), capacity);
  strcpy(dst, src);
}

void Strncpyn(char* dst, const char* src, int n, int capacity) {
  if (!dst || !src || n < 0 || capacity <= 0 || strnlen(src, n) >= static_cast<size_t>(capacity))
    kgFatalWithNotice("Strncpyn: bad argument: %#lx %#lx %d %d",
                      reinterpret_cast<unsigned long>(dst), reinterpret_cast<unsigned long>(src), n,
                      capacity);
  size_t len = strnlen(src, n);
  memcpy(dst, src, len);
  dst[len] = '\0';
}

void Strcatn(char* dst, const char* src, int capacity) {
  if (!dst || !src || capacity <= 0 ||
      strlen(dst) + strlen(src) >= static_cast<size_t>(capacity))
    kgFatalWithNotice("Strcatn: bad argument: %#lx %#lx %d", reinterpret_cast<unsigned long>(dst),
                      reinterpret_cast<unsigned long>(src), capacity);
  strcat(dst, src);
}

void Strncatn(char* dst, const char* src, int n, int capacity) {
  if (!dst || !src || n < 0 || capacity <= 0 ||
      strlen(dst) + strnlen(src, n) >= static_cast<size_t>(capacity))
    kgFatalWithNotice("Strncatn: bad argument: %#lx %#lx %d %d",
                      reinterpret_cast<unsigned long>(dst), reinterpret_cast<unsigned long>(src), n,
                      capacity);
  strncat(dst, src, n);
}

void StrcatnDots(char* dst, const char* src, int n, int capacity) {
  if (!dst || !src || n < 0 || capacity < 4 || strlen(dst) >= static_cast<size_t>(capacity))
    kgFatalWithNotice("StrcatnDots: bad argument: %#lx %#lx %d %d",
                      reinterpret_cast<unsigned long>(dst), reinterpret_cast<unsigned long>(src), n,
                      capacity);
  size_t have = strlen(dst);
  size_t want = strnlen(src, n);
  size_t room = static_cast<size_t>(capacity) - 1 - have;
  if (want <= room) {
    strncat(dst, src, want);
    return;
  }
  // Cut the text and mark the cut with "..." inside the capacity.
  size_t keep = room >= 3 ? room - 3 : 0;
  strncat(dst, src, keep);
  size_t len = strlen(dst);
  size_t dots = room >= 3 ? 3 : room;
  for (size_t i = 0; i < dots; ++i) dst[len + i] = '.';
  dst[len + dots] = '\0';
}

size_t kgStrlen(const char* s) {
  if (!s) {
    kgInternalError("NULL passed to strlen.");
    return 0;
  }
  return strlen(s);
}

int kgStrcmp(const char* a, const char* b) {
  if (!a || !b) {
    kgInternalError("NULL passed to strcmp.");
    return a == b ? 0 : (a ? 1 : -1);
  }
  return strcmp(a, b);
}

int kgStrncmp(const char* a, const char* b, size_t n) {
  if (!a || !b) {
    kgInternalError("NULL passed to strncmp.");
    return a == b ? 0 : (a ? 1 : -1);
  }
  return strncmp(a, b, n);
}

// ---- settings ----

int kgChooseLanguage(const char* name) {
  const char* value = (name && *name) ? name : nullptr;
  const char* vars[] = {"QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE", "LANG"};
  for (size_t i = 0; !value && i < sizeof vars / sizeof vars[0]; ++i) {
    const char* v = getenv(vars[i]);
    if (v && *v) value = v;
  }
  // "C.UTF-8" and "POSIX" are the C locale under other names (Debian's default is C.UTF-8);
  // they select English without the warning, as "C" does.
  if (!value || strcmp(value, "C") == 0 || strncmp(value, "C.", 2) == 0 ||
      strcmp(value, "POSIX") == 0)
    return 0;
  if (strncasecmp(value, "english", 2) == 0 && strlen(value) >= 2) return 0;
  if (strncasecmp(value, "japanese", 2) == 0 && strlen(value) >= 2) return 1;
  kgWarning("Unknown language \"%s\", using %s.", value, "English");
  return 0;
}
