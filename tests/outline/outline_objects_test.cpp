// The building blocks under the rows: links, pointer arrays, action strings and tables, and the
// family hooks as a client deriving its own rows sees them.
#include "tests/outline/outline_support.h"

#include "outline/qr_pointer_array.h"

using Lines = std::vector<std::string>;

namespace {

struct Watcher : QR_Object {
  std::vector<std::uintptr_t> gone;  // addresses only: the objects no longer exist
  void linked_object_destroyed(QR_Object* o) override { gone.push_back(reinterpret_cast<std::uintptr_t>(o)); }
};

// A client row with an action table of its own, as the summary rows have.
struct ReportRow : QR_OutlineText {
  explicit ReportRow(const char* t) : QR_OutlineText(t) {}
  void open_report() { ++opened; }
  void count_argument(void* arg) { last_argument = arg; }
  int opened = 0;
  void* last_argument = nullptr;
};

QR_CompiledActions* reportTable() {
  static const QR_ActionSpec specs[] = {
      {"KG_OpenReport", &QR_ActionCall<ReportRow, &ReportRow::open_report>},
      {"KG_Argument", &QR_ActionCallWithArgument<ReportRow, &ReportRow::count_argument>},
  };
  static QR_CompiledActions table(specs, 2);
  return &table;
}

}  // namespace

TEST(Links, AreMutualAndTheSurvivorHearsOfTheOthersEnd) {
  Watcher a;
  auto* b = new Watcher;
  a.link(b);
  EXPECT_TRUE(a.is_linked(b));
  EXPECT_TRUE(b->is_linked(&a));
  b->unlink(&a);
  EXPECT_FALSE(a.is_linked(b));
  EXPECT_FALSE(b->is_linked(&a));
  b->link(&a);
  b->link(&a);
  EXPECT_EQ(a.linked_objects()->count(), 1u);
  const auto b_address = reinterpret_cast<std::uintptr_t>(static_cast<QR_Object*>(b));
  delete b;
  EXPECT_EQ(a.gone, std::vector<std::uintptr_t>{b_address});
  EXPECT_EQ(a.linked_objects()->count(), 0u);
}

TEST(PointerArrays, FindNeighboursInsertUniquelyAndAnswerNullOutOfRange) {
  QR_PointerArray<QR_Object> arr;
  QR_Object x, y, z;
  arr.append(&x);
  arr.append(&y);
  arr.insert(&z, 99);
  EXPECT_EQ(arr.count(), 3u);
  EXPECT_EQ(arr.after(nullptr), &x);
  EXPECT_EQ(arr.after(&y), &z);
  EXPECT_EQ(arr.after(&z), nullptr);
  EXPECT_EQ(arr.before(nullptr), &z);
  EXPECT_EQ(arr.before(&x), nullptr);
  EXPECT_EQ(arr.at(3), nullptr);
  arr.insert(&z, 0, true);
  EXPECT_EQ(arr.count(), 3u);
  EXPECT_EQ(arr.index_of(&z), 0u);
  EXPECT_TRUE(arr.remove(&y));
  EXPECT_EQ(arr.index_of(&y), 0xFFFFFFFFu);
  EXPECT_EQ(arr.after(&y), nullptr);

  bool freed = false;
  struct Noted : QR_Object {
    bool* flag;
    explicit Noted(bool* f) : flag(f) {}
    ~Noted() override { *flag = true; }
  };
  {
    QR_FreePointerArray<Noted> owned;
    owned.append(new Noted(&freed));
  }
  EXPECT_TRUE(freed);
}

TEST(ActionStrings, CommaListsRunEachKnownNameInOrder) {
  EXPECT_EQ(QR_SplitActionNames(" QR_OutlineExpand ,\tQR_OutlineMakeVisible,, "),
            (std::vector<std::string_view>{"QR_OutlineExpand", "QR_OutlineMakeVisible"}));
  EXPECT_EQ(QR_SplitActionNames("  QR_OutlineNext\t"), (std::vector<std::string_view>{"QR_OutlineNext"}));
  EXPECT_TRUE(QR_SplitActionNames(" , ,").empty());
  EXPECT_EQ(QR_ActionAtom(" QR_OutlineNext "), QR_ActionAtom("QR_OutlineNext"));

  Outline o;
  QR_OutlineText* dir = o.add_with_children(o.root.get(), "dir", "f", 1);
  dir->select();
  o.display->take_log();
  EXPECT_TRUE(o.act("Unknown, QR_OutlineExpand ,QR_OutlineMakeVisible"));
  Lines log = o.display->take_log();
  EXPECT_EQ(log.front(), "begin_action Unknown, QR_OutlineExpand ,QR_OutlineMakeVisible");
  Lines rowCalls;
  for (const std::string& s : log) {
    if (s.rfind("before", 0) == 0 || s.rfind("after", 0) == 0 || s.rfind("make_visible", 0) == 0) rowCalls.push_back(s);
  }
  EXPECT_EQ(rowCalls, (Lines{"before dir QR_OutlineExpand", "after dir QR_OutlineExpand",
                             "before dir QR_OutlineMakeVisible", "make_visible dir",
                             "after dir QR_OutlineMakeVisible"}));
  EXPECT_FALSE(o.act("Unknown"));
  EXPECT_FALSE(o.act(""));
  EXPECT_FALSE(o.act(nullptr));
  EXPECT_FALSE(o.root->has_action(nullptr));
}

