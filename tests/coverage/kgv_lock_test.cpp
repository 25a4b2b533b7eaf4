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
