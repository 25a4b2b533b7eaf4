// What must hold for whatever an importer accepted, shared by the lcov and gcov JSON targets:
// every imported line lands in exactly one function of its record, the record names the file
// and functions by the names that were read, and the data file written from the import reads
// back with the same records.
#pragma once

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <string>

#include "coverage/kgv_file.h"
#include "support/errors.h"
#include "tools/import/coverage_import.h"
#include "tools/import/import_records.h"
#include "tools/import/record_layout.h"

namespace kgfuzz {

[[noreturn]] inline void fail(const std::string& what) {
  fprintf(stderr, "import check failed: %s\n", what.c_str());
  abort();
}

// Printable for the failure message: names may hold any byte.
inline std::string shown(const std::string& s) {
  std::string out;
  for (unsigned char c : s.substr(0, 120)) {
    if (c >= 0x20 && c < 0x7f) out += static_cast<char>(c);
    else {
      char b[8];
      snprintf(b, sizeof b, "\\x%02x", c);
      out += b;
    }
  }
  return out;
}

// The scratch data file. A memory file system where there is one: every accepted input is
// written, and the writer syncs the disk. The name is never destroyed, so that the exit
// handler removing the file can still read it whatever the order of exit-time clean-up.
inline const std::string& scratchKgv() {
  static const std::string* path = new std::string([] {
    struct stat st;
    const char* tmp = getenv("TMPDIR");
    std::string dir = stat("/dev/shm", &st) == 0 && S_ISDIR(st.st_mode) && access("/dev/shm", W_OK) == 0
                          ? "/dev/shm"
                          : (tmp && *tmp ? tmp : "/tmp");
    std::string templ = dir + "/kg_import_fuzz.XXXXXX";
    int fd = mkstemp(templ.data());
    if (fd < 0) fail("cannot create a scratch file in " + dir);
    close(fd);
    return templ;
  }());
  return *path;
}

inline void removeScratchKgv() { unlink(scratchKgv().c_str()); }

inline void checkLayout(const ImportedFile& file, const LaidOutRecord& rec) {
  if (rec.path != file.path) fail("laid-out path differs: " + shown(rec.path));
  if (rec.signature == 0) fail("zero signature for " + shown(file.path));
  // Every function read, once each, then at most the one that holds the lines outside them.
  size_t n = file.functions.size();
  if (rec.functions.size() != n && !(rec.functions.size() == n + 1 && rec.functions[n].name == kFileScopeName))
    fail("functions lost or added in " + shown(file.path));
  std::map<std::string, int> names;
  for (size_t i = 0; i < n; ++i) ++names[rec.functions[i].name];
  for (const auto& f : file.functions)
    if (names[f.name] != 1) fail("function " + shown(f.name) + " laid out " + std::to_string(names[f.name]) + " times");
  std::map<std::uint32_t, int> seen;
  for (const auto& f : rec.functions) {
    for (size_t i = 0; i < f.lines.size(); ++i) {
      if (i > 0 && f.lines[i].line <= f.lines[i - 1].line) fail("lines out of order in " + shown(f.name));
      ++seen[f.lines[i].line];
      auto it = file.lines.find(f.lines[i].line);
      if (it == file.lines.end()) fail("line " + std::to_string(f.lines[i].line) + " was never read");
      if (f.lines[i].hits != saturatedCount(it->second)) fail("hits changed on line " + std::to_string(it->first));
    }
  }
  if (seen.size() != file.lines.size()) fail("lines lost in " + shown(file.path));
  for (const auto& [line, k] : seen)
    if (k != 1) fail("line " + std::to_string(line) + " placed " + std::to_string(k) + " times");
}

// The record names what the layout names, in the same order.
inline void checkRecordNames(const LaidOutRecord& rec, const ObjRecord& r) {
  if (r.map.empty() || mapTag(r.map[0]) != TagFile) fail("record does not start with its file");
  if (rec.path != r.nameAt(mapValue(r.map[0])))
    fail("record names its file " + shown(r.nameAt(mapValue(r.map[0]))) + ", read as " + shown(rec.path));
  size_t fn = 0;
  for (std::uint32_t e : r.map) {
    if (mapTag(e) != TagFunction) continue;
    if (fn >= rec.functions.size() || rec.functions[fn].name != r.nameAt(mapValue(e)))
      fail("record names a function " + shown(r.nameAt(mapValue(e))) + ", read as " +
           (fn < rec.functions.size() ? shown(rec.functions[fn].name) : std::string("nothing")));
    ++fn;
  }
  if (fn != rec.functions.size()) fail("functions missing from the record of " + shown(rec.path));
}

inline bool sameRecord(const ObjRecord& a, const ObjRecord& b) {
  return a.objHeader.signature == b.objHeader.signature && a.strings == b.strings && a.map == b.map &&
         a.counts == b.counts && a.fileNameOffset == b.fileNameOffset;
}

inline void checkImport(const ImportedData& data) {
  if (data.files.size() != data.fileIndex.size()) fail("file index out of step");
  for (size_t i = 0; i < data.files.size(); ++i) {
    const ImportedFile& f = data.files[i];
    if (f.path.empty()) fail("a file without a name was accepted");
    auto it = data.fileIndex.find(f.path);
    if (it == data.fileIndex.end() || it->second != i) fail("file index wrong for " + shown(f.path));
    for (const auto& [line, hits] : f.lines)
      if (line == 0 || line > kMapValueMask) fail("line number out of range: " + std::to_string(line));
    LaidOutRecord rec = layOutRecord(f);
    checkLayout(f, rec);
  }
  if (data.files.empty()) return;

  std::unique_ptr<KgvData> kgv = makeImportedData(data, 1700000000);
  if (kgv->records.size() != data.files.size()) fail("records lost");
  for (size_t i = 0; i < data.files.size(); ++i) checkRecordNames(layOutRecord(data.files[i]), *kgv->records[i]);

  // Written and read again, the records are the same.
  ErrorCode rc = writeKgvFile(scratchKgv(), *kgv);
  if (rc != allOK) fail("the data file cannot be written: " + errorMessage(rc));
  std::unique_ptr<KgvData> back;
  rc = readKgvFile(scratchKgv(), back);
  clearPendingSystemError();
  if (rc != allOK) fail("the written data file is refused: " + errorMessage(rc));
  if (back->records.size() != kgv->records.size()) fail("records lost on the way back");
  for (size_t i = 0; i < kgv->records.size(); ++i)
    if (!sameRecord(*kgv->records[i], *back->records[i])) fail("record " + std::to_string(i) + " changed on the way back");
}

}  // namespace kgfuzz
