// Contiguous runs of items on a few threads.
#include "support/parallel_runs.h"

#include <algorithm>
#include <system_error>
#include <thread>
#include <vector>

void runInParallel(std::size_t count, const std::function<std::size_t(std::size_t)>& weight, std::size_t minWeight,
                   const std::function<void(std::size_t, std::size_t)>& work) {
  if (count == 0) return;
  std::size_t total = 0;
  for (std::size_t k = 0; k < count; ++k) total += weight(k);
  const unsigned threads = std::min(4u, std::thread::hardware_concurrency());
  if (total < minWeight || threads < 2 || count < 2) {
    work(0, count);
    return;
  }
  std::vector<std::thread> workers;
  std::size_t from = 0, seen = 0;
  for (std::size_t k = 0; k < count; ++k) {
    seen += weight(k);
    const bool last = k + 1 == count;
    if (!last && seen < total / threads * (workers.size() + 1)) continue;
    if (!last && workers.size() + 1 < threads) {
      try {
        workers.emplace_back(work, from, k + 1);
        from = k + 1;
        continue;
      } catch (const std::system_error&) {
        // No thread to be had: the rest runs here.
      }
    }
    if (last) work(from, count);
  }
  for (std::thread& t : workers) t.join();
}
