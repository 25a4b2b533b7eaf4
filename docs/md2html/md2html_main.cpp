// kg-md2html IN.md OUT.html: the manual as an HTML page, with the images it shows copied
// beside the page.
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "docs/md2html/markdown_html.h"

namespace fs = std::filesystem;

int main(int argc, char** argv) {
  if (argc != 3) {
    fputs("usage: kg-md2html IN.md OUT.html\n", stderr);
    return 2;
  }
  const fs::path in = argv[1], out = argv[2];
  std::ifstream src(in, std::ios::binary);
  if (!src) {
    fprintf(stderr, "kg-md2html: cannot read %s\n", in.c_str());
    return 1;
  }
  std::ostringstream text;
  text << src.rdbuf();
  const kgdoc::HtmlPage page = kgdoc::convertMarkdown(text.str());
  std::error_code ec;
  for (const std::string& image : page.images) {
    // A relative image is a file beside the Markdown; it must be there, or the page shows a hole.
    if (image.find("://") != std::string::npos || image.empty() || image[0] == '/') continue;
    const fs::path from = in.parent_path() / image, to = out.parent_path() / image;
    fs::create_directories(to.parent_path(), ec);
    if (!fs::copy_file(from, to, fs::copy_options::overwrite_existing, ec)) {
      fprintf(stderr, "kg-md2html: %s: the image %s cannot be copied: %s\n", in.c_str(), image.c_str(),
              ec.message().c_str());
      return 1;
    }
  }
  const fs::path tmp = out.string() + ".tmp";
  {
    std::ofstream dst(tmp, std::ios::binary | std::ios::trunc);
    dst << kgdoc::htmlDocument(page);
    if (!dst.flush()) {
      fprintf(stderr, "kg-md2html: cannot write %s\n", tmp.c_str());
      return 1;
    }
  }
  fs::rename(tmp, out, ec);
  if (ec) {
    fprintf(stderr, "kg-md2html: cannot write %s: %s\n", out.c_str(), ec.message().c_str());
    return 1;
  }
  return 0;
}
