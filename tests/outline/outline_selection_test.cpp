// Moving the selection through an outline with the navigation actions, and what the root offers.
#include "tests/outline/outline_support.h"

using Lines = std::vector<std::string>;

namespace {

// dir1 (open: f1 f2), dir2 (closed: g1), dir3 (open: h1)
struct Tree {
  Outline o;
  QR_OutlineText* dir1 = o.add_with_children(o.root.get(), "dir1", "f", 2);
  QR_OutlineText* dir2 = o.add_with_children(o.root.get(), "dir2", "g", 1);
  QR_OutlineText* dir3 = o.add_with_children(o.root.get(), "dir3", "h", 1);
  Tree() {
    dir1->expand();
    dir3->expand();
  }
  QR_OutlineObject* row(const char* text) {
    for (std::uint32_t l = 0; l < o.root->total_lines(); ++l) {
      QR_OutlineObject* r = o.root->object_at_line(l);
      if (RecordingDisplay::name(r) == text) return r;
    }
    return nullptr;
  }
};

}  // namespace

TEST(Navigation, NextAndPreviousWalkEveryVisibleRowInDisplayOrder) {
  Tree t;
  t.o.act(QR_OutlineFirst);  // nothing selected: the root's own tables do not have it
  EXPECT_EQ(t.o.root->selection_count(), 0u);
  t.dir1->select();
  Lines seen = t.o.selection();
  for (int i = 0; i < 10; ++i) {
    t.o.act(QR_OutlineNext);
    seen.push_back(t.o.selection().at(0));
  }
  EXPECT_EQ(seen, (Lines{"dir1", "f1", "f2", "dir2", "dir3", "h1", "h1", "h1", "h1", "h1", "h1"}));
  EXPECT_FALSE(t.o.root->has_action(QR_OutlineNext));
  Lines back;
  for (int i = 0; i < 6; ++i) {
    t.o.act(QR_OutlinePrevious);
    back.push_back(t.o.selection().at(0));
  }
  EXPECT_EQ(back, (Lines{"dir3", "dir2", "f2", "f1", "dir1", "dir1"}));
  EXPECT_FALSE(t.o.root->has_action(QR_OutlinePrevious));
}

TEST(Navigation, NextMovesFromTheLowerOfTwoSelectedRowsAndPreviousFromTheUpper) {
  Tree t;
  t.o.root->select_exclusively(t.row("f1"));
  t.o.root->add_to_selection(t.dir2);
  EXPECT_EQ(t.o.selection(), (Lines{"f1", "dir2"}));
  t.o.act(QR_OutlineNext);
  EXPECT_EQ(t.o.selection(), (Lines{"dir3"}));

  // Added in the other order, the selection is still kept in line order.
  t.o.root->select_exclusively(t.dir2);
  t.o.root->add_to_selection(t.row("f1"));
  EXPECT_EQ(t.o.selection(), (Lines{"f1", "dir2"}));
  t.o.act(QR_OutlinePrevious);
  EXPECT_EQ(t.o.selection(), (Lines{"dir1"}));
}

TEST(Navigation, SameLevelMovesSkipOtherDepthsAndStopAtTheEnds) {
  Tree t;
  t.dir1->select();
  t.o.act(QR_OutlineNextSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"dir2"}));
  t.o.act(QR_OutlineNextSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"dir3"}));
  t.o.display->take_log();
  t.o.act(QR_OutlineNextSameLevel);  // the last row of its depth
  EXPECT_EQ(t.o.selection(), (Lines{"dir3"}));
  Lines log = t.o.display->take_log();
  EXPECT_EQ(std::count_if(log.begin(), log.end(), [](const std::string& s) { return s.rfind("selected", 0) == 0; }), 0);

  // From f2 the next row of depth 1 is h1, past two top-level rows.
  t.row("f2")->select();
  t.o.act(QR_OutlineNextSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"h1"}));
  t.o.act(QR_OutlinePreviousSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"f2"}));
  t.o.act(QR_OutlinePreviousSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"f1"}));
  t.o.act(QR_OutlinePreviousSameLevel);
  EXPECT_EQ(t.o.selection(), (Lines{"f1"}));
}

