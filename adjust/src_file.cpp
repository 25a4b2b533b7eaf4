// Source files: search, checks, display form, EUC conversion and safe writing back.
#include "adjust/src_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <vector>

#include "adjust/adjust_settings.h"
#include "adjust/code_set.h"
#include "adjust/source_search_path.h"
#include "support/temp_file.h"

namespace {

std::string baseName(const std::string& path) {
  size_t slash = path.find_last_of('/');
  return slash == std::string::npos ? path : path.substr(slash + 1);
}

std::string dirName(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  return slash == 0 ? "/" : path.substr(0, slash);
}

bool readAll(FILE* f, std::string& out) {
  out.clear();
  char buf[65536];
  size_t n;
  while ((n = fread(buf, 1, sizeof buf, f)) > 0) out.append(buf, n);
  return !ferror(f);
}

}  // namespace

namespace {

// The length of the well-formed UTF-8 character at the start of `s` (2 to 4 bytes), or 0.
std::size_t utf8Length(std::string_view s) {
  const auto b = [&](std::size_t i) { return static_cast<unsigned char>(s[i]); };
  const auto cont = [&](std::size_t i) { return i < s.size() && (b(i) & 0xC0) == 0x80; };
  const unsigned char c = b(0);
  if (c >= 0xC2 && c <= 0xDF) return cont(1) ? 2 : 0;
  if (c >= 0xE0 && c <= 0xEF) {
    if (!cont(1) || !cont(2)) return 0;
    if (c == 0xE0 && b(1) < 0xA0) return 0;   // overlong
    if (c == 0xED && b(1) >= 0xA0) return 0;  // surrogates
    return 3;
  }
  if (c >= 0xF0 && c <= 0xF4) {
    if (!cont(1) || !cont(2) || !cont(3)) return 0;
    if (c == 0xF0 && b(1) < 0x90) return 0;
    if (c == 0xF4 && b(1) >= 0x90) return 0;  // above U+10FFFF
    return 4;
  }
  return 0;
}

}  // namespace

std::string sourceDisplayForm(std::string_view bytes, std::uint32_t displayCodeSet) {
  if (bytes == "\f") return "^L";
  if (bytes.empty()) return " ";
  std::string out(bytes);
  if (displayCodeSet != codeSetPlain) return out;
  for (std::size_t i = 0; i < out.size();) {
    const auto u = static_cast<unsigned char>(out[i]);
    if (u == '\t' || u == '\r' || (u >= 0x20 && u < 0x7F)) {
      ++i;
      continue;
    }
    // Text in UTF-8 is shown as the characters it spells, except the C1 controls.
    const std::size_t n = u >= 0x80 ? utf8Length(std::string_view(out).substr(i)) : 0;
    if (n > 0 && !(u == 0xC2 && static_cast<unsigned char>(out[i + 1]) < 0xA0)) {
      i += n;
      continue;
    }
    out[i++] = '?';
  }
  return out;
}

SrcFile::~SrcFile() = default;

std::unique_ptr<SrcFile> SrcFile::closedCopy() const {
  auto copy = std::make_unique<SrcFile>();
  copy->state_ = stateClosed;
  copy->requestedName_ = requestedName_;
  copy->foundName_ = foundName_;
  copy->outputName_ = outputName_;
  copy->modTime_ = modTime_;
  copy->writable_ = writable_;
  copy->displayCodeSet_ = displayCodeSet_;
  copy->fileCodeSet_ = fileCodeSet_;
  copy->asciiEscape_ = asciiEscape_;
  return copy;
}

