// Conversions from the strings of resource files to typed values, by resource type name.
#pragma once

#include <string>

#include "support/errors.h"

struct EnumWord;

// "true"/"yes"/"on"/"1" and "false"/"no"/"off"/"0", any case, blanks around ignored.
bool convertBoolean(const std::string& raw, bool& out);
// An optional sign and decimal digits, blanks around ignored; values beyond the int range
// stop at its ends so that a range resource clamps them.
bool convertInteger(const std::string& raw, int& out);
// A word of an enumeration, any case, blanks around ignored.
bool convertEnumWord(const EnumWord* words, size_t count, const std::string& raw, int& out);

// The words of the enumerated types, in the order of their values.
extern const EnumWord kFileUpdateWords[3];
extern const EnumWord kColStripeWords[3];
extern const EnumWord kDirectoryStyleWords[2];
extern const EnumWord kNameTruncationWords[2];

// Sort criteria: ids 1..17 and their words ("alpha" ... "b_unused%").
constexpr int kSortCriterionCount = 17;
constexpr int kDefaultSortCriterion = 11;  // "al_unused"
// The word of a sort order id, or nullptr outside 1..17.
const char* sortCriterionWord(int id);
// The id of a word; invalidSortingOrder (42) for an empty or unknown word, with id 11.
ErrorCode sortCriterionFromWord(const std::string& word, int& id);

// Colour and cursor names can only be checked against a display. The GUI installs these
// checks once it has one; without them any name is kept as written.
using NameCheck = bool (*)(const std::string& name);
void setHighlightColourCheck(NameCheck check);
void setCursorNameCheck(NameCheck check);

// "default" and "reverse" (any case, "-" and "_" ignored) come out in that spelling; other
// names pass the colour check and are kept; an unknown colour fails with "default" as result.
bool convertHighlight(const std::string& raw, std::string& out);
// A cursor name the cursor check accepts (any name without a check), blanks around ignored.
bool convertCursorName(const std::string& raw, std::string& out);

// The seven resource types read through these converters, for messages and tests.
extern const char* const kConvertedTypeNames[7];