TEST(Navigation, FirstAndLastSelectTheEndsOfWhatIsShown) {
  Tree t;
  t.dir2->select();
  t.o.act(QR_OutlineLast);
  EXPECT_EQ(t.o.selection(), (Lines{"h1"}));
  t.o.act(QR_OutlineFirst);
  EXPECT_EQ(t.o.selection(), (Lines{"dir1"}));
  t.dir3->collapse();
  t.dir2->select();
  t.o.act(QR_OutlineLast);
  EXPECT_EQ(t.o.selection(), (Lines{"dir3"}));
}

TEST(Navigation, LastOnAnOutlineWithoutSelectableRowsLeavesNothingSelected) {
  Outline o;
  QR_OutlineText* title = new QR_OutlineText("title");  // neither selectable nor expandable
  o.root->add_child(title);
  QR_OutlineText* only = o.add(o.root.get(), "only");
  only->hide();  // a hidden row cannot be selected
  o.root->select_exclusively(title);
  EXPECT_EQ(o.selection(), (Lines{"title"}));
  // Performed on a row directly, as a glyph's menu does.
  EXPECT_TRUE(only->perform_action(QR_OutlineLast, nullptr));
  EXPECT_EQ(o.root->selection_count(), 0u);

  only->show();
  EXPECT_TRUE(only->perform_action(QR_OutlineLast, nullptr));
  EXPECT_EQ(o.selection(), (Lines{"only"}));
  expectConsistent(o);
}

TEST(Navigation, RootOffersRowActionsOnlyThroughTheSelection) {
  Tree t;
  QR_OutlineRoot& root = *t.o.root;
  EXPECT_FALSE(root.has_action(QR_OutlineNext));
  EXPECT_FALSE(root.has_action(QR_OutlineExpand));
  EXPECT_TRUE(root.has_action(QR_OutlineCollapseChildren));  // dir1 and dir3 are open
  EXPECT_FALSE(t.o.act(QR_OutlineNext));
  EXPECT_EQ(root.selection_count(), 0u);

  t.dir2->select();
  EXPECT_TRUE(root.has_action(QR_OutlineNext));
  EXPECT_TRUE(root.has_action(QR_OutlinePrevious));
  EXPECT_TRUE(root.has_action(QR_OutlineExpand));
  EXPECT_FALSE(root.has_action(QR_OutlineCollapse));
  EXPECT_TRUE(root.has_action("QR_OutlineCollapse, QR_OutlineExpand"));
  EXPECT_FALSE(root.has_action("NoSuchAction"));
  t.row("h1")->select();
  EXPECT_FALSE(root.has_action(QR_OutlineNext));
  EXPECT_FALSE(root.has_action(QR_OutlineExpand));
  root.clear_selection();
  EXPECT_FALSE(root.has_action(QR_OutlinePrevious));
}

TEST(Navigation, EachDispatchRecomputesTheOfferedActionsOnce) {
  Tree t;
  t.dir1->select();
  for (const char* a : {QR_OutlineNext, QR_OutlineNext, QR_OutlinePrevious, QR_OutlineExpandCollapse,
                        "QR_OutlineExpand,QR_OutlineMakeVisible", QR_OutlineCollapseChildren}) {
    const int before = t.o.display->actions_changed_calls;
    t.o.act(a);
    EXPECT_EQ(t.o.display->actions_changed_calls, before + 1) << a;
  }
}

TEST(Navigation, SelectingScrollsTheRowIntoView) {
  Outline o(3);
  QR_OutlineText* big = o.add_with_children(o.root.get(), "big", "f", 6);
  big->expand();
  big->select();
  o.display->take_log();
  o.act(QR_OutlineLast);
  EXPECT_EQ(o.selection(), (Lines{"f6"}));
  EXPECT_TRUE(o.display->is_line_visible(6));
  EXPECT_FALSE(o.display->is_line_visible(0));
  Lines log = o.display->take_log();
  EXPECT_NE(std::find(log.begin(), log.end(), "show_line 6"), log.end());
  EXPECT_NE(std::find(log.begin(), log.end(), "deselected big"), log.end());
}
