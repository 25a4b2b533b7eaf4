// Code-set detection and the JIS X 0208 mappings between EUC, Shift-JIS and JIS.
#include "adjust/code_set.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

// Detection over a sample of the file; `truncated` when the file goes on beyond it.
static std::uint32_t detectCodeSetOfSample(std::string_view bytes, bool truncated);

namespace {

constexpr unsigned char kEsc = 0x1B;
constexpr unsigned char kSs2 = 0x8E;  // EUC prefix of a half-width katakana

bool inRange(unsigned c, unsigned lo, unsigned hi) { return c >= lo && c <= hi; }

bool isSjisTrail(unsigned c) { return inRange(c, 0x40, 0x7E) || inRange(c, 0x80, 0xFC); }
bool isSjisLead(unsigned c) { return inRange(c, 0x81, 0x9F) || inRange(c, 0xE0, 0xEF); }
bool isEucByte(unsigned c) { return inRange(c, 0xA1, 0xFE); }

// Reads up to `limit` bytes from offset 0 without moving the file position.
bool readHead(int fd, std::string& out, size_t limit) {
  out.clear();
  char buf[65536];
  off_t offset = 0;
  while (out.size() < limit) {
    size_t want = limit - out.size() < sizeof buf ? limit - out.size() : sizeof buf;
    ssize_t n = pread(fd, buf, want, offset);
    if (n < 0) {
      if (errno == EINTR) continue;
      return false;
    }
    if (n == 0) break;
    out.append(buf, static_cast<size_t>(n));
    offset += n;
  }
  return true;
}

bool isRegular(int fd) {
  struct stat st;
  return fstat(fd, &st) == 0 && S_ISREG(st.st_mode);
}

// Odd single bytes for the text tests: control characters other than backspace, tab,
// newline, form feed, carriage return and escape, and DEL.
bool isOddControl(unsigned c) {
  if (c == 127) return true;
  return c < 32 && c != 8 && c != 9 && c != 10 && c != 12 && c != 13 && c != 27;
}

// Valid UTF-8 holding at least one multi-byte character. Such a file is today's ordinary
// text and must not be taken for Shift-JIS or EUC, whose byte patterns it can resemble.
bool isMultiByteUtf8(std::string_view s, bool truncated) {
  bool multi = false;
  for (size_t i = 0; i < s.size();) {
    unsigned c = static_cast<unsigned char>(s[i]);
    size_t len;
    unsigned min;
    if (c < 0x80) {
      ++i;
      continue;
    } else if (inRange(c, 0xC2, 0xDF)) {
      len = 2, min = 0x80;
    } else if (inRange(c, 0xE0, 0xEF)) {
      len = 3, min = 0x800;
    } else if (inRange(c, 0xF0, 0xF4)) {
      len = 4, min = 0x10000;
    } else {
      return false;
    }
    if (i + len > s.size()) return truncated && multi;  // cut off by the sample's end
    unsigned cp = c & (0xFF >> (len + 1));
    for (size_t k = 1; k < len; ++k) {
      unsigned t = static_cast<unsigned char>(s[i + k]);
      if ((t & 0xC0) != 0x80) return false;
      cp = (cp << 6) | (t & 0x3F);
    }
    if (cp < min || cp > 0x10FFFF || inRange(cp, 0xD800, 0xDFFF)) return false;
    multi = true;
    i += len;
  }
  return multi;
}

}  // namespace

bool codeSetNeedsConversion(std::uint32_t codeSet) {
  return codeSet == codeSetJisNew || codeSet == codeSetJisOld || codeSet == codeSetJisNec ||
         codeSet == codeSetShiftJis;
}

bool isPlainTextBytes(std::string_view head) {
  size_t odd = 0;
  for (unsigned char c : head) {
    if (c == 0) return false;
    if (c >= 128 || isOddControl(c)) ++odd;
  }
  return head.size() > 10 * odd || head.empty();
}

bool isTextInAnyEncoding(std::string_view head) {
  size_t odd = 0;
  for (unsigned char c : head) {
    if (c == 0) return false;
    if (isOddControl(c)) ++odd;
  }
  return head.size() > 10 * odd || head.empty();
}

bool isPlainTextOrUtf8Bytes(std::string_view head, bool truncated) {
  if (isPlainTextBytes(head)) return true;
  return isTextInAnyEncoding(head) && isMultiByteUtf8(head, truncated);
}

bool isPlainText(int fd) {
  if (!isRegular(fd)) return false;
  std::string head;
  if (!readHead(fd, head, 512)) return false;
  return isPlainTextBytes(head);
}

std::uint32_t detectCodeSetOfBytes(std::string_view b) { return detectCodeSetOfSample(b, false); }

