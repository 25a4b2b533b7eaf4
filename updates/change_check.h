// What the watch over the loaded data files decides without a display: which files changed
// since they were loaded, how the dialog lists them, and the stamp of the trace lines.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "coverage/kgv_file_ref.h"

// The dialog's lines for the files whose modification time is later than their load time:
// the time in the summary's date format, right-justified in 11 columns, " - ", the resolved
// name. A file that cannot be examined (removed, say) is not listed.
std::vector<std::string> changedFileLines(const std::vector<KgvFileRef>& files);

// "Don't reload, but inform me": the present versions count as seen.
void resetLoadTimes(std::vector<KgvFileRef>& files, std::uint32_t now);

// The time since the first trace line, in tenths of a second: "M:SS.T", "H:MM:SS.T" from
// one hour, "D HH:MM:SS.T" from one day.
std::string idleTraceStamp(std::uint64_t tenths);
