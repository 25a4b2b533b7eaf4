// Coverage straight from a build tree: gcov run on every .gcda file under it, in parallel,
// its JSON read as an input of its own.
#pragma once

#include <string>
#include <vector>

#include "tools/import/coverage_import.h"

struct GcovRunOptions {
  std::string gcov = "gcov";  // the program, found on PATH when it has no "/"
  unsigned jobs = 0;          // gcov processes at once; 0: one per processor
};

// The .gcda files under `dir`, sorted; symbolic links to directories are not followed.
// False with a message when the directory cannot be read.
bool findGcdaFiles(const std::string& dir, std::vector<std::string>& files, std::string& error);

// Runs gcov on the files and adds what it reports to `data`. gcov's own complaints (a
// stale or missing .gcno, say) go to `warnings`, one line each; false with the error when
// gcov cannot be run or its output cannot be read.
bool importGcdaFiles(const std::vector<std::string>& gcdaFiles, const GcovRunOptions& options,
                     ImportedData& data, std::vector<std::string>& warnings, std::string& error);
