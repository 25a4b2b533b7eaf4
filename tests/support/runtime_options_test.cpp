// The runtime option table's accessors and the option-name comparison.
#include <gtest/gtest.h>

#include "support/runtime_options.h"
#include "support/string_helpers.h"

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

TEST(OptionNames, MatchIgnoringCaseHyphensAndUnderscores) {
  EXPECT_TRUE(optionNamesMatch("-force-merge", "forcemerge"));
  EXPECT_TRUE(optionNamesMatch("FORCE_MERGE", "-force-merge"));
  EXPECT_TRUE(optionNamesMatch("--_lock-ing", "locking"));
  EXPECT_FALSE(optionNamesMatch("forcemerg", "forcemerge"));
  EXPECT_FALSE(optionNamesMatch("sorts", "sort"));
}
