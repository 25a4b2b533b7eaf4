// The report printed when the process receives a fatal signal, and the external demangler.
#include <cxxabi.h>
#include <execinfo.h>
#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <ucontext.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "support/cleanup_paths.h"
#include "support/diagnostic.h"

namespace diag {
const std::vector<std::string>& priorInformation();
}

namespace {

volatile sig_atomic_t gInReport = 0;
std::string gVersionForReport;

// Formatted output straight to descriptor 2: stdio buffers may be what broke.
void out(const char* fmt, ...) __attribute__((format(printf, 1, 2)));
void out(const char* fmt, ...) {
  char buf[1024];
  va_list ap;
  va_start(ap, fmt);
  int n = vsnprintf(buf, sizeof buf, fmt, ap);
  va_end(ap);
  if (n < 0) return;
  size_t len = n < static_cast<int>(sizeof buf) ? static_cast<size_t>(n) : sizeof buf - 1;
  size_t done = 0;
  while (done < len) {
    ssize_t w = write(2, buf + done, len - done);
    if (w <= 0) break;
    done += static_cast<size_t>(w);
  }
}

// Whether 4 bytes at p can be read, tested by handing them to the kernel: a write from
// an unmapped address fails with EFAULT instead of faulting here.
bool readable(const void* p, int pipeFds[2]) {
  if (pipeFds[1] < 0) return false;
  ssize_t w = write(pipeFds[1], p, 4);
  if (w != 4) return false;
  char sink[4];
  if (read(pipeFds[0], sink, 4) != 4) return false;
  return true;
}

const char* signalName(int sig) {
  switch (sig) {
    case SIGHUP: return "SIGHUP";
    case SIGQUIT: return "SIGQUIT";
    case SIGILL: return "SIGILL";
    case SIGABRT: return "SIGABRT";
    case SIGFPE: return "SIGFPE";
    case SIGBUS: return "SIGBUS";
    case SIGSEGV: return "SIGSEGV";
    default: return "SIG?";
  }
}

void fatalSignal(int sig, siginfo_t* info, void* context) {
  if (gInReport) _exit(1);
  gInReport = 1;

  removeCleanupPaths();  // first: it cannot fail, whatever state the rest is in
  diag::runCleanups();

  const std::string& label = diag::label();
  out("%s %s got signal %d (%s - %s)\n", label.empty() ? "PANIC:" : label.c_str(),
      gVersionForReport.c_str(), sig, signalName(sig), strsignal(sig));

  auto* uc = static_cast<ucontext_t*>(context);
  unsigned long pc = 0, sp = 0;
#if defined(__x86_64__)
  if (uc) {
    pc = static_cast<unsigned long>(uc->uc_mcontext.gregs[REG_RIP]);
    sp = static_cast<unsigned long>(uc->uc_mcontext.gregs[REG_RSP]);
  }
#endif
  unsigned long addr = info ? reinterpret_cast<unsigned long>(info->si_addr) : 0;
  out(" sigcode=%d; pc=0x%lx sp=0x%lx addr=0x%lx\n", info ? info->si_code : 0, pc, sp, addr);

  out("The Kestrelgauge viewer%s%s has stopped because of an internal fault.\n"
      "Please report this to your Kestrelgauge support contact.  Include all of the\n"
      "messages printed here and, if you can, the .kgv data files you were viewing.\n",
      gVersionForReport.empty() ? "" : " ", gVersionForReport.c_str());

  void* frames[101];
  int n = backtrace(frames, 101);
  out("This is happening in %s:\n", label.c_str());
  for (int i = 0; i < n; ++i) out("%d: 0x%lx\n", i, reinterpret_cast<unsigned long>(frames[i]));

#if defined(__x86_64__)
  if (uc) {
    struct {
      const char* name;
      int reg;
    } regs[] = {{"rax", REG_RAX}, {"rcx", REG_RCX}, {"rdx", REG_RDX}, {"rbx", REG_RBX},
                {"rsi", REG_RSI}, {"rdi", REG_RDI}, {"r8", REG_R8},   {"r9", REG_R9},
                {"r10", REG_R10}, {"r11", REG_R11}, {"r12", REG_R12}, {"r13", REG_R13},
                {"r14", REG_R14}, {"r15", REG_R15}};
    for (const auto& r : regs)
      out("%%%s = 0x%llx\n", r.name,
          static_cast<unsigned long long>(uc->uc_mcontext.gregs[r.reg]));
  }
#endif

  int fds[2] = {-1, -1};
  if (pipe(fds) != 0) fds[0] = fds[1] = -1;
  unsigned long start = (addr >= 64 ? addr - 64 : 0) & ~3UL;
  unsigned long end = start + 128;
  out("memory contents from 0x%lx to 0x%lx:\n", start, end);
  for (unsigned long a = start; a < end; a += 4) {
    const void* p = reinterpret_cast<const void*>(a);
    if (readable(p, fds)) {
      unsigned char b[4];
      memcpy(b, p, 4);
      unsigned int word;
      memcpy(&word, b, 4);
      char text[5];
      for (int i = 0; i < 4; ++i) text[i] = (b[i] >= 32 && b[i] < 127) ? static_cast<char>(b[i]) : '.';
      text[4] = '\0';
      out("\t0x%.8lx: %.8x %s\n", a, word, text);
    } else {
      out("\t0x%.8lx: (unreadable)\n", a);
    }
  }

  const auto& prior = diag::priorInformation();
  if (!prior.empty()) {
    out("---- Prior information ----\n");
    for (const auto& p : prior) out("%s\n", p.c_str());
  }
  _exit(1);
}

// Interrupt and termination: what the process holds is given back, then the signal takes
// its ordinary course, so that the parent sees how the process ended.
void stopSignal(int sig) {
  removeCleanupPaths();
  signal(sig, SIG_DFL);
  raise(sig);
}

}  // namespace

