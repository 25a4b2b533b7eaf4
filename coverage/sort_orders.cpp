// Sort order names and labels.
#include "coverage/sort_orders.h"

#include <cstring>

const std::vector<SortOrderInfo>& sortOrderTable() {
  static const std::vector<SortOrderInfo> table = {
      {1, "alpha", "Alphabetical"},
      {2, "native", "Unsorted"},
      {3, "lines", "Number of lines"},
      {4, "l_used", "Used lines"},
      {5, "l_used%", "Percent of lines used"},
      {6, "l_unused", "Unused lines"},
      {7, "l_unused%", "Percent of lines unused"},
      {8, "adj_lines", "Adjusted number of lines"},
      {9, "al_used", "Adjusted used lines"},
      {10, "al_used%", "Adjusted percent of lines used"},
      {11, "al_unused", "Adjusted unused lines"},
      {12, "al_unused%", "Adjusted percent of lines unused"},
      {13, "blocks", "Number of basic blocks"},
      {14, "b_used", "Used basic blocks"},
      {15, "b_used%", "Percent of basic blocks used"},
      {16, "b_unused", "Unused basic blocks"},
      {17, "b_unused%", "Percent of basic blocks unused"},
  };
  return table;
}

const std::vector<SortOrderInfo>& sortOrderNameTable() {
  static const std::vector<SortOrderInfo> table = [] {
    std::vector<SortOrderInfo> t;
    for (std::uint32_t id : {1u, 2u, 3u, 4u, 6u, 5u, 7u, 8u, 9u, 11u, 10u, 12u, 13u, 14u, 16u, 15u, 17u})
      t.push_back(sortOrderTable()[id - 1]);
    t.push_back({18, "", ""});
    return t;
  }();
  return table;
}

const char* sort_order_name(std::uint32_t id) {
  return id >= 1 && id <= 17 ? sortOrderTable()[id - 1].name : "";
}

const char* sort_order_label(std::uint32_t id) {
  return id >= 1 && id <= 17 ? sortOrderTable()[id - 1].menuLabel : "";
}

ErrorCode sort_order_by_name(const char* name, std::uint32_t& id) {
  if (name && *name) {
    for (const auto& o : sortOrderTable()) {
      if (strcmp(o.name, name) == 0) {
        id = o.id;
        return allOK;
      }
    }
  }
  id = kDefaultSortOrder;
  return invalidSortingOrder;
}
