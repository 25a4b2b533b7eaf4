// Fuzzes the marker scanner and the marker-comment edits: any text scans without a crash,
// and once its markers are cleared no one-line marker is found in it any more.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include "adjust/marker_comments.h"
#include "adjust/marker_scanner.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  const char* dir = getenv("KG_FUZZ_CORPUS");
  if (!dir || !*dir) return 0;
  const std::vector<std::string> seeds = {
      "int a; // kestrel: deadcode\n/* kestrel: begin tested */\nx;\n/* kestrel: end */\n",
      "// kestrel:\tbegin\tinspected kestrel: begin deadcode\n\n// kestrel: end kestrel: end\n"
      "y; /* kestrel: tested */ /* kestrel: inspected */ kestrel:deadcode-x\n",
      "kestrel: begin deadcode\nkestrel: begin tested\nkestrel: begin inspected\nkestrel:",
  };
  for (size_t i = 0; i < seeds.size(); ++i) {
    std::ofstream(std::string(dir) + "/marker_seed_" + std::to_string(i), std::ios::binary)
        << seeds[i];
  }
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string text(reinterpret_cast<const char*>(data), size);
  std::vector<std::string> lines;
  size_t pos = 0;
  while (pos < text.size()) {
    size_t nl = text.find('\n', pos);
    if (nl == std::string::npos) nl = text.size();
    lines.push_back(text.substr(pos, nl - pos));
    pos = nl + 1;
  }
  std::vector<std::string> warnings;
  CvgAdjustSetPtr set;
  scanLines(lines, warnings, set);
  if (set) set->countLines();

  VectorTextLines pane(lines);
  clearMarkers(pane, 1, lines.size());
  CvgAdjustSetPtr after;
  scanLines(lines, warnings, after);
  for (std::uint32_t n = 1; after && n <= lines.size(); ++n) {
    if (after->lineKinds(n) & adjLineMask) {
      fprintf(stderr, "line %u still carries a one-line marker: %s\n", n, lines[n - 1].c_str());
      abort();
    }
  }
  return 0;
}
