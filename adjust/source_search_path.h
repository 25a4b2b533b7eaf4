// The ordered list of directories searched for source files that are not where the
// coverage data says they are.
#pragma once

#include <string>
#include <vector>

// The process-wide list, in search order.
std::vector<std::string>& sourceSearchPath();

// At start: the directories of the userpath option (separated by ':'), then ".".
void initSourceSearchPath(const std::string* userpath);

// Adds a directory once (a second addition of the same text is ignored).
void addSourceSearchDirectory(const std::string& dir);

// The first directory holding a file of this base name; false when none does.
bool findInSourceSearchPath(const std::string& baseName, std::string& path);
