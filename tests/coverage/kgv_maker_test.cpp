// The data-file maker as tests and benchmarks use it: descriptions become readable files,
// and mistakes in a description are named by line.
#include <gtest/gtest.h>

#include "tests/coverage/kgv_test_util.h"

using namespace kgtest;

TEST(DataFileMaker, TheToolWritesAFileFromADescription) {
  TempDir dir;
  writeFile(dir.file("a.txt"),
            "# a small program\nclockTime 25\nrecord \"src/with space.c\" build=100 sessions=2\n"
            "function main line=3 calls=1\nblock 4 hits=1\nblockline 5\nempty\n");
  ProcessResult r = runProcess({binPath("kgv-make"), dir.file("a.txt"), dir.file("a.kgv")});
  EXPECT_EQ(r.status, 0) << r.err;
  auto d = readOk(dir.file("a.kgv"));
  ASSERT_TRUE(d);
  EXPECT_EQ(d->header.clockTime, 25u);
  EXPECT_EQ(describeMap(*d->records[0]), "F:src/with space.c:2 fn:main:1 fl:3:0 b:4:1 bl:5:0 E:0:0 ");

  ProcessResult fromStdin = runProcess({binPath("kgv-make"), "-", dir.file("b.kgv")}, {},
                                       "order swapped\nrecord b.c\nfunction f\n");
  EXPECT_EQ(fromStdin.status, 0) << fromStdin.err;
  EXPECT_EQ(readCode(dir.file("b.kgv")), allOK);
}

TEST(DataFileMaker, MistakesAreNamedByLine) {
  TempDir dir;
  writeFile(dir.file("bad.txt"), "record a.c\nfunction f calls=70000\n");
  ProcessResult r = runProcess({binPath("kgv-make"), dir.file("bad.txt"), dir.file("bad.kgv")});
  EXPECT_EQ(r.status, 1);
  EXPECT_EQ(r.err, "kgv-make: " + dir.file("bad.txt") + ": line 2: bad number for calls: 70000\n");
  EXPECT_FALSE(fileExists(dir.file("bad.kgv")));

  std::string bytes, error;
  EXPECT_FALSE(makeKgvImage("block 3\n", bytes, error));
  EXPECT_EQ(error, "line 1: block before the first record");
  EXPECT_FALSE(makeKgvImage("record a.c\nfrobnicate\n", bytes, error));
  EXPECT_EQ(error, "line 2: unknown directive frobnicate");
  EXPECT_FALSE(makeKgvImage("record \"a.c\n", bytes, error));
  EXPECT_EQ(error, "line 1: unterminated quoted word");
  EXPECT_FALSE(makeKgvImage("record a.c colour=red\n", bytes, error));
  EXPECT_EQ(error, "line 1: unknown setting colour");
}

TEST(DataFileMaker, GeneratedFilesShareRecordsWhereTheirRangesOverlap) {
  TempDir dir;
  auto a = readOk(makeKgv(dir, "a.kgv", "generate records=4 first=0 functions=2 blocks=4 seed=1\n"));
  auto b = readOk(makeKgv(dir, "b.kgv", "generate records=4 first=2 functions=2 blocks=4 seed=2\n"));
  ASSERT_TRUE(a && b);
  ASSERT_EQ(a->records.size(), 4u);
  EXPECT_STREQ(a->records[2]->fileName(), "gen/dir0/file2.c");
  EXPECT_STREQ(b->records[0]->fileName(), "gen/dir0/file2.c");
  EXPECT_TRUE(sameVersion(*a->records[2], *b->records[0]));
  EXPECT_EQ(a->records[2]->map, b->records[0]->map);
  EXPECT_FALSE(sameVersion(*a->records[0], *b->records[0]));
}
