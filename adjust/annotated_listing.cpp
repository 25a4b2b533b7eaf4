// Writing the annotated-source listing line by line through the source-file writer.
#include "adjust/annotated_listing.h"

#include <cstdio>
#include <new>

std::string annotatedListingLine(const std::string& countText, const std::string& text) {
  char head[64];
  snprintf(head, sizeof head, "%4s |\t", countText.substr(0, 40).c_str());
  return head + text;
}

ErrorCode writeAnnotatedListing(SrcFile& src, const std::vector<AnnotatedLine>& lines,
                                const std::string& prompt, const std::string& path,
                                SourcePrompter& prompter) {
  ErrorCode rc = src.openForWriting(path, prompt, !path.empty(), prompter);
  if (rc != allOK) return rc;
  try {
    for (const AnnotatedLine& line : lines) {
      rc = src.writeLine(annotatedListingLine(line.countText, line.text));
      if (rc != allOK) break;
    }
  } catch (const std::bad_alloc&) {
    rc = outOfMemory;
  }
  if (rc != allOK) {
    // Puts nothing in place: the target keeps its old contents.
    ErrorCode ignored = src.finishWriting();
    (void)ignored;
    return rc;
  }
  return src.finishWriting();
}
