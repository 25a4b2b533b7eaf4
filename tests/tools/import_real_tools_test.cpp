// kestrel-import on coverage the machine's own gcc, gcov and lcov produce during the test:
// every route (lcov tracefile, gcov JSON, the build directory) against lcov's own figures,
// C++ names, shared lines, paths, merges of separate captures, and the messages users see.
#include <gtest/gtest.h>
#include <zlib.h>

#include <algorithm>
#include <map>
#include <set>
#include <sstream>

#include "coverage/kgv_file.h"
#include "tests/common/test_support.h"
#include "tests/coverage/kgv_test_util.h"

using kgtest::runProcess;

namespace {

const char kProgram[] =
    "#include <stdio.h>\n"
    "static int twice(int x) { return 2 * x; }\n"
    "int never(int y) {\n"
    "  return y + 1;\n"
    "}\n"
    "int main(int argc, char **argv) {\n"
    "  int s = 0;\n"
    "  for (int i = 0; i < 3; i++) s += twice(i);\n"
    "  if (argc > 5) printf(\"%s\\n\", argv[1]);\n"
    "  printf(\"%d\\n\", s);\n"
    "  return 0;\n"
    "}\n";

// Conditions of every kind gcc counts as branches: && and ||, else-if chains, a switch, ?:,
// loops, and a function never called.
const char kBranchy[] =
    "#include <stdio.h>\n"
    "#include <string.h>\n"
    "static int classify(int x) {\n"
    "  if (x < 0 && x > -100) return -1;\n"
    "  else if (x == 0 || x == 7) return 0;\n"
    "  switch (x) { case 1: return 1; case 2: return 2; default: break; }\n"
    "  return x > 10 ? 3 : 4;\n"
    "}\n"
    "static int never(int y) {\n"
    "  return y ? y + 1 : 0;\n"
    "}\n"
    "int main(int argc, char **argv) {\n"
    "  int s = 0;\n"
    "  for (int i = 0; i < 4; i++) s += classify(i);\n"
    "  while (argc-- > 1) s += (int)strlen(argv[argc]);\n"
    "  if (s > 1000) s = never(s);\n"
    "  printf(\"%d\\n\", s);\n"
    "  return 0;\n"
    "}\n";

// A virtual destructor (gcc emits its deleting and base variants, which demangle alike),
// overloads, a constructor, and a throw with its exception branches.
const char kShapes[] =
    "#include <cstdio>\n"
    "#include <stdexcept>\n"
    "struct Shape {\n"
    "  virtual ~Shape() { std::puts(\"bye\"); }\n"
    "  virtual double area() const = 0;\n"
    "};\n"
    "struct Square : Shape {\n"
    "  double s;\n"
    "  explicit Square(double x) : s(x) {}\n"
    "  double area() const override { return s * s; }\n"
    "};\n"
    "double over(double x) { return x * 2; }\n"
    "int over(int x) { if (x > 3) throw std::runtime_error(\"big\"); return x + 1; }\n"
    "long over(long x) { return x - 1; }\n"
    "int main(int argc, char**) {\n"
    "  Shape* p = new Square(2.0);\n"
    "  double a = p->area() + over(1.5) + over(argc);\n"
    "  delete p;\n"
    "  try { over(argc + 5); } catch (const std::exception&) { a += 1; }\n"
    "  { Square q(1.0); a += q.area(); }\n"
    "  std::printf(\"%f\\n\", a);\n"
    "  return 0;\n"
    "}\n";

// lcov's exclusion markers, each kind: lcov leaves out what they mark when it captures,
// and so must every other route.
const char kMarked[] =
    "#include <cstdio>\n"
    "#include <stdexcept>\n"
    "int checked(int x) {\n"
    "  if (x > 100) throw std::out_of_range(\"x\");  // LCOV_EXCL_EXCEPTION_BR_LINE\n"
    "  if (x < 0) return -x;  // LCOV_EXCL_LINE\n"
    "  return x > 5 && x < 9 ? 1 : 2;  // LCOV_EXCL_BR_LINE\n"
    "}\n"
    "// LCOV_EXCL_START\n"
    "int debugOnly(int x) {\n"
    "  return x ? x * 3 : 1;\n"
    "}\n"
    "// LCOV_EXCL_STOP\n"
    "int main(int argc, char**) {\n"
    "  int s = checked(argc) + checked(7);\n"
    "  try { s += checked(argc + 200); } catch (const std::exception&) { s++; }\n"
    "  std::printf(\"%d\\n\", s);\n"
    "  return argc > 3 ? debugOnly(s) : 0;\n"
    "}\n";

// Functions a macro writes on one line each time it is used, as libuv's loop watchers and
// RB_GENERATE do.
const char kMacroFunctions[] =
    "#include <stdio.h>\n"
    "#define DEFINE_OPS(name) \\\n"
    "  int name##_get(int x) { return x > 0 ? x + 1 : 0; } \\\n"
    "  int name##_set(int x) { return x * 2; } \\\n"
    "  int name##_clear(int x) { return x - 3; }\n"
    "DEFINE_OPS(alpha)\n"
    "DEFINE_OPS(beta)\n"
    "DEFINE_OPS(gamma)\n"
    "int main(void) {\n"
    "  int s = alpha_set(1) + alpha_get(2) + alpha_get(-2) + beta_clear(3);\n"
    "  printf(\"%d\\n\", s);\n"
    "  return 0;\n"
    "}\n";

struct Built {
  kgtest::TempDir dir;
  std::string shell(const std::string& cmd) {
    auto r = runProcess({"/bin/sh", "-c", cmd}, {}, "", dir.path());
    EXPECT_EQ(r.status, 0) << cmd << "\n" << r.err;
    return r.out;
  }
  std::string real(const std::string& name) {
    char buf[4096];
    return realpath(dir.file(name).c_str(), buf) ? std::string(buf) : dir.file(name);
  }
};

// Builds NAME (.c or .cc) with coverage into NAME's stem, runs it `runs` times.
void buildAndRun(Built& b, const std::string& name, const std::string& source, int runs,
                 const std::string& args = "") {
  kgtest::writeFile(b.dir.file(name), source);
  std::string stem = name.substr(0, name.rfind('.'));
  std::string cc = name.size() > 3 && name.compare(name.size() - 3, 3, ".cc") == 0 ? "g++" : "gcc";
  b.shell(cc + " --coverage -O0 -c " + name + " -o " + stem + ".o && " + cc + " --coverage -o " + stem +
          " " + stem + ".o");
  for (int i = 0; i < runs; ++i) b.shell("./" + stem + " " + args + " > /dev/null");
}

std::string capture(Built& b, const std::string& dir, const std::string& out) {
  b.shell("lcov -q --rc lcov_branch_coverage=1 --capture --directory " + dir + " --output-file " + out +
          " 2>/dev/null");
  return kgtest::readFile(b.dir.file(out));
}

// gcov's JSON with branch counts, as a user would make it for one data file.
std::string gcovJson(Built& b, const std::string& gcda, const std::string& out) {
  b.shell("gcov --branch-probabilities --json-format --stdout " + gcda + " > " + out + " 2>/dev/null");
  return b.dir.file(out);
}

void import(Built& b, const std::string& out, const std::vector<std::string>& inputs,
            const std::vector<std::string>& options = {}) {
  std::vector<std::string> argv = {kgtest::binPath("kestrel-import"), "-o", b.dir.file(out)};
  argv.insert(argv.end(), options.begin(), options.end());
  argv.insert(argv.end(), inputs.begin(), inputs.end());
  auto r = runProcess(argv, {}, "", b.dir.path());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
}

// Per source file, the figures lcov reports: distinct lines, functions and branch
// outcomes, a record's repeats (a header in several objects) added up as lcov adds them.
struct Figures {
  int lines = 0, linesHit = 0, functions = 0, functionsHit = 0, branches = 0, branchesHit = 0;
  bool operator==(const Figures& o) const {
    return lines == o.lines && linesHit == o.linesHit && functions == o.functions &&
           functionsHit == o.functionsHit && branches == o.branches && branchesHit == o.branchesHit;
  }
};

std::ostream& operator<<(std::ostream& os, const Figures& f) {
  return os << "{lines " << f.linesHit << "/" << f.lines << ", functions " << f.functionsHit << "/"
            << f.functions << ", branches " << f.branchesHit << "/" << f.branches << "}";
}

struct LcovFile {
  std::map<std::uint32_t, std::uint64_t> lines;
  std::map<std::string, std::uint32_t> fnLine;
  std::map<std::string, std::uint64_t> fnCalls;
  std::map<std::string, std::uint64_t> branches;  // "line,block,branch"
};

std::map<std::string, LcovFile> readTracefile(const std::string& text) {
  std::map<std::string, LcovFile> files;
  LcovFile* f = nullptr;
  std::istringstream in(text);
  std::string line;
  while (std::getline(in, line)) {
    size_t colon = line.find(':');
    std::string key = line.substr(0, colon), v = colon == std::string::npos ? "" : line.substr(colon + 1);
    if (key == "SF") f = &files[v];
    if (!f) continue;
    size_t c = v.find(','), last = v.rfind(',');
    if (key == "DA") f->lines[std::stoul(v.substr(0, c))] += std::stoull(v.substr(c + 1));
    if (key == "FN") f->fnLine[v.substr(c + 1)] = std::stoul(v.substr(0, c));
    if (key == "FNDA") f->fnCalls[v.substr(c + 1)] += std::stoull(v.substr(0, c));
    if (key == "BRDA") {
      std::string taken = v.substr(last + 1);
      f->branches[v.substr(0, last)] += taken == "-" ? 0 : std::stoull(taken);
    }
  }
  return files;
}

std::map<std::string, Figures> lcovFigures(const std::string& tracefile) {
  std::map<std::string, Figures> out;
  for (const auto& [path, f] : readTracefile(tracefile)) {
    Figures& g = out[path];
    for (const auto& [l, hits] : f.lines) ++g.lines, g.linesHit += hits != 0;
    for (const auto& [name, line] : f.fnLine) ++g.functions, g.functionsHit += f.fnCalls.count(name) && f.fnCalls.at(name) != 0;
    for (const auto& [k, taken] : f.branches) ++g.branches, g.branchesHit += taken != 0;
  }
  return out;
}

// The export report, by file and function.
struct FunctionReport {
  int unusedBlocks = 0, blocks = 0, unusedLines = 0, lines = 0, calls = 0;
  std::vector<std::pair<int, int>> bl;           // line, hits
  std::vector<std::pair<int, std::string>> li;   // line, hits
};
struct FileReport {
  int unusedBlocks = 0, blocks = 0, unusedLines = 0, lines = 0, unusedFuncs = 0, funcs = 0, sessions = 0;
  std::map<std::string, FunctionReport> functions;
};
using Report = std::map<std::string, FileReport>;

std::vector<std::string> fields(const std::string& line) {
  std::vector<std::string> f;
  std::istringstream in(line);
  std::string x;
  while (std::getline(in, x, '\t')) f.push_back(x);
  return f;
}

Report exportOf(Built& b, const std::string& kgv) {
  kgtest::writeFile(b.dir.file(".none.adjust"), "");
  auto r = runProcess({kgtest::binPath("kestrel"), "-export", "-adjustmentfilename=" + b.dir.file(".none.adjust"),
                       b.dir.file(kgv)},
                      {"HOME=" + b.dir.path(), "LANG=C", "LC_ALL", "KESTREL_HITS_POLICY"}, "", b.dir.path());
  EXPECT_EQ(r.status, 0) << r.err;
  Report report;
  std::string dir;
  FileReport* file = nullptr;
  FunctionReport* fn = nullptr;
  std::istringstream in(r.out);
  std::string line;
  while (std::getline(in, line)) {
    auto f = fields(line);
    if (f.empty() || f[0].empty() || f[0][0] == '#') continue;
    auto n = [&](size_t i) { return i < f.size() ? std::stoi(f[i]) : -1; };
    if (f[0] == "di") dir = f[1];
    if (f[0] == "fi") {
      file = &report[dir + f[1]];
      *file = {n(2), n(3), n(4), n(5), n(6), n(7), n(8), {}};
    }
    if (f[0] == "fu" && file) {
      fn = &file->functions[f[1]];
      *fn = {n(2), n(3), n(4), n(5), n(6), {}, {}};
    }
    if (f[0] == "bl" && fn) fn->bl.emplace_back(n(1), n(2));
    if (f[0] == "li" && fn) fn->li.emplace_back(n(1), f.at(2));
  }
  return report;
}

// What lcov would count, from the export: the blocks beyond a line's own block are its
// branch outcomes; "(file scope)" is none of lcov's functions.
std::map<std::string, Figures> kestrelFigures(const Report& report) {
  std::map<std::string, Figures> out;
  for (const auto& [path, f] : report) {
    Figures& g = out[path];
    g.lines = f.lines;
    g.linesHit = f.lines - f.unusedLines;
    g.functions = f.funcs;
    g.functionsHit = f.funcs - f.unusedFuncs;
    auto fs = f.functions.find("(file scope)");
    if (fs != f.functions.end()) {
      --g.functions;
      g.functionsHit -= fs->second.calls != 0;
    }
    g.branches = f.blocks - f.lines;
    g.branchesHit = (f.blocks - f.unusedBlocks) - (f.lines - f.unusedLines);
  }
  return out;
}

bool sameReport(const Report& a, const Report& b, bool withSessions, std::string& why) {
  std::ostringstream w;
  for (const auto& [path, f] : a) {
    auto it = b.find(path);
    if (it == b.end()) {
      w << path << " only on one side\n";
      continue;
    }
    const FileReport& g = it->second;
    if (f.unusedBlocks != g.unusedBlocks || f.blocks != g.blocks || f.unusedLines != g.unusedLines ||
        f.lines != g.lines || f.unusedFuncs != g.unusedFuncs || f.funcs != g.funcs ||
        (withSessions && f.sessions != g.sessions))
      w << path << ": file figures differ\n";
    for (const auto& [name, x] : f.functions) {
      auto y = g.functions.find(name);
      if (y == g.functions.end()) {
        w << path << ": " << name << " only on one side\n";
        continue;
      }
      if (x.unusedBlocks != y->second.unusedBlocks || x.blocks != y->second.blocks || x.lines != y->second.lines ||
          x.unusedLines != y->second.unusedLines || x.calls != y->second.calls || x.bl != y->second.bl ||
          x.li != y->second.li)
        w << path << ": " << name << " differs\n";
    }
    if (f.functions.size() != g.functions.size()) w << path << ": other functions\n";
  }
  if (a.size() != b.size()) w << "other files\n";
  why = w.str();
  return why.empty();
}

struct RecordView {
  std::string path;
  std::map<std::string, std::uint16_t> calls;
  std::map<std::uint32_t, std::vector<std::uint16_t>> blocks;  // line -> hits of its blocks
  std::uint32_t signature = 0, buildTime = 0;
};

std::vector<RecordView> records(const std::string& kgv) {
  std::unique_ptr<KgvData> d;
  EXPECT_EQ(readKgvFile(kgv, d), allOK);
  std::vector<RecordView> out;
  if (!d) return out;
  for (const auto& rp : d->records) {
    const ObjRecord& r = *rp;
    RecordView v;
    v.path = r.fileName();
    v.signature = r.objHeader.signature;
    v.buildTime = r.objHeader.buildTime;
    for (size_t i = 0; i < r.map.size(); ++i) {
      std::uint32_t tag = mapTag(r.map[i]), value = mapValue(r.map[i]);
      if (tag == TagFunction) v.calls[r.nameAt(value)] = r.counts[i];
      if (tag == TagBlock) v.blocks[value].push_back(r.counts[i]);
    }
    out.push_back(v);
  }
  return out;
}

}  // namespace

