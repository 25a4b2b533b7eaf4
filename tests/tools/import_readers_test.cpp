// Reading lcov tracefiles and gcov JSON, their paths, names and branches, laying the lines
// out as functions, and refusing bad input with the file and line of the problem.
#include <gtest/gtest.h>
#include <unistd.h>
#include <zlib.h>

#include <set>

#include "tests/common/test_support.h"
#include "tools/import/coverage_import.h"
#include "tools/import/import_records.h"
#include "tools/import/record_layout.h"

namespace {

ImportedData lcov(const std::string& text) {
  ImportedData d;
  ImportError e;
  EXPECT_TRUE(readLcovTracefile("t.info", text, d, e)) << e.text();
  return d;
}

std::string lcovError(const std::string& text) {
  ImportedData d;
  ImportError e;
  EXPECT_FALSE(readLcovTracefile("t.info", text, d, e));
  return e.text();
}

const LaidOutFunction& fn(const LaidOutRecord& r, const std::string& name) {
  for (const auto& f : r.functions)
    if (f.name == name) return f;
  ADD_FAILURE() << "no function " << name;
  static LaidOutFunction none;
  return none;
}

std::vector<std::uint32_t> lines(const LaidOutFunction& f) {
  std::vector<std::uint32_t> v;
  for (const auto& l : f.lines) v.push_back(l.line);
  return v;
}

}  // namespace

TEST(LcovTracefiles, BothFunctionFormsChecksumsAndRepeatedRecordsAddUp) {
  ImportedData d = lcov(
      "TN:unit\nSF:/src/a.c\nFN:3,main\nFN:10,12,helper\nFNDA:2,main\nFNDA:0,helper\nFNF:2\nFNH:1\n"
      "DA:3,2,abcdef\nDA:4,2\nDA:11,0\nBRDA:4,0,0,1\nBRF:1\nBRH:1\nLF:3\nLH:2\nend_of_record\n"
      "TN:other\nSF:/src/a.c\nFNDA:3,main\nDA:4,5\nDA:20,1\nend_of_record\n");
  ASSERT_EQ(d.files.size(), 1u);
  ImportedFile& f = d.files[0];
  EXPECT_EQ(f.lines.at(4), 7u);
  EXPECT_EQ(f.lines.at(20), 1u);
  EXPECT_EQ(f.function("main").calls, 5u);
  EXPECT_EQ(f.function("helper").endLine, 12u);
}

TEST(LcovTracefiles, FunctionIndexRecordsOfNewerLcov) {
  ImportedData d = lcov("SF:x.c\nFNL:0,5,9\nFNA:0,4,f\nFNA:0,0,f_alias\nDA:6,4\nend_of_record\n");
  auto& file = d.files[0];
  EXPECT_EQ(file.function("f").startLine, 5u);
  EXPECT_EQ(file.function("f").endLine, 9u);
  EXPECT_EQ(file.function("f").calls, 4u);
  EXPECT_EQ(file.function("f_alias").startLine, 5u);
}

TEST(LcovTracefiles, BadInputNamesFileAndLine) {
  EXPECT_EQ(lcovError("SF:a.c\nDA:x,1\nend_of_record\n"), "t.info:2: malformed DA record 'x,1'");
  EXPECT_EQ(lcovError("DA:1,1\n"), "t.info:1: DA before any SF record");
  EXPECT_EQ(lcovError("SF:a.c\nDA:1,1\n"),
            "t.info:3: the tracefile looks truncated: its last record has no end_of_record");
  // Cut in the middle of a line: the line is named, and what it lacks.
  EXPECT_EQ(lcovError("SF:a.c\nDA:1,1\nDA"),
            "t.info:3: the tracefile looks truncated: its last line 'DA' is incomplete "
            "(not a tracefile line: 'DA')");
  EXPECT_EQ(lcovError("SF:a.c\nDA:1,1\nBRDA:1,0,"),
            "t.info:3: the tracefile looks truncated: its last line 'BRDA:1,0,' is incomplete "
            "(malformed BRDA record '1,0,')");
  EXPECT_EQ(lcovError("SF:a.c\nthis is not lcov\nend_of_record\n"),
            "t.info:2: not a tracefile line: 'this is not lcov'");
  EXPECT_EQ(lcovError("SF:a.c\nFNA:3,1,f\nend_of_record\n"),
            "t.info:2: FNA record for function index 3 without FNL");
  EXPECT_EQ(lcovError("SF:a.c\nDA:0,1\nend_of_record\n"), "t.info:2: malformed DA record '0,1'");
  EXPECT_EQ(lcovError("SF:a.c\nBRDA:1,0,1\nend_of_record\n"), "t.info:2: malformed BRDA record '1,0,1'");
  EXPECT_EQ(lcovError("SF:a.c\nBRDA:0,0,1,1\nend_of_record\n"), "t.info:2: malformed BRDA record '0,0,1,1'");
  EXPECT_EQ(lcovError("SF:a.c\nBRDA:2,0,1,x\nend_of_record\n"), "t.info:2: malformed BRDA record '2,0,1,x'");
  // Huge counts saturate instead of being refused.
  ImportedData d = lcov("SF:a.c\nDA:1,99999999999999999999999\nend_of_record\n");
  EXPECT_EQ(saturatedCount(d.files[0].lines.at(1)), 10000u);
}

