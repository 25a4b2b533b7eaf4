// Loading files under their locks and merging them into one accumulated body.
#include "coverage/kgv_load.h"

#include <sys/stat.h>

#include <ctime>
#include <new>

#include "coverage/kgv_file.h"
#include "coverage/kgv_lock.h"
#include "coverage/kgv_merge.h"

namespace {
bool g_isJava = false;

const char* nonRegularKind(mode_t mode) {
  if (S_ISDIR(mode)) return "a directory";
  if (S_ISFIFO(mode)) return "a FIFO (named pipe)";
  if (S_ISCHR(mode)) return "a character device";
  if (S_ISBLK(mode)) return "a block device";
  if (S_ISSOCK(mode)) return "a socket";
  return "not a regular file";
}

}  // namespace

bool kgvIsJava() { return g_isJava; }
void setKgvIsJava(bool isJava) { g_isJava = isJava; }

ErrorCode refuseNonRegularDataFile(const std::string& path) {
  struct stat st;
  if (stat(path.c_str(), &st) != 0 || S_ISREG(st.st_mode)) return allOK;  // the read says why
  recordSystemError(0, "%s is %s, not a data file.", path.c_str(), nonRegularKind(st.st_mode));
  return notOurFile;
}

namespace {

// Runs a read of the file under its lock; on success the reference's loadTime is set.
template <class Read>
ErrorCode underLock(KgvFileRef& ref, Read read) {
  ErrorCode rc = refuseNonRegularDataFile(ref.givenName);
  if (rc != allOK) return rc;
  rc = lockKgvFile(ref.givenName);
  if (rc != allOK) return rc;
  try {
    rc = read();
  } catch (const std::bad_alloc&) {
    rc = outOfMemory;
  }
  ErrorCode unlocked = unlockKgvFile(ref.givenName);
  if (rc == allOK && unlocked != allOK) rc = unlocked;
  if (rc == allOK) ref.loadTime = static_cast<std::uint32_t>(time(nullptr));
  return rc;
}

// Merges a file's records into the accumulated data while the file is read, so that
// records that only add counts are never copied.
class MergeWhileReading : public KgvRecordVisitor {
 public:
  MergeWhileReading(KgvMerger& merger, std::uint32_t mode, std::vector<std::string>* ignored)
      : merger_(merger), mode_(mode), ignored_(ignored) {}
  ErrorCode header(const KgvHeader& h, const std::vector<std::uint32_t>&) override {
    header_ = h;
    mixed_ = !merger_.begin(h);
    return allOK;
  }
  ErrorCode record(const KgvRecordBytes& r) override {
    return mixed_ ? allOK : merger_.add(mode_, r, ignored_);
  }
  // After a complete read: 1, or 36 when data were set aside.
  ErrorCode finish() {
    if (mixed_) {
      merger_.warnMixedLanguages();
      return mergeIgnored;
    }
    return merger_.finish(mode_, header_, false);
  }

 private:
  KgvMerger& merger_;
  std::uint32_t mode_;
  std::vector<std::string>* ignored_;
  KgvHeader header_;
  bool mixed_ = false;
};

}  // namespace

ErrorCode loadKgvFile(KgvFileRef& ref, std::unique_ptr<KgvData>& out) {
  out.reset();
  ErrorCode rc = underLock(ref, [&] { return readKgvFile(ref.givenName, out); });
  if (rc != allOK) out.reset();
  return rc;
}

ErrorCode loadAllKgvFiles(std::vector<KgvFileRef>& files, std::uint32_t mergeMode,
                          std::vector<std::string>* ignored, MessageSink& messages,
                          std::unique_ptr<KgvData>& out, std::size_t& fileCountOrFailedIndex) {
  out.reset();
  fileCountOrFailedIndex = 0;
  if (files.empty()) return noFileName;
  // The first file becomes the accumulated data; every later one is merged into it in
  // place while it is read, so memory holds the result and one file's bytes at a time.
  std::unique_ptr<KgvData> acc;
  std::unique_ptr<KgvMerger> merger;
  bool anyIgnored = false;
  KgvReadBuffer buffer;
  for (size_t i = 0; i < files.size(); ++i) {
    ErrorCode rc;
    if (!acc) {
      rc = underLock(files[i], [&] { return readKgvFile(files[i].givenName, acc, &buffer); });
      if (rc == allOK) {
        setKgvIsJava(acc->header.isJava != 0);
        try {
          merger = std::make_unique<KgvMerger>(*acc, messages);
        } catch (const std::bad_alloc&) {
          rc = outOfMemory;
        }
      }
    } else {
      MergeWhileReading visitor(*merger, mergeMode, ignored);
      rc = underLock(files[i], [&] { return readKgvRecords(files[i].givenName, &buffer, visitor); });
      if (rc == allOK) rc = visitor.finish();
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