// Every route to a data file gives lcov's figures per file, branches included, lcov's
// exclusion markers heeded; and the one command on the build directory gives exactly what
// the tracefile gives.
TEST(ImportFromRealTools, EveryRouteAgreesWithLcovOnLinesFunctionsAndBranches) {
  for (const auto& [name, source] : {std::pair<std::string, std::string>{"branchy.c", kBranchy},
                                     {"shapes.cc", kShapes}, {"marked.cc", kMarked}}) {
    SCOPED_TRACE(name);
    Built b;
    buildAndRun(b, name, source, 2, "some words");
    std::string stem = name.substr(0, name.rfind('.'));
    std::string info = capture(b, ".", "app.info");
    auto expected = lcovFigures(info);
    ASSERT_TRUE(expected.count(b.real(name))) << info;
    EXPECT_GT(expected[b.real(name)].branches, 4);
    EXPECT_GT(expected[b.real(name)].branchesHit, 0);
    EXPECT_LT(expected[b.real(name)].branchesHit, expected[b.real(name)].branches);

    import(b, "tracefile.kgv", {"app.info"});
    import(b, "json.kgv", {gcovJson(b, stem + ".gcda", "app.json")});
    import(b, "tree.kgv", {b.dir.path()});
    Report fromInfo = exportOf(b, "tracefile.kgv");
    EXPECT_EQ(kestrelFigures(fromInfo), expected);
    std::string why;
    // lcov also reports the library headers the program inlines: gcov's JSON of the program
    // and the build directory give the same.
    EXPECT_TRUE(sameReport(fromInfo, exportOf(b, "tree.kgv"), true, why)) << why;
    EXPECT_TRUE(sameReport(fromInfo, exportOf(b, "json.kgv"), true, why)) << why;
    // The records themselves: one source, one signature and build time by every route.
    auto t = records(b.dir.file("tracefile.kgv")), d = records(b.dir.file("tree.kgv"));
    ASSERT_EQ(t.size(), d.size());
    for (size_t i = 0; i < t.size(); ++i) {
      EXPECT_EQ(t[i].path, d[i].path);
      EXPECT_EQ(t[i].signature, d[i].signature);
      EXPECT_EQ(t[i].buildTime, d[i].buildTime);
      EXPECT_EQ(t[i].blocks, d[i].blocks);
      EXPECT_EQ(t[i].calls, d[i].calls);
    }
  }
}