TEST(GcovJson, DocumentsFilesFunctionsAndLines) {
  std::string doc =
      R"j({"format_version":"1","current_working_directory":"/build","files":[{"file":"src/a.c",)j"
      R"j("functions":[{"name":"_Z1fi","demangled_name":"f(int)","start_line":2,"end_line":4,)j"
      R"j("execution_count":3}],"lines":[{"line_number":3,"count":3},{"line_number":8,"count":0}]}]})j";
  ImportedData d;
  ImportError e;
  ASSERT_TRUE(readGcovJson("a.json", doc + "\n" + doc + "\n", d, e)) << e.text();
  ASSERT_EQ(d.files.size(), 1u);
  EXPECT_EQ(d.files[0].path, "/build/src/a.c");
  EXPECT_EQ(d.files[0].function("_Z1fi").calls, 6u);
  EXPECT_EQ(d.files[0].function("_Z1fi").name, "f(int)");
  EXPECT_EQ(d.files[0].lines.at(3), 6u);
}

TEST(GcovJson, BadDocumentsNameTheLine) {
  ImportedData d;
  d.baseDirectory = "/w";
  ImportError e;
  EXPECT_FALSE(readGcovJson("b.json", "{\"files\": [\n{\"file\": \"a.c\",\n \"lines\": [oops]}]}", d, e));
  EXPECT_EQ(e.line, 3u);
  EXPECT_EQ(e.text().rfind("b.json:3: not valid JSON", 0), 0u) << e.text();
  EXPECT_FALSE(readGcovJson("c.json", "{\"files\": 3}", d, e));
  EXPECT_EQ(e.text(), "c.json:1: not gcov JSON: no \"files\" array");
  EXPECT_FALSE(readGcovJson("d.json", "{\"files\":[{\"file\":\"a.c\",\"lines\":[{\"count\":1}]}]}", d, e));
  EXPECT_EQ(e.text(), "d.json:1: a line entry of /w/a.c has no line number or count");
  EXPECT_FALSE(readGcovJson("e.json", "{\"files\":[{\"file\":\"a.c\"", d, e));
  EXPECT_EQ(e.text().rfind("e.json:1: the gcov JSON looks truncated (not valid JSON", 0), 0u) << e.text();
  EXPECT_FALSE(readGcovJson("f.json", "{\"files\":[{\"file\":\"/a.c\",\"lines\":[{\"line_number\":1,"
                                      "\"count\":1,\"branches\":7}]}]}", d, e));
  EXPECT_EQ(e.text(), "f.json:1: \"branches\" of a line of /a.c is not an array");
}

// A data file ends names at a NUL, so a name holding one would name another file or
// function, or none; the first input is the one the fuzzer found.
TEST(GcovJson, NamesHoldingANulAreRefused) {
  std::string found = kgtest::readFile(std::string(KG_SOURCE_DIR) +
      "/fuzz/regressions/gcov_json_reader_fuzz/crash-f5b80d1e686694b3f5da7ee31033b8a2a0fe33e3");
  ASSERT_NE(found.find("\\u0000"), std::string::npos);
  ImportedData d;
  ImportError e;
  EXPECT_FALSE(readGcovJson("f.json", found, d, e));
  EXPECT_EQ(e.text(), "f.json:1: a file name holds a NUL character");

  EXPECT_FALSE(readGcovJson("g.json", R"j({"current_working_directory":"/b\u0000x","files":[{"file":"a.c"}]})j", d, e));
  EXPECT_EQ(e.text(), "g.json:1: a file name holds a NUL character");
  EXPECT_FALSE(readGcovJson("h.json",
      R"j({"files":[{"file":"/s/a.c","functions":[{"name":"f\u0000x","start_line":1}]}]})j", d, e));
  EXPECT_EQ(e.text(), "h.json:1: a function name of /s/a.c holds a NUL character");

  // Other escapes are names like any other; a directory not used does not matter.
  ImportedData ok;
  ASSERT_TRUE(readGcovJson("i.json",
      R"j({"current_working_directory":"/b\u0000x","files":[{"file":"/s/caf\u00e9.c",)j"
      R"j("functions":[{"name":"g\tx","start_line":2}]}]})j", ok, e)) << e.text();
  ASSERT_EQ(ok.files.size(), 1u);
  EXPECT_EQ(ok.files[0].path, "/s/caf\xc3\xa9.c");
  EXPECT_EQ(ok.files[0].functions.at(0).name, "g\tx");
}

