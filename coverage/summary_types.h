// The records of the summary tree: overall totals, directories, files and functions, each
// with the nine line and block counts. The tree is built from loaded data elsewhere.
#pragma once

#include <cstdint>
#include <vector>

#include "coverage/cvg_adjust.h"
#include "coverage/kgv_data.h"
#include "coverage/line_state.h"
#include "coverage/line_states.h"

struct SumCounts {
  std::uint32_t lines = 0;           // lines with code
  std::uint32_t unusedLines = 0;     // lines with code and no hits
  std::uint32_t blocks = 0;
  std::uint32_t unusedBlocks = 0;
  std::uint32_t deadLines = 0;       // unused lines whose dominant adjustment is dead code
  std::uint32_t testedLines = 0;
  std::uint32_t inspectedLines = 0;
  std::uint32_t adjLines = 0;        // lines that count for adjusted coverage
  std::uint32_t adjUnusedLines = 0;  // of those, the ones still unused after adjustments

  std::uint32_t usedLines() const { return lines - unusedLines; }
  std::uint32_t adjUsedLines() const { return adjLines - adjUnusedLines; }
  std::uint32_t usedBlocks() const { return blocks - unusedBlocks; }
  SumCounts& operator+=(const SumCounts& o);
};

// How an unused line counts under its dominant adjustment kind (0: none): without one it
// counts for adjusted coverage and as adjusted-unused; dead code leaves adjusted coverage;
// tested and inspected lines count for it as used. Adds the line's share to the counts.
void countUnusedLine(SumCounts& c, CvgAdjust dominantKind);
// An unused line's adjustment changes from one kind (0: none) to another: the counts move
// by the difference of the two shares, none of them below 0 whatever order changes come in.
void moveUnusedLine(SumCounts& c, CvgAdjust from, CvgAdjust to);

struct SumDir;
struct SumFile;

struct SumFunc {
  const char* name = "";  // in the record's string area
  std::uint32_t nativeIndex = 0;  // map position of its TagFunction entry
  SumCounts counts;
  std::uint32_t viewState = 0;
  std::uint16_t calls = 0;
  bool allDead = false;
  std::uint32_t firstMapIndex = 0;
  std::uint32_t lastMapIndex = 0;
  std::uint32_t firstLine = 0;
  std::uint32_t lastLine = 0;
};

struct SumFile {
  const char* name = "";  // base name, in the directory's fileNames
  std::uint32_t nativeIndex = 0;
  SumCounts counts;
  std::uint32_t viewState = 0;
  std::uint16_t sessions = 0;
  std::uint32_t funcs = 0;
  std::uint32_t unusedFuncs = 0;
  std::uint32_t deadFuncs = 0;
  std::uint32_t firstTime = 0;
  std::uint32_t lastTime = 0;
  std::vector<SumFunc> functions;
  std::vector<SumFunc*> funcOrder;
  ObjRecord* record = nullptr;  // not owned
  SumDir* dir = nullptr;
  std::uint32_t lineCount = 0;
  LineStates lineStates;  // index 0 = line 1; empty until built
};

struct SumDir {
  const char* name = "";  // directory part with the final "/", in the root's dirNames
  std::uint32_t nativeIndex = 0;
  SumCounts counts;
  std::uint32_t viewState = 0;
  std::uint32_t funcs = 0;
  std::uint32_t unusedFuncs = 0;
  std::uint32_t deadFuncs = 0;
  std::uint32_t files = 0;
  std::uint32_t firstTime = 0;
  std::uint32_t lastTime = 0;
  std::vector<SumFile> fileRecords;
  std::vector<SumFile*> fileOrder;
  std::vector<char> fileNames;
};

struct SumRoot {
  std::uint32_t nativeIndex = 0;
  SumCounts counts;
  std::uint32_t viewState = 0;
  std::uint32_t funcs = 0;
  std::uint32_t unusedFuncs = 0;
  std::uint32_t deadFuncs = 0;
  std::uint32_t files = 0;
  std::uint32_t dirs = 0;
  std::uint32_t firstTime = 0;
  std::uint32_t lastTime = 0;
  std::vector<SumDir> dirRecords;
  std::vector<SumDir*> dirOrder;
  std::vector<char> dirNames;
  std::uint32_t sortOrder = 1;
  std::uint32_t hitsPolicy = 1;
  // Whether every file's line states were made with the counts (else they are made when
  // a file is shown, see LazyLineStates); a recount does as the build did.
  bool lineStatesKept = true;
};

// Directory name used for paths without "/".
constexpr const char* kNoDirectoryName = "**no_directory_provided**/";
