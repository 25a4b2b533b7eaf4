// Moving about a source file by its coverage and its text: the unused lines and their runs,
// the find pattern, and where the paging and line keys go. No window here: the annotated source
// window asks these with its lines and its view.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "coverage/line_state.h"

// An unused line: a code line with no hits and no adjustment at all.
bool kgUnusedLine(const LineState& s);

// Whether a run of unused lines goes on at this line, walking up (`mask` LineFuncEnd) or down
// (LineFuncStart): lines without code and unused dead code continue it unless runs stop after
// codeless regions; a line with the mask's flag ends it; any other line continues it exactly
// when it is unused.
bool kgRunContinues(const LineState& s, std::uint32_t mask, bool stopAfterCodeless);

// The next and previous unused line from the reference line (1-based; the window's "above"
// reference for next, "below" for previous); 0 when there is none, which the window says.
// `textLines` limits the downward search to lines that are shown.
std::uint32_t kgNextUnused(const std::vector<LineState>& states, std::uint32_t reference, std::uint32_t textLines,
                           bool stopAfterCodeless);
std::uint32_t kgPreviousUnused(const std::vector<LineState>& states, std::uint32_t reference,
                               bool stopAfterCodeless);

// Whether a line matches the find text: the text stands anywhere in the line ("*" any run of
// characters, "?" any one, every other character itself, case counting); blanks and tabs of the
// text are left out and those of the line skipped where the text does not ask for them; ";"
// ends the text.
bool kgFindMatches(std::string_view text, std::string_view line);

// Where the window's keys go, from the top line of the view (1-based) and its height.
struct KG_View {
  std::uint32_t first = 1;
  std::uint32_t visible = 1;
};
std::uint32_t kgPageUpTarget(const KG_View& v);
std::uint32_t kgPageDownTarget(const KG_View& v);
// From the reference lines "below" and "above".
std::uint32_t kgLineUpTarget(std::uint32_t below);
std::uint32_t kgLineDownTarget(std::uint32_t above);
