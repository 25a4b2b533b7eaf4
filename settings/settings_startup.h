// The start-up entry points of the settings: build the database, read every resource,
// merge the Java texts, the default sort order, and users' texts for error messages.
#pragma once

#include <string>
#include <vector>

#include "settings/resource_database.h"

// At start-up:
//   ResourceSettingsInput in;            // installDir, language (0/1), and from the GUI the
//   in.installDir = home;                // display's resources and -xrm lines when it has them
//   for (auto& w : loadResourceSettings(in)) kgWarning("%s", w.c_str());
//   ... load the data files ...
//   if (isJava) mergeJavaResourceFiles(home);
//   int order = sortOption given and valid ? its id : defaultSortOrder();
using ResourceSettingsInput = ResourceDatabaseInput;

// Start-up step 7: points OI_LIB at the installation's "UI" directory, builds the merged
// resource database, reads every resource of the table and installs the user's texts for
// error messages. Returns the warnings for the console (missing language files, values a
// converter rejected); nothing is printed.
std::vector<std::string> loadResourceSettings(const ResourceSettingsInput& in);

// Start-up step 10, for Java data: merges "Kestrelgauge.java.msg" and "Kestrelgauge.java.label"
// from the application defaults when readable, and reads the table again so that their
// texts take effect. Returns the names of the files merged.
std::vector<std::string> mergeJavaResourceFiles(const std::string& installDir);

// Start-up step 11: the sort order the user's settings ask for (sortCriterion, 1..17).
int defaultSortOrder();

// The lookup errorMessageWithName uses: the user's resource named by the error identifier.
bool lookupErrorText(const char* identifier, std::string& text);
void installErrorTextLookup();
