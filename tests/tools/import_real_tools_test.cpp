// kestrel-import on coverage the machine's own gcc, gcov and lcov produce during the test.
#include <gtest/gtest.h>
#include <zlib.h>

#include <map>

#include "coverage/kgv_file.h"
#include "tests/common/test_support.h"

using kgtest::runProcess;

namespace {

const char kProgram[] =
    "#include <stdio.h>\n"                                  // 1
    "static int twice(int x) { return 2 * x; }\n"           // 2
    "int never(int y) {\n"                                  // 3
    "  return y + 1;\n"                                     // 4
    "}\n"                                                   // 5
    "int main(int argc, char **argv) {\n"                   // 6
    "  int s = 0;\n"                                        // 7
    "  for (int i = 0; i < 3; i++) s += twice(i);\n"        // 8
    "  if (argc > 5) printf(\"%s\\n\", argv[1]);\n"         // 9
    "  printf(\"%d\\n\", s);\n"                             // 10
    "  return 0;\n"                                         // 11
    "}\n";                                                  // 12

struct Built {
  kgtest::TempDir dir;
  std::string shell(const std::string& cmd) {
    auto r = runProcess({"/bin/sh", "-c", cmd}, {}, "", dir.path());
    EXPECT_EQ(r.status, 0) << cmd << "\n" << r.err;
    return r.out;
  }
};

// Builds prog.c with coverage, runs it `runs` times, and leaves .gcda data in the directory.
void buildAndRun(Built& b, const std::string& source, int runs) {
  kgtest::writeFile(b.dir.file("prog.c"), source);
  b.shell("gcc --coverage -O0 -c prog.c -o prog.o && gcc --coverage -o prog prog.o");
  for (int i = 0; i < runs; ++i) b.shell("./prog > /dev/null");
}

struct RecordView {
  std::string path;
  std::map<std::string, std::uint16_t> calls;
  std::map<std::uint32_t, std::uint16_t> blocks;  // line -> hits
  std::uint16_t sessions = 0;
};

RecordView onlyRecord(const std::string& kgv) {
  std::unique_ptr<KgvData> d;
  EXPECT_EQ(readKgvFile(kgv, d), allOK);
  RecordView v;
  if (!d || d->records.size() != 1) {
    ADD_FAILURE() << "expected one record";
    return v;
  }
  const ObjRecord& r = *d->records[0];
  v.path = r.fileName();
  for (size_t i = 0; i < r.map.size(); ++i) {
    std::uint32_t tag = mapTag(r.map[i]), value = mapValue(r.map[i]);
    if (tag == TagFile) v.sessions = r.counts[i];
    if (tag == TagFunction) v.calls[r.nameAt(value)] = r.counts[i];
    if (tag == TagBlock) v.blocks[value] = r.counts[i];
  }
  return v;
}

}  // namespace

TEST(ImportFromRealTools, GcovJsonAndLcovTracefileGiveTheSameRecord) {
  Built b;
  buildAndRun(b, kProgram, 2);
  b.shell("gcov --json-format prog.o > /dev/null 2>&1");
  b.shell("lcov -q --capture --directory . --output-file prog.info 2>/dev/null");
  std::string importer = kgtest::binPath("kestrel-import");
  auto r1 = runProcess({importer, "-o", b.dir.file("g.kgv"), b.dir.file("prog.gcov.json.gz")});
  ASSERT_EQ(r1.status, 0) << r1.err;
  auto r2 = runProcess({importer, "-o", b.dir.file("l.kgv"), b.dir.file("prog.info")});
  ASSERT_EQ(r2.status, 0) << r2.err;

  RecordView g = onlyRecord(b.dir.file("g.kgv"));
  RecordView l = onlyRecord(b.dir.file("l.kgv"));
  char real[4096];
  ASSERT_NE(realpath(b.dir.file("prog.c").c_str(), real), nullptr);
  EXPECT_EQ(g.path, real);
  EXPECT_EQ(l.path, real);
  EXPECT_EQ(g.calls, l.calls);
  EXPECT_EQ(g.blocks, l.blocks);
  EXPECT_EQ(g.calls["main"], 2u);
  EXPECT_EQ(g.calls["never"], 0u);
  EXPECT_EQ(g.calls["twice"], 6u);
  EXPECT_EQ(g.blocks[4], 0u);  // the body of never()
  EXPECT_EQ(g.blocks[10], 2u);
  EXPECT_EQ(g.sessions, 1u);
}

