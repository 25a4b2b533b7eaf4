// Work over many independent items split into contiguous runs, one thread each.
#pragma once

#include <cstddef>
#include <functional>

// Calls work(from, to) for contiguous runs covering items 0..count-1, each run about the
// same total weight, on up to four threads (this one takes the last run). When all items
// weigh less than `minWeight` together, or no second thread can be had, everything runs
// here in one call. work must not throw.
void runInParallel(std::size_t count, const std::function<std::size_t(std::size_t)>& weight, std::size_t minWeight,
                   const std::function<void(std::size_t, std::size_t)>& work);
