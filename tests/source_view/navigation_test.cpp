// Moving about a source by its unused lines and its text, without a window.
#include <gtest/gtest.h>

#include "coverage/cvg_adjust.h"
#include "source_view/kg_navigation.h"

namespace {

// Lines written as letters: 'n' unused code, 'u' used code, '.' no code, 'd' unused dead code,
// 't' unused tested code; a '[' before a letter starts a function there, a ']' after it ends one.
std::vector<LineState> lines(const std::string& picture) {
  std::vector<LineState> out;
  for (std::size_t i = 0; i < picture.size(); ++i) {
    const char c = picture[i];
    if (c == '[') continue;
    if (c == ']') {
      out.back().flags |= LineFuncEnd;
      continue;
    }
    LineState s;
    if (i > 0 && picture[i - 1] == '[') s.flags |= LineFuncStart;
    switch (c) {
      case 'n': s.flags |= LineHasCode; break;
      case 'u': s.flags |= LineHasCode, s.count = 3; break;
      case 'd': s.flags |= LineHasCode | adjLineDead; break;
      case 't': s.flags |= LineHasCode | adjRangeTested; break;
      default: break;
    }
    out.push_back(s);
  }
  return out;
}

}  // namespace

TEST(UnusedRuns, TheRulesOfARunAtALine) {
  const LineState blank = lines(".")[0], dead = lines("d")[0], used = lines("u")[0], unused = lines("n")[0];
  const LineState start = lines("[n")[0], tested = lines("t")[0];
  struct Case {
    const LineState* s;
    std::uint32_t mask;
    bool stopAfterCodeless;
    bool continues;
  } cases[] = {
      {&blank, LineFuncStart, false, true},  {&blank, LineFuncStart, true, false},
      {&dead, LineFuncStart, false, true},   {&dead, LineFuncStart, true, false},
      {&start, LineFuncStart, false, false}, {&start, LineFuncEnd, false, true},
      {&used, LineFuncStart, false, false},  {&unused, LineFuncEnd, true, true},
      {&tested, LineFuncStart, false, false},
  };
  for (const Case& c : cases)
    EXPECT_EQ(kgRunContinues(*c.s, c.mask, c.stopAfterCodeless), c.continues)
        << "flags " << c.s->flags << " mask " << c.mask << " stop " << c.stopAfterCodeless;
  EXPECT_TRUE(kgUnusedLine(unused));
  EXPECT_FALSE(kgUnusedLine(dead));
  EXPECT_FALSE(kgUnusedLine(tested));
  EXPECT_FALSE(kgUnusedLine(blank));
}

TEST(UnusedRuns, NextAndPreviousSkipTheRunTheyStartIn) {
  // Lines 1-8 the first function, 9-11 the second.
  const auto s = lines("[unn..nnu][nnu]");
  // From line 2, in a run that goes on over two lines without code to line 7: the next unused
  // line is the first of the next function, whose start ends any run.
  EXPECT_EQ(kgNextUnused(s, 2, 100, false), 9u);
  // Stopping after codeless regions, the run ends at line 4.
  EXPECT_EQ(kgNextUnused(s, 2, 100, true), 6u);
  // From a used line the search starts right there; from nothing, at line 1.
  EXPECT_EQ(kgNextUnused(s, 1, 100, false), 2u);
  EXPECT_EQ(kgNextUnused(s, 0, 100, false), 2u);
  EXPECT_EQ(kgNextUnused(s, 10, 100, false), 0u);
  EXPECT_EQ(kgNextUnused(s, 9, 100, false), 0u);
  EXPECT_EQ(kgNextUnused(s, 12, 100, false), 0u);
  // Only lines that are shown count.
  EXPECT_EQ(kgNextUnused(s, 2, 8, false), 0u);
  // Backwards: from the second function's run to the first function's last unused line; from
  // a used line, the nearest unused one above.
  EXPECT_EQ(kgPreviousUnused(s, 10, false), 7u);
  EXPECT_EQ(kgPreviousUnused(s, 9, false), 7u);
  EXPECT_EQ(kgPreviousUnused(s, 11, false), 10u);
  EXPECT_EQ(kgPreviousUnused(s, 3, false), 0u);
  EXPECT_EQ(kgPreviousUnused(s, 99, false), 10u);
  EXPECT_EQ(kgPreviousUnused(s, 0, false), 0u);
  // Dead code inside a run does not break it, unless runs stop after codeless regions.
  const auto d = lines("[nndnun]");
  EXPECT_EQ(kgNextUnused(d, 1, 100, false), 6u);
  EXPECT_EQ(kgNextUnused(d, 1, 100, true), 4u);
}

TEST(FindText, PatternsBlanksAndTheEnd) {
  struct Case {
    const char* text;
    const char* line;
    bool matches;
  } cases[] = {
      {"return", "  return x * 2;", true},
      {"Return", "  return x * 2;", false},
      {"x*2", "  return x * 2;", true},
      {"x 2", "  return x*2;", false},  // the text's blank goes, the line's "*" stays
      {"x2", "  return x  2;", true},   // the line's blanks are skipped
      {"x2", "  return x * 2;", false},
      {"ret?rn", "  return x;", true},
      {"ret?rn", "  retrn x;", false},
      {"abc;def", "  abc only", true},
      {"*", "", true},
      {"", "anything", true},
      {"zz", "", false},
      {"a?c", "a c", true},
      {"if(x", "  if (x > 100)", true},
  };
  for (const Case& c : cases)
    EXPECT_EQ(kgFindMatches(c.text, c.line), c.matches) << c.text << " in \"" << c.line << "\"";
  // Two letters with a blank between them find the two side by side.
  EXPECT_TRUE(kgFindMatches("r e", "  stderr end"));
  EXPECT_TRUE(kgFindMatches("r e", "  re"));
}

TEST(MovingKeys, PagesAndLines) {
  EXPECT_EQ(kgPageUpTarget({30, 25}), 5u);
  EXPECT_EQ(kgPageUpTarget({10, 25}), 1u);
  EXPECT_EQ(kgPageDownTarget({1, 25}), 27u);
  EXPECT_EQ(kgLineUpTarget(1), 1u);
  EXPECT_EQ(kgLineUpTarget(26), 25u);
  EXPECT_EQ(kgLineDownTarget(0), 1u);
}