// C++ functions are told apart by their mangled names, as lcov counts them, and shown by
// their demangled ones; variants that demangle alike say which they are.
TEST(ImportFromRealTools, CxxNamesAreDemangledAndVariantsCountAsLcovCountsThem) {
  Built b;
  buildAndRun(b, "shapes.cc", kShapes, 1);
  std::string info = capture(b, ".", "app.info");
  LcovFile lcovShapes = readTracefile(info)[b.real("shapes.cc")];
  ASSERT_GE(lcovShapes.fnLine.size(), 8u);
  std::string mangled;
  for (const auto& [name, line] : lcovShapes.fnLine) mangled += name + "\n";
  auto filt = runProcess({"/usr/bin/c++filt"}, {}, mangled);
  ASSERT_EQ(filt.status, 0);
  std::multiset<std::string> demangled;
  std::istringstream in(filt.out);
  for (std::string l; std::getline(in, l);) demangled.insert(l);

  import(b, "tracefile.kgv", {"app.info"});
  import(b, "json.kgv", {gcovJson(b, "shapes.gcda", "app.json")});
  for (const char* kgv : {"tracefile.kgv", "json.kgv"}) {
    SCOPED_TRACE(kgv);
    Report r = exportOf(b, kgv);
    const FileReport& f = r[b.real("shapes.cc")];
    EXPECT_EQ(kestrelFigures(r)[b.real("shapes.cc")], lcovFigures(info)[b.real("shapes.cc")]);
    std::multiset<std::string> shown;
    std::map<std::string, int> calls;
    for (const auto& [name, fn] : f.functions) {
      if (name == "(file scope)") continue;
      // A name shown with its variant: the demangled name, then " [D0]" and the like.
      std::string base = name.substr(0, name.find(" ["));
      shown.insert(base);
      calls[base] += fn.calls;
    }
    EXPECT_EQ(shown, demangled);
    EXPECT_EQ(f.functions.count("Shape::~Shape() [D0]"), 1u);
    EXPECT_EQ(f.functions.count("Shape::~Shape() [D2]"), 1u);
    EXPECT_EQ(f.functions.count("over(int)"), 1u);
    std::map<std::string, int> lcovCalls;
    std::string names;
    for (const auto& [name, c] : lcovShapes.fnCalls) names += name + "\n";
    auto each = runProcess({"/usr/bin/c++filt"}, {}, names);
    std::istringstream shownNames(each.out);
    for (const auto& [name, c] : lcovShapes.fnCalls) {
      std::string d;
      std::getline(shownNames, d);
      lcovCalls[d] += static_cast<int>(c);
    }
    EXPECT_EQ(calls, lcovCalls);
  }
}

