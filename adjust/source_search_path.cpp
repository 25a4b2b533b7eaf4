// Source search path: userpath directories first, then the current directory, then the
// directories of files the user pointed at.
#include "adjust/source_search_path.h"

#include <sys/stat.h>

#include <algorithm>

std::vector<std::string>& sourceSearchPath() {
  static std::vector<std::string> path;
  return path;
}

void addSourceSearchDirectory(const std::string& dir) {
  if (dir.empty()) return;
  std::vector<std::string>& p = sourceSearchPath();
  if (std::find(p.begin(), p.end(), dir) == p.end()) p.push_back(dir);
}

void initSourceSearchPath(const std::string* userpath) {
  if (userpath) {
    size_t start = 0;
    while (start <= userpath->size()) {
      size_t colon = userpath->find(':', start);
      if (colon == std::string::npos) colon = userpath->size();
      addSourceSearchDirectory(userpath->substr(start, colon - start));
      start = colon + 1;
    }
  }
  addSourceSearchDirectory(".");
}

bool findInSourceSearchPath(const std::string& baseName, std::string& path) {
  if (baseName.empty()) return false;
  for (const std::string& dir : sourceSearchPath()) {
    std::string candidate = dir.back() == '/' ? dir + baseName : dir + "/" + baseName;
    struct stat st;
    if (stat(candidate.c_str(), &st) == 0) {
      path = candidate;
      return true;
    }
  }
  return false;
}
