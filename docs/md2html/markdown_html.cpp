// The manual's Markdown subset to HTML: blocks from lines, then the text inside them.
#include "docs/md2html/markdown_html.h"

#include <cctype>
#include <cstring>
#include <map>
#include <string_view>

namespace kgdoc {

namespace {

const char kTocMark[] = "\x01TOC\x01";

bool blank(std::string_view s) { return s.find_first_not_of(" \t") == std::string_view::npos; }

size_t indentOf(std::string_view s) {
  size_t n = 0;
  while (n < s.size() && s[n] == ' ') ++n;
  return n;
}

std::string trim(std::string_view s) {
  const size_t a = s.find_first_not_of(" \t");
  if (a == std::string_view::npos) return {};
  const size_t b = s.find_last_not_of(" \t");
  return std::string(s.substr(a, b - a + 1));
}

bool startsWith(std::string_view s, std::string_view p) { return s.substr(0, p.size()) == p; }

bool isFence(std::string_view line) { return startsWith(line.substr(std::min(indentOf(line), line.size())), "```"); }

// The level of an ATX heading line, 0 when it is none.
int headingLevel(std::string_view line) {
  if (indentOf(line) > 3) return 0;
  line.remove_prefix(indentOf(line));
  int n = 0;
  while (n < static_cast<int>(line.size()) && line[static_cast<size_t>(n)] == '#') ++n;
  if (n < 1 || n > 6) return 0;
  if (static_cast<size_t>(n) < line.size() && line[static_cast<size_t>(n)] != ' ') return 0;
  return n;
}

// A list item's marker: its kind ('-' for "-" and "*", '1' for numbers) and the column its
// text starts at; false when the line starts no item.
bool listMarker(std::string_view line, char& kind, size_t& contentColumn) {
  const size_t ind = indentOf(line);
  std::string_view s = line.substr(ind);
  if (s.size() >= 2 && (s[0] == '-' || s[0] == '*') && s[1] == ' ') {
    kind = '-';
    contentColumn = ind + 2;
    return true;
  }
  size_t d = 0;
  while (d < s.size() && d < 9 && isdigit(static_cast<unsigned char>(s[d]))) ++d;
  if (d > 0 && d + 1 < s.size() && (s[d] == '.' || s[d] == ')') && s[d + 1] == ' ') {
    kind = '1';
    contentColumn = ind + d + 2;
    return true;
  }
  return false;
}

bool isTableRule(std::string_view line) {
  const std::string t = trim(line);
  if (t.empty() || t[0] != '|' || t.find('-') == std::string::npos) return false;
  return t.find_first_not_of("|-: ") == std::string::npos;
}

bool isTableStart(const std::vector<std::string>& lines, size_t i) {
  return trim(lines[i]).rfind('|', 0) == 0 && i + 1 < lines.size() && isTableRule(lines[i + 1]);
}

// The cells of a table row: split at "|" outside code spans and not escaped.
std::vector<std::string> tableCells(std::string_view row) {
  std::string t = trim(row);
  if (!t.empty() && t.front() == '|') t.erase(0, 1);
  if (!t.empty() && t.back() == '|' && (t.size() < 2 || t[t.size() - 2] != '\\')) t.pop_back();
  std::vector<std::string> cells;
  std::string cur;
  bool code = false;
  for (size_t i = 0; i < t.size(); ++i) {
    const char c = t[i];
    if (c == '\\' && i + 1 < t.size() && t[i + 1] == '|') {
      cur += '|';  // an escaped bar is text, in code spans too
      ++i;
    } else if (c == '`') {
      code = !code;
      cur += c;
    } else if (c == '|' && !code) {
      cells.push_back(trim(cur));
      cur.clear();
    } else {
      cur += c;
    }
  }
  cells.push_back(trim(cur));
  return cells;
}

class Converter {
 public:
  explicit Converter(HtmlPage& page) : page_(page) {}

  std::string blocks(const std::vector<std::string>& lines, bool tight);
  std::string inlines(std::string_view text);
  std::string toc() const;

 private:
  std::string heading(std::string_view line, int level);
  std::string table(const std::vector<std::string>& lines, size_t& i);
  std::string list(const std::vector<std::string>& lines, size_t& i);
  // The end of a span that starts at `from` with `marker`, npos when it does not close.
  static size_t closing(std::string_view text, size_t from, std::string_view marker);