static std::uint32_t detectCodeSetOfSample(std::string_view b, bool truncated) {
  // The text test that comes first: no NUL and few odd control bytes near the start;
  // bytes with the high bit set are the multi-byte text this test must let through.
  std::string_view head = b.substr(0, 512);
  size_t odd = 0;
  for (unsigned char c : head) {
    if (c == 0) return codeSetNotText;
    if (isOddControl(c)) ++odd;
  }
  if (!head.empty() && head.size() <= 10 * odd) return codeSetNotText;
  if (isMultiByteUtf8(b, truncated)) return codeSetPlain;

  std::uint32_t result = codeSetPlain;
  const size_t n = b.size();
  auto at = [&](size_t i) -> unsigned { return i < n ? static_cast<unsigned char>(b[i]) : 0x100; };
  size_t i = 0;
  while (i < n && (result == codeSetPlain || result == codeSetEucOrSjis)) {
    unsigned c = at(i);
    unsigned d = at(i + 1);
    if (c == kEsc) {
      if (d == '$' && at(i + 2) == 'B') {
        result = codeSetJisNew;
      } else if (d == '$' && at(i + 2) == '@') {
        result = codeSetJisOld;
      } else if (d == 'K') {
        result = codeSetJisNec;
      }
      ++i;
    } else if (inRange(c, 0x81, 0x8D) || inRange(c, 0x8F, 0x9F)) {
      if (isSjisTrail(d)) result = codeSetShiftJis;
      ++i;
    } else if (c == kSs2) {
      if (inRange(d, 0x40, 0x7E) || inRange(d, 0x80, 0xA0) || inRange(d, 0xE0, 0xFC)) {
        result = codeSetShiftJis;
      } else if (inRange(d, 0xA1, 0xDF)) {
        result = codeSetEucOrSjis;
        ++i;
      }
      ++i;
    } else if (inRange(c, 0xA1, 0xDF)) {
      // EUC lead, or a Shift-JIS half-width katakana standing alone.
      if (inRange(d, 0xF0, 0xFE)) {
        result = codeSetEuc;
      } else if (inRange(d, 0xA1, 0xDF)) {
        result = codeSetEucOrSjis;
        ++i;
      } else if (inRange(d, 0xE0, 0xEF)) {
        result = codeSetEucOrSjis;
      } else if (d <= 0xA0) {
        result = codeSetShiftJis;
      }
      ++i;
    } else if (inRange(c, 0xF0, 0xFE)) {
      result = codeSetEuc;
      ++i;
    } else if (inRange(c, 0xE0, 0xEF)) {
      if (inRange(d, 0x40, 0x7E) || inRange(d, 0x80, 0xA0)) {
        result = codeSetShiftJis;
      } else if (inRange(d, 0xFD, 0xFE)) {
        result = codeSetEuc;
      } else if (inRange(d, 0xA1, 0xFC)) {
        result = codeSetEucOrSjis;
        ++i;
      }
      ++i;
    } else {
      ++i;
    }
  }
  return result;
}

std::uint32_t detectCodeSet(int fd) {
  if (!isRegular(fd)) return codeSetNotText;
  // A sample of the first 64 MiB decides for any larger file, keeping memory bounded.
  constexpr size_t kSample = size_t{64} << 20;
  std::string sample;
  if (!readHead(fd, sample, kSample + 1)) return codeSetNotText;
  bool truncated = sample.size() > kSample;
  if (truncated) sample.resize(kSample);
  return detectCodeSetOfSample(sample, truncated);
}

bool shiftJisToEuc(std::string_view in, std::string& out) {
  out.clear();
  out.reserve(in.size() + in.size() / 8);
  for (size_t i = 0; i < in.size(); ++i) {
    unsigned c = static_cast<unsigned char>(in[i]);
    if (c < 0x80) {
      out += static_cast<char>(c);
    } else if (inRange(c, 0xA1, 0xDF)) {
      out += static_cast<char>(kSs2);
      out += static_cast<char>(c);
    } else if (isSjisLead(c) && i + 1 < in.size() &&
               isSjisTrail(static_cast<unsigned char>(in[i + 1]))) {
      unsigned t = static_cast<unsigned char>(in[++i]);
      // Two JIS rows share one Shift-JIS lead byte: trails below 0x9F are the odd row.
      unsigned adjust = t < 0x9F ? 1 : 0;
      unsigned row = ((c - (c < 0xA0 ? 0x70 : 0xB0)) << 1) - adjust;
      unsigned cell = t - (adjust ? (t > 0x7F ? 0x20 : 0x1F) : 0x7E);
      out += static_cast<char>(row | 0x80);
      out += static_cast<char>(cell | 0x80);
    } else {
      return false;
    }
  }
  return true;
}