void kgInstallSignalHandlers() {
  // backtrace() loads its unwinder on first use; do that now, not inside the handler.
  void* warm[1];
  backtrace(warm, 1);
  gVersionForReport = KG_VERSION;
  diag::setVersionText(KG_VERSION);

  static char altStack[64 * 1024];
  stack_t ss{};
  ss.ss_sp = altStack;
  ss.ss_size = sizeof altStack;
  sigaltstack(&ss, nullptr);

  struct sigaction sa {};
  sa.sa_sigaction = fatalSignal;
  sa.sa_flags = SA_SIGINFO | SA_ONSTACK;
  sigemptyset(&sa.sa_mask);
  for (int sig : {SIGHUP, SIGQUIT, SIGILL, SIGABRT, SIGFPE, SIGBUS, SIGSEGV}) sigaction(sig, &sa, nullptr);
  signal(SIGPIPE, SIG_IGN);

  struct sigaction stop {};
  stop.sa_handler = stopSignal;
  sigemptyset(&stop.sa_mask);
  for (int sig : {SIGINT, SIGTERM}) {
    // A shell that started us in the background with interrupts ignored keeps them so.
    struct sigaction old {};
    if (sigaction(sig, nullptr, &old) == 0 && old.sa_handler == SIG_IGN) continue;
    sigaction(sig, &stop, nullptr);
  }
}

// ---- demangling ----

namespace {
pid_t gDemanglerPid = -1;
FILE* gDemanglerIn = nullptr;   // we write names here
FILE* gDemanglerOut = nullptr;  // and read the demangled lines here

bool demanglerFailed(const char* program, const char* what) {
  kgWarning("Could not start the demangler %s (%s).  Using internal demangler.", program, what);
  return false;
}
}  // namespace

bool kgStartDemangler(const char* program) {
  if (!program || !*program) return demanglerFailed("(none)", "no program named");
  std::string path = program;
  if (path.find('/') == std::string::npos) {
    const char* pathEnv = getenv("PATH");
    std::string dirs = pathEnv ? pathEnv : "";
    std::string found;
    size_t pos = 0;
    while (found.empty() && pos <= dirs.size()) {
      size_t colon = dirs.find(':', pos);
      std::string dir = dirs.substr(pos, colon == std::string::npos ? std::string::npos : colon - pos);
      std::string candidate = (dir.empty() ? "." : dir) + "/" + program;
      if (access(candidate.c_str(), X_OK) == 0) found = candidate;
      if (colon == std::string::npos) break;
      pos = colon + 1;
    }
    if (found.empty()) return demanglerFailed(program, "not found");
    path = found;
  } else if (access(path.c_str(), X_OK) != 0) {
    return demanglerFailed(program, "not found");
  }
  int toChild[2], fromChild[2];
  if (pipe(toChild) != 0) return demanglerFailed(program, "pipe failed");
  if (pipe(fromChild) != 0) {
    close(toChild[0]);
    close(toChild[1]);
    return demanglerFailed(program, "pipe failed");
  }
  pid_t pid = fork();
  if (pid < 0) {
    close(toChild[0]); close(toChild[1]); close(fromChild[0]); close(fromChild[1]);
    return demanglerFailed(program, "fork failed");
  }
  if (pid == 0) {
    if (dup2(toChild[0], 0) < 0 || dup2(fromChild[1], 1) < 0) _exit(127);
    close(toChild[0]); close(toChild[1]); close(fromChild[0]); close(fromChild[1]);
    execl(path.c_str(), path.c_str(), static_cast<char*>(nullptr));
    _exit(127);
  }
  close(toChild[0]);
  close(fromChild[1]);
  gDemanglerIn = fdopen(toChild[1], "w");
  gDemanglerOut = fdopen(fromChild[0], "r");
  gDemanglerPid = pid;
  // An exec that failed shows as an immediate exit of the child.
  usleep(20000);
  int status;
  if (waitpid(pid, &status, WNOHANG) == pid) {
    fclose(gDemanglerIn);
    fclose(gDemanglerOut);
    gDemanglerIn = gDemanglerOut = nullptr;
    gDemanglerPid = -1;
    return demanglerFailed(program, "exec failed");
  }
  return true;
}

std::string kgDemangle(const char* name) {
  if (!name) return std::string();
  if (gDemanglerPid > 0 && gDemanglerIn && gDemanglerOut) {
    if (fprintf(gDemanglerIn, "%s\n", name) > 0 && fflush(gDemanglerIn) == 0) {
      char* line = nullptr;
      size_t cap = 0;
      ssize_t n = getline(&line, &cap, gDemanglerOut);
      if (n > 0) {
        std::string result(line, static_cast<size_t>(n));
        free(line);
        if (!result.empty() && result.back() == '\n') result.pop_back();
        return result;
      }
      free(line);
    }
    kgWarning("The demangler stopped answering.  Using internal demangler.");
    fclose(gDemanglerIn);
    fclose(gDemanglerOut);
    gDemanglerIn = gDemanglerOut = nullptr;
    waitpid(gDemanglerPid, nullptr, 0);
    gDemanglerPid = -1;
  }
  int status = 0;
  char* d = abi::__cxa_demangle(name, nullptr, nullptr, &status);
  if (status == 0 && d) {
    std::string result = d;
    free(d);
    return result;
  }
  free(d);
  return name;
}