// Functions written on one line by a macro: the line's code goes to the last of them by
// name, the others keep the line as their first with their calls, and both routes give the
// same report with lcov's figures.
TEST(ImportFromRealTools, FunctionsSharingALineKeepLcovsFiguresByBothRoutes) {
  Built b;
  buildAndRun(b, "ops.c", kMacroFunctions, 1);
  std::string info = capture(b, ".", "app.info");
  import(b, "tracefile.kgv", {"app.info"});
  import(b, "tree.kgv", {b.dir.path()});
  Report t = exportOf(b, "tracefile.kgv"), d = exportOf(b, "tree.kgv");
  std::string why;
  EXPECT_TRUE(sameReport(t, d, true, why)) << why;
  EXPECT_EQ(kestrelFigures(t), lcovFigures(info));

  LcovFile lf = readTracefile(info)[b.real("ops.c")];
  const FileReport& f = t[b.real("ops.c")];
  std::map<std::uint32_t, std::vector<std::string>> byLine;
  for (const auto& [name, line] : lf.fnLine) byLine[line].push_back(name);
  int shared = 0;
  for (const auto& [line, names] : byLine) {
    if (names.size() < 2) continue;
    ++shared;
    int owners = 0;
    std::string last = *std::max_element(names.begin(), names.end());
    for (const auto& name : names) {
      ASSERT_TRUE(f.functions.count(name)) << name;
      const FunctionReport& fn = f.functions.at(name);
      EXPECT_EQ(fn.calls, static_cast<int>(lf.fnCalls[name])) << name;
      // Every function of the line shows it, with the line's count.
      ASSERT_EQ(fn.li.size(), 1u) << name;
      EXPECT_EQ(fn.li[0].first, static_cast<int>(line));
      EXPECT_EQ(fn.li[0].second, std::to_string(lf.lines[line]));
      if (fn.lines != 0) {
        ++owners;
        EXPECT_EQ(fn.lines, 1) << name;
        EXPECT_EQ(name, last);
      } else {
        EXPECT_EQ(fn.blocks, 0) << name;
      }
    }
    EXPECT_EQ(owners, 1) << "line " << line;
  }
  EXPECT_EQ(shared, 3);
}

