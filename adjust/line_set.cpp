// Bit-array line sets: word-at-a-time range updates and run iteration.
#include "adjust/line_set.h"

#include <bit>

LineSet::LineSet() : capacity_(kInitialCapacity), words_(kInitialCapacity / 64, 0) {}

void LineSet::grow(std::uint32_t line) {
  std::uint32_t cap = capacity_;
  while (line >= cap) cap *= 2;  // kMaxLine < 2^24 keeps this far from overflow
  if (cap != capacity_) {
    capacity_ = cap;
    words_.resize(cap / 64, 0);
  }
}

bool LineSet::test(std::uint32_t line) const {
  if (line >= capacity_) return false;
  return (words_[line / 64] >> (line % 64)) & 1u;
}

bool LineSet::set(std::uint32_t line) { return line != 0 && setRange(line, line); }

void LineSet::clear(std::uint32_t line) { clearRange(line, line); }

bool LineSet::setRange(std::uint32_t first, std::uint32_t last) {
  if (first > last || last > kMaxLine) return false;
  if (first == 0) first = 1;  // line 0 is never used
  if (first > last) return false;
  grow(last);
  std::uint32_t w1 = first / 64, w2 = last / 64;
  std::uint64_t lowMask = ~0ull << (first % 64);
  std::uint64_t highMask = ~0ull >> (63 - last % 64);
  if (w1 == w2) {
    words_[w1] |= lowMask & highMask;
    return true;
  }
  words_[w1] |= lowMask;
  for (std::uint32_t w = w1 + 1; w < w2; ++w) words_[w] = ~0ull;
  words_[w2] |= highMask;
  return true;
}

void LineSet::clearRange(std::uint32_t first, std::uint32_t last) {
  if (first > last || first >= capacity_) return;
  if (last >= capacity_) last = capacity_ - 1;
  std::uint32_t w1 = first / 64, w2 = last / 64;
  std::uint64_t lowMask = ~0ull << (first % 64);
  std::uint64_t highMask = ~0ull >> (63 - last % 64);
  if (w1 == w2) {
    words_[w1] &= ~(lowMask & highMask);
    return;
  }
  words_[w1] &= ~lowMask;
  for (std::uint32_t w = w1 + 1; w < w2; ++w) words_[w] = 0;
  words_[w2] &= ~highMask;
}

bool LineSet::empty() const {
  for (std::uint64_t w : words_) {
    if (w) return false;
  }
  return true;
}

// First position at or after pos whose bit equals `value`; the capacity when there is none.
std::uint32_t LineSet::findBit(std::uint32_t pos, bool value) const {
  const std::uint32_t nwords = static_cast<std::uint32_t>(words_.size());
  std::uint32_t w = pos / 64;
  if (w >= nwords) return capacity_;
  std::uint64_t bits = (value ? words_[w] : ~words_[w]) & (~0ull << (pos % 64));
  while (bits == 0) {
    if (++w >= nwords) return capacity_;
    bits = value ? words_[w] : ~words_[w];
  }
  return w * 64 + static_cast<std::uint32_t>(std::countr_zero(bits));
}

bool LineSet::forEachRun(const std::function<bool(std::uint32_t, std::uint32_t)>& fn) const {
  std::uint32_t pos = 0;
  while (pos < capacity_) {
    std::uint32_t first = findBit(pos, true);
    if (first >= capacity_) break;
    std::uint32_t end = findBit(first, false);
    if (!fn(first, end - 1)) return false;
    pos = end;
  }
  return true;
}
