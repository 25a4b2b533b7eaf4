// kestrel-import: lcov tracefiles, gcov JSON files (compressed or not) and build trees
// (gcov run on their .gcda files) into one .kgv file.
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <exception>
#include <new>
#include <string>
#include <vector>

#include "coverage/kgv_file.h"
#include "coverage/kgv_lock.h"
#include "support/diagnostic.h"
#include "support/errors.h"
#include "tools/import/coverage_import.h"
#include "tools/import/gcov_runner.h"
#include "tools/import/import_records.h"

namespace {

const char kUsage[] =
    "usage: kestrel-import -o OUT.kgv [OPTIONS] INPUT...\n"
    "Each INPUT is an lcov tracefile (.info), gcov JSON (gcov --json-format), plain or\n"
    "gzip-compressed, recognised from its content, or a build directory: gcov is run on\n"
    "every .gcda file under it.\n"
    "Options:\n"
    "  -o, --output FILE          the data file to write\n"
    "  -b, --base-directory DIR   relative source paths of tracefiles are taken from DIR\n"
    "                             (default: the current directory)\n"
    "      --gcov-tool PROGRAM    the gcov to run on build directories (default: gcov)\n"
    "  -j, --jobs N               gcov processes at once (default: one per processor)\n"
    "  -h, --help                 this text\n";

int usage(int status) {
  fputs(kUsage, status == 0 ? stdout : stderr);
  return status;
}

int fail(const std::string& message) {
  fprintf(stderr, "kestrel-import: %s\n", message.c_str());
  return 2;
}

// The folder a new file at `path` goes into.
std::string folderOf(const std::string& path) {
  size_t slash = path.rfind('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

bool isDirectory(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

int runImport(int argc, char** argv) {
  // Stopped part way, the output's lock and its unfinished new copy go with the process.
  kgInstallSignalHandlers();
  std::string out;
  std::string base;
  GcovRunOptions gcov;
  std::vector<std::string> inputs;
  bool inputsOnly = false;
  for (int i = 1; i < argc; ++i) {
    std::string a = argv[i];
    // "--name VALUE", "--name=VALUE" and, for short names, "-n VALUE".
    auto value = [&](const char* shortName, const char* longName, std::string& to) {
      std::string l = longName;
      if ((shortName && a == shortName) || a == l) {
        if (i + 1 >= argc) return false;
        to = argv[++i];
        return true;
      }
      if (a.compare(0, l.size() + 1, l + "=") == 0) {
        to = a.substr(l.size() + 1);
        return true;
      }
      // "-n=VALUE" and "-nVALUE" ("-j2", as make takes it).
      if (shortName && a.size() > 2 && a.compare(0, 2, shortName) == 0) {
        to = a.substr(a[2] == '=' ? 3 : 2);
        return true;
      }
      return false;
    };
    std::string jobs;
    if (inputsOnly || a.empty() || a[0] != '-' || a == "-") {
      inputs.push_back(a);
    } else if (a == "--") {
      inputsOnly = true;
    } else if (a == "-h" || a == "--help") {
      return usage(0);
    } else if (value("-o", "--output", out) || value("-b", "--base-directory", base) ||
               value(nullptr, "--gcov-tool", gcov.gcov)) {
      continue;
    } else if (value("-j", "--jobs", jobs)) {
      char* end = nullptr;
      unsigned long n = strtoul(jobs.c_str(), &end, 10);
      if (jobs.empty() || *end != '\0' || n == 0 || n > 256)
        return fail("--jobs wants a number from 1 to 256, not '" + jobs + "'");
      gcov.jobs = static_cast<unsigned>(n);
    } else {
      fprintf(stderr, "kestrel-import: unknown option '%s'\n", a.c_str());
      return usage(2);
    }
  }
  if (out.empty() || inputs.empty()) return usage(2);
  if (gcov.gcov.empty()) return fail("--gcov-tool wants a program");

  // Checked first, so that a long import does not end in a message about locks.
  std::string folder = folderOf(out);
  if (!isDirectory(folder)) {
    struct stat st;
    bool exists = stat(folder.c_str(), &st) == 0;
    return fail("cannot write " + out + ": the folder " + folder +
                (exists ? " is not a folder" : " does not exist"));
  }
  if (!base.empty()) {
    if (!isDirectory(base)) return fail("--base-directory " + base + ": no such directory");
    base = normalisedSourcePath(base, "");
  }

  ImportedData data;
  data.baseDirectory = base;
  std::vector<std::string> warnings;
  for (const auto& input : inputs) {
    if (isDirectory(input)) {
      std::vector<std::string> gcda;
      std::string error;
      if (!findGcdaFiles(input, gcda, error)) return fail(error);
      if (gcda.empty())
        return fail("no .gcda files under " + input +
                    ": build with --coverage (when compiling and linking), run the program or "
                    "its tests, then import the build directory");
      bool ok = importGcdaFiles(gcda, gcov, data, warnings, error);
      for (const auto& w : warnings) fprintf(stderr, "kestrel-import: %s\n", w.c_str());
      warnings.clear();
      if (!ok) return fail(error);
      continue;
    }
    ImportError error;
    bool handled = false;
    bool streamed = readPlainTracefile(input, data, error, handled);
    if (handled) {
      if (!streamed) return fail(error.text());
      continue;
    }
    std::string text;
    if (!readInputText(input, text, error)) return fail(error.text());
    bool ok = false;
    switch (detectFormat(text)) {
      case InputFormat::lcov: ok = readLcovTracefile(input, text, data, error); break;
      case InputFormat::gcovJson: ok = readGcovJson(input, text, data, error); break;
      case InputFormat::unknown:
        error = {input, 1, "neither an lcov tracefile nor gcov JSON"};
        break;
    }
    if (!ok) return fail(error.text());
  }
  applyExclusionMarkers(data, warnings);
  for (const auto& w : warnings) fprintf(stderr, "kestrel-import: %s\n", w.c_str());
  if (data.files.empty()) return fail("the inputs hold no coverage data");

  auto now = static_cast<std::uint32_t>(time(nullptr));
  auto kgv = makeImportedDataReleasing(data, now);
  // Other programs may be reading or merging into the same file: write under its lock.
  ErrorCode rc = lockKgvFile(out);
  if (rc == allOK) {
    try {
      rc = writeKgvFile(out, *kgv);
    } catch (...) {
      unlockKgvFile(out);  // no lock left behind for others to wait on
      throw;
    }
    ErrorCode unlocked = unlockKgvFile(out);
    if (rc == allOK) rc = unlocked;
  }
  if (rc == lockDirNotCreated || rc == lockDirNotRemove) {
    // The viewer's text for these offers -locking=no, which is no option of this program.
    std::string detail = pendingSystemError();
    clearPendingSystemError();
    return fail("cannot write " + out + ": its lock directory could not be " +
                (rc == lockDirNotCreated ? "created" : "removed") + "; check that you may write in " + folder +
                (detail.empty() ? "" : "\n" + detail));
  }
  if (rc != allOK) return fail("cannot write " + out + ":\n" + errorMessage(rc));
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  // Data that do not fit in memory (or a limit set on it) end the import with a message,
  // as any other failure does; the output is replaced only when written whole.
  try {
    return runImport(argc, argv);
  } catch (const std::bad_alloc&) {
    return fail("out of memory");
  } catch (const std::exception& e) {
    return fail(std::string("stopped: ") + e.what());
  }
}