// Runs that called other functions of a line, captured and imported apart, merge in either
// order as one import of both: the line stays with one function, and no function doubles.
TEST(ImportFromRealTools, CapturesThatCalledOtherFunctionsOfALineMergeAsOneImport) {
  Built b;
  kgtest::writeFile(b.dir.file("ops.c"),
                    "#include <stdio.h>\n"
                    "#define DEFINE_OPS(name) \\\n"
                    "  int name##_get(int x) { return x > 0 ? x + 1 : 0; } \\\n"
                    "  int name##_set(int x) { return x * 2; } \\\n"
                    "  int name##_clear(int x) { return x - 3; }\n"
                    "DEFINE_OPS(alpha)\n"
                    "DEFINE_OPS(beta)\n"
                    "int main(int argc, char **argv) {\n"
                    "  (void)argv;\n"
                    "  if (argc > 1) printf(\"%d\\n\", beta_set(2) + alpha_clear(1));\n"
                    "  else printf(\"%d\\n\", alpha_set(1) + alpha_get(2) + beta_get(-2));\n"
                    "  return 0;\n"
                    "}\n");
  b.shell("gcc --coverage -O0 -c ops.c -o ops.o && gcc --coverage -o ops ops.o && ./ops > /dev/null");
  capture(b, ".", "one.info");
  b.shell("lcov -q --zerocounters --directory . 2>/dev/null; ./ops x > /dev/null");
  capture(b, ".", "two.info");
  auto one = readTracefile(kgtest::readFile(b.dir.file("one.info")))[b.real("ops.c")];
  auto two = readTracefile(kgtest::readFile(b.dir.file("two.info")))[b.real("ops.c")];
  ASSERT_NE(one.fnCalls, two.fnCalls);
  b.shell("lcov -q --rc lcov_branch_coverage=1 -a one.info -a two.info -o both.info 2>/dev/null");
  import(b, "one.kgv", {"one.info"});
  import(b, "two.kgv", {"two.info"});
  import(b, "combined.kgv", {"one.info", "two.info"});
  Report combined = exportOf(b, "combined.kgv");
  EXPECT_EQ(kestrelFigures(combined), lcovFigures(kgtest::readFile(b.dir.file("both.info"))));
  for (const auto& order : {std::pair<std::string, std::string>{"one.kgv", "two.kgv"}, {"two.kgv", "one.kgv"}}) {
    SCOPED_TRACE(order.first + " then " + order.second);
    auto m = runProcess({kgtest::binPath("kestrel"), "-merge=all.kgv", order.first, order.second},
                        {"HOME=" + b.dir.path()}, "", b.dir.path());
    ASSERT_EQ(m.status, 0) << m.err;
    EXPECT_EQ(m.err, "");
    std::string why;
    EXPECT_TRUE(sameReport(exportOf(b, "all.kgv"), combined, false, why)) << why;
  }
}

