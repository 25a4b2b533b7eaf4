// lcov's exclusion markers, applied to what gcov reports as Debian 12's lcov 1.16 applies
// them when it captures, so that a build directory or gcov's JSON gives the figures a
// tracefile of the same run gives.
#include <sys/stat.h>

#include <algorithm>
#include <fstream>
#include <set>

#include "tools/import/coverage_import.h"

namespace {

struct Exclusions {
  std::set<std::uint32_t> lines;     // everything on them
  std::set<std::uint32_t> branches;  // their branches
  bool open = false;                 // a section without its end
};

bool has(const std::string& line, const char* marker) { return line.find(marker) != std::string::npos; }

// Markers match anywhere in a line; a section's start line is in it, its stop line not.
// lcov 1.16 as Debian 12 ships it leaves out every branch of a line marked for exception
// branches only, as for a line marked for all its branches.
Exclusions scan(std::istream& in) {
  Exclusions e;
  bool lines = false, branches = false, exceptions = false;
  std::string text;
  for (std::uint32_t n = 1; std::getline(in, text); ++n) {
    if (has(text, "LCOV_EXCL_STOP")) lines = false;
    else if (has(text, "LCOV_EXCL_START")) lines = true;
    if (lines || has(text, "LCOV_EXCL_LINE")) e.lines.insert(n);
    if (has(text, "LCOV_EXCL_BR_STOP")) branches = false;
    else if (has(text, "LCOV_EXCL_BR_START")) branches = true;
    if (has(text, "LCOV_EXCL_EXCEPTION_BR_STOP")) exceptions = false;
    else if (has(text, "LCOV_EXCL_EXCEPTION_BR_START")) exceptions = true;
    if (branches || exceptions || has(text, "LCOV_EXCL_BR_LINE") || has(text, "LCOV_EXCL_EXCEPTION_BR_LINE"))
      e.branches.insert(n);
  }
  e.open = lines || branches || exceptions;
  return e;
}

void apply(ImportedFile& file, const Exclusions& e) {
  // One pass over each map: a section may mark many lines.
  if (!e.lines.empty()) file.lines.eraseKeys([&](std::uint32_t l) { return e.lines.count(l) != 0; });
  if (!e.lines.empty() || !e.branches.empty())
    file.branches.eraseLines([&](std::uint32_t l) { return e.lines.count(l) != 0 || e.branches.count(l) != 0; });
  auto excluded = [&](const ImportedFunction& f) { return e.lines.count(f.startLine) != 0; };
  if (std::none_of(file.functions.begin(), file.functions.end(), excluded)) return;
  file.functions.erase(std::remove_if(file.functions.begin(), file.functions.end(), excluded), file.functions.end());
  file.reindexFunctions();
  file.namesDue = true;  // a name that met a left-out one may stand alone now
}

}  // namespace

void applyExclusionMarkers(ImportedData& data, std::vector<std::string>& warnings) {
  for (ImportedFile& file : data.files) {
    if (!file.fromGcov) continue;
    // Only regular files: opening a pipe of that name would wait for a writer.
    struct stat st;
    if (stat(file.path.c_str(), &st) != 0 || !S_ISREG(st.st_mode)) continue;
    std::ifstream in(file.path, std::ios::binary);
    if (!in) continue;
    Exclusions e = scan(in);
    if (e.open) warnings.push_back(file.path + ": an LCOV_EXCL section is not closed; it reaches to the end of the file");
    apply(file, e);
  }
  data.nameFunctions();
}
