// Rows arriving and leaving while the outline is shown: auto-select, scrolling to the growing
// end, removals and the line map, and outlines far larger than a screen.
#include "tests/outline/outline_support.h"

using Lines = std::vector<std::string>;

TEST(Children, WithAutoSelectAppendedRowsAreSelectedOneAfterAnother) {
  Outline o(4);
  o.root->set_auto_select(true);
  QR_OutlineText* log = o.add(o.root.get(), "run log", true);
  log->expand();
  EXPECT_EQ(o.selection(), (Lines{"run log"}));  // the first row was selected when it came
  o.add(log, "step 1");
  EXPECT_EQ(o.selection(), (Lines{"step 1"}));
  for (int i = 2; i <= 9; ++i) {
    o.add(log, ("step " + std::to_string(i)).c_str());
    EXPECT_EQ(o.selection(), (Lines{"step " + std::to_string(i)}));
  }
  // The view followed the selection down.
  EXPECT_TRUE(o.display->is_line_visible(9));
  EXPECT_FALSE(o.display->is_line_visible(5));
  expectConsistent(o);
}

TEST(Children, WithoutAutoSelectTheSelectionStaysAndTheViewFollowsOnlyWhileItsEndIsShown) {
  Outline o(4);
  QR_OutlineText* log = o.add(o.root.get(), "run log", true);
  log->expand();
  for (int i = 1; i <= 3; ++i) o.add(log, ("step " + std::to_string(i)).c_str());
  EXPECT_EQ(o.root->selection_count(), 0u);
  o.display->take_log();
  o.add(log, "step 4");  // line 4: the line above it is on screen, so the view moves down
  EXPECT_EQ(o.display->take_log().back(), "show_line 4");
  EXPECT_TRUE(o.display->is_line_visible(4));
  o.display->top = 0;  // the user scrolls back up
  o.add(log, "step 5");
  Lines calls = o.display->take_log();
  EXPECT_EQ(std::count_if(calls.begin(), calls.end(), [](const std::string& s) { return s.rfind("show_line", 0) == 0; }), 0);

  // A selected row on screen keeps the view where it is.
  log->select();
  o.display->take_log();
  o.add(log, "step 6");
  calls = o.display->take_log();
  EXPECT_EQ(std::count_if(calls.begin(), calls.end(), [](const std::string& s) { return s.rfind("show_line", 0) == 0; }), 0);
  EXPECT_EQ(o.selection(), (Lines{"run log"}));
  expectConsistent(o);
}

TEST(Children, RemovingRowsKeepsTheLineMapInStepWithTheText) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "a", 3);
  QR_OutlineText* b = o.add_with_children(o.root.get(), "b", "b", 2);
  QR_OutlineText* c = o.add_with_children(o.root.get(), "c", "c", 2);
  a->expand();
  b->expand();
  c->expand();
  ASSERT_EQ(o.root->total_lines(), 10u);
  expectConsistent(o);

  // An open row in the middle: its own line and its children's go, rows below move up.
  o.root->remove_child(b);
  delete b;
  EXPECT_EQ(o.screen(), (Lines{"v  a", "      a1", "      a2", "      a3", "v  c", "      c1", "      c2"}));
  EXPECT_EQ(c->first_line(), 4u);
  expectConsistent(o);

  // A first child, then the last row of the outline.
  QR_OutlineObject* a1 = a->child_row(0);
  a->remove_child(a1);
  delete a1;
  QR_OutlineObject* c2 = c->child_row(1);
  c->remove_child(c2);
  delete c2;
  EXPECT_EQ(o.screen(), (Lines{"v  a", "      a2", "      a3", "v  c", "      c1"}));
  expectConsistent(o);
  EXPECT_EQ(o.root->object_at_line(5), nullptr);
  EXPECT_EQ(o.root->object_at_line(9), nullptr);

  // Deleting a row that is still in the outline takes it out first.
  delete a;
  EXPECT_EQ(o.screen(), (Lines{"v  c", "      c1"}));
  expectConsistent(o);
  // A removed row can be put back elsewhere and shows there.
  o.root->insert_child(new QR_OutlineText("new first"), 0);
  EXPECT_EQ(o.screen(), (Lines{"   new first", "v  c", "      c1"}));
  expectConsistent(o);
}

