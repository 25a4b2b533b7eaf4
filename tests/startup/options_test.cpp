// The viewer option parser.
#include <gtest/gtest.h>

#include <cstring>

#include "startup/viewer_options.h"

namespace {

// Owns a writable argument vector as the parser needs one.
struct Args {
  explicit Args(std::vector<std::string> a) : store(std::move(a)) {
    for (auto& s : store) ptrs.push_back(s.data());
    ptrs.push_back(nullptr);
    argc = static_cast<int>(store.size());
  }
  std::vector<std::string> rest() const {
    std::vector<std::string> r;
    for (int i = 0; i < argc; ++i) r.emplace_back(ptrs[static_cast<size_t>(i)]);
    return r;
  }
  std::vector<std::string> store;
  std::vector<char*> ptrs;
  int argc;
};

}  // namespace

TEST(ViewerOptions, ParsingRecordsFirstOccurrencesAndCompactsTheVector) {
  testing::internal::CaptureStderr();
  auto t = makeViewerOptionTable();
  Args a({"kestrel-viewer", "x.kgv", "-sort=alpha", "", "-Sort=lines", "y.kgv", "-force-merge",
          "-VERBOSE=1", "-userpath=/src:/lib"});
  EXPECT_EQ(parseViewerOptions("kestrel -view", t, a.argc, a.ptrs.data()), allOK);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(a.rest(), (std::vector<std::string>{"kestrel-viewer", "x.kgv", "y.kgv"}));
  EXPECT_EQ(a.ptrs[3], nullptr);
  ASSERT_NE(findGivenOption("sort", t), nullptr);
  EXPECT_EQ(findGivenOption("sort", t)->value, "alpha");
  EXPECT_EQ(findGivenOption("userpath", t)->value, "/src:/lib");
  EXPECT_EQ(findGivenOption("forcemerge", t)->value, "");
  EXPECT_TRUE(getBoolViewerOption("forcemerge", t, false, true));
  EXPECT_TRUE(getBoolViewerOption("locking", t, true, true));
  EXPECT_NE(findGivenOption("VERBOSE", t), nullptr);
  EXPECT_EQ(findGivenOption("verbose", t), nullptr);  // exact names only
}

TEST(ViewerOptions, FaultyOptionsAreReportedOnceEachAndLeftUnset) {
  testing::internal::CaptureStderr();
  auto t = makeViewerOptionTable();
  Args a({"kestrel-viewer", "-help=1", "-sort", "-nosuch=3", "-kestrel=yes", "f.kgv"});
  EXPECT_EQ(parseViewerOptions("kestrel -view", t, a.argc, a.ptrs.data()), argError);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Kestrelgauge: kestrel -view: option -help=1 should not include a value.\n\n"
            "Kestrelgauge: kestrel -view: option -sort must include a value.\n\n"
            "Kestrelgauge: kestrel -view: unknown option '-nosuch=3'.\n\n"
            "Kestrelgauge: kestrel -view: option -kestrel=yes should not include a value.\n\n");
  EXPECT_EQ(findGivenOption("help", t), nullptr);
  EXPECT_EQ(findGivenOption("sort", t), nullptr);
  EXPECT_EQ(a.rest(), (std::vector<std::string>{"kestrel-viewer", "f.kgv"}));
}

TEST(ViewerOptions, BooleanWords) {
  for (const char* v : {"OFF", "No", "false", "f-a-l-s-e"}) {
    auto t = makeViewerOptionTable();
    std::string arg = std::string("-lock-ing=") + v;
    Args a({"p", arg});
    parseViewerOptions("p", t, a.argc, a.ptrs.data());
    EXPECT_FALSE(getBoolViewerOption("locking", t, true, true)) << v;
  }
  auto t = makeViewerOptionTable();
  Args a({"p", "-locking=maybe"});
  parseViewerOptions("p", t, a.argc, a.ptrs.data());
  EXPECT_FALSE(getBoolViewerOption("forcemerge", t, false, false));  // absent: never fatal
  EXPECT_EXIT(getBoolViewerOption("locking", t, true, false), testing::ExitedWithCode(6),
              "\\(usage: -locking=no\\)");
}

TEST(ViewerOptions, RawValuesAndQuotesBeforeParsing) {
  Args a({"p", "\"-userpath=/a b\"", "-Kestrel_Home=/opt/kg", "\"", "\"\"", "-kestrelhome=/other"});
  stripArgumentQuotes(a.argc, a.ptrs.data());
  EXPECT_STREQ(a.ptrs[1], "-userpath=/a b");
  EXPECT_STREQ(a.ptrs[3], "\"");  // a lone quote is too short to be enclosed
  EXPECT_STREQ(a.ptrs[4], "");
  std::string v;
  ASSERT_TRUE(findRawOptionValue(a.argc, a.ptrs.data(), "kestrelhome", v));
  EXPECT_EQ(v, "/opt/kg");
  EXPECT_FALSE(findRawOptionValue(a.argc, a.ptrs.data(), "sort", v));
}
