// Locks on data files: lock directories beside the file, waiting, breaking old locks, and
// the console lines a user sees while the viewer waits.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "coverage/kgv_load.h"
#include "coverage/kgv_lock.h"
#include "startup/console_report.h"
#include "tests/coverage/kgv_test_util.h"

using namespace kgtest;

namespace {

// Every test starts from the program's settings and leaves them so.
class Locks : public testing::Test {
 protected:
  void SetUp() override {
    setLockingEnabled(true);
    setLockTimes(45, 120, 10);
    setLockWaitCallback(consoleLockReporter);
    resetConsoleLockReporter();
    setLockSleeper(nullptr);
    clearPendingSystemError();
  }
  void TearDown() override {
    setLockingEnabled(true);
    setLockTimes(360, 120, 10);
    setLockWaitCallback(nullptr);
    setLockSleeper(nullptr);
    clearPendingSystemError();
  }
  TempDir dir;
  std::string kgv = makeKgv(dir, "a.kgv", "record a.c\nfunction f line=1 calls=1\nblock 2 hits=1\n");
  std::string lock = dir.file(".lock.quor.a.kgv");
};

bool isDirectory(const std::string& p) {
  struct stat st;
  return lstat(p.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

}  // namespace

TEST_F(Locks, TheLockIsADirectoryBesideTheFile) {
  std::string name;
  ASSERT_EQ(kgvLockName("/home/u/a.out.kgv", name), allOK);
  EXPECT_EQ(name, "/home/u/.lock.quor.a.out.kgv");
  ASSERT_EQ(kgvLockName("a.kgv", name), allOK);
  EXPECT_EQ(name, ".lock.quor.a.kgv");
  EXPECT_EQ(lockKgvFile(""), noLockFilename);
  EXPECT_EQ(lockKgvFile(std::string(4085, 'x')), filenameTooLong);
  EXPECT_EQ(unlockKgvFile(std::string(4085, 'x')), filenameTooLong);

  ASSERT_EQ(lockKgvFile(kgv), allOK);
  EXPECT_TRUE(isDirectory(lock));
  struct stat st;
  ASSERT_EQ(stat(lock.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0222u);
  ASSERT_EQ(unlockKgvFile(kgv), allOK);
  EXPECT_FALSE(isDirectory(lock));
  // A lock that someone else already removed is not an error.
  EXPECT_EQ(unlockKgvFile(kgv), allOK);
}

TEST_F(Locks, AProcessHoldingALockCanTakeItAgainUnderAnotherName) {
  setLockSleeper([] { ADD_FAILURE() << "waited for its own lock"; });
  std::string other = dir.path() + "/./a.kgv";
  ASSERT_EQ(lockKgvFile(kgv), allOK);
  ASSERT_EQ(lockKgvFile(other), allOK);
  EXPECT_EQ(unlockKgvFile(kgv), allOK);
  EXPECT_TRUE(isDirectory(lock)) << "still held once";
  EXPECT_EQ(unlockKgvFile(other), allOK);
  EXPECT_FALSE(isDirectory(lock));
  // Held no more: someone else's lock of the same name is waited for.
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  int waits = 0;
  setLockSleeper([&] { ++waits; });
  setLockTimes(0, 3, 0);
  EXPECT_EQ(lockKgvFile(kgv), lockWaitLong);
  EXPECT_EQ(waits, 3);
}

TEST_F(Locks, WithLockingOffNothingIsCreated) {
  setLockingEnabled(false);
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);  // even a busy lock does not stop the load
  KgvFileRef ref = makeKgvFileRef(kgv);
  std::unique_ptr<KgvData> d;
  EXPECT_EQ(loadKgvFile(ref, d), allOK);
  EXPECT_TRUE(isDirectory(lock));
  ASSERT_EQ(rmdir(lock.c_str()), 0);
  EXPECT_EQ(loadKgvFile(ref, d), allOK);
  EXPECT_EQ(filesIn(dir.path()), std::vector<std::string>{"a.kgv"});
}

TEST_F(Locks, AStaleLockIsBrokenAndTheFileLoads) {
  setLockTimes(1, 0, 0);  // a lock older than a second is stale here
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  KgvFileRef ref = makeKgvFileRef(kgv);
  std::unique_ptr<KgvData> d;
  testing::internal::CaptureStderr();
  ErrorCode rc = loadKgvFile(ref, d);
  std::string err = testing::internal::GetCapturedStderr();
  EXPECT_EQ(rc, allOK);
  EXPECT_TRUE(d);
  EXPECT_EQ(err, "Kestrelgauge: Breaking old lock on " + kgv + "\nKestrelgauge: (lock name: " +
                     lock + ")\n");
  EXPECT_FALSE(isDirectory(lock)) << "the load unlocks again";
}

TEST_F(Locks, AHeldLockMakesTheLoaderWaitAndSayWhy) {
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  // Another process holds the lock for ten and a half seconds.
  pid_t holder = fork();
  ASSERT_GE(holder, 0);
  if (holder == 0) {
    usleep(10500000);
    rmdir(lock.c_str());
    _exit(0);
  }
  KgvFileRef ref = makeKgvFileRef(kgv);
  std::unique_ptr<KgvData> d;
  testing::internal::CaptureStderr();
  ErrorCode rc = loadKgvFile(ref, d);
  std::string err = testing::internal::GetCapturedStderr();
  int status = 0;
  waitpid(holder, &status, 0);
  EXPECT_EQ(rc, allOK);
  std::string waiting = "Kestrelgauge: Waiting for lock on " + kgv +
                        "\nKestrelgauge: (Will break lock if it gets older than 45 seconds.)\n"
                        "Kestrelgauge: (lock name: " + lock + ")\n";
  EXPECT_EQ(err, waiting + waiting);  // after the 5th and the 10th second
}

TEST_F(Locks, ALockThatNeverGoesAwayEndsTheWait) {
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  int seconds = 0;
  setLockSleeper([&] { ++seconds; });  // the seconds pass at once
  setLockWaitCallback(nullptr);
  EXPECT_EQ(lockKgvFile(kgv), lockWaitLong);
  EXPECT_EQ(seconds, 120);
  EXPECT_EQ(errorMessage(lockWaitLong),
            "Could not get the file lock after too much elapsed time.\n120 timeouts were tried "
            "while trying to lock " + kgv);
  EXPECT_TRUE(isDirectory(lock)) << "someone else's lock stays";
}

TEST_F(Locks, TheCallbackCanAbandonTheWait) {
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  std::vector<std::string> asked;
  setLockWaitCallback([&](int event, const std::string& path, const std::string& name) {
    asked.push_back(std::to_string(event) + " " + path + " " + name);
    return false;
  });
  KgvFileRef ref = makeKgvFileRef(kgv);
  std::unique_ptr<KgvData> d;
  EXPECT_EQ(loadKgvFile(ref, d), lockAborted);
  EXPECT_EQ(asked, std::vector<std::string>{"1 " + kgv + " " + lock});
  EXPECT_EQ(ref.loadTime, 0u);

  // Refusing to break an old lock abandons too.
  setLockTimes(1, 0, 0);
  sleep(2);
  asked.clear();
  EXPECT_EQ(lockKgvFile(kgv), lockAborted);
  EXPECT_EQ(asked, std::vector<std::string>{"2 " + kgv + " " + lock});
  EXPECT_TRUE(isDirectory(lock));
}

TEST_F(Locks, LocksThatCannotBeMadeOrRemovedAreReported) {
  // No directory to put the lock in.
  std::string nowhere = dir.file("missing/a.kgv");
  EXPECT_EQ(lockKgvFile(nowhere), lockDirNotCreated);
  EXPECT_NE(errorMessage(lockDirNotCreated).find("Lock name: " + dir.file("missing/.lock.quor.a.kgv")),
            std::string::npos);

  // An old lock that is not empty cannot be removed.
  ASSERT_EQ(mkdir(lock.c_str(), 0777), 0);
  writeFile(lock + "/note", "x");
  setLockTimes(1, 0, 0);
  setLockWaitCallback(nullptr);
  sleep(2);
  EXPECT_EQ(lockKgvFile(kgv), lockDirNotRemove);
  EXPECT_EQ(unlockKgvFile(kgv), lockDirNotRemove);
  clearPendingSystemError();
}

TEST_F(Locks, AHeldLockStaysFreshSoPeersNeverTakeItForLeftOver) {
  ASSERT_EQ(lockKgvFile(kgv), allOK);
  struct stat st;
  ASSERT_EQ(stat(lock.c_str(), &st), 0);
  const time_t made = st.st_ctime;
  // Long work while the lock is held: peers break locks older than their break age.
  sleep(7);
  ASSERT_EQ(stat(lock.c_str(), &st), 0);
  EXPECT_GT(st.st_ctime, made);
  EXPECT_LE(time(nullptr) - st.st_ctime, 5) << "renewed well within ten seconds";
  EXPECT_EQ(st.st_mode & 0777, 0222u);
  ASSERT_EQ(unlockKgvFile(kgv), allOK);
  EXPECT_FALSE(isDirectory(lock));
}

TEST_F(Locks, AWriterWhoseLockWasBrokenLeavesTheBreakersFileAndLock) {
  ASSERT_EQ(lockKgvFile(kgv), allOK);
  std::unique_ptr<KgvData> mine = readOk(kgv);
  // Another process found the lock old, broke it and wrote the file under its own lock. (A
  // breaker comes at least the break age later; a moment later is enough to tell the
  // directories apart even when the new one gets the same inode number.)
  usleep(50000);
  ASSERT_EQ(rmdir(lock.c_str()), 0);
  ASSERT_EQ(mkdir(lock.c_str(), 0222), 0);
  std::string theirs = "theirs";
  writeFile(kgv, theirs);

  EXPECT_EQ(checkKgvLockHeld(kgv), unabelToLock);
  EXPECT_EQ(writeKgvFile(kgv, *mine), unabelToLock);
  EXPECT_NE(errorMessage(unabelToLock).find("The lock " + lock +
                                            " was broken by another process while this one held it"),
            std::string::npos);
  EXPECT_EQ(readFile(kgv), theirs);
  EXPECT_EQ(unlockKgvFile(kgv), allOK);
  EXPECT_TRUE(isDirectory(lock)) << "the breaker's lock is not ours to remove";
  EXPECT_EQ(filesIn(dir.path()), (std::vector<std::string>{".lock.quor.a.kgv", "a.kgv"}));
  // Gone as well: the same answer.
  ASSERT_EQ(rmdir(lock.c_str()), 0);
  ASSERT_EQ(lockKgvFile(kgv), allOK);
  ASSERT_EQ(rmdir(lock.c_str()), 0);
  EXPECT_EQ(writeKgvFile(kgv, *mine), unabelToLock);
  EXPECT_EQ(unlockKgvFile(kgv), allOK);
  clearPendingSystemError();
}

TEST_F(Locks, TheLockHolderClearsNewCopiesThatKilledWritersLeft) {
  std::unique_ptr<KgvData> d = readOk(kgv);
  const std::string left = dir.file(".a.kgv.new.Qx7Lp2");
  writeFile(left, std::string(4096, 'x'));
  writeFile(dir.file(".a.kgv.new.notes"), "not one of ours");
  writeFile(dir.file(".b.kgv.new.Qx7Lp2"), "another file's");
  // Without the lock another writer may be at work: its copy stays.
  setLockingEnabled(false);
  ASSERT_EQ(writeKgvFile(kgv, *d), allOK);
  EXPECT_TRUE(fileExists(left));
  setLockingEnabled(true);
  ASSERT_EQ(lockKgvFile(kgv), allOK);
  ASSERT_EQ(writeKgvFile(kgv, *d), allOK);
  ASSERT_EQ(unlockKgvFile(kgv), allOK);
  EXPECT_EQ(filesIn(dir.path()),
            (std::vector<std::string>{".a.kgv.new.notes", ".b.kgv.new.Qx7Lp2", "a.kgv"}));
}

TEST_F(Locks, ATargetReachedThroughALinkIsWrittenThroughIt) {
  std::unique_ptr<KgvData> d = readOk(kgv);
  ASSERT_EQ(mkdir(dir.file("shared").c_str(), 0755), 0);
  std::string real = dir.file("shared/run.kgv");
  std::string link = dir.file("run.kgv");
  writeFile(real, "old");
  ASSERT_EQ(chmod(real.c_str(), 0640), 0);
  ASSERT_EQ(symlink("shared/run.kgv", link.c_str()), 0);
  ASSERT_EQ(lockKgvFile(link), allOK);
  ASSERT_EQ(writeKgvFile(link, *d), allOK);
  ASSERT_EQ(unlockKgvFile(link), allOK);
  struct stat st;
  ASSERT_EQ(lstat(link.c_str(), &st), 0);
  EXPECT_TRUE(S_ISLNK(st.st_mode));
  ASSERT_EQ(stat(real.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);
  EXPECT_EQ(readOk(real)->records.size(), d->records.size());
  EXPECT_EQ(filesIn(dir.file("shared")), std::vector<std::string>{"run.kgv"});
}

TEST_F(Locks, NonRegularFilesAreRefusedBeforeAnyLock) {
  ASSERT_EQ(mkfifo(dir.file("pipe.kgv").c_str(), 0600), 0);
  ASSERT_EQ(mkdir(dir.file("dir.kgv").c_str(), 0755), 0);
  struct Case {
    std::string path, kind;
  };
  for (const Case& c : {Case{dir.file("pipe.kgv"), "a FIFO (named pipe)"},
                        Case{dir.file("dir.kgv"), "a directory"},
                        Case{"/dev/zero", "a character device"}}) {
    KgvFileRef ref = makeKgvFileRef(c.path);
    std::unique_ptr<KgvData> d;
    EXPECT_EQ(loadKgvFile(ref, d), notOurFile) << c.path;
    EXPECT_NE(errorMessage(notOurFile).find(c.path + " is " + c.kind + ", not a data file."),
              std::string::npos) << c.path;
  }
  EXPECT_EQ(filesIn(dir.path()), (std::vector<std::string>{"a.kgv", "dir.kgv", "pipe.kgv"}));
}
