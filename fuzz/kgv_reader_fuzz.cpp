// Fuzz target for the .kgv reader: any bytes must give data or a clean code. Data that
// read well are also merged with themselves both ways and written back and re-read.
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "coverage/kgv_file.h"
#include "coverage/kgv_merge.h"
#include "support/message_sink.h"
#include "tools/kgv_maker.h"

namespace {

std::string g_input;   // scratch file for the bytes under test
std::string g_output;  // scratch file for writing back

std::string scratchFile(const char* what) {
  const char* tmp = getenv("TMPDIR");
  std::string templ = std::string(tmp && *tmp ? tmp : "/tmp") + "/kgv_fuzz_" + what + ".XXXXXX";
  int fd = mkstemp(templ.data());
  if (fd < 0) abort();
  close(fd);
  return templ;
}

void removeScratch() {
  unlink(g_input.c_str());
  unlink(g_output.c_str());
}

const char* const kSeeds[] = {
    "clockTime 5\nrecord src/a.c signature=3 build=10 first=100 last=200\n"
    "function main line=3 calls=2\nblock 4 hits=2\nblockline 5\nblock 7 hits=0\n"
    "function helper line=12 calls=0\nblock 13 hits=0\nempty\n"
    "record b.c\nfunction f line=1 calls=1\nblock 2 hits=1\npad 2\n",
    "generate records=6 functions=3 blocks=5 seed=4\n",
    "hitFlags 1\njava 1\nrecord Main.java\nfunction run line=8 calls=1\nblock 9 hits=1\n",
};

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  g_input = scratchFile("in");
  g_output = scratchFile("out");
  atexit(removeScratch);
  const char* corpus = getenv("KG_FUZZ_CORPUS");
  if (!corpus || !*corpus) return 0;
  int n = 0;
  for (const char* seed : kSeeds) {
    for (const char* order : {"native", "swapped"}) {
      std::string path = std::string(corpus) + "/generated_" + std::to_string(n++) + ".kgv";
      std::string error;
      makeKgvFile(std::string("order ") + order + "\n" + seed, path, error);
    }
  }
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (g_input.empty()) LLVMFuzzerInitialize(nullptr, nullptr);
  // Overwrite and cut to size instead of truncating to nothing first: some file systems
  // flush a file that was emptied and rewritten, which would make each input a disk write.
  static int fd = -1;
  if (fd < 0) fd = open(g_input.c_str(), O_WRONLY);
  if (fd < 0) abort();
  if ((size && pwrite(fd, data, size, 0) != static_cast<ssize_t>(size)) ||
      ftruncate(fd, static_cast<off_t>(size)) != 0)
    abort();

  std::unique_ptr<KgvData> d;
  ErrorCode rc = readKgvFile(g_input, d);
  clearPendingSystemError();
  if (rc != allOK) {
    if (d) abort();  // a failed read hands back nothing
    return 0;
  }
  // Merge with a copy of itself: once as the same version, once as another version.
  std::unique_ptr<KgvData> same = copyKgvData(*d), other = copyKgvData(*d);
  for (auto& r : other->records) r->objHeader.signature ^= 0x5A5A5A5A;
  std::unique_ptr<KgvData> merged;
  std::vector<std::string> ignored;
  MessageList messages;
  mergeKgvDataCopy(kMergeNewestWins, *d, *same, &ignored, messages, merged);
  mergeKgvDataCopy(kMergeForce, *d, *other, &ignored, messages, merged);
  // What was read writes back and reads again with the same records. Writing syncs the
  // disk, so only every sixteenth good input takes this path.
  static unsigned goodInputs = 0;
  if (++goodInputs % 16 == 1 && writeKgvFile(g_output, *d) == allOK) {
    std::unique_ptr<KgvData> back;
    if (readKgvFile(g_output, back) != allOK || back->records.size() != d->records.size()) abort();
  }
  clearPendingSystemError();
  return 0;
}
