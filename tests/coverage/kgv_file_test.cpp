// Reading and writing data files: both byte orders, the header checks, damaged and
// hostile files, exact round trips, and a write that fails half-way.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

#include "tests/coverage/kgv_test_util.h"

using namespace kgtest;

namespace {

const char* const kProgram = R"(
saveTime 1700000500
clockTime 250
cpuTime 120
record src/lib/util.c signature=0x1234 build=100 first=1700000000 last=1700000400 sessions=3
function parse line=12 calls=4
block 13 hits=4
blockline 14
block 16 hits=0
function "print all" line=30 calls=0
block 31 hits=0
record main.c signature=0x99 build=200 first=1700000100 last=1700000300
function main line=3 calls=1
block 4 hits=1
pad 3
)";

std::string withOrder(const std::string& order) { return "order " + order + "\n" + kProgram; }

}  // namespace
namespace kgtest {

}  // namespace

TEST(DataFiles, AFileFromAMachineOfTheOtherByteOrderReadsTheSame) {
  TempDir dir;
  auto swapped = readOk(makeKgv(dir, "swapped.kgv", withOrder("swapped")));
  auto native = readOk(makeKgv(dir, "native.kgv", withOrder("native")));
  ASSERT_TRUE(swapped && native);
  // The header's times and flags come out right too, not only the words that identify it.
  for (const KgvData* d : {swapped.get(), native.get()}) {
    EXPECT_EQ(d->header.saveTime, 1700000500u);
    EXPECT_EQ(d->header.clockTime, 250u);
    EXPECT_EQ(d->header.cpuTime, 120u);
    EXPECT_EQ(d->header.isJava, 0u);
    EXPECT_EQ(d->header.recordCount, 2u);
  }
  ASSERT_EQ(swapped->records.size(), 2u);
  EXPECT_EQ(swapped->recordSizes, native->recordSizes);
  for (size_t i = 0; i < 2; ++i) {
    const ObjRecord& s = *swapped->records[i];
    const ObjRecord& n = *native->records[i];
    EXPECT_STREQ(s.fileName(), n.fileName());
    EXPECT_EQ(describeMap(s), describeMap(n));
    EXPECT_EQ(s.objHeader.firstTime, n.objHeader.firstTime);
    EXPECT_EQ(s.objHeader.lastTime, n.objHeader.lastTime);
    EXPECT_EQ(s.objHeader.buildTime, n.objHeader.buildTime);
    EXPECT_EQ(s.objHeader.signature, n.objHeader.signature);
  }
  EXPECT_STREQ(native->records[0]->fileName(), "src/lib/util.c");
  EXPECT_EQ(describeMap(*native->records[0]),
            "F:src/lib/util.c:3 fn:parse:4 fl:12:0 b:13:4 bl:14:0 b:16:0 fn:print all:0 fl:30:0 "
            "b:31:0 ");

  // Java and hit-flag files of the other order keep their flags.
  auto java = readOk(makeKgv(dir, "java.kgv", "order swapped\njava 1\nhitFlags 1\n" + std::string(kProgram)));
  ASSERT_TRUE(java);
  EXPECT_EQ(java->header.isJava, 1u);
  EXPECT_EQ(java->header.hitFlagsOnly, 1u);
}

TEST(DataFiles, ReadingAndWritingBackReproducesTheFile) {
  TempDir dir;
  std::string original = makeKgv(dir, "a.kgv", withOrder("native"));
  auto d = readOk(original);
  ASSERT_TRUE(d);
  std::string copy = dir.file("copy.kgv");
  ASSERT_EQ(writeKgvFile(copy, *d), allOK);
  std::string before = readFile(original), after = readFile(copy);
  ASSERT_EQ(before.size(), after.size());
  // Only the save time differs.
  EXPECT_EQ(before.substr(0, 20), after.substr(0, 20));
  EXPECT_EQ(before.substr(24), after.substr(24));
  EXPECT_NE(d->header.saveTime, 1700000500u);
}

TEST(DataFiles, WritingFillsInUnknownTimes) {
  TempDir dir;
  auto d = readOk(makeKgv(dir, "a.kgv", "record a.c\nfunction f line=1 calls=1\nblock 2 hits=1\n"));
  ASSERT_TRUE(d);
  time_t before = time(nullptr);
  ASSERT_EQ(writeKgvFile(dir.file("b.kgv"), *d), allOK);
  auto back = readOk(dir.file("b.kgv"));
  ASSERT_TRUE(back);
  const ObjHeader& h = back->records[0]->objHeader;
  EXPECT_GE(h.lastTime, static_cast<std::uint32_t>(before));
  EXPECT_EQ(h.firstTime, h.lastTime);
  EXPECT_EQ(d->records[0]->objHeader.lastTime, h.lastTime);  // kept in memory too
}

