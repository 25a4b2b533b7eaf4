// Opening, showing and writing back source files the way the annotated source window does.
#include <dirent.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <utime.h>

#include <gtest/gtest.h>

#include <deque>
#include <string>
#include <vector>

#include "adjust/code_set.h"
#include "adjust/marker_comments.h"
#include "adjust/source_search_path.h"
#include "adjust/source_text.h"
#include "adjust/src_file.h"
#include "support/diagnostic.h"
#include "support/temp_file.h"
#include "tests/common/test_support.h"

namespace {

using kgtest::readFile;
using kgtest::TempDir;
using kgtest::writeFile;

const char* kPrompt = "Can't find source file \"%s\".  New name:";

// Answers the dialogs from a script and remembers what was asked.
class ScriptedPrompter : public SourcePrompter {
 public:
  std::deque<std::string> names;  // "" entries cancel
  std::deque<bool> continues;
  std::vector<std::string> asked;
  std::vector<std::string> questions;
  std::vector<std::string> errors;

  bool askFileName(const std::string& prompt, std::string& name) override {
    asked.push_back(prompt);
    if (names.empty() || names.front().empty()) {
      if (!names.empty()) names.pop_front();
      return false;
    }
    name = names.front();
    names.pop_front();
    return true;
  }
  bool askContinue(const std::string& message) override {
    questions.push_back(message);
    bool answer = continues.empty() ? false : continues.front();
    if (!continues.empty()) continues.pop_front();
    return answer;
  }
  void showError(const std::string& context, ErrorCode) override { errors.push_back(context); }
};

// A private temporary directory for the converted copies, checked for leftovers.
class SourceFiles : public ::testing::Test {
 protected:
  void SetUp() override {
    setenv("TMPDIR", tmp.path().c_str(), 1);
    kgResetTempDirectory();
    sourceSearchPath().clear();
  }
  void TearDown() override {
    unsetenv("TMPDIR");
    kgResetTempDirectory();
    sourceSearchPath().clear();
  }
  std::vector<std::string> temporaries() const {
    std::vector<std::string> names;
    DIR* d = opendir(tmp.path().c_str());
    while (dirent* e = d ? readdir(d) : nullptr) {
      std::string n = e->d_name;
      if (n != "." && n != "..") names.push_back(n);
    }
    if (d) closedir(d);
    return names;
  }
  std::vector<std::string> readAllLines(SrcFile& src) {
    std::vector<std::string> lines;
    std::string line;
    while (src.readLine(line)) lines.push_back(line);
    return lines;
  }
  // Reads the file, then writes the same display lines back to it.
  void showAndWriteBack(const std::string& path, std::vector<std::string>* shown = nullptr) {
    SrcFile src;
    ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
    std::vector<std::string> lines = readAllLines(src);
    if (shown) *shown = lines;
    src.closeReading();
    ASSERT_EQ(src.openForWriting(path, "Save as:", true, prompter), allOK);
    for (const std::string& l : lines) ASSERT_EQ(src.writeLine(l), allOK);
    ASSERT_EQ(src.finishWriting(), allOK);
  }

