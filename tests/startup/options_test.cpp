// The viewer option parser and the runtime option accessors.
#include <gtest/gtest.h>

#include <cstring>

#include "startup/runtime_options.h"
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

TEST(ViewerOptions, TableHasTheViewerOptionsThenTheRuntimeNames) {
  auto t = makeViewerOptionTable();
  ASSERT_EQ(t.size(), 403u);
  EXPECT_EQ(t[0].name, "sort");
  EXPECT_EQ(t[0].kind, 3u);
  EXPECT_EQ(t[6].name, "locking");
  EXPECT_EQ(t[6].kind, 2u);
  EXPECT_EQ(t[9].name, "applyadjustments");
  EXPECT_EQ(t[10].name, "DUMMY_OPTION");
  EXPECT_EQ(t[10 + KESTREL_HOME].name, "KESTREL_HOME");
  EXPECT_EQ(t[10 + QUOR_HELP_MAX_WAIT].name, "QUOR_HELP_MAX_WAIT");
  EXPECT_EQ(t[402].name, "ignore_this_kestrel_arg");
}

TEST(ViewerOptions, NamesMatchIgnoringCaseHyphensAndUnderscores) {
  EXPECT_TRUE(optionNamesMatch("-force-merge", "forcemerge"));
  EXPECT_TRUE(optionNamesMatch("FORCE_MERGE", "-force-merge"));
  EXPECT_TRUE(optionNamesMatch("--_lock-ing", "locking"));
  EXPECT_FALSE(optionNamesMatch("forcemerg", "forcemerge"));
  EXPECT_FALSE(optionNamesMatch("sorts", "sort"));
}

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

TEST(RuntimeOptions, DefaultsSettingAndTypeChecks) {
  resetRuntimeOptions();
  EXPECT_FALSE(getBoolOption(KESTREL));
  setOption(KESTREL, 1);
  EXPECT_TRUE(getBoolOption(KESTREL));
  EXPECT_EQ(getStringOption(KESTREL_HOME), nullptr);
  setStringOption(KESTREL_HOME, "/opt/kg");
  EXPECT_STREQ(getStringOption(KESTREL_HOME), "/opt/kg");
  EXPECT_EQ(getIntOption(QUOR_HELP_MAX_WAIT), 20);
  EXPECT_STREQ(getStringOption(AUTO_MOUNT_PREFIX), "/tmp_mnt");
  EXPECT_EXIT(getIntOption(KESTREL_HOME), testing::ExitedWithCode(1),
              "Internal error: option kestrel-home is not an integer option\\.");
  EXPECT_EXIT(getBoolOption(AUTO_MOUNT_PREFIX), testing::ExitedWithCode(1),
              "option auto-mount-prefix is not a boolean option");
  EXPECT_EXIT(getUnsignedOption(QUOR_HELP_MAX_WAIT), testing::ExitedWithCode(1),
              "option quor-help-max-wait is not an unsigned integer option");
  EXPECT_EXIT(getOption(392), testing::ExitedWithCode(1), "option index 392 out of range");
  resetRuntimeOptions();
}
