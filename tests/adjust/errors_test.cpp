// Error texts, the pending system error and the dialog wrapping.
#include "adjust/errors.h"

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

TEST(ErrorMessages, TableFormsAndIdentifiers) {
  EXPECT_STREQ(errorText(errorOccured), "An error occured");
  EXPECT_STREQ(errorShortText(errorOccured), "An error occurred.");
  EXPECT_STREQ(errorIdentifier(unabelToLock), "unabelToLock");
  EXPECT_EQ(errorIdentifier(displayNotOpened), nullptr);
  EXPECT_EQ(errorIdentifier(incompatibleVersion), nullptr);
  EXPECT_STREQ(errorIdentifier(4), "fatalInternalError");
  EXPECT_STREQ(errorText(32), errorText(noSubshell));
  EXPECT_STREQ(errorText(55), "");
  EXPECT_STREQ(errorText(7), "");
  // The short form of code 36 breaks the line where the console needs it.
  EXPECT_STREQ(errorShortText(mergeIgnored),
               "Some data were ignored because they were from\nan old version of your program.");
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

TEST(ExitStatus, MapsCodes) {
  EXPECT_EQ(exitStatusFor(allOK), 0);
  EXPECT_EQ(exitStatusFor(fatalInternalError), 3);
  EXPECT_EQ(exitStatusFor(invalidSortingOrder), 42);
  EXPECT_EQ(exitStatusFor(256), 3);
}
