// Start-up's loading of the data files and the console merge (kestrel -merge=OUT FILE...).
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "coverage/kgv_file.h"
#include "coverage/kgv_lock.h"
#include "startup/load_files.h"
#include "startup/merge_mode.h"
#include "tests/coverage/kgv_test_util.h"

using namespace kgtest;

namespace {

const char* const kOld = "record s.c signature=1 build=100\nfunction f line=1 calls=1\nblock 2 hits=1\n"
                         "record t.c signature=1 build=100\nfunction g line=1 calls=1\n";
const char* const kNew = "record t.c signature=2 build=200\nfunction g line=1 calls=2\n"
                         "record s.c signature=2 build=200\nfunction f line=1 calls=3\nblock 2 hits=3\n";
const char* const kRun = "clockTime 10\nrecord s.c signature=5 build=100 first=1000 last=2000\n"
                         "function f line=1 calls=1\nblock 2 hits=1\n";

StartupState stateFor(const std::vector<std::string>& files, const std::string& target = {}) {
  StartupState s;
  s.fileArgs = files;
  s.mergeTarget = target;
  s.mode = target.empty() ? RunMode::view : RunMode::merge;
  testing::internal::CaptureStderr();
  s.loadedFiles = buildFileList(files);
  testing::internal::GetCapturedStderr();
  return s;
}

class StartupLoading : public testing::Test {
 protected:
  void TearDown() override {
    setLockingEnabled(true);
    clearPendingSystemError();
  }
  TempDir dir;
};

}  // namespace

TEST_F(StartupLoading, AFileThatCannotBeLoadedIsNamedOnTheConsole) {
  std::string good = makeKgv(dir, "good.kgv", kOld);
  writeFile(dir.file("bad.kgv"), std::string(100, 'x'));
  StartupState s = stateFor({good, dir.file("bad.kgv")});
  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;
  testing::internal::CaptureStderr();
  ErrorCode rc = loadStartupFiles(s, data, ignored);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Kestrelgauge: Can't load file " + dir.file("bad.kgv") +
                ".\nThe file is not a .kgv-format file.\n\n");
  EXPECT_EQ(rc, notOurFile);
  EXPECT_FALSE(data);
  EXPECT_TRUE(s.loadedFiles.empty());
}

TEST_F(StartupLoading, OutOfDateSourcesAreListedOnceInOrder) {
  std::string oldA = makeKgv(dir, "a.kgv", kOld);
  std::string newer = makeKgv(dir, "b.kgv", kNew);
  std::string oldC = makeKgv(dir, "c.kgv", kOld);
  StartupState s = stateFor({oldA, newer, oldC});
  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;
  EXPECT_EQ(loadStartupFiles(s, data, ignored), mergeIgnored);
  EXPECT_EQ(ignored, (std::vector<std::string>{"s.c", "t.c"}));
  ASSERT_TRUE(data);
  EXPECT_EQ(data->records[0]->objHeader.buildTime, 200u);
  EXPECT_EQ(s.loadedFiles.size(), 3u);
  EXPECT_FALSE(s.isJava);

  StartupState j = stateFor({makeKgv(dir, "j.kgv", "java 1\nrecord A.java\nfunction a line=1\n")});
  EXPECT_EQ(loadStartupFiles(j, data, ignored), allOK);
  EXPECT_TRUE(j.isJava);
}

TEST_F(StartupLoading, WithLockingOffABusyLockDoesNotDelayTheLoad) {
  std::string a = makeKgv(dir, "a.kgv", kOld);
  ASSERT_EQ(mkdir(dir.file(".lock.quor.a.kgv").c_str(), 0777), 0);
  StartupState s = stateFor({a});
  s.lockingEnabled = false;
  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;
  time_t start = time(nullptr);
  EXPECT_EQ(loadStartupFiles(s, data, ignored), allOK);
  EXPECT_LE(time(nullptr) - start, 1);
}

TEST_F(StartupLoading, MergingIntoOneOfTheInputsAccumulatesRuns) {
  std::string all = makeKgv(dir, "all.kgv", kRun);
  std::string run2 = makeKgv(dir, "run2.kgv", kRun);
  std::string run3 = makeKgv(dir, "run3.kgv", kRun);
  for (const std::string& run : {run2, run3}) {
    StartupState s = stateFor({all, run}, all);
    testing::internal::CaptureStderr();
    EXPECT_EQ(runMergeMode(s), allOK);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  }
  auto d = readOk(all);
  ASSERT_TRUE(d);
  EXPECT_EQ(describeMap(*d->records[0]), "F:s.c:3 fn:f:3 fl:1:0 b:2:3 ");
  EXPECT_EQ(d->header.clockTime, 30u);
  EXPECT_EQ(filesIn(dir.path()).size(), 3u) << "no lock or temporary file stays";
}

TEST_F(StartupLoading, MergingOutOfDateDataNotesTheFilesAndSucceeds) {
  std::string a = makeKgv(dir, "a.kgv", kOld);
  std::string b = makeKgv(dir, "b.kgv", kNew);
  StartupState s = stateFor({a, b}, dir.file("out.kgv"));
  testing::internal::CaptureStderr();
  EXPECT_EQ(runMergeMode(s), allOK);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Kestrelgauge: Some coverage for these files was out of date:\ns.c\nt.c\n\n");
  auto d = readOk(dir.file("out.kgv"));
  ASSERT_TRUE(d);
  EXPECT_EQ(d->records.size(), 2u);

  StartupState one = stateFor({makeKgv(dir, "c.kgv", "record s.c signature=3 build=50\nfunction f line=1\n"), b},
                              dir.file("out2.kgv"));
  testing::internal::CaptureStderr();
  EXPECT_EQ(runMergeMode(one), allOK);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Kestrelgauge: Some coverage for this file was out of date:\ns.c\n\n");
}

TEST_F(StartupLoading, AFailedMergeLeavesTheTargetAsItWas) {
  std::string all = makeKgv(dir, "all.kgv", kRun);
  std::string before = readFile(all);
  std::string big = makeKgv(dir, "big.kgv", "generate records=300 functions=4 blocks=8\n");

  // The disk is full: the write fails half-way.
  pid_t pid = fork();
  ASSERT_GE(pid, 0);
  if (pid == 0) {
    signal(SIGXFSZ, SIG_IGN);
    struct rlimit lim {16384, 16384};
    setrlimit(RLIMIT_FSIZE, &lim);
    StartupState s = stateFor({all, big}, all);
    _exit(static_cast<int>(runMergeMode(s)));
  }
  int status = 0;
  ASSERT_EQ(waitpid(pid, &status, 0), pid);
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), static_cast<int>(fileWriteFailed));
  EXPECT_EQ(readFile(all), before);

  // A damaged input: nothing is written.
  writeFile(dir.file("bad.kgv"), "");
  StartupState s = stateFor({all, dir.file("bad.kgv")}, all);
  testing::internal::CaptureStderr();
  EXPECT_EQ(runMergeMode(s), fileTooShort);
  EXPECT_NE(testing::internal::GetCapturedStderr().find("Can't load file"), std::string::npos);
  EXPECT_EQ(readFile(all), before);
  EXPECT_EQ(filesIn(dir.path()).size(), 3u) << "no lock or temporary file stays";
}
