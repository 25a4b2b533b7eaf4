// Helpers for the settings tests: databases made from resource text, and resource lines.
#pragma once

#include <X11/Xresource.h>

#include <cstdio>
#include <string>
#include <vector>

#include "settings/kg_resource.h"
#include "settings/resource_table.h"

namespace kgtest {

// A database holding the given resource-file text; destroyed with the object.
class TextDatabase {
 public:
  explicit TextDatabase(const std::string& text) {
    XrmInitialize();
    db_ = XrmGetStringDatabase(text.c_str());
  }
  ~TextDatabase() {
    if (db_) XrmDestroyDatabase(db_);
  }
  TextDatabase(const TextDatabase&) = delete;
  TextDatabase& operator=(const TextDatabase&) = delete;
  XrmDatabase db() const { return db_; }
  ResourceSource source() { return ResourceSource{db_, &warnings}; }

  std::vector<std::string> warnings;

 private:
  XrmDatabase db_ = nullptr;
};

// The settings table as a user's resource text makes it.
inline KG_Settings& settingsFrom(TextDatabase& d) { return buildSettings(d.source()); }

// What a resource writes.
inline std::string written(const KG_Resource& r) {
  char* buf = nullptr;
  size_t len = 0;
  FILE* f = open_memstream(&buf, &len);
  r.writeTo(f);
  fclose(f);
  std::string s(buf, len);
  free(buf);
  return s;
}

inline std::string writtenAll(bool includeAll) {
  char* buf = nullptr;
  size_t len = 0;
  FILE* f = open_memstream(&buf, &len);
  writeAllResources(f, includeAll);
  fclose(f);
  std::string s(buf, len);
  free(buf);
  return s;
}

// The resource names of the lines of a resource file ("Kestrelgauge*NAME: ...").
inline std::vector<std::string> namesOfLines(const std::string& text) {
  std::vector<std::string> names;
  size_t start = 0;
  while (start < text.size()) {
    size_t nl = text.find('\n', start);
    if (nl == std::string::npos) nl = text.size();
    std::string line = text.substr(start, nl - start);
    size_t star = line.find('*');
    size_t colon = line.find(':');
    if (line.rfind("Kestrelgauge*", 0) == 0 && colon != std::string::npos)
      names.push_back(line.substr(star + 1, colon - star - 1));
    start = nl + 1;
  }
  return names;
}

}  // namespace kgtest
