// The table of every preference and changeable text, one typed resource object each.
#pragma once

#include "settings/kg_resource.h"

// The cursor shown while adjustments are edited: the cursor font's left-button shape.
extern const char* const kDefaultEditCursor;

// All resources, constructed (and so registered) in this order. The rest of the program
// reads each preference from its member, for instance kgSettings().summaryLines.value.
struct KG_Settings {
  explicit KG_Settings(const ResourceSource& src);
  KG_Settings(const KG_Settings&) = delete;
  KG_Settings& operator=(const KG_Settings&) = delete;

  // Preferences the GUI lets the user change (written by the ordinary save).
  KG_DirectoryStyleResource directoryNames;
  KG_FileUpdateResource coverageChangesOption;
  KG_BoolResource highlightDeadcodeLines;
  KG_BoolResource highlightInspectedLines;
  KG_BoolResource highlightTestedLines;
  KG_BoolResource highlightUnusedLines;
  KG_BoolResource highlightUsedLines;
  KG_NameTruncationResource longDirectoryNames;
  KG_NameTruncationResource longFileNames;
  KG_NameTruncationResource longFunctionNames;
  KG_IntRangeResource nameColumnWidth;
  KG_BoolResource showAdjustedAnnotations;
  KG_BoolResource showCounts;
  KG_BoolResource showLineNumbers;
  KG_BoolResource showToolbar;
  KG_GfxSortOrderResource sortCriterion;
  KG_ColStripeResource outlineDataColumnSeparators;
  KG_IntRangeResource summaryLines;
  KG_BoolResource suppressCplusplusArgumentList;
  KG_BoolResource suppressCplusplusClassName;
  KG_BoolResource suppressCplusplusOperatorPrefix;

  // Preferences and texts set only through resource files.
  KG_QuotedStrResource adjustmentCommentFormat;
  KG_QuotedStrResource adjustmentDisableString;
  KG_IntResource adjustmentExtractWarnThreshold;
  KG_StrResource crmsCommandString;
  KG_StrResource crmsQueryCommandString;
  KG_HighlightResource deadcodeLineBackground;
  KG_HighlightResource inspectedLineBackground;
  KG_HighlightResource dubiousAdjustmentBackground;
  KG_HighlightResource testedLineBackground;
  KG_HighlightResource unusedLineBackground;
  KG_HighlightResource usedLineBackground;
  KG_HighlightResource deadcodeLineForeground;
  KG_HighlightResource inspectedLineForeground;
  KG_HighlightResource dubiousAdjustmentForeground;
  KG_HighlightResource testedLineForeground;
  KG_HighlightResource unusedLineForeground;
  KG_HighlightResource usedLineForeground;
  KG_BoolResource highlightDubiousAdjustments;
  KG_BoolResource hideDeadcodeCounts;
  KG_BoolResource highlightCodelessRegions;
  KG_IntRangeResource filePollRetryInterval;
  KG_BoolResource showMergeWarnings;
  KG_BoolResource saveAdjustmentsAtExit;
  KG_BoolResource saveSourceAtExit;
  KG_BoolResource stopAfterCodelessRegions;
  KG_StrResource xdefaultsUpdateCommandString;

  // Changeable texts of dialogs, prompts, titles and busy messages.
  KG_StrResource actualCoverageShown;
  KG_StrResource compileAdjWindowErrorsPrompt;
  KG_StrResource manySourceFilesToProcess;
  KG_StrResource readAdjFileWarningsPrompt;
  KG_StrResource reloadAdjFileWarningsPrompt;
  KG_StrResource loadingSourceBusyMsg;
  KG_StrResource loadingKgvDataBusyMsg;
  KG_StrResource outlineSortBusyMsg;
  KG_StrResource coverageActualPrompt;
  KG_StrResource coverageAdjustedPrompt;
  KG_StrResource exportKgvFilePrompt;
  KG_StrResource fileNotFoundPrompt;
  KG_StrResource noCodeTherePrompt;
  KG_StrResource noLinesSelectedPrompt;
  KG_StrResource openKgvFilePrompt;
  KG_StrResource readOnlyAdjustmentsPrompt;
  KG_StrResource readOnlySourcePrompt;
  KG_StrResource readOnlyWarningPrompt;
  KG_StrResource saveOutlinePrompt;
  KG_StrResource saveKgvFilePrompt;
  KG_StrResource saveScriptOutputPrompt;
  KG_StrResource sourceNeedsSavePrompt;
  KG_StrResource lineNumberPaneTitle;
  KG_StrResource hitCountsPaneTitle;
  KG_StrResource annotatedSourcePaneTitle;
  KG_StrResource adjustmentEditPaneTitle;
  KG_StrResource turnAdjustsOffPrompt;
  KG_StrResource turnAdjustsOnPrompt;
  KG_StrResource turnToolbarOffPrompt;
  KG_StrResource turnToolbarOnPrompt;
  KG_StrResource writeAnnotatedPrompt;
  KG_StrResource writeSourcePrompt;
  KG_StrResource writeXdefaultsPrompt;
  KG_StrResource mergedDataNeedsSavePrompt;
  KG_StrResource scriptOutputsNeedSavePrompt;
  KG_StrResource deadcodeFunctionText;
  KG_StrResource unusedFunctionText;
  KG_StrResource usedFunctionText;