// A library directory and its tests captured apart: the header they both inline holds other
// lines in each capture, yet it is one source, and the merged captures equal one import of
// both, in either order and by either route.
TEST(ImportFromRealTools, CapturesOfOneProgramMergeInEitherOrderAsOneImport) {
  Built b;
  b.shell("mkdir -p lib tests");
  kgtest::writeFile(b.dir.file("lib/ops.h"),
                    "static inline int clamp(int v, int lo, int hi) {\n"
                    "  if (v < lo) return lo;\n"
                    "  if (v > hi) return hi;\n"
                    "  return v;\n"
                    "}\n"
                    "static inline int twice(int v) {\n"
                    "  return v > 100 ? v : 2 * v;\n"
                    "}\n"
                    "static inline int sign(int v) {\n"
                    "  return v > 0 ? 1 : v < 0 ? -1 : 0;\n"
                    "}\n");
  kgtest::writeFile(b.dir.file("lib/scale.c"),
                    "#include \"ops.h\"\n"
                    "int scale(int v) { return twice(clamp(v, 0, 10)); }\n");
  kgtest::writeFile(b.dir.file("tests/run.c"),
                    "#include <stdio.h>\n"
                    "#include \"../lib/ops.h\"\n"
                    "int scale(int v);\n"
                    "int main(void) {\n"
                    "  int s = 0;\n"
                    "  for (int i = -3; i < 14; i++) s += scale(i) + sign(i) + twice(i);\n"
                    "  printf(\"%d\\n\", s);\n"
                    "  return 0;\n"
                    "}\n");
  b.shell("gcc --coverage -O0 -c lib/scale.c -o lib/scale.o && gcc --coverage -O0 -c tests/run.c -o tests/run.o"
          " && gcc --coverage -o tests/run lib/scale.o tests/run.o && tests/run > /dev/null");
  std::string libInfo = capture(b, "lib", "lib.info"), testsInfo = capture(b, "tests", "tests.info");
  std::string header = b.real("lib/ops.h");
  auto libLines = readTracefile(libInfo)[header].lines, testLines = readTracefile(testsInfo)[header].lines;
  ASSERT_FALSE(libLines.empty());
  ASSERT_NE(libLines, testLines);  // the header is inlined differently in the two captures
  b.shell("lcov -q --rc lcov_branch_coverage=1 -a lib.info -a tests.info -o all.info 2>/dev/null");

  struct Route {
    const char* name;
    std::vector<std::string> lib, tests;
  };
  for (const Route& route : {Route{"tracefiles", {"lib.info"}, {"tests.info"}},
                             Route{"build directories", {"lib"}, {"tests"}}}) {
    SCOPED_TRACE(route.name);
    import(b, "lib.kgv", route.lib);
    import(b, "tests.kgv", route.tests);
    std::vector<std::string> both = route.lib;
    both.insert(both.end(), route.tests.begin(), route.tests.end());
    import(b, "combined.kgv", both);
    Report combined = exportOf(b, "combined.kgv");
    // One gcov process at a time or several: the same data.
    import(b, "serial.kgv", both, {"--jobs", "1"});
    std::string serialWhy;
    EXPECT_TRUE(sameReport(exportOf(b, "serial.kgv"), combined, true, serialWhy)) << serialWhy;
    EXPECT_EQ(kestrelFigures(combined), lcovFigures(kgtest::readFile(b.dir.file("all.info"))));
    for (const auto& order : {std::pair<std::string, std::string>{"lib.kgv", "tests.kgv"}, {"tests.kgv", "lib.kgv"}}) {
      SCOPED_TRACE(order.first + " then " + order.second);
      kgtest::writeFile(b.dir.file(".none.adjust"), "");
      auto m = runProcess({kgtest::binPath("kestrel"), "-merge=all.kgv", order.first, order.second},
                          {"HOME=" + b.dir.path()}, "", b.dir.path());
      ASSERT_EQ(m.status, 0) << m.err;
      EXPECT_EQ(m.err, "");  // nothing set aside as out of date
      Report merged = exportOf(b, "all.kgv");
      std::string why;
      // Two captures are two sessions; everything else is as one import of both.
      EXPECT_TRUE(sameReport(merged, combined, false, why)) << why;
      EXPECT_EQ(merged[header].sessions, 2);
    }
  }
}