TEST(ImportFromRealTools, ImportsOfOneBuildMergeAndAChangedSourceIsOutOfDate) {
  Built b;
  buildAndRun(b, kProgram, 1);
  b.shell("lcov -q --capture --directory . --output-file first.info 2>/dev/null");
  b.shell("./prog > /dev/null && lcov -q --zerocounters --directory . 2>/dev/null; ./prog > /dev/null");
  b.shell("lcov -q --capture --directory . --output-file second.info 2>/dev/null");
  std::string importer = kgtest::binPath("kestrel-import");
  ASSERT_EQ(runProcess({importer, "-o", b.dir.file("a.kgv"), b.dir.file("first.info")}).status, 0);
  ASSERT_EQ(runProcess({importer, "-o", b.dir.file("b.kgv"), b.dir.file("second.info")}).status, 0);
  auto m = runProcess({kgtest::binPath("kestrel"), "-merge=all.kgv", "a.kgv", "b.kgv"},
                      {"HOME=" + b.dir.path()}, "", b.dir.path());
  ASSERT_EQ(m.status, 0) << m.err;
  EXPECT_EQ(m.err, "");
  RecordView all = onlyRecord(b.dir.file("all.kgv"));
  EXPECT_EQ(all.calls["main"], 2u);
  EXPECT_EQ(all.sessions, 2u);

  // The source changes (one more line): its coverage is another version of the file.
  std::string changed = kProgram;
  changed.insert(changed.find("  return 0;"), "  s++;\n");
  buildAndRun(b, changed, 1);
  b.shell("lcov -q --capture --directory . --output-file third.info 2>/dev/null");
  ASSERT_EQ(runProcess({importer, "-o", b.dir.file("c.kgv"), b.dir.file("third.info")}).status, 0);
  m = runProcess({kgtest::binPath("kestrel"), "-merge=newer.kgv", "all.kgv", "c.kgv"},
                 {"HOME=" + b.dir.path()}, "", b.dir.path());
  EXPECT_EQ(m.status, 0) << m.err;
  EXPECT_NE(m.err.find("Some coverage for this file was out of date:"), std::string::npos) << m.err;
}

TEST(ImportCommand, BadInputIsRefusedWithoutAnOutputFile) {
  kgtest::TempDir dir;
  std::string importer = kgtest::binPath("kestrel-import");
  kgtest::writeFile(dir.file("bad.info"), "SF:/a.c\nDA:3,x\nend_of_record\n");
  auto r = runProcess({importer, "-o", dir.file("out.kgv"), dir.file("bad.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: " + dir.file("bad.info") + ":2: malformed DA record '3,x'\n");
  EXPECT_FALSE(kgtest::fileExists(dir.file("out.kgv")));

  kgtest::writeFile(dir.file("picture.png"), "\x89PNG\r\n");
  r = runProcess({importer, "-o", dir.file("out.kgv"), dir.file("picture.png")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: " + dir.file("picture.png") +
                       ":1: neither an lcov tracefile nor gcov JSON\n");
  r = runProcess({importer, dir.file("bad.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err.rfind("usage: kestrel-import -o OUT.kgv INPUT...", 0), 0u);
  kgtest::writeFile(dir.file("empty.info"), "TN:\n");
  r = runProcess({importer, "-o", dir.file("out.kgv"), dir.file("empty.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: the inputs hold no coverage data\n");
  EXPECT_FALSE(kgtest::fileExists(dir.file("out.kgv")));
}

TEST(ImportCommand, AGzipBombIsRefusedWithinItsCeiling) {
  kgtest::TempDir dir;
  // A tracefile head, then 400 MB of one repeated byte: about 400 KB compressed.
  std::string bomb = dir.file("bomb.info.gz");
  gzFile out = gzopen(bomb.c_str(), "wb9");
  ASSERT_NE(out, nullptr);
  gzputs(out, "TN:\nSF:/src/a.c\n");
  const std::string block(1 << 20, 'A');
  for (int i = 0; i < 400; ++i) ASSERT_EQ(gzwrite(out, block.data(), block.size()), int(block.size()));
  ASSERT_EQ(gzclose(out), Z_OK);

  std::string importer = kgtest::binPath("kestrel-import");
  std::string command = "exec '" + importer + "' -o '" + dir.file("out.kgv") + "' '" + bomb + "'";
#if !defined(__SANITIZE_ADDRESS__)
  // Without the ceiling the whole text would be read: far more than this allows.
  command = "ulimit -v 300000 && " + command;
#endif
  auto r = runProcess({"/bin/sh", "-c", command});
  EXPECT_EQ(r.status, 2);
  EXPECT_NE(r.err.find("kestrel-import: " + bomb + ": cannot read: it inflates to more than 67108864 "
                       "bytes (64 times its compressed size); refused as a likely gzip bomb\n"),
            std::string::npos) << r.err;
  EXPECT_FALSE(kgtest::fileExists(dir.file("out.kgv")));

  // An ordinary compressed tracefile stays well inside it.
  std::string small = dir.file("small.info.gz");
  out = gzopen(small.c_str(), "wb9");
  gzputs(out, "TN:\nSF:/src/a.c\nFN:1,main\nFNDA:1,main\nDA:2,1\nend_of_record\n");
  ASSERT_EQ(gzclose(out), Z_OK);
  r = runProcess({importer, "-o", dir.file("out.kgv"), small});
  EXPECT_EQ(r.status, 0) << r.err;
}