  // More preferences set only through resource files.
  KG_BoolResource deleteGUIAdjustments;
  KG_BoolResource deleteAdjustmentsBeforeInsert;
  KG_BoolResource invalidateUserAdjustments;
  KG_CursorNameResource adjustEditCursor;
  KG_IntRangeResource filePollPauseInterval;
  KG_BoolResource showMergeWarningDetails;
  KG_BoolResource debugRevealIdlerActivity;
  KG_BoolResource saveMergedDataAtExit;
  KG_BoolResource saveScriptOutputsAtExit;
  KG_ColStripeResource outlineHeaderColumnSeparators;
  KG_IntRangeResource annotatedSourceWindowMinHeight;
  KG_IntRangeResource viewerWindowMinHeight;
  KG_IntRangeResource scriptOutputWindowMinHeight;
  KG_IntRangeResource annotatedSourceWindowMinWidth;
  KG_IntRangeResource viewerWindowMinWidth;
  KG_IntRangeResource scriptOutputWindowMinWidth;

  // Visibility of the summary columns, in the column table's order.
  KG_BoolResource showNumberOfDirectories;
  KG_BoolResource showNumberOfFiles;
  KG_BoolResource showCompilationDate;
  KG_BoolResource showNumberOfRuns;
  KG_BoolResource showOldestSessionDate;
  KG_BoolResource showNewestSessionDate;
  KG_BoolResource showRealTime;
  KG_BoolResource showCpuTime;
  KG_BoolResource showNumberOfCalls;
  KG_BoolResource showFunctionsUnused;
  KG_BoolResource showFunctionsPercentUnused;
  KG_BoolResource showFunctionsUsed;
  KG_BoolResource showFunctionsPercentUsed;
  KG_BoolResource showFunctionsTotal;
  KG_BoolResource showFunctionsDeadcode;
  KG_BoolResource showFunctionsPercentDeadcode;
  KG_BoolResource showAdjustedLinesUnused;
  KG_BoolResource showAdjustedLinesPercentUnused;
  KG_BoolResource showAdjustedLinesUsed;
  KG_BoolResource showAdjustedLinesPercentUsed;
  KG_BoolResource showAdjustedLinesTotal;
  KG_BoolResource showLinesUnused;
  KG_BoolResource showLinesPercentUnused;
  KG_BoolResource showLinesUsed;
  KG_BoolResource showLinesPercentUsed;
  KG_BoolResource showLinesTotal;
  KG_BoolResource showDeadcodeAdjustments;
  KG_BoolResource showInspectedAdjustments;
  KG_BoolResource showTestedAdjustments;
  KG_BoolResource showTotalAdjustments;
  KG_BoolResource showBlocksUnused;
  KG_BoolResource showBlocksPercentUnused;
  KG_BoolResource showBlocksUsed;
  KG_BoolResource showBlocksPercentUsed;
  KG_BoolResource showBlocksTotal;

  // Beyond the classic table: the Help menus run it with the manual's file URL as its last
  // argument.
  KG_StrResource helpBrowserCommand;
};

// The number of resource objects in the table.
constexpr size_t kSettingsResourceCount = 137;

// Builds the table from a database, replacing any earlier one. Conversion problems go to
// src.warnings.
KG_Settings& buildSettings(const ResourceSource& src);
// The table; built from no database (all defaults) when nothing was built yet.
KG_Settings& kgSettings();
// Reads every value again from a database that has grown (values changed by the GUI are
// replaced by what the database says).
void rereadSettings(const ResourceSource& src);
