// The typed resource objects: each reads its value once from the resource database and can
// write itself back as a resource line; all of them sit in one process-wide registry.
#pragma once

#include <X11/Xresource.h>

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

// The application name that prefixes every resource line ("Kestrelgauge*summaryLines").
extern const char* const kResourceAppName;
// The name the toolkit gives the program; resources are looked up as "kestrel.NAME" with
// the class "Kestrelgauge.NAME", so lines written for either match.
extern const char* const kResourceProgramName;

// Where a resource object reads its value from, and where conversion problems go.
struct ResourceSource {
  XrmDatabase db = nullptr;
  std::vector<std::string>* warnings = nullptr;  // may be null: problems are then dropped
};

// The raw string a database holds for a resource name, looked up by program name and class.
bool lookupResourceString(XrmDatabase db, const char* name, std::string& value);

class KG_Resource {
 public:
  KG_Resource(const char* name, bool guiEditable);
  virtual ~KG_Resource();
  KG_Resource(const KG_Resource&) = delete;
  KG_Resource& operator=(const KG_Resource&) = delete;

  // Writes "fullName: value" and a newline; false when the stream reports an error.
  virtual bool writeTo(FILE* stream) const = 0;
  // Reads the value again from a database (after more resource files were merged).
  virtual void reread(const ResourceSource& src) = 0;

  const char* name() const { return fullName.c_str() + prefixLength_; }

  std::uint8_t found = 0;        // the resource database held a value
  std::uint8_t guiEditable = 0;  // written by the ordinary save
  std::string fullName;          // "Kestrelgauge*NAME"

 protected:
  // Looks the resource up; sets found and hands out the string when there is one.
  bool lookup(const ResourceSource& src, std::string& raw);
  // Records "Cannot convert string ..." for a value the converter rejected.
  void conversionFailed(const ResourceSource& src, const std::string& raw, const char* type,
                        const char* detail = nullptr) const;

 private:
  size_t prefixLength_;
};

class KG_BoolResource : public KG_Resource {
 public:
  KG_BoolResource(const ResourceSource& src, const char* name, bool def, bool guiEditable);
  bool writeTo(FILE* stream) const override;
  void reread(const ResourceSource& src) override { load(src); }
  KG_BoolResource& operator=(bool v) {
    value = v;
    return *this;
  }
  operator bool() const { return value; }

  bool value;

 private:
  void load(const ResourceSource& src);
  bool default_;
};

class KG_IntResource : public KG_Resource {
 public:
  KG_IntResource(const ResourceSource& src, const char* name, int def, bool guiEditable);
  bool writeTo(FILE* stream) const override;
  void reread(const ResourceSource& src) override { load(src); }
  virtual void setValue(int v) { value = v; }

  std::int32_t value;

 protected:
  // For the derived kinds, which read through their own converter.
  KG_IntResource(const char* name, int def, bool guiEditable);
  // Converts the raw string; false leaves the value as it is.
  virtual bool convert(const ResourceSource& src, const std::string& raw, int& out) const;
  void load(const ResourceSource& src);
  int default_;
};

class KG_IntRangeResource : public KG_IntResource {
 public:
  KG_IntRangeResource(const ResourceSource& src, const char* name, int def, int min, int max,
                      bool guiEditable);
  void setValue(int v) override;
  void reread(const ResourceSource& src) override;

  std::int32_t min;
  std::int32_t max;
};

// The enumerations: an int resource whose values have words, in the file and in writing.
struct EnumWord {
  const char* word;
  int value;
};

class KG_EnumResource : public KG_IntResource {
 public:
  bool writeTo(FILE* stream) const override;
  const char* typeName() const { return type_; }
  // The word written for a value.
  virtual const char* wordFor(int v) const = 0;

 protected:
  // The derived constructor reads the value once its own converter is in place.
  KG_EnumResource(const char* type, const EnumWord* words, size_t count, const char* name,
                  int def, bool guiEditable);
  bool convert(const ResourceSource& src, const std::string& raw, int& out) const override;

