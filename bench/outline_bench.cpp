// Outline operations on directories of files (100 files each) under a display that draws nothing:
// each should take time in proportion to the number of rows.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "outline/qr_outline_actions.h"
#include "outline/qr_outline_root.h"
#include "outline/qr_outline_text.h"

namespace {

class SilentDisplay : public QR_OutlineDisplay {
 public:
  void insert_lines(std::uint32_t, std::uint32_t) override {}
  void delete_lines(std::uint32_t, std::uint32_t) override {}
  void set_line(std::uint32_t, std::uint32_t, const char* text, QR_OutlineObject*) override {
    benchmark::DoNotOptimize(text);
  }
};

constexpr int kFilesPerDirectory = 100;

struct BigOutline {
  QR_OutlineRoot root{new SilentDisplay};
  std::vector<QR_OutlineText*> dirs;

  explicit BigOutline(std::int64_t rows) {
    const std::int64_t directories = rows / kFilesPerDirectory;
    for (std::int64_t d = 0; d < directories; ++d) {
      auto* dir = new QR_OutlineText(("src/module" + std::to_string(d)).c_str());
      dir->make_expandable();
      for (int f = 0; f < kFilesPerDirectory; ++f) {
        auto* file = new QR_OutlineText(("file" + std::to_string(f) + ".c").c_str());
        file->make_selectable();
        dir->add_child(file);
      }
      root.add_child(dir);
      dirs.push_back(dir);
    }
  }
};

void BM_ExpandAll(benchmark::State& state) {
  BigOutline o(state.range(0));
  for (auto _ : state) {
    state.PauseTiming();
    o.root.collapse_all();
    state.ResumeTiming();
    o.root.expand_all();
  }
  state.SetComplexityN(state.range(0));
}

void BM_CollapseAll(benchmark::State& state) {
  BigOutline o(state.range(0));
  for (auto _ : state) {
    state.PauseTiming();
    o.root.expand_all();
    state.ResumeTiming();
    o.root.collapse_all();
  }
  state.SetComplexityN(state.range(0));
}

void BM_NextThroughEveryRow(benchmark::State& state) {
  BigOutline o(state.range(0));
  o.root.expand_all();
  const std::uint32_t lines = o.root.total_lines();
  for (auto _ : state) {
    o.root.select_exclusively(o.dirs.front());
    for (std::uint32_t i = 1; i < lines; ++i) o.root.perform_action(QR_OutlineNext, nullptr);
  }
  if (o.root.selected(0) != o.dirs.back()->child_row(kFilesPerDirectory - 1)) state.SkipWithError("did not reach the end");
  state.SetComplexityN(state.range(0));
}

void BM_ExpandLastDirectory(benchmark::State& state) {
  BigOutline o(state.range(0));
  QR_OutlineText* last = o.dirs.back();
  for (auto _ : state) {
    state.PauseTiming();
    last->collapse();
    state.ResumeTiming();
    last->expand();
  }
  state.SetComplexityN(state.range(0));
}

}  // namespace

BENCHMARK(BM_ExpandAll)->Arg(10000)->Arg(100000)->Arg(300000)->Unit(benchmark::kMillisecond)->Complexity(benchmark::oN);
BENCHMARK(BM_CollapseAll)->Arg(10000)->Arg(100000)->Arg(300000)->Unit(benchmark::kMillisecond)->Complexity(benchmark::oN);
BENCHMARK(BM_NextThroughEveryRow)->Arg(10000)->Arg(100000)->Arg(300000)->Unit(benchmark::kMillisecond)->Complexity(benchmark::oN);
BENCHMARK(BM_ExpandLastDirectory)->Arg(10000)->Arg(100000)->Arg(300000)->Unit(benchmark::kMicrosecond)->Complexity(benchmark::oN);

BENCHMARK_MAIN();
