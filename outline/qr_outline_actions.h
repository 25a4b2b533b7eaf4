// The outline's action names and its eight shared action tables.
#pragma once

#include <X11/Xresource.h>

#include "outline/qr_action_object.h"

inline constexpr const char* QR_OutlineExpand = "QR_OutlineExpand";
inline constexpr const char* QR_OutlineExpandCollapse = "QR_OutlineExpandCollapse";
inline constexpr const char* QR_OutlineCollapse = "QR_OutlineCollapse";
inline constexpr const char* QR_OutlineExpandAll = "QR_OutlineExpandAll";
inline constexpr const char* QR_OutlineCollapseAll = "QR_OutlineCollapseAll";
inline constexpr const char* QR_OutlineCollapseChildren = "QR_OutlineCollapseChildren";
inline constexpr const char* QR_OutlineNext = "QR_OutlineNext";
inline constexpr const char* QR_OutlineNextSameLevel = "QR_OutlineNextSameLevel";
inline constexpr const char* QR_OutlinePrevious = "QR_OutlinePrevious";
inline constexpr const char* QR_OutlinePreviousSameLevel = "QR_OutlinePreviousSameLevel";
inline constexpr const char* QR_OutlineSelect = "QR_OutlineSelect";
inline constexpr const char* QR_OutlineFirst = "QR_OutlineFirst";
inline constexpr const char* QR_OutlineLast = "QR_OutlineLast";
inline constexpr const char* QR_OutlineToTop = "QR_OutlineToTop";
inline constexpr const char* QR_OutlineMakeVisible = "QR_OutlineMakeVisible";
// Not an action: the annotation that marks a current row.
inline constexpr const char* QR_OutlineHere = "QR_OutlineHere";
// The glyph of a collapsed row: expanding also brings the opened rows into view.
inline constexpr const char* QR_OutlineExpandGlyph = "QR_OutlineExpand,QR_OutlineMakeVisible";
// Resource by which the help system finds each action's help text, and its value.
inline constexpr const char* QR_OutlineHelpFileResource = "helpFile";
inline constexpr const char* QR_OutlineHelpFile = "qr_help.txt";

// The shared tables: built on first use, alive for the whole run.
struct QR_OutlineTables {
  QR_CompiledActions* expand;
  QR_CompiledActions* collapse;
  QR_CompiledActions* expand_all;
  QR_CompiledActions* collapse_all;
  QR_CompiledActions* collapse_children;
  QR_CompiledActions* next;
  QR_CompiledActions* previous;
  QR_CompiledActions* select;
  XrmQuark select_atom;  // "QR_OutlineSelect", asked for on every selectable test
};
const QR_OutlineTables& QR_outlineTables();
