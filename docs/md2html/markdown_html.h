// A small Markdown-to-HTML converter for the manual, so that the build makes the HTML help
// with nothing but the compiler. It reads the part of Markdown the manual uses:
//
//   # Heading ... ###### Heading    with an id from the text, or the one given as "{#id}" at its end
//   paragraphs                      lines up to a blank line
//   - item, * item, 1. item         lists; lines indented under an item belong to it (nested lists too)
//   | a | b |  then  |---|---|      tables; ":" in the rule aligns a column
//   ```  ...  ```, 4-space indent   code blocks
//   > text                          quotations
//   [TOC]                           a list of links to the level-2 and level-3 headings
//   `code`, **strong**, *emphasis*, [text](url), ![alt](image), \ before punctuation
//
// Everything else is text: "<" and "&" are written as entities, never passed through as HTML,
// and "_" never marks emphasis (names like l_used are common in the manual).
#pragma once

#include <string>
#include <vector>

namespace kgdoc {

struct Heading {
  int level = 0;
  std::string id;
  std::string text;  // as HTML
};

struct HtmlPage {
  std::string title;                // the text of the first level-1 heading
  std::string body;                 // the converted blocks
  std::vector<Heading> headings;    // in order
  std::vector<std::string> images;  // the sources of the images, in order
};

// Converts Markdown text to the body of a page.
HtmlPage convertMarkdown(const std::string& markdown);

// The whole HTML document: UTF-8, the title, a small style sheet, the body.
std::string htmlDocument(const HtmlPage& page);

// The id a heading's text gets: lowercase letters, digits and "-" for each run of blanks and
// dashes; other characters are left out ("The `-view` mode" gives "the-view-mode").
std::string headingId(const std::string& text);

// The text with &, <, > and " written as entities.
std::string escapeHtml(const std::string& text);

}  // namespace kgdoc
