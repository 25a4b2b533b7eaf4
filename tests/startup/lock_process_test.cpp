// Several processes at one data file, as on a shared build machine: a writer paused past
// the break age, writers stopped by signals, FIFOs and directories named as data files,
// new copies left by killed writers.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/coverage/kgv_test_util.h"

using kgtest::BackgroundProcess;
using kgtest::runProcess;

namespace {

std::string kestrel() { return kgtest::binPath("kestrel"); }

class SharedDataFile : public testing::Test {
 protected:
  std::vector<std::string> env() const {
    return {"DISPLAY", "QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE", "LANG=C",
            "QUOR_WHERE_AM_I", "HOME=" + dir.path()};
  }
  // A data file of one run whose block was hit `hits` times.
  std::string run(const std::string& name, int hits) {
    return kgtest::makeKgv(dir, name,
                           "record src/a.c build=100 first=1700000000 last=1700000100\n"
                           "function main line=3 calls=1\nblock 4 hits=" +
                               std::to_string(hits) + "\n");
  }
  unsigned hitsIn(const std::string& name) {
    auto d = kgtest::readOk(dir.file(name));
    return d && d->records.size() == 1 ? d->records[0]->counts.back() : 0;
  }
  bool isDirectory(const std::string& name) const {
    struct stat st;
    return lstat(dir.file(name).c_str(), &st) == 0 && S_ISDIR(st.st_mode);
  }
  // A merge into all.kgv that holds the target's lock while it waits for the lock of its
  // input, which the test holds.
  std::unique_ptr<BackgroundProcess> mergeWaitingFor(const std::string& input) {
    EXPECT_EQ(mkdir(dir.file(".lock.quor." + input).c_str(), 0222), 0);
    auto p = std::make_unique<BackgroundProcess>(
        std::vector<std::string>{kestrel(), "-merge=all.kgv", "all.kgv", input}, env(), dir.path());
    EXPECT_TRUE(kgtest::waitUntil(20, [&] { return isDirectory(".lock.quor.all.kgv"); }));
    usleep(500000);  // past the read of all.kgv, waiting for the input
    return p;
  }

  kgtest::TempDir dir;
};

}  // namespace

TEST_F(SharedDataFile, AWriterPausedPastTheBreakAgeLeavesTheBreakersResult) {
  run("all.kgv", 1);
  run("a.kgv", 10);
  run("b.kgv", 100);
  auto first = mergeWaitingFor("a.kgv");
  // The first writer stops (a slow disk, a suspended job) while it holds the lock.
  first->signal(SIGSTOP);
  ASSERT_EQ(rmdir(dir.file(".lock.quor.a.kgv").c_str()), 0);
  // The second finds the lock older than the break age, breaks it and merges.
  auto second = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "b.kgv"}, env(), "", dir.path());
  EXPECT_EQ(second.status, 0) << second.err;
  EXPECT_NE(second.err.find("Kestrelgauge: Breaking old lock on all.kgv\n"), std::string::npos)
      << second.err;
  EXPECT_EQ(hitsIn("all.kgv"), 101u);
  // The first goes on, finds its lock gone and writes nothing.
  first->signal(SIGCONT);
  auto r = first->wait();
  EXPECT_EQ(r.status, 13) << r.err;
  EXPECT_NE(r.err.find("Kestrelgauge: Couldn't write the file all.kgv.\nUnable to lock the file.\n"
                       "The lock .lock.quor.all.kgv was broken by another process while this one "
                       "held it, so all.kgv was not written."),
            std::string::npos) << r.err;
  EXPECT_EQ(hitsIn("all.kgv"), 101u) << "the second writer's counts stay";
  EXPECT_EQ(kgtest::filesIn(dir.path()), (std::vector<std::string>{"a.kgv", "all.kgv", "b.kgv"}));
}

