// Runs a fuzz target without libFuzzer: every seed file, then random mutations of the
// seeds for a few seconds. Used for the smoke run inside the test suite; the long runs
// use libFuzzer with clang (see the README).
#include <dirent.h>
#include <sys/stat.h>

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <random>
#include <sstream>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);
extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv) __attribute__((weak));

namespace {

void collect(const std::string& path, std::vector<std::string>& out) {
  struct stat st;
  if (stat(path.c_str(), &st) != 0) return;
  if (S_ISDIR(st.st_mode)) {
    DIR* d = opendir(path.c_str());
    if (!d) return;
    while (dirent* e = readdir(d)) {
      if (e->d_name[0] == '.') continue;
      collect(path + "/" + e->d_name, out);
    }
    closedir(d);
  } else if (S_ISREG(st.st_mode)) {
    std::ifstream f(path, std::ios::binary);
    std::ostringstream s;
    s << f.rdbuf();
    out.push_back(s.str());
  }
}

void mutate(std::string& s, std::mt19937_64& rng) {
  int edits = 1 + static_cast<int>(rng() % 8);
  for (int i = 0; i < edits; ++i) {
    switch (rng() % 6) {
      case 0:  // flip a byte
        if (!s.empty()) s[rng() % s.size()] = static_cast<char>(rng());
        break;
      case 1:  // truncate
        if (!s.empty()) s.resize(rng() % s.size());
        break;
      case 2:  // insert bytes
        s.insert(s.empty() ? 0 : rng() % s.size(), 1 + rng() % 4, static_cast<char>(rng()));
        break;
      case 3:  // set a 32-bit word to an interesting value
        if (s.size() >= 4) {
          static const uint32_t v[] = {0, 1, 0x7fffffff, 0x80000000, 0xffffffff, 0x0fffffff, 0x10000000, 64};
          uint32_t w = v[rng() % (sizeof v / sizeof v[0])];
          memcpy(&s[(rng() % (s.size() - 3)) & ~size_t{3}], &w, 4);
        }
        break;
      case 4:  // duplicate a slice
        if (!s.empty()) {
          size_t a = rng() % s.size();
          size_t n = 1 + rng() % std::min<size_t>(64, s.size() - a);
          s.insert(rng() % s.size(), s.substr(a, n));
        }
        break;
      default:  // erase a slice
        if (!s.empty()) {
          size_t a = rng() % s.size();
          s.erase(a, 1 + rng() % std::min<size_t>(16, s.size() - a));
        }
        break;
    }
  }
}

}  // namespace

// Usage: driver [-seconds=N] [-seed=N] SEED_FILE_OR_DIR...
int main(int argc, char** argv) {
  if (LLVMFuzzerInitialize) LLVMFuzzerInitialize(&argc, &argv);
  double seconds = 3;
  uint64_t seed = 12345;
  std::vector<std::string> corpus;
  for (int i = 1; i < argc; ++i) {
    if (strncmp(argv[i], "-seconds=", 9) == 0) seconds = atof(argv[i] + 9);
    else if (strncmp(argv[i], "-seed=", 6) == 0) seed = strtoull(argv[i] + 6, nullptr, 10);
    else collect(argv[i], corpus);
  }
  if (corpus.empty()) corpus.emplace_back();
  for (const auto& c : corpus) LLVMFuzzerTestOneInput(reinterpret_cast<const uint8_t*>(c.data()), c.size());
  std::mt19937_64 rng(seed);
  auto end = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
  unsigned long runs = 0;
  while (std::chrono::steady_clock::now() < end) {
    for (int k = 0; k < 64; ++k, ++runs) {
      std::string s = corpus[rng() % corpus.size()];
      mutate(s, rng);
      LLVMFuzzerTestOneInput(reinterpret_cast<const uint8_t*>(s.data()), s.size());
    }
  }
  printf("%lu inputs, %zu seeds: no crash\n", runs + corpus.size(), corpus.size());
  return 0;
}
