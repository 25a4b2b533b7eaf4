// One source file opened for display and for writing back: finding it, checking it,
// handing out its lines in display form, and writing lines back in the file's own code set.
#pragma once

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <string_view>

#include "adjust/source_prompter.h"
#include "support/atomic_write.h"
#include "support/errors.h"
#include "support/temp_file.h"

// The display form of a line's bytes: "^L" for a line that is a lone form feed, one blank for
// an empty line; in the plain code set every byte that is neither printable, a tab, a carriage
// return nor part of a well-formed UTF-8 character (C1 controls excepted) shows as "?".
std::string sourceDisplayForm(std::string_view bytes, std::uint32_t displayCodeSet);

class SrcFile {
 public:
  enum : std::uint32_t { stateNew = 0, stateReading = 1, stateClosed = 2, stateWriting = 3 };

  SrcFile() = default;
  ~SrcFile();
  SrcFile(const SrcFile&) = delete;
  SrcFile& operator=(const SrcFile&) = delete;

  // Finds the file (as named, along the source search path, then by asking), checks that
  // it is text and not newer than buildTime (0 = no check), and prepares the display form.
  // Only from the new state.
  ErrorCode openForReading(const std::string& requestedName, const std::string& promptText,
                           std::uint32_t buildTime, SourcePrompter& prompter);
  // The next line in display form; false at end of file.
  bool readLine(std::string& line);
  // The next line as its bytes (in the display code set), without its line end; `ended` tells
  // whether a newline followed it. False at end of file.
  bool readRawLine(std::string& bytes, bool& ended);
  void closeReading();

  // Starts writing to path (or to a path asked for with the prompt when pathGiven is false).
  // The file is replaced only when finishWriting succeeds. Only from the closed state.
  ErrorCode openForWriting(const std::string& path, const std::string& promptText, bool pathGiven,
                           SourcePrompter& prompter);
  // One line in display form; written back in the file's own form.
  ErrorCode writeLine(const std::string& text);
  // Bytes exactly as given (in the display code set), line ends included.
  ErrorCode writeBytes(const std::string& bytes);
  // Converts back when needed and puts the new file in place.
  ErrorCode finishWriting();

  // A copy of this file's description in the closed state (names, times, code sets), for a
  // window that shows the same text and may write it out.
  std::unique_ptr<SrcFile> closedCopy() const;

  std::uint32_t state() const { return state_; }
  const std::string& requestedName() const { return requestedName_; }
  const std::string& foundName() const { return foundName_; }
  const std::string& outputName() const { return outputName_; }
  const std::string& temporaryPath() const { return temp_.path(); }
  std::uint32_t modificationTime() const { return modTime_; }
  bool writable() const { return writable_; }
  std::uint32_t displayCodeSet() const { return displayCodeSet_; }
  std::uint32_t fileCodeSet() const { return fileCodeSet_; }

 private:
  enum class Candidate { opened, failed, refused };
  Candidate tryCandidate(const std::string& path, std::uint32_t buildTime,
                         SourcePrompter& prompter);
  ErrorCode prepareDisplay();
  // Where display lines come from (the file or its converted copy) and where written lines
  // go (the new file or the copy converted back when writing ends).
  FILE* readStream() const { return temp_ ? temp_.stream() : source_.get(); }
  FILE* writeStream() const { return temp_ ? temp_.stream() : writer_.stream(); }

  struct FileCloser {
    void operator()(FILE* f) const { fclose(f); }
  };

  std::uint32_t state_ = stateNew;
  std::string requestedName_;
  std::string foundName_;
  std::string outputName_;
  std::unique_ptr<FILE, FileCloser> source_;  // the file as found, while it is read
  TemporaryFile temp_;                         // the EUC form of a JIS or Shift-JIS file
  std::uint32_t modTime_ = 0;
  bool writable_ = false;
  std::uint32_t displayCodeSet_ = 1;
  std::uint32_t fileCodeSet_ = 1;
  std::string asciiEscape_;  // how the JIS file returned to one-byte text
  AtomicFileWriter writer_;
  bool writeFailed_ = false;
};