SrcFile::Candidate SrcFile::tryCandidate(const std::string& path, std::uint32_t buildTime,
                                         SourcePrompter& prompter) {
  if (path.empty()) return Candidate::failed;
  // Non-blocking, so that a name that turns out to be a FIFO cannot hang the viewer.
  int fd = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  if (fd < 0) return Candidate::failed;
  struct stat st;
  if (fstat(fd, &st) != 0) {
    close(fd);
    return Candidate::refused;
  }
  int flags = fcntl(fd, F_GETFL);
  if (flags >= 0) fcntl(fd, F_SETFL, flags & ~O_NONBLOCK);
  std::uint32_t codeSet = S_ISREG(st.st_mode) ? detectCodeSet(fd) : codeSetNotText;
  if (codeSet == codeSetNotText) {
    close(fd);
    prompter.showError("File is not a plain text file", notTextFile);
    return Candidate::refused;
  }
  const auto mtime = static_cast<std::uint32_t>(st.st_mtime);
  if (buildTime != 0 && mtime >= buildTime &&
      !prompter.askContinue("Source file has been modified since object file was compiled.")) {
    close(fd);
    return Candidate::refused;
  }
  FILE* f = fdopen(fd, "r");
  if (!f) {
    close(fd);
    return Candidate::failed;
  }
  source_.reset(f);
  modTime_ = mtime;
  writable_ = access(path.c_str(), W_OK) == 0;
  fileCodeSet_ = codeSet;
  return Candidate::opened;
}

ErrorCode SrcFile::openForReading(const std::string& requestedName, const std::string& promptText,
                                  std::uint32_t buildTime, SourcePrompter& prompter) {
  if (state_ != stateNew) return errorOccured;
  std::string candidate = requestedName;
  Candidate result = tryCandidate(candidate, buildTime, prompter);
  if (result == Candidate::failed) {
    std::string alternative;
    if (findInSourceSearchPath(baseName(requestedName), alternative)) {
      candidate = alternative;
      result = tryCandidate(candidate, buildTime, prompter);
    }
  }
  while (result != Candidate::opened && !candidate.empty()) {
    std::string name;
    if (!prompter.askFileName(formatWithString(promptText, baseName(candidate)), name)) {
      return noFileName;
    }
    candidate = name;
    result = tryCandidate(candidate, buildTime, prompter);
    if (result == Candidate::opened) addSourceSearchDirectory(dirName(candidate));
  }
  if (result != Candidate::opened) return noFileName;
  requestedName_ = requestedName;
  foundName_ = candidate;
  ErrorCode rc = prepareDisplay();
  if (rc != allOK) {
    source_.reset();
    temp_.remove();
    return rc;
  }
  state_ = stateReading;
  return allOK;
}

ErrorCode SrcFile::prepareDisplay() {
  if (!codeSetNeedsConversion(fileCodeSet_)) {
    displayCodeSet_ = fileCodeSet_;
    return allOK;
  }
  std::string raw;
  bool readOk = readAll(source_.get(), raw);
  int readErr = errno;
  std::string euc;
  if (readOk && !(fileCodeSet_ == codeSetShiftJis ? shiftJisToEuc(raw, euc)
                                                  : jisToEuc(raw, euc, &asciiEscape_))) {
    // Bytes the detected code set cannot hold: the guess was wrong (Latin-1 letters and other
    // stray bytes can look like Shift-JIS), so the file is shown and written as it is.
    fileCodeSet_ = codeSetPlain;
    displayCodeSet_ = codeSetPlain;
    asciiEscape_.clear();
    rewind(source_.get());
    return allOK;
  }
  source_.reset();
  if (!temp_.create("kgXRd")) {
    recordSystemError(errno, "Converting %s\ninto EUC in %s\nprior to display", foundName_.c_str(),
                      temp_.path().c_str());
    temp_.remove();
    return writeError;
  }
  int err = 0;
  if (!readOk) {
    err = readErr ? readErr : EIO;
  } else if (fwrite(euc.data(), 1, euc.size(), temp_.stream()) != euc.size() ||
             fflush(temp_.stream()) != 0) {
    err = errno ? errno : EIO;
  }
  if (err) {
    recordSystemError(err, "Writing EUC version of %s\ninto %s\nprior to display",
                      foundName_.c_str(), temp_.path().c_str());
    temp_.remove();
    return fileWriteFailed;
  }
  rewind(temp_.stream());
  displayCodeSet_ = codeSetEuc;
  return allOK;
}

bool SrcFile::readLine(std::string& line) {
  bool ended = false;
  if (!readRawLine(line, ended)) return false;
  line = sourceDisplayForm(line, displayCodeSet_);
  return true;
}