TEST(ActionStrings, ClientTablesTakePartLikeTheLibrarysOwn) {
  Outline o;
  auto* row = new ReportRow("report");
  row->make_selectable();
  row->attach_actions(reportTable());
  row->attach_actions(reportTable());
  EXPECT_EQ(row->action_tables()->count(), 2u);  // the select table and the report table
  o.root->add_child(row);
  EXPECT_FALSE(o.root->has_action("KG_OpenReport"));
  row->select();
  EXPECT_TRUE(o.root->has_action("KG_OpenReport"));
  int marker = 0;
  EXPECT_TRUE(o.root->perform_action("KG_OpenReport,KG_Argument", &marker));
  EXPECT_EQ(row->opened, 1);
  EXPECT_EQ(row->last_argument, &marker);

  // A table written for another row class does nothing on a plain row.
  QR_OutlineText* plain = o.add(o.root.get(), "plain");
  plain->attach_actions(reportTable());
  EXPECT_TRUE(plain->perform_action("KG_OpenReport", nullptr));
  row->detach_actions(reportTable());
  EXPECT_FALSE(row->perform_action("KG_OpenReport", nullptr));
  EXPECT_EQ(row->opened, 1);
}

namespace {

// A row whose action clears its whole group, itself included, as a "remove these" command might.
struct GroupRow : QR_OutlineText {
  explicit GroupRow(const char* t) : QR_OutlineText(t) {}
  void clear_group() {
    QR_FamilyObject* group = parent();
    while (group->child_count() > 0) delete group->child(0);
  }
};

}  // namespace

TEST(ActionStrings, RowsDestroyedByAnEarlierActionArePassedOver) {
  static const QR_ActionSpec specs[] = {{"KG_ClearGroup", &QR_ActionCall<GroupRow, &GroupRow::clear_group>}};
  static QR_CompiledActions table(specs, 1);
  Outline o;
  QR_OutlineText* group = o.add(o.root.get(), "group", true);
  for (const char* n : {"one", "two", "three"}) {
    auto* r = new GroupRow(n);
    r->make_selectable();
    r->attach_actions(&table);
    group->add_child(r);
  }
  QR_OutlineText* after = o.add(o.root.get(), "after");
  group->expand();
  o.root->select_exclusively(group->child_row(0));
  o.root->add_to_selection(group->child_row(2));
  EXPECT_TRUE(o.act("KG_ClearGroup,QR_OutlineMakeVisible"));
  EXPECT_EQ(group->child_count(), 0u);
  EXPECT_EQ(o.root->selection_count(), 0u);
  EXPECT_EQ(o.screen(), (Lines{"v  group", "   after"}));
  EXPECT_EQ(after->first_line(), 1u);
  expectConsistent(o);
}

TEST(Annotations, OnePerPlaceAndTheDisplayHearsOfEachChange) {
  Outline o;
  QR_OutlineText* row = o.add(o.root.get(), "row");
  row->append_line("second");
  o.display->take_log();
  const int changes = o.display->row_changed_calls;
  row->put_annotation("KG_Mark", 1, 5);
  row->put_annotation("KG_Other", 1, 5);
  EXPECT_EQ(o.display->row_changed_calls, changes + 2);
  ASSERT_NE(row->annotation_at(1, 5), nullptr);
  EXPECT_STREQ(row->annotation_at(1, 5)->name_text(), "KG_Other");
  EXPECT_EQ(row->annotations()->count(), 1u);
  EXPECT_EQ(o.display->take_log(), (Lines{"annotation removed KG_Mark"}));
  row->remove_annotation(1, 5);
  row->remove_annotation(1, 5);
  EXPECT_EQ(o.display->take_log(), (Lines{"annotation removed KG_Other"}));

  // Making a row a leaf takes its glyph away, making it expandable brings it back.
  QR_OutlineText* dir = o.add_with_children(o.root.get(), "dir", "f", 1);
  EXPECT_EQ(o.screen()[2], ">  dir");
  dir->make_leaf();
  EXPECT_EQ(o.screen()[2], "   dir");
  EXPECT_FALSE(dir->has_action(QR_OutlineExpand));
  dir->expand();
  EXPECT_FALSE(dir->is_expanded());
  dir->make_expandable();
  EXPECT_EQ(o.screen()[2], ">  dir");
}

TEST(Family, ATreeCannotBeMadeIntoALoopAndAMovedRowLeavesItsOldParent) {
  Outline o;
  QR_OutlineText* a = o.add(o.root.get(), "a", true);
  QR_OutlineText* b = o.add(a, "b", true);
  EXPECT_FALSE(b->add_child(a));
  EXPECT_FALSE(a->add_child(a));
  EXPECT_FALSE(a->add_child(nullptr));
  EXPECT_FALSE(o.root->remove_child(b));
  a->expand();
  o.root->add_child(b);
  EXPECT_EQ(a->child_count(), 0u);
  EXPECT_EQ(b->parent(), o.root.get());
  EXPECT_EQ(o.screen(), (Lines{"v  a", ">  b"}));
  EXPECT_EQ(b->depth(), 0u);
  expectConsistent(o);
}

TEST(Family, AnOutlineWithoutADisplayStillNumbersItsRowsAndMovesTheSelection) {
  QR_OutlineRoot root(nullptr);
  auto* dir = new QR_OutlineText("dir");
  dir->make_expandable();
  for (const char* n : {"a", "b"}) {
    auto* f = new QR_OutlineText(n);
    f->make_selectable();
    dir->add_child(f);
  }
  root.add_child(dir);
  dir->select();
  EXPECT_TRUE(root.perform_action("QR_OutlineExpand", nullptr));
  EXPECT_EQ(root.total_lines(), 3u);
  EXPECT_EQ(root.object_at_line(2), dir->child_row(1));
  root.perform_action(QR_OutlineLast, nullptr);
  EXPECT_EQ(root.selected(0), dir->child_row(1));
}
