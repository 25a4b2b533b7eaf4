// Cell formatting for the summary outline and its headings.
#include "summary/cell_format.h"

#include <charconv>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <string_view>

namespace {

constexpr unsigned kLimit = 1024;

// The text as far as the limit, without copying it.
std::string_view limited(const char* text) {
  if (text == nullptr) return {};
  return std::string_view(text, strnlen(text, kLimit));
}

// Cells are formatted by the ten thousand when a large outline opens: build each result in place.
std::string padded(std::string_view before, std::string_view text, std::string_view after) {
  std::string out;
  out.reserve(before.size() + text.size() + after.size());
  out.append(before).append(text).append(after);
  return out;
}

std::string fills(std::size_t n, char fill) { return std::string(n, fill); }

// An unsigned value's decimal digits in buf, as printf's "%u" gives them.
std::string_view decimal(char (&buf)[32], std::uint32_t value) {
  auto r = std::to_chars(buf, buf + sizeof buf, value);
  return std::string_view(buf, static_cast<std::size_t>(r.ptr - buf));
}

bool gNowKnown = false;
std::uint32_t gNow = 0;

}  // namespace

namespace {

std::string right(std::string_view t, unsigned width, char fill) {
  if (width > kLimit) width = kLimit;
  if (t.size() >= width) return std::string(t);
  std::string out(width, fill);
  out.replace(width - t.size(), t.size(), t);
  return out;
}

}  // namespace

std::string justify_right(const char* text, unsigned width, char fill) { return right(limited(text), width, fill); }

std::string justify_left(const char* text, unsigned width, char fill) {
  std::string_view t = limited(text);
  if (width > kLimit) width = kLimit;
  if (t.size() >= width) return std::string(t);
  return padded({}, t, fills(width - t.size(), fill));
}

std::string justify_centre(const char* text, unsigned width, char fill) {
  std::string_view t = limited(text);
  if (width > kLimit) width = kLimit;
  if (t.size() >= width) return std::string(t);
  size_t before = (width - t.size()) / 2;
  return padded(fills(before, fill), t, fills(width - t.size() - before, fill));
}

std::string format_count(unsigned width, std::uint32_t value) {
  char buf[32];
  return right(decimal(buf, value), width, ' ');
}

std::string format_small_count(unsigned width, std::uint32_t value) {
  std::uint32_t low = value & 0xffff;
  if (low > 9999) return justify_right("10K+", width);
  return format_count(width, low);
}

std::string format_percent(unsigned width, std::uint32_t part, std::uint32_t whole) {
  if (whole == 0) return justify_right("-- ", width);
  if (part == whole) return justify_right("100%", width);
  char buf[32];
  double pct = static_cast<double>(part) * 100.0 / static_cast<double>(whole);
  // A part far above its whole (damaged data) still fits: no narrowing to int.
  auto r = std::to_chars(buf, buf + sizeof buf - 1, static_cast<long long>(pct));
  *r.ptr++ = '%';
  return right(std::string_view(buf, static_cast<std::size_t>(r.ptr - buf)), width, ' ');
}

std::string format_elapsed(unsigned width, std::uint32_t tenths) {
  unsigned s = tenths / 10, t = tenths % 10, d = 0, h = 0, m = 0;
  if (s >= 86400) {
    d = s / 86400;
    s %= 86400;
  }
  if (s >= 3600) {
    h = s / 3600;
    s %= 3600;
  }
  if (s >= 60) {
    m = s / 60;
    s %= 60;
  }
  char buf[64];
  if (d != 0) snprintf(buf, sizeof buf, "%u %02u:%02u:%02u.%u", d, h, m, s, t);
  else if (h != 0) snprintf(buf, sizeof buf, "%u:%02u:%02u.%u", h, m, s, t);
  else snprintf(buf, sizeof buf, "%u:%02u.%u", m, s, t);
  return justify_right(buf, width);
}

void set_format_date_now(std::uint32_t now) {
  gNow = now;
  gNowKnown = true;
}

std::string format_date(unsigned width, std::uint32_t seconds) {
  if (!gNowKnown) set_format_date_now(static_cast<std::uint32_t>(time(nullptr)));
  time_t value = static_cast<time_t>(seconds);
  struct tm tmv {};
  localtime_r(&value, &tmv);
  // A value in the future wraps to a huge age, so it shows the year too.
  std::uint32_t age = gNow - seconds;
  char buf[64];
  strftime(buf, sizeof buf, age < 15552001u ? "%m/%d %H:%M" : "%m/%d/%Y", &tmv);
  return justify_right(buf, width);
}
