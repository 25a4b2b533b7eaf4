// Turning imported coverage into a data file: one record per source file.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "coverage/kgv_data.h"
#include "tools/import/coverage_import.h"
#include "tools/import/record_layout.h"

// The record of one laid-out source file. buildTime: the source's modification time when
// known; importTime: now (the record's first and last collection times).
std::unique_ptr<ObjRecord> makeImportedRecord(const LaidOutRecord& rec, std::uint32_t buildTime,
                                              std::uint32_t importTime);

// All files of the import, in order of first appearance.
std::unique_ptr<KgvData> makeImportedData(const ImportedData& data, std::uint32_t importTime);
// The same, letting go of `data` as it goes (it is left empty): the records take the
// memory the files gave up, and the import's peak is lower.
std::unique_ptr<KgvData> makeImportedDataReleasing(ImportedData& data, std::uint32_t importTime);
