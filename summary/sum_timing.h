// Timings the program takes of itself for its tests and benchmarks: when KG_TIMINGS names a
// file, each measured step appends "NAME MILLISECONDS" to it.
#pragma once

#include <string>

bool kgTimingsWanted();
// Milliseconds since the process started (as the kernel counts it), 10 ms resolution.
double kgMsSinceProcessStart();
double kgNowMs();
void kgRecordTiming(const std::string& name, double ms);