TEST(DataFiles, RecordsWithAnOddNumberOfEntriesArePaddedToWholeWords) {
  TempDir dir;
  // Three entries: 64 + 8 (names) + 12 + 6 + 2 padding bytes = 92 bytes = 23 words.
  auto d = readOk(makeKgv(dir, "a.kgv", "record a.c\nfunction f calls=1\nblock 2 hits=1\n"));
  ASSERT_TRUE(d);
  EXPECT_EQ(d->recordSizes[0], 23u);
  EXPECT_EQ(recordWords(*d->records[0]), 23u);
}

TEST(DataFiles, HeaderChecksNameTheVersion) {
  TempDir dir;
  clearPendingSystemError();
  EXPECT_EQ(readCode(makeKgv(dir, "old.kgv", "version 3\noldest 2\n" + std::string(kProgram))),
            incompatibleVersion);
  EXPECT_EQ(errorMessage(incompatibleVersion),
            "The .kgv file is from an incompatible version of Kestrelgauge.\n"
            "Got a disk format version 3 file, wanted a version 5 file.");
  EXPECT_EQ(readCode(makeKgv(dir, "new.kgv", "version 7\noldest 5\n" + std::string(kProgram))),
            allOK);
  EXPECT_EQ(readCode(makeKgv(dir, "newer.kgv", "version 7\noldest 6\n" + std::string(kProgram))),
            incompatibleVersion);
  EXPECT_EQ(readCode(makeKgv(dir, "swold.kgv", "order swapped\nversion 3\n" + std::string(kProgram))),
            incompatibleVersion);
  clearPendingSystemError();
  EXPECT_EQ(readCode(makeKgv(dir, "kind.kgv", "kind 2\n" + std::string(kProgram))), notOurFile);
  EXPECT_EQ(readCode(makeKgv(dir, "wintally.kgv",
                             "text \"*Visual Kestrelgauge data file\"\n" + std::string(kProgram))),
            cfyFile);
  writeFile(dir.file("text.kgv"), std::string(200, 'x'));
  EXPECT_EQ(readCode(dir.file("text.kgv")), notOurFile);
  writeFile(dir.file("empty.kgv"), "");
  EXPECT_EQ(readCode(dir.file("empty.kgv")), fileTooShort);
  EXPECT_EQ(readCode(dir.file("missing.kgv")), openError);
  clearPendingSystemError();
}

TEST(DataFiles, EveryTruncationGivesACleanError) {
  TempDir dir;
  for (const char* order : {"native", "swapped"}) {
    std::string whole = readFile(makeKgv(dir, "a.kgv", withOrder(order)));
    for (size_t len = 0; len < whole.size(); ++len) {
      writeFile(dir.file("cut.kgv"), whole.substr(0, len));
      EXPECT_EQ(readCode(dir.file("cut.kgv")), fileTooShort) << order << " length " << len;
    }
    clearPendingSystemError();
  }
}

TEST(DataFiles, DamagedRecordsGiveTheirCodes) {
  TempDir dir;
  struct Case {
    const char* what;
    const char* text;
    ErrorCode code;
  } cases[] = {
      {"no records", "recordCount 0\nrecord a.c\n", corruptKgvFile},
      {"zero-sized record", "record a.c\nfunction f\nsize 0\n", corruptKgvFile},
      {"record smaller than its header", "record a.c\nsize 15\n", corruptKgvFile},
      {"map does not fit", "record a.c\nblock 3\nmapCount 1000\n", corruptKgvFile},
      {"strings do not fit", "record a.c\nblock 3\nstringWords 0x40000000\n", corruptKgvFile},
      {"huge map count", "record a.c\nmapCount 0xFFFFFFFF\n", corruptKgvFile},
      {"first entry not the file", "record a.c nofile=1\nfunction f\nentry 2 0 1\n",
       filenameNotFirst},
      {"empty map", "record a.c\nmapCount 0\n", filenameNotFirst},
      {"empty file name", "record \"\"\nfunction f line=2\n", filenameEmpty},
      {"file name outside the strings", "record a.c\nentry 2 400 1\nmapCount 2\n", corruptKgvFile},
      {"function name outside the strings", "record a.c\nentry 3 0x0FFFFFFF 1\n", corruptKgvFile},
      {"name running off the string area", "record a nofile=1\nstrings abcdefgh\nentry 2 4 1\n",
       corruptKgvFile},
      {"second record damaged", "record a.c\nrecord b.c\nentry 3 999 0\n", corruptKgvFile},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(readCode(makeKgv(dir, "bad.kgv", c.text)), c.code) << c.what;
  }
  clearPendingSystemError();
}

