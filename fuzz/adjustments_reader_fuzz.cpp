// Fuzzes the adjustments-file reader: any text must give warnings, never a crash, and what
// the list writes back must read again without a single warning.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include "adjust/adjustments_file.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  const char* dir = getenv("KG_FUZZ_CORPUS");
  if (!dir || !*dir) return 0;
  const std::string banner = "Kestrelgauge Adjustments File 1.0\n";
  const std::vector<std::string> seeds = {
      banner + "######\n# written\n######\n/src/a.c\t1700000000\tdeadcode\tL\t 1 3-5\n"
               "/src/a.c\t1700000000\ttested\tB\t 10-20\n",
      banner + "/src/b.c\t5\tinspected\tB\t9-2 7\n/src/b.c\t4\tdeadcode\tL\t1\n\n# x\n",
      banner + "./rel/../c.c\t12\ttested\tL\t4294967289 1-\n/d.c\t1x\tx\tQ\t\n",
  };
  for (size_t i = 0; i < seeds.size(); ++i) {
    std::ofstream(std::string(dir) + "/adjust_seed_" + std::to_string(i), std::ios::binary)
        << seeds[i];
  }
  return 0;
}

namespace {

void readAndRewrite(std::string_view text) {
  AdjustmentList list;
  std::vector<std::string> warnings;
  parseAdjustments(text, "fuzz.adjust", list, warnings);

  char* buf = nullptr;
  size_t len = 0;
  FILE* out = open_memstream(&buf, &len);
  if (!out) return;
  bool ok = writeAdjustments(out, "fuzz", list);
  fclose(out);
  if (ok) {
    AdjustmentList again;
    std::vector<std::string> more;
    parseAdjustments(std::string_view(buf, len), "fuzz.adjust", again, more);
    if (!more.empty()) {
      fprintf(stderr, "written adjustments read back with warnings:\n%s\n", more[0].c_str());
      abort();
    }
  }
  free(buf);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string_view text(reinterpret_cast<const char*>(data), size);
  readAndRewrite(text);
  // Mutations mostly break the banner; read the records behind a good one as well.
  static const std::string_view banner = "Kestrelgauge Adjustments File 1.0\n";
  if (!text.starts_with(banner)) readAndRewrite(std::string(banner) + std::string(text));
  return 0;
}