TEST(Layout, LinesGoToTheInnermostFunctionAndTheRestToFileScope) {
  ImportedFile f;
  f.path = "/src/n.cc";
  f.function("outer").startLine = 10;
  f.function("outer").endLine = 30;
  f.function("outer").calls = 1;
  f.function("lambda").startLine = 15;
  f.function("lambda").endLine = 18;
  f.function("lambda").calls = 20000;
  for (std::uint32_t l : {5u, 11u, 16u, 18u, 19u, 31u}) f.addLine(l, l == 16 ? 70000 : 1);
  LaidOutRecord r = layOutRecord(f);
  ASSERT_EQ(r.functions.size(), 3u);
  EXPECT_EQ(r.functions[0].name, "outer");
  EXPECT_EQ(lines(fn(r, "outer")), (std::vector<std::uint32_t>{11, 19}));
  EXPECT_EQ(lines(fn(r, "lambda")), (std::vector<std::uint32_t>{16, 18}));
  EXPECT_EQ(fn(r, "lambda").calls, 10000u);
  EXPECT_EQ(fn(r, "lambda").lines[0].hits, 10000u);
  EXPECT_EQ(r.functions[2].name, "(file scope)");
  EXPECT_EQ(lines(r.functions[2]), (std::vector<std::uint32_t>{5, 31}));
  EXPECT_EQ(r.functions[2].firstLine, 5u);
  EXPECT_EQ(r.sessions, 1u);
  EXPECT_NE(r.signature, 0u);
}

TEST(Layout, UnknownEndsReachToTheNextFunctionAndTheHashFollowsStructure) {
  ImportedFile f;
  f.path = "/src/a.c";
  f.function("a").startLine = 1;
  f.function("b").startLine = 5;
  for (std::uint32_t l : {2u, 4u, 5u, 9u}) f.addLine(l, 1);
  LaidOutRecord r = layOutRecord(f);
  EXPECT_EQ(lines(fn(r, "a")), (std::vector<std::uint32_t>{2, 4}));
  EXPECT_EQ(lines(fn(r, "b")), (std::vector<std::uint32_t>{5, 9}));
  // Same structure, other counts: same signature; one more line: another.
  ImportedFile g = f;
  g.lines[2] = 40;
  EXPECT_EQ(layOutRecord(g).signature, r.signature);
  g.addLine(10, 0);
  EXPECT_NE(layOutRecord(g).signature, r.signature);
}

TEST(Inputs, CompressedAndPlainFilesReadAlikeAndFormatsAreRecognised) {
  kgtest::TempDir dir;
  std::string text = "TN:\nSF:a.c\nDA:1,1\nend_of_record\n";
  kgtest::writeFile(dir.file("plain.info"), text);
  gzFile gz = gzopen(dir.file("packed.info.gz").c_str(), "wb");
  ASSERT_NE(gz, nullptr);
  gzwrite(gz, text.data(), static_cast<unsigned>(text.size()));
  gzclose(gz);
  std::string a, b;
  ImportError e;
  ASSERT_TRUE(readInputText(dir.file("plain.info"), a, e));
  ASSERT_TRUE(readInputText(dir.file("packed.info.gz"), b, e));
  EXPECT_EQ(a, text);
  EXPECT_EQ(b, text);
  EXPECT_EQ(detectFormat(a), InputFormat::lcov);
  EXPECT_EQ(detectFormat("  \n{\"files\":[]}"), InputFormat::gcovJson);
  EXPECT_EQ(detectFormat("GIF89a"), InputFormat::unknown);
  // A truncated archive is an error, not a short input.
  std::string packed = kgtest::readFile(dir.file("packed.info.gz"));
  kgtest::writeFile(dir.file("cut.gz"), packed.substr(0, packed.size() - 6));
  EXPECT_FALSE(readInputText(dir.file("cut.gz"), a, e));
  EXPECT_FALSE(readInputText(dir.file("missing.info"), a, e));
  EXPECT_EQ(e.text().rfind(dir.file("missing.info") + ": cannot open", 0), 0u);
}

