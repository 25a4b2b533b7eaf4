// The seventeen sort orders: ids, the names options and settings use, and their labels.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/errors.h"

struct SortOrderInfo {
  std::uint32_t id;
  const char* name;       // used in preferences, options and menu cells
  const char* menuLabel;  // shown in the sort menu and the name column heading
};

constexpr std::uint32_t kDefaultSortOrder = 11;  // "al_unused"

// The orders by id (1..17).
const std::vector<SortOrderInfo>& sortOrderTable();
// The name table in its own sequence, ending with the empty 18th row.
const std::vector<SortOrderInfo>& sortOrderNameTable();

// Name of an order, or "" for an unknown id.
const char* sort_order_name(std::uint32_t id);
const char* sort_order_label(std::uint32_t id);
// Exact, case-sensitive name; empty or unknown: invalidSortingOrder with id 11.
ErrorCode sort_order_by_name(const char* name, std::uint32_t& id);