TEST(Children, RemovingARowDeselectsEverySelectedRowOfItsSubtree) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "a", 3);
  QR_OutlineText* b = o.add(o.root.get(), "b");
  a->expand();
  o.root->select_exclusively(a->child_row(1));
  o.root->add_to_selection(b);
  o.display->take_log();
  o.root->remove_child(a);
  EXPECT_EQ(o.selection(), (Lines{"b"}));
  Lines log = o.display->take_log();
  EXPECT_NE(std::find(log.begin(), log.end(), "deselected a2"), log.end());
  delete a;
  EXPECT_EQ(o.screen(), (Lines{"   b"}));
  o.act(QR_OutlinePrevious);  // nothing above b any more
  EXPECT_EQ(o.selection(), (Lines{"b"}));
  expectConsistent(o);
}

TEST(Children, InsertingInTheMiddleOfAnOpenRowShiftsOnlyWhatFollows) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "a", 2);
  QR_OutlineText* z = o.add(o.root.get(), "z");
  a->expand();
  QR_OutlineText* mid = new QR_OutlineText("a1.5");
  mid->make_selectable();
  a->insert_child(mid, 1);
  EXPECT_EQ(o.screen(), (Lines{"v  a", "      a1", "      a1.5", "      a2", "   z"}));
  EXPECT_EQ(z->first_line(), 4u);
  expectConsistent(o);
  // Rows added under a closed row appear only when it opens.
  QR_OutlineText* c = o.add(o.root.get(), "c", true);
  o.add(c, "c1");
  EXPECT_EQ(o.root->total_lines(), 6u);
  c->expand();
  EXPECT_EQ(o.screen().back(), "      c1");
  expectConsistent(o);
}

TEST(Children, TextRowsGrowAndChangeInPlace) {
  Outline o;
  QR_OutlineText* a = o.add_with_children(o.root.get(), "a", "a", 1);
  QR_OutlineText* z = o.add(o.root.get(), "z");
  a->expand();
  a->append_line("second line of a");
  EXPECT_EQ(o.screen(), (Lines{"v  a", "   second line of a", "      a1", "   z"}));
  a->replace_line("renamed", 0);
  a->replace_line("ignored", 7);
  a->append_line(nullptr);
  z->replace_line("tab\there", 0);
  EXPECT_EQ(o.screen(), (Lines{"v  renamed", "   second line of a", "      a1", "   tab     here"}));
  EXPECT_EQ(a->line_text(2), nullptr);
  expectConsistent(o);
}

TEST(Children, ARowWithMoreThanSixtyFiveThousandChildrenShowsThemAll) {
  Outline o;
  QR_OutlineText* dir = o.add(o.root.get(), "big directory", true);
  const int n = 70000;
  for (int i = 0; i < n; ++i) o.add(dir, ("file" + std::to_string(i)).c_str());
  QR_OutlineText* after = o.add(o.root.get(), "after");
  EXPECT_EQ(dir->child_count(), std::uint32_t(n));
  dir->expand();
  EXPECT_EQ(o.root->total_lines(), std::uint32_t(n + 2));
  EXPECT_EQ(after->first_line(), std::uint32_t(n + 1));
  EXPECT_EQ(RecordingDisplay::name(o.root->object_at_line(n)), "file69999");
  EXPECT_EQ(o.display->lines[n], "      file69999");
  EXPECT_EQ(o.display->lines[65536], "      file65535");
  dir->child_row(n - 1)->select();
  o.act(QR_OutlineNext);
  EXPECT_EQ(o.selection(), (Lines{"after"}));
  o.act(QR_OutlinePrevious);
  EXPECT_EQ(o.selection(), (Lines{"file69999"}));
  dir->collapse();
  EXPECT_EQ(o.screen(), (Lines{">  big directory", "   after"}));
}

TEST(Children, DestroyingTheRootDestroysTheDisplayAndEveryRow) {
  bool destroyed = false;
  {
    auto* d = new RecordingDisplay(&destroyed);
    QR_OutlineRoot root(d);
    auto* a = new QR_OutlineText("a");
    a->make_expandable();
    root.add_child(a);
    a->add_child(new QR_OutlineText("a1"));
    a->expand();
    root.select_exclusively(a);
  }
  EXPECT_TRUE(destroyed);
}