// A build outside the source tree names its sources with "..", relative to gcov's working
// directory; tracefiles name them absolutely or relative to a base directory. Every route
// gives one file.
TEST(ImportFromRealTools, AnOutOfTreeBuildGivesOneFilePerSourceByEveryRoute) {
  Built b;
  b.shell("mkdir -p src obj/sub");
  kgtest::writeFile(b.dir.file("src/prog.c"), kProgram);
  b.shell("cd obj/sub && gcc --coverage -O0 -c ../../src/prog.c -o prog.o && gcc --coverage -o prog prog.o && ./prog > /dev/null");
  std::string json = gcovJson(b, "obj/sub/prog.gcda", "prog.json");
  ASSERT_NE(kgtest::readFile(json).find("\"../../src/prog.c\""), std::string::npos);
  std::string info = capture(b, "obj/sub", "prog.info");
  // The same tracefile with the source named relative to the tree's top, as other tools write.
  std::string relative = info;
  std::string sf = "SF:" + b.real("src/prog.c");
  ASSERT_NE(relative.find(sf), std::string::npos);
  relative.replace(relative.find(sf), sf.size(), "SF:src/./prog.c");
  kgtest::writeFile(b.dir.file("obj/relative.info"), relative);

  import(b, "all.kgv", {json, "prog.info", "obj/sub", "obj/relative.info"}, {"--base-directory", b.dir.path()});
  auto all = records(b.dir.file("all.kgv"));
  ASSERT_EQ(all.size(), 1u);
  EXPECT_EQ(all[0].path, b.real("src/prog.c"));
  // Without the option, relative names are taken from the current directory.
  auto r = runProcess({kgtest::binPath("kestrel-import"), "-o", b.dir.file("rel.kgv"), "obj/relative.info", "prog.info"},
                 {}, "", b.dir.path());
  ASSERT_EQ(r.status, 0) << r.err;
  auto rel = records(b.dir.file("rel.kgv"));
  ASSERT_EQ(rel.size(), 1u);
  EXPECT_EQ(rel[0].path, b.real("src/prog.c"));
  // Each route alone gives that file's figures.
  import(b, "json.kgv", {json});
  EXPECT_EQ(kestrelFigures(exportOf(b, "json.kgv")), lcovFigures(info));
}

