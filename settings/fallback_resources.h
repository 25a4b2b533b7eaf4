// The built-in resource lines that sit below every resource file.
#pragma once

#include <string>
#include <vector>

// The viewer's own fallback lines (accelerators, translations, glyph looks, help file).
const std::vector<std::string>& viewerFallbackLines();
// The outline library's fallback lines, including any the library registered.
const std::vector<std::string>& outlineFallbackLines();
// Lets the outline library add lines before the database is built.
void registerOutlineFallbackLine(const std::string& line);
