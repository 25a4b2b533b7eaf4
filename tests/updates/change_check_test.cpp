// The watch's decisions without a display: which files count as changed, and the trace stamp.
#include "updates/change_check.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/time.h>

#include "summary/cell_format.h"
#include "tests/common/test_support.h"

TEST(ChangedFiles, OnlyFilesWrittenAfterTheirLoadAreListedAndRemovedOnesAreNot) {
  kgtest::TempDir dir;
  std::vector<KgvFileRef> files;
  const time_t now = time(nullptr);
  for (const char* name : {"old.kgv", "new.kgv", "gone.kgv"}) {
    kgtest::writeFile(dir.file(name), "x");
    files.push_back({dir.file(name), dir.file(name), static_cast<std::uint32_t>(now - 100), nullptr});
  }
  struct timeval before[2] = {{now - 200, 0}, {now - 200, 0}};
  utimes(dir.file("old.kgv").c_str(), before);
  ASSERT_EQ(unlink(dir.file("gone.kgv").c_str()), 0);
  struct stat st;
  ASSERT_EQ(stat(dir.file("new.kgv").c_str(), &st), 0);
  EXPECT_EQ(changedFileLines(files),
            std::vector<std::string>{format_date(11, static_cast<std::uint32_t>(st.st_mtime)) + " - " +
                                     dir.file("new.kgv")});
  EXPECT_EQ(changedFileLines(files)[0].find(" - "), 11u);
  // Once the present versions count as seen, nothing is listed until the next write.
  resetLoadTimes(files, static_cast<std::uint32_t>(now + 1));
  EXPECT_TRUE(changedFileLines(files).empty());
}

TEST(IdleTrace, TheStampGrowsFromMinutesToHoursToDays) {
  EXPECT_EQ(idleTraceStamp(0), "0:00.0");
  EXPECT_EQ(idleTraceStamp(123), "0:12.3");
  EXPECT_EQ(idleTraceStamp(36000 - 1), "59:59.9");
  EXPECT_EQ(idleTraceStamp(36000), "1:00:00.0");
  EXPECT_EQ(idleTraceStamp(864000 - 1), "23:59:59.9");
  EXPECT_EQ(idleTraceStamp(864000 * 3 + 36000 * 4 + 600 * 5 + 67), "3 04:05:06.7");
}