TEST(Paths, DotsDoubledSlashesAndRelativePathsAreResolved) {
  EXPECT_EQ(normalisedSourcePath("/b/obj/../../zlib//adler32.c", ""), "/zlib/adler32.c");
  EXPECT_EQ(normalisedSourcePath("./src/./a.c", "/w/build/"), "/w/build/src/a.c");
  EXPECT_EQ(normalisedSourcePath("../../src/a.c", "/w/obj/sub"), "/w/src/a.c");
  EXPECT_EQ(normalisedSourcePath("/../../a.c", "/w"), "/a.c");  // above the root is the root
  EXPECT_EQ(normalisedSourcePath("a.c", "rel/dir"), normalisedSourcePath("rel/dir/a.c", ""));
  char cwd[4096];
  ASSERT_NE(getcwd(cwd, sizeof cwd), nullptr);
  EXPECT_EQ(normalisedSourcePath("x/../a.c", ""), std::string(cwd) + "/a.c");

  // Tracefiles take relative names from the base directory, gcov JSON from its own.
  ImportedData d;
  d.baseDirectory = "/base";
  ImportError e;
  ASSERT_TRUE(readLcovTracefile("t.info", "SF:src/../a.c\nDA:1,1\nend_of_record\nSF:/base/a.c\nDA:2,1\nend_of_record\n", d, e));
  ASSERT_TRUE(readGcovJson("t.json", R"j({"current_working_directory":"/base/obj","files":[{"file":"../a.c","lines":[{"line_number":3,"count":1}]}]})j", d, e));
  ASSERT_TRUE(readGcovJson("u.json", R"j({"files":[{"file":"a.c","lines":[{"line_number":4,"count":1}]}]})j", d, e));
  ASSERT_EQ(d.files.size(), 1u);
  EXPECT_EQ(d.files[0].path, "/base/a.c");
  EXPECT_EQ(d.files[0].lines.size(), 4u);
}

TEST(Names, CxxNamesAreDemangledAndVariantsThatDemangleAlikeStayApart) {
  ImportedData d = lcov(
      "SF:/s/shape.cc\nFN:4,_ZN5ShapeD0Ev\nFN:4,_ZN5ShapeD2Ev\nFN:9,_Z4overd\nFN:10,_Z4overi\n"
      "FN:12,main\nFN:14,f\nFNDA:1,_ZN5ShapeD2Ev\nDA:4,1\nend_of_record\n");
  const ImportedFile& f = d.files[0];
  std::vector<std::string> names;
  for (const auto& fn : f.functions) names.push_back(fn.name);
  // "f" alone is no C++ name, though the demangler would read it as the type "float".
  EXPECT_EQ(names, (std::vector<std::string>{"Shape::~Shape() [D0]", "Shape::~Shape() [D2]",
                                             "over(double)", "over(int)", "main", "f"}));

  // The same functions from gcov JSON: the mangled name decides, so the same names.
  ImportedData j;
  ImportError e;
  ASSERT_TRUE(readGcovJson("s.json",
      R"j({"files":[{"file":"/s/shape.cc","functions":[)j"
      R"j({"name":"_ZN5ShapeD2Ev","demangled_name":"Shape::~Shape()","start_line":4,"end_line":4,"execution_count":1},)j"
      R"j({"name":"_ZN5ShapeD0Ev","demangled_name":"Shape::~Shape()","start_line":4,"end_line":4,"execution_count":0}]}]})j",
      j, e)) << e.text();
  ASSERT_EQ(j.files[0].functions.size(), 2u);
  EXPECT_EQ(j.files[0].function("_ZN5ShapeD0Ev").name, "Shape::~Shape() [D0]");
  EXPECT_EQ(j.files[0].function("_ZN5ShapeD2Ev").name, "Shape::~Shape() [D2]");

  // Crafted names that meet a demangled one still come out distinct.
  ImportedData c = lcov("SF:/s/c.cc\nFN:1,_Z4overd\nFN:2,over(double)\nFN:3,over(double) [_Z4overd]\nend_of_record\n");
  std::set<std::string> distinct;
  for (const auto& fn : c.files[0].functions) distinct.insert(fn.name);
  EXPECT_EQ(distinct.size(), 3u);
  EXPECT_EQ(c.files[0].function("over(double)").name, "over(double)");
}

