// Expanding and collapsing rows as a user sees it on the display, line by line.
#include "tests/outline/outline_support.h"

using Lines = std::vector<std::string>;

TEST(Expansion, OpeningARowWithThreeLeavesInsertsThreeLinesAndMovesLaterRowsDown) {
  Outline o;
  QR_OutlineText* src = o.add_with_children(o.root.get(), "src", "file", 3);
  QR_OutlineText* lib = o.add_with_children(o.root.get(), "lib", "obj", 1);
  QR_OutlineText* notes = o.add(o.root.get(), "NOTES");
  EXPECT_EQ(o.screen(), (Lines{">  src", ">  lib", "   NOTES"}));
  o.display->take_log();

  src->select();
  EXPECT_TRUE(o.act(QR_OutlineExpand));
  EXPECT_EQ(o.screen(), (Lines{"v  src", "      file1", "      file2", "      file3", ">  lib", "   NOTES"}));
  Lines log = o.display->take_log();
  EXPECT_EQ(std::count(log.begin(), log.end(), "insert 1 3"), 1);
  EXPECT_EQ(std::count_if(log.begin(), log.end(), [](const std::string& s) { return s.rfind("insert", 0) == 0; }), 1);
  EXPECT_EQ(lib->first_line(), 4u);
  EXPECT_EQ(notes->first_line(), 5u);
  EXPECT_EQ(o.root->object_at_line(2)->line_text(0), std::string("file2"));
  expectConsistent(o);

  // The row now offers collapsing instead of expanding.
  EXPECT_TRUE(src->has_action(QR_OutlineCollapse));
  EXPECT_FALSE(src->has_action(QR_OutlineExpand));
  EXPECT_EQ(src->flags() & 0xE, unsigned(QR_OutlineObject::kExpanded | QR_OutlineObject::kCollapsible));
}

TEST(Expansion, CollapsingAndReopeningShowsTheSubtreeAsItWas) {
  Outline o;
  QR_OutlineText* top = o.add(o.root.get(), "top", true);
  QR_OutlineText* a = o.add_with_children(top, "a", "a", 2);
  o.add_with_children(top, "b", "b", 1);
  o.add(o.root.get(), "end");
  top->expand();
  a->expand();
  const Lines open = {"v  top", "   v  a", "         a1", "         a2", "   >  b", "   end"};
  EXPECT_EQ(o.screen(), open);

  top->collapse();
  EXPECT_EQ(o.screen(), (Lines{">  top", "   end"}));
  EXPECT_EQ(a->first_line(), QR_OutlineObject::kNoLine);
  EXPECT_TRUE(a->is_expanded());
  expectConsistent(o);

  top->expand();
  EXPECT_EQ(o.screen(), open);
  expectConsistent(o);
}

TEST(Expansion, ExpandOnAnOpenRowOrALeafAndCollapseOnAClosedRowChangeNothing) {
  Outline o;
  QR_OutlineText* dir = o.add_with_children(o.root.get(), "dir", "f", 2);
  QR_OutlineText* leaf = o.add(o.root.get(), "leaf");
  o.display->take_log();
  dir->collapse();
  leaf->expand();
  leaf->collapse();
  EXPECT_TRUE(o.display->take_log().empty());
  dir->expand();
  o.display->take_log();
  dir->expand();
  EXPECT_TRUE(o.display->take_log().empty());
  EXPECT_EQ(o.screen(), (Lines{"v  dir", "      f1", "      f2", "   leaf"}));
}

TEST(Expansion, ReturnOnAnOpenRowClosesItAndBringsItIntoView) {
  Outline o;
  QR_OutlineText* dir = o.add_with_children(o.root.get(), "dir", "f", 2);
  dir->select();
  o.act(QR_OutlineExpandCollapse);
  o.act(QR_OutlineMakeVisible);
  EXPECT_TRUE(dir->is_expanded());
  o.display->take_log();

  // The Return key performs the two strings in turn.
  o.act(QR_OutlineExpandCollapse);
  o.act(QR_OutlineMakeVisible);
  EXPECT_FALSE(dir->is_expanded());
  EXPECT_EQ(o.screen(), (Lines{">  dir"}));
  Lines log = o.display->take_log();
  auto del = std::find(log.begin(), log.end(), "delete 1 2");
  auto shown = std::find(log.begin(), log.end(), "make_visible dir");
  ASSERT_NE(del, log.end());
  ASSERT_NE(shown, log.end());
  EXPECT_LT(del, shown);
  expectConsistent(o);
}