  TempDir tmp;
  TempDir dir;
  ScriptedPrompter prompter;
};

TEST_F(SourceFiles, AShiftJisFileIsShownFromAnEucCopyAndWrittenBackUnchanged) {
  const std::string sjis =
      "/* \x93\xfa\x96\x7b\x8c\xea */\nint x; // \xb1\xb2\n\nchar* s = \"\x83\x5c\";\n";
  std::string path = dir.file("jp.c");
  writeFile(path, sjis);
  SrcFile src;
  ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  EXPECT_EQ(src.fileCodeSet(), codeSetShiftJis);
  EXPECT_EQ(src.displayCodeSet(), codeSetEuc);
  ASSERT_EQ(temporaries().size(), 1u);
  EXPECT_EQ(temporaries()[0].rfind("kgXRd", 0), 0u);
  std::vector<std::string> lines = readAllLines(src);
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(lines[0], "/* \xc6\xfc\xcb\xdc\xb8\xec */");
  EXPECT_EQ(lines[1], "int x; // \x8e\xb1\x8e\xb2");
  EXPECT_EQ(lines[2], " ");
  src.closeReading();
  EXPECT_TRUE(temporaries().empty());
  ASSERT_EQ(src.openForWriting(path, "Save as:", true, prompter), allOK);
  ASSERT_EQ(temporaries().size(), 1u);
  EXPECT_EQ(temporaries()[0].rfind("kgXWr", 0), 0u);
  for (const std::string& l : lines) ASSERT_EQ(src.writeLine(l), allOK);
  ASSERT_EQ(src.finishWriting(), allOK);
  EXPECT_EQ(readFile(path), sjis);
  EXPECT_TRUE(temporaries().empty());
}

TEST_F(SourceFiles, IsoJisFilesOfEachVariantComeBackByteIdentical) {
  const std::string files[] = {
      "/* \x1b$B\x46\x7c\x4b\x5c\x38\x6c\x1b(B */\nint a;\n\x1b$B\x24\x22\x1b(B\n",
      "/* \x1b$@\x46\x7c\x1b(J ok */\n",
      "/* \x1bK\x46\x7c\x4b\x5c\x1bH */\n",
  };
  const std::uint32_t codeSets[] = {codeSetJisNew, codeSetJisOld, codeSetJisNec};
  for (int i = 0; i < 3; ++i) {
    std::string path = dir.file("jis" + std::to_string(i) + ".c");
    writeFile(path, files[i]);
    std::vector<std::string> shown;
    showAndWriteBack(path, &shown);
    EXPECT_EQ(readFile(path), files[i]) << i;
    ASSERT_FALSE(shown.empty());
    EXPECT_EQ(shown[0].substr(0, 5), "/* \xc6\xfc");
    SrcFile again;
    ASSERT_EQ(again.openForReading(path, kPrompt, 0, prompter), allOK);
    EXPECT_EQ(again.fileCodeSet(), codeSets[i]);
  }
}

TEST_F(SourceFiles, FormFeedsEmptyLinesAndOddCharactersHaveADisplayForm) {
  std::string path = dir.file("ff.c");
  writeFile(path, "a\n\f\n\nb\tc\r\nd\x01\x7f" "e\n" + std::string(40, '-') + "\nlast");
  SrcFile src;
  ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  EXPECT_EQ(readAllLines(src),
            (std::vector<std::string>{"a", "^L", " ", "b\tc\r", "d??e", std::string(40, '-'), "last"}));
  src.closeReading();
  // The form feed and the empty line survive a write-back.
  writeFile(path, "int a;\n\f\n\nint b;\n");
  showAndWriteBack(path);
  EXPECT_EQ(readFile(path), "int a;\n\f\n\nint b;\n");
}

TEST_F(SourceFiles, ANewerSourceAsksOnceAndDecliningAsksForAnotherName) {
  std::string path = dir.file("new.c");
  writeFile(path, "int a;\n");
  struct stat st;
  ASSERT_EQ(stat(path.c_str(), &st), 0);
  SrcFile src;
  prompter.continues = {false};
  prompter.names = {""};
  EXPECT_EQ(src.openForReading(path, kPrompt, static_cast<std::uint32_t>(st.st_mtime), prompter),
            noFileName);
  EXPECT_EQ(prompter.questions,
            std::vector<std::string>{"Source file has been modified since object file was compiled."});
  EXPECT_EQ(prompter.asked, std::vector<std::string>{"Can't find source file \"new.c\".  New name:"});
  EXPECT_EQ(src.state(), SrcFile::stateNew);

  SrcFile accepted;
  ScriptedPrompter yes;
  yes.continues = {true};
  EXPECT_EQ(accepted.openForReading(path, kPrompt, static_cast<std::uint32_t>(st.st_mtime), yes),
            allOK);
  SrcFile older;
  ScriptedPrompter none;
  EXPECT_EQ(older.openForReading(path, kPrompt, static_cast<std::uint32_t>(st.st_mtime) + 10, none),
            allOK);
  EXPECT_TRUE(none.questions.empty());
}

TEST_F(SourceFiles, AMissingFileIsFoundAlongTheUserPathOrByAskingTheUser) {
  TempDir src1, src2;
  writeFile(src2.file("util.c"), "int util;\n");
  std::string userpath = src1.path() + ":" + src2.path();
  initSourceSearchPath(&userpath);
  EXPECT_EQ(sourceSearchPath().back(), ".");
  SrcFile viaPath;
  ASSERT_EQ(viaPath.openForReading("/build/gone/util.c", kPrompt, 0, prompter), allOK);
  EXPECT_EQ(viaPath.foundName(), src2.file("util.c"));
  EXPECT_EQ(viaPath.requestedName(), "/build/gone/util.c");
  EXPECT_TRUE(prompter.asked.empty());

  TempDir elsewhere;
  writeFile(elsewhere.file("main.c"), "int main;\n");
  prompter.names = {"/no/such/main.c", elsewhere.file("main.c")};
  SrcFile viaUser;
  ASSERT_EQ(viaUser.openForReading("/build/gone/main.c", kPrompt, 0, prompter), allOK);
  EXPECT_EQ(viaUser.foundName(), elsewhere.file("main.c"));
  ASSERT_EQ(prompter.asked.size(), 2u);
  EXPECT_EQ(prompter.asked[1], "Can't find source file \"main.c\".  New name:");
  // The user's directory is searched from now on.
  writeFile(elsewhere.file("other.c"), "int other;\n");
  SrcFile next;
  EXPECT_EQ(next.openForReading("/build/gone/other.c", kPrompt, 0, prompter), allOK);
  EXPECT_EQ(prompter.asked.size(), 2u);
}

TEST_F(SourceFiles, BinaryFilesDevicesAndPipesAreRefusedWithoutHanging) {
  std::string bin = dir.file("a.out");
  writeFile(bin, std::string("\x7f" "ELF\0\0\0", 8));
  std::string fifo = dir.file("pipe.c");
  ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
  for (const std::string& path : {bin, fifo, dir.path()}) {
    ScriptedPrompter p;
    SrcFile src;
    EXPECT_EQ(src.openForReading(path, kPrompt, 0, p), noFileName) << path;
    EXPECT_EQ(p.errors, std::vector<std::string>{"File is not a plain text file"});
    EXPECT_EQ(p.asked.size(), 1u);
  }
}

TEST_F(SourceFiles, OperationsOutOfTurnAreRefused) {
  std::string path = dir.file("s.c");
  writeFile(path, "x\n");
  SrcFile src;
  EXPECT_EQ(src.writeLine("x"), fileWriteFailed);
  EXPECT_EQ(src.finishWriting(), errorOccured);
  EXPECT_EQ(src.openForWriting(path, "", true, prompter), errorOccured);
  ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  EXPECT_EQ(src.openForReading(path, kPrompt, 0, prompter), errorOccured);
  src.closeReading();
  EXPECT_EQ(src.state(), SrcFile::stateClosed);
}

TEST_F(SourceFiles, AnAnnotatedCopyGoesToTheNameTheUserChoosesAndKeepsTheSource) {
  std::string path = dir.file("s.c");
  writeFile(path, "x\n");
  SrcFile src;
  ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  src.closeReading();
  prompter.names = {dir.file("no/such/dir/out.txt"), dir.file("out.txt")};
  ASSERT_EQ(src.openForWriting(path, "Write listing to:", false, prompter), allOK);
  EXPECT_EQ(src.outputName(), dir.file("out.txt"));
  EXPECT_EQ(src.writeLine("    1  x"), allOK);
  EXPECT_EQ(src.finishWriting(), allOK);
  EXPECT_EQ(readFile(dir.file("out.txt")), "    1  x\n");
  EXPECT_EQ(readFile(path), "x\n");
  // Writing through a symbolic link replaces the file it points at, not the link.
  ASSERT_EQ(symlink(path.c_str(), dir.file("link.c").c_str()), 0);
  ASSERT_EQ(src.openForWriting(dir.file("link.c"), "", true, prompter), allOK);
  EXPECT_EQ(src.writeLine("y"), allOK);
  EXPECT_EQ(src.finishWriting(), allOK);
  EXPECT_EQ(readFile(path), "y\n");
  struct stat st;
  ASSERT_EQ(lstat(dir.file("link.c").c_str(), &st), 0);
  EXPECT_TRUE(S_ISLNK(st.st_mode));
}

// In a child process whose files may not grow beyond `limit` bytes (a full disk): reads
// the file and writes it back. Returns the child's exit status: 0 when the write failed
// with fileWriteFailed, 1 when it succeeded, 2 on a set-up problem.
int writeBackOnFullDisk(const std::string& path, rlim_t limit) {
  pid_t pid = fork();
  if (pid == 0) {
    signal(SIGXFSZ, SIG_IGN);
    struct rlimit rl = {limit, limit};
    if (setrlimit(RLIMIT_FSIZE, &rl) != 0) _exit(2);
    ScriptedPrompter p;
    SrcFile src;
    if (src.openForReading(path, kPrompt, 0, p) != allOK) _exit(2);
    std::vector<std::string> lines;
    std::string l;
    while (src.readLine(l)) lines.push_back(l + " /* kestrel: deadcode */");
    src.closeReading();
    if (src.openForWriting(path, "", true, p) != allOK) _exit(2);
    ErrorCode rc = allOK;
    for (const std::string& line : lines) {
      if (src.writeLine(line) != allOK) rc = fileWriteFailed;
    }
    ErrorCode fin = src.finishWriting();
    _exit(fin == fileWriteFailed && (rc == allOK || rc == fileWriteFailed) ? 0 : 1);
  }
  int status = 0;
  waitpid(pid, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 3;
}

TEST_F(SourceFiles, AWriteBackThatRunsOutOfSpaceLeavesTheSourceIntact) {
  std::string text;
  for (int i = 0; i < 4000; ++i) text += "int line" + std::to_string(i) + ";\n";
  std::string plain = dir.file("big.c");
  writeFile(plain, text);
  EXPECT_EQ(writeBackOnFullDisk(plain, 20000), 0);
  EXPECT_EQ(readFile(plain), text);

  std::string sjis = dir.file("big_sjis.c");
  std::string jtext;
  for (int i = 0; i < 4000; ++i) jtext += "// \x93\xfa\x96\x7b " + std::to_string(i) + "\n";
  writeFile(sjis, jtext);
  // Room for the converted copy that is shown, not for the edited text.
  EXPECT_EQ(writeBackOnFullDisk(sjis, 100000), 0);
  EXPECT_EQ(readFile(sjis), jtext);
  // Nothing is left behind in the directory but the two sources.
  std::vector<std::string> names;
  DIR* d = opendir(dir.path().c_str());
  while (dirent* e = readdir(d)) {
    if (e->d_name[0] != '.') names.push_back(e->d_name);
  }
  closedir(d);
  EXPECT_EQ(names.size(), 2u);
}

TEST_F(SourceFiles, AnEditedLineThatShiftJisCannotHoldFailsTheWriteAndKeepsTheFile) {
  std::string path = dir.file("jp.c");
  const std::string sjis = "// \x93\xfa\n";
  writeFile(path, sjis);
  SrcFile src;
  ASSERT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  src.closeReading();
  ASSERT_EQ(src.openForWriting(path, "", true, prompter), allOK);
  EXPECT_EQ(src.writeLine("// \x8f\xb0\xa1"), allOK);  // a JIS X 0212 character
  EXPECT_EQ(src.finishWriting(), fileWriteFailed);
  EXPECT_NE(pendingSystemError().find("Translating from EUC"), std::string::npos);
  EXPECT_EQ(readFile(path), sjis);
  EXPECT_TRUE(temporaries().empty());
}

// What the window does: the text as its bytes, one marker edited, saved in place.
std::string editOneLineAndSave(const std::string& path, std::size_t line, CvgAdjust kind,
                               SourcePrompter& prompter, std::vector<std::string>* display = nullptr) {
  SrcFile src;
  SourceText text;
  EXPECT_EQ(src.openForReading(path, kPrompt, 0, prompter), allOK);
  EXPECT_EQ(text.read(src), allOK);
  src.closeReading();
  if (display) {
    for (std::size_t n = 1; n <= text.lineCount(); ++n)
      display->push_back(sourceDisplayForm(text.view(n), src.displayCodeSet()));
  }
  CvgAdjustSet set;
  editAdjustmentLine(text, line, kind, set);
  EXPECT_TRUE(text.edited(line));
  EXPECT_EQ(src.openForWriting(path, "Write source to file:", true, prompter), allOK);
  EXPECT_EQ(text.write(src), allOK);
  EXPECT_EQ(src.finishWriting(), allOK);
  return text.line(line);
}

TEST_F(SourceFiles, SavingAfterOneEditChangesOnlyThatLinesMarker) {
  // UTF-8, Latin-1 bytes, a 20,000-byte line, CRLF ends, a form feed, a single blank, an empty
  // line, a C1 control, and no newline at the end: all of it must come back as it was.
  const std::string longLine = "static const char k[] = \"" + std::string(20000 - 27, 'x') + "\";";
  ASSERT_EQ(longLine.size(), 20000u);
  const std::vector<std::string> lines = {
      "/* Gr\xc3\xbc\xc3\x9f dich, \xe2\x82\xac and \xf0\x9f\x98\x80 */",
      "// Latin-1: caf\xe9 na\xefve",
      longLine,
      "int covered(void) {\r",
      "  return 1;\r",
      "}\r",
      "\f",
      " ",
      "",
      "// bell \x07 and C1 \xc2\x85 here",
      "int last(void) { return 0; }",
  };
  std::string original;
  for (std::size_t i = 0; i < lines.size(); ++i) original += lines[i] + (i + 1 < lines.size() ? "\n" : "");
  const std::string path = dir.file("mixed.c");
  writeFile(path, original);
  ASSERT_EQ(chmod(path.c_str(), 0640), 0);
  // "\xefv" looks like Shift-JIS, but the rest cannot be converted: the file opens as it is.
  SrcFile probe;
  ASSERT_EQ(probe.openForReading(path, kPrompt, 0, prompter), allOK);
  EXPECT_EQ(probe.fileCodeSet(), codeSetPlain);
  EXPECT_TRUE(temporaries().empty());
  probe.closeReading();

  std::vector<std::string> shown;
  const std::string edited = editOneLineAndSave(path, 5, adjLineDead, prompter, &shown);
  EXPECT_EQ(edited, "  return 1; /* kestrel: deadcode */");
  std::string want;
  for (std::size_t i = 0; i < lines.size(); ++i) {
    want += i == 4 ? "  return 1; /* kestrel: deadcode */\r" : lines[i];
    want += i + 1 < lines.size() ? "\n" : "";
  }
  EXPECT_EQ(readFile(path), want);
  struct stat st;
  ASSERT_EQ(stat(path.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 07777, 0640u);

  // On screen: UTF-8 as its characters; Latin-1 bytes and controls as "?"; the whole long line.
  ASSERT_EQ(shown.size(), lines.size());
  EXPECT_EQ(shown[0], lines[0]);
  EXPECT_EQ(shown[1], "// Latin-1: caf? na?ve");
  EXPECT_EQ(shown[2], longLine);
  EXPECT_EQ(shown[3], "int covered(void) {");
  EXPECT_EQ(shown[6], "^L");
  EXPECT_EQ(shown[7], " ");
  EXPECT_EQ(shown[8], " ");
  EXPECT_EQ(shown[9], "// bell ? and C1 ?? here");

  // Taking the marker off again gives the file back exactly.
  editOneLineAndSave(path, 5, 0, prompter);
  EXPECT_EQ(readFile(path), original);
  EXPECT_TRUE(temporaries().empty());
}

TEST_F(SourceFiles, AShiftJisFileEditedAsItsBytesComesBackUnchangedElsewhere) {
  const std::string sjis = "/* \x93\xfa\x96\x7b\x8c\xea */\r\nint x; // \xb1\xb2\r\nint y;";
  const std::string path = dir.file("jp.c");
  writeFile(path, sjis);
  editOneLineAndSave(path, 3, adjLineInspected, prompter);
  EXPECT_EQ(readFile(path),
            "/* \x93\xfa\x96\x7b\x8c\xea */\r\nint x; // \xb1\xb2\r\nint y; /* kestrel: inspected */");
  EXPECT_TRUE(temporaries().empty());
}

}  // namespace
