// The built-in resource lines of the viewer and of the outline library.
#include "settings/fallback_resources.h"

namespace {

// Both function glyphs of the outline pass keys and the menu button through to the text,
// and look flat in every look of the toolkit.
void addGlyphLines(std::vector<std::string>& lines, const char* glyph) {
  std::string path = std::string("*kgOutlineGang.") + glyph;
  lines.push_back(path +
                  ".translations: #override\\n<Key>:      drop_through()\\n"
                  "<Btn3Down>: drop_through()\\n<Btn3Up>:   drop_through()\\n");
  for (const char* look : {"motif", "Openlook", "openlook3d"}) {
    std::string p = std::string("*") + look + path;
    lines.push_back(p + ".bevelWidth: 0");
    lines.push_back(p + ".highlight: false");
    lines.push_back(p + ".background: white");
    lines.push_back(p + ".foreground: black");
  }
}

std::vector<std::string> makeViewerLines() {
  std::vector<std::string> l = {
      "*motif*QR_OI_MultiText.noInherit:              \"background\"",
      "*motif*QR_OI_MultiText.background:             white",
      "*viewportFitsText:                             true",
      "*QR_OI_ScrollTextGang.OI_glyph.borderWidth:    0",
      "*QR_OI_ScrollTextGang.OI_glyph.bevelWidth:     1",
      "*QR_OutlineExpand,QR_OutlineMakeVisible.accelerators: Ctrl<Key>O: fire()",
      "*QR_OutlineCollapse.accelerators:              Ctrl<Key>K: fire()",
      "*QR_OutlineNext.accelerators:                  Ctrl<Key>N: fire()",
      "*QR_OutlinePrevious.accelerators:              Ctrl<Key>P: fire()",
      "*KG_ScrollToFunction.accelerators:                Ctrl<Key>A: fire()",
      // Entry fields: three substitutions the toolkit applies over its own translations.
      "*OI_entry_field.deleteSubstitution: #override\\n<Key>Delete: delete-previous-character()",
      "*OI_entry_field.button2Substitution: #override\\n<Btn2Down>: do-nothing()\\n"
      "<Btn2Motion>: do-nothing()\\n<Btn2Up>: do-nothing()",
      "*OI_entry_field.emacsSubstitution: #override\\nCtrl<Key>k: kill-to-end-of-line()\\n"
      "Ctrl<Key>d: delete-next-character()\\nCtrl<Key>a: beginning-of-line()\\n"
      "Ctrl<Key>b: backward-character()\\nCtrl<Key>e: end-of-line()\\n"
      "Ctrl<Key>f: forward-character()\\nCtrl<Key>u: kill-to-start-of-line()\\n"
      "Ctrl<Key>h: delete-previous-character()\\nCtrl<Key>w: delete-previous-word()",
  };
  addGlyphLines(l, "kgFunctionUsedGlyph");
  addGlyphLines(l, "kgFunctionUnusedGlyph");
  l.push_back("*KG_ScrollToFunction.cells: KG_ScrollToFunction");
  l.push_back("*KG_ScrollToFunction.label: Show annotated source");
  l.push_back("*helpFile: kestrel_help.txt");
  return l;
}

std::vector<std::string>& outlineLines() {
  // Each outline action's help comes from the library's own help file.
  static std::vector<std::string> l = {
      "*QR_OutlineExpand.helpFile:      qr_help.txt",
      "*QR_OutlineCollapse.helpFile:    qr_help.txt",
      "*QR_OutlineMakeVisible.helpFile: qr_help.txt",
      "*QR_OutlineNext.helpFile:        qr_help.txt",
      "*QR_OutlinePrevious.helpFile:    qr_help.txt",
  };
  return l;
}

}  // namespace

const std::vector<std::string>& viewerFallbackLines() {
  static const std::vector<std::string> lines = makeViewerLines();
  return lines;
}

const std::vector<std::string>& outlineFallbackLines() { return outlineLines(); }

void registerOutlineFallbackLine(const std::string& line) { outlineLines().push_back(line); }
