// The preference values the adjustment and source-text code reads, through one accessor.
#pragma once

#include <string>

struct AdjustSettings {
  std::string adjustmentCommentFormat = " /* %s */";
  bool deleteGUIAdjustments = true;
  bool invalidateUserAdjustments = true;
  std::string adjustmentDisableString = " NOT";
  int adjustmentExtractWarnThreshold = 50;
  std::string manySourceFilesToProcess = "%u files to process; this may take a while";
  std::string compileAdjWindowErrorsPrompt =
      "These warnings occurred while extracting adjustments:";
  std::string fileNotFoundPrompt = "Can't find source file \"%s\".  New name:";
  std::string readOnlyAdjustmentsPrompt = "[Adjustments read only]";
};

// The current values. Until a provider is installed these are the built-in defaults.
AdjustSettings adjustSettings();

// The settings layer installs a provider that reads its resource objects; nullptr goes
// back to the defaults.
using AdjustSettingsProvider = AdjustSettings (*)();
void setAdjustSettingsProvider(AdjustSettingsProvider provider);

// A user-supplied format with one string argument, filled in without printf: "%s" takes the
// argument (the first one only), "%%" a percent sign; anything else stays as written, so a
// stray conversion in a resource value can never read memory it should not.
std::string formatWithString(const std::string& format, const std::string& arg);
