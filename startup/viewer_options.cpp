// Viewer option table, name matching and the command-line parser.
#include "startup/viewer_options.h"

#include <cstring>

#include "startup/console_report.h"
#include "support/runtime_options.h"
#include "support/string_helpers.h"

std::vector<ViewerOption> makeViewerOptionTable() {
  std::vector<ViewerOption> t;
  t.reserve(kViewerOptionRows);
  const struct {
    const char* name;
    std::uint32_t kind;
  } viewer[] = {{"sort", 3},      {"userpath", 3}, {"kestrel", 1},   {"version", 1},
                {"kestrelhome", 3}, {"help", 1},   {"locking", 2},   {"forcemerge", 2},
                {"adjustmentfilename", 3},         {"applyadjustments", 2}};
  for (const auto& v : viewer) t.push_back({v.name, v.kind, optNotGiven, {}});
  const RuntimeOption* rt = runtimeOptions();
  for (int i = 0; i < kRuntimeOptionCount; ++i) t.push_back({rt[i].name, optValueOptional, optNotGiven, {}});
  t.push_back({"ignore_this_kestrel_arg", optValueOptional, optNotGiven, {}});
  return t;
}

namespace {

// Splits "-name=value" for matching: the name part and whether/what value follows.
void splitArgument(const char* arg, std::string& name, std::string& value) {
  const char* eq = strchr(arg, '=');
  if (eq) {
    name.assign(arg, static_cast<size_t>(eq - arg));
    value = eq + 1;
  } else {
    name = arg;
    value.clear();
  }
}

}  // namespace

ErrorCode parseViewerOptions(const char* programName, std::vector<ViewerOption>& table, int& argc,
                             char** argv) {
  int errors = 0;
  int kept = 0;
  for (int i = 0; i < argc; ++i) {
    char* arg = argv[i];
    if (arg == nullptr || arg[0] == '\0') continue;  // empty arguments are dropped
    if (arg[0] != '-') {
      argv[kept++] = arg;
      continue;
    }
    std::string name, value;
    splitArgument(arg, name, value);
    ViewerOption* row = nullptr;
    for (auto& r : table) {
      if (optionNamesMatch(name.c_str(), r.name.c_str())) {
        row = &r;
        break;
      }
    }
    if (!row) {
      reportError(argError, "%s: unknown option '%s'.\n", programName, arg);
      ++errors;
      continue;
    }
    if (row->state != optNotGiven) continue;  // the first occurrence wins
    if (!value.empty()) {
      if (row->kind == optNoValue) {
        reportError(argError, "%s: option %s should not include a value.\n", programName, arg);
        row->state = optInError;
        ++errors;
      } else {
        row->value = value;
        row->state = optGiven;
      }
    } else if (row->kind == optValueRequired) {
      reportError(argError, "%s: option %s must include a value.\n", programName, arg);
      row->state = optInError;
      ++errors;
    } else {
      row->value.clear();
      row->state = optGiven;
    }
  }
  for (int i = kept; i < argc; ++i) argv[i] = nullptr;
  argc = kept;
  return errors ? argError : allOK;
}

const ViewerOption* findGivenOption(const char* name, const std::vector<ViewerOption>& table) {
  for (const auto& r : table) {
    if (r.name == name) return r.state == optGiven ? &r : nullptr;
  }
  return nullptr;
}

bool getBoolViewerOption(const char* name, const std::vector<ViewerOption>& table, bool whenAbsent,
                         bool whenEmpty) {
  const ViewerOption* o = findGivenOption(name, table);
  if (!o) return whenAbsent;
  if (o->value.empty()) return whenEmpty;
  for (const char* w : {"no", "off", "false"})
    if (optionNamesMatch(o->value.c_str(), w)) return false;
  for (const char* w : {"yes", "on", "true"})
    if (optionNamesMatch(o->value.c_str(), w)) return true;
  reportError(argError, "Option '%s=%s' must be a boolean (usage: -%s=%s).\n", name,
              o->value.c_str(), name, whenEmpty ? "yes" : "no");
  exitWithCode(argError);
}

bool findRawOptionValue(int argc, char** argv, const char* name, std::string& value) {
  for (int i = 1; i < argc; ++i) {
    const char* arg = argv[i];
    if (!arg || arg[0] != '-') continue;
    std::string n, v;
    splitArgument(arg, n, v);
    if (optionNamesMatch(n.c_str(), name)) {
      value = v;
      return true;
    }
  }
  return false;
}

void stripArgumentQuotes(int argc, char** argv) {
  for (int i = 0; i < argc; ++i) {
    char* a = argv[i];
    if (!a) continue;
    size_t n = strlen(a);
    if (n >= 2 && a[0] == '"' && a[n - 1] == '"') {
      memmove(a, a + 1, n - 2);
      a[n - 2] = '\0';
    }
  }
}