bool SrcFile::readRawLine(std::string& bytes, bool& ended) {
  bytes.clear();
  ended = false;
  FILE* in = readStream();
  if (state_ != stateReading || !in) return false;
  char* buf = nullptr;
  size_t cap = 0;
  ssize_t len = getline(&buf, &cap, in);
  if (len < 0) {
    free(buf);
    return false;
  }
  bytes.assign(buf, static_cast<size_t>(len));
  free(buf);
  if (!bytes.empty() && bytes.back() == '\n') {
    bytes.pop_back();
    ended = true;
  }
  return true;
}

void SrcFile::closeReading() {
  if (state_ != stateReading) return;
  source_.reset();
  temp_.remove();
  state_ = stateClosed;
}

ErrorCode SrcFile::openForWriting(const std::string& path, const std::string& promptText,
                                  bool pathGiven, SourcePrompter& prompter) {
  if (state_ != stateClosed) return errorOccured;
  std::string target = path;
  if (!pathGiven && !prompter.askFileName(formatWithString(promptText, baseName(path)), target)) {
    return noFileName;
  }
  for (;;) {
    ErrorCode rc = writer_.open(writeTargetFor(target));
    if (rc == allOK) break;
    if (pathGiven) return rc;
    if (!prompter.askFileName(formatWithString(promptText, baseName(target)), target)) {
      return noFileName;
    }
  }
  outputName_ = target;
  writeFailed_ = false;
  if (codeSetNeedsConversion(fileCodeSet_) && !temp_.create("kgXWr")) {
    int err = errno;
    writer_.abandon();
    recordSystemError(err, "Opening %s\nfor converting the display from EUC\nback to the proper format.",
                      temp_.path().c_str());
    temp_.remove();
    return writeError;
  }
  state_ = stateWriting;
  return allOK;
}

ErrorCode SrcFile::writeLine(const std::string& text) {
  FILE* out = writeStream();
  if (state_ != stateWriting || !out) return fileWriteFailed;
  std::string line;
  if (text == " ") {
    line = "\n";
  } else if (text.starts_with("^L")) {
    line = "\f" + text.substr(2) + "\n";
  } else {
    line = text + "\n";
  }
  if (fwrite(line.data(), 1, line.size(), out) != line.size()) {
    writeFailed_ = true;
    recordSystemError(errno ? errno : EIO, "while writing into %s", outputName_.c_str());
    return fileWriteFailed;
  }
  return allOK;
}

ErrorCode SrcFile::writeBytes(const std::string& bytes) {
  FILE* out = writeStream();
  if (state_ != stateWriting || !out) return fileWriteFailed;
  if (fwrite(bytes.data(), 1, bytes.size(), out) != bytes.size()) {
    writeFailed_ = true;
    recordSystemError(errno ? errno : EIO, "while writing into %s", outputName_.c_str());
    return fileWriteFailed;
  }
  return allOK;
}

ErrorCode SrcFile::finishWriting() {
  if (state_ != stateWriting) return errorOccured;
  ErrorCode rc = allOK;
  if (temp_) {
    std::string euc, converted;
    int err = 0;
    if (fflush(temp_.stream()) != 0 || ferror(temp_.stream())) {
      err = errno ? errno : EIO;
    } else {
      rewind(temp_.stream());
      if (!readAll(temp_.stream(), euc)) {
        err = errno ? errno : EIO;
      } else if (!(fileCodeSet_ == codeSetShiftJis
                       ? eucToShiftJis(euc, converted)
                       : eucToJis(euc, fileCodeSet_, asciiEscape_, converted))) {
        err = EILSEQ;
      } else if (fwrite(converted.data(), 1, converted.size(), writer_.stream()) !=
                 converted.size()) {
        err = errno ? errno : EIO;
      }
    }
    if (err) {
      recordSystemError(err, "Translating from EUC (%s)\ninto destination %s.\n", temp_.path().c_str(),
                        outputName_.c_str());
      rc = fileWriteFailed;
    } else if (writeFailed_) {
      recordSystemError(EIO, "while writing into %s", outputName_.c_str());
      rc = fileWriteFailed;
    }
    temp_.remove();
  } else if (writeFailed_) {
    recordSystemError(EIO, "while writing into %s", outputName_.c_str());
    rc = fileWriteFailed;
  }
  if (rc == allOK) {
    rc = writer_.commit();
  } else {
    writer_.abandon();
  }
  state_ = stateClosed;
  return rc;
}