TEST(ImportFromRealTools, ImportsOfOneBuildMergeAndAChangedSourceIsOutOfDate) {
  Built b;
  buildAndRun(b, "prog.c", kProgram, 1);
  std::string first = capture(b, ".", "first.info");
  b.shell("./prog > /dev/null && lcov -q --zerocounters --directory . 2>/dev/null; ./prog > /dev/null");
  std::string second = capture(b, ".", "second.info");
  import(b, "a.kgv", {"first.info"});
  import(b, "b.kgv", {"second.info"});
  auto m = runProcess({kgtest::binPath("kestrel"), "-merge=all.kgv", "a.kgv", "b.kgv"},
                      {"HOME=" + b.dir.path()}, "", b.dir.path());
  ASSERT_EQ(m.status, 0) << m.err;
  EXPECT_EQ(m.err, "");
  auto all = records(b.dir.file("all.kgv"));
  ASSERT_EQ(all.size(), 1u);
  auto one = readTracefile(first)[b.real("prog.c")], two = readTracefile(second)[b.real("prog.c")];
  for (const auto& [name, calls] : one.fnCalls) EXPECT_EQ(all[0].calls[name], calls + two.fnCalls[name]) << name;
  EXPECT_EQ(exportOf(b, "all.kgv")[b.real("prog.c")].sessions, 2);

  // The source changes (one more line): its coverage is another version of the file.
  std::string changed = kProgram;
  changed.insert(changed.find("  return 0;"), "  s++;\n");
  buildAndRun(b, "prog.c", changed, 1);
  capture(b, ".", "third.info");
  import(b, "c.kgv", {"third.info"});
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
  EXPECT_EQ(r.err.rfind("usage: kestrel-import -o OUT.kgv [OPTIONS] INPUT...", 0), 0u);
  r = runProcess({importer, "--bogus", "-o", dir.file("out.kgv"), dir.file("bad.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err.rfind("kestrel-import: unknown option '--bogus'\nusage:", 0), 0u) << r.err;
  kgtest::writeFile(dir.file("empty.info"), "TN:\n");
  r = runProcess({importer, "-o", dir.file("out.kgv"), dir.file("empty.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: the inputs hold no coverage data\n");
  EXPECT_FALSE(kgtest::fileExists(dir.file("out.kgv")));
}

// What a user meets first: a misspelt output folder, a tracefile cut short by a full disk,
// a build directory not yet run, no gcov on the machine, a stale data file.
TEST(ImportCommand, MessagesSayWhatIsWrongAndWhatToDo) {
  Built b;
  buildAndRun(b, "prog.c", kProgram, 1);
  std::string info = capture(b, ".", "prog.info");
  std::string importer = kgtest::binPath("kestrel-import");

  auto r = runProcess({importer, "-o", b.dir.file("no/such/out.kgv"), b.dir.file("prog.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: cannot write " + b.dir.file("no/such/out.kgv") + ": the folder " +
                       b.dir.file("no/such") + " does not exist\n");

  // A folder no file can be made in (even by root): no advice of an option this program lacks.
  r = runProcess({importer, "-o", "/proc/out.kgv", b.dir.file("prog.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err.rfind("kestrel-import: cannot write /proc/out.kgv: its lock directory could not be created; "
                        "check that you may write in /proc\n", 0), 0u) << r.err;
  EXPECT_EQ(r.err.find("-locking"), std::string::npos) << r.err;

  // Cut in the middle of a line, and at a line's end.
  size_t da = info.find("\nDA:") + 3;
  kgtest::writeFile(b.dir.file("cut.info"), info.substr(0, da));
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.file("cut.info")});
  EXPECT_EQ(r.status, 2);
  EXPECT_NE(r.err.find("cut.info:"), std::string::npos) << r.err;
  EXPECT_NE(r.err.find(": the tracefile looks truncated: its last line 'DA' is incomplete"), std::string::npos) << r.err;
  kgtest::writeFile(b.dir.file("cut.info"), info.substr(0, info.find('\n', da) + 1));
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.file("cut.info")});
  EXPECT_NE(r.err.find(": the tracefile looks truncated: its last record has no end_of_record"), std::string::npos) << r.err;
  std::string json = kgtest::readFile(gcovJson(b, "prog.gcda", "prog.json"));
  kgtest::writeFile(b.dir.file("cut.json"), json.substr(0, json.size() / 2));
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.file("cut.json")});
  EXPECT_NE(r.err.find("cut.json:1: the gcov JSON looks truncated"), std::string::npos) << r.err;
  EXPECT_FALSE(kgtest::fileExists(b.dir.file("out.kgv")));

  b.shell("mkdir -p empty && cp prog.o empty/");
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.file("empty")});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: no .gcda files under " + b.dir.file("empty") +
                       ": build with --coverage (when compiling and linking), run the program or its "
                       "tests, then import the build directory\n");

  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.path()}, {"PATH=/nonexistent"});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "kestrel-import: cannot run gcov: 'gcov' was not found on PATH; install gcc's gcov "
                   "(the Debian package gcc), or name the program with --gcov-tool\n");
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), "--gcov-tool", "/usr/bin/gcov-none", b.dir.path()});
  EXPECT_EQ(r.err, "kestrel-import: cannot run gcov: '/usr/bin/gcov-none' was not found; install gcc's gcov "
                   "(the Debian package gcc), or name the program with --gcov-tool\n");
  EXPECT_FALSE(kgtest::fileExists(b.dir.file("out.kgv")));

  // A data file gcov cannot read is reported in gcov's words; the others are imported.
  kgtest::writeFile(b.dir.file("stale.gcda"), "not coverage");
  r = runProcess({importer, "-o", b.dir.file("out.kgv"), b.dir.path()});
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_NE(r.err.find("kestrel-import: gcov: " + b.dir.file("stale.gcda")), std::string::npos) << r.err;
  auto recs = records(b.dir.file("out.kgv"));
  ASSERT_EQ(recs.size(), 1u);
  EXPECT_EQ(recs[0].path, b.real("prog.c"));
}

#if !defined(__SANITIZE_ADDRESS__)  // a limit on the address space leaves no room for the sanitizer's
TEST(ImportCommand, RunningOutOfMemoryEndsWithAMessageAndLeavesTheOutputAsItWas) {
  kgtest::TempDir dir;
  // About 10 MB of tracefile: it needs several times the memory the limit leaves.
  std::string text;
  for (int f = 0; text.size() < (std::size_t(10) << 20); ++f) {
    text += "TN:\nSF:/src/d" + std::to_string(f % 400) + "/file" + std::to_string(f) + ".c\n";
    for (int k = 0; k < 4; ++k) text += "FN:" + std::to_string(k * 25 + 1) + ",func_" + std::to_string(f) + "_" + std::to_string(k) + "\n";
    for (int l = 1; l <= 100; l += 3) text += "DA:" + std::to_string(l) + "," + std::to_string((l * f) % 7) + "\n";
    text += "end_of_record\n";
  }
  const std::string input = dir.file("big.info"), output = dir.file("out.kgv");
  kgtest::writeFile(input, text);
  kgtest::writeFile(output, "the previous contents");
  const std::string importer = kgtest::binPath("kestrel-import");
  auto r = runProcess({"/bin/sh", "-c", "ulimit -v 40000 && exec '" + importer + "' -o '" + output + "' '" + input + "'"});
  EXPECT_EQ(r.status, 2) << r.err;
  EXPECT_EQ(r.err, "kestrel-import: out of memory\n");
  EXPECT_EQ(kgtest::readFile(output), "the previous contents");
  EXPECT_EQ(kgtest::filesIn(dir.path()).size(), 2u);  // no lock or new copy left behind
  // With room, the same input imports.
  r = runProcess({importer, "-o", output, input});
  EXPECT_EQ(r.status, 0) << r.err;
}
#endif

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
