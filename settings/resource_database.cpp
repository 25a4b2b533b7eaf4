// The merged resource database and the resource files it is made of.
#include "settings/resource_database.h"

#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cctype>
#include <cstdio>
#include <cstdlib>

#include "settings/fallback_resources.h"
#include "settings/kg_resource.h"

namespace {

XrmDatabase gDatabase = nullptr;
bool gOwned = true;  // false once the display owns the database

void dropDatabase() {
  if (gDatabase && gOwned) XrmDestroyDatabase(gDatabase);
  gDatabase = nullptr;
  gOwned = true;
}

// Merges lines given as text over the database (the text's entries win).
void mergeText(XrmDatabase& db, const std::string& text) {
  if (text.empty()) return;
  XrmDatabase add = XrmGetStringDatabase(text.c_str());
  if (add) XrmMergeDatabases(add, &db);  // consumes add
}

std::string joinLines(const std::vector<std::string>& lines) {
  std::string text;
  for (const auto& l : lines) {
    text += l;
    text += '\n';
  }
  return text;
}

std::string homeDirectory(const std::string& user) {
  if (user.empty()) {
    const char* home = getenv("HOME");
    if (home && *home) return home;
    struct passwd* pw = getpwuid(getuid());
    return pw && pw->pw_dir ? pw->pw_dir : "";
  }
  struct passwd* pw = getpwnam(user.c_str());
  return pw && pw->pw_dir ? pw->pw_dir : "";
}

// Only regular files: a FIFO or device named by mistake would hang or flood the start.
bool readable(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode) && access(path.c_str(), R_OK) == 0;
}

}  // namespace

std::string toolkitLibraryDir(const std::string& installDir) { return installDir + "/UI"; }

std::string appDefaultsDir(const std::string& installDir) {
  return toolkitLibraryDir(installDir) + "/app-defaults";
}

std::string expandUserPath(const std::string& path) {
  std::string out;
  size_t i = 0;
  if (!path.empty() && path[0] == '~') {
    size_t slash = path.find('/');
    std::string user = path.substr(1, slash == std::string::npos ? std::string::npos : slash - 1);
    std::string home = homeDirectory(user);
    if (!home.empty() || user.empty()) {
      out = home;
      i = slash == std::string::npos ? path.size() : slash;
    }
  }
  while (i < path.size()) {
    char c = path[i];
    if (c != '$' || i + 1 >= path.size()) {
      out += c;
      ++i;
      continue;
    }
    size_t start = i + 1;
    size_t end;
    std::string name;
    if (path[start] == '{') {
      end = path.find('}', start);
      if (end == std::string::npos) {  // unterminated: the text stays as written
        out += path.substr(i);
        break;
      }
      name = path.substr(start + 1, end - start - 1);
      ++end;
    } else {
      end = start;
      while (end < path.size() && (isalnum(static_cast<unsigned char>(path[end])) || path[end] == '_'))
        ++end;
      name = path.substr(start, end - start);
    }
    if (name.empty()) {
      out += c;
      ++i;
      continue;
    }
    const char* v = getenv(name.c_str());
    if (v) out += v;
    i = end;
  }
  return out;
}

std::string userDefaultsPath() {
  return expandUserPath(std::string("~/.") + kResourceProgramName + ".Xdefaults");
}

XrmDatabase buildResourceDatabase(const ResourceDatabaseInput& in,
                                  std::vector<std::string>& warnings) {
  XrmInitialize();
  dropDatabase();
  XrmDatabase db = nullptr;

  // Lowest first: the built-in lines, then the toolkit's background for its Motif look.
  mergeText(db, joinLines(outlineFallbackLines()));
  mergeText(db, in.greyBackground ? "*motif*background: grey\n" : "*motif*background: white\n");
  mergeText(db, joinLines(viewerFallbackLines()));

  // The application defaults the installation ships.
  std::string dir = appDefaultsDir(in.installDir);
  std::string appDefaults = dir + "/" + kResourceAppName;
  if (readable(appDefaults)) XrmCombineFileDatabase(appDefaults.c_str(), &db, True);

  // Message and label files of a language other than English.
  if (in.language != 0) {
    const char* language = "Japanese";
    struct {
      const char* suffix;
      const char* kind;
      const char* what;
    } files[] = {{"msg", "message", "Messages"}, {"msg2", "message", "Messages"},
                 {"label", "label", "Labels"}};
    for (const auto& f : files) {
      std::string path = dir + "/" + kResourceAppName + "." + f.suffix;
      if (readable(path) && XrmCombineFileDatabase(path.c_str(), &db, True)) continue;
      char buf[4096];
      snprintf(buf, sizeof buf,
               "The %s %s file (%s) does not exist or is not readable.\n%s will be displayed in %s.",
               language, f.kind, path.c_str(), f.what, "English");
      warnings.emplace_back(buf);
    }
  }

  // The display's own resources (xrdb), then the user's file over them, then the command
  // line's -xrm lines over everything: the order X users know.
  mergeText(db, in.displayResources);
  std::string user = in.userDefaultsFile.empty() ? userDefaultsPath() : in.userDefaultsFile;
  if (readable(user)) XrmCombineFileDatabase(user.c_str(), &db, True);
  mergeText(db, joinLines(in.commandLineResources));

  if (!db) db = XrmGetStringDatabase("");
  gDatabase = db;
  return db;
}

XrmDatabase resourceDatabase() { return gDatabase; }

void handOverResourceDatabase() { gOwned = false; }

bool mergeResourceFileIfReadable(const std::string& path) {
  if (!readable(path)) return false;
  XrmInitialize();
  return XrmCombineFileDatabase(path.c_str(), &gDatabase, True) != 0;
}

void mergeResourceLine(const std::string& line) {
  XrmInitialize();
  mergeText(gDatabase, line + "\n");
}

bool lookupNamedText(const char* name, std::string& text) {
  return lookupResourceString(gDatabase, name, text);
}

std::string namedText(const char* name, const char* def) {
  std::string t;
  return lookupNamedText(name, t) ? t : std::string(def);
}
