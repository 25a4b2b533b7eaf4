// File references and the resolution of their paths.
#include "coverage/kgv_file_ref.h"

#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>

#include "support/runtime_options.h"

namespace {

constexpr size_t kPathLimit = 4096;

void bound(std::string& s) {
  if (s.size() >= kPathLimit) s.resize(kPathLimit - 1);
}

bool realPathOf(const std::string& path, std::string& out) {
  char buf[PATH_MAX];
  if (!realpath(path.c_str(), buf)) return false;
  out = buf;
  return true;
}

std::string currentDirectory() {
  char buf[PATH_MAX];
  if (!getcwd(buf, sizeof buf)) return "/";
  return buf;
}

bool replaceFirst(std::string& s, const std::string& from, const std::string& to) {
  size_t pos = s.find(from);
  if (pos == std::string::npos) return false;
  s.replace(pos, from.size(), to);
  return true;
}

// One ".." step: the first "/../" or a trailing "/..", after any leading run of '.' and '/'.
bool resolveDotDot(std::string& s, int& steps) {
  size_t skip = s.find_first_not_of("./");
  if (skip == std::string::npos) return false;
  size_t pos = s.find("/../", skip);
  size_t len = 4;
  if (pos == std::string::npos) {
    if (s.size() >= 3 && s.size() - 3 >= skip && s.compare(s.size() - 3, 3, "/..") == 0) {
      pos = s.size() - 3;
      len = 3;
    } else {
      return false;
    }
  }
  // Following symbolic links could go round for ever; after 50 steps the rest of the ".."
  // steps are taken on the text alone, which always ends. (A path from a data or
  // adjustments file may hold any number of them: no reason to stop the program.)
  const bool followLinks = ++steps <= 50;
  std::string before = s.substr(0, pos);
  std::string after = s.substr(pos + len);  // after "/../" or nothing
  std::string real;
  if (followLinks && !before.empty() && realPathOf(before, real) && real != before) {
    // A symbolic link was involved: ".." is relative to where it really leads.
    s = real + s.substr(pos);
    bound(s);
    return true;
  }
  size_t slash = before.find_last_of('/');
  std::string parent = slash == std::string::npos ? std::string() : before.substr(0, slash);
  s = len == 4 ? parent + "/" + after : (parent.empty() ? "/" : parent);
  bound(s);
  return true;
}

}  // namespace

std::string normalizePath(const std::string& path) {
  std::string s = path;
  if (s.empty() || s[0] != '/') {
    while (s.compare(0, 2, "./") == 0) s.erase(0, 2);
    s = currentDirectory() + "/" + s;
  }
  bound(s);
  int steps = 0;
  for (;;) {
    if (replaceFirst(s, "//", "/")) continue;
    if (s.compare(0, 2, "./") == 0) {
      s.erase(0, 2);
      continue;
    }
    if (replaceFirst(s, "/./", "/")) continue;
    if (s.size() >= 2 && s.compare(s.size() - 2, 2, "/.") == 0) {
      s.erase(s.size() - 2);
      continue;
    }
    if (resolveDotDot(s, steps)) continue;
    break;
  }
  if (s.empty()) s = "/";
  return s;
}

std::string resolveFilePath(const std::string& path) {
  std::string resolved;
  if (path.empty() || !realPathOf(path, resolved)) resolved = normalizePath(path);
  bound(resolved);
  return translateAutoMountPath(resolved.c_str());
}

KgvFileRef makeKgvFileRef(const std::string& path) {
  KgvFileRef ref;
  ref.givenName = path;
  ref.resolvedName = resolveFilePath(path);
  return ref;
}

KgvFileRef makeKgvFileRef(const std::string& givenName, const std::string& resolvedName) {
  KgvFileRef ref;
  ref.givenName = givenName;
  ref.resolvedName = resolvedName;
  return ref;
}

int findKgvFileRef(const std::vector<KgvFileRef>& list, const std::string& resolvedName) {
  for (size_t i = 0; i < list.size(); ++i)
    if (list[i].resolvedName == resolvedName) return static_cast<int>(i);
  return -1;
}
