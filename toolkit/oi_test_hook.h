// What a user sees, written to a file for tests: when KG_TEST_HOOK names a file, SIGUSR1 makes
// the program write every window's widgets (names, states, places, labels) and text lines there.
#pragma once

#include <string>

class OI_Application;

void oiInstallTestHook(OI_Application& app);
// Writes the state to `path` now (through a temporary file, so readers never see half of it).
bool oiWriteTestState(OI_Application& app, const std::string& path);
