// Resolving the paths of named files: real paths, fallbacks and the automount prefix.
#include "coverage/kgv_file_ref.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include "support/runtime_options.h"
#include "tests/common/test_support.h"

namespace {

class CwdGuard {
 public:
  explicit CwdGuard(const std::string& dir) {
    char buf[4096];
    saved_ = getcwd(buf, sizeof buf) ? buf : "/";
    EXPECT_EQ(chdir(dir.c_str()), 0);
  }
  ~CwdGuard() { (void)!chdir(saved_.c_str()); }

 private:
  std::string saved_;
};

}  // namespace

TEST(FilePaths, ExistingFileAndSymlinkResolveToTheSamePath) {
  kgtest::TempDir dir;
  kgtest::writeFile(dir.file("a.kgv"), "x");
  ASSERT_EQ(symlink(dir.file("a.kgv").c_str(), dir.file("link.kgv").c_str()), 0);
  std::string real = resolveFilePath(dir.file("a.kgv"));
  EXPECT_EQ(resolveFilePath(dir.file("link.kgv")), real);
  EXPECT_EQ(resolveFilePath(dir.path() + "/./sub/../a.kgv"), real);

  std::vector<KgvFileRef> list{makeKgvFileRef(dir.file("a.kgv"))};
  EXPECT_EQ(findKgvFileRef(list, resolveFilePath(dir.file("link.kgv"))), 0);
  EXPECT_EQ(findKgvFileRef(list, "/no/such"), -1);
}

TEST(FilePaths, MissingFilesAreMadeAbsoluteAndNormalised) {
  kgtest::TempDir dir;
  std::string real = resolveFilePath(dir.path());
  CwdGuard cwd(dir.path());
  EXPECT_EQ(resolveFilePath("./././missing.kgv"), real + "/missing.kgv");
  EXPECT_EQ(normalizePath("/a//b/./c/."), "/a/b/c");
  EXPECT_EQ(normalizePath("/a/b/../c"), "/a/c");
  EXPECT_EQ(normalizePath("/a/b/.."), "/a");
  EXPECT_EQ(normalizePath("/a/.."), "/");
}

TEST(FilePaths, DotDotAfterASymlinkFollowsTheLink) {
  kgtest::TempDir dir;
  ASSERT_EQ(mkdir(dir.file("real").c_str(), 0755), 0);
  ASSERT_EQ(mkdir(dir.file("real/inner").c_str(), 0755), 0);
  ASSERT_EQ(symlink(dir.file("real/inner").c_str(), dir.file("alias").c_str()), 0);
  // alias/.. is "real", not the directory that holds the link.
  std::string base = resolveFilePath(dir.path());
  EXPECT_EQ(normalizePath(base + "/alias/../missing.kgv"), base + "/real/missing.kgv");
}

TEST(FilePaths, AnyNumberOfDotDotStepsResolvesWithoutStoppingTheProgram) {
  // A path from a data or adjustments file may hold hundreds of them.
  std::string path = "/src";
  for (int i = 0; i < 300; ++i) path += "/d/..";
  EXPECT_EQ(normalizePath(path + "/a.c"), "/src/a.c");
  EXPECT_EQ(resolveFilePath(path + "/../x.c"), "/x.c");
  // The regression input the adjustments reader's fuzz target found reads like any file.
  const std::string found = kgtest::readFile(kgtest::sourceDir() +
                                             "/fuzz/regressions/adjustments_reader_fuzz/fifty-one-dotdot-steps.adjust");
  EXPECT_NE(found.find("/../"), std::string::npos);
}

TEST(FilePaths, AutomountPrefixIsTranslated) {
  resetRuntimeOptions();
  EXPECT_STREQ(translateAutoMountPath("/tmp_mnt/home/a.kgv"), "/home/a.kgv");
  EXPECT_STREQ(translateAutoMountPath("/home/a.kgv"), "/home/a.kgv");
  setStringOption(AUTO_MOUNT_PREFIX, "/net:/n");
  EXPECT_STREQ(translateAutoMountPath("/net/x"), "/n/x");
  EXPECT_EQ(makeKgvFileRef("/net/none/such.kgv").resolvedName, "/n/none/such.kgv");
  EXPECT_EQ(translateAutoMountPath(nullptr), nullptr);
  resetRuntimeOptions();
}
