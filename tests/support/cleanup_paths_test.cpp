// What a stopping signal leaves behind: nothing this process made for the moment only.
#include "support/cleanup_paths.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/atomic_write.h"
#include "support/diagnostic.h"
#include "support/temp_file.h"
#include "tests/common/test_support.h"

namespace {

bool exists(const std::string& p) {
  struct stat st;
  return lstat(p.c_str(), &st) == 0;
}

// Runs `work` in a child with the program's signal handlers, then stops the child with the
// signal; gives how it ended.
template <class Work>
int stopChildWith(int sig, Work work) {
  pid_t pid = fork();
  if (pid == 0) {
    kgInstallSignalHandlers();
    work();
    raise(sig);
    _exit(99);  // not reached when the signal ends the process
  }
  int status = 0;
  waitpid(pid, &status, 0);
  return status;
}

}  // namespace

TEST(StoppingSignals, RemoveHeldDirectoriesAndUnfinishedFiles) {
  for (int sig : {SIGTERM, SIGINT, SIGHUP}) {
    kgtest::TempDir dir;
    kgtest::TempDir tmp;
    std::string lock = dir.file(".lock.quor.a.kgv");
    std::string target = dir.file("a.kgv");
    kgtest::writeFile(target, "kept");
    setenv("TMPDIR", tmp.path().c_str(), 1);
    int status = stopChildWith(sig, [&] {
      kgResetTempDirectory();
      mkdir(lock.c_str(), 0222);
      registerCleanupPath(lock, CleanupPathKind::directory);
      static AtomicFileWriter w;  // never finished: the signal comes first
      if (w.open(target) != allOK) _exit(98);
      fputs("half", w.stream());
      fflush(w.stream());
      static TemporaryFile t;
      if (!t.create("kgtemp")) _exit(97);
      fclose(stderr);  // the SIGHUP report is not what this test reads
    });
    unsetenv("TMPDIR");
    kgResetTempDirectory();
    if (sig == SIGHUP) {
      EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 1) << status;
    } else {
      EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == sig) << "ends by the signal";
    }
    EXPECT_FALSE(exists(lock)) << strsignal(sig);
    EXPECT_EQ(kgtest::readFile(target), "kept");
    EXPECT_EQ(kgtest::runProcess({"/bin/ls", "-A", dir.path()}).out, "a.kgv\n") << strsignal(sig);
    EXPECT_EQ(kgtest::runProcess({"/bin/ls", "-A", tmp.path()}).out, "") << strsignal(sig);
  }
}

TEST(StoppingSignals, LeaveWhatWasFinishedOrIsAnotherProcesss) {
  kgtest::TempDir dir;
  std::string lock = dir.file(".lock.quor.a.kgv");
  std::string done = dir.file("done");
  int status = stopChildWith(SIGTERM, [&] {
    mkdir(lock.c_str(), 0222);
    registerCleanupPath(lock, CleanupPathKind::directory);
    // Broken and taken over by another process: a different directory of the same name.
    usleep(50000);
    rmdir(lock.c_str());
    mkdir(lock.c_str(), 0222);
    AtomicFileWriter w;
    if (w.open(done) != allOK || fputs("whole", w.stream()) < 0 || w.commit() != allOK) _exit(98);
    // A file made for the moment and then kept.
    kgtest::writeFile(dir.file("kept"), "k");
    unregisterCleanupPath(registerCleanupPath(dir.file("kept"), CleanupPathKind::file));
  });
  EXPECT_TRUE(WIFSIGNALED(status)) << status;
  EXPECT_TRUE(exists(lock));
  EXPECT_EQ(kgtest::readFile(done), "whole");
  EXPECT_TRUE(exists(dir.file("kept")));
  rmdir(lock.c_str());
}

TEST(StoppingSignals, AFullTableIsNoFaultAndFreedSlotsAreUsedAgain) {
  std::vector<int> slots;
  for (int i = 0; i < 200; ++i) slots.push_back(registerCleanupPath("/nonexistent/x", CleanupPathKind::file));
  EXPECT_EQ(slots.back(), -1);
  EXPECT_GE(slots.front(), 0);
  for (int s : slots) unregisterCleanupPath(s);
  int again = registerCleanupPath("/nonexistent/y", CleanupPathKind::file);
  EXPECT_GE(again, 0);
  unregisterCleanupPath(again);
}
