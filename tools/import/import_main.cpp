// kestrel-import: lcov tracefiles and gcov JSON files (compressed or not) into one .kgv file.
#include <cstdio>
#include <cstring>
#include <ctime>
#include <string>
#include <vector>

#include "coverage/kgv_file.h"
#include "coverage/kgv_lock.h"
#include "support/diagnostic.h"
#include "tools/import/coverage_import.h"
#include "tools/import/import_records.h"

namespace {

int usage() {
  fputs("usage: kestrel-import -o OUT.kgv INPUT...\n"
        "Each INPUT is an lcov tracefile (.info) or gcov JSON (gcov --json-format),\n"
        "plain or gzip-compressed; its format is recognised from its content.\n",
        stderr);
  return 2;
}

int fail(const std::string& message) {
  fprintf(stderr, "kestrel-import: %s\n", message.c_str());
  return 2;
}

}  // namespace

int main(int argc, char** argv) {
  // Stopped part way, the output's lock and its unfinished new copy go with the process.
  kgInstallSignalHandlers();
  std::string out;
  std::vector<std::string> inputs;
  for (int i = 1; i < argc; ++i) {
    std::string a = argv[i];
    if (a == "-o" && i + 1 < argc) out = argv[++i];
    else if (a.compare(0, 3, "-o=") == 0) out = a.substr(3);
    else if (a == "-h" || a == "--help") return usage(), 0;
    else if (!a.empty() && a[0] == '-' && a != "-") return usage();
    else inputs.push_back(a);
  }
  if (out.empty() || inputs.empty()) return usage();

  ImportedData data;
  for (const auto& input : inputs) {
    std::string text;
    ImportError error;
    if (!readInputText(input, text, error)) return fail(error.text());
    bool ok = false;
    switch (detectFormat(text)) {
      case InputFormat::lcov: ok = readLcovTracefile(input, text, data, error); break;
      case InputFormat::gcovJson: ok = readGcovJson(input, text, data, error); break;
      case InputFormat::unknown:
        error = {input, 1, "neither an lcov tracefile nor gcov JSON"};
        break;
    }
    if (!ok) return fail(error.text());
  }
  if (data.files.empty()) return fail("the inputs hold no coverage data");

  auto now = static_cast<std::uint32_t>(time(nullptr));
  auto kgv = makeImportedData(data, now);
  // Other programs may be reading or merging into the same file: write under its lock.
  ErrorCode rc = lockKgvFile(out);
  if (rc == allOK) {
    rc = writeKgvFile(out, *kgv);
    ErrorCode unlocked = unlockKgvFile(out);
    if (rc == allOK) rc = unlocked;
  }
  if (rc != allOK) return fail("cannot write " + out + ":\n" + errorMessage(rc));
  return 0;
}