TEST(Expansion, ExpandAllOpensEveryLevelAndUpdatesActionsOnce) {
  Outline o;
  QR_OutlineText* top = o.add(o.root.get(), "top", true);
  QR_OutlineText* a = o.add(top, "a", true);
  o.add_with_children(a, "a1", "x", 2);
  o.add_with_children(top, "b", "y", 1);
  QR_OutlineText* other = o.add_with_children(o.root.get(), "other", "z", 1);
  top->select();
  EXPECT_TRUE(o.root->has_action(QR_OutlineExpandAll));
  const int before = o.display->actions_changed_calls;
  EXPECT_TRUE(o.act(QR_OutlineExpandAll));
  EXPECT_EQ(o.display->actions_changed_calls, before + 1);
  EXPECT_EQ(o.screen(), (Lines{"v  top", "   v  a", "      v  a1", "            x1", "            x2", "   v  b",
                               "         y1", ">  other"}));
  EXPECT_FALSE(other->is_expanded());
  expectConsistent(o);
  // Nothing further to open below the selected row.
  EXPECT_FALSE(o.root->has_action(QR_OutlineExpandAll));
  EXPECT_TRUE(o.root->has_action(QR_OutlineCollapseAll));

  const int mid = o.display->actions_changed_calls;
  EXPECT_TRUE(o.act(QR_OutlineCollapseAll));
  EXPECT_EQ(o.display->actions_changed_calls, mid + 1);
  EXPECT_EQ(o.screen(), (Lines{">  top", ">  other"}));
  expectConsistent(o);
  // Everything below was closed too: opening the top shows closed children.
  top->expand();
  EXPECT_EQ(o.screen(), (Lines{"v  top", "   >  a", "   >  b", ">  other"}));
  expectConsistent(o);
}

TEST(Expansion, CollapseChildrenClosesOneLevelAndGrandchildrenKeepTheirState) {
  Outline o;
  QR_OutlineText* a = o.add(o.root.get(), "a", true);
  QR_OutlineText* a1 = o.add_with_children(a, "a1", "f", 1);
  QR_OutlineText* b = o.add_with_children(o.root.get(), "b", "g", 2);
  EXPECT_FALSE(o.root->has_action(QR_OutlineCollapseChildren));
  a->expand();
  a1->expand();
  b->expand();
  EXPECT_TRUE(o.root->has_action(QR_OutlineCollapseChildren));
  EXPECT_TRUE(o.act(QR_OutlineCollapseChildren));
  EXPECT_EQ(o.screen(), (Lines{">  a", ">  b"}));
  EXPECT_TRUE(a1->is_expanded());
  EXPECT_FALSE(o.root->has_action(QR_OutlineCollapseChildren));
  a->expand();
  EXPECT_EQ(o.screen(), (Lines{"v  a", "   v  a1", "         f1", ">  b"}));
  expectConsistent(o);
}

TEST(Expansion, SeveralSelectedRowsOpenFromTheFirstAndCloseFromTheLast) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "a", 2);
  QR_OutlineText* b = o.add_with_children(o.root.get(), "b", "b", 1);
  o.root->select_exclusively(a);
  o.root->add_to_selection(b);
  o.display->take_log();
  o.act(QR_OutlineExpand);
  Lines log = o.display->take_log();
  EXPECT_LT(std::find(log.begin(), log.end(), "before a QR_OutlineExpand"),
            std::find(log.begin(), log.end(), "before b QR_OutlineExpand"));
  EXPECT_EQ(o.screen(), (Lines{"v  a", "      a1", "      a2", "v  b", "      b1"}));
  EXPECT_EQ(o.selection(), (Lines{"a", "b"}));
  o.act(QR_OutlineCollapse);
  log = o.display->take_log();
  EXPECT_LT(std::find(log.begin(), log.end(), "before b QR_OutlineCollapse"),
            std::find(log.begin(), log.end(), "before a QR_OutlineCollapse"));
  EXPECT_EQ(o.screen(), (Lines{">  a", ">  b"}));
  expectConsistent(o);
}

TEST(Expansion, HiddenRowsLeaveTheDisplayAndComeBackWithTheirGlyph) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "f", 2);
  QR_OutlineText* two = o.add(o.root.get(), "two");
  two->append_line("two, second line");
  o.add(o.root.get(), "z");
  a->expand();
  a->select();
  a->hide();
  EXPECT_EQ(o.screen(), (Lines{"   two", "   two, second line", "   z"}));
  EXPECT_EQ(o.root->selection_count(), 0u);
  EXPECT_FALSE(a->is_selectable());
  expectConsistent(o);
  two->hide();
  EXPECT_EQ(o.screen(), (Lines{"   z"}));
  expectConsistent(o);

  a->show();
  two->show();
  EXPECT_EQ(o.screen(), (Lines{">  a", "   two", "   two, second line", "   z"}));
  expectConsistent(o);
}