TEST_F(SharedDataFile, AStoppedWriterGivesBackItsLockSoTheNextRunDoesNotWait) {
  run("all.kgv", 1);
  run("in.kgv", 10);
  const std::string before = kgtest::readFile(dir.file("all.kgv"));
  struct Stop {
    int sig;
    int status;
  };
  for (Stop stop : {Stop{SIGTERM, 128 + SIGTERM}, Stop{SIGINT, 128 + SIGINT}, Stop{SIGHUP, 1}}) {
    auto writer = mergeWaitingFor("in.kgv");
    if (stop.sig == SIGTERM) {
      // Waiting is long work too: the held lock stays fresh meanwhile.
      sleep(6);
      struct stat st;
      ASSERT_EQ(stat(dir.file(".lock.quor.all.kgv").c_str(), &st), 0);
      EXPECT_LE(time(nullptr) - st.st_ctime, 5);
    }
    writer->signal(stop.sig);
    auto r = writer->wait();
    EXPECT_EQ(r.status, stop.status) << strsignal(stop.sig) << "\n" << r.err;
    EXPECT_FALSE(isDirectory(".lock.quor.all.kgv")) << strsignal(stop.sig);
    EXPECT_EQ(kgtest::readFile(dir.file("all.kgv")), before);
    ASSERT_EQ(rmdir(dir.file(".lock.quor.in.kgv").c_str()), 0);
    EXPECT_EQ(kgtest::filesIn(dir.path()), (std::vector<std::string>{"all.kgv", "in.kgv"}));
  }
  auto next = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "in.kgv"}, env(), "", dir.path());
  EXPECT_EQ(next.status, 0);
  EXPECT_EQ(next.err, "") << "no waiting for a dead lock";
  EXPECT_EQ(hitsIn("all.kgv"), 11u);
}

TEST_F(SharedDataFile, AFifoADirectoryOrADeviceIsRefusedAtOnce) {
  run("all.kgv", 1);
  ASSERT_EQ(mkfifo(dir.file("pipe.kgv").c_str(), 0600), 0);
  ASSERT_EQ(mkdir(dir.file("dir.kgv").c_str(), 0755), 0);
  struct Case {
    std::string name, kind;
  };
  for (const Case& c : {Case{"pipe.kgv", "a FIFO (named pipe)"}, Case{"dir.kgv", "a directory"},
                        Case{"/dev/zero", "a character device"}}) {
    auto r = runProcess({kestrel(), "-export", c.name}, env(), "", dir.path());
    EXPECT_EQ(r.status, 25);
    EXPECT_EQ(r.err, "Kestrelgauge: Can't load file " + c.name +
                         ".\nThe file is not a .kgv-format file.\n" + c.name + " is " + c.kind +
                         ", not a data file.\n\n");
    r = runProcess({kestrel(), "-merge=" + c.name, "all.kgv"}, env(), "", dir.path());
    EXPECT_EQ(r.status, 25);
    EXPECT_EQ(r.err, "Kestrelgauge: Couldn't write the file " + c.name +
                         ".\nThe file is not a .kgv-format file.\n" + c.name + " is " + c.kind +
                         ", not a data file.\n\n");
  }
  EXPECT_EQ(kgtest::filesIn(dir.path()), (std::vector<std::string>{"all.kgv", "dir.kgv", "pipe.kgv"}));
}

TEST_F(SharedDataFile, TheNextWriterClearsCopiesThatKilledWritersLeft) {
  run("all.kgv", 1);
  run("in.kgv", 10);
  kgtest::writeFile(dir.file(".all.kgv.new.k9Xw2Q"), std::string(1 << 20, '\0'));
  kgtest::writeFile(dir.file(".all.kgv.new.a1B2c3"), "half a file");
  auto r = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "in.kgv"}, env(), "", dir.path());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(kgtest::filesIn(dir.path()), (std::vector<std::string>{"all.kgv", "in.kgv"}));
  EXPECT_EQ(hitsIn("all.kgv"), 11u);
}
