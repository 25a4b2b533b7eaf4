// Text tests and Japanese code sets of source files: detection, and conversion to and from
// EUC for Shift-JIS and the three JIS (ISO-2022) variants.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

enum : std::uint32_t {
  codeSetNotText = 0,
  codeSetPlain = 1,       // ASCII or undetermined
  codeSetJisNew = 2,      // kanji introduced by ESC $ B
  codeSetJisOld = 3,      // kanji introduced by ESC $ @
  codeSetJisNec = 4,      // kanji introduced by ESC K
  codeSetEuc = 5,
  codeSetShiftJis = 6,
  codeSetEucOrSjis = 7,   // could be either; shown as it is
};

// Whether the text in this code set must be converted to EUC for display.
bool codeSetNeedsConversion(std::uint32_t codeSet);

// The plain-text test of the first 512 bytes of an open file (its position is unchanged):
// a regular file without NUL bytes in which more than nine bytes in ten are ordinary.
bool isPlainText(int fd);
bool isPlainTextBytes(std::string_view head);
// The same test for files this program writes itself, whose text may name paths in any
// script: bytes of valid UTF-8 count as ordinary. `truncated`: the head was cut from a
// longer text, so a character cut off at its end is no fault.
bool isPlainTextOrUtf8Bytes(std::string_view head, bool truncated);
// Text in any encoding: no NUL and few odd control bytes; bytes with the high bit set are
// not counted at all.
bool isTextInAnyEncoding(std::string_view head);

// The code set of an open file (its position is unchanged); codeSetNotText for anything that
// is not a readable regular text file. Multi-byte text is allowed here, unlike isPlainText.
std::uint32_t detectCodeSet(int fd);
std::uint32_t detectCodeSetOfBytes(std::string_view bytes);

// Conversions of whole texts; false when the input holds a sequence the target cannot express
// (the output is then incomplete and must not be used).
bool shiftJisToEuc(std::string_view in, std::string& out);
bool eucToShiftJis(std::string_view in, std::string& out);
// JIS to EUC; `asciiEscape` receives the first escape sequence that returns to one-byte text,
// so that writing back can use the same one.
bool jisToEuc(std::string_view in, std::string& out, std::string* asciiEscape = nullptr);
// EUC to the JIS variant of the code set (2, 3 or 4); an empty asciiEscape takes the usual
// one of the variant.
bool eucToJis(std::string_view in, std::uint32_t codeSet, const std::string& asciiEscape,
              std::string& out);