TEST(Branches, TracefileAndJsonOutcomesAddUpByLineAndPlace) {
  ImportedData d = lcov(
      "SF:/s/b.c\nDA:3,4\nBRDA:3,0,1,2\nBRDA:3,0,0,-\nBRDA:3,0,10,1\nBRDA:3,1,0,0\nBRDA:3,1,1,9\nDA:5,0\n"
      "BRDA:9,0,0,1\nBRDA:5,0,2,1\n"
      "end_of_record\nSF:/s/b.c\nBRDA:3,0,0,3\nend_of_record\n");
  ImportError e;
  ASSERT_TRUE(readGcovJson("b.json",
      R"j({"files":[{"file":"/s/b.c","lines":[{"line_number":3,"count":1,"branches":[{"count":1},{"count":0,"throw":true}]},)j"
      R"j({"line_number":5,"count":0,"branches":[{"count":0},{"count":0}]}]}]})j", d, e)) << e.text();
  const ImportedFile& f = d.files[0];
  std::vector<std::pair<std::string, std::uint64_t>> line3;
  for (const auto& [key, taken] : f.branches.at(3)) line3.emplace_back(key.block + "," + key.branch, taken);
  EXPECT_EQ(line3, (std::vector<std::pair<std::string, std::uint64_t>>{
                       {"0,0", 4}, {"0,1", 2}, {"0,10", 1}, {"1,0", 0}, {"1,1", 9}}));
  EXPECT_EQ(f.lines.at(3), 5u);

  // Laid out after the line's own count, never above it (merged or odd data: 9 on a line run
  // 5 times, 1 on a line never run); an outcome at a line without a count (line 9) would
  // add a line, so it is left out.
  LaidOutRecord r = layOutRecord(f);
  ASSERT_EQ(r.functions.size(), 1u);
  ASSERT_EQ(r.functions[0].lines.size(), 2u);
  EXPECT_EQ(r.functions[0].lines[0].branches, (std::vector<std::uint16_t>{4, 2, 1, 0, 5}));
  EXPECT_EQ(r.functions[0].lines[1].branches, (std::vector<std::uint16_t>{0, 0, 0}));

  std::unique_ptr<KgvData> kgv = makeImportedData(d, 1700000000);
  const ObjRecord& rec = *kgv->records[0];
  std::vector<std::pair<std::uint32_t, std::uint16_t>> blocks;
  for (size_t i = 0; i < rec.map.size(); ++i)
    if (mapTag(rec.map[i]) == TagBlock) blocks.emplace_back(mapValue(rec.map[i]), rec.counts[i]);
  EXPECT_EQ(blocks, (std::vector<std::pair<std::uint32_t, std::uint16_t>>{
                        {3, 5}, {3, 4}, {3, 2}, {3, 1}, {3, 0}, {3, 5}, {5, 0}, {5, 0}, {5, 0}, {5, 0}}));
}

TEST(Layout, FunctionsSharingTheirFirstLineGiveItsLinesToTheLastOfThem) {
  // Six functions a macro writes on two lines, then one of their own.
  auto make = [](bool withEnds) {
    ImportedFile f;
    f.path = "/s/m.c";
    struct { const char* key; std::uint32_t line; std::uint64_t calls; } fs[] = {
        {"alpha_get", 6, 2}, {"alpha_set", 6, 1}, {"alpha_clear", 6, 0},
        {"beta_get", 7, 0},  {"beta_set", 7, 0},  {"beta_clear", 7, 1}, {"main", 8, 1}};
    for (const auto& x : fs) {
      ImportedFunction& fn = f.function(x.key);
      fn.startLine = x.line;
      fn.endLine = withEnds ? (x.line == 8 ? 12 : x.line) : 0;
      fn.calls = x.calls;
    }
    for (std::uint32_t l : {6u, 7u, 9u, 10u}) f.addLine(l, 3);
    return f;
  };
  LaidOutRecord r = layOutRecord(make(true));
  // The last by name holds the line, called or not; the others keep their line and calls.
  EXPECT_EQ(lines(fn(r, "alpha_set")), (std::vector<std::uint32_t>{6}));
  EXPECT_EQ(lines(fn(r, "alpha_clear")), (std::vector<std::uint32_t>{}));
  EXPECT_EQ(lines(fn(r, "alpha_get")), (std::vector<std::uint32_t>{}));
  EXPECT_EQ(fn(r, "alpha_get").firstLine, 6u);
  EXPECT_EQ(fn(r, "alpha_get").calls, 2u);
  EXPECT_EQ(lines(fn(r, "beta_set")), (std::vector<std::uint32_t>{7}));
  EXPECT_EQ(lines(fn(r, "beta_clear")), (std::vector<std::uint32_t>{}));
  EXPECT_EQ(lines(fn(r, "main")), (std::vector<std::uint32_t>{9, 10}));
  // Another capture that called other functions of the group lays out the same.
  ImportedFile other = make(true);
  other.function("alpha_get").calls = 0;
  other.function("alpha_clear").calls = 5;
  LaidOutRecord o = layOutRecord(other);
  for (size_t i = 0; i < r.functions.size(); ++i) {
    EXPECT_EQ(o.functions[i].name, r.functions[i].name);
    EXPECT_EQ(lines(o.functions[i]), lines(r.functions[i]));
  }
  // Without known ends (lcov 1.x tracefiles) the same.
  LaidOutRecord u = layOutRecord(make(false));
  ASSERT_EQ(u.functions.size(), r.functions.size());
  for (size_t i = 0; i < r.functions.size(); ++i) {
    EXPECT_EQ(u.functions[i].name, r.functions[i].name);
    EXPECT_EQ(lines(u.functions[i]), lines(r.functions[i]));
  }
}

