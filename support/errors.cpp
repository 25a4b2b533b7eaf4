// Error code table, pending system error and message forms.
#include "support/errors.h"

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

struct ErrorEntry {
  const char* identifier;
  const char* text;
  const char* shortText;  // nullptr: same as text
};

const char* const kFatalText = "(internal error) A fatal error occurred.";
const char* const kSubshellText = "Couldn't create subshell.";

// Indexed by code; codes 7 and those above 54 have no entry.
const ErrorEntry kErrors[] = {
    /* 0 */ {"fatalInternalError", kFatalText, nullptr},
    /* 1 */ {"allOK", "Everything was OK.", nullptr},
    /* 2 */ {"oprAborted", "Operation aborted at your request.", nullptr},
    /* 3 */ {"errorOccured", "An error occured", "An error occurred."},
    /* 4 */ {"fatalInternalError", kFatalText, nullptr},
    /* 5 */ {"notImplemented", "(internal error) The feature is not implemented yet.", nullptr},
    /* 6 */ {"argError", "A command-line option was invalid.", nullptr},
    /* 7 */ {nullptr, "", nullptr},
    /* 8 */ {nullptr, "Cannot open graphics display.", nullptr},
    /* 9 */ {"noFileName", "No file names were provided.", nullptr},
    /* 10 */ {"duplicateFile", "The file is already loaded.", nullptr},
    /* 11 */ {"driverError", "(internal error) Larkspur Software driver error.", nullptr},
    /* 12 */ {"outOfMemory", "Ran out of dynamic memory space.", nullptr},
    /* 13 */ {"unabelToLock", "Unable to lock the file.", nullptr},
    /* 14 */ {"unableToUnlock", "Unable to unlock the file.", nullptr},
    /* 15 */ {"fileNotExist", "The file does not exist.", nullptr},
    /* 16 */ {"readAccessDenied", "Read access denied for the file.", nullptr},
    /* 17 */ {"writeAccessDenied", "Write access denied for the file.", nullptr},
    /* 18 */
    {"openError",
     "The system reported an error when trying to open the file for reading.  Usually this is "
     "because the filename is misspelled or incorrect, or because you don't have necessary "
     "privileges to read the file.",
     "The system reported an error when trying to open the file\nfor reading.  Usually this is "
     "because the filename is\nmisspelled or incorrect, or because you don't have necessary\n"
     "privileges to read the file."},
    /* 19 */
    {"writeError",
     "The system reported an error when trying to open the file for writing.  Usually this is "
     "because the filename is misspelled or incorrect, or because you don't have necessary "
     "privileges to modify the file or the directory containing it.",
     "The system reported an error when trying to open the file for\nwriting.  Usually this is "
     "because the filename is misspelled\nor incorrect, or because you don't have necessary "
     "privileges\nto modify the file or the directory containing it."},
    /* 20 */ {"readFileFail", "An attempt to read the file failed.", nullptr},
    /* 21 */ {"fileWriteFailed", "An attempt to write the file failed.", nullptr},
    /* 22 */
    {"fileTooShort",
     "The file was too short.  This probably means the file has been truncated or otherwise "
     "corrupted, but it could indicate a filesystem failure of some type.",
     "The file was too short.  This probably means the file has\nbeen truncated or otherwise "
     "corrupted, but it could indicate\na filesystem failure of some type."},
    /* 23 */ {"dirNotRead", "The directory could not be read.", nullptr},
    /* 24 */ {"dirEmpty", "The directory contained no appropriate entries.", nullptr},
    /* 25 */ {"notOurFile", "The file is not a .kgv-format file.", nullptr},
    /* 26 */ {"notRightFile", "The file is the wrong type of Kestrelgauge file.", nullptr},
    /* 27 */ {nullptr, "The .kgv file is from an incompatible version of Kestrelgauge.", nullptr},
    /* 28 */ {"corruptKgvFile", "The .kgv file is corrupted.", nullptr},
    /* 29 */
    {"notTextFile", "The file is not a plain text file (It contains a lot of non-ASCII bytes.)",
     "The file is not a plain text file.\n(It contains a lot of non-ASCII bytes.)"},
    /* 30 */ {"seekFail", "A direct-access attempt (seek) on the file failed.", nullptr},
    /* 31 */ {"noSubshell", kSubshellText, nullptr},
    /* 32 */ {"noSubshell", kSubshellText, nullptr},
    /* 33 */ {"cmdErrStatus", "The command returned an error status.", nullptr},
    /* 34 */ {"filenameNotFirst", "(internal error) Filename in middle of ofile data.", nullptr},
    /* 35 */ {"filenameEmpty", "No filename found with .o file's data.", nullptr},
    /* 36 */
    {"mergeIgnored",
     "Some data were ignored because they were from an old version of your program.",
     "Some data were ignored because they were from\nan old version of your program."},
    /* 37 */ {"blockInvalid", "(internal error) Pointer isn't a string block.", nullptr},
    /* 38 */ {"blockFroze", "(internal error) String block is frozen.", nullptr},
    /* 39 */ {nullptr, "(internal error) String block is melted.", nullptr},
    /* 40 */ {"blockEmpty", "(internal error) String block is empty.", nullptr},
    /* 41 */ {"stringNotInBlk", "(internal error) Couldn't find the string in the block.", nullptr},
    /* 42 */ {"invalidSortingOrder", "Invalid request for sorting order.", nullptr},
    /* 43 */ {"invalidMap", "(internal error) Unknown type of line data detected.", nullptr},
    /* 44 */ {"errorLock", "Internal error during lock operation.", nullptr},
    /* 45 */ {"lockAborted", "Lock operation aborted at user request.", nullptr},
    /* 46 */ {"noLockFilename", "No filename provided for file to be locked.", nullptr},
    /* 47 */ {"filenameTooLong", "Filename is longer than the system limit.", nullptr},
    /* 48 */
    {"lockDirNotRemove",
     "The file's lock directory could not be removed.  Verify that you have appropriate "
     "permissions on the lock and the directory containing it (and that the lock is in fact a "
     "directory), or rerun the session with -locking=no if you are sure no other process will be "
     "updating the file at the same time.",
     "The file's lock directory could not be removed.  Verify that\nyou have appropriate "
     "permissions on the lock and the directory\ncontaining it (and that the lock is in fact a "
     "directory), or\nrerun the session with -locking=no if you are sure no other\nprocess will "
     "be updating the file at the same time."},
    /* 49 */
    {"lockDirNotCreated",
     "The file's lock directory could not be created.  Verify that you have appropriate "
     "permissions on the file and directory, or rerun the session with -locking=no if you are "
     "sure no other process will be updating the file at the same time.",
     "The file's lock directory could not be created.  Verify that\nyou have appropriate "
     "permissions on the file and directory, or\nrerun the session with -locking=no if you are "
     "sure no other\nprocess will be updating the file at the same time."},
    /* 50 */ {"lockBusy", "Lock busy: retry later.", nullptr},
    /* 51 */ {"lockWaitLong", "Could not get the file lock after too much elapsed time.", nullptr},
    /* 52 */
    {"lockContention", "Could not get the file lock due to contention by other processes.",
     nullptr},
    /* 53 */ {"cfyFile", "This appears to be a Wintally data file.", nullptr},
    /* 54 */ {"fatalInternalError", kFatalText, nullptr},
};

