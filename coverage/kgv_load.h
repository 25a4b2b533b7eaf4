// Loading data files under their locks and merging them, file after file, into one body.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "coverage/kgv_file_ref.h"
#include "support/errors.h"
#include "support/message_sink.h"

// Only regular files are data files: a FIFO would hang its reader, holding the lock, and a
// device could be read for ever. 1 for a regular or missing file (the read then says why);
// 25 (notOurFile) with the detail "PATH is a directory, not a data file." and the like.
// Loading checks this before taking any lock.
ErrorCode refuseNonRegularDataFile(const std::string& path);

// Locks the file named by the reference's given name, reads it, unlocks it; on success the
// reference's loadTime becomes the current time.
ErrorCode loadKgvFile(KgvFileRef& ref, std::unique_ptr<KgvData>& out);

// Loads and merges every file in order. 1, 36 when data were set aside, else the first
// failure's code with failedIndex set to the failing file (0-based); 9 for an empty list.
// The first file's isJava becomes the process-wide isJava. On success fileCount is the
// number of files. Warnings about data set aside go to `messages`.
ErrorCode loadAllKgvFiles(std::vector<KgvFileRef>& files, std::uint32_t mergeMode,
                          std::vector<std::string>* ignored, MessageSink& messages,
                          std::unique_ptr<KgvData>& out, std::size_t& fileCountOrFailedIndex);

// The isJava field of the first file of the last load of all files.
bool kgvIsJava();
void setKgvIsJava(bool isJava);
