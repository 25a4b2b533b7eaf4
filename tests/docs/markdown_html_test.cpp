// The manual's Markdown converter: each block and inline form it reads, and text that must
// stay text.
#include <gtest/gtest.h>

#include "docs/md2html/markdown_html.h"

namespace {

using kgdoc::convertMarkdown;

std::string body(const std::string& markdown) { return convertMarkdown(markdown).body; }

TEST(MarkdownHeadings, TakeIdsFromTheirTextOrTheOneGivenAndNeverRepeatOne) {
  const kgdoc::HtmlPage page = convertMarkdown(
      "# The Manual\n\n## Keys of the `-view` mode\n\n### Keys\n\n## Keys\n\n## Menus {#main-menus}\n\n#### File #\n");
  EXPECT_EQ(page.title, "The Manual");
  ASSERT_EQ(page.headings.size(), 6u);
  EXPECT_EQ(page.headings[1].id, "keys-of-the-view-mode");
  EXPECT_EQ(page.headings[1].text, "Keys of the <code>-view</code> mode");
  EXPECT_EQ(page.headings[2].id, "keys");
  EXPECT_EQ(page.headings[3].id, "keys-2");
  EXPECT_EQ(page.headings[4].id, "main-menus");
  EXPECT_EQ(page.headings[4].text, "Menus");
  EXPECT_EQ(page.headings[5].level, 4);
  EXPECT_NE(page.body.find("<h4 id=\"file\">File</h4>"), std::string::npos) << page.body;
  EXPECT_NE(page.body.find("<h2 id=\"main-menus\">Menus</h2>"), std::string::npos);
  // Seven hashes, or none followed by a blank, are text.
  EXPECT_EQ(body("####### seven\n"), "<p>####### seven</p>\n");
  EXPECT_EQ(body("#tag\n"), "<p>#tag</p>\n");
}

TEST(MarkdownHeadings, IdsKeepLettersAndDigitsWithOneDashForEachRunOfBlanksAndDashes) {
  EXPECT_EQ(kgdoc::headingId("When data files change: the update dialog"), "when-data-files-change-the-update-dialog");
  EXPECT_EQ(kgdoc::headingId("  kestrel -- import  "), "kestrel-import");
  EXPECT_EQ(kgdoc::headingId("Ünïcode 2"), "ncode-2");
}

TEST(MarkdownParagraphs, RunToABlankLineOrTheNextBlock) {
  EXPECT_EQ(body("one\ntwo\n\nthree\n"), "<p>one\ntwo</p>\n<p>three</p>\n");
  EXPECT_EQ(body("text\n## Next\n"), "<p>text</p>\n<h2 id=\"next\">Next</h2>\n");
  // A dash item interrupts a paragraph; a number other than 1 does not.
  EXPECT_EQ(body("text\n- item\n"), "<p>text</p>\n<ul>\n<li>item</li>\n</ul>\n");
  EXPECT_EQ(body("the year\n2024. was\n"), "<p>the year\n2024. was</p>\n");
}

TEST(MarkdownText, IsEscapedAndNeverPassedOnAsHtml) {
  EXPECT_EQ(body("<script>alert(\"x\") & more</script>\n"),
            "<p>&lt;script&gt;alert(&quot;x&quot;) &amp; more&lt;/script&gt;</p>\n");
  EXPECT_EQ(body("a \\*star\\* and a \\` tick\n"), "<p>a *star* and a ` tick</p>\n");
}

TEST(MarkdownInline, CodeEmphasisLinksAndImages) {
  EXPECT_EQ(body("`a < b` and ``x ` y``\n"), "<p><code>a &lt; b</code> and <code>x ` y</code></p>\n");
  EXPECT_EQ(body("**bold** and *it* and * not *\n"), "<p><strong>bold</strong> and <em>it</em> and * not *</p>\n");
  // Underscores are part of names, never emphasis.
  EXPECT_EQ(body("l_used and _x_\n"), "<p>l_used and _x_</p>\n");
  // No emphasis ends inside a code span.
  EXPECT_EQ(body("*a `b*` c*\n"), "<p><em>a <code>b*</code> c</em></p>\n");
  EXPECT_EQ(body("see [the *keys*](#keys) now\n"), "<p>see <a href=\"#keys\">the <em>keys</em></a> now</p>\n");
  EXPECT_EQ(body("[not a link] (x)\n"), "<p>[not a link] (x)</p>\n");
  const kgdoc::HtmlPage page = convertMarkdown("![A \"shot\"](shot.png) and ![b](dir/b.png)\n");
  EXPECT_EQ(page.body, "<p><img src=\"shot.png\" alt=\"A &quot;shot&quot;\"> and <img src=\"dir/b.png\" alt=\"b\"></p>\n");
  EXPECT_EQ(page.images, (std::vector<std::string>{"shot.png", "dir/b.png"}));
  // An unclosed span stays text.
  EXPECT_EQ(body("`open and **open\n"), "<p>`open and **open</p>\n");
}

TEST(MarkdownCode, FencedAndIndentedBlocksKeepTheirTextEscaped) {
  EXPECT_EQ(body("```sh\nif [ a < b ]; then\n\n  echo *x*\nfi\n```\nafter\n"),
            "<pre><code>if [ a &lt; b ]; then\n\n  echo *x*\nfi\n</code></pre>\n<p>after</p>\n");
  EXPECT_EQ(body("text\n\n    code  line\n      more\n\n    last\n\nnext\n"),
            "<p>text</p>\n<pre><code>code  line\n  more\n\nlast\n</code></pre>\n<p>next</p>\n");
}

TEST(MarkdownLists, TightLooseNestedAndWithCodeInTheirItems) {
  EXPECT_EQ(body("- one\n- two\n  more\n* three\n"), "<ul>\n<li>one</li>\n<li>two\nmore</li>\n<li>three</li>\n</ul>\n");
  EXPECT_EQ(body("1. one\n2. two\n"), "<ol>\n<li>one</li>\n<li>two</li>\n</ol>\n");
  EXPECT_EQ(body("- a\n  - b\n  - c\n- d\n"),
            "<ul>\n<li>a\n<ul>\n<li>b</li>\n<li>c</li>\n</ul></li>\n<li>d</li>\n</ul>\n");
  EXPECT_EQ(body("1. Build:\n\n       gcc x.c\n\n   Then run.\n2. Look.\n"),
            "<ol>\n<li><p>Build:</p>\n<pre><code>gcc x.c\n</code></pre>\n<p>Then run.</p></li>\n<li><p>Look.</p></li>\n</ol>\n");
  // A list ends at a line that is not in it.
  EXPECT_EQ(body("- a\n\nafter\n"), "<ul>\n<li>a</li>\n</ul>\n<p>after</p>\n");
}

TEST(MarkdownTables, HeadAlignmentsAndCellsWithBars) {
  EXPECT_EQ(body("| Key | Does |\n|:---|--:|\n| `a|b` | x \\| y |\n| only |\n"),
            "<table>\n<thead>\n<tr><th style=\"text-align:left\">Key</th><th style=\"text-align:right\">Does</th></tr>\n"
            "</thead>\n<tbody>\n"
            "<tr><td style=\"text-align:left\"><code>a|b</code></td><td style=\"text-align:right\">x | y</td></tr>\n"
            "<tr><td style=\"text-align:left\">only</td><td style=\"text-align:right\"></td></tr>\n"
            "</tbody>\n</table>\n");
  // Without the rule under it, a line of bars is text.
  EXPECT_EQ(body("| a | b |\n"), "<p>| a | b |</p>\n");
}

TEST(MarkdownQuotes, HoldBlocks) {
  EXPECT_EQ(body("> quoted *text*\n> - item\n"), "<blockquote>\n<p>quoted <em>text</em></p>\n<ul>\n<li>item</li>\n</ul>\n</blockquote>\n");
}

TEST(MarkdownContents, ListTheSecondAndThirdLevelHeadingsWhereTheMarkIs) {
  const kgdoc::HtmlPage page = convertMarkdown("# T\n\n[TOC]\n\n## A\n\n### A1\n\n#### deep\n\n## B <x>\n");
  EXPECT_EQ(page.body.substr(0, page.body.find("<h2")),
            "<h1 id=\"t\">T</h1>\n<nav class=\"toc\">\n<ul>\n<li><a href=\"#a\">A</a>\n<ul>\n"
            "<li><a href=\"#a1\">A1</a></li>\n</ul>\n</li>\n<li><a href=\"#b-x\">B &lt;x&gt;</a></li>\n</ul>\n</nav>\n");
}

TEST(MarkdownDocument, IsUtf8WithItsTitle) {
  const std::string html = kgdoc::htmlDocument(convertMarkdown("# Kestrelgauge & co\n\nテキスト\n"));
  EXPECT_EQ(html.rfind("<!DOCTYPE html>\n", 0), 0u);
  EXPECT_NE(html.find("<meta charset=\"utf-8\">"), std::string::npos);
  EXPECT_NE(html.find("<title>Kestrelgauge &amp; co</title>"), std::string::npos);
  EXPECT_NE(html.find("<p>テキスト</p>"), std::string::npos);
  EXPECT_EQ(html.substr(html.size() - 16), "</body>\n</html>\n");
}

TEST(MarkdownLines, CarriageReturnsAndTabsAreRead) {
  EXPECT_EQ(body("- a\r\n-\tb\r\n"), "<ul>\n<li>a</li>\n<li>b</li>\n</ul>\n");
  EXPECT_EQ(body("\tcode\n"), "<pre><code>code\n</code></pre>\n");
}

}  // namespace
