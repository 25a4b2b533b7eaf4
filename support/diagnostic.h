// Console diagnostics: severity-tagged messages, fatal stops, clean-up actions,
// checked allocation, the language setting, fatal-signal report.
#pragma once

#include <cstddef>
#include <string>

namespace diag {

// Identity printed by messages and the signal report.
void setIdentity(const char* label, const char* product, const char* command);
void setVersionText(const char* version);
const std::string& label();

// 1+ notes, 2+ verify, 3+ diag, 4+ debug.
void setLevel(int level);
int level();
void setQuiet(bool quiet);
// 0 = no limit.
void setWarningLimit(unsigned limit);
void setErrorLimit(unsigned limit);
unsigned warningCount();
unsigned errorCount();
unsigned suppressedCount();
// Internal errors normally end the process; these relax that for callers that can go on.
void setIgnoreInternalErrors(bool ignore);
void setContinueAfterInternalErrors(bool cont);

// Messages about a new file are preceded once by "While processing file %s:".
void setCurrentFile(const char* name);

void addPriorInformation(const char* text);
using CleanupFn = void (*)(void* arg);
void addCleanup(CleanupFn fn, void* arg);
void removeCleanup(CleanupFn fn, void* arg);
void runCleanups();

// Enables the verbose messages of a category (printed with the category's name as tag).
void enableVerbose(const char* category, bool on = true);

}  // namespace diag

#define KG_PRINTF(f, a) __attribute__((format(printf, f, a)))

void kgNote(const char* fmt, ...) KG_PRINTF(1, 2);
void kgVerify(const char* fmt, ...) KG_PRINTF(1, 2);
void kgDiag(const char* fmt, ...) KG_PRINTF(1, 2);
void kgDebug(const char* fmt, ...) KG_PRINTF(1, 2);
void kgTracedNote(const char* fmt, ...) KG_PRINTF(1, 2);
void kgWarning(const char* fmt, ...) KG_PRINTF(1, 2);
void kgError(const char* fmt, ...) KG_PRINTF(1, 2);
void kgLimitedError(const char* fmt, ...) KG_PRINTF(1, 2);
void kgInternalError(const char* fmt, ...) KG_PRINTF(1, 2);
[[noreturn]] void kgFatal(const char* fmt, ...) KG_PRINTF(1, 2);
// The variant used by the bounded string operations: the support notice comes first.
[[noreturn]] void kgFatalWithNotice(const char* fmt, ...) KG_PRINTF(1, 2);
void kgVerbose(const char* category, const char* fmt, ...) KG_PRINTF(2, 3);

// Warnings of writers of optional output files, by reason bit (1, 2, 4, 8, 16, 32).
void kgFileWriteWarning(unsigned reason, const char* what, const char* name);

// Stack trace when QUOR_WHERE_AM_I is set.
void kgWhereAmI();

// Checked allocation: never returns null; failure stops the process with a message.
void* kgMalloc(size_t size);
void* kgRealloc(void* p, size_t size);
char* kgStrdup(const char* s);
void kgFree(void* p);

// Checked string helpers of the runtime library; bad arguments are fatal.
void Strcpyn(char* dst, const char* src, int capacity);
void Strncpyn(char* dst, const char* src, int n, int capacity);
void Strcatn(char* dst, const char* src, int capacity);
void Strncatn(char* dst, const char* src, int n, int capacity);
void StrcatnDots(char* dst, const char* src, int n, int capacity);
size_t kgStrlen(const char* s);
int kgStrcmp(const char* a, const char* b);
int kgStrncmp(const char* a, const char* b, size_t n);

// 0 = English, 1 = Japanese, from the argument or the locale variables.
int kgChooseLanguage(const char* name);

// Installs the fatal-signal report and ignores SIGPIPE.
void kgInstallSignalHandlers();

// Demangling: an external program when started successfully, else the C++ ABI's.
bool kgStartDemangler(const char* program);
std::string kgDemangle(const char* name);
