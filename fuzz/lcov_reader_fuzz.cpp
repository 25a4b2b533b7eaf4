// Fuzzes the lcov tracefile reader on any bytes: bad input is refused with a message, and
// what is accepted lays out, becomes a data file and reads back unchanged
// (fuzz/import_checks.h).
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <string>
#include <string_view>

#include "fuzz/import_checks.h"
#include "tools/import/coverage_import.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  atexit(kgfuzz::removeScratchKgv);
  // Seeds: the record kinds of both lcov generations.
  const char* dir = getenv("KG_FUZZ_CORPUS");
  if (!dir || !*dir) return 0;
  const char* seeds[] = {
      "TN:t\nSF:/src/a.c\nFN:3,main\nFN:10,12,helper\nFNDA:2,main\nFNDA:0,helper\nFNF:2\nFNH:1\n"
      "DA:3,2,abc\nDA:4,2\nDA:11,0\nBRDA:4,0,0,1\nLF:3\nLH:2\nend_of_record\n",
      "SF:x.c\nFNL:0,5,9\nFNA:0,4,f\nDA:6,4\nDA:7,0\nend_of_record\nSF:y.c\nDA:1,1\nend_of_record\n",
  };
  int i = 0;
  for (const char* s : seeds) {
    std::ofstream(std::string(dir) + "/lcov_seed_" + std::to_string(i++) + ".info") << s;
  }
  return 0;
}

// Plain tracefiles are read in pieces that end at lines' ends: fed line by line, the
// reader accepts or refuses alike, with the same message, and keeps as many files.
void checkReadInPieces(const std::string& text, bool wholeOk, const ImportError& wholeError,
                       const ImportedData& whole) {
  ImportedData pieces;
  ImportError error;
  bool ok = true;
  {
    LcovTracefileReader reader("fuzz.info", pieces, error, text.size());
    std::size_t from = 0;
    while (ok && from < text.size()) {
      std::size_t nl = text.find('\n', from);
      std::size_t to = nl == std::string::npos ? text.size() : nl + 1;
      ok = reader.feed(std::string_view(text).substr(from, to - from));
      from = to;
    }
    ok = reader.finish() && ok;
  }
  if (ok != wholeOk) kgfuzz::fail("read in pieces, the tracefile is taken or refused otherwise");
  if (!ok && error.text() != wholeError.text()) kgfuzz::fail("read in pieces, the tracefile is refused for another reason");
  if (pieces.files.size() != whole.files.size()) kgfuzz::fail("read in pieces, the tracefile has other files");
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string text(reinterpret_cast<const char*>(data), size);
  ImportedData imported;
  ImportError error;
  const bool ok = readLcovTracefile("fuzz.info", text, imported, error);
  checkReadInPieces(text, ok, error, imported);
  if (!ok) {
    if (error.message.empty()) kgfuzz::fail("refused without a message");
    return 0;
  }
  kgfuzz::checkImport(imported);
  return 0;
}
