// Lock directories beside data files.
#include "coverage/kgv_lock.h"

#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <ctime>
#include <mutex>
#include <thread>
#include <vector>

#include "support/cleanup_paths.h"
#include "support/file_identity.h"

namespace {

struct LockSettings {
  bool enabled = true;
  int breakAge = 360;
  unsigned maxTries = 120;
  unsigned maxRaces = 10;
  LockWaitCallback callback;
  std::function<void()> sleeper;
  std::string lastPath;
  std::string lastLockName;
  // Locks this process holds, by the identity of the lock directory, so that a file
  // locked for writing can be read by the same process without waiting for itself.
  struct Held {
    std::string name;
    FileIdentity id;
    unsigned depth;
    int cleanupSlot;
  };
  // Guards `held` against the renewing thread.
  std::mutex heldMutex;
  std::vector<Held> held;
};

LockSettings& settings() {
  static LockSettings s;
  return s;
}

LockSettings::Held* heldLock(const FileIdentity& id) {
  for (auto& h : settings().held)
    if (sameFile(h.id, id)) return &h;
  return nullptr;
}

// The held lock the name stands for now, if any; called with the held list guarded.
LockSettings::Held* heldLockNamed(const std::string& name) {
  FileIdentity id;
  return fileIdentityOf(name.c_str(), id) ? heldLock(id) : nullptr;
}

constexpr size_t kLockNameBuffer = 4096;

bool callback(int event) {
  LockSettings& s = settings();
  if (!s.callback) return true;
  return s.callback(event, s.lastPath, s.lastLockName);
}

void sleepOneSecond() {
  LockSettings& s = settings();
  if (s.sleeper)
    s.sleeper();
  else
    sleep(1);
}

// Peers break a lock by its age, so a lock held through long work is renewed: its
// status-change time is refreshed by re-applying its permissions, well within the ten
// seconds a peer allows. A thread does it, since the holder may be busy in one long read
// or write; it runs only while a lock is held.
class LockRenewer {
 public:
  static constexpr auto kInterval = std::chrono::seconds(4);

  ~LockRenewer() { stop(); }

  // Called with the held list guarded.
  void start() {
    if (thread_.joinable()) return;
    stopping_ = false;
    // Signals stay with the main thread, whose handlers expect to interrupt it.
    sigset_t all, previous;
    sigfillset(&all);
    pthread_sigmask(SIG_BLOCK, &all, &previous);
    thread_ = std::thread([this] { run(); });
    pthread_sigmask(SIG_SETMASK, &previous, nullptr);
  }

  void stop() {
    {
      std::lock_guard<std::mutex> g(mutex_);
      stopping_ = true;
    }
    wake_.notify_all();
    if (thread_.joinable()) thread_.join();
  }

 private:
  void run() {
    std::unique_lock<std::mutex> g(mutex_);
    while (!wake_.wait_for(g, kInterval, [this] { return stopping_; })) renewAll();
  }

  static void renewAll() {
    LockSettings& s = settings();
    std::lock_guard<std::mutex> g(s.heldMutex);
    for (const LockSettings::Held& h : s.held) {
      // Only our own directory: one that replaced it after a break belongs to another.
      FileIdentity now;
      if (fileIdentityOf(h.name.c_str(), now) && sameFile(now, h.id)) (void)!chmod(h.name.c_str(), 0222);
    }
  }

  std::mutex mutex_;
  std::condition_variable wake_;
  bool stopping_ = false;
  std::thread thread_;
};

LockRenewer& renewer() {
  static LockRenewer r;
  return r;
}

// The lock just made becomes ours: renewed while held, removed if a signal stops us.
void holdLock(const std::string& name, const FileIdentity& id) {
  LockSettings& s = settings();
  int slot = registerCleanupPath(name, CleanupPathKind::directory);
  std::lock_guard<std::mutex> g(s.heldMutex);
  s.held.push_back({name, id, 1, slot});
  renewer().start();
}

// Forgets held entries; the renewing thread stops with the last one.
template <class Pred>
void releaseHeld(Pred pred) {
  LockSettings& s = settings();
  bool none;
  {
    std::lock_guard<std::mutex> g(s.heldMutex);
    for (const LockSettings::Held& h : s.held)
      if (pred(h)) unregisterCleanupPath(h.cleanupSlot);
    std::erase_if(s.held, pred);
    none = s.held.empty();
  }
  if (none) renewer().stop();
}

}  // namespace

ErrorCode kgvLockName(const std::string& path, std::string& lockName) {
  lockName.clear();
  if (path.empty()) return noLockFilename;
  if (path.size() + 12 > kLockNameBuffer) return filenameTooLong;
  size_t slash = path.find_last_of('/');
  std::string dir = slash == std::string::npos ? std::string() : path.substr(0, slash + 1);
  std::string base = slash == std::string::npos ? path : path.substr(slash + 1);
  lockName = dir + ".lock.quor." + base;
  return allOK;
}

