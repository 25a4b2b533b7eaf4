// Name shortening, function display names and the name column width.
#include <gtest/gtest.h>

#include "summary/name_style.h"

TEST(NameShortening, TextsAndPaths) {
  EXPECT_EQ(shorten_leftmost("abcdefghij", 6), "abc...");
  EXPECT_EQ(shorten_rightmost("abcdefghij", 6), "...hij");
  EXPECT_EQ(shorten_leftmost("abcdefghij", 2), "..");
  EXPECT_EQ(shorten_rightmost("abcdefghij", 2), "..");
  EXPECT_EQ(shorten_leftmost("abc", 3), "abc");
  EXPECT_EQ(directory_segment("/a/b/c/"), "c/");
  EXPECT_EQ(directory_segment("/a/b/c"), "c");
  EXPECT_EQ(directory_segment("/usr/src/lib/"), "lib/");
  EXPECT_EQ(directory_segment("lib/"), "lib/");
  EXPECT_EQ(shorten_path_leftmost("/usr/local/src/project/lib/", 16), "/usr/local/...");
  EXPECT_EQ(shorten_path_rightmost("/usr/local/src/project/lib/", 16), ".../project/lib/");
  EXPECT_EQ(shorten_path_rightmost("/usr/local/src/project/lib/", 3), "...");
  EXPECT_EQ(shorten_path_leftmost("/short/", 16), "/short/");
}

TEST(FunctionNames, PartsAreHiddenByShowBits) {
  const std::string f = "ns::Cls::f(int) const";
  EXPECT_EQ(function_display_name(f, 7), f);
  EXPECT_EQ(function_display_name(f, 6), "Cls::f(int) const");
  EXPECT_EQ(function_display_name(f, 3), "ns::Cls::f");
  EXPECT_EQ(function_display_name("Cls::operator==(const Cls&)", 5), "Cls::==(const Cls&)");
  EXPECT_EQ(function_display_name("Cls::operator()(int)", 5), "Cls::()(int)");
  EXPECT_EQ(function_display_name("Cls::operator new(unsigned long)", 5), "Cls::new(unsigned long)");
  EXPECT_EQ(function_display_name("Cls::operatorX(int)", 5), "Cls::operatorX(int)");
  EXPECT_EQ(function_display_name("f(int) [clone .cold]", 3), "f [clone .cold]");
  EXPECT_EQ(function_display_name("main", 0), "main");
  EXPECT_EQ(function_display_name("a::b", 6), "b");
}

TEST(NameColumn, WidthIsClampedAndAbsorbsWindowChanges) {
  EXPECT_EQ(clamp_name_column_width(250), 200u);
  EXPECT_EQ(clamp_name_column_width(10), 32u);
  EXPECT_EQ(clamp_name_column_width(-5), 32u);
  NameStyle s;
  s.nameColumnWidth = 40;
  s.chosenWidth = 40;
  // The window was as wide as its columns; 20 more characters go to the name column.
  EXPECT_EQ(resized_name_column_width(s, 120, 100, true), 60u);
  s.nameColumnWidth = 60;
  EXPECT_EQ(resized_name_column_width(s, 80, 120, false), 40u);  // never below the chosen width
  EXPECT_EQ(resized_name_column_width(s, 110, 120, false), 50u);
  EXPECT_EQ(resized_name_column_width(s, 100, 120, true), 60u);  // widening never shrinks it
}

TEST(NameColumn, CellsFollowTheStyle) {
  NameStyle s;
  EXPECT_EQ(directory_name_cell("/usr/local/src/project/lib/", 16, s), ".../project/lib/");
  s.directoryNames = rightmostSegment;
  EXPECT_EQ(directory_name_cell("/usr/local/src/project/lib/", 16, s), "lib/            ");
  EXPECT_EQ(file_name_cell("a_very_long_file_name.c", 10, s), "a_very_...");
  s.longFileNames = keepRightmost;
  EXPECT_EQ(file_name_cell("a_very_long_file_name.c", 10, s), "..._name.c");
  s.showBits = showClassQualifier;
  EXPECT_EQ(function_name_cell("Cls::f(int)", 12, s), "Cls::f      ");
}
