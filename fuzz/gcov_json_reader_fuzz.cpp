// Fuzzes the gcov JSON reader on any bytes: bad input is refused with a message, and what is
// accepted lays out, becomes a data file and reads back unchanged (fuzz/import_checks.h).
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <string>

#include "fuzz/import_checks.h"
#include "tools/import/coverage_import.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  atexit(kgfuzz::removeScratchKgv);
  const char* dir = getenv("KG_FUZZ_CORPUS");
  if (!dir || !*dir) return 0;
  // Seeds: what the reader treats specially, beside the real gcov output in fuzz/seeds/.
  const char* seeds[] = {
      // Relative names made absolute, C++ names, a function without an end, repeated lines.
      R"j({"format_version":"1","gcc_version":"13.2.0","current_working_directory":"/tmp/w",)j"
      R"j("data_file":"a.gcda","files":[{"file":"./src/a.cc","functions":[)j"
      R"j({"name":"_Z1fv","demangled_name":"f()","start_line":3,"end_line":9,"execution_count":2},)j"
      R"j({"name":"main","start_line":12,"execution_count":1}],"lines":[)j"
      R"j({"line_number":4,"count":2,"function_name":"_Z1fv"},{"line_number":4,"count":1},)j"
      R"j({"line_number":13,"count":1},{"line_number":40,"count":0}]}]})j",
      // Counts as floats and negative, two documents on two lines as gcov --stdout writes them.
      "{\"files\":[{\"file\":\"/tmp/b.c\",\"lines\":[{\"line_number\":1,\"count\":1.5e3},"
      "{\"line_number\":2,\"count\":-4}]}]}\n"
      "{\"files\":[{\"file\":\"/tmp/b.c\",\"functions\":[{\"name\":\"g\",\"start_line\":1,"
      "\"end_line\":1,\"execution_count\":18446744073709551615}]}]}\n",
      // Nested functions sharing a start line, and a file with nothing in it.
      R"j({"files":[{"file":"/tmp/c.c","functions":[{"name":"outer","start_line":5,"end_line":20},)j"
      R"j({"name":"inner","start_line":5,"end_line":8,"execution_count":3}],"lines":[)j"
      R"j({"line_number":6,"count":3},{"line_number":19,"count":0}]},{"file":"/tmp/empty.c"}]})j",
  };
  int i = 0;
  for (const char* s : seeds)
    std::ofstream(std::string(dir) + "/gcov_json_seed_" + std::to_string(i++) + ".json") << s;
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string text(reinterpret_cast<const char*>(data), size);
  ImportedData imported;
  ImportError error;
  if (!readGcovJson("fuzz.json", text, imported, error)) {
    if (error.message.empty()) kgfuzz::fail("refused without a message");
    return 0;
  }
  kgfuzz::checkImport(imported);
  return 0;
}
