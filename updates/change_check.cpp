// Changed data files and the trace stamp of the watch.
#include "updates/change_check.h"

#include <sys/stat.h>

#include <cstdio>

#include "summary/cell_format.h"

std::vector<std::string> changedFileLines(const std::vector<KgvFileRef>& files) {
  std::vector<std::string> lines;
  for (const KgvFileRef& f : files) {
    struct stat st;
    if (stat(f.resolvedName.c_str(), &st) != 0) continue;
    if (st.st_mtime <= static_cast<time_t>(f.loadTime)) continue;
    lines.push_back(format_date(11, static_cast<std::uint32_t>(st.st_mtime)) + " - " + f.resolvedName);
  }
  return lines;
}

void resetLoadTimes(std::vector<KgvFileRef>& files, std::uint32_t now) {
  for (KgvFileRef& f : files) f.loadTime = now;
}

std::string idleTraceStamp(std::uint64_t tenths) {
  const std::uint64_t t = tenths % 10, s = tenths / 10;
  const unsigned sec = static_cast<unsigned>(s % 60), min = static_cast<unsigned>(s / 60 % 60);
  const unsigned hours = static_cast<unsigned>(s / 3600 % 24);
  const std::uint64_t days = s / 86400;
  char buf[64];
  if (s < 3600)
    snprintf(buf, sizeof buf, "%u:%02u.%u", static_cast<unsigned>(s / 60), sec, static_cast<unsigned>(t));
  else if (s < 86400)
    snprintf(buf, sizeof buf, "%u:%02u:%02u.%u", hours, min, sec, static_cast<unsigned>(t));
  else
    snprintf(buf, sizeof buf, "%llu %02u:%02u:%02u.%u", static_cast<unsigned long long>(days), hours, min, sec,
             static_cast<unsigned>(t));
  return buf;
}
