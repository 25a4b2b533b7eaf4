// The export report: a fixed header and key block, then the whole summary tree as nested,
// tab-separated records down to lines and blocks, with adjusted figures.
#pragma once

#include <cstdio>
#include <ctime>
#include <string>

#include "coverage/summary_types.h"
#include "support/errors.h"
#include "support/message_sink.h"

// Writes the report with the current local time in its header. A reader that closes its
// end early (broken pipe) is no failure; other write failures give fileWriteFailed with the
// system error pending. Notices about damaged line numbers go to `messages`.
ErrorCode writeExport(FILE* stream, const SumRoot& root, MessageSink& messages);
// The same with the time of the header given.
ErrorCode writeExport(FILE* stream, const SumRoot& root, std::time_t when, MessageSink& messages);

// Writes the report to a named file, replacing it only when everything was written: 1, or
// writeError when it cannot be created, or the write's failure. The caller shows failures
// under its "Couldn't export" context.
ErrorCode exportToFile(const SumRoot& root, const std::string& path, MessageSink& messages);
