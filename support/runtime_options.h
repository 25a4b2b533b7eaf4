// The runtime option table shared with the runtime library: typed options by index.
#pragma once

#include <cstdint>

struct RuntimeOption {
  std::intptr_t value;         // integer, or pointer to a NUL-terminated string
  std::intptr_t defaultValue;  // returned while the option is not set
  std::uint16_t flags;         // bit 0 set explicitly, bit 1 bootstrap, bits 2-9 type
  const char* name;
};

enum RuntimeOptionType { optBool = 0, optInt = 1, optUnsigned = 2, optInt2 = 3, optString = 4 };

constexpr int kRuntimeOptionCount = 392;

// Indices of the options the viewer reads or sets.
enum RuntimeOptionIndex {
  DUMMY_OPTION = 0,
  KESTREL = 8,
  KESTREL_HOME = 223,
  AUTO_MOUNT_PREFIX = 232,
  QUOR_HELP_MAX_WAIT = 278,
};

// The table itself (its names also fill the viewer option table).
RuntimeOption* runtimeOptions();

void setOption(int index, std::intptr_t value);
// Stores a copy of the string as the option's value.
void setStringOption(int index, const char* value);
std::intptr_t getOption(int index);
const char* getStringOption(int index);
long getIntOption(int index);
unsigned long getUnsignedOption(int index);
bool getBoolOption(int index);
// Back to the built-in state (tests).
void resetRuntimeOptions();

// PREFIX or PREFIX:REPLACEMENT from AUTO_MOUNT_PREFIX; a path starting with PREFIX gets
// REPLACEMENT instead. The result stays valid until the next call; a null path gives null.
const char* translateAutoMountPath(const char* path);