TEST(Layout, FunctionsGivenInAnyOrderAreLaidOutByLineThenName) {
  // Few and many functions, given backwards, two of them on each line.
  for (int count : {6, 40}) {
    ImportedFile f;
    f.path = "/s/many.c";
    std::vector<std::pair<std::uint32_t, std::string>> expected;
    for (int k = count - 1; k >= 0; --k) {
      const std::string name = std::string(k % 2 ? "b" : "a") + std::to_string(k);
      ImportedFunction& fn = f.function(name);
      fn.startLine = 10 * static_cast<std::uint32_t>(k / 2) + 1;
      f.addLine(fn.startLine + 1, 1);
      expected.emplace_back(fn.startLine, name);
    }
    std::sort(expected.begin(), expected.end());
    LaidOutRecord r = layOutRecord(f);
    ASSERT_EQ(r.functions.size(), expected.size()) << count;
    for (std::size_t k = 0; k < expected.size(); ++k) EXPECT_EQ(r.functions[k].name, expected[k].second) << count;
  }
}

TEST(Inputs, ImportsAddedTogetherEqualOneImportOfAllInputs) {
  const char* a = "SF:/s/a.c\nFN:1,_Z1fv\nFNDA:2,_Z1fv\nDA:2,2\nBRDA:2,0,0,1\nend_of_record\n";
  const char* b = "SF:/s/a.c\nFN:1,_Z1fv\nFN:5,_Z1gv\nFNDA:1,_Z1fv\nDA:2,1\nDA:6,0\nBRDA:2,0,1,1\nend_of_record\n";
  ImportedData one, first, second;
  ImportError e;
  ASSERT_TRUE(readLcovTracefile("a", a, one, e));
  ASSERT_TRUE(readLcovTracefile("b", b, one, e));
  ASSERT_TRUE(readLcovTracefile("a", a, first, e));
  ASSERT_TRUE(readLcovTracefile("b", b, second, e));
  addImportedData(first, second);
  auto k1 = makeImportedData(one, 1), k2 = makeImportedData(first, 1);
  ASSERT_EQ(k1->records.size(), 1u);
  ASSERT_EQ(k2->records.size(), 1u);
  EXPECT_EQ(k1->records[0]->map, k2->records[0]->map);
  EXPECT_EQ(k1->records[0]->counts, k2->records[0]->counts);
  EXPECT_EQ(k1->records[0]->strings, k2->records[0]->strings);
}

namespace {

// The records an import makes, with the same import time: equal when the data are.
std::unique_ptr<KgvData> recordsOf(const ImportedData& d) { return makeImportedData(d, 1); }

void expectSameRecords(const KgvData& a, const KgvData& b) {
  ASSERT_EQ(a.records.size(), b.records.size());
  for (std::size_t k = 0; k < a.records.size(); ++k) {
    EXPECT_EQ(a.records[k]->map, b.records[k]->map) << k;
    EXPECT_EQ(a.records[k]->counts, b.records[k]->counts) << k;
    EXPECT_EQ(a.records[k]->strings, b.records[k]->strings) << k;
  }
}

}  // namespace

