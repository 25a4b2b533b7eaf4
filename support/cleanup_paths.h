// Files and directories to remove when a signal stops the process: held lock directories
// and unfinished temporary files, so that no later run waits for a dead lock and no
// half-written copy is left beside a user's file. The table has a fixed size and is walked
// without locks or allocation, so signal handlers may use it.
#pragma once

#include <string>

enum class CleanupPathKind { file, directory };

// The slot to unregister the path with, or -1 when the table is full (the path is then not
// removed by a signal, which is no worse than before).
int registerCleanupPath(const std::string& path, CleanupPathKind kind);
// -1 is ignored.
void unregisterCleanupPath(int slot);

// Removes every registered path; async-signal-safe. A directory goes only while it is still
// the one registered (same device and inode): a lock another process made since stays.
void removeCleanupPaths();
