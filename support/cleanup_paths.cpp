// The registry of paths a signal must not leave behind.
#include "support/cleanup_paths.h"

#include <unistd.h>

#include <atomic>
#include <cstring>

#include "support/file_identity.h"

namespace {

enum SlotState : int { slotFree = 0, slotFilling = 1, slotActive = 2 };

struct Slot {
  std::atomic<int> state{slotFree};
  char* path = nullptr;
  CleanupPathKind kind = CleanupPathKind::file;
  bool known = false;  // whether `id` holds the directory's identity
  FileIdentity id;
};

// Enough for the one lock held at a time, the files being written and a few temporary ones.
constexpr int kSlots = 64;
Slot gSlots[kSlots];

}  // namespace

int registerCleanupPath(const std::string& path, CleanupPathKind kind) {
  for (int i = 0; i < kSlots; ++i) {
    int expected = slotFree;
    if (!gSlots[i].state.compare_exchange_strong(expected, slotFilling)) continue;
    Slot& s = gSlots[i];
    s.path = new char[path.size() + 1];
    std::memcpy(s.path, path.c_str(), path.size() + 1);
    s.kind = kind;
    s.known = kind == CleanupPathKind::directory && fileIdentityOf(path.c_str(), s.id);
    s.state.store(slotActive, std::memory_order_release);
    return i;
  }
  return -1;
}

void unregisterCleanupPath(int slot) {
  if (slot < 0 || slot >= kSlots) return;
  Slot& s = gSlots[slot];
  // Taken out of the walk before the name goes.
  if (s.state.exchange(slotFilling) != slotActive) return;
  delete[] s.path;
  s.path = nullptr;
  s.state.store(slotFree, std::memory_order_release);
}

void removeCleanupPaths() {
  for (Slot& s : gSlots) {
    if (s.state.load(std::memory_order_acquire) != slotActive) continue;
    if (s.kind == CleanupPathKind::file) {
      unlink(s.path);
      continue;
    }
    FileIdentity now;
    if (!s.known || (fileIdentityOf(s.path, now) && sameFile(now, s.id))) rmdir(s.path);
  }
}
