// Lock directories beside data files.
#include "coverage/kgv_lock.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <ctime>
#include <vector>

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
    dev_t dev;
    ino_t ino;
    unsigned depth;
  };
  std::vector<Held> held;
};

LockSettings& settings() {
  static LockSettings s;
  return s;
}

LockSettings::Held* heldLock(const struct stat& st) {
  for (auto& h : settings().held)
    if (h.dev == st.st_dev && h.ino == st.st_ino) return &h;
  return nullptr;
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
      if (LockSettings::Held* h = heldLock(st)) {
        ++h->depth;
        return allOK;
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
        struct stat mine;
        if (lstat(name.c_str(), &mine) == 0) s.held.push_back({name, mine.st_dev, mine.st_ino, 1});
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
  struct stat st;
  if (lstat(name.c_str(), &st) == 0) {
    if (LockSettings::Held* h = heldLock(st)) {
      if (--h->depth > 0) return allOK;
      s.held.erase(s.held.begin() + (h - s.held.data()));
    }
  }
  // Whatever this process held under the name is given up, also a lock that another
  // process broke meanwhile.
  std::erase_if(s.held, [&](const LockSettings::Held& h) { return h.name == name; });
  if (rmdir(name.c_str()) == 0 || errno == ENOENT) return allOK;
  recordSystemError(errno, "Lock name: %s", name.c_str());
  return lockDirNotRemove;
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
