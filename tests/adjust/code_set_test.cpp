// The plain-text test, code-set detection and the EUC conversions on real bytes.
#include <fcntl.h>
#include <iconv.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <string>

#include "adjust/code_set.h"
#include "tests/common/test_support.h"

namespace {

using kgtest::TempDir;
using kgtest::writeFile;

// "Nihongo" and a half-width katakana A in the three encodings.
const std::string kSjis = "x = \"\x93\xfa\x96\x7b\x8c\xea\xb1\";\n";
const std::string kEuc = "x = \"\xc6\xfc\xcb\xdc\xb8\xec\x8e\xb1\";\n";
const std::string kJis = "x = \"\x1b$B\x46\x7c\x4b\x5c\x38\x6c\x1b(B\";\n";

bool plainTextFile(const std::string& path) {
  int fd = open(path.c_str(), O_RDONLY);
  if (fd < 0) return false;
  bool text = isPlainText(fd);
  off_t pos = lseek(fd, 0, SEEK_CUR);
  close(fd);
  EXPECT_EQ(pos, 0);
  return text;
}

TEST(PlainTextTest, TenOddBytesInAHundredAreTooManyButNineAreNot) {
  TempDir dir;
  std::string nine = std::string(91, 'a') + std::string(9, '\x01');
  std::string ten = std::string(90, 'a') + std::string(5, '\x80') + std::string(5, '\x7f');
  writeFile(dir.file("nine"), nine);
  writeFile(dir.file("ten"), ten);
  EXPECT_TRUE(plainTextFile(dir.file("nine")));
  EXPECT_FALSE(plainTextFile(dir.file("ten")));
}

TEST(PlainTextTest, ANulByteNearTheStartMakesAnyFileBinary) {
  TempDir dir;
  writeFile(dir.file("nul"), std::string("int a;\0", 7) + std::string(2000, 'b'));
  writeFile(dir.file("late"), std::string(600, 'b') + std::string("\0", 1));
  writeFile(dir.file("empty"), "");
  writeFile(dir.file("controls"), "a\b\t\n\f\r\x1b" + std::string(10, 'z'));
  EXPECT_FALSE(plainTextFile(dir.file("nul")));
  EXPECT_TRUE(plainTextFile(dir.file("late")));
  EXPECT_TRUE(plainTextFile(dir.file("empty")));
  EXPECT_TRUE(plainTextFile(dir.file("controls")));
  EXPECT_FALSE(plainTextFile(dir.path()));  // a directory
}

TEST(CodeSetDetection, JapaneseEncodingsAreRecognised) {
  EXPECT_EQ(detectCodeSetOfBytes("int main() { return 0; }\n"), codeSetPlain);
  EXPECT_EQ(detectCodeSetOfBytes(kSjis), codeSetShiftJis);
  EXPECT_EQ(detectCodeSetOfBytes(kJis), codeSetJisNew);
  EXPECT_EQ(detectCodeSetOfBytes("a\x1b$@\x46\x7c\x1b(J\n"), codeSetJisOld);
  EXPECT_EQ(detectCodeSetOfBytes("a\x1bK\x46\x7c\x1bH\n"), codeSetJisNec);
  // Hiragana "a" then a kanji whose trail byte Shift-JIS cannot have.
  EXPECT_EQ(detectCodeSetOfBytes("\xa4\xa2\xb0\xfe\n"), codeSetEuc);
  EXPECT_EQ(detectCodeSetOfBytes("\xc6\xfc\xcb\xdc\n"), codeSetEuc);  // FC cannot follow a kana
  EXPECT_EQ(detectCodeSetOfBytes("\xb0\xa1\xb0\xa1\n"), codeSetEucOrSjis);
  // Terminal colours are not JIS.
  EXPECT_EQ(detectCodeSetOfBytes("\x1b[31mred\x1b[0m\n"), codeSetPlain);
  EXPECT_EQ(detectCodeSetOfBytes(std::string("a\0b", 3)), codeSetNotText);
}

TEST(CodeSetDetection, UnicodeTextIsNotMistakenForShiftJis) {
  // "Nihongo" in UTF-8 starts with E6 97 A5: a Shift-JIS lead and trail to a naive test.
  EXPECT_EQ(detectCodeSetOfBytes("// \xe6\x97\xa5\xe6\x9c\xac\xe8\xaa\x9e\nint x;\n"), codeSetPlain);
  EXPECT_EQ(detectCodeSetOfBytes("// caf\xc3\xa9\n"), codeSetPlain);
}

TEST(EucConversion, EveryJisX0208CellRoundTripsThroughShiftJisAndJis) {
  std::string euc;
  for (int a = 0xA1; a <= 0xFE; ++a) {
    for (int b = 0xA1; b <= 0xFE; ++b) {
      euc += static_cast<char>(a);
      euc += static_cast<char>(b);
    }
    euc += '\n';
  }
  for (int k = 0xA1; k <= 0xDF; ++k) {
    euc += '\x8e';
    euc += static_cast<char>(k);
  }
  std::string sjis, back;
  ASSERT_TRUE(eucToShiftJis(euc, sjis));
  ASSERT_TRUE(shiftJisToEuc(sjis, back));
  EXPECT_EQ(back, euc);
  std::string sjisAgain;
  ASSERT_TRUE(eucToShiftJis(back, sjisAgain));
  EXPECT_EQ(sjisAgain, sjis);
  for (std::uint32_t cs : {codeSetJisNew, codeSetJisOld, codeSetJisNec}) {
    std::string jis, euc2, jis2, escape;
    ASSERT_TRUE(eucToJis(euc, cs, "", jis));
    ASSERT_TRUE(jisToEuc(jis, euc2, &escape));
    EXPECT_EQ(euc2, euc);
    ASSERT_TRUE(eucToJis(euc2, cs, escape, jis2));
    EXPECT_EQ(jis2, jis);
  }
}

TEST(EucConversion, ShiftJisAgreesWithTheCLibraryForAssignedCharacters) {
  iconv_t cd = iconv_open("SHIFT_JIS", "EUC-JP");
  if (cd == reinterpret_cast<iconv_t>(-1)) GTEST_SKIP() << "no EUC-JP converter";
  int compared = 0;
  for (int a = 0xB0; a <= 0xF4; ++a) {  // the kanji rows
    for (int b = 0xA1; b <= 0xFE; ++b) {
      char in[2] = {static_cast<char>(a), static_cast<char>(b)};
      char out[8];
      char* ip = in;
      char* op = out;
      size_t il = 2, ol = sizeof out;
      iconv(cd, nullptr, nullptr, nullptr, nullptr);
      if (iconv(cd, &ip, &il, &op, &ol) == static_cast<size_t>(-1)) continue;  // unassigned
      std::string mine;
      ASSERT_TRUE(eucToShiftJis(std::string(in, 2), mine));
      ASSERT_EQ(mine, std::string(out, op - out)) << std::hex << a << " " << b;
      ++compared;
    }
  }
  iconv_close(cd);
  EXPECT_GT(compared, 6000);
}

TEST(EucConversion, BytesThatAreNotValidInTheSourceEncodingAreRefused) {
  std::string out;
  EXPECT_FALSE(shiftJisToEuc("ab\x81", out));         // lead without a trail
  EXPECT_FALSE(shiftJisToEuc("ab\x81\x7f", out));     // trail out of range
  EXPECT_FALSE(shiftJisToEuc("\xfa\x40", out));       // vendor extension without EUC form
  EXPECT_FALSE(jisToEuc("\x1b$B\x46", out));          // half a character
  EXPECT_FALSE(jisToEuc("caf\xe9", out));             // eight-bit byte in seven-bit text
  EXPECT_FALSE(eucToShiftJis("\x8f\xb0\xa1", out));   // JIS X 0212 has no Shift-JIS form
  EXPECT_TRUE(shiftJisToEuc(kSjis, out));
  EXPECT_EQ(out, kEuc);
  EXPECT_TRUE(jisToEuc(kJis, out));
  EXPECT_EQ(out, "x = \"\xc6\xfc\xcb\xdc\xb8\xec\";\n");
}

}  // namespace
