// The start-up entry points of the settings.
#include "settings/settings_startup.h"

#include <cstdlib>

#include "settings/kg_resource.h"
#include "settings/resource_converters.h"
#include "settings/resource_table.h"
#include "support/errors.h"

std::vector<std::string> loadResourceSettings(const ResourceSettingsInput& in) {
  std::vector<std::string> warnings;
  // The toolkit and anything started from here find the installation's resource files here.
  setenv("OI_LIB", toolkitLibraryDir(in.installDir).c_str(), 1);
  XrmDatabase db = buildResourceDatabase(in, warnings);
  buildSettings(ResourceSource{db, &warnings});
  installErrorTextLookup();
  return warnings;
}

std::vector<std::string> mergeJavaResourceFiles(const std::string& installDir) {
  std::vector<std::string> merged;
  for (const char* kind : {"msg", "label"}) {
    std::string path = appDefaultsDir(installDir) + "/" + kResourceAppName + ".java." + kind;
    if (mergeResourceFileIfReadable(path)) merged.push_back(path);
  }
  if (!merged.empty()) rereadSettings(ResourceSource{resourceDatabase(), nullptr});
  return merged;
}

int defaultSortOrder() {
  int v = kgSettings().sortCriterion.value;
  return v >= 1 && v <= kSortCriterionCount ? v : kDefaultSortCriterion;
}

bool lookupErrorText(const char* identifier, std::string& text) {
  return identifier && *identifier && lookupNamedText(identifier, text);
}

void installErrorTextLookup() { setErrorTextLookup(lookupErrorText); }