TEST(Inputs, APlainTracefileReadInPiecesReadsAsTheWholeText) {
  // Larger than a piece, so that records, lines and a very long line cross the pieces'
  // ends; the last line has no newline.
  std::string text;
  for (int f = 0; text.size() < (std::size_t(9) << 20); ++f) {
    text += "TN:t\nSF:/src/d" + std::to_string(f % 7) + "/f" + std::to_string(f) + ".c\n";
    text += "FN:1,fn" + std::to_string(f) + "\nFNDA:" + std::to_string(f % 3) + ",fn" + std::to_string(f) + "\n";
    for (int l = 1; l < 90; l += 2) {
      text += "DA:" + std::to_string(l) + "," + std::to_string((l * f) % 5) + "\n";
      if (l % 10 == 1) text += "BRDA:" + std::to_string(l) + ",0,1," + std::to_string(f % 4) + "\n";
    }
    if (f == 3000) text += "TN:" + std::string(std::size_t(5) << 20, 'x') + "\n";  // longer than a piece
    text += "end_of_record\n";
  }
  text.pop_back();
  kgtest::TempDir dir;
  kgtest::writeFile(dir.file("big.info"), text);
  ImportedData whole, streamed;
  ImportError e;
  ASSERT_TRUE(readLcovTracefile("big.info", text, whole, e)) << e.text();
  bool handled = false;
  ASSERT_TRUE(readPlainTracefile(dir.file("big.info"), streamed, e, handled)) << e.text();
  EXPECT_TRUE(handled);
  expectSameRecords(*recordsOf(whole), *recordsOf(streamed));

  // Fed line by line, the same again.
  ImportedData byLines;
  {
    LcovTracefileReader reader("big.info", byLines, e, text.size());
    std::size_t from = 0;
    while (from < text.size()) {
      std::size_t nl = text.find('\n', from);
      std::size_t to = nl == std::string::npos ? text.size() : nl + 1;
      ASSERT_TRUE(reader.feed(std::string_view(text).substr(from, to - from)));
      from = to;
    }
    ASSERT_TRUE(reader.finish());
  }
  expectSameRecords(*recordsOf(whole), *recordsOf(byLines));

  // A bad line past the first piece is reported at its line, as in the whole text.
  std::size_t cut = text.find("DA:", std::size_t(6) << 20);
  std::string bad = text.substr(0, cut) + "DA:x,1\n" + text.substr(cut);
  kgtest::writeFile(dir.file("bad.info"), bad);
  ImportedData d1, d2;
  ImportError e1, e2;
  EXPECT_FALSE(readLcovTracefile(dir.file("bad.info"), bad, d1, e1));
  EXPECT_FALSE(readPlainTracefile(dir.file("bad.info"), d2, e2, handled));
  EXPECT_TRUE(handled);
  EXPECT_EQ(e1.text(), e2.text());
  EXPECT_GT(e2.line, 100000u);

  // A record cut short at the end, and a last line cut short, as the whole text says.
  for (const std::string& cutShort : {text.substr(0, text.rfind("end_of_record")), text.substr(0, text.size() - 3)}) {
    kgtest::writeFile(dir.file("cut.info"), cutShort);
    ImportedData d3, d4;
    ImportError e3, e4;
    EXPECT_FALSE(readLcovTracefile(dir.file("cut.info"), cutShort, d3, e3));
    EXPECT_FALSE(readPlainTracefile(dir.file("cut.info"), d4, e4, handled));
    EXPECT_EQ(e3.text(), e4.text());
  }

  // Compressed data, gcov JSON and empty files are read whole instead: nothing is read here.
  gzFile gz = gzopen(dir.file("big.info.gz").c_str(), "wb");
  ASSERT_NE(gz, nullptr);
  gzwrite(gz, text.data(), 4096);
  gzclose(gz);
  kgtest::writeFile(dir.file("g.json"), "{\"files\": []}");
  kgtest::writeFile(dir.file("empty.info"), "");
  for (const char* name : {"big.info.gz", "g.json", "empty.info", "missing.info"}) {
    ImportedData none;
    EXPECT_FALSE(readPlainTracefile(dir.file(name), none, e, handled)) << name;
    EXPECT_FALSE(handled) << name;
    EXPECT_TRUE(none.files.empty()) << name;
  }
}

