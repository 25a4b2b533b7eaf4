// Long random sessions of expanding, hiding, adding, moving and removing rows: after every step
// the display must show exactly what the tree says, and the line map must agree with it.
#include <random>

#include "tests/outline/outline_support.h"

namespace {

void render(QR_OutlineObject* row, std::uint32_t depth, std::vector<std::string>& out) {
  for (std::uint32_t i = 0; i < row->line_count(); ++i) {
    const char* t = row->line_text(i);
    std::string line = std::string(3 * depth + 3, ' ') + (t ? t : "");
    if (i == 0) {
      if (QR_OutlineAnnotation* a = row->annotation_at(0, 0)) {
        const std::string n = a->name_text();
        line[3 * depth] = n.rfind("QR_OutlineExpand", 0) == 0 ? '>' : n.rfind("QR_OutlineCollapse", 0) == 0 ? 'v' : '?';
      }
    }
    out.push_back(line);
  }
  if (row->is_expanded()) {
    for (std::uint32_t i = 0; i < row->child_count(); ++i) render(row->child_row(i), depth + 1, out);
  }
}

std::vector<std::string> expectedScreen(QR_OutlineRoot& root) {
  std::vector<std::string> out;
  for (std::uint32_t i = 0; i < root.child_count(); ++i) render(root.child_row(i), 0, out);
  return out;
}

void collect(QR_OutlineObject* row, std::vector<QR_OutlineObject*>& out) {
  out.push_back(row);
  for (std::uint32_t i = 0; i < row->child_count(); ++i) collect(row->child_row(i), out);
}

void runSession(unsigned seed, int steps, bool auto_select) {
  Outline o(6);
  o.root->set_auto_select(auto_select);
  std::mt19937 rng(seed);
  auto pick = [&](int n) { return static_cast<int>(rng() % static_cast<unsigned>(n)); };
  int made = 0;
  auto fresh = [&]() {
    auto* r = new QR_OutlineText(("row" + std::to_string(++made)).c_str());
    if (pick(2) == 0) {
      r->make_expandable();
    } else {
      r->make_selectable();
    }
    return r;
  };
  for (int i = 0; i < 6; ++i) o.root->add_child(fresh());

  for (int step = 0; step < steps; ++step) {
    std::vector<QR_OutlineObject*> rows;
    collect(o.root.get(), rows);
    QR_OutlineObject* r = rows[pick(static_cast<int>(rows.size()))];
    auto* text = dynamic_cast<QR_OutlineText*>(r);
    const int op = pick(16);
    std::string what = "step " + std::to_string(step) + " op " + std::to_string(op) + " on " + RecordingDisplay::name(r);
    switch (op) {
      case 0: r->expand(); break;
      case 1: r->collapse(); break;
      case 2: r->expand_all(); break;
      case 3: r->collapse_all(); break;
      case 4: if (r != o.root.get()) r->hide(); break;
      case 5: r->show(); break;
      case 6: if (text) text->append_line("more"); break;
      case 7:
      case 8: r->add_child(fresh()); break;
      case 9: r->insert_child(fresh(), static_cast<std::uint32_t>(pick(3))); break;
      case 10:
        if (r != o.root.get()) {
          r->parent()->remove_child(r);
          delete r;
        }
        break;
      case 11: {
        // Move the row under another one (loops are refused).
        QR_OutlineObject* to = rows[pick(static_cast<int>(rows.size()))];
        if (r != o.root.get()) to->add_child(r);
        break;
      }
      case 12: r->select(); break;
      case 13: {
        static const char* moves[] = {QR_OutlineNext, QR_OutlinePrevious, QR_OutlineNextSameLevel,
                                      QR_OutlinePreviousSameLevel, QR_OutlineFirst, QR_OutlineLast,
                                      QR_OutlineExpandCollapse, QR_OutlineCollapseChildren};
        o.act(moves[pick(8)]);
        break;
      }
      case 14: {
        // Several changes inside one update bracket.
        const bool was = o.root->hold_updates();
        r->expand();
        r->add_child(fresh());
        r->collapse_children();
        o.root->add_child(fresh());
        o.root->release_updates(was);
        break;
      }
      case 15: if (r != o.root.get()) o.root->add_to_selection(r); break;
    }
    SCOPED_TRACE(what);
    ASSERT_EQ(o.screen(), expectedScreen(*o.root));
    expectConsistent(o);
    if (::testing::Test::HasFailure()) return;
    for (std::uint32_t i = 0; i < o.root->selection_count(); ++i) {
      QR_OutlineObject* s = o.root->selected(i);
      ASSERT_EQ(s->root(), o.root.get());
      ASSERT_TRUE(s->is_selected());
      if (i > 0) {
        ASSERT_LE(o.root->selected(i - 1)->first_line(), s->first_line());
      }
    }
  }
}

}  // namespace

TEST(RandomSessions, TheDisplayAlwaysShowsWhatTheTreeHolds) {
  for (unsigned seed = 1; seed <= 20; ++seed) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    runSession(seed, 500, seed % 2 == 0);
    if (HasFailure()) return;
  }
}
