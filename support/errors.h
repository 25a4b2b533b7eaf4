// Error codes of the engine and file operations, their texts and message forms.
#pragma once

#include <cstdint>
#include <string>

using ErrorCode = std::uint32_t;

// Codes with an identifier carry it as their name; the identifier is also the resource
// name by which a user may replace the text shown in the GUI.
enum : ErrorCode {
  fatalInternalError = 0,
  allOK = 1,
  oprAborted = 2,
  errorOccured = 3,
  notImplemented = 5,
  argError = 6,
  displayNotOpened = 8,  // no identifier
  noFileName = 9,
  duplicateFile = 10,
  driverError = 11,
  outOfMemory = 12,
  unabelToLock = 13,
  unableToUnlock = 14,
  fileNotExist = 15,
  readAccessDenied = 16,
  writeAccessDenied = 17,
  openError = 18,
  writeError = 19,
  readFileFail = 20,
  fileWriteFailed = 21,
  fileTooShort = 22,
  dirNotRead = 23,
  dirEmpty = 24,
  notOurFile = 25,
  notRightFile = 26,
  incompatibleVersion = 27,  // no identifier
  corruptKgvFile = 28,
  notTextFile = 29,
  seekFail = 30,
  noSubshell = 31,
  cmdErrStatus = 33,
  filenameNotFirst = 34,
  filenameEmpty = 35,
  mergeIgnored = 36,
  blockInvalid = 37,
  blockFroze = 38,
  blockMelted = 39,  // no identifier
  blockEmpty = 40,
  stringNotInBlk = 41,
  invalidSortingOrder = 42,
  invalidMap = 43,
  errorLock = 44,
  lockAborted = 45,
  noLockFilename = 46,
  filenameTooLong = 47,
  lockDirNotRemove = 48,
  lockDirNotCreated = 49,
  lockBusy = 50,
  lockWaitLong = 51,
  lockContention = 52,
  cfyFile = 53,
};

// The identifier of a code ("corruptKgvFile"), or nullptr for codes without one.
const char* errorIdentifier(ErrorCode code);
// The table's text of a code; empty for codes outside the table.
const char* errorText(ErrorCode code);
// The short-line form used on the console and inside other messages.
const char* errorShortText(ErrorCode code);

// Sets up the pending system error that the next message of a code carries:
// the formatted context (if any), then "System error code: N (description)" when err != 0.
void recordSystemError(int err, const char* fmt = nullptr, ...) __attribute__((format(printf, 2, 3)));
// The pending text as it stands (for tests and for callers that show it elsewhere).
const std::string& pendingSystemError();
void clearPendingSystemError();

// Short-line text of the code plus the pending text (which is consumed).
std::string errorMessage(ErrorCode code);

// As errorMessage, but the text comes from the user's resource named by the code's
// identifier when one is set. The lookup is installed by the settings layer.
using ErrorTextLookup = bool (*)(const char* identifier, std::string& text);
void setErrorTextLookup(ErrorTextLookup lookup);
std::string errorMessageWithName(ErrorCode code);

// Breaks a message for the error dialog: at most 60 characters between inserted breaks.
std::string wrapDialogText(const std::string& text);
// "%s:\n %s": the context, then the wrapped resource form of the code's message.
std::string errorDialogText(const std::string& context, ErrorCode code);