TEST(DataFiles, HostileSizesDoNotMakeTheReaderAllocate) {
  TempDir dir;
  // A header that promises four billion records and an index entry of 16 GB.
  EXPECT_EQ(readCode(makeKgv(dir, "a.kgv", "recordCount 0xFFFFFFFF\nrecord a.c\n")), fileTooShort);
  EXPECT_EQ(readCode(makeKgv(dir, "b.kgv", "record a.c\nsize 0xFFFFFFFF\n")), fileTooShort);
  EXPECT_EQ(readCode(makeKgv(dir, "c.kgv", "order swapped\nrecord a.c\nsize 0xFFFFFFF0\n")),
            fileTooShort);
  clearPendingSystemError();
}

TEST(DataFiles, AWriteThatFailsLeavesThePreviousFileIntact) {
  TempDir dir;
  std::string target = makeKgv(dir, "all.kgv", withOrder("native"));
  std::string before = readFile(target);
  auto big = readOk(makeKgv(dir, "big.kgv", "generate records=200 functions=5 blocks=8\n"));
  ASSERT_TRUE(big);

  // The disk fills up half-way: a file-size limit makes every write beyond 8 KB fail.
  pid_t pid = fork();
  ASSERT_GE(pid, 0);
  if (pid == 0) {
    signal(SIGXFSZ, SIG_IGN);
    struct rlimit lim {8192, 8192};
    setrlimit(RLIMIT_FSIZE, &lim);
    _exit(static_cast<int>(writeKgvFile(target, *big)));
  }
  int status = 0;
  ASSERT_EQ(waitpid(pid, &status, 0), pid);
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(static_cast<ErrorCode>(WEXITSTATUS(status)), fileWriteFailed);
  EXPECT_EQ(readFile(target), before);
  std::vector<std::string> left = filesIn(dir.path());
  EXPECT_EQ(left.size(), 2u) << "no temporary file may stay behind";

  // A target in a directory that does not exist cannot be created.
  EXPECT_EQ(writeKgvFile(dir.file("no/such/dir.kgv"), *big), writeError);
  clearPendingSystemError();
}

TEST(DataFiles, ALargeFileReadsTheSameFromDiskAndFromAPipeAcrossItsReadStretches) {
  TempDir dir;
  // Larger than the stretch the reader takes at a time, records straddling its ends.
  const std::string path =
      makeKgv(dir, "big.kgv", "generate records=1500 functions=50 blocks=20 seed=3 hits=1\n");
  const std::string bytes = readFile(path);
  ASSERT_GT(bytes.size(), size_t(10) << 20);
  auto fromDisk = readOk(path);
  ASSERT_TRUE(fromDisk);
  ASSERT_EQ(fromDisk->records.size(), 1500u);
  // Written back, it is the same file but for the save time.
  ASSERT_EQ(writeKgvFile(dir.file("copy.kgv"), *fromDisk), allOK);
  const std::string copy = readFile(dir.file("copy.kgv"));
  ASSERT_EQ(copy.size(), bytes.size());
  EXPECT_TRUE(copy.compare(0, 20, bytes, 0, 20) == 0 && copy.compare(24, std::string::npos, bytes, 24) == 0);

  const std::string fifo = dir.file("pipe.kgv");
  ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
  pid_t writer = fork();
  ASSERT_GE(writer, 0);
  if (writer == 0) {
    // Small writes, so the reader sees the data arrive in pieces.
    FILE* out = fopen(fifo.c_str(), "wb");
    for (size_t at = 0; out && at < bytes.size(); at += 4093)
      fwrite(bytes.data() + at, 1, std::min<size_t>(4093, bytes.size() - at), out);
    _exit(out && fclose(out) == 0 ? 0 : 1);
  }
  std::unique_ptr<KgvData> fromPipe;
  EXPECT_EQ(readKgvFile(fifo, fromPipe), allOK);
  int status = 0;
  waitpid(writer, &status, 0);
  ASSERT_TRUE(fromPipe);
  ASSERT_EQ(fromPipe->records.size(), fromDisk->records.size());
  for (size_t i = 0; i < fromDisk->records.size(); ++i) {
    const ObjRecord &a = *fromDisk->records[i], &b = *fromPipe->records[i];
    ASSERT_EQ(a.map, b.map) << i;
    ASSERT_EQ(a.counts, b.counts) << i;
    ASSERT_EQ(std::string(a.fileName()), std::string(b.fileName())) << i;
  }
  // Cut anywhere near the stretches' ends, the file is short, never misread.
  for (size_t cut : {size_t(8) << 20, (size_t(8) << 20) + 5, (size_t(8) << 20) - 4, bytes.size() - 1}) {
    writeFile(dir.file("cut.kgv"), bytes.substr(0, cut));
    EXPECT_EQ(readCode(dir.file("cut.kgv")), fileTooShort) << cut;
  }
  clearPendingSystemError();
}
