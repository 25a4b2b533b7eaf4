// Advisory locks on data files: a directory ".lock.quor.NAME" beside the file, created
// atomically, broken when older than a limit, with waits reported through a callback.
#pragma once

#include <functional>
#include <string>

#include "support/errors.h"

enum LockEvent : int {
  LockEventWait = 1,   // about to wait one second for a busy lock
  LockEventBreak = 2,  // about to break an old lock
};

// (event, data file path, lock name) -> continue (true) or abandon (false).
using LockWaitCallback =
    std::function<bool(int event, const std::string& path, const std::string& lockName)>;

// A process that holds a lock may take it again (under any name of the same lock
// directory) without waiting for itself; the directory goes with the last unlock.
// 1 when held (or locking is off); 45 abandoned; 46 empty path; 47 too long; 48 an old
// lock could not be removed; 49 the lock could not be created; 51 too many tries; 52 too
// many lost races.
ErrorCode lockKgvFile(const std::string& path);
// 1 also when the lock is already gone; 46, 47 or 48. A lock of ours that another process
// broke and replaced by its own is left to that process.
ErrorCode unlockKgvFile(const std::string& path);

// While a lock is held it is renewed every few seconds, so that peers never take it for
// left over; and a stopping signal removes it.

// Before replacing a file: 1 when this process still holds the lock it took for the path
// (or locking is off, or it never took one); 13 (unabelToLock, the detail recorded) when
// another process broke it meanwhile.
ErrorCode checkKgvLockHeld(const std::string& path);
// Whether locking is on and the lock of the path is this process's own right now.
bool kgvLockHeldHere(const std::string& path);

// Returns the previous callback.
LockWaitCallback setLockWaitCallback(LockWaitCallback callback);
// An age below 1 or a count of 0 leaves that setting as it is.
void setLockTimes(int age, unsigned tries, unsigned races);
int lockBreakAge();
void setLockingEnabled(bool enabled);
bool lockingEnabled();

// The lock directory of a data file path; empty (with the code) when none can be formed.
ErrorCode kgvLockName(const std::string& path, std::string& lockName);

// How a waiting lock passes a second; replaceable so that callers can be told of the wait.
void setLockSleeper(std::function<void()> sleeper);
