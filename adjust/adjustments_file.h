// The per-user adjustments file: reading it into the adjustment list with a warning for
// every malformed line, and writing the list back in full.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "coverage/adjustment_list.h"
#include "support/errors.h"

extern const char* const kDefaultAdjustmentsFile;  // "~/.kestrel.adjust"
extern const char* const kAdjustmentsWriterName;   // "Kestrelgauge viewer"

// "~" or "~/..." -> the home directory (HOME, else the user database entry of USER, else of
// the real user id); "~name/..." -> that user's home. Unchanged when no home is found.
std::string expandHomePath(const std::string& path);

// Start-up: reads the file named by the adjustmentfilename option (nullptr or empty: the
// default) into the process-wide list. The problems found come back as messages.
std::vector<std::string> readStartupAdjustments(const char* optionValue);

// Reads the file (after "~" expansion, which becomes the stored path for writing) into the
// process-wide list. A missing file is no problem; the result is the list of warnings. A
// file that cannot be read as a whole (not opened, not text, no banner, a read error) is
// never rewritten afterwards, and adjustmentsWritable() is false.
std::vector<std::string> readAdjustmentsFile(const std::string& path);

// The reader proper over the file's whole text; `path` names it in warnings. False when the
// text was refused as a whole (not text, or no banner).
bool parseAdjustments(std::string_view text, const std::string& path, AdjustmentList& list,
                      std::vector<std::string>& warnings);

// Writes the process-wide list to the stored path with the viewer's writer name. The file
// is replaced only when everything was written; the result may be ignored. Refused
// (fileWriteFailed, with the reason recorded) while the file read last could not be read.
ErrorCode writeAdjustmentsFile();

// The writer proper. No stream: nothing to do. False when a write failed.
bool writeAdjustments(FILE* stream, const char* writerName, const AdjustmentList& list);

// Whether the adjustments file can be rewritten (the editing window allows edits then).
bool adjustmentsWritable();
// The stored path (after "~" expansion); the default until a file was read.
const std::string& adjustmentsFilePath();
