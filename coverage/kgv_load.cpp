// Loading files under their locks and merging them into one accumulated body.
#include "coverage/kgv_load.h"

#include <ctime>
#include <new>

#include "coverage/kgv_file.h"
#include "coverage/kgv_lock.h"
#include "coverage/kgv_merge.h"

namespace {
bool g_isJava = false;
}

bool kgvIsJava() { return g_isJava; }
void setKgvIsJava(bool isJava) { g_isJava = isJava; }

namespace {

ErrorCode loadWithBuffer(KgvFileRef& ref, std::unique_ptr<KgvData>& out, KgvReadBuffer* buffer) {
  out.reset();
  ErrorCode rc = lockKgvFile(ref.givenName);
  if (rc != allOK) return rc;
  try {
    rc = readKgvFile(ref.givenName, out, buffer);
  } catch (const std::bad_alloc&) {
    out.reset();
    rc = outOfMemory;
  }
  ErrorCode unlocked = unlockKgvFile(ref.givenName);
  if (rc == allOK && unlocked != allOK) {
    out.reset();
    rc = unlocked;
  }
  if (rc == allOK) ref.loadTime = static_cast<std::uint32_t>(time(nullptr));
  return rc;
}

}  // namespace

ErrorCode loadKgvFile(KgvFileRef& ref, std::unique_ptr<KgvData>& out) {
  return loadWithBuffer(ref, out, nullptr);
}

ErrorCode loadAllKgvFiles(std::vector<KgvFileRef>& files, std::uint32_t mergeMode,
                          std::vector<std::string>* ignored, std::unique_ptr<KgvData>& out,
                          std::size_t& fileCountOrFailedIndex) {
  out.reset();
  fileCountOrFailedIndex = 0;
  if (files.empty()) return noFileName;
  // Each file is merged into the accumulated data in place and then dropped, so memory
  // holds the result and one file at a time.
  std::unique_ptr<KgvData> acc;
  std::unique_ptr<KgvMerger> merger;
  bool anyIgnored = false;
  KgvReadBuffer buffer;  // one for all files
  for (size_t i = 0; i < files.size(); ++i) {
    std::unique_ptr<KgvData> data;
    ErrorCode rc = loadWithBuffer(files[i], data, &buffer);
    if (rc == allOK && !acc) {
      acc = std::move(data);
      setKgvIsJava(acc->header.isJava != 0);
      try {
        merger = std::make_unique<KgvMerger>(*acc);
      } catch (const std::bad_alloc&) {
        rc = outOfMemory;
      }
    } else if (rc == allOK) {
      rc = merger->merge(mergeMode, *data, ignored, true, false);
      if (rc == mergeIgnored) {
        anyIgnored = true;
        rc = allOK;
      }
    }
    if (rc != allOK) {
      fileCountOrFailedIndex = i;
      return rc;
    }
  }
  acc->mergeMode = mergeMode;
  if (merger->mergedAny()) rebuildRecordSizes(*acc);
  fileCountOrFailedIndex = files.size();
  out = std::move(acc);
  return anyIgnored ? mergeIgnored : allOK;
}