constexpr ErrorCode kTableSize = sizeof(kErrors) / sizeof(kErrors[0]);

std::string gPending;
ErrorTextLookup gLookup = nullptr;

std::string withPending(std::string text) {
  if (!text.empty() && text.back() == '\n') text.pop_back();
  if (!gPending.empty()) {
    text += '\n';
    text += gPending;
    gPending.clear();
  }
  return text;
}

}  // namespace

const char* errorIdentifier(ErrorCode code) {
  return code < kTableSize ? kErrors[code].identifier : nullptr;
}

const char* errorText(ErrorCode code) { return code < kTableSize ? kErrors[code].text : ""; }

const char* errorShortText(ErrorCode code) {
  if (code >= kTableSize) return "";
  return kErrors[code].shortText ? kErrors[code].shortText : kErrors[code].text;
}

void recordSystemError(int err, const char* fmt, ...) {
  gPending.clear();
  if (fmt && *fmt) {
    va_list ap;
    va_start(ap, fmt);
    char* text = nullptr;
    if (vasprintf(&text, fmt, ap) >= 0 && text) {
      gPending = text;
      free(text);
    }
    va_end(ap);
  }
  if (err != 0) {
    if (!gPending.empty() && gPending.back() != '\n') gPending += '\n';
    char line[256];
    snprintf(line, sizeof line, "System error code: %d (%s)", err, strerror(err));
    gPending += line;
  }
}

const std::string& pendingSystemError() { return gPending; }

void clearPendingSystemError() { gPending.clear(); }

std::string errorMessage(ErrorCode code) { return withPending(errorShortText(code)); }

void setErrorTextLookup(ErrorTextLookup lookup) { gLookup = lookup; }

std::string errorMessageWithName(ErrorCode code) {
  std::string text = errorText(code);
  const char* id = errorIdentifier(code);
  if (id && gLookup) {
    std::string user;
    if (gLookup(id, user)) text = user;
  }
  return withPending(text);
}

std::string wrapDialogText(const std::string& text) {
  std::string out = text;
  size_t start = 0;  // first character of the remaining text
  while (out.size() - start > 60) {
    size_t window = 61;
    size_t blank = out.rfind(' ', start + window - 1);
    if (blank != std::string::npos && blank >= start) {
      out[blank] = '\n';
      start = blank + 1;
    } else {
      out.insert(start + 60, 1, '\n');
      start += 61;
    }
  }
  return out;
}

std::string errorDialogText(const std::string& context, ErrorCode code) {
  return context + ":\n " + wrapDialogText(errorMessageWithName(code));
}
