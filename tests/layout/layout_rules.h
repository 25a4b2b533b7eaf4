// The rules of the source layout: which folder may include which, and which headers the
// engine library may reach. Checked over the real tree and over small made-up trees.
#pragma once

#include <string>
#include <vector>

namespace kglayout {

// The floor of a project file, from its path relative to the source root ("coverage/x.h",
// "outline/qr_oi_y.cpp"); -1 when its folder has none (tests, fuzz targets and benchmarks
// stand outside the floors).
int floorOf(const std::string& relativePath);
// The name of a floor, for messages ("coverage/", "outline/ display half").
std::string floorName(int floor);

// Every violation in the tree under `root`, one line each:
// - a project file that includes a file of a higher floor;
// - a file reached from an engine library source (`engineSources`, relative paths) that is
//   a toolkit or display-half header, or that includes an X, Motif or Xft header other than
//   <X11/Xresource.h> from settings/ or the outline's object half;
// - a project folder that has no floor.
std::vector<std::string> layoutViolations(const std::string& root,
                                          const std::vector<std::string>& engineSources);

}  // namespace kglayout
