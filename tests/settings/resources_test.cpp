#include <gtest/gtest.h>
#include "settings/resource_table.h"
TEST(X, Y) { EXPECT_EQ(registeredResources().size(), 0u); kgSettings(); EXPECT_EQ(registeredResources().size(), 136u); }
