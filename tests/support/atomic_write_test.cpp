// Writing a user's file through a temporary file: success replaces, failure keeps.
#include "support/atomic_write.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include "tests/common/test_support.h"

TEST(AtomicWrite, ReplacesTheTargetAndKeepsItsPermissions) {
  kgtest::TempDir dir;
  std::string target = dir.file("settings");
  kgtest::writeFile(target, "old\n");
  ASSERT_EQ(chmod(target.c_str(), 0640), 0);
  AtomicFileWriter w;
  ASSERT_EQ(w.open(target), allOK);
  fputs("new\n", w.stream());
  EXPECT_EQ(kgtest::readFile(target), "old\n");  // nothing visible before the commit
  ASSERT_EQ(w.commit(), allOK);
  EXPECT_EQ(kgtest::readFile(target), "new\n");
  struct stat st;
  ASSERT_EQ(stat(target.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);
}

TEST(AtomicWrite, AFullDiskLeavesThePreviousFileIntact) {
  // /dev/full refuses every write with ENOSPC; a directory there is not possible, so the
  // failing stream is simulated by pointing the writer's stream at /dev/full.
  kgtest::TempDir dir;
  std::string target = dir.file("data");
  kgtest::writeFile(target, "precious");
  AtomicFileWriter w;
  ASSERT_EQ(w.open(target), allOK);
  std::string temp = w.temporaryPath();
  ASSERT_NE(freopen("/dev/full", "w", w.stream()), nullptr);
  fputs("replacement that cannot be stored", w.stream());
  EXPECT_EQ(w.commit(), fileWriteFailed);
  EXPECT_EQ(kgtest::readFile(target), "precious");
  EXPECT_FALSE(kgtest::fileExists(temp));
}

TEST(AtomicWrite, AnAbandonedWriteLeavesNoTrace) {
  kgtest::TempDir dir;
  std::string target = dir.file("never");
  {
    AtomicFileWriter w;
    ASSERT_EQ(w.open(target), allOK);
    fputs("half", w.stream());
  }
  EXPECT_FALSE(kgtest::fileExists(target));
  EXPECT_EQ(system(("test -z \"$(ls -A " + dir.path() + ")\"").c_str()), 0);
}

TEST(AtomicWrite, AnUnwritableDirectoryIsAnOpenError) {
  AtomicFileWriter w;
  EXPECT_EQ(w.open("/proc/no-such-dir/file"), writeError);
  clearPendingSystemError();
}
