// Speed of the adjustment paths a user waits for: scanning a large source for markers,
// reading a large adjustments file, and shifting a large Shift-JIS file into EUC.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "adjust/adjustments_file.h"
#include "adjust/code_set.h"
#include "adjust/marker_scanner.h"

namespace {

std::vector<std::string> sourceLines(int count) {
  std::vector<std::string> lines;
  lines.reserve(static_cast<size_t>(count));
  for (int i = 0; i < count; ++i) {
    if (i % 50 == 0) {
      lines.push_back("  if (unlikely(p == nullptr)) abort(); /* kestrel: deadcode */");
    } else if (i % 500 == 1) {
      lines.push_back("  /* kestrel: begin tested */");
    } else if (i % 500 == 40) {
      lines.push_back("  /* kestrel: end */");
    } else {
      lines.push_back("  total += compute(values[" + std::to_string(i) + "], scale); // step");
    }
  }
  return lines;
}

void BM_ScanSourceLines(benchmark::State& state) {
  std::vector<std::string> lines = sourceLines(static_cast<int>(state.range(0)));
  for (auto _ : state) {
    std::vector<std::string> warnings;
    CvgAdjustSetPtr set;
    scanLines(lines, warnings, set);
    benchmark::DoNotOptimize(set);
  }
  state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK(BM_ScanSourceLines)->Arg(10000)->Arg(200000);

void BM_ReadAdjustmentsFile(benchmark::State& state) {
  std::string text = "Kestrelgauge Adjustments File 1.0\n######\n";
  for (int f = 0; f < state.range(0); ++f) {
    std::string name = "/no/such/project/src/file" + std::to_string(f) + ".c";
    text += name + "\t1765000000\tdeadcode\tL\t";
    for (int l = 1; l < 400; l += 7) text += " " + std::to_string(l);
    text += "\n" + name + "\t1765000000\ttested\tB\t 500-900 1000-1200\n";
  }
  for (auto _ : state) {
    AdjustmentList list;
    std::vector<std::string> warnings;
    parseAdjustments(text, "bench.adjust", list, warnings);
    benchmark::DoNotOptimize(list);
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(text.size()));
}
BENCHMARK(BM_ReadAdjustmentsFile)->Arg(100)->Arg(2000)->Arg(80000)->Unit(benchmark::kMillisecond);

void BM_ShiftJisToEuc(benchmark::State& state) {
  std::string sjis;
  while (sjis.size() < 1 << 20) sjis += "int x; // \x93\xfa\x96\x7b\x8c\xea\xb1\n";
  std::string euc;
  for (auto _ : state) {
    benchmark::DoNotOptimize(shiftJisToEuc(sjis, euc));
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(sjis.size()));
}
BENCHMARK(BM_ShiftJisToEuc);

}  // namespace

BENCHMARK_MAIN();
