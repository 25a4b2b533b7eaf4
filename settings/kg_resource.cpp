// The typed resource objects, their conversions from the database and their resource lines.
#include "settings/kg_resource.h"

#include <algorithm>
#include <cstring>

#include "settings/resource_converters.h"

const char* const kResourceAppName = "Kestrelgauge";
const char* const kResourceProgramName = "kestrel";

namespace {

// Never destroyed: resource objects of static lifetime leave it during exit.
std::vector<KG_Resource*>& registry() {
  static auto* r = new std::vector<KG_Resource*>;
  return *r;
}

}  // namespace

bool lookupResourceString(XrmDatabase db, const char* name, std::string& value) {
  if (!db) return false;
  std::string n = std::string(kResourceProgramName) + "." + name;
  std::string c = std::string(kResourceAppName) + "." + name;
  char* type = nullptr;
  XrmValue v{0, nullptr};
  if (!XrmGetResource(db, n.c_str(), c.c_str(), &type, &v) || !v.addr) return false;
  // Values from resource files carry their terminating zero in the size.
  size_t len = v.size;
  if (len > 0 && v.addr[len - 1] == '\0') --len;
  value.assign(v.addr, strnlen(v.addr, len));
  return true;
}

// ---------------------------------------------------------------------------------------
// KG_Resource

KG_Resource::KG_Resource(const char* name, bool editable)
    : guiEditable(editable ? 1 : 0),
      fullName(std::string(kResourceAppName) + "*" + name),
      prefixLength_(strlen(kResourceAppName) + 1) {
  registry().push_back(this);
}

KG_Resource::~KG_Resource() {
  auto& r = registry();
  r.erase(std::remove(r.begin(), r.end(), this), r.end());
}

bool KG_Resource::lookup(const ResourceSource& src, std::string& raw) {
  found = lookupResourceString(src.db, name(), raw) ? 1 : 0;
  return found != 0;
}

void KG_Resource::conversionFailed(const ResourceSource& src, const std::string& raw,
                                   const char* type, const char* detail) const {
  if (!src.warnings) return;
  std::string w = "Cannot convert string \"" + raw + "\" to type " + type + " for resource " +
                  fullName;
  if (detail) w += std::string(": ") + detail;
  src.warnings->push_back(w);
}

const std::vector<KG_Resource*>& registeredResources() { return registry(); }

KG_Resource* findResource(const std::string& name) {
  for (KG_Resource* r : registry())
    if (name == r->name()) return r;
  return nullptr;
}

bool writeAllResources(FILE* stream, bool includeAll) {
  for (KG_Resource* r : registry()) {
    if (!includeAll && !r->guiEditable) continue;
    if (!r->writeTo(stream)) return false;
  }
  return true;
}

// ---------------------------------------------------------------------------------------
// Booleans and integers

KG_BoolResource::KG_BoolResource(const ResourceSource& src, const char* name, bool def,
                                 bool editable)
    : KG_Resource(name, editable), value(def), default_(def) {
  load(src);
}

void KG_BoolResource::load(const ResourceSource& src) {
  value = default_;
  std::string raw;
  if (!lookup(src, raw)) return;
  bool v;
  if (convertBoolean(raw, v))
    value = v;
  else
    conversionFailed(src, raw, "Boolean");
}

bool KG_BoolResource::writeTo(FILE* stream) const {
  return fprintf(stream, "%s: %s\n", fullName.c_str(), value ? "true" : "false") >= 0 &&
         !ferror(stream);
}

KG_IntResource::KG_IntResource(const char* name, int def, bool editable)
    : KG_Resource(name, editable), value(def), default_(def) {}

KG_IntResource::KG_IntResource(const ResourceSource& src, const char* name, int def,
                               bool editable)
    : KG_IntResource(name, def, editable) {
  load(src);
}

bool KG_IntResource::convert(const ResourceSource& src, const std::string& raw, int& out) const {
  if (convertInteger(raw, out)) return true;
  conversionFailed(src, raw, "Int");
  return false;
}

void KG_IntResource::load(const ResourceSource& src) {
  value = default_;
  std::string raw;
  if (!lookup(src, raw)) return;
  int v;
  if (convert(src, raw, v)) value = v;
}

bool KG_IntResource::writeTo(FILE* stream) const {
  return fprintf(stream, "%s: %d\n", fullName.c_str(), value) >= 0 && !ferror(stream);
}

KG_IntRangeResource::KG_IntRangeResource(const ResourceSource& src, const char* name, int def,
                                         int lo, int hi, bool editable)
    : KG_IntResource(name, def, editable), min(lo), max(hi) {
  reread(src);
}

void KG_IntRangeResource::reread(const ResourceSource& src) {
  load(src);
  setValue(value);
}

void KG_IntRangeResource::setValue(int v) { value = std::clamp(v, min, max); }

// ---------------------------------------------------------------------------------------
// Enumerations

KG_EnumResource::KG_EnumResource(const char* type, const EnumWord* words, size_t count,
                                 const char* name, int def, bool editable)
    : KG_IntResource(name, def, editable), type_(type), words_(words), count_(count) {}

bool KG_EnumResource::convert(const ResourceSource& src, const std::string& raw,
                              int& out) const {
  if (convertEnumWord(words_, count_, raw, out)) return true;
  conversionFailed(src, raw, type_);
  return false;
}

bool KG_EnumResource::writeTo(FILE* stream) const {
  return fprintf(stream, "%s: %s\n", fullName.c_str(), wordFor(value)) >= 0 && !ferror(stream);
}

