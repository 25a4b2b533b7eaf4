// Running gcov over a build tree: the .gcda files in batches, one gcov process per
// processor, each batch's JSON read as it comes and the batches added up in file order, so
// the result does not depend on which process finished first.
#include "tools/import/gcov_runner.h"

#include <fcntl.h>
#include <poll.h>
#include <sched.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <thread>

extern char** environ;

namespace fs = std::filesystem;

bool findGcdaFiles(const std::string& dir, std::vector<std::string>& files, std::string& error) {
  std::error_code ec;
  fs::path root = fs::absolute(dir, ec);
  if (ec) root = dir;
  fs::recursive_directory_iterator it(root, fs::directory_options::skip_permission_denied, ec);
  if (ec) {
    error = "cannot read the directory " + dir + ": " + ec.message();
    return false;
  }
  for (; it != fs::recursive_directory_iterator(); it.increment(ec)) {
    if (ec) {
      error = "cannot read the directory " + dir + ": " + ec.message();
      return false;
    }
    std::error_code typeError;
    if (it->path().extension() == ".gcda" && it->is_regular_file(typeError))
      files.push_back(normalisedSourcePath(it->path().string(), ""));
  }
  std::sort(files.begin(), files.end());
  return true;
}

namespace {

unsigned processors() {
  cpu_set_t set;
  if (sched_getaffinity(0, sizeof set, &set) == 0 && CPU_COUNT(&set) > 0) return CPU_COUNT(&set);
  long n = sysconf(_SC_NPROCESSORS_ONLN);
  return n > 0 ? static_cast<unsigned>(n) : 1;
}

struct Batch {
  std::vector<std::string> files;
  ImportedData data;
  std::vector<std::string> warnings;
  std::string error;
};

// Runs the program with the arguments; its standard output and error gathered. False with
// the error when it cannot be started or is killed.
bool runGcov(const GcovRunOptions& options, const std::vector<std::string>& files, std::string& out,
             std::string& err, int& status, std::string& error) {
  std::vector<std::string> args = {options.gcov, "--json-format", "--stdout", "--branch-probabilities"};
  args.insert(args.end(), files.begin(), files.end());
  std::vector<char*> argv;
  for (auto& a : args) argv.push_back(a.data());
  argv.push_back(nullptr);

  // Close-on-exec, so that gcov processes started at the same time by other threads do
  // not hold this one's pipes open.
  int outPipe[2], errPipe[2];
  if (pipe2(outPipe, O_CLOEXEC) != 0) {
    error = std::string("cannot start gcov: ") + strerror(errno);
    return false;
  }
  if (pipe2(errPipe, O_CLOEXEC) != 0) {
    error = std::string("cannot start gcov: ") + strerror(errno);
    close(outPipe[0]);
    close(outPipe[1]);
    return false;
  }
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, outPipe[1], 1);
  posix_spawn_file_actions_adddup2(&actions, errPipe[1], 2);
  pid_t pid = -1;
  int rc = posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  close(outPipe[1]);
  close(errPipe[1]);
  if (rc != 0) {
    close(outPipe[0]);
    close(errPipe[0]);
    if (rc == ENOENT)
      error = "cannot run gcov: '" + options.gcov + "' was not found" +
              (options.gcov.find('/') == std::string::npos ? " on PATH" : "") +
              "; install gcc's gcov (the Debian package gcc), or name the program with --gcov-tool";
    else
      error = "cannot run gcov ('" + options.gcov + "'): " + strerror(rc);
    return false;
  }
  pollfd fds[2] = {{outPipe[0], POLLIN, 0}, {errPipe[0], POLLIN, 0}};
  std::string* sinks[2] = {&out, &err};
  int open = 2;
  char buf[1 << 16];
  while (open > 0) {
    if (poll(fds, 2, -1) < 0) {
      if (errno == EINTR) continue;
      break;
    }
    for (int i = 0; i < 2; ++i) {
      if (fds[i].fd < 0 || !(fds[i].revents & (POLLIN | POLLHUP | POLLERR))) continue;
      ssize_t n = read(fds[i].fd, buf, sizeof buf);
      if (n < 0 && (errno == EINTR || errno == EAGAIN)) continue;
      if (n <= 0) {
        close(fds[i].fd);
        fds[i].fd = -1;
        --open;
      } else {
        sinks[i]->append(buf, static_cast<size_t>(n));
      }
    }
  }
  for (auto& f : fds)
    if (f.fd >= 0) close(f.fd);
  int wstatus = 0;
  while (waitpid(pid, &wstatus, 0) < 0 && errno == EINTR) {
  }
  if (WIFSIGNALED(wstatus)) {
    error = "gcov was killed by signal " + std::to_string(WTERMSIG(wstatus)) + " while reading " + files.front() +
            (files.size() > 1 ? " and " + std::to_string(files.size() - 1) + " more" : "");
    return false;
  }
  status = WIFEXITED(wstatus) ? WEXITSTATUS(wstatus) : 1;
  return true;
}

