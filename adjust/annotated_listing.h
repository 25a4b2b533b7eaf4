// The annotated-source listing: each line of the annotated source window written with its
// count column text in front, through the source file's own writer.
#pragma once

#include <string>
#include <vector>

#include "adjust/source_prompter.h"
#include "adjust/src_file.h"
#include "support/errors.h"

// One line of the window: its count column text and its source text in display form.
struct AnnotatedLine {
  std::string countText;
  std::string text;
};

// "%4s |\t" with the count text, then the source text.
std::string annotatedListingLine(const std::string& countText, const std::string& text);

// Writes the lines through `src` (read and closed by the window) into a file the user
// names at the prompt (or into `path` when it is not empty). A cancelled prompt gives
// noFileName quietly; the first failed line ends the listing and its code is returned.
// The file is put in place only when every line was written.
ErrorCode writeAnnotatedListing(SrcFile& src, const std::vector<AnnotatedLine>& lines,
                                const std::string& prompt, const std::string& path,
                                SourcePrompter& prompter);
