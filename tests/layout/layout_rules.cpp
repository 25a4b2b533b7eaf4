// The layout rules: floors from the folder names, includes read from the files themselves.
#include "tests/layout/layout_rules.h"

#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <set>

namespace fs = std::filesystem;

namespace kglayout {

namespace {

// Bottom to top. The outline folder holds two floors: its object half and, in the files
// named qr_oi_*, its display half on the toolkit.
const char* const kFloors[] = {
    "support/",  "outline/ object half", "settings/",    "coverage/",   "adjust/",   "toolkit/",
    "outline/ display half", "summary/", "source_view/", "updates/",    "startup/",  "tools/",
};
constexpr int kFloorCount = sizeof kFloors / sizeof kFloors[0];
constexpr int kOutlineObject = 1;
constexpr int kOutlineDisplay = 6;

// Folders outside the floors: they may include anything.
const char* const kOutside[] = {"tests", "fuzz", "bench", "build", "docs", "data", ".ci"};

struct Include {
  std::string target;  // as written between the quotes or brackets
  bool system;         // <...>
};

std::vector<Include> includesOf(const fs::path& file) {
  static const std::regex line(R"(^\s*#\s*include\s*([<"])([^>"]+)[>"])");
  std::vector<Include> out;
  std::ifstream in(file);
  std::string text;
  std::smatch m;
  while (std::getline(in, text)) {
    if (std::regex_search(text, m, line)) out.push_back({m[2].str(), m[1].str() == "<"});
  }
  return out;
}

std::string folderOf(const std::string& relative) {
  const std::size_t slash = relative.find('/');
  return slash == std::string::npos ? std::string() : relative.substr(0, slash);
}

bool outside(const std::string& folder) {
  for (const char* o : kOutside)
    if (folder == o) return true;
  // Build trees ("build", "build-asan", ...) and hidden folders are not sources.
  return folder.empty() || folder[0] == '.' || folder.rfind("build", 0) == 0;
}

// An X, Motif, Xft or font header.
bool windowSystemHeader(const std::string& h) {
  return h.rfind("X11/", 0) == 0 || h.rfind("Xm/", 0) == 0 || h.rfind("ft2build", 0) == 0 ||
         h.rfind("fontconfig/", 0) == 0 || h.rfind("freetype", 0) == 0;
}

bool toolkitFile(const std::string& relative) {
  const int f = floorOf(relative);
  return f == floorOf("toolkit/x.h") || f == kOutlineDisplay;
}

}  // namespace

int floorOf(const std::string& relative) {
  const std::string folder = folderOf(relative);
  if (folder == "outline") {
    const std::string base = relative.substr(relative.rfind('/') + 1);
    return base.rfind("qr_oi_", 0) == 0 ? kOutlineDisplay : kOutlineObject;
  }
  for (int i = 0; i < kFloorCount; ++i)
    if (folder + "/" == kFloors[i]) return i;
  return -1;
}

std::string floorName(int floor) {
  return floor >= 0 && floor < kFloorCount ? kFloors[floor] : "(no floor)";
}

std::vector<std::string> layoutViolations(const std::string& root,
                                          const std::vector<std::string>& engineSources) {
  std::vector<std::string> out;
  std::map<std::string, std::vector<Include>> files;  // every project source, by relative path
  std::set<std::string> unplaced;
  for (auto it = fs::recursive_directory_iterator(root); it != fs::recursive_directory_iterator(); ++it) {
    const std::string relative = fs::relative(it->path(), root).generic_string();
    if (it->is_directory()) {
      if (it.depth() == 0 && outside(relative)) it.disable_recursion_pending();
      continue;
    }
    const std::string ext = it->path().extension().string();
    if (ext != ".cpp" && ext != ".h" && ext != ".inc") continue;
    const std::string folder = folderOf(relative);
    if (outside(folder)) continue;
    if (floorOf(relative) < 0) {
      unplaced.insert(folder);
      continue;
    }
    files[relative] = includesOf(it->path());
  }
  for (const std::string& folder : unplaced)
    out.push_back("folder " + folder + "/ has no floor: place it in tests/layout/layout_rules.cpp and docs/ARCHITECTURE.md");

  // Includes point down or sideways within a floor.
  for (const auto& [file, includes] : files) {
    const int mine = floorOf(file);
    for (const Include& inc : includes) {
      if (inc.system) continue;
      if (folderOf(inc.target).empty()) {
        out.push_back(file + " includes \"" + inc.target + "\" without its folder");
        continue;
      }
      if (outside(folderOf(inc.target))) continue;
      const int theirs = floorOf(inc.target);
      if (theirs > mine) {
        out.push_back(file + " (" + floorName(mine) + ") includes " + inc.target + " (" +
                      floorName(theirs) + "), a floor above it");
      }
    }
  }

  // What the engine library reaches, header by header.
  for (const std::string& source : engineSources) {
    std::vector<std::string> chain{source};
    std::set<std::string> seen{source};
    std::vector<std::vector<std::string>> work{chain};
    while (!work.empty()) {
      std::vector<std::string> path = std::move(work.back());
      work.pop_back();
      const std::string& file = path.back();
      auto found = files.find(file);
      if (found == files.end()) continue;
      auto via = [&] {
        std::string text;
        for (std::size_t i = 0; i + 1 < path.size(); ++i) text += path[i] + " -> ";
        return text + file;
      };
      if (toolkitFile(file)) {
        out.push_back("engine source " + source + " reaches the window code: " + via());
        continue;
      }
      const int floor = floorOf(file);
      const bool xrmAllowed = floor == floorOf("settings/x.h") || floor == kOutlineObject;
      for (const Include& inc : found->second) {
        if (inc.system) {
          if (windowSystemHeader(inc.target) && !(xrmAllowed && inc.target == "X11/Xresource.h"))
            out.push_back("engine source " + source + " reaches <" + inc.target + ">: " + via());
          continue;
        }
        if (seen.insert(inc.target).second) {
          std::vector<std::string> next = path;
          next.push_back(inc.target);
          work.push_back(std::move(next));
        }
      }
    }
  }
  return out;
}

}  // namespace kglayout