TEST(Inputs, ALargeTracefileReadInTwoHalvesReadsAsTheWholeText) {
  // Records of many files, then again some of the first ones with other counts and one more
  // function each: those are in both halves.
  auto record = [](int f, int round) {
    std::string r = "TN:t\nSF:/src/d" + std::to_string(f % 7) + "/f" + std::to_string(f) + ".c\n";
    r += "FN:1,fn" + std::to_string(f) + "\nFNDA:" + std::to_string(f % 3 + round) + ",fn" + std::to_string(f) + "\n";
    if (round) r += "FN:95,late" + std::to_string(f) + "\nFNDA:1,late" + std::to_string(f) + "\nDA:96,1\n";
    for (int l = 1; l < 90; l += 2) {
      r += "DA:" + std::to_string(l) + "," + std::to_string((l * f + round) % 5) + "\n";
      if (l % 10 == 1) r += "BRDA:" + std::to_string(l) + ",0," + std::to_string(round) + "," + std::to_string(f % 4) + "\n";
    }
    return r + "end_of_record\n";
  };
  std::string text;
  int files = 0;
  while (text.size() < (std::size_t(9) << 20)) text += record(files++, 0);
  for (int f = 0; f < 50; ++f) text += record(f, 1);
  kgtest::TempDir dir;
  const std::string path = dir.file("large.info");
  kgtest::writeFile(path, text);
  const std::uint64_t half = tracefileSecondHalf(path);
  ASSERT_GT(half, text.size() / 2);  // this file is read in two halves
  ASSERT_LT(half, text.size());
  ImportedData whole, halves;
  ImportError e;
  ASSERT_TRUE(readLcovTracefile(path, text, whole, e)) << e.text();
  bool handled = false;
  ASSERT_TRUE(readPlainTracefile(path, halves, e, handled)) << e.text();
  ASSERT_EQ(halves.files.size(), static_cast<std::size_t>(files));
  expectSameRecords(*recordsOf(whole), *recordsOf(halves));

  // Bad lines: in the second half only, in both (the first counts), a cut-short end.
  const std::size_t early = text.find("DA:", std::size_t(1) << 20), late = text.find("DA:", half + 1000);
  const std::string bad = "DA:x,1\n";
  for (const std::string& damaged : {text.substr(0, late) + bad + text.substr(late),
                                     text.substr(0, early) + bad + text.substr(early, late - early) + bad + text.substr(late),
                                     text.substr(0, text.size() - 20)}) {
    kgtest::writeFile(path, damaged);
    ImportedData d1, d2;
    ImportError e1, e2;
    EXPECT_FALSE(readLcovTracefile(path, damaged, d1, e1));
    EXPECT_FALSE(readPlainTracefile(path, d2, e2, handled));
    EXPECT_EQ(e1.text(), e2.text());
  }
  // A file without a record's end near its middle is read in one.
  kgtest::writeFile(path, "TN:" + std::string(std::size_t(9) << 20, 'x') + "\n");
  EXPECT_EQ(tracefileSecondHalf(path), 0u);
}

TEST(Exclusions, MarkedLinesBranchesAndFunctionsOfGcovDataAreLeftOutAsLcovDoes) {
  kgtest::TempDir dir;
  std::string src = dir.file("x.cc");
  kgtest::writeFile(src,
                    "int a() {\n"                              // 1
                    "  return 1;  // LCOV_EXCL_LINE\n"         // 2
                    "}\n"                                      // 3
                    "// LCOV_EXCL_START\n"                     // 4
                    "int b() { return 2; }\n"                  // 5
                    "// LCOV_EXCL_STOP\n"                      // 6
                    "int c(int x) { return x ? 1 : 0; }  // LCOV_EXCL_BR_LINE\n"  // 7
                    "int d(int x) { return x ? 1 : 0; }  // LCOV_EXCL_EXCEPTION_BR_LINE\n"  // 8
                    "int e(int x) { return x ? 1 : 0; }\n"     // 9
                    "// LCOV_EXCL_BR_START\n");               // 10, left open
  std::string doc = R"j({"files":[{"file":")j" + src + R"j(","functions":[)j"
      R"j({"name":"a","start_line":1,"end_line":3},{"name":"b","start_line":5,"end_line":5},)j"
      R"j({"name":"_ZN1SD0Ev","start_line":5,"end_line":5},{"name":"_ZN1SD2Ev","start_line":9,"end_line":9}],"lines":[)j";
  for (int l = 1; l <= 9; ++l)
    doc += std::string(l > 1 ? "," : "") + R"j({"line_number":)j" + std::to_string(l) +
           R"j(,"count":1,"branches":[{"count":1},{"count":0}]})j";
  doc += "]}]}";
  ImportedData d;
  ImportError e;
  ASSERT_TRUE(readGcovJson("x.json", doc, d, e)) << e.text();
  // The same data from a tracefile are lcov's already: nothing more is left out.
  ImportedData t = lcov("SF:" + src + "\nDA:2,1\nBRDA:7,0,0,1\nend_of_record\n");
  std::vector<std::string> warnings;
  applyExclusionMarkers(d, warnings);
  applyExclusionMarkers(t, warnings);
  EXPECT_EQ(warnings, (std::vector<std::string>{src + ": an LCOV_EXCL section is not closed; it reaches to the end of the file"}));
  const ImportedFile& f = d.files[0];
  std::vector<std::uint32_t> kept, branched;
  for (const auto& [l, hits] : f.lines) kept.push_back(l);
  for (const auto& [l, b] : f.branches) branched.push_back(l);
  EXPECT_EQ(kept, (std::vector<std::uint32_t>{1, 3, 6, 7, 8, 9}));
  EXPECT_EQ(branched, (std::vector<std::uint32_t>{1, 3, 6, 9}));
  std::vector<std::string> names;
  for (const auto& fn : f.functions) names.push_back(fn.name);
  // A variant alone again needs no mark.
  EXPECT_EQ(names, (std::vector<std::string>{"a", "S::~S()"}));
  EXPECT_EQ(t.files[0].lines.size(), 1u);
  EXPECT_EQ(t.files[0].branches.size(), 1u);
}
