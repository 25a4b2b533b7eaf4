// Cells of the summary: counts, percentages, elapsed times, dates and justification.
#include "summary/cell_format.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>

TEST(CellFormat, JustificationKeepsLongTextsWhole) {
  EXPECT_EQ(justify_right("ab", 5, ' '), "   ab");
  EXPECT_EQ(justify_left("ab", 5, '.'), "ab...");
  EXPECT_EQ(justify_centre("abc", 8, '-'), "--abc---");
  EXPECT_EQ(justify_right("abcdef", 3, ' '), "abcdef");
  EXPECT_EQ(justify_left(nullptr, 2, '*'), "**");
  EXPECT_EQ(justify_right("x", 5000, ' ').size(), 1024u);
}

TEST(CellFormat, CountsGrowRatherThanLoseDigits) {
  EXPECT_EQ(format_count(7, 42), "     42");
  EXPECT_EQ(format_count(5, 123456), "123456");
  EXPECT_EQ(format_small_count(6, 9999), "  9999");
  EXPECT_EQ(format_small_count(6, 10000), "  10K+");
  EXPECT_EQ(format_small_count(6, 65536 + 7), "     7");  // only the low 16 bits count
}

TEST(CellFormat, PercentShowsHundredOnlyWhenComplete) {
  EXPECT_EQ(format_percent(5, 0, 0), "  -- ");
  EXPECT_EQ(format_percent(4, 0, 5), "  0%");
  EXPECT_EQ(format_percent(4, 5, 5), "100%");
  EXPECT_EQ(format_percent(4, 199, 200), " 99%");
  EXPECT_EQ(format_percent(4, 1, 1000), "  0%");
  EXPECT_EQ(format_percent(4, 4294967295u, 4294967295u), "100%");
  EXPECT_EQ(format_percent(4, 4294967294u, 4294967295u), " 99%");
  EXPECT_EQ(format_percent(4, 4294967295u, 1), "429496729500%");  // damaged data: no overflow
}

TEST(CellFormat, ElapsedTimes) {
  EXPECT_EQ(format_elapsed(0, 53), "0:05.3");
  EXPECT_EQ(format_elapsed(0, 599), "0:59.9");
  EXPECT_EQ(format_elapsed(0, 600), "1:00.0");
  EXPECT_EQ(format_elapsed(0, 36000), "1:00:00.0");
  EXPECT_EQ(format_elapsed(0, 864005), "1 00:00:00.5");
  EXPECT_EQ(format_elapsed(14, 4294967295u), "4971 00:38:49.5");
  EXPECT_EQ(format_elapsed(8, 0), "  0:00.0");
}

TEST(CellFormat, DatesWithinHalfAYearShowTheTimeOfDay) {
  setenv("TZ", "UTC", 1);
  tzset();
  const std::uint32_t now = 1800000000;  // 2027-01-15 08:00 UTC
  set_format_date_now(now);
  EXPECT_EQ(format_date(0, now - 15552000), "07/19 08:00");
  EXPECT_EQ(format_date(0, now - 15552001), "07/19/2026");
  EXPECT_EQ(format_date(0, now), "01/15 08:00");
  EXPECT_EQ(format_date(0, now + 60), "01/15/2027");  // the future shows the year
  EXPECT_EQ(format_date(13, now), "  01/15 08:00");
}