 private:
  const char* type_;
  const EnumWord* words_;
  size_t count_;
};

class KG_FileUpdateResource : public KG_EnumResource {
 public:
  enum Choice { automaticReload = 2, reload = 3, prompt = 4, ignore = 5 };
  KG_FileUpdateResource(const ResourceSource& src, const char* name, int def, bool guiEditable);
  void set(Choice c) { setValue(c); }
  const char* wordFor(int v) const override;
};

class KG_ColStripeResource : public KG_EnumResource {
 public:
  enum Choice { none = 1, groups = 2, all = 3 };
  KG_ColStripeResource(const ResourceSource& src, const char* name, int def, bool guiEditable);
  void set(Choice c) { setValue(c); }
  const char* wordFor(int v) const override;
};

class KG_DirectoryStyleResource : public KG_EnumResource {
 public:
  enum Choice { whole = 1, rightmost = 2 };
  KG_DirectoryStyleResource(const ResourceSource& src, const char* name, int def,
                            bool guiEditable);
  void set(Choice c) { setValue(c); }
  const char* wordFor(int v) const override;
};

class KG_NameTruncationResource : public KG_EnumResource {
 public:
  enum Choice { leftmost = 1, rightmost = 2 };
  KG_NameTruncationResource(const ResourceSource& src, const char* name, int def,
                            bool guiEditable);
  void set(Choice c) { setValue(c); }
  const char* wordFor(int v) const override;
};

class KG_GfxSortOrderResource : public KG_EnumResource {
 public:
  KG_GfxSortOrderResource(const ResourceSource& src, const char* name, int def,
                          bool guiEditable);
  // A sort order id 1..17 (the sort criterion words name them).
  void set(int sortOrder) { setValue(sortOrder); }
  const char* wordFor(int v) const override;

 protected:
  bool convert(const ResourceSource& src, const std::string& raw, int& out) const override;
};

class KG_StrResource : public KG_Resource {
 public:
  KG_StrResource(const ResourceSource& src, const char* name, const char* def, bool guiEditable);
  bool writeTo(FILE* stream) const override;
  void reread(const ResourceSource& src) override { load(src); }
  const char* c_str() const { return value.c_str(); }

  std::string value;

 protected:
  KG_StrResource(const char* name, const char* def, bool guiEditable);
  // Writes "fullName: " then the text with newlines continued, between double quotes if asked.
  bool writeText(FILE* stream, bool quoted) const;
  // Converts the raw string; false keeps the value.
  virtual bool convert(const ResourceSource& src, const std::string& raw, std::string& out) const;
  void load(const ResourceSource& src);
  std::string default_;
};

class KG_QuotedStrResource : public KG_StrResource {
 public:
  KG_QuotedStrResource(const ResourceSource& src, const char* name, const char* def,
                       bool guiEditable);
  bool writeTo(FILE* stream) const override;

 protected:
  bool convert(const ResourceSource& src, const std::string& raw, std::string& out) const override;
};

class KG_CursorNameResource : public KG_StrResource {
 public:
  KG_CursorNameResource(const ResourceSource& src, const char* name, const char* def,
                        bool guiEditable);

 protected:
  bool convert(const ResourceSource& src, const std::string& raw, std::string& out) const override;
};

class KG_HighlightResource : public KG_StrResource {
 public:
  KG_HighlightResource(const ResourceSource& src, const char* name, const char* def,
                       bool guiEditable);

 protected:
  bool convert(const ResourceSource& src, const std::string& raw, std::string& out) const override;
};

// The registry: every live resource object in construction order.
const std::vector<KG_Resource*>& registeredResources();
KG_Resource* findResource(const std::string& name);
// Writes every registered resource whose guiEditable is set (or all of them); the first
// failing write stops and fails.
bool writeAllResources(FILE* stream, bool includeAll);
