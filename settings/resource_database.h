// The merged resource database: fallback lines, application defaults, language files,
// the display's resources and the per-user defaults file, later sources winning.
#pragma once

#include <X11/Xresource.h>

#include <string>
#include <vector>

// What the database is built from besides the files found on disk.
struct ResourceDatabaseInput {
  std::string installDir;  // the installation directory; resource files live in its "UI"
  int language = 0;        // 0 English, 1 Japanese
  bool greyBackground = false;  // the display asks for the grey Motif background
  // Resources of the display (the server's resource property), merged above the application
  // defaults and below the per-user defaults file; -xrm lines, merged over everything.
  std::string displayResources;
  std::vector<std::string> commandLineResources;
  // A per-user defaults file other than "~/.kestrel.Xdefaults" (tests); empty = the usual.
  std::string userDefaultsFile;
};

// The toolkit's library directory: "<installDir>/UI".
std::string toolkitLibraryDir(const std::string& installDir);
// "<installDir>/UI/app-defaults".
std::string appDefaultsDir(const std::string& installDir);

// Expands a leading "~" or "~user" and "$NAME" / "${NAME}" references.
std::string expandUserPath(const std::string& path);
// The per-user defaults file, "~/.kestrel.Xdefaults" expanded.
std::string userDefaultsPath();

// Builds a new process-wide database from the input, replacing the previous one (which is
// destroyed). Warnings about missing language files are appended to warnings.
XrmDatabase buildResourceDatabase(const ResourceDatabaseInput& in,
                                  std::vector<std::string>& warnings);
// The process-wide database (null before it is built). The GUI hands it to its display;
// after XrmSetDatabase the display owns it, so call handOverResourceDatabase() then: the
// engine keeps using it but never destroys it.
XrmDatabase resourceDatabase();
void handOverResourceDatabase();

// Merges a resource file over the database if it can be read; false when it cannot.
bool mergeResourceFileIfReadable(const std::string& path);
// Merges one resource line ("Kestrelgauge*name: value") over the database.
void mergeResourceLine(const std::string& line);

// The raw value of any resource by name (an error identifier, a dialog text name).
bool lookupNamedText(const char* name, std::string& text);
// The user's text for a name, or the given default.
std::string namedText(const char* name, const char* def);
