// A source text as bytes, with its line ends, edited line by line.
#include "adjust/source_text.h"

#include <algorithm>
#include <new>

void SourceText::clear() {
  bytes_.clear();
  starts_.clear();
  ends_.clear();
  edits_.clear();
  longest_ = 0;
}

void SourceText::append(std::string_view line, std::uint8_t end) {
  if (end == endLf && !line.empty() && line.back() == '\r') {
    line.remove_suffix(1);
    end = endCrLf;
  }
  starts_.push_back(bytes_.size());
  bytes_.append(line);
  ends_.push_back(end);
  longest_ = std::max(longest_, line.size());
}

ErrorCode SourceText::read(SrcFile& src) {
  clear();
  try {
    std::string line;
    bool ended = false;
    while (src.readRawLine(line, ended)) append(line, ended ? endLf : endNone);
    // The text stays as long as the window: no room kept for growth.
    bytes_.shrink_to_fit();
    starts_.shrink_to_fit();
    ends_.shrink_to_fit();
  } catch (const std::bad_alloc&) {
    clear();
    return outOfMemory;
  }
  return allOK;
}

void SourceText::assign(std::string_view bytes) {
  clear();
  while (!bytes.empty()) {
    const std::size_t nl = bytes.find('\n');
    if (nl == std::string_view::npos) {
      append(bytes, endNone);
      break;
    }
    append(bytes.substr(0, nl), endLf);
    bytes.remove_prefix(nl + 1);
  }
}

std::string_view SourceText::view(std::size_t n) const {
  if (n < 1 || n > ends_.size()) return {};
  if (!edits_.empty()) {
    auto it = edits_.find(n);
    if (it != edits_.end()) return it->second;
  }
  const std::size_t start = starts_[n - 1];
  const std::size_t end = n < starts_.size() ? starts_[n] : bytes_.size();
  return std::string_view(bytes_).substr(start, end - start);
}

std::string& SourceText::editable(std::size_t n) {
  auto it = edits_.find(n);
  if (it == edits_.end()) it = edits_.emplace(n, std::string(view(n))).first;
  return it->second;
}

void SourceText::deleteChars(std::size_t n, std::size_t offset, std::size_t count) {
  if (n < 1 || n > ends_.size() || offset >= view(n).size()) return;
  editable(n).erase(offset, count);
}

void SourceText::insertChars(std::size_t n, std::size_t offset, const std::string& text) {
  if (n < 1 || n > ends_.size()) return;
  std::string& l = editable(n);
  l.insert(std::min(offset, l.size()), text);
  longest_ = std::max(longest_, l.size());
}

void SourceText::appendToLine(std::size_t n, const std::string& text) {
  if (n < 1 || n > ends_.size()) return;
  std::string& l = editable(n);
  l += text;
  longest_ = std::max(longest_, l.size());
}

std::string SourceText::bytes() const {
  std::string out;
  out.reserve(bytes_.size() + 2 * ends_.size());
  for (std::size_t n = 1; n <= ends_.size(); ++n) {
    out.append(view(n));
    if (ends_[n - 1] == endCrLf) out.append("\r\n");
    if (ends_[n - 1] == endLf) out.push_back('\n');
  }
  return out;
}

ErrorCode SourceText::write(SrcFile& src) const {
  // Whole runs of lines go out at once; a line and its end are never split by a failure check.
  std::string chunk;
  for (std::size_t n = 1; n <= ends_.size(); ++n) {
    chunk.append(view(n));
    if (ends_[n - 1] == endCrLf) chunk.append("\r\n");
    if (ends_[n - 1] == endLf) chunk.push_back('\n');
    if (chunk.size() >= (1u << 16) || n == ends_.size()) {
      ErrorCode rc = src.writeBytes(chunk);
      if (rc != allOK) return rc;
      chunk.clear();
    }
  }
  return allOK;
}
