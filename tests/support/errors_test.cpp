// Error texts, the pending system error and the dialog wrapping.
#include "support/errors.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>

TEST(ErrorMessages, PendingSystemErrorIsAttachedToExactlyOneMessage) {
  recordSystemError(ENOENT, "Lock name: %s", "/tmp/.lock.quor.a.kgv");
  std::string first = errorMessage(lockDirNotCreated);
  EXPECT_EQ(first, std::string(errorShortText(lockDirNotCreated)) +
                       "\nLock name: /tmp/.lock.quor.a.kgv\nSystem error code: 2 (" +
                       strerror(ENOENT) + ")");
  EXPECT_EQ(errorMessage(lockDirNotCreated), errorShortText(lockDirNotCreated));
  EXPECT_EQ(errorMessage(allOK), "Everything was OK.");
}

TEST(ErrorMessages, UserTextReplacesTableTextByIdentifier) {
  setErrorTextLookup([](const char* id, std::string& text) {
    if (std::strcmp(id, "corruptKgvFile") != 0) return false;
    text = "Your data file is damaged.";
    return true;
  });
  EXPECT_EQ(errorMessageWithName(corruptKgvFile), "Your data file is damaged.");
  EXPECT_EQ(errorMessageWithName(fileTooShort), errorText(fileTooShort));
  EXPECT_EQ(errorMessageWithName(incompatibleVersion), errorText(incompatibleVersion));
  setErrorTextLookup(nullptr);
}

TEST(DialogWrapping, BreaksAtLastBlankWithinSixtyOneCharacters) {
  std::string word61(61, 'x');
  EXPECT_EQ(wrapDialogText(word61), std::string(60, 'x') + "\n" + "x");
  std::string sixty(60, 'y');
  EXPECT_EQ(wrapDialogText(sixty), sixty);
  // A blank at position 61 (the 61st character) is still inside the window.
  std::string s = std::string(60, 'a') + " bbb";
  EXPECT_EQ(wrapDialogText(s), std::string(60, 'a') + "\nbbb");
  std::string text = errorText(openError);
  std::string wrapped = wrapDialogText(text);
  size_t start = 0;
  for (size_t nl = wrapped.find('\n'); nl != std::string::npos; nl = wrapped.find('\n', start)) {
    EXPECT_LE(nl - start, 60u);
    start = nl + 1;
  }
  EXPECT_EQ(errorDialogText("Couldn't export", allOK), "Couldn't export:\n Everything was OK.");
}
