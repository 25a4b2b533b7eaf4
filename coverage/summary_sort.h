// The seventeen orders of the summary tree: their comparisons and the sort of every level
// of a tree (their names: coverage/sort_orders.h).
#pragma once

#include <cstdint>

#include "coverage/summary_types.h"
#include "support/errors.h"

// Sorts dirOrder, every fileOrder and (unless functionsToo is false: they were sorted file by
// file) every funcOrder by the order and stores it in the root. Ids outside 1..17 leave the
// tree as it is.
ErrorCode sortSummary(SumRoot& root, std::uint32_t sortOrder, bool functionsToo = true);
// Sorts one file's funcOrder by the order, as sortSummary does.
void sortFunctions(SumFile& file, std::uint32_t sortOrder);
// Summaries with at least this many functions have them sorted on several threads (tests
// set 0).
void setSortThreadThreshold(std::size_t functions);