KG_FileUpdateResource::KG_FileUpdateResource(const ResourceSource& src, const char* name,
                                             int def, bool editable)
    : KG_EnumResource("FileUpdate", kFileUpdateWords, 3, name, def, editable) {
  load(src);
}

const char* KG_FileUpdateResource::wordFor(int v) const {
  // The automatic choice of a running session (2) is not kept: a new session asks again.
  return v == reload ? "reload" : v == ignore ? "ignore" : "prompt";
}

KG_ColStripeResource::KG_ColStripeResource(const ResourceSource& src, const char* name, int def,
                                           bool editable)
    : KG_EnumResource("ColStripe", kColStripeWords, 3, name, def, editable) {
  load(src);
}

const char* KG_ColStripeResource::wordFor(int v) const {
  return v == none ? "none" : v == groups ? "groups" : v == all ? "all" : "<invalid>";
}

KG_DirectoryStyleResource::KG_DirectoryStyleResource(const ResourceSource& src,
                                                     const char* name, int def, bool editable)
    : KG_EnumResource("DirectoryStyle", kDirectoryStyleWords, 2, name, def, editable) {
  load(src);
}

const char* KG_DirectoryStyleResource::wordFor(int v) const {
  return v == rightmost ? "rightmost" : "whole";
}

KG_NameTruncationResource::KG_NameTruncationResource(const ResourceSource& src,
                                                     const char* name, int def, bool editable)
    : KG_EnumResource("NameTruncation", kNameTruncationWords, 2, name, def, editable) {
  load(src);
}

const char* KG_NameTruncationResource::wordFor(int v) const {
  return v == rightmost ? "rightmost" : "leftmost";
}

KG_GfxSortOrderResource::KG_GfxSortOrderResource(const ResourceSource& src, const char* name,
                                                 int def, bool editable)
    : KG_EnumResource("GfxSortOrder", nullptr, 0, name, def, editable) {
  load(src);
}

bool KG_GfxSortOrderResource::convert(const ResourceSource& src, const std::string& raw,
                                      int& out) const {
  if (sortCriterionFromWord(raw, out) != allOK)
    conversionFailed(src, raw, "GfxSortOrder", errorText(invalidSortingOrder));
  return true;  // an unknown word still gives an order: the default one
}

const char* KG_GfxSortOrderResource::wordFor(int v) const {
  const char* w = sortCriterionWord(v);
  return w ? w : "<invalid>";
}

// ---------------------------------------------------------------------------------------
// Strings

KG_StrResource::KG_StrResource(const char* name, const char* def, bool editable)
    : KG_Resource(name, editable), value(def ? def : ""), default_(def ? def : "") {}

KG_StrResource::KG_StrResource(const ResourceSource& src, const char* name, const char* def,
                               bool editable)
    : KG_StrResource(name, def, editable) {
  load(src);
}

bool KG_StrResource::convert(const ResourceSource&, const std::string& raw,
                             std::string& out) const {
  out = raw;
  return true;
}

void KG_StrResource::load(const ResourceSource& src) {
  value = default_;
  std::string raw;
  if (!lookup(src, raw)) return;
  std::string v;
  if (convert(src, raw, v)) value = v;
}

bool KG_StrResource::writeText(FILE* stream, bool quoted) const {
  if (fprintf(stream, "%s: ", fullName.c_str()) < 0) return false;
  std::string out;
  if (quoted) out += '"';
  for (size_t i = 0; i < value.size(); ++i) {
    char c = value[i];
    if (c == '\n') {
      out += "\\n\\\n";  // a newline continues the resource line
    } else if (c == '\\') {
      out += "\\\\";  // read back as one backslash, never as an escape
    } else if ((c == ' ' || c == '\t') && !quoted && i == 0) {
      // Blanks that open a value would be dropped when it is read back.
      out += '\\';
      out += c;
    } else {
      out += c;
    }
  }
  if (quoted) out += '"';
  out += '\n';
  return fputs(out.c_str(), stream) >= 0 && !ferror(stream);
}

bool KG_StrResource::writeTo(FILE* stream) const { return writeText(stream, false); }

KG_QuotedStrResource::KG_QuotedStrResource(const ResourceSource& src, const char* name,
                                           const char* def, bool editable)
    : KG_StrResource(name, def, editable) {
  load(src);
}

bool KG_QuotedStrResource::convert(const ResourceSource&, const std::string& raw,
                                   std::string& out) const {
  out = raw;
  if (out.size() >= 2 && out.front() == '"' && out.back() == '"') out = out.substr(1, out.size() - 2);
  return true;
}

bool KG_QuotedStrResource::writeTo(FILE* stream) const { return writeText(stream, true); }

KG_CursorNameResource::KG_CursorNameResource(const ResourceSource& src, const char* name,
                                             const char* def, bool editable)
    : KG_StrResource(name, def, editable) {
  load(src);
}

bool KG_CursorNameResource::convert(const ResourceSource& src, const std::string& raw,
                                    std::string& out) const {
  if (convertCursorName(raw, out)) return true;
  conversionFailed(src, raw, "CursorName");
  return false;
}

KG_HighlightResource::KG_HighlightResource(const ResourceSource& src, const char* name,
                                           const char* def, bool editable)
    : KG_StrResource(name, def, editable) {
  load(src);
}

bool KG_HighlightResource::convert(const ResourceSource& src, const std::string& raw,
                                   std::string& out) const {
  // An unknown colour is reported and shown in the pane's normal colours ("default").
  if (!convertHighlight(raw, out)) conversionFailed(src, raw, "Highlight");
  return true;
}
