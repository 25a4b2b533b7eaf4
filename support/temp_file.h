// The temporary directory and temporary files made safely inside it.
#pragma once

#include <cstdio>
#include <string>

// TMPDIR when set (even empty), else "/tmp"; computed once.
const char* kgTempDirectory();
// Forgets the computed value (tests change TMPDIR between cases).
void kgResetTempDirectory();

// A temporary file in the temporary directory, created safely with a unique name that
// begins with the prefix, open for reading and writing. nullptr on failure (errno set;
// path then holds the name pattern).
FILE* createTemporaryFile(const char* prefix, std::string& path);
