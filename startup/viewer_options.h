// The viewer's command-line option table and its parser.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/errors.h"

struct ViewerOption {
  std::string name;          // as written after the hyphen
  std::uint32_t kind;        // 1 no value, 2 value optional, 3 value required
  std::uint32_t state = 1;   // 1 not given, 2 given, 3 given with an error
  std::string value;         // valid in state 2
};

enum : std::uint32_t { optNoValue = 1, optValueOptional = 2, optValueRequired = 3 };
enum : std::uint32_t { optNotGiven = 1, optGiven = 2, optInError = 3 };

constexpr int kViewerOptionRows = 403;

// A fresh table: the ten viewer options, the runtime options' names, ignore_this_kestrel_arg.
std::vector<ViewerOption> makeViewerOptionTable();

// Takes the options (and empty arguments) out of argv, from argv[0] on; argc shrinks.
// Returns allOK, or argError when any option was in error (each reported).
ErrorCode parseViewerOptions(const char* programName, std::vector<ViewerOption>& table, int& argc,
                             char** argv);

// The row named exactly `name`, only when given (state 2).
const ViewerOption* findGivenOption(const char* name, const std::vector<ViewerOption>& table);

// Absent -> whenAbsent; empty value -> whenEmpty; no/off/false, yes/on/true; else fatal (6).
bool getBoolViewerOption(const char* name, const std::vector<ViewerOption>& table, bool whenAbsent,
                         bool whenEmpty);

// Before parsing: the value of the first "-name[=value]" argument (after argv[0]) matching name.
bool findRawOptionValue(int argc, char** argv, const char* name, std::string& value);

// Removes one pair of enclosing double quotes from each argument of two or more characters.
void stripArgumentQuotes(int argc, char** argv);