namespace {

// The lock name of a path, remembered with the path for the wait callback.
ErrorCode beginLockCall(const std::string& path, std::string& name) {
  ErrorCode rc = kgvLockName(path, name);
  if (rc != allOK) return rc;
  settings().lastPath = path;
  settings().lastLockName = name;
  return allOK;
}

}  // namespace

ErrorCode lockKgvFile(const std::string& path) {
  LockSettings& s = settings();
  if (!s.enabled) return allOK;
  std::string name;
  ErrorCode rc = beginLockCall(path, name);
  if (rc != allOK) return rc;

  unsigned tries = 0, races = 0;
  while (tries < s.maxTries && races < s.maxRaces) {
    ++tries;
    struct stat st;
    bool exists = lstat(name.c_str(), &st) == 0;
    if (exists) {
      {
        std::lock_guard<std::mutex> g(s.heldMutex);
        if (LockSettings::Held* h = heldLockNamed(name)) {
          ++h->depth;
          return allOK;
        }
      }
      long age = static_cast<long>(time(nullptr)) - static_cast<long>(st.st_ctime);
      if (age < 0) age = 0;
      if (age > s.breakAge) {
        if (!callback(LockEventBreak)) return lockAborted;
        if (rmdir(name.c_str()) != 0 && errno != ENOENT) {
          recordSystemError(errno, "Lock name: %s", name.c_str());
          return lockDirNotRemove;
        }
        exists = false;
      }
    }
    if (!exists) {
      int made = mkdir(name.c_str(), 0777);
      int err = errno;
      (void)!chmod(name.c_str(), 0222);
      if (made == 0) {
        FileIdentity mine;
        if (fileIdentityOf(name.c_str(), mine)) holdLock(name, mine);
        return allOK;
      }
      if (err != EEXIST) {
        recordSystemError(err, "Lock name: %s", name.c_str());
        return lockDirNotCreated;
      }
      ++races;
    }
    if (!callback(LockEventWait)) return lockAborted;
    sleepOneSecond();
  }
  if (races >= s.maxRaces) {
    recordSystemError(0, "%u races were lost while trying to lock %s", races, path.c_str());
    return lockContention;
  }
  recordSystemError(0, "%u timeouts were tried while trying to lock %s", tries, path.c_str());
  return lockWaitLong;
}

ErrorCode unlockKgvFile(const std::string& path) {
  LockSettings& s = settings();
  if (!s.enabled) return allOK;
  std::string name;
  ErrorCode rc = beginLockCall(path, name);
  if (rc != allOK) return rc;
  FileIdentity id;
  bool exists = fileIdentityOf(name.c_str(), id);
  bool ours = false, heldUnderName = false;
  {
    std::lock_guard<std::mutex> g(s.heldMutex);
    if (exists) {
      if (LockSettings::Held* h = heldLock(id)) {
        if (h->depth > 1) {
          --h->depth;
          return allOK;
        }
        ours = true;
      }
    }
    for (const LockSettings::Held& h : s.held) heldUnderName |= h.name == name;
  }
  // Whatever this process held under the name is given up, also a lock that another
  // process broke meanwhile.
  releaseHeld([&](const LockSettings::Held& h) {
    return h.name == name || (ours && sameFile(h.id, id));
  });
  // A directory standing where our broken lock was is another process's live lock.
  if (exists && !ours && heldUnderName) return allOK;
  if (rmdir(name.c_str()) == 0 || errno == ENOENT) return allOK;
  recordSystemError(errno, "Lock name: %s", name.c_str());
  return lockDirNotRemove;
}

ErrorCode checkKgvLockHeld(const std::string& path) {
  LockSettings& s = settings();
  if (!s.enabled) return allOK;
  std::string name;
  ErrorCode rc = kgvLockName(path, name);
  if (rc != allOK) return rc;
  std::lock_guard<std::mutex> g(s.heldMutex);
  if (heldLockNamed(name)) return allOK;
  for (const LockSettings::Held& h : s.held) {
    if (h.name != name) continue;
    recordSystemError(0, "The lock %s was broken by another process while this one held it, "
                      "so %s was not written.", name.c_str(), path.c_str());
    return unabelToLock;
  }
  return allOK;  // never taken here: nothing to check
}

bool kgvLockHeldHere(const std::string& path) {
  LockSettings& s = settings();
  std::string name;
  if (!s.enabled || kgvLockName(path, name) != allOK) return false;
  std::lock_guard<std::mutex> g(s.heldMutex);
  return heldLockNamed(name) != nullptr;
}

LockWaitCallback setLockWaitCallback(LockWaitCallback cb) {
  LockWaitCallback previous = std::move(settings().callback);
  settings().callback = std::move(cb);
  return previous;
}

void setLockTimes(int age, unsigned tries, unsigned races) {
  LockSettings& s = settings();
  if (age >= 1) s.breakAge = age;
  if (tries != 0) s.maxTries = tries;
  if (races != 0) s.maxRaces = races;
}

int lockBreakAge() { return settings().breakAge; }
void setLockingEnabled(bool enabled) { settings().enabled = enabled; }
bool lockingEnabled() { return settings().enabled; }
void setLockSleeper(std::function<void()> sleeper) { settings().sleeper = std::move(sleeper); }