  HtmlPage& page_;
  std::map<std::string, int> ids_;
};

std::string Converter::heading(std::string_view line, int level) {
  std::string text = trim(line.substr(indentOf(line) + static_cast<size_t>(level)));
  while (!text.empty() && text.back() == '#') text.pop_back();  // closing hashes
  text = trim(text);
  std::string id;
  const size_t brace = text.rfind("{#");
  if (brace != std::string::npos && text.back() == '}') {
    id = text.substr(brace + 2, text.size() - brace - 3);
    text = trim(text.substr(0, brace));
  }
  if (id.empty()) id = headingId(text);
  if (id.empty()) id = "section";
  // Two headings of one text get distinct ids: the second "-2", the third "-3".
  const int seen = ++ids_[id];
  if (seen > 1) id += "-" + std::to_string(seen);
  Heading h{level, id, inlines(text)};
  if (level == 1 && page_.title.empty()) page_.title = trim(text);
  page_.headings.push_back(h);
  const std::string n = std::to_string(level);
  return "<h" + n + " id=\"" + escapeHtml(id) + "\">" + h.text + "</h" + n + ">\n";
}

std::string Converter::table(const std::vector<std::string>& lines, size_t& i) {
  const std::vector<std::string> head = tableCells(lines[i]);
  std::vector<std::string> align;
  for (const std::string& rule : tableCells(lines[i + 1])) {
    const bool left = !rule.empty() && rule.front() == ':', right = !rule.empty() && rule.back() == ':';
    align.push_back(left && right ? "center" : right ? "right" : left ? "left" : "");
  }
  auto row = [&](const std::vector<std::string>& cells, const char* tag) {
    std::string out = "<tr>";
    for (size_t c = 0; c < head.size(); ++c) {
      out += std::string("<") + tag;
      if (c < align.size() && !align[c].empty()) out += " style=\"text-align:" + align[c] + "\"";
      out += ">" + (c < cells.size() ? inlines(cells[c]) : std::string()) + "</" + tag + ">";
    }
    return out + "</tr>\n";
  };
  std::string out = "<table>\n<thead>\n" + row(head, "th") + "</thead>\n<tbody>\n";
  for (i += 2; i < lines.size() && trim(lines[i]).rfind('|', 0) == 0; ++i) out += row(tableCells(lines[i]), "td");
  return out + "</tbody>\n</table>\n";
}

std::string Converter::list(const std::vector<std::string>& lines, size_t& i) {
  char kind = 0;
  size_t column = 0;
  listMarker(lines[i], kind, column);
  const size_t indent = indentOf(lines[i]);
  std::vector<std::vector<std::string>> items;
  bool loose = false;
  while (i < lines.size()) {
    char k = 0;
    size_t c = 0;
    const std::string& line = lines[i];
    if (!listMarker(line, k, c) || k != kind || indentOf(line) != indent) break;
    column = c;
    items.push_back({line.substr(column)});
    ++i;
    // The item's own lines: indented under its text, or running on from its paragraph.
    while (i < lines.size()) {
      const std::string& l = lines[i];
      if (blank(l)) {
        size_t j = i;
        while (j < lines.size() && blank(lines[j])) ++j;
        if (j < lines.size() && indentOf(lines[j]) >= column) {
          for (; i < j; ++i) items.back().push_back("");
          loose = true;
          continue;
        }
        char k2 = 0;
        size_t c2 = 0;
        if (j < lines.size() && listMarker(lines[j], k2, c2) && k2 == kind && indentOf(lines[j]) == indent) {
          i = j;
          loose = true;
        }
        break;
      }
      if (indentOf(l) >= column) {
        items.back().push_back(l.substr(column));
      } else {
        char k2 = 0;
        size_t c2 = 0;
        if (listMarker(l, k2, c2) || headingLevel(l) || isFence(l) || isTableStart(lines, i) ||
            trim(l).rfind('>', 0) == 0 || blank(items.back().back()))
          break;
        items.back().push_back(trim(l));
      }
      ++i;
    }
  }
  const char* tag = kind == '1' ? "ol" : "ul";
  std::string out = std::string("<") + tag + ">\n";
  for (const auto& item : items) {
    std::string body = blocks(item, !loose);
    while (!body.empty() && body.back() == '\n') body.pop_back();
    out += "<li>" + body + "</li>\n";
  }
  return out + "</" + tag + ">\n";
}

std::string Converter::blocks(const std::vector<std::string>& lines, bool tight) {
  std::string out;
  size_t i = 0;
  while (i < lines.size()) {
    const std::string& line = lines[i];
    if (blank(line)) {
      ++i;
      continue;
    }
    if (isFence(line)) {
      const size_t fenceIndent = indentOf(line);
      std::string code;
      for (++i; i < lines.size() && !isFence(lines[i]); ++i) {
        const std::string& l = lines[i];
        code += l.substr(std::min(fenceIndent, indentOf(l))) + "\n";
      }
      if (i < lines.size()) ++i;
      out += "<pre><code>" + escapeHtml(code) + "</code></pre>\n";
      continue;
    }
    if (int level = headingLevel(line)) {
      out += heading(line, level);
      ++i;
      continue;
    }
    if (trim(line) == "[TOC]") {
      out += kTocMark;
      ++i;
      continue;
    }
    if (isTableStart(lines, i)) {
      out += table(lines, i);
      continue;
    }
    char kind = 0;
    size_t column = 0;
    if (listMarker(line, kind, column)) {
      out += list(lines, i);
      continue;
    }
    if (indentOf(line) >= 4) {
      std::vector<std::string> code;
      for (; i < lines.size() && (blank(lines[i]) || indentOf(lines[i]) >= 4); ++i)
        code.push_back(blank(lines[i]) ? "" : lines[i].substr(4));
      while (!code.empty() && code.back().empty()) code.pop_back();
      std::string text;
      for (const std::string& c : code) text += c + "\n";
      out += "<pre><code>" + escapeHtml(text) + "</code></pre>\n";
      continue;
    }
    if (trim(line).rfind('>', 0) == 0) {
      std::vector<std::string> quoted;
      for (; i < lines.size() && trim(lines[i]).rfind('>', 0) == 0; ++i) {
        std::string q = trim(lines[i]).substr(1);
        if (!q.empty() && q[0] == ' ') q.erase(0, 1);
        quoted.push_back(q);
      }
      out += "<blockquote>\n" + blocks(quoted, false) + "</blockquote>\n";
      continue;
    }
    // A paragraph: up to a blank line or the start of another block.
    std::string text = trim(line);
    for (++i; i < lines.size(); ++i) {
      const std::string& l = lines[i];
      char k = 0;
      size_t c = 0;
      if (blank(l) || headingLevel(l) || isFence(l) || isTableStart(lines, i) || trim(l).rfind('>', 0) == 0 ||
          (listMarker(l, k, c) && (k == '-' || trim(l).rfind("1", 0) == 0)))
        break;
      text += "\n" + trim(l);
    }
    out += tight ? inlines(text) + "\n" : "<p>" + inlines(text) + "</p>\n";
  }
  return out;
}

size_t Converter::closing(std::string_view text, size_t from, std::string_view marker) {
  for (size_t j = from; j + marker.size() <= text.size(); ++j) {
    if (text[j] == '\\') {
      ++j;
      continue;
    }
    if (text[j] == '`') {  // no emphasis ends inside code
      size_t n = 0;
      while (j + n < text.size() && text[j + n] == '`') ++n;
      const size_t end = text.find(std::string(n, '`'), j + n);
      if (end != std::string_view::npos) j = end + n - 1;
      continue;
    }
    if (text.substr(j, marker.size()) == marker && j > from && text[j - 1] != ' ') return j;
  }
  return std::string_view::npos;
}

std::string Converter::inlines(std::string_view text) {
  std::string out;
  size_t i = 0;
  while (i < text.size()) {
    const char c = text[i];
    if (c == '\\' && i + 1 < text.size() && ispunct(static_cast<unsigned char>(text[i + 1]))) {
      out += escapeHtml(std::string(1, text[i + 1]));
      i += 2;
      continue;
    }
    if (c == '`') {
      size_t n = 0;
      while (i + n < text.size() && text[i + n] == '`') ++n;
      size_t end = text.find(std::string(n, '`'), i + n);
      // Only a run of exactly as many backticks closes the span.
      while (end != std::string_view::npos && end + n < text.size() && text[end + n] == '`') {
        size_t k = end;
        while (k < text.size() && text[k] == '`') ++k;
        end = text.find(std::string(n, '`'), k);
      }
      if (end == std::string_view::npos) {
        out += std::string(n, '`');
        i += n;
        continue;
      }
      std::string code(text.substr(i + n, end - i - n));
      for (char& ch : code)
        if (ch == '\n') ch = ' ';
      if (code.size() >= 2 && code.front() == ' ' && code.back() == ' ' && !blank(code))
        code = code.substr(1, code.size() - 2);
      out += "<code>" + escapeHtml(code) + "</code>";
      i = end + n;
      continue;
    }
    if ((c == '[' || (c == '!' && i + 1 < text.size() && text[i + 1] == '['))) {
      const size_t open = c == '!' ? i + 1 : i;
      int depth = 0;
      size_t close = std::string_view::npos;
      for (size_t j = open; j < text.size(); ++j) {
        if (text[j] == '\\') {
          ++j;
        } else if (text[j] == '[') {
          ++depth;
        } else if (text[j] == ']' && --depth == 0) {
          close = j;
          break;
        }
      }
      if (close != std::string_view::npos && close + 1 < text.size() && text[close + 1] == '(') {
        const size_t end = text.find(')', close + 2);
        if (end != std::string_view::npos) {
          const std::string label(text.substr(open + 1, close - open - 1));
          const std::string target = trim(text.substr(close + 2, end - close - 2));
          if (c == '!') {
            page_.images.push_back(target);
            out += "<img src=\"" + escapeHtml(target) + "\" alt=\"" + escapeHtml(label) + "\">";
          } else {
            out += "<a href=\"" + escapeHtml(target) + "\">" + inlines(label) + "</a>";
          }
          i = end + 1;
          continue;
        }
      }
    }
    if (c == '*') {
      const bool strong = i + 1 < text.size() && text[i + 1] == '*';
      const std::string_view marker = strong ? "**" : "*";
      const size_t start = i + marker.size();
      if (start < text.size() && text[start] != ' ') {
        const size_t end = closing(text, start, marker);
        if (end != std::string_view::npos) {
          const char* tag = strong ? "strong" : "em";
          out += std::string("<") + tag + ">" + inlines(text.substr(start, end - start)) + "</" + tag + ">";
          i = end + marker.size();
          continue;
        }
      }
    }
    out += escapeHtml(std::string(1, c));
    ++i;
  }
  return out;
}

std::string Converter::toc() const {
  std::string out = "<nav class=\"toc\">\n<ul>\n";
  bool inner = false;
  bool first = true;
  for (const Heading& h : page_.headings) {
    if (h.level == 2) {
      if (inner) out += "</ul>\n";
      if (!first) out += "</li>\n";
      inner = false;
      first = false;
      out += "<li><a href=\"#" + escapeHtml(h.id) + "\">" + h.text + "</a>";
    } else if (h.level == 3 && !first) {
      if (!inner) out += "\n<ul>\n";
      inner = true;
      out += "<li><a href=\"#" + escapeHtml(h.id) + "\">" + h.text + "</a></li>\n";
    }
  }
  if (inner) out += "</ul>\n";
  if (!first) out += "</li>\n";
  return out + "</ul>\n</nav>\n";
}

}  // namespace

std::string escapeHtml(const std::string& text) {
  std::string out;
  out.reserve(text.size());
  for (char c : text) {
    switch (c) {
      case '&': out += "&amp;"; break;
      case '<': out += "&lt;"; break;
      case '>': out += "&gt;"; break;
      case '"': out += "&quot;"; break;
      default: out += c;
    }
  }
  return out;
}

std::string headingId(const std::string& text) {
  std::string id;
  bool dash = false;
  for (unsigned char c : text) {
    if (isalnum(c) && c < 128) {
      if (dash && !id.empty()) id += '-';
      dash = false;
      id += static_cast<char>(tolower(c));
    } else if (c == ' ' || c == '-' || c == '\t') {
      dash = true;
    }
  }
  return id;
}

HtmlPage convertMarkdown(const std::string& markdown) {
  std::vector<std::string> lines;
  size_t start = 0;
  while (start <= markdown.size()) {
    size_t end = markdown.find('\n', start);
    if (end == std::string::npos) end = markdown.size();
    std::string line = markdown.substr(start, end - start);
    if (!line.empty() && line.back() == '\r') line.pop_back();
    // Tabs count as four columns, as the block rules measure indentation in spaces.
    for (size_t t = line.find('\t'); t != std::string::npos; t = line.find('\t', t)) line.replace(t, 1, "    ");
    lines.push_back(line);
    if (end == markdown.size()) break;
    start = end + 1;
  }
  HtmlPage page;
  Converter converter(page);
  page.body = converter.blocks(lines, false);
  const size_t mark = page.body.find(kTocMark);
  if (mark != std::string::npos) page.body.replace(mark, strlen(kTocMark), converter.toc());
  return page;
}

std::string htmlDocument(const HtmlPage& page) {
  return "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
         "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n<title>" +
         escapeHtml(page.title) +
         "</title>\n<style>\n"
         "body { font-family: sans-serif; max-width: 56em; margin: 1em auto; padding: 0 1em; line-height: 1.45; }\n"
         "code, pre { font-family: monospace; background: #f3f3f3; }\n"
         "pre { padding: 0.5em; overflow-x: auto; }\n"
         "table { border-collapse: collapse; margin: 0.5em 0; }\n"
         "th, td { border: 1px solid #bbb; padding: 0.2em 0.5em; vertical-align: top; }\n"
         "th { background: #e8e8e8; }\n"
         "img { max-width: 100%; }\n"
         "h2 { border-bottom: 1px solid #ccc; margin-top: 2em; }\n"
         "nav.toc ul { margin: 0.2em 0; }\n"
         "</style>\n</head>\n<body>\n" +
         page.body + "</body>\n</html>\n";
}

}  // namespace kgdoc
