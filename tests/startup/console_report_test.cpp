// Start-up's console reporting: exit statuses and the report lines.
#include "startup/console_report.h"

#include <gtest/gtest.h>

TEST(ExitStatus, MapsCodes) {
  EXPECT_EQ(exitStatusFor(allOK), 0);
  EXPECT_EQ(exitStatusFor(fatalInternalError), 3);
  EXPECT_EQ(exitStatusFor(invalidSortingOrder), 42);
  EXPECT_EQ(exitStatusFor(256), 3);
}
