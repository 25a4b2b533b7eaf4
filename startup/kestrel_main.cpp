// kestrel: the product's command. Finds the installation directory and runs the program
// with the mode first and -kestrelhome=DIR after it.
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace {

const char* const kUsage =
    "Kestrelgauge: Kestrelgauge must be invoked in one of these forms:\n"
    "    kestrel -view\n"
    "    kestrel -export\n"
    "    kestrel -merge=<file>\n"
    "    kestrel -extract\n"
    "For additional information, use 'kestrel -help'.\n\n";

bool isMode(const char* a) {
  return strcmp(a, "-view") == 0 || strcmp(a, "-export") == 0 || strcmp(a, "-extract") == 0 ||
         (strncmp(a, "-merge=", 7) == 0 && a[7] != '\0');
}

std::string parentOf(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

bool executable(const std::string& path) { return access(path.c_str(), X_OK) == 0; }

// Installed: PREFIX/bin/kestrel with PREFIX/share/kestrelgauge; in the build tree the
// directory above bin/ is the installation directory itself.
std::string installationDirectory() {
  char buf[4096];
  ssize_t n = readlink("/proc/self/exe", buf, sizeof buf - 1);
  if (n <= 0) return std::string();
  buf[n] = '\0';
  std::string prefix = parentOf(parentOf(buf));
  std::string installed = prefix + "/" KG_SHARE_SUBDIR;
  if (executable(installed + "/bin/kestrel-viewer")) return installed;
  if (executable(prefix + "/bin/kestrel-viewer")) return prefix;
  return std::string();
}

}  // namespace

int main(int argc, char** argv) {
  std::vector<char*> in(argv, argv + argc);
  // "kestrel -help" and "kestrel -version" without a mode: what the usage message advises
  // must work, so they run as the console export mode would, which prints them and stops.
  std::string exportMode = "-export";
  bool onlyHelp = in.size() >= 2;
  for (size_t i = 1; i < in.size(); ++i)
    onlyHelp = onlyHelp && (strcmp(in[i], "-help") == 0 || strcmp(in[i], "-version") == 0);
  if (onlyHelp) in.insert(in.begin() + 1, exportMode.data());
  if (in.size() < 2 || !isMode(in[1])) {
    fflush(stdout);
    fputs(kUsage, stderr);
    return 11;
  }
  std::string dir = installationDirectory();
  if (dir.empty()) {
    fprintf(stderr, "Kestrelgauge: cannot find the installation directory of %s.\n\n", argv[0]);
    return 11;
  }
  std::string viewer = dir + "/bin/kestrel-viewer";
  std::string home = "-kestrelhome=" + dir;
  std::vector<char*> args;
  args.push_back(const_cast<char*>(viewer.c_str()));
  args.push_back(in[1]);
  args.push_back(const_cast<char*>(home.c_str()));
  for (size_t i = 2; i < in.size(); ++i) args.push_back(in[i]);
  args.push_back(nullptr);
  execv(viewer.c_str(), args.data());
  perror(viewer.c_str());
  return 11;
}