void runBatch(const GcovRunOptions& options, const std::string& baseDirectory, Batch& b) {
  std::string out, err;
  int status = 0;
  if (!runGcov(options, b.files, out, err, status, b.error)) return;
  for (size_t at = 0; at < err.size();) {
    size_t nl = err.find('\n', at);
    std::string line = err.substr(at, nl == std::string::npos ? std::string::npos : nl - at);
    if (!line.empty()) b.warnings.push_back("gcov: " + line);
    at = nl == std::string::npos ? err.size() : nl + 1;
  }
  // gcov reports the files it cannot read and goes on with the others (exit status 2).
  if (out.find_first_not_of(" \t\r\n") == std::string::npos) {
    if (status != 0 && err.empty())
      b.warnings.push_back("gcov exited with status " + std::to_string(status) + " on " + b.files.front() +
                           (b.files.size() > 1 ? " and " + std::to_string(b.files.size() - 1) + " more" : ""));
    return;
  }
  b.data.baseDirectory = baseDirectory;
  ImportError e;
  std::string name = "gcov's output for " + b.files.front() +
                     (b.files.size() > 1 ? " (and " + std::to_string(b.files.size() - 1) + " more)" : "");
  if (!readGcovJson(name, out, b.data, e)) b.error = e.text();
}

}  // namespace

bool importGcdaFiles(const std::vector<std::string>& gcdaFiles, const GcovRunOptions& options,
                     ImportedData& data, std::vector<std::string>& warnings, std::string& error) {
  if (gcdaFiles.empty()) return true;
  unsigned jobs = options.jobs != 0 ? options.jobs : processors();
  // Batches small enough to keep every process busy to the end, large enough that starting
  // gcov costs little beside its work.
  size_t per = (gcdaFiles.size() + jobs * 4 - 1) / (jobs * 4);
  per = std::clamp<size_t>(per, 1, 64);
  std::vector<Batch> batches;
  for (size_t i = 0; i < gcdaFiles.size(); i += per) {
    batches.emplace_back();
    batches.back().files.assign(gcdaFiles.begin() + i, gcdaFiles.begin() + std::min(gcdaFiles.size(), i + per));
  }
  std::atomic<size_t> next{0};
  std::atomic<bool> stop{false};
  auto work = [&] {
    for (size_t i; !stop && (i = next++) < batches.size();) {
      runBatch(options, data.baseDirectory, batches[i]);
      if (!batches[i].error.empty()) stop = true;  // no point running the rest
    }
  };
  std::vector<std::thread> threads;
  unsigned n = std::min<size_t>(jobs, batches.size());
  try {
    for (unsigned t = 1; t < n; ++t) threads.emplace_back(work);
  } catch (const std::system_error&) {
    // Fewer threads than asked for: the ones there are (and this one) do all the batches.
  }
  work();
  for (auto& t : threads) t.join();
  for (Batch& b : batches) {
    warnings.insert(warnings.end(), b.warnings.begin(), b.warnings.end());
    if (!b.error.empty()) {
      error = b.error;
      return false;
    }
    addImportedData(data, b.data);
  }
  return true;
}