bool eucToShiftJis(std::string_view in, std::string& out) {
  out.clear();
  out.reserve(in.size());
  for (size_t i = 0; i < in.size(); ++i) {
    unsigned c = static_cast<unsigned char>(in[i]);
    if (c < 0x80) {
      out += static_cast<char>(c);
    } else if (c == kSs2 && i + 1 < in.size() &&
               inRange(static_cast<unsigned char>(in[i + 1]), 0xA1, 0xDF)) {
      out += in[++i];
    } else if (isEucByte(c) && i + 1 < in.size() &&
               isEucByte(static_cast<unsigned char>(in[i + 1]))) {
      unsigned row = c & 0x7F;
      unsigned cell = static_cast<unsigned char>(in[++i]) & 0x7F;
      unsigned lead = ((row + 1) >> 1) + (row < 0x5F ? 0x70 : 0xB0);
      unsigned trail = cell + ((row & 1) ? (cell > 0x5F ? 0x20 : 0x1F) : 0x7E);
      out += static_cast<char>(lead);
      out += static_cast<char>(trail);
    } else {
      return false;
    }
  }
  return true;
}

bool jisToEuc(std::string_view in, std::string& out, std::string* asciiEscape) {
  enum { ascii, kanji, kana } mode = ascii;
  out.clear();
  out.reserve(in.size());
  for (size_t i = 0; i < in.size(); ++i) {
    unsigned c = static_cast<unsigned char>(in[i]);
    if (c == kEsc) {
      std::string_view rest = in.substr(i + 1);
      size_t len = 0;
      if (rest.starts_with("$B") || rest.starts_with("$@")) {
        mode = kanji, len = 2;
      } else if (rest.starts_with("K")) {
        mode = kanji, len = 1;
      } else if (rest.starts_with("(B") || rest.starts_with("(J") || rest.starts_with("(H")) {
        mode = ascii, len = 2;
      } else if (rest.starts_with("H")) {
        mode = ascii, len = 1;
      } else if (rest.starts_with("(I")) {
        mode = kana, len = 2;
      }
      if (len) {
        if (mode == ascii && asciiEscape && asciiEscape->empty()) {
          *asciiEscape = std::string(in.substr(i, len + 1));
        }
        i += len;
        continue;
      }
      out += static_cast<char>(c);  // some other escape sequence: part of the text
      continue;
    }
    if (c >= 0x80) return false;  // JIS text is seven-bit
    if (mode == kanji && inRange(c, 0x21, 0x7E)) {
      if (i + 1 >= in.size()) return false;
      unsigned d = static_cast<unsigned char>(in[++i]);
      if (!inRange(d, 0x21, 0x7E)) return false;
      out += static_cast<char>(c | 0x80);
      out += static_cast<char>(d | 0x80);
    } else if (mode == kana && inRange(c, 0x21, 0x5F)) {
      out += static_cast<char>(kSs2);
      out += static_cast<char>(c | 0x80);
    } else {
      out += static_cast<char>(c);
    }
  }
  return true;
}

bool eucToJis(std::string_view in, std::uint32_t codeSet, const std::string& asciiEscape,
              std::string& out) {
  const char* kanjiIn = codeSet == codeSetJisOld   ? "\x1b$@"
                        : codeSet == codeSetJisNec ? "\x1bK"
                                                   : "\x1b$B";
  std::string toAscii = asciiEscape;
  if (toAscii.empty()) {
    toAscii = codeSet == codeSetJisOld ? "\x1b(J" : codeSet == codeSetJisNec ? "\x1bH" : "\x1b(B";
  }
  enum { ascii, kanji, kana } mode = ascii;
  out.clear();
  out.reserve(in.size() + 16);
  for (size_t i = 0; i < in.size(); ++i) {
    unsigned c = static_cast<unsigned char>(in[i]);
    if (c < 0x80) {
      if (mode != ascii) out += toAscii;
      mode = ascii;
      out += static_cast<char>(c);
    } else if (c == kSs2 && i + 1 < in.size() &&
               inRange(static_cast<unsigned char>(in[i + 1]), 0xA1, 0xDF)) {
      if (mode != kana) out += "\x1b(I";
      mode = kana;
      out += static_cast<char>(in[++i] & 0x7F);
    } else if (isEucByte(c) && i + 1 < in.size() &&
               isEucByte(static_cast<unsigned char>(in[i + 1]))) {
      if (mode != kanji) out += kanjiIn;
      mode = kanji;
      out += static_cast<char>(c & 0x7F);
      out += static_cast<char>(in[++i] & 0x7F);
    } else {
      return false;
    }
  }
  if (mode != ascii) out += toAscii;
  return true;
}
