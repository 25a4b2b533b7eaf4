// Shared by the coverage tests: data files made from descriptions, and reading them back.
#pragma once

#include <dirent.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include <memory>
#include <string>

#include "coverage/kgv_file.h"
#include "tests/common/test_support.h"
#include "tools/kgv_maker.h"

namespace kgtest {

inline std::string makeKgv(const TempDir& dir, const std::string& name, const std::string& text) {
  std::string path = dir.file(name);
  std::string error;
  EXPECT_TRUE(makeKgvFile(text, path, error)) << error;
  return path;
}

inline std::unique_ptr<KgvData> readOk(const std::string& path) {
  std::unique_ptr<KgvData> d;
  ErrorCode rc = readKgvFile(path, d);
  EXPECT_EQ(rc, allOK) << errorMessage(rc);
  return d;
}

inline ErrorCode readCode(const std::string& path) {
  std::unique_ptr<KgvData> d;
  ErrorCode rc = readKgvFile(path, d);
  EXPECT_EQ(rc == allOK, d != nullptr);
  return rc;
}

// "tag:value:count" for every map entry, names spelled out, for readable comparisons.
inline std::string describeMap(const ObjRecord& r) {
  std::string s;
  for (size_t i = 0; i < r.map.size(); ++i) {
    std::uint32_t tag = mapTag(r.map[i]);
    std::string v = (tag == TagFile || tag == TagFunction) ? std::string(r.nameAt(mapValue(r.map[i])))
                                                           : std::to_string(mapValue(r.map[i]));
    static const char* names[] = {"E", "?1", "F", "fn", "fl", "?5", "b", "bl"};
    s += (tag < 8 ? names[tag] : "?") + std::string(":") + v + ":" + std::to_string(r.counts[i]) + " ";
  }
  return s;
}

// The names in a directory, without "." and "..", sorted.
inline std::vector<std::string> filesIn(const std::string& dir) {
  std::vector<std::string> names;
  if (DIR* d = opendir(dir.c_str())) {
    while (dirent* e = readdir(d))
      if (std::strcmp(e->d_name, ".") && std::strcmp(e->d_name, "..")) names.push_back(e->d_name);
    closedir(d);
  }
  std::sort(names.begin(), names.end());
  return names;
}

}  // namespace kgtest
