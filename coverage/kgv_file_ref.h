// A named file: the name the user gave and its resolved path. Used for the data files of
// the command line and for the per-source-file entries of the adjustments.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

struct KgvFileRef {
  std::string givenName;
  std::string resolvedName;
  std::uint32_t loadTime = 0;  // seconds since 1970 of the last successful read; 0 before
  void* payload = nullptr;     // owned by the user of the reference
};

// The real path with symbolic links resolved; when that fails, the path made absolute and
// normalised; in both cases then passed through the automount translation.
std::string resolveFilePath(const std::string& path);

// Absolute, normalised form of a path that need not exist ("//", "./", "/./", "/." and
// "/.." steps), with ".." resolved against the real path of what precedes it.
std::string normalizePath(const std::string& path);

KgvFileRef makeKgvFileRef(const std::string& path);
KgvFileRef makeKgvFileRef(const std::string& givenName, const std::string& resolvedName);

// Index of the first entry whose resolvedName equals the name (byte comparison), or -1.
int findKgvFileRef(const std::vector<KgvFileRef>& list, const std::string& resolvedName);
