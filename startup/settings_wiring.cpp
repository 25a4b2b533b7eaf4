// The adjustment code reads its preferences through one accessor; here that accessor is
// given the values of the resource objects, so a user's settings reach it.
#include "startup/settings_wiring.h"

#include "adjust/adjust_settings.h"
#include "settings/resource_table.h"

namespace {

AdjustSettings adjustSettingsFromResources() {
  const KG_Settings& s = kgSettings();
  AdjustSettings a;
  a.adjustmentCommentFormat = s.adjustmentCommentFormat.value;
  a.deleteGUIAdjustments = s.deleteGUIAdjustments.value;
  a.invalidateUserAdjustments = s.invalidateUserAdjustments.value;
  a.adjustmentDisableString = s.adjustmentDisableString.value;
  a.adjustmentExtractWarnThreshold = s.adjustmentExtractWarnThreshold.value;
  a.manySourceFilesToProcess = s.manySourceFilesToProcess.value;
  a.compileAdjWindowErrorsPrompt = s.compileAdjWindowErrorsPrompt.value;
  a.fileNotFoundPrompt = s.fileNotFoundPrompt.value;
  a.readOnlyAdjustmentsPrompt = s.readOnlyAdjustmentsPrompt.value;
  return a;
}

}  // namespace

void wireSettingsIntoEngine() { setAdjustSettingsProvider(adjustSettingsFromResources); }
